#include "Qelvar/Models/Data/QVSelectedTimeScopeController.h"

void QVSelectedTimeScopeController::setSelectedTimeScope(QVTimeScope timeScope) {
    selectedTimeScope_ = timeScope;
    observers_.tell([this](QVSelectedTimeScopeControllerObserver& observer) {
        observer.timeScopeControllerDidUpdateSelectedTimeScope(*this);
    });
}
