#include "Qelvar/DataProviders/QVSamplesExistDataProvider.h"

#include <algorithm>

#include "Platform/Localization.h"
#include "Platform/TextScale.h"
#include "Qelvar/Charts/QVChartSeriesPointMarker.h"
#include "Qelvar/DataProviders/QVHealthStoreExtensions.h"
#include "Qelvar/Formatters/QVDateFormatters.h"
#include "Qelvar/Formatters/QVNumberFormatters.h"
#include "VessaUI/VSTimePeriods.h"

namespace {

constexpr double sectionY = 0;
constexpr double accentY = 1;
constexpr int positiveTest = 2;

// The dot before the secondary text.
constexpr double dotRadius = 3.0;
constexpr double dotLineWidth = 1.5;
constexpr double dotBaselineAdjustment = 1.0;
constexpr double dotSpacing = 5.0;

bool startsCycle(const VSSample& sample) {
    const auto entry = sample.metadata().find(VSMetadataKeyMenstrualCycleStart);
    if (entry == sample.metadata().end()) return false;
    return entry->second.boolean().value_or(entry->second.integer() == 1);
}

bool isPositiveTest(const VSSample& sample) {
    const auto* category = dynamic_cast<const VSCategorySample*>(&sample);
    return category && category->value() == positiveTest;
}

}  // namespace

void QVSamplesExistDataProvider::restartQueries() {
    QVDataProvider::restartQueries();
    if (shouldDisplayPrimaryValue() && needsCurrentValueQuery(currentValueQuery_)) restartCurrentValueQuery();
    if (shouldDisplaySecondaryValue() && needsSecondaryValueQuery(secondaryValueQuery_))
        restartSecondaryValueQuery();
    restartHistoricalDataQuery();
}

void QVSamplesExistDataProvider::stopQueries() {
    QVDataProvider::stopQueries();
    currentValueQuery_.stop();
    historicalDataQuery_.stop();
    secondaryValueQuery_.stop();
}

platform::StyledText QVSamplesExistDataProvider::secondaryValueText() const {
    if (!shouldDisplaySecondaryValue()) return {};
    const Value value = secondaryValue();
    const QString date =
        value ? QVShortDateFormatter().stringFromDate(VSDate::fromSecondsSinceReferenceDate(*value))
              : QVNoDataString();
    platform::StyledText text(secondaryTextForDate(date));
    if (!shouldPrefixSecondaryValueWithDot()) return text;
    const QImage dot =
        QVChartSeriesPointMarker::chartPointForText(Qt::white, dotRadius, dotLineWidth, QVPointStyle::Ring);
    return platform::prefixedWithImage(text, dot, dotBaselineAdjustment * platform::textScale(), dotSpacing);
}

// The current value

void QVSamplesExistDataProvider::restartCurrentValueQuery() {
    beginQuery(Answer::CurrentValue);
    auto handler = onMainQueue(this, [](QVSamplesExistDataProvider& self, const Error& error) {
        self.updateMostRecentObject(error);
    });
    currentValueQuery_.start(
        healthStore(), std::make_shared<VSObserverQuery>(dataUnit()->dataType(), VSPredicate{}, handler));
}

void QVSamplesExistDataProvider::updateMostRecentObject(const Error& error) {
    const Ticket ticket = nextTicket();
    if (error) {
        intake().logError("Error executing current value query", *error);
        intake().updateCurrentValue({}, {}, error, {}, ticket);
        return;
    }
    mostRecentCategorySampleOfType(
        *healthStore(), dataUnit()->sampleType(), std::nullopt,
        [intake = intake(), ticket](const VSResult<std::shared_ptr<const VSCategorySample>>& answer) {
            if (answer && *answer) {
                const VSDate date = dateOfCurrentValue({(*answer)->startDate(), (*answer)->endDate()});
                intake.updateCurrentValue((*answer)->value(), date, std::nullopt, {}, ticket);
                return;
            }
            if (!answer) intake.logError("Error fetching most recent sample", answer.error());
            intake.updateCurrentValue({}, {}, answer ? std::nullopt : Error(answer.error()), {}, ticket);
        });
}

// The secondary value

void QVSamplesExistDataProvider::restartSecondaryValueQuery() {
    beginQuery(Answer::Secondary);
    auto handler = onMainQueue(
        this, [](QVSamplesExistDataProvider& self, const Error& error) { self.updateSecondaryValue(error); });
    secondaryValueQuery_.start(
        healthStore(),
        std::make_shared<VSObserverQuery>(dataUnit()->sampleType(), predicateForSecondaryValue(), handler));
}

