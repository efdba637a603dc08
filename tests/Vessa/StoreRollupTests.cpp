#include <gtest/gtest.h>

#include <algorithm>
#include <map>

#include "StatisticsHistory.h"
#include "Vessa/VSMergedRollup.h"
#include "Vessa/VSStoreSchema.h"

using namespace test;

namespace {

std::unique_ptr<VSDatabase> databaseOf(const std::filesystem::path& folder) {
    return VSStoreSchema::openForWriting(folder, false, false, std::chrono::seconds(10));
}

/// All rows of the rollups and the orders with which they were merged.
std::vector<std::string> rowsOf(VSDatabase& database) {
    std::vector<std::string> rows;
    auto rollups = database.use("SELECT slot, quarters FROM rollups ORDER BY slot");
    while (rollups.step()) rows.push_back(rollups.text(0) + ":" + std::string(rollups.blob(1)));
    auto orders = database.use("SELECT type, position, source FROM merged_orders ORDER BY type, position");
    while (orders.step()) rows.push_back(orders.text(0) + " " + orders.text(1) + " " + orders.text(2));
    return rows;
}

constexpr const char* mergedRows = " WHERE (slot >> 28 & 1048575) = 0";

/// Two days on which the phone and the watch counted the same steps, but for half an hour.
struct TwoSources {
    TwoSources() : store(openStore(folder.path())) {
        std::vector<VSSamplePtr> objects;
        for (int quarter = 0; quarter < 192; ++quarter) {
            const VSDate start = date("2020-03-01T00:00Z") + std::chrono::minutes(15 * quarter);
            const VSDate end = start + std::chrono::minutes(15);
            objects.push_back(quantity(steps(), 30, start, end, from("Phone")));
            if (quarter > 1) objects.push_back(quantity(steps(), 60, start, end, from("Watch")));
        }
        EXPECT_OK(store->saveObjectsAndWait(objects));
    }
    std::optional<double> sum() const {
        return store->statistics(steps(), {}, VSStatisticsOptionCumulativeSum)->sum;
    }
    void execute(const std::string& sql) const { databaseOf(folder.path())->execute(sql.c_str()); }
    int64_t integer(const std::string& sql) const { return databaseOf(folder.path())->integer(sql); }

    FixedEnvironment environment;
    TemporaryFolder folder;
    std::shared_ptr<VSHealthStore> store;
};

}  // namespace

/// Rebuilt from nothing they equal those kept by updates, row for row and byte for byte.
TEST(StoreRollup, RebuiltFromNothingEqualsKept) {
    for (unsigned seed = 2000; seed < 2000 + historyCount(20); ++seed) {
        History history(seed);
        for (int step = 0; step < 12; ++step) history.change();
        const auto database = databaseOf(history.folder());
        const auto kept = rowsOf(*database);
        VSTransaction transaction(*database, VSTransaction::Kind::Write);
        VSRebuildAllRollups(*database);
        transaction.commit();
        ASSERT_EQ(rowsOf(*database), kept) << "seed " << seed;
    }
}

TEST(StoreRollup, WhatComesInAnyOrderLeavesTheSame) {
    std::mt19937 random(1);
    std::vector<double> values{0.1, 1e-5, -0.0, 0, 3e9, 0.061, 1e14, -1e14, 72, 1.0 / 3};
    VSDayRollup first;
    for (int round = 0; round < 20; ++round) {
        VSDayRollup rollup;
        for (double value : values)
            rollup.add(0, static_cast<int64_t>(std::abs(value)) % 86400 * 1'000'000, 86'400'000'000, value);
        if (round == 0) first = rollup;
        EXPECT_EQ(rollup.encoded(), first.encoded());
        EXPECT_EQ(VSDayRollup::decoded(rollup.encoded()).encoded(), first.encoded());
        std::shuffle(values.begin(), values.end(), random);
    }
}

TEST(StoreRollup, MergedRowsFollowTheOrderOfSources) {
    const TwoSources two;
    EXPECT_EQ(two.sum(), 192 * 30);
    EXPECT_EQ(two.integer(std::string("SELECT count(*) FROM rollups") + mergedRows), 2);
    EXPECT_OK(wait([&](auto done) {
        two.store->setOrderedSources({VSSource::forImportedName("Watch")}, steps(), done);
    }));
    EXPECT_EQ(two.sum(), 2 * 30 + 190 * 60);
    EXPECT_OK(wait([&](auto done) { two.store->setOrderedSources({}, steps(), done); }));
    EXPECT_EQ(two.sum(), 192 * 30);
    // The watch's first sample lies earlier now: it counts first, on the days where nothing was saved too.
    EXPECT_OK(two.store->saveObjectsAndWait(
        {quantity(steps(), 5, "2020-02-01T10:00", "2020-02-01T10:01", from("Watch"))}));
    EXPECT_EQ(two.sum(), 5 + 2 * 30 + 190 * 60);
    expectSound(*two.store);
    EXPECT_OK(wait([&](auto done) {
        two.store->deleteAllSamples({steps()}, VSSource::forImportedName("Watch").bundleIdentifier, done);
    }));
    EXPECT_EQ(two.integer(std::string("SELECT count(*) FROM rollups") + mergedRows), 0);
    EXPECT_EQ(two.sum(), 192 * 30);
    expectSound(*two.store);
}

/// A merged row that is missing or of another order is answered from the samples; one with other content is
/// believed, as every rollup is. `check` finds them all.
TEST(StoreRollup, CheckFindsWhatDoesNotFollowFromTheSamples) {
    const struct {
        std::string sql;
        const char* problem;
        double sum;
    } cases[] = {
        {std::string("DELETE FROM rollups") + mergedRows, "is missing", 192 * 30},
        {"UPDATE merged_orders SET source = 3 - source", "another order of sources", 192 * 30},
        {"DELETE FROM merged_orders", "another order of sources", 192 * 30},
        {"UPDATE rollups SET quarters = CAST(substr(quarters, 1, 14) || x'1f' || substr(quarters, 16) AS "
         "BLOB)" +
             std::string(mergedRows),
         "differs from its samples", 192 * 30 + 2},
        {"INSERT INTO rollups SELECT slot + 1000, quarters FROM rollups", "differs from its samples",
         192 * 60},
    };
    for (const auto& one : cases) {
        const TwoSources two;
        two.execute(one.sql);
        const auto report = two.store->check();
        ASSERT_TRUE(report.ok());
        const auto told =
            std::any_of(report->problems.begin(), report->problems.end(),
                        [&](const auto& text) { return text.find(one.problem) != std::string::npos; });
        EXPECT_TRUE(told) << one.sql;
        if (one.sql.starts_with("INSERT")) continue;
        EXPECT_EQ(two.sum(), one.sum) << one.sql;
    }
}
