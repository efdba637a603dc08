#include "Vessa/VSStoreMigration.h"

#include <fcntl.h>
#include <sqlite3.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <chrono>
#include <memory>
#include <optional>
#include <string>
#include <thread>

#include "Vessa/VSDatabase.h"
#include "Vessa/VSRollup.h"
#include "Vessa/VSStoreSchema.h"

namespace {

namespace fs = std::filesystem;

/// While it is made; under its own name it is complete. This one stays until all is done: it tells others
/// that a migration is under way.
fs::path unfinishedCopy(const fs::path& file) {
    return file.string() + "-copy";
}

fs::path freeNameForCopy(const fs::path& file, int version) {
    const std::string stem =
        (file.parent_path() / file.stem()).string() + ".version-" + std::to_string(version);
    fs::path name = stem + file.extension().string();
    for (int number = 2; fs::symlink_status(name).type() != fs::file_type::not_found; ++number)
        name = stem + "." + std::to_string(number) + file.extension().string();
    return name;
}

[[noreturn]] void failWithSystem(int reason, const std::string& what) {
    throw VSDatabaseFailure(VSErrorFromSystem(reason, what));
}

/// A database file with all that may stand beside it.
void removeDatabase(const fs::path& file) {
    for (const char* suffix : {"", "-journal", "-wal", "-shm"}) ::unlink((file.string() + suffix).c_str());
}

void syncToDisk(const fs::path& path, int flags) {
    const int descriptor = ::open(path.c_str(), flags | O_CLOEXEC);
    const bool done = descriptor >= 0 && ::fsync(descriptor) == 0;
    const int reason = errno;
    if (descriptor >= 0) ::close(descriptor);
    if (!done) failWithSystem(reason, path.string() + " cannot be written to the disk");
}

/// A copy of the old store beside it. Goes at the end unless it is kept.
class Copy {
 public:
    Copy(VSDatabase& store, const fs::path& file) : path_(unfinishedCopy(file)), folder_(file.parent_path()) {
        removeDatabase(path_);  // what a killed migration left
        try {
            make(store);
        } catch (const VSDatabaseFailure&) {
            removeDatabase(path_);
            throw;
        }
    }
    ~Copy() {
        removeDatabase(path_);
        if (!kept_ && !name_.empty()) ::unlink(name_.c_str());
    }
    Copy(const Copy&) = delete;
    Copy& operator=(const Copy&) = delete;

    /// Gives it its name, for good once `keep` was called.
    void setName(const fs::path& name) {
        std::error_code error;
        fs::create_hard_link(path_, name, error);
        if (error && error != std::errc::file_exists) fs::rename(path_, name, error);  // no links there
        if (error) failWithSystem(error.value(), "the copy " + name.string() + " cannot be named");
        name_ = name;
        syncToDisk(folder_, O_RDONLY | O_DIRECTORY);
    }
    void keep() { kept_ = true; }

 private:
    void make(VSDatabase& store) {
        const int descriptor = ::open(path_.c_str(), O_RDWR | O_CREAT | O_EXCL | O_CLOEXEC, 0600);
        if (descriptor < 0) failWithSystem(errno, "the copy " + path_.string() + " cannot be made");
        ::close(descriptor);
        {
            VSDatabase copy(path_, VSDatabase::Mode::Write, VSDuration(0));
            copy.execute("PRAGMA synchronous = OFF; PRAGMA journal_mode = OFF;");
            sqlite3_backup* backup = sqlite3_backup_init(copy.handle(), "main", store.handle(), "main");
            if (!backup) copy.fail(sqlite3_extended_errcode(copy.handle()));
            const int code = sqlite3_backup_step(backup, -1);
            const int reason = errno;
            sqlite3_backup_finish(backup);
            errno = reason;
            if (code != SQLITE_DONE) copy.fail(code);
        }
        syncToDisk(path_, O_RDONLY);
    }

