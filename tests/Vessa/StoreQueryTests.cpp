#include <gtest/gtest.h>

#include <algorithm>
#include <random>

#include "StoreTestSupport.h"

using namespace test;

namespace {

struct StoreQueries : StoreTest {
    using StoreTest::save;
    void save(double value, const std::string& start, const std::string& end = "",
              const VSObjectType* of = heartRate(), VSProvenance provenance = {}) {
        save({quantity(of, value, start, end.empty() ? start : end, std::move(provenance))});
    }
};

std::vector<double> valuesOf(const std::vector<VSSamplePtr>& samples) {
    std::vector<double> values;
    for (const auto& sample : samples) values.push_back(valueOf(sample));
    return values;
}

}  // namespace

/// Predicates, orders and limits against plain filtering and sorting of everything.
TEST_F(StoreQueries, AgreesWithFilteringEverything) {
    std::mt19937 random(11);
    const auto pick = [&](int64_t from, int64_t to) {
        return std::uniform_int_distribution<int64_t>(from, to)(random);
    };
    const VSDate origin = date("2020-03-01");
    const std::vector<VSProvenance> provenances = {from("Watch"), from("Phone", "2"), {}};
    auto tagged = from("Watch");
    tagged.metadata = std::make_shared<VSMetadata>(VSMetadata{{"tag", 1}});
    tagged.device = std::make_shared<VSDevice>(VSDevice{"Band", {}, {}, {}, {}, {}, {}, {}});
    std::vector<VSSamplePtr> objects;
    for (int i = 0; i < 600; ++i) {
        const int64_t lengths[] = {
            0, 0, pick(1, 3600), 86400 * pick(1, 2), 86400 * pick(3, 9), pick(1, 7) * 900};
        const VSDate start =
            origin + std::chrono::seconds(pick(0, 9) == 0 ? 3600 * pick(0, 240) : pick(0, 864000));
        const VSDate end = start + std::chrono::seconds(lengths[pick(0, 5)]);
        objects.push_back(quantity(steps(), static_cast<double>(pick(0, 50)), start, end,
                                   pick(0, 5) == 0 ? tagged : provenances[static_cast<size_t>(pick(0, 2))]));
    }
    save(objects);
    const auto all = allSamples(*store, steps());
    ASSERT_EQ(all.size(), objects.size());

    for (int round = 0; round < 400; ++round) {
        const VSDate a = origin + std::chrono::hours(pick(-30, 250)),
                     b = a + std::chrono::hours(pick(0, 100));
        VSPredicate predicate = VSPredicate::samplesWithStartDate(
            pick(0, 3) ? std::optional(a) : std::nullopt, pick(0, 3) ? std::optional(b) : std::nullopt,
            static_cast<int>(pick(0, 3)));
        if (pick(0, 3) == 0)
            predicate =
                predicate & VSPredicate::samplesWithStartDate(a + std::chrono::hours(pick(-20, 20)),
                                                              std::nullopt, static_cast<int>(pick(0, 3)));
        if (pick(0, 3) == 0)
            predicate = predicate & VSPredicate::samplesWithStartDate(std::nullopt,
                                                                      b + std::chrono::hours(pick(-20, 20)),
                                                                      static_cast<int>(pick(0, 3)));
        if (pick(0, 3) == 0)
            predicate =
                predicate & VSPredicate::samplesStartingBefore(origin + std::chrono::hours(pick(0, 240)));
        if (pick(0, 3) == 0) predicate.sources = {VSSource::forImportedName("Phone")};
        if (pick(0, 7) == 0) predicate.metadataKeys = {"tag"};
        if (pick(0, 7) == 0) predicate = predicate & VSPredicate::withMetadata("tag", pick(0, 1) ? 1 : 2);
        if (pick(0, 7) == 0) predicate.device = *tagged.device;
        std::vector<VSSortDescriptor> sort;
        const char* keys[] = {VSSampleSortIdentifierStartDate, VSSampleSortIdentifierEndDate,
                              VSObjectSortIdentifierDataID};
        for (int i = static_cast<int>(pick(0, 2)); i > 0; --i)
            sort.push_back({keys[pick(0, 2)], pick(0, 1) == 0});
        const int limit = static_cast<int>(pick(0, 1) ? 0 : pick(1, 30));

        std::vector<VSSamplePtr> expected;
        std::copy_if(all.begin(), all.end(), std::back_inserter(expected),
                     [&](const auto& s) { return predicate.matches(*s); });
        std::sort(expected.begin(), expected.end(), [&](const VSSamplePtr& x, const VSSamplePtr& y) {
            for (const auto& key : sort) {
                const auto value = [&](const VSSamplePtr& s) {
                    return key.key == keys[0]   ? s->startDate().microseconds()
                           : key.key == keys[1] ? s->endDate().microseconds()
                                                : VSObjectIDValue(s->dataID());
                };
                if (value(x) != value(y)) return key.ascending == (value(x) < value(y));
            }
            return (sort.empty() || sort[0].ascending) == (x->dataID() < y->dataID());
        });
        if (limit && expected.size() > static_cast<size_t>(limit))
            expected.resize(static_cast<size_t>(limit));
        const auto found = store->samples(steps(), predicate, limit, sort);
        ASSERT_TRUE(found.ok()) << found.error().message;
        ASSERT_EQ(found->size(), expected.size()) << "round " << round;
        for (size_t i = 0; i < expected.size(); ++i)
            ASSERT_EQ((*found)[i]->dataID(), expected[i]->dataID()) << "round " << round << ", place " << i;
    }
    const auto unknown = store->samples(steps(), {}, 0, {{"value", true}});
    ASSERT_FALSE(unknown.ok());
    EXPECT_EQ(unknown.error().code, VSErrorCode::Invalid);
}

