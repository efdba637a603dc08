#include <gtest/gtest.h>

#include <algorithm>
#include <random>
#include <set>

#include "StoreTestSupport.h"
#include "Vessa/VSDatabase.h"
#include "Vessa/VSSummaryQuery.h"

using namespace test;

namespace {

struct StoreQueryKinds : StoreTest {
    using StoreTest::save;
    VSSamplePtr save(VSSamplePtr object) {
        save(std::vector{object});
        return object;
    }
    VSSamplePtr save(VSTypeCode code, double value, const std::string& start, const std::string& end = "",
                     VSProvenance provenance = {}) {
        const auto* of = type(code);
        const VSDate from = date(start), to = date(end.empty() ? start : end);
        if (of->isQuantityType()) return save(quantity(of, value, from, to, std::move(provenance)));
        return save(
            std::make_shared<VSCategorySample>(of, static_cast<int>(value), from, to, std::move(provenance)));
    }
    void TearDown() override { store.reset(); }  // before what handlers use
};

const VSDateComponents kDay{.days = 1};

}  // namespace

TEST_F(StoreQueryKinds, CorrelationsAreFoundByTheirMembers) {
    VSProvenance noted;
    noted.metadata = std::make_shared<VSMetadata>(VSMetadata{{"arm", "left"}});
    const auto *systolic = type(VSCode::BloodPressureSystolic),
               *diastolic = type(VSCode::BloodPressureDiastolic);
    for (const int day : {1, 2, 3}) {
        const VSDate when = date("2020-03-0" + std::to_string(day) + "T08:00");
        save(
            bloodPressureOf({quantity(systolic, 110 + 10 * day, when, when, day > 1 ? noted : VSProvenance()),
                             quantity(diastolic, 80, when, when)}));
    }
    const auto find = [&](const VSObjectType* of, const VSPredicate& predicate,
                          const std::map<const VSObjectType*, VSPredicate>& members) {
        std::vector<double> found;
        const auto answer = ask<VSCorrelationQuery::Correlations>([&](auto handler) {
            return std::make_shared<VSCorrelationQuery>(of, predicate, members, handler);
        });
        if (!answer) return std::vector<double>{-static_cast<double>(answer.error().code)};
        for (const auto& correlation : *answer) found.push_back(valueOf(correlation->objects().at(0)));
        return found;
    };
    const auto* both = type(VSCode::BloodPressure);
    VSPredicate left = VSPredicate::withMetadata("arm", "left"), loose;
    loose.noCorrelation = true;
    const auto before3rd = VSPredicate::samplesStartingBefore(date("2020-03-03"));
    EXPECT_EQ(find(both, {}, {}), (std::vector<double>{120, 130, 140}));
    EXPECT_EQ(find(both, {}, {{systolic, left}}), (std::vector<double>{130, 140}));
    EXPECT_EQ(find(both, before3rd, {{systolic, left}, {diastolic, {}}}), (std::vector<double>{130}));
    EXPECT_EQ(find(both, {}, {{diastolic, left}}), std::vector<double>());
    EXPECT_EQ(find(both, {}, {{heartRate(), {}}}), std::vector<double>());
    EXPECT_EQ(find(both, {}, {{systolic, loose}}), std::vector<double>());
    EXPECT_EQ(find(systolic, {}, {}), std::vector<double>{-static_cast<double>(VSErrorCode::Invalid)});
}

TEST_F(StoreQueryKinds, DateRangesFollowEveryType) {
    Log<VSDateRangeQuery::Ranges> told;
    auto query = std::make_shared<VSDateRangeQuery>([&](const auto& ranges) { told.add(*ranges); });
    store->executeQuery(query);
    ASSERT_TRUE(told.waitFor(1));
    EXPECT_TRUE(told.entries()[0].empty());
    save(VSCode::HeartRate, 60, "2020-03-02T08:00");
    ASSERT_TRUE(told.waitFor(2));
    const auto nap = save(VSCode::SleepAnalysis, 1, "2020-03-01T22:00", "2020-03-04T07:00");
    ASSERT_TRUE(told.waitFor(3));
    save(VSCode::SleepAnalysis, 1, "2020-03-02T22:00", "2020-03-03T07:00");
    ASSERT_TRUE(told.waitFor(4));
    EXPECT_OK(remove({nap}));
    ASSERT_TRUE(told.waitFor(5));
    const VSDateInterval moment{date("2020-03-02T08:00"), date("2020-03-02T08:00")};
    const auto *heart = heartRate(), *sleep = type(VSCode::SleepAnalysis);
    EXPECT_EQ(told.entries()[1], (VSDateRangeQuery::Ranges{{heart, moment}}));
    EXPECT_EQ(told.entries()[3],
              (VSDateRangeQuery::Ranges{{heart, moment},
                                        {sleep, {date("2020-03-01T22:00"), date("2020-03-04T07:00")}}}));
    EXPECT_EQ(told.entries()[4].at(sleep),
              (VSDateInterval{date("2020-03-02T22:00"), date("2020-03-03T07:00")}));
}

