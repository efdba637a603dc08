#include <gtest/gtest.h>
#include <sched.h>
#include <sys/mount.h>

#include <chrono>
#include <random>

#include "ChildProcess.h"
#include "StoreTestSupport.h"
#include "Vessa/VSDatabase.h"

using namespace test;

// A store among others: processes that are killed, that write at the same time, that hold it for long.

namespace {

struct StoreDoor : testing::Test {
    FixedEnvironment environment;
    TemporaryFolder folder;
    const std::filesystem::path file = folder.path() / "vessa.sqlite";

    static VSHealthStore::Options options(VSDuration patience, bool readOnly = false) {
        VSHealthStore::Options options;
        options.patience = patience;
        options.readOnly = readOnly;
        return options;
    }
    static std::vector<VSSamplePtr> hour(int index, const std::string& source, int count = 60) {
        std::vector<VSSamplePtr> samples;
        for (int i = 0; i < count; ++i) {
            const VSDate start = date("2020-01-01") + std::chrono::hours(index) + std::chrono::minutes(i);
            samples.push_back(quantity(steps(), i, start, start + std::chrono::minutes(1), from(source)));
        }
        return samples;
    }
    int64_t logSize() const {
        std::error_code error;
        const auto size = std::filesystem::file_size(file.string() + "-wal", error);
        return error ? 0 : static_cast<int64_t>(size);
    }
    static void expectHeld(const VSError& error) {
        EXPECT_EQ(error.code, VSErrorCode::NotAccessible);
        EXPECT_NE(error.message.find("held by another program"), std::string::npos) << error.message;
    }
    /// Another program that holds the store with these statements until it is told to let go.
    Child holder(const char* sql) const {
        return Child([this, sql](const auto& say, const auto& listen) {
            VSDatabase database(file, VSDatabase::Mode::Write, std::chrono::seconds(10));
            database.execute(sql);
            say('+');
            listen();
        });
    }
};

}  // namespace

TEST_F(StoreDoor, AKilledProcessLosesNoAcknowledgedSave) {
    const int runs = longTests() ? 500 : 60;
    std::mt19937 random(1);
    std::unique_ptr<TemporaryFolder> place;
    int acknowledged = 0;
    for (int run = 0; run < runs; ++run) {
        SCOPED_TRACE(run);
        if (run % 50 == 0) {
            place = std::make_unique<TemporaryFolder>();
            acknowledged = 0;
            if (run % 100 == 0) openStore(place->path());  // else the first process makes it
        }
        Child child([&](const auto& say, const auto&) {
            VSHealthStore::Options power;
            power.survivesPowerLoss = run % 2;
            const auto opened = VSHealthStore::open(place->path(), power);
            if (!opened) _exit(3);
            const auto& store = *opened;
            for (int i = 0;; ++i) {
                // Some saves are large and some delete, so that every phase of a commit is hit.
                std::vector<VSSamplePtr> objects =
                    hour(run % 50 * 10 + i, "Watch", i % 7 == 3 ? 400 : 1 + i % 3);
                objects.push_back(quantity(heartRate(), run, "2020-03-01", "2020-03-01"));
                if (i % 5 == 4) store->deleteAllSamples({steps()}, std::nullopt, {});
                if (!store->saveObjectsAndWait(objects).ok()) _exit(3);
                say('+');
            }
        });
        // A moment that hits every phase: some acknowledgements, then some work of our own.
        const int wait = static_cast<int>(random() % 8);
        for (int heard = 0; heard < wait; ++heard) acknowledged += child.hear();
        for (auto pieces = random() % 32; pieces > 0; --pieces)
            ASSERT_EQ(hour(static_cast<int>(pieces), "Here").size(), 60u);
        child.kill();
        while (child.hear()) ++acknowledged;
        auto store = openStore(place->path());
        const auto kept = static_cast<int>(allSamples(*store, heartRate()).size());
        EXPECT_GE(kept, acknowledged);
        EXPECT_LE(kept, acknowledged + 1) << "at most the one that was under way when it died";
        acknowledged = kept;
        expectSound(*store);
        if (HasFailure()) return;
    }
}

