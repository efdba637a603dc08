#include "Qelvar/Dashboard/QVDashboardViewController.h"

#include <algorithm>
#include <set>

#include "Platform/Announcement.h"
#include "Platform/Appearance.h"
#include "Platform/Localization.h"
#include "Platform/NavigationStack.h"
#include "Platform/RestorableState.h"
#include "Platform/SystemEvents.h"
#include "Platform/TextScale.h"
#include "Qelvar/Controllers/QVUserActivityManager.h"
#include "Qelvar/Dashboard/QVDashboardTable.h"
#include "Qelvar/Dashboard/QVDashboardTableViewCell.h"
#include "Qelvar/Formatters/QVNumberFormatters.h"

namespace {

constexpr double kDraggingViewOpacity = 0.8;

// In saved states; never changed.
constexpr const char* kTimeScopeKey = "Time Scope";
constexpr const char* kTableKey = "Dashboard TableView";
constexpr const char* kOffsetKey = "Offset";

QVTimeScopeControl* makeControl() {
    return new QVTimeScopeControl(
        {QVTimeScope::Day, QVTimeScope::Week, QVTimeScope::Month, QVTimeScope::Year});
}

template <typename Values, typename Value>
bool contains(const Values& values, const Value& value) {
    return std::find(values.begin(), values.end(), value) != values.end();
}

QVDashboardViewController::Groups withoutRepetition(const QVDashboardViewController::Groups& groups) {
    QVDashboardViewController::Groups result;
    for (const VSDataUnitGroup* group : groups)
        if (!contains(result, group)) result.push_back(group);
    return result;
}

bool showsDataType(const VSDataUnitGroup& group, const VSObjectType* dataType) {
    return std::any_of(group.dataUnits().begin(), group.dataUnits().end(),
                       [dataType](const VSDataUnit* unit) { return unit->dataType() == dataType; });
}

}  // namespace

