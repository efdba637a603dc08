#include "Qelvar/DataProviders/QVDataProvider.h"

#include <algorithm>
#include <string>

#include "Platform/Localization.h"
#include "Qelvar/Formatters/QVNumberFormatters.h"
#include "Vessa/Base/VSCalendar.h"
#include "Vessa/Base/VSEnvironment.h"
#include "Vessa/Base/VSLog.h"

namespace {

bool samePoints(const QVDataProvider::Points& a, const QVDataProvider::Points& b) {
    return std::equal(a.begin(), a.end(), b.begin(), b.end(),
                      [](const QVChartPointPtr& x, const QVChartPointPtr& y) { return *x == *y; });
}

/// Missing values equal nothing, not even each other.
template <typename T>
bool presentAndEqual(const std::optional<T>& a, const std::optional<T>& b) {
    return a && b && *a == *b;
}

std::string inTimeScope(const char* what, QVTimeScope timeScope) {
    return std::string(what) + " for time scope (" + std::to_string(static_cast<int64_t>(timeScope)) + ")";
}

std::string logLine(const char* className, std::string_view what, const VSError& error) {
    return std::string(className) + ": " + std::string(what) + ": " + error.message;
}

bool isLate(QVDataProvider::Ticket ticket, QVDataProvider::Ticket& accepted) {
    if (ticket == 0) return false;
    if (ticket < accepted) return true;
    accepted = ticket;
    return false;
}

QVDataState stateAfter(const QVDataProvider::Error& error) {
    return error ? QVDataState::Failed : QVDataState::Loaded;
}

}  // namespace

QVDataProvider::QVDataProvider(const VSDataUnit* dataUnit, const VSDataUnitGroupChartingRules& chartingRules,
                               std::shared_ptr<VSUnitController> unitController,
                               std::shared_ptr<VSHealthStore> healthStore)
    : unitController_(std::move(unitController)),
      healthStore_(std::move(healthStore)),
      dataUnit_(dataUnit),
      chartingRules_(chartingRules) {
    if (dataUnit_->dataType()->isQuantityType()) keptUnit_ = preferredUnit();
    unitPreferences_ = QObject::connect(
        unitController_.get(), &VSUnitController::unitPreferencesDidChange,
        [this](const QSet<const VSObjectType*>& changedTypes) { unitPreferencesDidChange(changedTypes); });
}

QVDataProvider::~QVDataProvider() {
    QObject::disconnect(unitPreferences_);
}

void QVDataProvider::setStartDate(std::optional<VSDate> startDate, std::optional<VSDate> endDate,
                                  QVTimeScope timeScope) {
    startDate_ = startDate;
    endDate_ = endDate;
    timeScope_ = timeScope;
}

std::optional<VSDateComponents> QVDataProvider::intervalComponentsForTimeScope(QVTimeScope timeScope) const {
    const VSDateComponents interval =
        chartingRules_.intervalComponentsForTimeScope(QVTimeScopeIndex(timeScope));
    if (interval.isZero()) return std::nullopt;
    return interval;
}

VSDate QVDataProvider::dateOfCurrentValue(const VSTimeSpan& span) {
    const VSDate last = VSLastMomentOfSpan(span, VSCalendar::current());
    const VSDate now = VSEnvironment::current()->now();
    return span.start <= now ? std::min(last, now) : last;
}

QString QVDataProvider::secondaryTextForValue(Value value) const {
    return value ? QVStringFromNumberInDisplayRange(*value, dataUnit_, *unitController_, false)
                 : QVNoDataString();
}

platform::StyledText QVDataProvider::secondaryValueText() const {
    const QString text = secondaryTextForValue(hasLoadedSecondaryValues() ? averageValue() : std::nullopt);
    // A day alone has no daily average: what is told beside it is that of the week.
    const char* key = timeScope_ == QVTimeScope::Day ? "SEVEN_DAY_AVG %@" : "DAILY_AVG %@";
    return platform::StyledText(platform::localized(key, {text}));
}

void QVDataProvider::restartQueries() {
    CacheValue& entry = cache(timeScope_);
    if (entry.historicalDataState != QVDataState::Loaded) entry.historicalDataState = QVDataState::Loading;
    if (entry.secondaryValueDataState != QVDataState::Loaded)
        entry.secondaryValueDataState = QVDataState::Loading;
}

void QVDataProvider::stopQueries() {
    CacheValue& entry = cache(timeScope_);
    if (entry.historicalDataState == QVDataState::Loading) entry.historicalDataState = QVDataState::NotLoaded;
    if (entry.secondaryValueDataState == QVDataState::Loading)
        entry.secondaryValueDataState = QVDataState::NotLoaded;
}