namespace {

std::string describe(const std::optional<VSSummaryValue>& value) {
    if (!value) return "none";
    if (const auto* quantity = std::get_if<VSQuantity>(&*value)) return std::to_string(quantity->value());
    if (const auto* duration = std::get_if<VSDuration>(&*value))
        return std::to_string(duration->count() / 60'000'000) + " min";
    if (const auto* count = std::get_if<VSSampleCount>(&*value))
        return std::to_string(count->value) + " times";
    if (const auto* moment = std::get_if<VSDate>(&*value))
        return VSISO8601FromDate(*moment, VSCalendar::current());
    return "value " + std::to_string(std::get<VSCategoryValue>(*value).value);
}

using Described = std::map<std::string, std::string>;
Described describe(const VSSummaryQuery::Values& values) {
    Described described;
    for (const auto& [of, value] : values) described[std::string(of->name())] = describe(value);
    return described;
}

}  // namespace

TEST_F(StoreQueryKinds, ASummaryHasEachTypesValueAndThenWhatBecameAnother) {
    // Two sources that overlap, a span over midnight, a day of 23 hours.
    save(VSCode::StepCount, 1000, "2020-03-29T10:00", "2020-03-29T11:00", from("Old"));
    save(VSCode::StepCount, 800, "2020-03-29T10:30", "2020-03-29T11:30", from("Young"));
    save(VSCode::StepCount, 60, "2020-03-28T23:30", "2020-03-29T00:30", from("Old"));
    save(VSCode::HeartRate, 60, "2020-03-29T10:00");
    save(VSCode::HeartRate, 70, "2020-03-29T12:00");
    save(VSCode::HeartRate, 200, "2020-03-30T00:00");
    save(VSCode::SleepAnalysis, 0, "2020-03-28T22:00", "2020-03-29T08:00");
    save(VSCode::SleepAnalysis, 1, "2020-03-28T23:00", "2020-03-29T05:00");
    save(VSCode::SleepAnalysis, 1, "2020-03-29T04:00", "2020-03-29T07:00", from("Young"));
    for (const char* source : {"Old", "Young"})
        save(VSCode::ZentroStandHour, 0, "2020-03-29T09:00", "2020-03-29T10:00", from(source));
    save(VSCode::ZentroStandHour, 1, "2020-03-29T10:00", "2020-03-29T11:00");
    save(VSCode::SexualActivity, 0, "2020-03-29T21:00");
    save(VSCode::IntermenstrualBleeding, 0, "2020-03-29T07:00");
    save(VSCode::IntermenstrualBleeding, 0, "2020-03-29T19:00");
    save(VSCode::MenstrualFlow, 4, "2020-03-29T08:00");
    const auto light = save(VSCode::MenstrualFlow, 2, "2020-03-29T09:00");
    for (const auto& [start, end, minutes] : {std::tuple("2020-03-29T23:00", "2020-03-30T01:00", 100),
                                              {"2020-03-29T12:00", "2020-03-29T13:00", 45}})
        save(std::make_shared<VSWorkout>(37, date(start), date(end), std::chrono::minutes(minutes),
                                         std::nullopt, std::nullopt, std::vector<VSWorkoutEvent>()));
    save(bloodPressure(120, 80, date("2020-03-29T08:00")));
    save(VSCode::BodyMass, 70, "2020-03-28T08:00");

    Log<Described> told;
    const auto tell = [&](const VSResult<VSSummaryQuery::Values>& values) { told.add(describe(*values)); };
    auto query = std::make_shared<VSSummaryQuery>(date("2020-03-29"), date("2020-03-30"), tell);
    query->updateHandler = tell;
    store->executeQuery(query);
    ASSERT_TRUE(told.waitFor(1));
    EXPECT_EQ(told.entries()[0], (Described{{"StepCount", "1430.000000"},
                                            {"HeartRate", "65.000000"},
                                            {"SleepAnalysis", "360 min"},
                                            {"ZentroStandHour", "1 times"},
                                            {"SexualActivity", "1 times"},
                                            {"IntermenstrualBleeding", "2020-03-29T19:00:00+02:00"},
                                            {"MenstrualFlow", "value 2"},
                                            {"Workout", "95 min"},
                                            {"BloodPressureSystolic", "120.000000"},
                                            {"BloodPressureDiastolic", "80.000000"}}));

    save(VSCode::BodyMass, 71, "2020-03-28T09:00");  // another day: nothing is told
    save(VSCode::HeartRate, 80, "2020-03-29T14:00");
    ASSERT_TRUE(told.waitFor(2));
    EXPECT_EQ(told.entries()[1], (Described{{"HeartRate", "70.000000"}}));
    EXPECT_OK(remove({light}));
    ASSERT_TRUE(told.waitFor(3));
    EXPECT_EQ(told.entries()[2], (Described{{"MenstrualFlow", "value 4"}}));
    EXPECT_OK(
        wait([&](auto done) { store->deleteAllSamples({type(VSCode::SleepAnalysis)}, std::nullopt, done); }));
    ASSERT_TRUE(told.waitFor(4));
    EXPECT_EQ(told.entries()[3], (Described{{"SleepAnalysis", "none"}}));
    save(VSCode::SleepAnalysis, 0, "2020-03-28T22:00", "2020-03-29T08:00");
    ASSERT_TRUE(told.waitFor(5));
    EXPECT_EQ(told.entries()[4], (Described{{"SleepAnalysis", "420 min"}})) << "only in bed";
}

