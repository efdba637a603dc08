#include "Qelvar/DataProviders/QVDataProviderOrderController.h"

#include "Platform/Queue.h"
#include "Vessa/Base/VSLog.h"

void QVDataProviderOrderController::orderedDataProviderSourcesForDataType(
    const VSObjectType* dataType, std::function<void(const Sources&, const VSObjectType*)> completion) {
    if (!completion) return;
    healthStore_->orderedSources(dataType, [completion = std::move(completion),
                                            dataType](const VSResult<std::vector<VSSource>>& answer) {
        completion(answer ? Sources(*answer) : std::nullopt, dataType);
    });
}

void QVDataProviderOrderController::setOrderedDataProviderSources(std::vector<VSSource> orderedSources,
                                                                  const VSObjectType* dataType) {
    healthStore_->setOrderedSources(
        orderedSources, dataType,
        [this, alive = std::weak_ptr<bool>(alive_), orderedSources, dataType](const VSStatus& status) {
            if (!status) VSLog(VSLogLevel::Error, "Error saving source order");
            // Destruction happens on the main thread, so the check and the telling cannot be torn apart
            // there.
            platform::mainQueue().async([this, alive, orderedSources, dataType] {
                if (alive.expired()) return;
                observers_.tell([&](QVDataProviderOrderObserver& observer) {
                    observer.dataProviderOrderUpdated(orderedSources, dataType);
                });
            });
        });
}
