#pragma once

#include <memory>

#include "Qelvar/DataProviders/QVDashboardDataUnitGroupsController.h"
#include "Qelvar/DataProviders/QVDataProviderOrderController.h"
#include "Qelvar/Models/Data/QVDateCache.h"
#include "Qelvar/Models/Data/QVSelectedTimeScopeController.h"
#include "Vessa/VSHealthStore.h"
#include "VessaUI/VSDataCategory.h"
#include "VessaUI/VSDataUnitGroup.h"
#include "VessaUI/VSUnitController.h"

/// What more than one screen shares: the store and the controllers on it. Every screen is handed the one
/// manager of the process when it is created and reaches all shared state through it. Its members are made
/// once, in the order in which they are declared, and live as long as it does. Main thread only.
class QVControllerManager {
 public:
    /// The name under which saved states refer to it, and the key of that reference.
    static constexpr const char* RestorationIdentifier = "Controller Manager";

    /// The loader reads the demonstration's document; it is asked only when the local default "UseDemoData"
    /// is true.
    explicit QVControllerManager(std::shared_ptr<VSHealthStore> healthStore,
                                 QVDashboardDataUnitGroupsController::DemoDataLoader demoDataLoader = {});
    QVControllerManager(const QVControllerManager&) = delete;
    QVControllerManager& operator=(const QVControllerManager&) = delete;

    const std::shared_ptr<VSHealthStore>& healthStore() const { return healthStore_; }
    const VSDataCategoryController& dataCategoryController() const { return dataCategoryController_; }
    const VSDataUnitGroupController& dataUnitGroupController() const { return dataUnitGroupController_; }
    const std::shared_ptr<VSUnitController>& unitController() const { return unitController_; }
    QVDashboardDataUnitGroupsController& dashboardDataUnitGroupsController() {
        return dashboardDataUnitGroupsController_;
    }
    QVDataProviderOrderController& dataProviderOrderController() { return dataProviderOrderController_; }
    QVSelectedTimeScopeController& selectedTimeScopeController() { return selectedTimeScopeController_; }
    QVDateCache& dateCache() { return dateCache_; }

 private:
    const std::shared_ptr<VSHealthStore> healthStore_;
    const VSDataCategoryController& dataCategoryController_;
    const VSDataUnitGroupController& dataUnitGroupController_;
    const std::shared_ptr<VSUnitController> unitController_;
    QVDashboardDataUnitGroupsController dashboardDataUnitGroupsController_;
    QVDataProviderOrderController dataProviderOrderController_;
    QVSelectedTimeScopeController selectedTimeScopeController_;
    QVDateCache dateCache_;
};
