#include <fcntl.h>
#include <gtest/gtest.h>
#include <poll.h>
#include <sys/inotify.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <unistd.h>

#include <csignal>
#include <fstream>
#include <future>

#include "ChildProcess.h"
#include "FaultyFileSystem.h"
#include "StoreTestSupport.h"
#include "Vessa/VSDatabase.h"
#include "Vessa/VSStoreMigration.h"
#include "Vessa/VSStoreSchema.h"

using namespace test;

namespace {

namespace fs = std::filesystem;

// What the stored files answer is in tests/Program; here is how they become new ones.
struct StoreMigration : testing::Test {
    FixedEnvironment environment;
    TemporaryFolder folder;
    const fs::path stored = fs::path(QELVAR_TEST_DATA) / "stores" / "version-1" / "vessa.sqlite";
    const fs::path file = folder.path() / "vessa.sqlite";

    void SetUp() override { fs::copy_file(stored, file); }

    static VSDatabase open(const fs::path& path) { return {path, VSDatabase::Mode::Write, VSDuration(0)}; }
    static void change(const fs::path& path, const char* sql) { open(path).execute(sql); }
    static std::vector<std::string> texts(VSDatabase& database, const std::string& sql) {
        std::vector<std::string> result;
        auto rows = database.use(sql);
        while (rows.step()) result.push_back(rows.text(0));
        return result;
    }
    /// All but the rollups, whose form may differ.
    static void expectSameContent(const fs::path& a, const fs::path& b) {
        EXPECT_GE(expectSameRows(a, b, {"rollups", "batches", "sqlite_sequence"}), 16);
    }
    std::vector<std::string> copies() const {
        std::vector<std::string> names;
        for (const auto& entry : fs::directory_iterator(folder.path())) {
            const auto name = entry.path().filename().string();
            if (name.find("version") != name.npos || name.find("copy") != name.npos) names.push_back(name);
        }
        std::sort(names.begin(), names.end());
        return names;
    }
    /// Opens the store and finds all of the old content in it.
    void expectMigrated() const {
        {
            const auto store = openStore(folder.path());
            ASSERT_TRUE(store);
            expectSound(*store);
        }
        EXPECT_EQ(open(file).integer("PRAGMA user_version"), VSStoreSchema::currentVersion);
        expectSameContent(stored, file);
    }
};

}  // namespace

TEST_F(StoreMigration, MakesWhatANewStoreHas) {
    expectMigrated();
    TemporaryFolder other;
    openStore(other.path());
    VSDatabase migrated = open(file), made = open(other.path() / "vessa.sqlite");
    const char* schema = "SELECT name || ': ' || coalesce(sql, '') FROM sqlite_master ORDER BY name";
    EXPECT_EQ(texts(migrated, schema), texts(made, schema));

    // The one import of that store took 14 numbers, three of them for characteristics; its own does not come
    // again.
    EXPECT_EQ(migrated.integer("SELECT added FROM batches WHERE batch = 1"), 11);
    migrated.execute(
        "DELETE FROM batches; INSERT INTO batches(name, date, first_id, last_id, added, undone)"
        " VALUES ('x', 0, 1, 1, 1, 0)");
    EXPECT_EQ(migrated.integer("SELECT batch FROM batches"), 2);
}

TEST_F(StoreMigration, KeepsACompleteCopyUnderANameOfItsOwn) {
    // The last save of the old program is in its log only, as after a kill.
    TemporaryFolder before;
    const fs::path old = before.path() / "vessa.sqlite";
    fs::copy_file(stored, old);
    {
        VSDatabase database = open(old);
        // And it took values that are refused today.
        database.execute(
            "PRAGMA wal_autocheckpoint = 0; INSERT INTO defaults VALUES ('app', 'late', '1');"
            "UPDATE samples SET value = 1e300 WHERE type = 5");
        fs::copy_file(old, file, fs::copy_options::overwrite_existing);
        fs::copy_file(old.string() + "-wal", file.string() + "-wal");
    }
    std::ofstream(folder.path() / "vessa.version-1.sqlite") << "mine";
    expectSound(*openStore(folder.path()));
    EXPECT_EQ(copies(), (std::vector<std::string>{"vessa.version-1.2.sqlite", "vessa.version-1.sqlite"}));
    EXPECT_EQ(contentOf(folder.path() / "vessa.version-1.sqlite"), "mine");
    const fs::path copy = folder.path() / "vessa.version-1.2.sqlite";
    struct stat status {};
    ASSERT_EQ(stat(copy.c_str(), &status), 0);
    EXPECT_EQ(status.st_mode & 0777, 0600u);
    expectSameContent(old, copy);
    expectSameContent(copy, file);
    VSDatabase kept = open(copy);
    EXPECT_EQ(kept.integer("SELECT count(*) FROM defaults WHERE key = 'late'"), 1);
    EXPECT_EQ(kept.integer("PRAGMA user_version"), 1);
    EXPECT_EQ(texts(kept, "PRAGMA integrity_check"), (std::vector<std::string>{"ok"}));
}