/// Against counting one by one, over a change to summer time, with and without other conditions.
TEST_F(StoreQueryKinds, CountsPerBucketAreThoseOfStartingSamples) {
    std::mt19937 random(4);
    std::vector<VSSamplePtr> objects;
    const VSDate origin = date("2020-03-27");
    for (int i = 0; i < 400; ++i) {
        const VSDate start = origin + std::chrono::minutes(15 * (random() % 500));
        objects.push_back(std::make_shared<VSCategorySample>(
            type(VSCode::SleepAnalysis), static_cast<int>(random() % 2), start,
            start + std::chrono::minutes(random() % 600), from(random() % 2 ? "A" : "B")));
    }
    save(objects);
    const auto calendar = VSCalendar::current();
    for (int round = 0; round < 60; ++round) {
        const VSDate start = origin + std::chrono::minutes(5 * (random() % 1000)),
                     end = start + std::chrono::minutes(1 + random() % 5000);
        const VSDateComponents interval =
            random() % 2 ? kDay : VSDateComponents{.hours = 1 + static_cast<int>(random() % 5)};
        VSPredicate predicate;
        if (random() % 2) predicate = VSPredicate::withCategoryValue(1);
        if (random() % 2) predicate.sources = {VSSource::forImportedName("A")};
        VSCountStatisticsQuery::Counts expected;
        const auto borders = calendar.bucketBoundaries(start, interval, start, end);
        for (const auto& sample : objects) {
            if (sample->startDate() < start || sample->startDate() >= end || !predicate.matches(*sample))
                continue;
            const auto next = std::upper_bound(borders.begin(), borders.end(), sample->startDate());
            ++expected[{*std::prev(next), *next}];
        }
        const auto counts = ask<VSCountStatisticsQuery::Counts>([&](auto handler) {
            return std::make_shared<VSCountStatisticsQuery>(type(VSCode::SleepAnalysis), start, end, interval,
                                                            predicate, handler);
        });
        ASSERT_TRUE(counts.ok()) << counts.error().message;
        ASSERT_EQ(*counts, expected) << "round " << round;
    }
    const auto none = ask<VSCountStatisticsQuery::Counts>([&](auto handler) {
        return std::make_shared<VSCountStatisticsQuery>(type(VSCode::SleepAnalysis), origin, origin,
                                                        VSDateComponents{}, VSPredicate(), handler);
    });
    ASSERT_FALSE(none.ok());
    EXPECT_EQ(none.error().code, VSErrorCode::Invalid);
}

