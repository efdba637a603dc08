#include "Qelvar/DataProviders/QVGroupDataProvider.h"

#include <algorithm>

#include "Platform/Localization.h"
#include "Qelvar/DataProviders/QVChartSeriesFactory.h"
#include "Qelvar/DataProviders/QVDataUnitGroupDataProviders.h"
#include "Qelvar/Formatters/QVNumberFormatters.h"

namespace {

// The look of the composite text of a blood pressure.
constexpr double markerRadius = 3.0;
constexpr double markerLineWidth = 1.5;
constexpr double markerSpacing = 2.5;
constexpr double pieceSpacing = 3.0;

}  // namespace

std::shared_ptr<QVGroupDataProvider> QVGroupDataProvider::create(
    const VSDataUnitGroup* dataUnitGroup, std::shared_ptr<VSUnitController> unitController,
    const std::shared_ptr<VSHealthStore>& healthStore) {
    std::shared_ptr<QVGroupDataProvider> group(
        new QVGroupDataProvider(dataUnitGroup, std::move(unitController), healthStore));
    for (const auto& [dataUnit, provider] : group->dataProviders_) provider->setDelegate(group);
    return group;
}

QVGroupDataProvider::QVGroupDataProvider(const VSDataUnitGroup* dataUnitGroup,
                                         std::shared_ptr<VSUnitController> unitController,
                                         const std::shared_ptr<VSHealthStore>& healthStore)
    : dataUnitGroup_(dataUnitGroup), unitController_(std::move(unitController)) {
    for (const VSDataUnit* unit : dataUnitGroup_->dataUnitsOrderedForDataEntry())
        dataProviders_.emplace(
            unit, qv_dataProviderForDataUnit(dataUnitGroup_, unit, dataUnitGroup_->chartingRules(),
                                             healthStore, unitController_));
    chartSeries_ = QVChartSeriesForDataUnitGroup(dataUnitGroup_, timeScope_);
}

template <typename Predicate>
bool QVGroupDataProvider::allProviders(Predicate predicate) const {
    return std::all_of(dataProviders_.begin(), dataProviders_.end(),
                       [&](const auto& entry) { return predicate(*entry.second); });
}

bool QVGroupDataProvider::hasLoadedHistoricalData() const {
    return allProviders([](const QVDataProvider& provider) { return provider.hasLoadedHistoricalData(); });
}

bool QVGroupDataProvider::hasLoadedCurrentValueData() const {
    return allProviders([](const QVDataProvider& provider) { return provider.hasLoadedCurrentValue(); });
}

bool QVGroupDataProvider::isWaiting() const {
    return !allProviders([](const QVDataProvider& provider) { return !provider.isWaiting(); });
}

bool QVGroupDataProvider::holdsCurrentValueData() const {
    return allProviders([](const QVDataProvider& provider) { return provider.holdsCurrentValue(); });
}

bool QVGroupDataProvider::hasLoadedSecondaryValueData() const {
    return allProviders([](const QVDataProvider& provider) { return provider.hasLoadedSecondaryValues(); });
}

std::optional<double> QVGroupDataProvider::averageValueForDataUnit(const VSDataUnit* dataUnit) const {
    return providerForDataUnit(dataUnit)->averageValue();
}

std::optional<double> QVGroupDataProvider::currentValueForDataUnit(const VSDataUnit* dataUnit) const {
    return providerForDataUnit(dataUnit)->currentValue();
}

void QVGroupDataProvider::setStartDate(std::optional<VSDate> startDate, std::optional<VSDate> endDate,
                                       QVTimeScope timeScope) {
    startDate_ = startDate;
    endDate_ = endDate;
    timeScope_ = timeScope;
    chartSeries_ = QVChartSeriesForDataUnitGroup(dataUnitGroup_, timeScope_);
    const auto& units = dataUnitGroup_->dataUnits();
    pendingHistoricalRequests_ = {units.begin(), units.end()};
    for (const auto& [dataUnit, provider] : dataProviders_) {
        provider->setStartDate(startDate_, endDate_, timeScope_);
        if (isActive_) provider->restartQueries();
    }
}

void QVGroupDataProvider::activate() {
    if (isActive_) return;
    for (const VSDataUnit* unit : dataUnitGroup_->dataUnits()) providerForDataUnit(unit)->restartQueries();
    isActive_ = true;
}

void QVGroupDataProvider::deactivate() {
    for (const auto& [dataUnit, provider] : dataProviders_) provider->stopQueries();
    isActive_ = false;
}

void QVGroupDataProvider::invalidateCachedData() {
    for (const auto& [dataUnit, provider] : dataProviders_) provider->invalidateCachedData();
}

void QVGroupDataProvider::dayDidChange() {
    if (!isActive_) return;
    for (const auto& [dataUnit, provider] : dataProviders_) provider->restartQueriesOfAnotherDay();
}

void QVGroupDataProvider::localeDidChange() {
    chartSeries_ = QVChartSeriesForDataUnitGroup(dataUnitGroup_, timeScope_);
}

// Secondary text