TEST_F(StoreMigration, IsNotForReadersAndNotWhileAnotherProgramIsIn) {
    const std::string before = contentOf(file);
    VSHealthStore::Options options;
    options.readOnly = true;
    const auto reading = VSHealthStore::open(folder.path(), options);
    ASSERT_FALSE(reading.ok());
    EXPECT_EQ(reading.error().code, VSErrorCode::Refused);
    {
        // A running program of the old format, between two of its saves.
        VSDatabase other = open(file);
        EXPECT_GT(other.integer("SELECT last FROM state"), 0);
        try {
            VSStoreMigration::migrate(file, std::chrono::milliseconds(50));
            ADD_FAILURE() << "the other one would write the old format into the new store";
        } catch (const VSDatabaseFailure& failure) {
            EXPECT_EQ(failure.error().code, VSErrorCode::NotAccessible) << failure.what();
        }
        EXPECT_EQ(other.integer("PRAGMA user_version"), 1);
    }
    EXPECT_EQ(copies(), std::vector<std::string>());
    EXPECT_EQ(contentOf(file), before);
    expectMigrated();
}

TEST_F(StoreMigration, IsDoneOnceByProcessesThatOpenAtTheSameTime) {
    std::vector<std::unique_ptr<Child>> processes;
    for (int i = 0; i < 4; ++i)
        processes.push_back(std::make_unique<Child>([this](const auto& say, const auto& listen) {
            listen();
            const auto store = VSHealthStore::open(folder.path());
            if (store && (*store)->saveObjectsAndWait({quantity(heartRate(), 1, "2020-04-01", "2020-04-01")}))
                say('+');
        }));
    for (const auto& process : processes) process->tell();
    for (const auto& process : processes) EXPECT_TRUE(process->hear());
    processes.clear();
    EXPECT_EQ(copies(), (std::vector<std::string>{"vessa.version-1.sqlite"}));
    const auto store = openStore(folder.path());
    EXPECT_EQ(allSamples(*store, heartRate()).size(), 5u);
    expectSound(*store);
}

