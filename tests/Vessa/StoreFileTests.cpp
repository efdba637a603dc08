#include <gtest/gtest.h>
#include <sys/stat.h>

#include "StoreTestSupport.h"
#include "Vessa/VSDatabase.h"

using namespace test;

namespace {

struct StoreFile : testing::Test {
    FixedEnvironment environment;
    TemporaryFolder folder;
    const std::filesystem::path file = folder.path() / "vessa.sqlite";

    void makeStore(int samples = 10) const {
        const auto store = openStore(folder.path());
        std::vector<VSSamplePtr> objects;
        for (int i = 0; i < samples; ++i)
            objects.push_back(quantity(heartRate(), i, date("2020-03-01") + std::chrono::seconds(i),
                                       date("2020-03-01") + std::chrono::seconds(i)));
        EXPECT_OK(store->saveObjectsAndWait(objects));
    }
    void change(const char* sql) const {
        VSDatabase(file, VSDatabase::Mode::Write, VSDuration(0)).execute(sql);
    }
    VSErrorCode refusal(VSHealthStore::Options options = {}) const {
        const auto store = VSHealthStore::open(folder.path(), options);
        EXPECT_FALSE(store.ok());
        if (store.ok()) return VSErrorCode::Failed;
        EXPECT_NE(store.error().message, "");
        return store.error().code;
    }
};

}  // namespace

TEST_F(StoreFile, BelongsToItsUserOnly) {
    const auto inner = folder.path() / "deep" / "store";
    openStore(inner);
    const auto rights = [](const std::filesystem::path& path) {
        struct stat status {};
        EXPECT_EQ(stat(path.c_str(), &status), 0) << path;
        return status.st_mode & 0777;
    };
    EXPECT_EQ(rights(inner), 0700u);
    EXPECT_EQ(rights(inner / "vessa.sqlite"), 0600u);
}

TEST_F(StoreFile, IsCompleteInItselfAfterTheLastConnectionClosed) {
    {
        const auto store = openStore(folder.path());
        auto transaction = store->beginImport("document");
        ASSERT_TRUE((*transaction)->add(*quantity(heartRate(), 1, "2020-03-01", "2020-03-01")).ok());
        EXPECT_OK((*transaction)->commit());
        EXPECT_EQ(allSamples(*store, heartRate()).size(), 1u);
    }
    EXPECT_FALSE(std::filesystem::exists(file.string() + "-wal"));
    TemporaryFolder copy;
    std::filesystem::copy(file, copy.path() / "vessa.sqlite");
    EXPECT_EQ(allSamples(*openStore(copy.path()), heartRate()).size(), 1u);
}

TEST_F(StoreFile, IsRefusedUntouchedWhenItIsNotOursOrNewer) {
    VSHealthStore::Options options;
    options.createIfMissing = false;
    EXPECT_EQ(refusal(options), VSErrorCode::NotAccessible) << "missing";

    std::ofstream(file) << std::string(5000, 'x');
    EXPECT_EQ(refusal(), VSErrorCode::Corrupt);
    EXPECT_EQ(contentOf(file), std::string(5000, 'x'));
    std::ofstream(file) << "";
    change("CREATE TABLE theirs(a)");
    const std::string theirs = contentOf(file);
    EXPECT_EQ(refusal(), VSErrorCode::Refused);
    EXPECT_EQ(contentOf(file), theirs);
    std::filesystem::remove(file);

    makeStore();
    change("PRAGMA user_version = 99; PRAGMA wal_checkpoint(TRUNCATE)");
    const std::string newer = contentOf(file);
    for (const bool readOnly : {false, true}) {
        options.readOnly = readOnly;
        EXPECT_EQ(refusal(options), VSErrorCode::Refused);
    }
    EXPECT_EQ(contentOf(file), newer);
}

TEST_F(StoreFile, DamageIsReportedAndNothingIsChanged) {
    makeStore(20000);
    const auto whole = contentOf(file);
    std::filesystem::resize_file(file, whole.size() / 2);
    EXPECT_EQ(refusal(), VSErrorCode::Corrupt);
    EXPECT_EQ(contentOf(file), whole.substr(0, whole.size() / 2));

    // Broken pages: the store opens, what reads them says so, and the check finds them.
    std::string broken = whole;
    for (size_t at = broken.size() / 4; at < broken.size() / 2; ++at) broken[at] = static_cast<char>(at * 31);
    std::ofstream(file, std::ios::binary) << broken;
    const auto store = openStore(folder.path());
    ASSERT_TRUE(store);
    const auto samples = store->samples(heartRate(), {}, 0, {});
    ASSERT_FALSE(samples.ok()) << "an empty or partial answer would be a lie";
    EXPECT_EQ(samples.error().code, VSErrorCode::Corrupt);
    const auto report = store->check();
    EXPECT_TRUE(!report.ok() || !report->problems.empty());
}