platform::StyledText QVGroupDataProvider::secondaryValueText() const {
    if (dataUnitGroup_->dataUnitGroupID() == VSGroupID::BloodPressure) return bloodPressureSecondaryText();
    return providerForDataUnit(dataUnitGroup_->dataUnitsOrderedForDataEntry().back())->secondaryValueText();
}

platform::StyledText QVGroupDataProvider::bloodPressureSecondaryText() const {
    using platform::StyledText;
    std::vector<StyledText> pieces;
    const auto& units = dataUnitGroup_->dataUnitsOrderedForDataEntry();
    for (size_t i = 0; i < units.size(); ++i) {
        const QImage marker = QVChartSeriesPointMarker::chartPointForText(
            Qt::white, markerRadius, markerLineWidth, QVPointStyleForDataUnitAtIndex(dataUnitGroup_, i));
        pieces.push_back(
            platform::prefixedWithImage(minMaxSecondaryTextForDataUnit(units[i]), marker, 0, markerSpacing));
        pieces.push_back(StyledText::spacer(pieceSpacing));
        if (i + 1 < units.size()) {
            pieces.emplace_back(dataUnitGroup_->joinString());
            pieces.push_back(StyledText::spacer(pieceSpacing));
        } else {
            pieces.emplace_back(unitController_->displayNameForDataUnit(units[i]));
        }
    }
    return platform::joinForLocale(pieces);
}

platform::StyledText QVGroupDataProvider::minMaxSecondaryTextForDataUnit(const VSDataUnit* dataUnit) const {
    using platform::StyledText;
    const QVDataProvider& provider = *providerForDataUnit(dataUnit);
    const auto text = [&](std::optional<double> value) {
        if (!value || !hasLoadedSecondaryValueData()) return QVNoDataString();
        return QVStringFromNumberInDisplayRange(*value, dataUnit, *unitController_, false);
    };
    QString first = text(provider.minValue());
    QString last = text(provider.maxValue());
    if (first == last) return StyledText(first);
    // A range reads from the lower to the higher number in a left-to-right run, also inside right-to-left
    // text.
    if (platform::isRightToLeft()) std::swap(first, last);
    return platform::joinForLocale(
        {StyledText(first), StyledText(platform::localized("RANGE_SEPARATOR")), StyledText(last)});
}

// The chart renderer asks

const QVDataProvider& QVGroupDataProvider::providerAtIndex(size_t index) const {
    return *providerForDataUnit(dataUnitGroup_->dataUnitsOrderedForDataEntry().at(index));
}

bool QVGroupDataProvider::dataForChartRendererIsFinishedLoading(const QVChartRenderer&) {
    return hasLoadedHistoricalData();
}

size_t QVGroupDataProvider::numberOfSeriesInChartRenderer(const QVChartRenderer&) {
    return dataUnitGroup_->dataUnits().size();
}

std::shared_ptr<const QVChartSeries> QVGroupDataProvider::seriesAtIndex(const QVChartRenderer&,
                                                                        size_t index) {
    return chartSeriesForIndex(index);
}

size_t QVGroupDataProvider::numberOfDataPointsForSeriesAtIndex(const QVChartRenderer&, size_t seriesIndex) {
    return providerAtIndex(seriesIndex).historicalData().size();
}

std::shared_ptr<QVChartPoint> QVGroupDataProvider::dataPointAtIndex(const QVChartRenderer&, size_t pointIndex,
                                                                    size_t seriesIndex) {
    return providerAtIndex(seriesIndex).historicalData().at(pointIndex);
}

VSDataUnitGroupChartingRules::Bounds QVGroupDataProvider::adjustChartBounds(double min, double max) {
    const VSUnit unit = unitController_->unitForDataUnit(dataUnitGroup_->anyDataUnit());
    return dataUnitGroup_->chartingRules().calculateAdjustedBounds(min, max, unit);
}

// The providers tell

void QVGroupDataProvider::dataProviderDidUpdateHistoricalData(QVDataProvider& provider) {
    pendingHistoricalRequests_.erase(provider.dataUnit());
    if (pendingHistoricalRequests_.empty()) tellHistoricalData();
}

void QVGroupDataProvider::dataProviderDidConfirmHistoricalData(QVDataProvider& provider) {
    // The last answer that was waited for: what another unit brought meanwhile has been withheld until now.
    if (pendingHistoricalRequests_.erase(provider.dataUnit()) > 0 && pendingHistoricalRequests_.empty())
        tellHistoricalData();
}

void QVGroupDataProvider::tellHistoricalData() {
    if (const auto delegate = delegate_.lock()) delegate->groupDataProviderDidUpdateHistoricalData(*this);
}

void QVGroupDataProvider::dataProviderDidUpdateCurrentValueData(QVDataProvider&) {
    lastUpdatedDate_.reset();
    // An absent date is earlier than any other.
    for (const auto& [dataUnit, provider] : dataProviders_)
        lastUpdatedDate_ = std::max(lastUpdatedDate_, provider->lastUpdatedDate());
    if (const auto delegate = delegate_.lock()) delegate->groupDataProviderDidUpdateCurrentValueData(*this);
}

void QVGroupDataProvider::dataProviderDidUpdateSecondaryData(QVDataProvider&) {
    if (const auto delegate = delegate_.lock()) delegate->groupDataProviderDidUpdateSecondaryData(*this);
}
