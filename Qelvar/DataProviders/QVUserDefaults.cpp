#include "Qelvar/DataProviders/QVUserDefaults.h"

QVUserDefaults& QVUserDefaults::sharedDefaults() {
    static QVUserDefaults instance;
    return instance;
}

void QVUserDefaults::setValue(VSValue::Dictionary value, const std::string& key,
                              std::function<void(bool)> completion) {
    if (!healthStore_) {
        if (completion) completion(false);
        return;
    }
    healthStore_->setDefaultValue(VSValue(std::move(value)), key,
                                  [completion = std::move(completion)](const VSStatus& status) {
                                      if (completion) completion(status.ok());
                                  });
}

void QVUserDefaults::updateValue(const std::string& key, VSHealthStore::DefaultValueChange change,
                                 std::function<void(const VSResult<std::optional<VSValue>>&)> completion) {
    if (healthStore_) return healthStore_->updateDefaultValue(key, std::move(change), std::move(completion));
    if (completion) completion(VSError{VSErrorCode::NotAccessible, "no connection to the health store"});
}

std::shared_ptr<const void> QVUserDefaults::observe(std::function<void(const std::string& key)> handler) {
    return healthStore_ ? healthStore_->observeDefaultValues(std::move(handler)) : nullptr;
}

void QVUserDefaults::valueForKey(const std::string& key,
                                 std::function<void(const VSResult<std::optional<VSValue>>&)> callback) {
    if (!callback) return;
    if (!healthStore_)
        return callback(VSError{VSErrorCode::NotAccessible, "no connection to the health store"});
    healthStore_->getDefaultValue(key, std::move(callback));
}
