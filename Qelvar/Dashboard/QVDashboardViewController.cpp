#include "Qelvar/Dashboard/QVDashboardViewController.h"

#include <algorithm>
#include <set>

#include "Platform/Localization.h"
#include "Platform/NavigationStack.h"
#include "Platform/SystemEvents.h"
#include "Qelvar/Controllers/QVUserActivityManager.h"
#include "Qelvar/Dashboard/QVDashboardTable.h"
#include "Qelvar/Dashboard/QVDashboardTableViewCell.h"

namespace {

QVTimeScopeControl* makeControl() {
    return new QVTimeScopeControl(
        {QVTimeScope::Day, QVTimeScope::Week, QVTimeScope::Month, QVTimeScope::Year});
}

bool showsDataType(const VSDataUnitGroup& group, const VSObjectType* dataType) {
    return std::any_of(group.dataUnits().begin(), group.dataUnits().end(),
                       [dataType](const VSDataUnit* unit) { return unit->dataType() == dataType; });
}

}  // namespace

struct QVDashboardViewController::Observer final : QVDashboardDataUnitGroupsObserver,
                                                   QVDataProviderOrderObserver {
    explicit Observer(QVDashboardViewController& owner) : screen(owner) {}
    void dashboardDataUnitGroupsUpdated(const Groups&) override { screen.reloadDataUnitGroups(); }
    void dataProviderOrderUpdated(const std::vector<VSSource>&, const VSObjectType* dataType) override {
        screen.dataProviderOrderUpdated(dataType);
    }
    QVDashboardViewController& screen;
};

QVDashboardViewController::QVDashboardViewController(std::shared_ptr<QVControllerManager> controllerManager,
                                                     ScreenFactory detailScreen)
    : controllerManager_(std::move(controllerManager)),
      detailScreen_(std::move(detailScreen)),
      timeScopeControl_(makeControl()),
      table_(std::make_unique<QVDashboardTable>()),
      observer_(std::make_shared<Observer>(*this)) {
    controllerManager_->dataProviderOrderController().addObserver(observer_);
    setTitle(platform::localized("DASHBOARD"));
    connect(&platform::SystemEvents::shared(), &platform::SystemEvents::localeDidChange, this,
            &QVDashboardViewController::localeDidChange);
    setUserActivity(QVUserActivityManager::activity(title(), {}, QVUserActivityTab::Dashboard));
    connect(timeScopeControl_.get(), &QVTimeScopeControl::valueChanged, this,
            &QVDashboardViewController::timeScopeDidChange);
}

QVDashboardViewController::~QVDashboardViewController() = default;

QUrl QVDashboardViewController::view() const {
    return QUrl(QStringLiteral("qrc:/Qelvar/QVDashboardViewController.qml"));
}

QAbstractItemModel* QVDashboardViewController::table() const {
    return table_.get();
}

QString QVDashboardViewController::emptyStateTitle() const {
    return platform::localized("DASHBOARD_EMPTY");
}
QString QVDashboardViewController::emptyStateHelp() const {
    return platform::localized("DASHBOARD_EMPTY_HELP");
}
QString QVDashboardViewController::importTitle() const {
    return platform::localized("IMPORT_ACTION");
}

double QVDashboardViewController::emptyStateHelpMargin(double screenWidth) {
    if (screenWidth > 375) return 10;
    return screenWidth > 320 ? 50 : 20;
}

void QVDashboardViewController::willAppear() {
    controllerManager_->dashboardDataUnitGroupsController().addObserver(observer_);
    reloadDataUnitGroups();
    timeScopeControl_->setSelectedTimeScope(
        controllerManager_->selectedTimeScopeController().selectedTimeScope());
    timeScopeDidChange();
}

void QVDashboardViewController::willDisappear() {
    controllerManager_->dashboardDataUnitGroupsController().removeObserver(observer_.get());
}

void QVDashboardViewController::reloadDataUnitGroups() {
    QVControllerManager& manager = *controllerManager_;
    dashboardDataUnitGroups_ = manager.dashboardDataUnitGroupsController().dataUnitGroupsForDashboard();
    std::set<int> ids;
    for (const VSDataUnitGroup* group : dashboardDataUnitGroups_) ids.insert(group->dataUnitGroupID());
    std::erase_if(dashboardChartItems_, [&ids](const auto& entry) { return !ids.contains(entry.first); });
    for (const VSDataUnitGroup* group : dashboardDataUnitGroups_) {
        auto& item = dashboardChartItems_[group->dataUnitGroupID()];
        if (!item)
            item = QVDashboardChartItem::create(
                group, manager.dataCategoryController().categoryWithID(group->categoryID()),
                manager.unitController(), manager.healthStore());
    }
    updateEmptyState();
    table_->setGroups(dashboardDataUnitGroups_);
    reloadTable();
}

void QVDashboardViewController::updateEmptyState() {
    // A list that has not been read yet is not an empty one.
    const bool empty = dashboardDataUnitGroups_.empty() &&
                       controllerManager_->dashboardDataUnitGroupsController().hasLoadedDashboard();
    if (empty == showsEmptyState_) return;
    showsEmptyState_ = empty;
    emit emptyStateChanged();
}

void QVDashboardViewController::reloadTable() {
    emit tableReloaded();
}

void QVDashboardViewController::prepareCell(QVDashboardTableViewCell& cell, int row) {
    if (row < 0 || row >= static_cast<int>(table_->groups().size())) return;
    const auto& item = dashboardChartItems_.at(table_->groups()[static_cast<size_t>(row)]->dataUnitGroupID());
    // The cache is a member of the manager and lives as long.
    cell.setDateCache(std::shared_ptr<QVDateCache>(controllerManager_, &controllerManager_->dateCache()));
    cell.setTimeScope(controllerManager_->selectedTimeScopeController().selectedTimeScope());
    cell.setChartItem(item);
    item->activate();
}

void QVDashboardViewController::selectRow(int row) {
    if (row < 0 || row >= static_cast<int>(table_->groups().size()) || !detailScreen_ || !navigationStack())
        return;
    navigationStack()->push(detailScreen_(table_->groups()[static_cast<size_t>(row)]));
}

void QVDashboardViewController::timeScopeDidChange() {
    controllerManager_->selectedTimeScopeController().setSelectedTimeScope(
        timeScopeControl_->selectedTimeScope());
    reloadTable();
}

void QVDashboardViewController::localeDidChange() {
    setTitle(platform::localized("DASHBOARD"));
    timeScopeControl_->updateTitles();
    emit textsChanged();
    table_->updateNames();
    for (const auto& [id, item] : dashboardChartItems_) item->setLocaleDidChange(true);
    reloadTable();
}

void QVDashboardViewController::dataProviderOrderUpdated(const VSObjectType* dataType) {
    bool changed = false;
    for (const auto& [id, item] : dashboardChartItems_) {
        if (!showsDataType(*item->dataUnitGroup(), dataType)) continue;
        item->invalidateChart();
        changed = true;
    }
    if (changed) reloadTable();
}