TEST_F(StoreQueries, ObserverFiresAtItsStartAndAfterChangesOfItsTypeOnly) {
    save(60, "2020-03-01T08:00");
    Log<bool> told;
    auto query = std::make_shared<VSObserverQuery>(heartRate(), VSPredicate(),
                                                   [&](const auto& error) { told.add(!error); });
    store->executeQuery(query);
    ASSERT_TRUE(told.waitFor(1));
    save(100, "2020-03-01T08:00", "", steps());  // another type
    save(61, "2020-03-01T08:01");
    ASSERT_TRUE(told.waitFor(2));
    EXPECT_OK(remove({allSamples(*store, heartRate())[0]}));
    ASSERT_TRUE(told.waitFor(3));
    store->stopQuery(query);
    // A change after the stop is not told: a second observer, which hears of it, shows that there was time
    // for it.
    Log<bool> witness;
    auto other = std::make_shared<VSObserverQuery>(heartRate(), VSPredicate(),
                                                   [&](const auto&) { witness.add(true); });
    store->executeQuery(other);
    ASSERT_TRUE(witness.waitFor(1));
    save(62, "2020-03-01T08:02");
    ASSERT_TRUE(witness.waitFor(2));
    store.reset();
    EXPECT_EQ(told.entries(), std::vector<bool>(3, true));
}

TEST_F(StoreQueries, AnchoredQueryTellsEachChangeOnce) {
    for (int i = 0; i < 5; ++i) save(i, "2020-03-01T08:0" + std::to_string(i));
    using Answer = VSAnchoredObjectQuery::Answer;
    const auto since = [&](VSQueryAnchor anchor) {
        return *ask<Answer>([&](auto handler) {
            return std::make_shared<VSAnchoredObjectQuery>(heartRate(), VSPredicate(), anchor, 0, handler);
        });
    };
    const VSQueryAnchor seen = since({0}).anchor;
    Log<Answer> live;
    auto query = std::make_shared<VSAnchoredObjectQuery>(
        heartRate(), VSPredicate(), VSQueryAnchor::beyondAll(), 0, [&](const auto& a) { live.add(*a); });
    query->updateHandler = [&](const auto& a) { live.add(*a); };
    store->executeQuery(query);
    ASSERT_TRUE(live.waitFor(1));
    EXPECT_TRUE(live.entries()[0].added.empty());
    const auto gone = allSamples(*store, heartRate()).at(1);
    save(9, "2020-03-01T09:00");
    ASSERT_TRUE(live.waitFor(2));
    EXPECT_OK(remove({gone}));
    ASSERT_TRUE(live.waitFor(3));
    EXPECT_EQ(valuesOf(live.entries()[1].added), (std::vector<double>{9}));
    ASSERT_EQ(live.entries()[2].deleted.size(), 1u);
    EXPECT_EQ(live.entries()[2].deleted[0].id, gone->dataID());
    EXPECT_TRUE(live.entries()[2].added.empty());
    store->stopQuery(query);

    // Who saw the object hears that it went; who never saw it does not.
    EXPECT_EQ(valuesOf(since(seen).added), (std::vector<double>{9}));
    EXPECT_EQ(since(seen).deleted.size(), 1u);
    EXPECT_TRUE(since({0}).deleted.empty());
    store.reset();  // before what its handlers use
}

