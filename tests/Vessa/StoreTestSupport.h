#pragma once

#include <gtest/gtest.h>

#include <condition_variable>
#include <cstdlib>
#include <fstream>
#include <map>
#include <memory>
#include <mutex>
#include <set>
#include <string>
#include <vector>

#include "TestSupport.h"
#include "Vessa/VSDatabase.h"
#include "Vessa/VSHealthStore.h"

namespace test {

/// QELVAR_LONG_TESTS in the environment: every case there is, instead of a selection.
inline bool longTests() {
    return std::getenv("QELVAR_LONG_TESTS") != nullptr;
}

inline std::string contentOf(const std::filesystem::path& file) {
    std::ifstream stream(file, std::ios::binary);
    return {std::istreambuf_iterator<char>(stream), {}};
}

inline const VSObjectType* type(VSTypeCode code) {
    return VSObjectType::dataTypeWithCode(code);
}
inline const VSObjectType* heartRate() {
    return type(VSCode::HeartRate);
}
inline const VSObjectType* steps() {
    return type(VSCode::StepCount);
}

inline VSProvenance from(const std::string& sourceName, const std::string& version = "") {
    VSProvenance provenance;
    provenance.sourceRevision =
        std::make_shared<VSSourceRevision>(VSSourceRevision{VSSource::forImportedName(sourceName), version});
    return provenance;
}

inline VSSamplePtr quantity(const VSObjectType* type, double value, VSDate start, VSDate end,
                            VSProvenance provenance = {}) {
    return std::make_shared<VSQuantitySample>(type, VSQuantity(type->canonicalUnit(), value), start, end,
                                              std::move(provenance));
}
inline VSSamplePtr quantity(const VSObjectType* type, double value, const std::string& start,
                            const std::string& end, VSProvenance provenance = {}) {
    return quantity(type, value, date(start), date(end), std::move(provenance));
}

/// Without waiting for the disk at each save, which is most of the time of a test.
inline std::shared_ptr<VSHealthStore> openStore(const std::filesystem::path& folder,
                                                VSHealthStore::Options options = {}) {
    options.survivesPowerLoss = false;
    // Nothing happens in the files but what a test does, unless it says otherwise.
    if (options.quiet == VSHealthStore::Options().quiet) options.quiet = VSDuration::max();
    auto store = VSHealthStore::open(folder, options);
    if (!store) {
        ADD_FAILURE() << store.error().message;
        return nullptr;
    }
    return *store;
}

inline double valueOf(const VSSamplePtr& sample) {
    return dynamic_cast<const VSQuantitySample&>(*sample).quantity().value();
}

inline const std::vector<VSSamplePtr>& membersOf(const VSSamplePtr& correlation) {
    return dynamic_cast<const VSCorrelation&>(*correlation).objects();
}

inline VSSamplePtr bloodPressureOf(std::vector<VSSamplePtr> members, const VSProvenance& provenance = {}) {
    const VSDate when = members[0]->startDate();
    return std::make_shared<VSCorrelation>(type(VSCode::BloodPressure), when, when, std::move(members),
                                           provenance);
}
inline VSSamplePtr bloodPressure(double systolic, double diastolic, VSDate when,
                                 const VSProvenance& provenance = {}) {
    return bloodPressureOf(
        {quantity(type(VSCode::BloodPressureSystolic), systolic, when, when, provenance),
         quantity(type(VSCode::BloodPressureDiastolic), diastolic, when, when, provenance)},
        provenance);
}

/// A workout that says nothing but its times.
inline VSSamplePtr plainWorkout(VSDate start, VSDate end, const VSProvenance& provenance = {},
                                VSObjectID id = {}) {
    return std::make_shared<VSWorkout>(37, start, end, VSDuration(0), std::nullopt, std::nullopt,
                                       std::vector<VSWorkoutEvent>(), provenance, id);
}

inline std::vector<VSSamplePtr> allSamples(VSHealthStore& store, const VSObjectType* type) {
    auto samples = store.samples(type, {}, VSObjectQueryNoLimit, {});
    if (!samples) {
        ADD_FAILURE() << samples.error().message;
        return {};
    }
    return *samples;
}

/// Every last bit of what a sample says, but for its number; `origin` is what the store keeps apart of it.
struct Said {
    std::string content, origin;
    friend bool operator==(const Said&, const Said&) = default;
};

inline Said saidBy(const VSSample& sample) {
    VSValue::Array content{sample.sampleType()->identifier(), sample.startDate(), sample.endDate(),
                           sample.creationDate().value_or(VSDate())};
    VSValue::Array origin{sample.sourceRevision().source.name, sample.sourceRevision().version,
                          sample.device() ? sample.device()->description() : "none",
                          sample.timeZoneOffset().value_or(-1), VSValue(sample.metadata())};
    if (const auto* quantity = dynamic_cast<const VSQuantitySample*>(&sample))
        content.push_back(quantity->quantity().doubleValueForUnit(sample.sampleType()->canonicalUnit()));
    if (const auto* category = dynamic_cast<const VSCategorySample*>(&sample))
        content.push_back(category->value());
    if (const auto* workout = dynamic_cast<const VSWorkout*>(&sample)) {
        content.push_back(workout->workoutActivityType());
        origin.push_back(workout->duration().count());
        if (workout->totalEnergyBurned())
            origin.push_back(workout->totalEnergyBurned()->doubleValueForUnit(VSUnit::kilocalorieUnit()));
        if (workout->totalDistance())
            origin.push_back(workout->totalDistance()->doubleValueForUnit(VSUnit::fromString("m")));
        for (const auto& event : workout->workoutEvents())
            origin.push_back(VSValue::Array{event.type, event.date.value_or(VSDate())});
    }
    if (const auto* correlation = dynamic_cast<const VSCorrelation*>(&sample))
        for (const auto& member : correlation->objects()) origin.push_back(saidBy(*member).content);
    return {VSValue(std::move(content)).serialized(), VSValue(std::move(origin)).serialized()};
}

/// All samples of a store by number.
inline std::map<int64_t, Said> contentsOf(VSHealthStore& store) {
    std::map<int64_t, Said> contents;
    for (const VSObjectType* type : VSObjectType::allTypes()) {
        if (!type->isSampleType()) continue;
        for (const VSSamplePtr& sample : allSamples(store, type))
            contents[VSObjectIDValue(sample->dataID())] = saidBy(*sample);
    }
    return contents;
}

/// Every table of a file holds the same rows as the table of that name in another one; those that only one
/// has are left out. Returns how many were compared.
inline int expectSameRows(const std::filesystem::path& a, const std::filesystem::path& b,
                          const std::set<std::string>& except = {}) {
    VSDatabase database(a, VSDatabase::Mode::Write, VSDuration(0));
    database.execute(("ATTACH '" + b.string() + "' AS other").c_str());
    auto names = database.use(
        "SELECT name FROM main.sqlite_master WHERE type = 'table' AND name IN (SELECT name FROM "
        "other.sqlite_master)");
    int compared = 0;
    while (names.step()) {
        const std::string name = names.text(0);
        if (except.contains(name)) continue;
        ++compared;
        for (const auto& [x, y] : {std::pair("main.", "other."), std::pair("other.", "main.")})
            EXPECT_EQ(database.integer("SELECT count(*) FROM (SELECT * FROM " + (x + name) +
                                       " EXCEPT SELECT * FROM " + (y + name) + ")"),
                      0)
                << name;
    }
    return compared;
}

inline void expectSound(VSHealthStore& store) {
    const auto report = store.check();
    ASSERT_TRUE(report.ok()) << report.error().message;
    for (const std::string& problem : report->problems) ADD_FAILURE() << problem;
}

/// Runs an operation that ends in a completion, and waits for it.
template <typename Start>
VSStatus wait(Start start) {
    auto promise = std::make_shared<Promise<VSStatus>>();
    start([promise](const VSStatus& status) { promise->set(status); });
    auto status = promise->wait();
    if (!status) return VSError{VSErrorCode::Failed, "no completion came"};
    return *status;
}

/// The answer of a question that is answered later, with a result.
template <typename Answer, typename Start>
VSResult<Answer> answerOf(Start start) {
    auto promise = std::make_shared<Promise<VSResult<Answer>>>();
    start([promise](const VSResult<Answer>& answer) { promise->set(answer); });
    auto answer = promise->wait();
    if (!answer) return VSError{VSErrorCode::Failed, "no answer came"};
    return std::move(*answer);
}

inline VSResult<std::optional<VSValue>> defaultValueOf(VSHealthStore& store, const std::string& key) {
    return answerOf<std::optional<VSValue>>([&](auto done) { store.getDefaultValue(key, done); });
}
inline std::vector<VSSource> sourceOrderOf(VSHealthStore& store, const VSObjectType* type) {
    return *answerOf<std::vector<VSSource>>([&](auto done) { store.orderedSources(type, done); });
}

#define EXPECT_OK(expression)                                   \
    do {                                                        \
        const VSStatus okStatus = (expression);                 \
        EXPECT_TRUE(okStatus.ok()) << okStatus.error().message; \
    } while (false)

/// A store in a folder of its own.
struct StoreTest : testing::Test {
    size_t count(VSTypeCode code) { return allSamples(*store, type(code)).size(); }
    void save(const std::vector<VSSamplePtr>& objects) { EXPECT_OK(store->saveObjectsAndWait(objects)); }
    VSStatus remove(std::vector<VSSamplePtr> objects) {
        return wait([&](auto done) { store->deleteObjects(std::move(objects), done); });
    }
    /// The answer of a query that is made with a handler and ends with its first answer.
    template <typename Answer, typename Make>
    VSResult<Answer> ask(Make make) {
        return answerOf<Answer>([&](auto done) { store->executeQuery(make(done)); });
    }

    FixedEnvironment environment;
    TemporaryFolder folder;
    std::shared_ptr<VSHealthStore> store = openStore(folder.path());
};

/// What handlers were told, in order; a test waits for the n-th.
template <typename T>
class Log {
 public:
    void add(T entry) {
        std::lock_guard lock(mutex_);
        entries_.push_back(std::move(entry));
        condition_.notify_all();
    }
    /// Waits, at most a minute, until there are so many.
    bool waitFor(size_t count) {
        std::unique_lock lock(mutex_);
        return condition_.wait_for(lock, std::chrono::minutes(1), [&] { return entries_.size() >= count; });
    }
    std::vector<T> entries() const {
        std::lock_guard lock(mutex_);
        return entries_;
    }

 private:
    mutable std::mutex mutex_;
    std::condition_variable condition_;
    std::vector<T> entries_;
};

}  // namespace test