    const fs::path path_, folder_;
    fs::path name_;  // empty: none yet
    bool kept_ = false;
};

/// Batches know what they added and their numbers never come again; sums over sources, permissions and what
/// several imports had in common have tables; the rollups have their new form.
void fromVersion1(VSDatabase& database) {
    database.execute(R"sql(
CREATE TABLE merged_orders(
    type INTEGER NOT NULL,
    position INTEGER NOT NULL,
    source INTEGER NOT NULL,
    PRIMARY KEY (type, position)) WITHOUT ROWID;

ALTER TABLE batches RENAME TO batches_1;
CREATE TABLE batches(
    batch INTEGER PRIMARY KEY AUTOINCREMENT,
    name TEXT NOT NULL,
    date INTEGER NOT NULL,
    first_id INTEGER NOT NULL,
    last_id INTEGER NOT NULL,
    added INTEGER NOT NULL,
    undone INTEGER NOT NULL);
INSERT INTO batches SELECT batch, name, date, first_id, last_id,
    (SELECT count(*) FROM types t JOIN samples s INDEXED BY samples_by_id
        ON s.type = t.type AND s.id BETWEEN first_id AND last_id) +
    (SELECT count(*) FROM deleted d WHERE d.id BETWEEN first_id AND last_id), 0
    FROM batches_1;
DROP TABLE batches_1;
CREATE TABLE batch_claims(
    batch INTEGER NOT NULL,
    first_id INTEGER NOT NULL,
    last_id INTEGER NOT NULL,
    PRIMARY KEY (batch, first_id)) WITHOUT ROWID;
CREATE TABLE batch_characteristics(
    batch INTEGER NOT NULL,
    type INTEGER NOT NULL,
    value INTEGER NOT NULL,
    given INTEGER NOT NULL,
    PRIMARY KEY (batch, type)) WITHOUT ROWID;

CREATE TABLE authorizations(
    bundle TEXT NOT NULL,
    type INTEGER NOT NULL,
    name TEXT NOT NULL,
    status INTEGER NOT NULL,
    reading INTEGER NOT NULL,
    sharing INTEGER NOT NULL,
    PRIMARY KEY (bundle, type)) WITHOUT ROWID;
)sql");
    VSRebuildAllRollups(database);
}

using Step = void (*)(VSDatabase&);
constexpr Step steps[] = {fromVersion1};
static_assert(std::size(steps) == VSStoreSchema::currentVersion - 1);

void takeSteps(VSDatabase& database, int version) {
    for (int step = version; step < VSStoreSchema::currentVersion; ++step) {
        steps[step - 1](database);
        database.execute(("PRAGMA user_version = " + std::to_string(step + 1)).c_str());
    }
}

/// The format of a store that others have open; none: somebody has it to himself.
std::optional<int64_t> versionAmongOthers(const fs::path& file) {
    try {
        return VSDatabase(file, VSDatabase::Mode::Write, VSDuration(0)).integer("PRAGMA user_version");
    } catch (const VSDatabaseFailure& failure) {
        if (!failure.error().isHeldByOthers) throw;
        return std::nullopt;
    }
}

/// A connection that has the whole file to itself from now until it closes: a program that knows only the old
/// format must not go on writing into the new one, and no commit may come between copy and steps. Null:
/// another process was faster.
std::unique_ptr<VSDatabase> openAlone(const fs::path& file, VSDuration patience) {
    const auto start = std::chrono::steady_clock::now();
    for (int attempt = 0;; ++attempt) {
        // Not SQLite's own waiting: two that wait for each other's shared lock would do so for ever.
        auto database = std::make_unique<VSDatabase>(file, VSDatabase::Mode::Write, VSDuration(0));
        try {
            database->execute("PRAGMA locking_mode = EXCLUSIVE; PRAGMA synchronous = FULL;");
            database->execute("BEGIN EXCLUSIVE; COMMIT;");
            return database;
        } catch (const VSDatabaseFailure& failure) {
            if (!failure.error().isHeldByOthers) throw;
            database.reset();
            const auto version = versionAmongOthers(file);
            if (version >= VSStoreSchema::currentVersion) return nullptr;
            // Who has a store of an old format to himself brings it to the new one.
            const VSDuration most =
                version ? patience : std::max(patience, VSStoreMigration::patienceForOthers);
            if (std::chrono::steady_clock::now() - start >= most) throw;
        }
        std::this_thread::sleep_for(std::chrono::milliseconds(1 + (::getpid() + attempt * 7) % 20));
    }
}

void migrateAlone(std::unique_ptr<VSDatabase> database, const fs::path& file) {
    const auto version = static_cast<int>(database->integer("PRAGMA user_version"));
    if (version >= VSStoreSchema::currentVersion) return;
    Copy copy(*database, file);
    {
        VSTransaction transaction(*database, VSTransaction::Kind::Write);
        takeSteps(*database, version);
        copy.setName(freeNameForCopy(file, version));
        copy.keep();  // a commit that fails on a bad disk may turn out to be there
        transaction.commit();
    }
    database.reset();  // moves the log into the file, for which others wait too
}

}  // namespace

void VSStoreMigration::migrate(const fs::path& file, VSDuration patience) {
    try {
        if (auto database = openAlone(file, patience)) migrateAlone(std::move(database), file);
    } catch (const VSDatabaseFailure& failure) {
        VSError error = failure.error();
        error.message = "the store " + file.string() +
                        " has an older format and could not be brought to this program's; nothing of it was "
                        "changed: " +
                        error.message;
        throw VSDatabaseFailure(std::move(error));
    }
}

bool VSStoreMigration::mayBeUnderWay(const fs::path& file) {
    std::error_code ignored;
    return fs::exists(unfinishedCopy(file), ignored);
}

void VSStoreMigration::clearUp(const fs::path& file) {
    if (mayBeUnderWay(file)) removeDatabase(unfinishedCopy(file));
}

std::vector<fs::path> VSStoreMigration::keptCopies(const fs::path& folder) {
    std::vector<fs::path> copies;
    std::error_code ignored;
    for (const auto& entry : fs::directory_iterator(folder, ignored)) {
        const std::string name = entry.path().filename().string();
        if (name.starts_with("vessa.version-") && name.ends_with(".sqlite")) copies.push_back(entry.path());
    }
    std::sort(copies.begin(), copies.end());
    return copies;
}