TEST_F(StoreQueries, StatisticsAnswerOnce) {
    save(60, "2020-03-01T08:00");
    save(80, "2020-03-01T10:00");
    const auto answer = ask<VSStatistics>([](auto handler) {
        return std::make_shared<VSStatisticsQuery>(
            heartRate(), VSPredicate(), VSStatisticsOptionDiscreteAverage | VSStatisticsOptionDiscreteMax,
            handler);
    });
    EXPECT_EQ(answer->average, 70);
    EXPECT_EQ(answer->maximum, 80);
    EXPECT_FALSE(answer->minimum || answer->sum) << "not asked for";
    const auto empty = store->statistics(
        heartRate(), VSPredicate::samplesWithStartDate(date("2020-04-01"), std::nullopt, 0), 30);
    EXPECT_FALSE(empty->hasData());
    EXPECT_EQ(empty->count, 0);
    for (const VSDateComponents& interval : {VSDateComponents{}, VSDateComponents{.days = -1}}) {
        const auto buckets = store->statisticsCollection(heartRate(), {}, VSStatisticsOptionDiscreteAverage,
                                                         date("2020-03-01"), interval);
        ASSERT_FALSE(buckets.ok());
        EXPECT_EQ(buckets.error().code, VSErrorCode::Invalid);
    }
}

TEST_F(StoreQueries, SourcesStandInTheirOrder) {
    save(1, "2020-03-03T08:00", "", steps(), from("Young"));
    save(1, "2020-03-01T08:00", "", steps(), from("Old"));
    save(1, "2020-03-05T08:00", "", steps());
    const auto order = [&] {
        std::vector<std::string> names;
        for (const auto& source : sourceOrderOf(*store, steps()))
            names.push_back(source.isApplication() ? "own" : source.name);
        return names;
    };
    EXPECT_EQ(order(), (std::vector<std::string>{"own", "Old", "Young"}));
    EXPECT_OK(wait([&](auto done) {
        store->setOrderedSources({VSSource::forImportedName("Young"), VSSource::application()}, steps(),
                                 done);
    }));
    EXPECT_EQ(order(), (std::vector<std::string>{"Young", "own", "Old"}));
    save(1, "2020-02-01T08:00", "", steps(), from("New"));
    EXPECT_EQ(order(), (std::vector<std::string>{"Young", "own", "New", "Old"}));
    EXPECT_OK(wait(
        [&](auto done) { store->setOrderedSources({VSSource::forImportedName("Lost")}, steps(), done); }));
    EXPECT_EQ(order(), (std::vector<std::string>{"New", "Old", "Young", "own"})) << "the user chose";
    expectSound(*store);

    const auto sources = ask<std::vector<VSSource>>([](auto handler) {
        return std::make_shared<VSSourceQuery>(
            steps(), VSPredicate::samplesWithStartDate(date("2020-03-02"), std::nullopt, 0), handler);
    });
    EXPECT_EQ(sources->size(), 2u);
}

TEST_F(StoreQueries, TheStoreMayEndInAHandler) {
    save(1, "2020-03-01T08:00");
    for (int round = 0; round < 20; ++round) {
        Promise<bool> ended;
        auto holder = std::make_shared<std::shared_ptr<VSHealthStore>>(openStore(folder.path()));
        VSHealthStore& inner = **holder;
        if (round % 2) {
            inner.executeQuery(std::make_shared<VSSampleQuery>(
                heartRate(), VSPredicate(), 0, std::vector<VSSortDescriptor>(), [&, holder](const auto&) {
                    holder->reset();
                    ended.set(true);
                }));
        } else {
            inner.saveObject(quantity(heartRate(), 2, "2020-03-01T08:00", "2020-03-01T08:00"),
                             [&, holder](const auto&) {
                                 holder->reset();
                                 ended.set(true);
                             });
        }
        EXPECT_EQ(ended.wait(), true);
    }
    EXPECT_EQ(allSamples(*store, heartRate()).size(), 11u);
}

TEST_F(StoreQueries, AcceptedWritesAreDoneBeforeTheStoreEnds) {
    std::atomic<int> completed = 0;
    for (int i = 0; i < 50; ++i)
        store->saveObject(quantity(heartRate(), i, "2020-03-01T08:00", "2020-03-01T08:00"),
                          [&](const VSStatus& s) { completed += s.ok(); });
    store.reset();
    EXPECT_EQ(completed, 50);
    store = openStore(folder.path());
    EXPECT_EQ(allSamples(*store, heartRate()).size(), 50u);
}
