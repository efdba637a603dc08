#pragma once

#include <functional>
#include <memory>
#include <optional>
#include <string>

#include "Vessa/VSHealthStore.h"

/// The gateway to the default values that the health-data service keeps for this application, over a
/// connection of its own. All operations return at once; callbacks run on the service's threads (on the
/// calling thread when no connection was set).
class QVUserDefaults {
 public:
    static QVUserDefaults& sharedDefaults();

    QVUserDefaults() = default;
    explicit QVUserDefaults(std::shared_ptr<VSHealthStore> healthStore)
        : healthStore_(std::move(healthStore)) {}

    /// The connection; null until start-up set one, and everything fails as not accessible until then. Main
    /// thread.
    const std::shared_ptr<VSHealthStore>& healthStore() const { return healthStore_; }
    void setHealthStore(std::shared_ptr<VSHealthStore> healthStore) { healthStore_ = std::move(healthStore); }

    /// The completion gets whether the value was stored; it may be empty.
    void setValue(VSValue::Dictionary value, const std::string& key,
                  std::function<void(bool success)> completion);
    /// Reads, changes and writes in one transaction, as VSHealthStore::updateDefaultValue does; the
    /// completion gets what is stored then and may be empty.
    void updateValue(const std::string& key, VSHealthStore::DefaultValueChange change,
                     std::function<void(const VSResult<std::optional<VSValue>>&)> completion);
    /// Calls the handler with the key of each value that this or another process changed, until the answer is
    /// gone. Null without a connection.
    [[nodiscard]] std::shared_ptr<const void> observe(std::function<void(const std::string& key)> handler);
    /// Without a callback it does nothing. The callback gets none when the value was never set.
    void valueForKey(const std::string& key,
                     std::function<void(const VSResult<std::optional<VSValue>>&)> callback);

 private:
    std::shared_ptr<VSHealthStore> healthStore_;
};