void QVDataProvider::invalidateCachedData() {
    currentValueDataState_ = QVDataState::NotLoaded;
    currentValueWasConverted_ = false;
}

void QVDataProvider::restartQueriesOfAnotherDay() {
    const Today today = Today::now();
    if (currentValueAskedOn_.value_or(today) != today || secondaryValueAskedOn_.value_or(today) != today)
        restartQueries();
}

QVDataProvider::Today QVDataProvider::Today::now() {
    const VSCalendar calendar = VSCalendar::current();
    return {calendar.startOfDay(VSEnvironment::current()->now()), calendar.timeZoneIdentifier()};
}

bool QVDataProvider::needsCurrentValueQuery(const QVRunningQuery& query) const {
    return !query.isRunning() || !hasLoadedCurrentValue() || currentValueAskedOn_ != Today::now();
}

bool QVDataProvider::needsSecondaryValueQuery(const QVRunningQuery& query) const {
    return !query.isRunning() || !hasLoadedSecondaryValues() || secondaryValueAskedOn_ != Today::now();
}

QVDataProvider::Ticket QVDataProvider::beginQuery(Answer answer, std::optional<QVTimeScope> timeScope) {
    const Ticket ticket = nextTicket();
    if (answer == Answer::CurrentValue) {
        currentValueTicket_ = ticket;
        currentValueAskedOn_ = Today::now();
        return ticket;
    }
    if (answer == Answer::Secondary) secondaryValueAskedOn_ = Today::now();
    for (size_t i = 0; i < cacheValues_.size(); ++i) {
        if (timeScope && static_cast<size_t>(*timeScope) != i) continue;
        CacheValue& entry = cacheValues_[i];
        (answer == Answer::Historical ? entry.historicalTicket : entry.secondaryTicket) = ticket;
    }
    return ticket;
}

// The answers, on the main thread

void QVDataProvider::takeHistoricalData(Points points, QVTimeScope timeScope, const Error& error,
                                        const Unit& unit, Ticket ticket) {
    CacheValue& entry = cache(timeScope);
    if (isLate(ticket, entry.historicalTicket)) return;
    entry.historicalDataState = stateAfter(error);
    if (error) intake().logError(inTimeScope("Error loading historical data", timeScope), *error);
    if (timeScope != timeScope_) return;

    if (isForeign(unit)) points = converted(points, *unit, *keptUnit_);
    const auto delegate = delegate_.lock();
    if (!error && entry.holdsHistoricalData && samePoints(entry.historicalData, points)) {
        if (delegate) delegate->dataProviderDidConfirmHistoricalData(*this);
        return;
    }
    entry.holdsHistoricalData = !error;
    entry.historicalData = std::move(points);
    if (delegate) delegate->dataProviderDidUpdateHistoricalData(*this);
}

void QVDataProvider::takeAverage(Value average, Value min, Value max, QVTimeScope timeScope,
                                 const Error& error, const Unit& unit, Ticket ticket) {
    CacheValue& entry = cache(timeScope);
    if (isLate(ticket, entry.secondaryTicket)) return;
    entry.secondaryValueDataState = stateAfter(error);
    if (error) intake().logError(inTimeScope("Error updating average/min/max", timeScope), *error);
    if (isForeign(unit)) {
        average = converted(average, *unit, *keptUnit_);
        min = converted(min, *unit, *keptUnit_);
        max = converted(max, *unit, *keptUnit_);
    }
    if (presentAndEqual(entry.averageValue, average) && presentAndEqual(entry.minValue, min) &&
        presentAndEqual(entry.maxValue, max))
        return;
    entry.averageValue = average;
    entry.minValue = min;
    entry.maxValue = max;
    if (const auto delegate = delegate_.lock()) delegate->dataProviderDidUpdateSecondaryData(*this);
}

void QVDataProvider::takeCurrentValue(Value value, std::optional<VSDate> date, const Error& error,
                                      const Unit& unit, Ticket ticket) {
    if (isLate(ticket, currentValueTicket_)) return;
    // After an invalidation nothing is shown until the answer comes, so it is told even when it is the same.
    const bool wasLoaded = hasLoadedCurrentValue();
    currentValueDataState_ = stateAfter(error);
    currentValueWasConverted_ = false;
    if (error) intake().logError("Error updating current value data", *error);
    if (isForeign(unit)) value = converted(value, *unit, *keptUnit_);
    if (wasLoaded && presentAndEqual(currentValue_, value) && presentAndEqual(lastUpdatedDate_, date)) return;
    currentValue_ = value;
    lastUpdatedDate_ = date;
    if (const auto delegate = delegate_.lock()) delegate->dataProviderDidUpdateCurrentValueData(*this);
}

// The answers, on any thread