TEST_F(StoreFile, TheCheckFindsWhatWasTamperedWith) {
    makeStore();
    for (const char* sql : {"UPDATE samples SET value = 9 WHERE value = 5",
                            "UPDATE type_sources SET count = 11",
                            "DELETE FROM rollups",
                            "DELETE FROM samples WHERE value = 3",
                            "UPDATE provenances SET source = 99",
                            "UPDATE samples SET provenance = 99 WHERE value = 5",
                            "UPDATE state SET last = 3",
                            "UPDATE samples SET id = 4 WHERE value = 5",
                            "UPDATE samples SET metadata = 9 WHERE value = 5",
                            "INSERT INTO metadata VALUES (1, '{}', 1)",
                            "INSERT INTO deleted VALUES (9, 5, 2)",
                            "UPDATE types SET change = 1",
                            "INSERT INTO members VALUES (1, 0, 2, 5, 9)",
                            "INSERT INTO workouts VALUES (3, 1, 1, 1)",
                            "INSERT INTO workout_events VALUES (3, 0, 1, 1)",
                            "INSERT INTO source_order VALUES (5, 0, 99)",
                            "INSERT INTO batches VALUES (1, 'x', 0, 9, 99, 1, 0)",
                            "INSERT INTO batch_claims VALUES (1, 1, 2)",
                            "INSERT INTO batch_characteristics VALUES (1, 64, 1, 1)",
                            "INSERT INTO authorizations VALUES ('a', 5, 'a', 9, 0, 0)",
                            "INSERT INTO defaults VALUES ('a', 'b', '{')",
                            "INSERT INTO medical_id VALUES (1, 'x', NULL)",
                            "INSERT INTO characteristics VALUES (5, 1)"}) {
        TemporaryFolder copy;
        std::filesystem::copy(folder.path(), copy.path(), std::filesystem::copy_options::recursive);
        VSDatabase(copy.path() / "vessa.sqlite", VSDatabase::Mode::Write, VSDuration(0)).execute(sql);
        const auto report = openStore(copy.path())->check();
        EXPECT_TRUE(!report.ok() || !report->problems.empty()) << sql;
    }
    const auto store = openStore(folder.path());
    EXPECT_EQ(store->check()->samples, 10);
    expectSound(*store);
}

TEST_F(StoreFile, ReadOnlyReadsAndRefusesToWrite) {
    makeStore();
    VSHealthStore::Options options;
    options.readOnly = true;
    const auto store = openStore(folder.path(), options);
    EXPECT_EQ(allSamples(*store, heartRate()).size(), 10u);
    const VSStatus status = store->saveObjectsAndWait({quantity(heartRate(), 1, "2020-03-01", "2020-03-01")});
    ASSERT_FALSE(status.ok());
    EXPECT_EQ(status.error().code, VSErrorCode::NotAccessible);
    EXPECT_FALSE(store->beginImport("x").ok());
}

/// Other processes are told in the same way as other connections of this one.
TEST_F(StoreFile, AnotherConnectionSeesAndHearsOfChanges) {
    Log<bool> told;
    const auto writing = openStore(folder.path()), watching = openStore(folder.path());
    watching->executeQuery(std::make_shared<VSObserverQuery>(heartRate(), VSPredicate(),
                                                             [&](const auto& error) { told.add(!error); }));
    ASSERT_TRUE(told.waitFor(1));
    EXPECT_OK(writing->saveObjectsAndWait({quantity(heartRate(), 1, "2020-03-01", "2020-03-01")}));
    ASSERT_TRUE(told.waitFor(2));
    EXPECT_EQ(allSamples(*watching, heartRate()).size(), 1u);
    // Numbers of sources and metadata that the other one gave are known here.
    auto provenance = from("Phone");
    provenance.metadata = std::make_shared<VSMetadata>(VSMetadata{{"k", 1}});
    for (int i = 0; i < 3; ++i) {
        EXPECT_OK(
            writing->saveObjectsAndWait({quantity(heartRate(), i, "2020-03-02", "2020-03-02", provenance)}));
        EXPECT_OK(
            watching->saveObjectsAndWait({quantity(heartRate(), i, "2020-03-02", "2020-03-02", provenance)}));
    }
    EXPECT_EQ(writing->sourceSummaries()->size(), 2u);
    expectSound(*writing);
}