TEST_F(StoreDoor, AnOldSnapshotKeepsItsAnswersAndItsLogIsCutBackAfterwards) {
    const auto store = openStore(folder.path());
    EXPECT_OK(store->saveObjectsAndWait(hour(0, "Before")));
    auto reading = std::make_unique<VSDatabase>(file, VSDatabase::Mode::Read, VSDuration(0));
    const char* count = "SELECT count(*) FROM samples";
    auto snapshot = std::make_unique<VSTransaction>(*reading, VSTransaction::Kind::Read);
    EXPECT_EQ(reading->integer(count), 60);
    auto import = store->beginImport("long");
    ASSERT_TRUE(import.ok());
    for (int i = 0; i < 100; ++i) {
        for (const auto& sample : hour(i + 24, "Import")) ASSERT_TRUE((*import)->add(*sample).ok());
        EXPECT_EQ(reading->integer(count), 60);
    }
    EXPECT_OK((*import)->commit());
    // Beyond the limit to which the log is cut back (64 MB).
    for (int i = 0; i < 10; ++i)
        EXPECT_OK(wait([&](auto done) {
            store->setDefaultValue(VSValue(std::string(8 << 20, static_cast<char>('a' + i))), "key", done);
        }));
    const int64_t grown = logSize();
    EXPECT_GT(grown, 80 << 20);
    EXPECT_EQ(reading->integer(count), 60);
    EXPECT_EQ(allSamples(*store, steps()).size(), 60u + 100 * 60);
    snapshot.reset();
    // One commit moves the log into the file, the next begins it anew and cuts it.
    for (int i = 0; i < 2; ++i) EXPECT_OK(store->saveObjectsAndWait(hour(-50 - i, "After")));
    EXPECT_LE(logSize(), 64 << 20);
    EXPECT_LT(logSize(), grown);
    // From then on it does not grow: it is used again from its start.
    for (int i = 0; i < 20; ++i) EXPECT_OK(store->saveObjectsAndWait(hour(-80 - i, "After")));
    EXPECT_LE(logSize(), 64 << 20);
}

TEST_F(StoreDoor, AStoreHeldByAnotherProgramIsReadAndAnswersInTime) {
    {
        const auto store = openStore(folder.path());
        EXPECT_OK(store->saveObjectsAndWait(hour(0, "Before")));
    }
    const auto patience = std::chrono::milliseconds(300);
    const auto start = std::chrono::steady_clock::now();
    {
        Child child = holder("BEGIN EXCLUSIVE");
        ASSERT_TRUE(child.hear());
        const auto store = VSHealthStore::open(folder.path(), options(patience));
        ASSERT_TRUE(store.ok()) << store.error().message;
        EXPECT_EQ(allSamples(**store, steps()).size(), 60u);
        const VSStatus saved = (*store)->saveObjectsAndWait(hour(1, "x"));
        const auto import = (*store)->beginImport("x", patience);
        ASSERT_FALSE(saved.ok() || import.ok());
        expectHeld(saved.error());
        expectHeld(import.error());
        // A save that waits does not keep the store from being closed, nor its completion from coming.
        Promise<bool> told;
        (*store)->saveObjects(hour(2, "x"), [&](const VSStatus& status) { told.set(status.ok()); });
        child.tell();
        child.end();
        EXPECT_OK((*store)->saveObjectsAndWait(hour(1, "After")));
    }
    {
        // The whole file, also against reading.
        Child child = holder("PRAGMA locking_mode = EXCLUSIVE; BEGIN EXCLUSIVE");
        ASSERT_TRUE(child.hear());
        for (const bool readOnly : {false, true}) {
            const auto store = VSHealthStore::open(folder.path(), options(patience, readOnly));
            ASSERT_FALSE(store.ok());
            expectHeld(store.error());
        }
        child.tell();
    }
    EXPECT_LT(std::chrono::steady_clock::now() - start, std::chrono::seconds(30));
    expectSound(*openStore(folder.path()));
}

