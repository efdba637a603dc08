#include "Qelvar/HealthData/QVDataUnitGroupDetailViewController.h"

#include "Platform/Localization.h"
#include "Platform/RestorableState.h"
#include "Platform/UserActivity.h"
#include "Qelvar/Controllers/QVUserActivityManager.h"

namespace {

constexpr const char* kDataUnitGroupKey = "Data Unit Group Detail View Controller Data Unit Group";

}  // namespace

struct QVDataUnitGroupDetailViewController::Observer final : QVDashboardDataUnitGroupsObserver {
    explicit Observer(QVDataUnitGroupDetailViewController& owner) : screen(owner) {}
    void dashboardDataUnitGroupsUpdated(const std::vector<const VSDataUnitGroup*>&) override {
        emit screen.actionStatesChanged();
    }
    QVDataUnitGroupDetailViewController& screen;
};

std::unique_ptr<platform::Screen> QVDataUnitGroupDetailViewController::fromRestorableState(
    const platform::RestorableState& state) {
    const auto manager = state.object<QVControllerManager>(QVControllerManager::RestorationIdentifier);
    const auto id = state.integer(kDataUnitGroupKey);
    if (!manager || !id || *id != static_cast<int>(*id)) return nullptr;
    const VSDataUnitGroup* group =
        manager->dataUnitGroupController().dataUnitGroupWithID(static_cast<int>(*id));
    if (!group) return nullptr;
    return std::make_unique<QVDataUnitGroupDetailViewController>(group, manager);
}

QVDataUnitGroupDetailViewController::QVDataUnitGroupDetailViewController(
    const VSDataUnitGroup* dataUnitGroup, std::shared_ptr<QVControllerManager> controllerManager)
    : QVPlaceholderViewController([dataUnitGroup] { return dataUnitGroup->displayName(); },
                                  dataUnitGroup->listIcon(), "DATA_TYPE_PENDING"),
      dataUnitGroup_(dataUnitGroup),
      controllerManager_(std::move(controllerManager)),
      observer_(std::make_shared<Observer>(*this)) {
    setActivityFactory([dataUnitGroup] {
        return QVUserActivityManager::activity(dataUnitGroup->displayName(), dataUnitGroup->keywords(),
                                               QVUserActivityTab::HealthData, false,
                                               dataUnitGroup->categoryID(), dataUnitGroup->dataUnitGroupID());
    });
    if (dataUnitGroup->isCharacteristic()) return;  // which has no chart
    setContent("DATA_TYPE_PENDING",
               {{[] { return platform::localized("SHOW_ON_DASHBOARD"); },
                 [this] { setIsOnDashboard(!isOnDashboard()); }, [this] { return isOnDashboard(); }}});
    controllerManager_->dashboardDataUnitGroupsController().addObserver(observer_);
}

bool QVDataUnitGroupDetailViewController::isOnDashboard() const {
    return controllerManager_->dashboardDataUnitGroupsController().isOnDashboard(dataUnitGroup_);
}

void QVDataUnitGroupDetailViewController::setIsOnDashboard(bool isOnDashboard) {
    auto& dashboard = controllerManager_->dashboardDataUnitGroupsController();
    if (isOnDashboard)
        dashboard.addDataUnitGroupToDashboard(dataUnitGroup_);
    else
        dashboard.removeDataUnitGroupFromDashboard(dataUnitGroup_);
}

void QVDataUnitGroupDetailViewController::encodeRestorableState(platform::RestorableState& state) const {
    state.setObject(QVControllerManager::RestorationIdentifier, controllerManager_.get());
    state.set(kDataUnitGroupKey, dataUnitGroup_->dataUnitGroupID());
}