void QVDataProvider::Intake::updateHistoricalData(Points points, QVTimeScope timeScope, Error error,
                                                  Unit unit, Ticket ticket) const {
    platform::mainQueue().async([provider = provider_, points = std::move(points), timeScope,
                                 error = std::move(error), unit, ticket] {
        if (const auto self = provider.lock())
            self->takeHistoricalData(points, timeScope, error, unit, ticket);
    });
}

void QVDataProvider::Intake::updateAverage(Value average, Value min, Value max, QVTimeScope timeScope,
                                           Error error, Unit unit, Ticket ticket) const {
    platform::mainQueue().async(
        [provider = provider_, average, min, max, timeScope, error = std::move(error), unit, ticket] {
            if (const auto self = provider.lock())
                self->takeAverage(average, min, max, timeScope, error, unit, ticket);
        });
}

void QVDataProvider::Intake::updateSecondaryValue(Value value, const Error& error, Ticket ticket) const {
    for (int i = 0; i < QVTimeScopeCount; ++i)
        updateAverage(value, {}, {}, QVTimeScope{i}, error, {}, ticket);
}

void QVDataProvider::Intake::updateCurrentValue(Value value, std::optional<VSDate> date, Error error,
                                                Unit unit, Ticket ticket) const {
    platform::mainQueue().async([provider = provider_, value, date, error = std::move(error), unit, ticket] {
        if (const auto self = provider.lock()) self->takeCurrentValue(value, date, error, unit, ticket);
    });
}

void QVDataProvider::Intake::logError(std::string_view what, const VSError& error) const {
    const VSLogLevel level = vs_isDatabaseAccessibilityError(error) ? VSLogLevel::Debug : VSLogLevel::Error;
    if (VSLogIsEnabled(level)) VSLog(level, logLine(className_, what, error));
}

void QVDataProvider::Intake::logErrorAlways(std::string_view what, const VSError& error) const {
    if (VSLogIsEnabled(VSLogLevel::Error)) VSLog(VSLogLevel::Error, logLine(className_, what, error));
}

// Units

void QVDataProvider::unitPreferencesDidChange(const QSet<const VSObjectType*>& changedTypes) {
    if (!changedTypes.contains(dataUnit_->dataType())) return;
    // The delegate may let go of the provider when it is told.
    const auto keepAlive = shared_from_this();
    if (keptUnit_) {
        const VSUnit before = *keptUnit_;
        keptUnit_ = preferredUnit();
        if (before != *keptUnit_) convertCachedValues(before, *keptUnit_);
    }
    const bool held = holdsCurrentValue();
    invalidateCachedData();
    currentValueWasConverted_ = held;
    restartQueries();
}

void QVDataProvider::convertCachedValues(const VSUnit& from, const VSUnit& to) {
    for (CacheValue& entry : cacheValues_) {
        entry.historicalData = converted(entry.historicalData, from, to);
        entry.averageValue = converted(entry.averageValue, from, to);
        entry.minValue = converted(entry.minValue, from, to);
        entry.maxValue = converted(entry.maxValue, from, to);
    }
    currentValue_ = converted(currentValue_, from, to);
    const auto delegate = delegate_.lock();
    if (!delegate) return;
    if (hasLoadedHistoricalData()) delegate->dataProviderDidUpdateHistoricalData(*this);
    if (hasLoadedSecondaryValues()) delegate->dataProviderDidUpdateSecondaryData(*this);
    if (holdsCurrentValue()) delegate->dataProviderDidUpdateCurrentValueData(*this);
}

QVDataProvider::Value QVDataProvider::converted(Value value, const VSUnit& from, const VSUnit& to) const {
    if (!value) return std::nullopt;
    const auto stored = from.convert(dataUnit_->adjustedValueForClientValue(*value), to);
    if (!stored) return std::nullopt;
    return dataUnit_->adjustedValueForDaemonValue(*stored);
}

QVDataProvider::Points QVDataProvider::converted(const Points& points, const VSUnit& from,
                                                 const VSUnit& to) const {
    Points result;
    result.reserve(points.size());
    for (const QVChartPointPtr& point : points) {
        const QVChartYValue y = point->yValue();
        if (const auto* values = std::get_if<QVChartYValues>(&y)) {
            QVChartYValues inNewUnit;
            for (const auto& [key, value] : *values)
                if (const Value number = converted(value, from, to)) inNewUnit.emplace(key, *number);
            result.push_back(QVChartPointDictionary::chartPoint(point->xValue(), std::move(inNewUnit)));
        } else {
            const auto* number = std::get_if<double>(&y);
            result.push_back(QVChartPointNumeric::chartPoint(
                point->xValue(), number ? converted(Value(*number), from, to) : std::nullopt));
        }
    }
    return result;
}
