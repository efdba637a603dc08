#include "Qelvar/Controllers/QVControllerManager.h"

QVControllerManager::QVControllerManager(std::shared_ptr<VSHealthStore> healthStore,
                                         QVDashboardDataUnitGroupsController::DemoDataLoader demoDataLoader)
    : healthStore_(std::move(healthStore)),
      dataCategoryController_(VSDataCategoryController::shared()),
      dataUnitGroupController_(VSDataUnitGroupController::shared()),
      unitController_(std::make_shared<VSUnitController>(healthStore_)),
      dashboardDataUnitGroupsController_(dataUnitGroupController_, std::move(demoDataLoader)),
      dataProviderOrderController_(healthStore_) {}