TEST_F(StoreQueryKinds, ALiveCollectionKeepsTheCalendarOfItsStart) {
    struct Bucket {
        VSDate start;
        int64_t count;
        size_t sources;
        bool operator==(const Bucket&) const = default;
    };
    using Buckets = std::vector<Bucket>;
    Log<Buckets> told;
    const auto tell = [&](const auto& result) {
        Buckets buckets;
        size_t every = 0;
        (*result)->enumerateStatistics(date("2020-02-28T12:00"), date("2020-03-03T12:00"),
                                       [&](const VSStatistics& bucket) { every += !bucket.hasData(); });
        EXPECT_EQ(every, 5u) << "of a category there are counts only";
        for (const auto& bucket : (*result)->statistics())
            buckets.push_back({bucket.startDate, bucket.count, bucket.bySource.size()});
        told.add(buckets);
    };
    const auto collect = [&] {
        auto query = std::make_shared<VSStatisticsCollectionQuery>(
            type(VSCode::SleepAnalysis), VSPredicate(),
            VSStatisticsOptionSeparateBySource | VSStatisticsOptionCumulativeSum, date("2020-02-01"), kDay);
        query->initialResultsHandler = tell;
        query->statisticsUpdateHandler = tell;
        return query;
    };
    const VSDate march1 = date("2020-03-01"), march2 = date("2020-03-02");
    save(VSCode::SleepAnalysis, 1, "2020-03-01T22:00", "2020-03-01T23:00", from("A"));
    save(VSCode::SleepAnalysis, 0, "2020-03-01T21:00", "2020-03-01T23:30", from("B"));
    const auto query = collect();
    store->executeQuery(query);
    ASSERT_TRUE(told.waitFor(1));
    EXPECT_EQ(told.entries()[0], (Buckets{{march1, 2, 2}}));
    const VSDate evening = date("2020-03-02T02:00");  // still March 1 in New York
    environment->setTimeZone("America/New_York");
    save(quantity(heartRate(), 60, evening, evening));  // another type
    save(std::make_shared<VSCategorySample>(type(VSCode::SleepAnalysis), 1, evening, evening, from("A")));
    ASSERT_TRUE(told.waitFor(2));
    EXPECT_EQ(told.entries()[1], (Buckets{{march1, 2, 2}, {march2, 1, 1}}));
    store->stopQuery(query);
    const auto later = collect();
    store->executeQuery(later);
    ASSERT_TRUE(told.waitFor(3));
    EXPECT_EQ(told.entries()[2], (Buckets{{date("2020-03-01"), 3, 2}}));
}

/// The rollup of a day cannot be read: each change is answered with one error, and the first change after
/// the repair with the truth.
TEST_F(StoreQueryKinds, AFailedLiveQueryWaitsForTheNextChange) {
    save(VSCode::HeartRate, 60, "2020-03-01T08:00");
    Log<std::string> told;
    const auto tell = [&](const auto& result) {
        const auto last = [&] { return (*result)->statistics().back().averageQuantity()->value(); };
        told.add(!result.ok() ? VSErrorCodeName(result.error().code)
                              : std::to_string((*result)->statistics().size()) + " of " +
                                    std::to_string(static_cast<int>(last())));
    };
    auto query = std::make_shared<VSStatisticsCollectionQuery>(
        heartRate(), VSPredicate(), VSStatisticsOptionDiscreteAverage, date("2020-03-01"), kDay);
    query->initialResultsHandler = tell;
    query->statisticsUpdateHandler = tell;
    store->executeQuery(query);
    ASSERT_TRUE(told.waitFor(1));
    const auto change = [&](const char* sql) {
        VSDatabase(folder.path() / "vessa.sqlite", VSDatabase::Mode::Write, std::chrono::seconds(10))
            .execute(sql);
    };
    change("CREATE TABLE sound AS SELECT * FROM rollups; UPDATE rollups SET quarters = x'00'");
    for (const size_t day : {3, 5}) {
        save(VSCode::HeartRate, 60, "2020-03-0" + std::to_string(day) + "T08:00");
        ASSERT_TRUE(told.waitFor(day / 2 + 1));
        // Time for it to repeat itself: questions that are asked and answered meanwhile.
        for (int i = 0; i < 60; ++i) allSamples(*store, heartRate());
    }
    change(
        "UPDATE rollups SET quarters = (SELECT quarters FROM sound WHERE sound.slot = rollups.slot) WHERE "
        "slot IN (SELECT slot FROM sound); DROP TABLE sound");
    save(VSCode::HeartRate, 90, "2020-03-07T08:00");
    ASSERT_TRUE(told.waitFor(4));
    store.reset();
    EXPECT_EQ(told.entries(), (std::vector<std::string>{"1 of 60", "corrupt", "corrupt", "4 of 90"}));
}

