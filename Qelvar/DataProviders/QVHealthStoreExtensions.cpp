#include "Qelvar/DataProviders/QVHealthStoreExtensions.h"

#include "Platform/Queue.h"
#include "Vessa/Base/VSCalendar.h"
#include "Vessa/Base/VSEnvironment.h"

void mostRecentSamplesOfType(VSHealthStore& store, const VSObjectType* type,
                             const std::optional<VSPredicate>& predicate, int limit,
                             std::function<void(const VSResult<std::vector<VSSamplePtr>>&)> completion) {
    const VSCalendar calendar = VSCalendar::current();
    const VSDate tomorrow = calendar.addDays(calendar.startOfDay(VSEnvironment::current()->now()), 1);
    VSPredicate narrowed = VSPredicate::samplesStartingBefore(tomorrow);
    if (predicate) narrowed = *predicate & narrowed;
    store.executeQuery(
        std::make_shared<VSSampleQuery>(type, narrowed, limit,
                                        std::vector<VSSortDescriptor>{{VSSampleSortIdentifierEndDate, false},
                                                                      {VSObjectSortIdentifierDataID, false}},
                                        std::move(completion)));
}

void mostRecentSampleOfType(VSHealthStore& store, const VSObjectType* type,
                            const std::optional<VSPredicate>& predicate,
                            std::function<void(const VSResult<VSSamplePtr>&)> completion) {
    mostRecentSamplesOfType(
        store, type, predicate, 1,
        [completion = std::move(completion)](const VSResult<std::vector<VSSamplePtr>>& answer) {
            if (!completion) return;
            if (!answer) return completion(answer.error());
            completion(answer->empty() ? VSSamplePtr() : answer->back());
        });
}

namespace {

template <typename Sample>
void mostRecent(VSHealthStore& store, const VSObjectType* type, const std::optional<VSPredicate>& predicate,
                std::function<void(const VSResult<std::shared_ptr<const Sample>>&)> completion) {
    mostRecentSampleOfType(store, type, predicate,
                           [completion = std::move(completion)](const VSResult<VSSamplePtr>& answer) {
                               if (!completion) return;
                               if (!answer) return completion(answer.error());
                               completion(std::dynamic_pointer_cast<const Sample>(*answer));
                           });
}

}  // namespace

void mostRecentQuantitySampleOfType(
    VSHealthStore& store, const VSObjectType* type, const std::optional<VSPredicate>& predicate,
    std::function<void(const VSResult<std::shared_ptr<const VSQuantitySample>>&)> completion) {
    mostRecent<VSQuantitySample>(store, type, predicate, std::move(completion));
}

void mostRecentCategorySampleOfType(
    VSHealthStore& store, const VSObjectType* type, const std::optional<VSPredicate>& predicate,
    std::function<void(const VSResult<std::shared_ptr<const VSCategorySample>>&)> completion) {
    mostRecent<VSCategorySample>(store, type, predicate, std::move(completion));
}

void averageQuantityForType(VSHealthStore& store, const VSObjectType* type, const VSUnit& unit,
                            const VSPredicate& predicate,
                            std::function<void(const VSResult<std::optional<double>>&)> completion) {
    store.executeQuery(std::make_shared<VSStatisticsQuery>(
        type, predicate, VSStatisticsOptionDiscreteAverage,
        [unit, completion = std::move(completion)](const VSResult<VSStatistics>& answer) {
            if (!completion) return;
            if (!answer) return completion(answer.error());
            const auto average = answer->averageQuantity();
            completion(average ? std::optional(average->doubleValueForUnit(unit)) : std::nullopt);
        }));
}

void calculateBMI(VSHealthStore& store, std::function<void(std::optional<double>)> completion) {
    struct Answers {
        double height = 0, bodyMass = 0;  // metres, kilograms; 0: missing
        int count = 0;
        std::function<void(std::optional<double>)> completion;
    };
    auto answers = std::make_shared<Answers>();
    answers->completion = std::move(completion);
    const auto ask = [&store, answers](VSTypeCode code, const char* unit, double Answers::*place) {
        mostRecentQuantitySampleOfType(
            store, VSObjectType::dataTypeWithCode(code), std::nullopt,
            [answers, unit = VSUnit::fromString(unit),
             place](const VSResult<std::shared_ptr<const VSQuantitySample>>& answer) {
                const double value = answer && *answer ? (*answer)->quantity().doubleValueForUnit(unit) : 0;
                platform::mainQueue().async([answers, place, value] {
                    (*answers).*place = value;
                    if (++answers->count < 2 || !answers->completion) return;
                    std::optional<double> bmi;
                    if (answers->height > 0 && answers->bodyMass > 0)
                        bmi = answers->bodyMass / (answers->height * answers->height);
                    answers->completion(bmi);
                });
            });
    };
    ask(VSCode::Height, "m", &Answers::height);
    ask(VSCode::BodyMass, "kg", &Answers::bodyMass);
}

void deleteObjectWithHealthStore(const VSSamplePtr& object, VSHealthStore& store,
                                 VSHealthStore::Completion completion) {
    std::vector<VSSamplePtr> objects;
    if (const auto* correlation = dynamic_cast<const VSCorrelation*>(object.get()))
        objects = correlation->objects();
    objects.push_back(object);
    store.deleteObjects(std::move(objects), std::move(completion));
}