void QVSamplesExistDataProvider::updateSecondaryValue(const Error& error) {
    const Ticket ticket = nextTicket();
    if (error) {
        intake().logError("Error executing current value query", *error);
        intake().updateSecondaryValue({}, error, ticket);
        return;
    }
    execute(std::make_shared<VSSampleQuery>(
        dataUnit()->sampleType(), predicateForSecondaryValue(), 1,
        std::vector<VSSortDescriptor>{{VSSampleSortIdentifierEndDate, false}},
        [intake = intake(), ticket](const VSResult<std::vector<VSSamplePtr>>& answer) {
            if (!answer) {
                intake.logError("Error updating secondary value query", answer.error());
                intake.updateSecondaryValue({}, answer.error(), ticket);
                return;
            }
            Value latest;
            if (!answer->empty())
                latest =
                    VSLastMomentOfSample(*answer->front(), VSCalendar::current()).secondsSinceReferenceDate();
            intake.updateSecondaryValue(latest, std::nullopt, ticket);
        }));
}

// The chart

void QVSamplesExistDataProvider::restartHistoricalDataQuery() {
    historicalDataQuery_.stop();
    if (!startDate()) return;
    const VSPredicate predicate = VSQuery::predicateForSamples(startDate(), endDate(), VSQueryOptionNone);
    beginQuery(Answer::Historical, timeScope());
    auto handler = onMainQueue(
        this, [predicate, scope = timeScope()](QVSamplesExistDataProvider& self, const Error& error) {
            self.updateHistoricalData(predicate, scope, error);
        });
    historicalDataQuery_.start(
        healthStore(), std::make_shared<VSObserverQuery>(dataUnit()->sampleType(), predicate, handler));
}

void QVSamplesExistDataProvider::updateHistoricalData(const VSPredicate& predicate, QVTimeScope timeScope,
                                                      const Error& error) {
    const Ticket ticket = nextTicket();
    if (error) {
        intake().logError("Error executing historical data query", *error);
        intake().updateHistoricalData({}, timeScope, error, {}, ticket);
        return;
    }
    execute(std::make_shared<VSSampleQuery>(
        dataUnit()->sampleType(), predicate, VSObjectQueryNoLimit,
        std::vector<VSSortDescriptor>{{VSSampleSortIdentifierStartDate, true}},
        [intake = intake(), accent = accent(), timeScope,
         ticket](const VSResult<std::vector<VSSamplePtr>>& answer) {
            if (!answer) return intake.updateHistoricalData({}, timeScope, answer.error(), {}, ticket);
            Points points = sectionPointsFromSamples(*answer);
            for (const VSSamplePtr& sample : *answer)
                if (accent(*sample))
                    points.push_back(QVChartPointNumeric::chartPoint(sample->startDate(), accentY));
            intake.updateHistoricalData(std::move(points), timeScope, std::nullopt, {}, ticket);
        }));
}

QVDataProvider::Points QVSamplesExistDataProvider::sectionPointsFromSamples(
    const std::vector<VSSamplePtr>& samples) {
    Points points;
    const VSCalendar calendar = VSCalendar::current();
    std::optional<VSDate> end, lastMoment;  // of the open section
    for (const VSSamplePtr& sample : samples) {
        if (end && !VSContinuesSection(*lastMoment, sample->startDate(), calendar)) {
            points.push_back(QVChartPointNumeric::chartPoint(*end, sectionY));
            end = lastMoment = std::nullopt;
        }
        if (!end) points.push_back(QVChartPointNumeric::chartPoint(sample->startDate(), sectionY));
        // A sample inside the section must not shorten it.
        end = std::max(end, std::optional(sample->endDate()));
        lastMoment = std::max(lastMoment, std::optional(VSLastMomentOfSample(*sample, calendar)));
    }
    if (end) points.push_back(QVChartPointNumeric::chartPoint(*end, sectionY));
    return points;
}

// The subclasses

QString QVMenstruationDataProvider::secondaryTextForDate(const QString& date) const {
    return platform::localized("START_OF_CYCLE %@", {date});
}
VSPredicate QVMenstruationDataProvider::predicateForSecondaryValue() const {
    return VSPredicate::withMetadata(VSMetadataKeyMenstrualCycleStart, true);
}
QVSamplesExistDataProvider::Accent QVMenstruationDataProvider::accent() const {
    return startsCycle;
}

QString QVOvulationDataProvider::secondaryTextForDate(const QString& date) const {
    return platform::localized("LAST_POSITIVE %@", {date});
}
VSPredicate QVOvulationDataProvider::predicateForSecondaryValue() const {
    return VSPredicate::withCategoryValue(positiveTest);
}
QVSamplesExistDataProvider::Accent QVOvulationDataProvider::accent() const {
    return isPositiveTest;
}

QString QVSpottingDataProvider::secondaryTextForDate(const QString& date) const {
    return platform::localized("LAST_RECORDED %@", {date});
}