TEST_F(StoreDoor, ClosingDoesNotHangWhileAnotherProgramHoldsTheStore) {
    openStore(folder.path());
    Child child = holder("BEGIN EXCLUSIVE");
    ASSERT_TRUE(child.hear());
    Log<bool> told;
    auto start = std::chrono::steady_clock::now();
    {
        auto store = VSHealthStore::open(folder.path(), options(std::chrono::minutes(2)));
        ASSERT_TRUE(store.ok());
        for (int i = 0; i < 6; ++i)
            (*store)->saveObjects(hour(i, "x"), [&](const VSStatus& status) { told.add(status.ok()); });
        start = std::chrono::steady_clock::now();
    }  // waits five seconds at most for all the saves, and says what became of them
    EXPECT_LT(std::chrono::steady_clock::now() - start, std::chrono::seconds(15));
    EXPECT_EQ(told.entries(), std::vector<bool>(6, false));
    child.tell();
}

TEST_F(StoreDoor, AQuestionDoesNotWaitForEverBehindASaveThatWaits) {
    openStore(folder.path());
    Child child = holder("BEGIN IMMEDIATE");
    ASSERT_TRUE(child.hear());
    const auto store = VSHealthStore::open(folder.path(), options(std::chrono::milliseconds(300)));
    ASSERT_TRUE(store.ok()) << store.error().message;
    const auto ask = [&] { return defaultValueOf(**store, "key"); };
    auto answer = ask();  // nothing was asked for before it
    ASSERT_TRUE(answer.ok());
    EXPECT_EQ(*answer, std::nullopt);
    // One after the other they wait and fail; a question waits no longer than for one.
    constexpr int saves = 40;
    for (int i = 1; i <= saves; ++i) (*store)->setDefaultValue(VSValue(i), "key", {});
    for (int i = 0; i < 2; ++i) {
        answer = ask();
        ASSERT_FALSE(answer.ok());
        EXPECT_EQ(answer.error().code, VSErrorCode::NotAccessible);
        EXPECT_TRUE(answer.error().isHeldByOthers);
    }
    child.tell();
    child.end();
    answer = ask();  // now the saves go on, and it sees them all
    ASSERT_TRUE(answer.ok());
    EXPECT_EQ(*answer, VSValue(saves));
}

TEST_F(StoreDoor, AReadOnlyDiskIsReadAndNotWrittenTo) {
    {
        const auto store = openStore(folder.path());
        EXPECT_OK(store->saveObjectsAndWait(hour(0, "Before")));
    }
    // A folder whose last program was killed, and left its log.
    TemporaryFolder killed;
    {
        const auto store = openStore(folder.path());
        EXPECT_OK(store->saveObjectsAndWait(hour(1, "InTheLog")));
        std::filesystem::copy(folder.path(), killed.path(), std::filesystem::copy_options::recursive);
        std::filesystem::remove(killed.path() / "vessa.sqlite-shm");
    }
    Child child([&](const auto& say, const auto&) {
        for (const auto& place : {folder.path(), killed.path()}) {
            // In a name space of our own; a system that does not allow it cannot make the case.
            if (unshare(CLONE_NEWUSER | CLONE_NEWNS) != 0 && unshare(CLONE_NEWNS) != 0) return say('-');
            if (mount(place.c_str(), place.c_str(), nullptr, MS_BIND, nullptr) != 0 ||
                mount(nullptr, place.c_str(), nullptr, MS_REMOUNT | MS_BIND | MS_RDONLY, nullptr) != 0)
                return say('-');
        }
        for (const auto& place : {folder.path(), killed.path()}) {
            const auto reading = VSHealthStore::open(place, options(std::chrono::seconds(1), true));
            if (!reading) return say('1');
            if (allSamples(**reading, steps()).size() != 120) return say('2');
            if (!(*reading)->check()->problems.empty()) return say('3');
            const auto writing = VSHealthStore::open(place, options(std::chrono::seconds(1)));
            if (writing || writing.error().code != VSErrorCode::NotAccessible) return say('4');
            if (writing.error().message.find("cannot be") == std::string::npos) return say('5');
            if ((*reading)->saveObjectsAndWait(hour(2, "x")).ok()) return say('6');
        }
        say('+');
    });
    const char word = child.hearWord();
    if (word == '-') GTEST_SKIP() << "this system does not let a test mount a folder for reading only";
    EXPECT_EQ(word, '+');
}