struct QVDashboardViewController::Observer final : QVDashboardDataUnitGroupsObserver,
                                                   QVDataProviderOrderObserver,
                                                   QVReorderableTableViewControllerDelegate {
    explicit Observer(QVDashboardViewController& owner) : screen(owner) {}
    void dashboardDataUnitGroupsUpdated(const Groups&) override { screen.reloadDataUnitGroups(); }
    void dataProviderOrderUpdated(const std::vector<VSSource>&, const VSObjectType* dataType) override {
        screen.dataProviderOrderUpdated(dataType);
    }
    void reorderingDidBegin(QVReorderableTableViewController&, int row) override {
        screen.reorderingDidBegin(row);
    }
    void rowDidMove(QVReorderableTableViewController&, int fromRow, int toRow) override {
        screen.rowDidMove(fromRow, toRow);
    }
    void reorderingDidFinish(QVReorderableTableViewController&) override { screen.reorderingDidFinish(); }
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
    setDelegate(observer_);
    setDraggingViewOpacity(kDraggingViewOpacity);
    setTitle(platform::localized("DASHBOARD"));
    connect(&platform::SystemEvents::shared(), &platform::SystemEvents::localeDidChange, this,
            &QVDashboardViewController::localeDidChange);
    connect(&platform::TextScale::shared(), &platform::TextScale::factorChanged, this, [this] {
        emit rowHeightChanged();
        localeDidChange();
    });
    connect(&platform::Appearance::shared(), &platform::Appearance::contrastChanged, this,
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

double QVDashboardViewController::rowHeight() const {
    return QVDashboardTableViewCell::preferredCellHeight();
}

int QVDashboardViewController::numberOfRows() const {
    return table_->rowCount();
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

QString QVDashboardViewController::moveHelp() const {
    return platform::localized("CARD_MOVE_HELP");
}

double QVDashboardViewController::emptyStateHelpMargin(double screenWidth) {
    if (screenWidth > 375) return 10;
    return screenWidth > 320 ? 50 : 20;
}

void QVDashboardViewController::willAppear() {
    controllerManager_->dashboardDataUnitGroupsController().addObserver(observer_);
    controllerManager_->dashboardDataUnitGroupsController().loadAgainIfFailed();
    reloadDataUnitGroups();
    timeScopeControl_->setSelectedTimeScope(
        controllerManager_->selectedTimeScopeController().selectedTimeScope());
    timeScopeDidChange();
}

void QVDashboardViewController::willDisappear() {
    finishReordering();
    controllerManager_->dashboardDataUnitGroupsController().removeObserver(observer_.get());
}

void QVDashboardViewController::reloadDataUnitGroups() {
    if (!placeholderRow_)
        return takeDataUnitGroups(
            controllerManager_->dashboardDataUnitGroupsController().dataUnitGroupsForDashboard());
    // The list changed under a drag: what is in it comes from the change, the order stays the user's.
    const Groups now = controllerManager_->dashboardDataUnitGroupsController().dataUnitGroupsForDashboard();
    Groups groups = table_->groups();
    std::erase_if(groups, [&now](const VSDataUnitGroup* group) { return !contains(now, group); });
    groups.insert(groups.end(), now.begin(), now.end());
    takeDataUnitGroupsDuringDrag(contains(now, draggedGroup()) ? std::move(groups) : now);
}

const VSDataUnitGroup* QVDashboardViewController::draggedGroup() const {
    return table_->groups()[static_cast<size_t>(*placeholderRow_)];
}

void QVDashboardViewController::takeDataUnitGroupsDuringDrag(Groups groups) {
    const VSDataUnitGroup* dragged = draggedGroup();
    groups = withoutRepetition(groups);
    const auto found = std::find(groups.begin(), groups.end(), dragged);
    placeholderRow_.reset();
    if (found != groups.end()) placeholderRow_ = static_cast<int>(found - groups.begin());
    takeDataUnitGroups(std::move(groups));
    rowsDidChange(placeholderRow_);
}

void QVDashboardViewController::takeDataUnitGroups(Groups groups) {
    QVControllerManager& manager = *controllerManager_;
    dashboardDataUnitGroups_ = std::move(groups);
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
    applyScrollOffset();
}

// The order of the cards

void QVDashboardViewController::reorderingDidBegin(int row) {
    placeholderRow_ = row;
    reloadTable();
}

void QVDashboardViewController::rowDidMove(int fromRow, int toRow) {
    Groups groups = table_->groups();
    std::swap(groups[static_cast<size_t>(fromRow)], groups[static_cast<size_t>(toRow)]);
    if (placeholderRow_ == fromRow)
        placeholderRow_ = toRow;
    else if (placeholderRow_ == toRow)
        placeholderRow_ = fromRow;
    dashboardDataUnitGroups_ = std::move(groups);
    table_->setGroups(dashboardDataUnitGroups_);
    reloadTable();
}

void QVDashboardViewController::reorderingDidFinish() {
    placeholderRow_.reset();
    auto& controller = controllerManager_->dashboardDataUnitGroupsController();
    // A card that was put back where it was changes nothing that is stored.
    if (dashboardDataUnitGroups_ != controller.dataUnitGroupsForDashboard())
        controller.setDataUnitGroupsForDashboard(dashboardDataUnitGroups_);
    reloadTable();
}

void QVDashboardViewController::restoreRows() {
    takeDataUnitGroupsDuringDrag(
        controllerManager_->dashboardDataUnitGroupsController().dataUnitGroupsForDashboard());
}

QImage QVDashboardViewController::snapshotOfRow(int row) {
    const int id = table_->groups()[static_cast<size_t>(row)]->dataUnitGroupID();
    const auto& item = dashboardChartItems_.at(id);
    const auto found = std::find_if(cells_.begin(), cells_.end(),
                                    [&item](const auto& cell) { return cell && cell->chartItem() == item; });
    return found == cells_.end() ? QImage() : (*found)->renderCard();
}

void QVDashboardViewController::moveCard(int row, int places) {
    if (row < 0 || row >= numberOfRows() || isDragging()) return;
    const QString name = table_->groups()[static_cast<size_t>(row)]->displayName();
    const bool moved = moveRow(row, places);
    const auto number = [](int value) {
        return QVNumberFormatterWithFractionDigits(0)->stringFromNumber(value);
    };
    platform::announce(
        platform::localized(moved ? "CARD_MOVED" : "CARD_STAYS",
                            {name, number((moved ? row + places : row) + 1), number(numberOfRows())}));
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
    std::erase_if(cells_, [&cell](const auto& known) { return !known || known == &cell; });
    cells_.emplace_back(&cell);
    cell.setContentHidden(row == placeholderRow_);
    // The cache is a member of the manager and lives as long.
    cell.setDateCache(std::shared_ptr<QVDateCache>(controllerManager_, &controllerManager_->dateCache()));
    cell.setTimeScope(controllerManager_->selectedTimeScopeController().selectedTimeScope());
    cell.setChartItem(item);
    item->activate();
}

void QVDashboardViewController::selectRow(int row) {
    if (row < 0 || row >= static_cast<int>(table_->groups().size()) || !detailScreen_ || !navigationStack())
        return;
    if (isDragging()) return;
    navigationStack()->push(detailScreen_(table_->groups()[static_cast<size_t>(row)]));
}

void QVDashboardViewController::timeScopeDidChange() {
    controllerManager_->selectedTimeScopeController().setSelectedTimeScope(
        timeScopeControl_->selectedTimeScope());
    reloadTable();
    emit restorableStateChanged();
}

void QVDashboardViewController::localeDidChange() {
    setTitle(platform::localized("DASHBOARD"));
    setUserActivity(QVUserActivityManager::activity(title(), {}, QVUserActivityTab::Dashboard));
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

// What a later session begins with

void QVDashboardViewController::encodeRestorableState(platform::RestorableState& state) const {
    state.setObject(QVControllerManager::RestorationIdentifier, controllerManager_.get());
    // The control takes it over only when it appears.
    state.set(kTimeScopeKey,
              static_cast<int64_t>(controllerManager_->selectedTimeScopeController().selectedTimeScope()));
    state.set(kTableKey, VSValue::Dictionary{{kOffsetKey, scrollOffset()}});
}

void QVDashboardViewController::decodeRestorableState(const platform::RestorableState& state) {
    if (const auto timeScope = state.integer(kTimeScopeKey))
        restoreTimeScope(static_cast<QVTimeScope>(*timeScope));
    const VSValue* table = state.value(kTableKey);
    const VSValue* offset = table ? (*table)[kOffsetKey] : nullptr;
    if (offset && offset->number()) restoreScrollOffset(*offset->number());
}

void QVDashboardViewController::restoreTimeScope(QVTimeScope timeScope) {
    if (!contains(timeScopeControl_->timeScopes(), timeScope)) return;
    timeScopeControl_->setSelectedTimeScope(timeScope);
    timeScopeDidChange();
}

double QVDashboardViewController::scrollOffset() const {
    const QVTableGeometry geometry = tableGeometry();
    return wantedScrollOffset_.value_or(geometry.restingOffset(geometry.contentOffset));
}

void QVDashboardViewController::restoreScrollOffset(double offset) {
    wantedScrollOffset_ = offset;
    applyScrollOffset();
}

void QVDashboardViewController::applyScrollOffset() {
    const QVTableGeometry geometry = tableGeometry();
    if (!wantedScrollOffset_ || isDragging() || geometry.visibleHeight <= 0 ||
        !controllerManager_->dashboardDataUnitGroupsController().hasReadDashboard())
        return;
    const double offset = geometry.restingOffset(*wantedScrollOffset_);
    wantedScrollOffset_.reset();
    scrollTo(offset);
}
