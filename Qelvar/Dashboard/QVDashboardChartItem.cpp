#include "Qelvar/Dashboard/QVDashboardChartItem.h"

#include <QStringList>

#include "Platform/Queue.h"
#include "Platform/TextScale.h"
#include "Qelvar/Formatters/QVDataUnitValueFormatter.h"
#include "Qelvar/Formatters/QVNumberFormatters.h"

std::shared_ptr<QVDashboardChartItem> QVDashboardChartItem::create(
    const VSDataUnitGroup* dataUnitGroup, const VSDataCategory* dataCategory,
    std::shared_ptr<VSUnitController> unitController, const std::shared_ptr<VSHealthStore>& healthStore) {
    std::shared_ptr<QVDashboardChartItem> item(
        new QVDashboardChartItem(dataUnitGroup, dataCategory, std::move(unitController), healthStore));
    item->dataProvider_->setDelegate(item);
    return item;
}

QVDashboardChartItem::QVDashboardChartItem(const VSDataUnitGroup* dataUnitGroup,
                                           const VSDataCategory* dataCategory,
                                           std::shared_ptr<VSUnitController> unitController,
                                           const std::shared_ptr<VSHealthStore>& healthStore)
    : dataUnitGroup_(dataUnitGroup),
      dataCategory_(dataCategory),
      unitController_(std::move(unitController)),
      dataProvider_(QVGroupDataProvider::create(dataUnitGroup_, unitController_, healthStore)),
      chartRenderer_(QVChartRenderer::create(platform::mainQueue(), dataProvider_)) {}

void QVDashboardChartItem::setLocaleDidChange(bool changed) {
    localeDidChange_ = changed;
    if (!changed) return;
    dataProvider_->localeDidChange();
    if (startDate_) chartRenderer_->setChartInsets(chartInsetsForTimeScope(timeScope_));
}

void QVDashboardChartItem::activate() {
    if (active_) return;
    active_ = true;
    dataProvider_->activate();
}

void QVDashboardChartItem::deactivate() {
    active_ = false;
}

void QVDashboardChartItem::invalidateChart() {
    dataProvider_->deactivate();
    dataProvider_->invalidateCachedData();
    dataProvider_->activate();
}

void QVDashboardChartItem::updateDateRange(QVDateCache& dateCache, QVTimeScope timeScope) {
    const bool noon = timeScope == QVTimeScope::Day && dataUnitGroup_->chartingRules().shouldStartDayAtNoon();
    const auto start = QVDateCacheStartDate(dateCache, timeScope, noon);
    const auto end = QVDateCacheEndDate(dateCache, timeScope, noon);
    // An absent date counts as different, so the hour is always set anew.
    const bool same = timeScope == timeScope_ && start && end && startDate_ == start && endDate_ == end;
    startDate_ = start;
    endDate_ = end;
    timeScope_ = timeScope;
    if (same) return dataProvider_->dayDidChange();
    chartRenderer_->setMinXValue(start);
    chartRenderer_->setMaxXValue(end);
    chartRenderer_->setChartInsets(chartInsetsForTimeScope(timeScope));
    chartRenderer_->dropCachedImages();
    dataProvider_->setStartDate(start, end, timeScope);
}

QVEdgeInsets QVDashboardChartItem::chartInsetsForTimeScope(QVTimeScope timeScope) {
    // The labels of the bounds stand at the right; at the left a first date that is too long for half of what
    // it needs moves over.
    const double scale = platform::textScale(), half = (1 + scale) / 2;
    switch (timeScope) {
        case QVTimeScope::Day:
            return {.top = 0, .left = 26 * half, .bottom = 0, .right = 38 * scale};
        case QVTimeScope::Week:
            return {.top = 0, .left = 13 * half, .bottom = 0, .right = 39 * scale};
        case QVTimeScope::Month:
            return {.top = 0, .left = 24 * half, .bottom = 0, .right = 36 * scale};
        case QVTimeScope::Year:
            return {.top = 0, .left = 14 * half, .bottom = 0, .right = 41 * scale};
        case QVTimeScope::Hour:
            break;
    }
    return {};
}

platform::StyledText QVDashboardChartItem::mostRecentValue(const QFont& valueFont,
                                                           const QFont& unitFont) const {
    if (!dataProvider_->holdsCurrentValueData()) return {};
    const auto& units = dataUnitGroup_->dataUnits();
    if (units.size() == 1) {
        const auto value = singleCurrentValue();
        if (!value) return platform::StyledText(QVNoDataString());
        const auto formatter =
            qv_valueFormatterForUnit(units.front(), unitController_->unitForDataUnit(units.front()));
        return formatter->attributedStringFromValue(*value, dataUnitGroup_, *unitController_, valueFont,
                                                    unitFont);
    }
    QStringList texts;
    for (const VSDataUnit* unit : units) {
        const auto value = dataProvider_->currentValueForDataUnit(unit);
        texts.append(value ? QVStringFromNumberInDisplayRange(*value, unit, *unitController_, false)
                           : QVNoDataString());
    }
    return platform::StyledText(texts.join(dataUnitGroup_->joinString()));
}

std::optional<double> QVDashboardChartItem::singleCurrentValue() const {
    const auto& units = dataUnitGroup_->dataUnits();
    if (units.size() != 1) return std::nullopt;
    return dataProvider_->currentValueForDataUnit(units.front());
}

QString QVDashboardChartItem::mostRecentValueUnitString() const {
    const auto value = singleCurrentValue();
    return value ? unitController_->displayNameForDataUnit(dataUnitGroup_->dataUnits().front(), *value)
                 : QString();
}

QString QVDashboardChartItem::mostRecentValueUnitIcon() const {
    return singleCurrentValue() ? dataUnitGroup_->unitIcon() : QString();
}

std::optional<VSDate> QVDashboardChartItem::lastUpdated() const {
    return dataProvider_->lastUpdatedDate();
}

platform::StyledText QVDashboardChartItem::secondaryValue() const {
    return dataProvider_->secondaryValueText();
}

bool QVDashboardChartItem::shouldHideAverageLineForTimeScope(QVTimeScope) const {
    return dataUnitGroup_->chartingRules().shouldHideAverageLine();
}

bool QVDashboardChartItem::shouldHideMinMaxOnBackgroundForTimeScope(QVTimeScope timeScope) const {
    switch (dataUnitGroup_->chartingRules().chartStyleForTimeScope(QVTimeScopeIndex(timeScope))) {
        case VSChartStyle::Periods:
        case VSChartStyle::StackedPeriods:
        case VSChartStyle::CenteredLine:
            return true;
        default:
            return false;
    }
}

void QVDashboardChartItem::groupDataProviderDidUpdateHistoricalData(QVGroupDataProvider&) {
    if (const auto delegate = delegate_.lock()) delegate->chartItemDidUpdateHistoricalData(*this);
}

void QVDashboardChartItem::groupDataProviderDidUpdateSecondaryData(QVGroupDataProvider&) {
    if (const auto delegate = delegate_.lock()) delegate->chartItemDidUpdateSecondaryValueData(*this);
}

void QVDashboardChartItem::groupDataProviderDidUpdateCurrentValueData(QVGroupDataProvider&) {
    if (const auto delegate = delegate_.lock()) delegate->chartItemDidUpdateCurrentValueData(*this);
}
