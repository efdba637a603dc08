#include <random>

#include "StoreTestSupport.h"
#include "Vessa/VSStoreSnapshot.h"

namespace {

/// Page by page, in the same order as a sorted query, and of the moment at which it was taken.
TEST(StoreSnapshot, ReadsOneMomentInTheOrderOfEnds) {
    const test::FixedEnvironment environment;
    const test::TemporaryFolder folder;
    const auto store = test::openStore(folder.path());
    std::mt19937 random(7);
    std::vector<VSSamplePtr> samples;
    for (int i = 0; i < 700; ++i) {
        // Many of no length, many that end together, some longer than any index expects.
        const VSDate start = test::date("2020-01-01") + std::chrono::hours(random() % 300);
        const VSDate end = start + std::chrono::hours(i % 3 == 0 ? 0 : i % 50 == 1 ? 500 : random() % 20);
        samples.push_back(test::quantity(test::steps(), i, start, end));
    }
    EXPECT_OK(store->saveObjectsAndWait(samples));
    const auto snapshot = VSStoreSnapshot::take(*store);
    ASSERT_TRUE(snapshot.ok()) << snapshot.error().message;
    const std::pair<VSStoreSnapshot::Order, std::vector<VSSortDescriptor>> orders[] = {
        {VSStoreSnapshot::Order::EndDate, {{VSSampleSortIdentifierEndDate, true}}},
        {VSStoreSnapshot::Order::Insertion, {}}};
    const auto valuesOf = [](const std::vector<VSSamplePtr>& page, std::vector<double>& values) {
        for (const auto& sample : page)
            values.push_back(dynamic_cast<const VSQuantitySample&>(*sample).quantity().value());
    };
    std::vector<std::vector<double>> expected(2);
    for (int i = 0; i < 2; ++i)
        valuesOf(*store->samples(test::steps(), {}, 0, orders[i].second), expected[i]);
    EXPECT_OK(store->saveObjectsAndWait({test::quantity(test::steps(), 1, "2020-01-02", "2020-01-03")}));
    EXPECT_OK(test::wait([&](auto done) {
        store->deleteAllSamples({test::heartRate(), test::steps()}, {}, done);
    }));

    for (int i = 0; i < 2; ++i) {
        std::vector<double> read;
        EXPECT_OK(
            (*snapshot)->readSamples(test::steps(), orders[i].first, 64, [&](std::vector<VSSamplePtr> page) {
                EXPECT_LE(page.size(), 64U);
                valuesOf(page, read);
                return true;
            }));
        EXPECT_EQ(read, expected[i]);
    }
    const auto extents = (*snapshot)->extents();
    EXPECT_EQ(extents->at(test::steps()).count, 700);
    int pages = 0;
    EXPECT_OK((*snapshot)->readSamples(test::steps(), orders[0].first, 64,
                                       [&](const auto&) { return ++pages < 3; }));
    EXPECT_EQ(pages, 3) << "the reader has had enough";
}

}  // namespace
