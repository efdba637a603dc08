#pragma once

#include <functional>
#include <memory>
#include <optional>
#include <vector>

#include "Platform/ObserverSet.h"
#include "Vessa/VSHealthStore.h"

class QVDataProviderOrderObserver {
 public:
    virtual ~QVDataProviderOrderObserver() = default;
    /// The order that was to be saved, for the data type; also when the store refused it.
    virtual void dataProviderOrderUpdated(const std::vector<VSSource>& order,
                                          const VSObjectType* dataType) = 0;
};

/// The order in which the sources of a data type are preferred. Main thread only.
class QVDataProviderOrderController {
 public:
    explicit QVDataProviderOrderController(std::shared_ptr<VSHealthStore> healthStore)
        : healthStore_(std::move(healthStore)) {}
    QVDataProviderOrderController() = delete;
    QVDataProviderOrderController(const QVDataProviderOrderController&) = delete;
    QVDataProviderOrderController& operator=(const QVDataProviderOrderController&) = delete;

    /// The completion gets the sources, most preferred first (none: they could not be read), and the data
    /// type, on the store's thread. Without a completion it does nothing.
    using Sources = std::optional<std::vector<VSSource>>;
    void orderedDataProviderSourcesForDataType(
        const VSObjectType* dataType, std::function<void(const Sources&, const VSObjectType*)> completion);
    /// Stores the order, then tells the observers.
    void setOrderedDataProviderSources(std::vector<VSSource> orderedSources, const VSObjectType* dataType);

    void addObserver(const std::shared_ptr<QVDataProviderOrderObserver>& observer) {
        observers_.add(observer);
    }
    void removeObserver(const QVDataProviderOrderObserver* observer) { observers_.remove(observer); }

 private:
    std::shared_ptr<VSHealthStore> healthStore_;
    platform::ObserverSet<QVDataProviderOrderObserver> observers_;
    std::shared_ptr<bool> alive_ = std::make_shared<bool>(true);
};
