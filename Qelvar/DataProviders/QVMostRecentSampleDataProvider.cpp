#include "Qelvar/DataProviders/QVMostRecentSampleDataProvider.h"

#include "Qelvar/DataProviders/QVHealthStoreExtensions.h"

void QVMostRecentSampleDataProvider::stopQueries() {
    QVDataProvider::stopQueries();
    currentValueQuery_.stop();
}

void QVMostRecentSampleDataProvider::restartCurrentValueQueryIfNeeded() {
    if (!needsCurrentValueQuery(currentValueQuery_)) return;
    beginQuery(Answer::CurrentValue);
    auto handler = onMainQueue(this, [](QVMostRecentSampleDataProvider& self, const Error& error) {
        self.updateMostRecentObject(error);
    });
    currentValueQuery_.start(
        healthStore(), std::make_shared<VSObserverQuery>(dataUnit()->dataType(), VSPredicate{}, handler));
}

void QVMostRecentSampleDataProvider::updateMostRecentObject(const Error& error) {
    const Ticket ticket = nextTicket();
    if (error) {
        intake().logError(currentValueLogs().observer, *error);
        intake().updateCurrentValue({}, {}, error, {}, ticket);
        return;
    }
    mostRecentQuantitySampleOfType(
        *healthStore(), dataUnit()->sampleType(), std::nullopt,
        [intake = intake(), dataUnit = dataUnit(), unit = preferredUnit(), logs = currentValueLogs(),
         ticket](const VSResult<std::shared_ptr<const VSQuantitySample>>& answer) {
            if (answer && *answer) {
                const VSQuantitySample& sample = **answer;
                const double value =
                    dataUnit->adjustedValueForDaemonValue(sample.quantity().doubleValueForUnit(unit));
                intake.updateCurrentValue(value, dateOfCurrentValue({sample.startDate(), sample.endDate()}),
                                          std::nullopt, unit, ticket);
                return;
            }
            if (!answer) intake.logError(logs.lookUp, answer.error());
            intake.updateCurrentValue({}, {}, answer ? std::nullopt : Error(answer.error()), {}, ticket);
        });
}
