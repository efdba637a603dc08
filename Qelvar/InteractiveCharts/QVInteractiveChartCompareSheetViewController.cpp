#include "Qelvar/InteractiveCharts/QVInteractiveChartCompareSheetViewController.h"

#include <QQmlEngine>

#include "Platform/Localization.h"
#include "Platform/SystemEvents.h"
#include "Qelvar/Formatters/QVNumberFormatters.h"

namespace {

QString countString(int count) {
    return QVNumberFormatterWithFractionDigits(0)->stringFromNumber(count);
}

}  // namespace

QVInteractiveChartCompareSheetViewController::QVInteractiveChartCompareSheetViewController(
    const Groups& selectedDataUnitGroups, const Groups& allDataUnitGroups,
    std::shared_ptr<QVControllerManager> controllerManager)
    : controllerManager_(std::move(controllerManager)),
      initiallySelected_(selectedDataUnitGroups.begin(), selectedDataUnitGroups.end()),
      table_(selectedDataUnitGroups, allDataUnitGroups, controllerManager_->dataCategoryController()) {
    QQmlEngine::setObjectOwnership(&table_, QQmlEngine::CppOwnership);
    connect(&table_, &QAbstractItemModel::dataChanged, this,
            &QVInteractiveChartCompareSheetViewController::updateTitles);
    connect(&platform::SystemEvents::shared(), &platform::SystemEvents::localeDidChange, this,
            &QVInteractiveChartCompareSheetViewController::localeDidChange);
    updateTitles();
}

QUrl QVInteractiveChartCompareSheetViewController::view() const {
    return QUrl(QStringLiteral("qrc:/Qelvar/QVInteractiveChartCompareSheetViewController.qml"));
}

QString QVInteractiveChartCompareSheetViewController::selectAllTitle() const {
    return platform::localized(table_.isAllSelected() ? "DESELECT_ALL" : "SELECT_ALL");
}

QString QVInteractiveChartCompareSheetViewController::doneTitle() const {
    return platform::localized("DONE");
}

QString QVInteractiveChartCompareSheetViewController::limitText() const {
    if (table_.rowCount() <= QVCompareSheetTable::kLimit) return {};
    return platform::localized("COMPARE_LIMIT", {countString(QVCompareSheetTable::kLimit)});
}

QString QVInteractiveChartCompareSheetViewController::emptyText() const {
    return canSelectAll() ? QString() : platform::localized("DASHBOARD_EMPTY");
}

void QVInteractiveChartCompareSheetViewController::tapRow(int row) {
    if (!finished_) table_.toggle(row);
}

void QVInteractiveChartCompareSheetViewController::tapSelectAll() {
    if (!finished_) table_.setAllSelected(!table_.isAllSelected());
}

void QVInteractiveChartCompareSheetViewController::tapDone() {
    if (finished_) return;
    finished_ = true;
    const Groups selected = table_.selectedGroups();
    const bool changed =
        std::set<const VSDataUnitGroup*>(selected.begin(), selected.end()) != initiallySelected_;
    if (const auto delegate = delegate_.lock())
        delegate->compareSheetViewControllerWillDismissWithSelectedGroups(*this, selected, changed);
    close();
}

void QVInteractiveChartCompareSheetViewController::cancel() {
    if (finished_) return;
    finished_ = true;
    close();
}

void QVInteractiveChartCompareSheetViewController::updateTitles() {
    setTitle(countString(table_.selectedCount()) + QLatin1Char(' ') + platform::localized("SELECTED"));
    emit textsChanged();
}

void QVInteractiveChartCompareSheetViewController::localeDidChange() {
    table_.updateNames();
    updateTitles();
}