/// Histories of saves and deletions between pages of answers: whoever goes on from the last anchor has what
/// the store has, and was told nothing twice.
TEST_F(StoreQueryKinds, PagesOfChangesLoseAndRepeatNothing) {
    std::mt19937 random(21);
    using Answer = VSAnchoredObjectQuery::Answer;
    for (int history = 0; history < 6; ++history) {
        const auto* of = std::array{heartRate(), steps(), type(VSCode::SleepAnalysis)}[history % 3];
        VSPredicate predicate;
        if (history >= 3) predicate = VSPredicate::samplesStartingBefore(date("2020-03-01T03:00"));
        VSQueryAnchor anchor{0};
        std::set<VSObjectID> client, seen, forgotten;
        const auto turnPage = [&](int limit) {
            const auto answer = ask<Answer>([&](auto handler) {
                return std::make_shared<VSAnchoredObjectQuery>(of, predicate, anchor, limit, handler);
            });
            EXPECT_TRUE(answer.ok());
            EXPECT_TRUE(!limit || answer->added.size() <= static_cast<size_t>(limit));
            EXPECT_GE(answer->anchor.value, anchor.value);
            for (const auto& sample : answer->added) {
                EXPECT_TRUE(predicate.matches(*sample));
                EXPECT_TRUE(seen.insert(sample->dataID()).second) << "told twice";
                client.insert(sample->dataID());
            }
            for (const auto& gone : answer->deleted) {
                EXPECT_TRUE(forgotten.insert(gone.id).second) << "told twice";
                client.erase(gone.id);
            }
            const bool moved = anchor.value != answer->anchor.value;
            anchor = answer->anchor;
            return moved;
        };
        for (int step = 0; step < 60; ++step) {
            auto all = allSamples(*store, of);
            std::shuffle(all.begin(), all.end(), random);
            if (random() % 2 && !all.empty()) {
                all.resize(1 + random() % std::min<size_t>(all.size(), 4));
                EXPECT_OK(remove(all));
            } else {
                std::vector<VSSamplePtr> objects;
                for (size_t n = 1 + random() % 6; n > 0; --n) {
                    const VSDate at = date("2020-03-01") + std::chrono::minutes(random() % 300);
                    objects.push_back(of->isQuantityType()
                                          ? quantity(of, 1, at, at)
                                          : VSSamplePtr(std::make_shared<VSCategorySample>(of, 1, at, at)));
                }
                save(objects);
            }
            if (random() % 3 == 0) turnPage(1 + static_cast<int>(random() % 3));
            if (random() % 7 == 0) {
                while (turnPage(1 + static_cast<int>(random() % 5))) {
                }
                std::set<VSObjectID> expected;
                for (const auto& sample : allSamples(*store, of)) {
                    if (predicate.matches(*sample)) expected.insert(sample->dataID());
                }
                ASSERT_EQ(client, expected) << "history " << history << ", step " << step;
            }
        }
    }
}

TEST_F(StoreQueryKinds, ALiveQueryWithALimitGoesOnByItself) {
    std::vector<VSSamplePtr> objects;
    for (int i = 0; i < 7; ++i) objects.push_back(quantity(heartRate(), i, "2020-03-01", "2020-03-01"));
    save(objects);
    Log<size_t> told;
    auto query = std::make_shared<VSAnchoredObjectQuery>(heartRate(), VSPredicate(), VSQueryAnchor{}, 3,
                                                         [&](const auto& a) { told.add(a->added.size()); });
    query->updateHandler = [&](const auto& a) { told.add(a->added.size()); };
    store->executeQuery(query);
    ASSERT_TRUE(told.waitFor(3));
    EXPECT_EQ(told.entries(), (std::vector<size_t>{3, 3, 1}));
}