/// One that takes long: who opens the store meanwhile waits for it beyond his own patience, and then does not
/// mind that its program goes on using the store.
TEST_F(StoreMigration, OfAnotherProcessIsWaitedFor) {
    Child other([this](const auto& say, const auto& listen) {
        {
            VSDatabase database = open(file);
            database.execute("PRAGMA locking_mode = EXCLUSIVE; BEGIN EXCLUSIVE; PRAGMA user_version = 2");
            say('+');
            listen();
            database.execute("COMMIT");
        }
        VSDatabase database = open(file);
        database.setPatience(std::chrono::minutes(1));
        database.integer("SELECT last FROM state");
        say('+');
        listen();
    });
    ASSERT_TRUE(other.hear());
    const int events = inotify_init1(IN_CLOEXEC);
    ASSERT_GE(inotify_add_watch(events, file.c_str(), IN_OPEN), 0);
    auto migrated =
        std::async(std::launch::async, [this] { VSStoreMigration::migrate(file, VSDuration(0)); });
    int opened = 0;
    for (pollfd ready{events, POLLIN, 0}; opened < 20 && poll(&ready, 1, 60'000) == 1;) {
        alignas(inotify_event) char buffer[sizeof(inotify_event)];
        opened += read(events, buffer, sizeof buffer) > 0;
        if (migrated.wait_for(VSDuration(0)) == std::future_status::ready) break;
    }
    close(events);
    EXPECT_EQ(opened, 20) << "it did not wait";
    other.tell();
    EXPECT_TRUE(other.hear());
    EXPECT_NO_THROW(migrated.get());
    other.tell();
    other.end();
    EXPECT_EQ(copies(), std::vector<std::string>());

    // Who has been told to give up does not wait at all.
    Child third([this](const auto& say, const auto& listen) {
        VSDatabase database = open(file);
        database.execute("PRAGMA locking_mode = EXCLUSIVE; BEGIN EXCLUSIVE");
        say('+');
        listen();
    });
    ASSERT_TRUE(third.hear());
    const std::atomic<bool> giveUp = true;
    EXPECT_THROW(VSStoreSchema::openForWriting(folder.path(), false, true, VSDuration::max(), &giveUp),
                 VSDatabaseFailure);
    third.tell();
}

/// The disk breaks at each of the migration's operations. A commit that is reported as failed may be there
/// when the disk is well again: then the copy is too.
TEST_F(StoreMigration, OnABrokenDiskNeverReplacesTheOldStoreWithoutItsCopy) {
    FaultyFileSystem disk;
    int thereAfterAll = 0;
    for (int n = 0;; ++n) {
        SCOPED_TRACE(n);
        for (const auto& entry : fs::directory_iterator(folder.path())) fs::remove(entry.path());
        fs::copy_file(stored, file);
        disk.failAt(n, FaultyFileSystem::Fault::BrokenDisk);
        const bool opened = VSHealthStore::open(folder.path()).ok();
        const bool reached = disk.operations() > n;
        disk.heal();
        if (open(file).integer("PRAGMA user_version") == VSStoreSchema::currentVersion) {
            thereAfterAll += !opened;
            ASSERT_EQ(copies(), (std::vector<std::string>{"vessa.version-1.sqlite"}));
            expectSameContent(stored, folder.path() / "vessa.version-1.sqlite");
        }
        expectMigrated();
        if (!reached || HasFailure()) break;
    }
    EXPECT_GT(thereAfterAll, 0);
}

TEST_F(StoreMigration, WithoutRoomChangesNothing) {
    const std::string before = contentOf(file);
    signal(SIGXFSZ, SIG_IGN);
    rlimit unlimited{};
    ASSERT_EQ(getrlimit(RLIMIT_FSIZE, &unlimited), 0);
    int refused = 0;
    for (rlim_t limit = 65536; limit <= before.size(); limit += 16384) {
        rlimit small = unlimited;
        small.rlim_cur = limit;
        ASSERT_EQ(setrlimit(RLIMIT_FSIZE, &small), 0);
        const auto store = VSHealthStore::open(folder.path());
        ASSERT_EQ(setrlimit(RLIMIT_FSIZE, &unlimited), 0);
        if (store.ok()) continue;
        ++refused;
        EXPECT_EQ(store.error().code, VSErrorCode::DiskFull) << store.error().message;
        EXPECT_EQ(copies(), std::vector<std::string>());
        EXPECT_EQ(contentOf(file), before);
    }
    EXPECT_GT(refused, 3);

    // The same after the copy was made: something in the way of a step.
    change(file, "CREATE TABLE authorizations(a)");
    const std::string odd = contentOf(file);
    EXPECT_FALSE(VSHealthStore::open(folder.path()).ok());
    EXPECT_EQ(copies(), std::vector<std::string>());
    EXPECT_EQ(contentOf(file), odd);
    change(file, "DROP TABLE authorizations");
    expectMigrated();
}

/// Killed after each of the first things that are seen to happen in the folder, then fewer and fewer.
TEST_F(StoreMigration, KilledAtAnyMomentIsDoneAtTheNextOpening) {
    bool finished = false;
    for (int moment = 1; !finished; moment += 1 + moment / 6) {
        ASSERT_LT(moment, 100000);
        for (const auto& entry : fs::directory_iterator(folder.path())) fs::remove(entry.path());
        fs::copy_file(stored, file);
        const int events = inotify_init1(IN_CLOEXEC);
        ASSERT_GE(inotify_add_watch(events, folder.path().c_str(),
                                    IN_CREATE | IN_MODIFY | IN_MOVED_TO | IN_DELETE | IN_CLOSE_WRITE),
                  0);
        Child process([this](const auto&, const auto&) {
            (void)VSHealthStore::open(folder.path());
            // Told in its own way that it got to its end.
            std::ofstream(folder.path() / "done");
        });
        for (int seen = 0; seen < moment && !finished;) {
            alignas(inotify_event) char buffer[sizeof(inotify_event) + NAME_MAX + 1];
            const ssize_t size = read(events, buffer, sizeof buffer);
            ASSERT_GT(size, 0);
            for (ssize_t at = 0; at < size;) {
                const auto* event = reinterpret_cast<const inotify_event*>(buffer + at);
                at += static_cast<ssize_t>(sizeof(inotify_event) + event->len);
                ++seen;
                if (event->len && std::string(event->name) == "done") finished = true;
            }
        }
        process.kill();
        close(events);
        fs::remove(folder.path() / "done");
        expectMigrated();
        const auto kept = copies();
        ASSERT_FALSE(kept.empty()) << "moment " << moment;
        EXPECT_LE(kept.size(), 2u);
        for (const auto& name : kept) {
            EXPECT_EQ(name.find("copy"), name.npos) << "unfinished";
            expectSameContent(stored, folder.path() / name);
        }
        if (HasFailure()) FAIL() << "moment " << moment;
    }
}
