#pragma once

#include <memory>

#include "Platform/ObserverSet.h"
#include "Qelvar/Models/Data/QVTimeScope.h"

class QVSelectedTimeScopeController;

class QVSelectedTimeScopeControllerObserver {
 public:
    virtual ~QVSelectedTimeScopeControllerObserver() = default;
    virtual void timeScopeControllerDidUpdateSelectedTimeScope(QVSelectedTimeScopeController& controller) = 0;
};

/// The time scope that all dashboard charts show. Lives as long as the process; who restores a session sets
/// it. One for the application. Main thread only.
class QVSelectedTimeScopeController {
 public:
    QVTimeScope selectedTimeScope() const { return selectedTimeScope_; }
    /// Tells the observers even when the value is the one it had.
    void setSelectedTimeScope(QVTimeScope timeScope);

    void addObserver(const std::shared_ptr<QVSelectedTimeScopeControllerObserver>& observer) {
        observers_.add(observer);
    }
    void removeObserver(const QVSelectedTimeScopeControllerObserver* observer) {
        observers_.remove(observer);
    }

 private:
    QVTimeScope selectedTimeScope_ = QVTimeScope::Week;
    platform::ObserverSet<QVSelectedTimeScopeControllerObserver> observers_;
};
