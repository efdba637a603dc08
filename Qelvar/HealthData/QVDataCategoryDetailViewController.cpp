#include "Qelvar/HealthData/QVDataCategoryDetailViewController.h"

#include <algorithm>

#include "Platform/NavigationStack.h"
#include "Platform/RestorableState.h"
#include "Platform/UserActivity.h"
#include "Qelvar/Controllers/QVUserActivityManager.h"
#include "Qelvar/HealthData/QVDataUnitGroupDetailViewController.h"

namespace {

constexpr const char* kCategoryKey = "Data Category Detail View Controller Category";

}  // namespace

std::unique_ptr<platform::Screen> QVDataCategoryDetailViewController::fromRestorableState(
    const platform::RestorableState& state) {
    const auto manager = state.object<QVControllerManager>(QVControllerManager::RestorationIdentifier);
    const auto id = state.integer(kCategoryKey);
    if (!manager || !id || *id != static_cast<int>(*id)) return nullptr;
    const VSDataCategory* category = manager->dataCategoryController().categoryWithID(static_cast<int>(*id));
    if (!category) return nullptr;
    return std::make_unique<QVDataCategoryDetailViewController>(category, manager);
}

QVDataCategoryDetailViewController::QVDataCategoryDetailViewController(
    const VSDataCategory* category, std::shared_ptr<QVControllerManager> controllerManager)
    : QVPlaceholderViewController([category] { return category->displayName(); }, category->listIcon(),
                                  "DATA_CATEGORY_PENDING"),
      category_(category),
      controllerManager_(std::move(controllerManager)),
      dataUnitGroups_(
          controllerManager_->dataUnitGroupController().dataUnitGroupsInCategory(category->categoryID())) {
    setActivityFactory([category] {
        return QVUserActivityManager::activity(category->displayName(), {}, QVUserActivityTab::HealthData,
                                               false, category->categoryID());
    });
    std::vector<Action> actions;
    for (size_t row = 0; row < dataUnitGroups_.size(); ++row)
        actions.push_back({[group = dataUnitGroups_[row]] { return group->displayName(); },
                           [this, row] { selectRow(row); }});
    setContent("DATA_CATEGORY_PENDING", std::move(actions));
}

void QVDataCategoryDetailViewController::selectRow(size_t row, bool animated) {
    if (row >= dataUnitGroups_.size() || !navigationStack()) return;
    navigationStack()->push(
        std::make_unique<QVDataUnitGroupDetailViewController>(dataUnitGroups_[row], controllerManager_),
        animated);
}

void QVDataCategoryDetailViewController::restoreUserActivityState(const platform::UserActivity& activity) {
    const QVariant id = activity.userInfo.value(QString::fromLatin1(QVUserActivityKey::DataUnit));
    if (!id.isValid()) return;
    const auto found = std::find_if(dataUnitGroups_.begin(), dataUnitGroups_.end(), [&id](const auto* group) {
        return group->dataUnitGroupID() == id.toInt();
    });
    selectRow(static_cast<size_t>(found - dataUnitGroups_.begin()), false);
}

void QVDataCategoryDetailViewController::encodeRestorableState(platform::RestorableState& state) const {
    state.setObject(QVControllerManager::RestorationIdentifier, controllerManager_.get());
    state.set(kCategoryKey, category_->categoryID());
}
