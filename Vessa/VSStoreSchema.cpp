#include "Vessa/VSStoreSchema.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <string>

#include "Vessa/VSStoreMigration.h"

namespace {

// The indexes last, as SQLite itself orders them when it makes the file anew: a salvage looks for the roots
// of a file without its list of tables where a new store has them.
constexpr const char* tables = R"sql(
CREATE TABLE state(
    only INTEGER PRIMARY KEY CHECK (only = 1),
    last INTEGER NOT NULL,
    last_metadata INTEGER NOT NULL);
INSERT INTO state VALUES (1, 0, 0);

CREATE TABLE types(
    type INTEGER PRIMARY KEY,
    change INTEGER NOT NULL,
    longest INTEGER NOT NULL);

CREATE TABLE sources(
    source INTEGER PRIMARY KEY,
    name TEXT NOT NULL,
    bundle TEXT NOT NULL,
    UNIQUE (bundle, name));

CREATE TABLE devices(
    device INTEGER PRIMARY KEY,
    name TEXT, manufacturer TEXT, model TEXT, hardware TEXT, firmware TEXT, software TEXT, local TEXT, udi TEXT);

CREATE TABLE provenances(
    provenance INTEGER PRIMARY KEY,
    source INTEGER NOT NULL REFERENCES sources,
    version TEXT NOT NULL,
    device INTEGER REFERENCES devices,
    zone INTEGER);

CREATE TABLE metadata(
    metadata INTEGER PRIMARY KEY,
    content TEXT NOT NULL UNIQUE,
    uses INTEGER NOT NULL);

CREATE TABLE samples(
    type INTEGER NOT NULL,
    start INTEGER NOT NULL,
    id INTEGER NOT NULL,
    duration INTEGER NOT NULL,
    value,
    provenance INTEGER NOT NULL,
    created INTEGER NOT NULL,
    metadata INTEGER,
    PRIMARY KEY (type, start, id)) WITHOUT ROWID;

CREATE TABLE members(
    parent INTEGER NOT NULL,
    position INTEGER NOT NULL,
    member INTEGER NOT NULL,
    type INTEGER NOT NULL,
    start INTEGER NOT NULL,
    PRIMARY KEY (parent, position)) WITHOUT ROWID;

CREATE TABLE workouts(
    workout INTEGER PRIMARY KEY,
    duration INTEGER NOT NULL,
    energy,
    distance);
CREATE TABLE workout_events(
    workout INTEGER NOT NULL,
    position INTEGER NOT NULL,
    type INTEGER NOT NULL,
    date INTEGER,
    PRIMARY KEY (workout, position)) WITHOUT ROWID;

CREATE TABLE deleted(
    change INTEGER PRIMARY KEY,
    type INTEGER NOT NULL,
    id INTEGER NOT NULL);

CREATE TABLE type_sources(
    type INTEGER NOT NULL,
    source INTEGER NOT NULL,
    count INTEGER NOT NULL,
    first_start INTEGER NOT NULL,
    last_end INTEGER NOT NULL,
    PRIMARY KEY (type, source)) WITHOUT ROWID;

CREATE TABLE rollups(
    slot INTEGER PRIMARY KEY,
    quarters BLOB NOT NULL);

CREATE TABLE source_order(
    type INTEGER NOT NULL,
    position INTEGER NOT NULL,
    source INTEGER NOT NULL,
    PRIMARY KEY (type, position)) WITHOUT ROWID;

CREATE TABLE merged_orders(
    type INTEGER NOT NULL,
    position INTEGER NOT NULL,
    source INTEGER NOT NULL,
    PRIMARY KEY (type, position)) WITHOUT ROWID;

CREATE TABLE batches(
    batch INTEGER PRIMARY KEY AUTOINCREMENT,
    name TEXT NOT NULL,
    date INTEGER NOT NULL,
    first_id INTEGER NOT NULL,
    last_id INTEGER NOT NULL,
    added INTEGER NOT NULL,
    undone INTEGER NOT NULL);
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

CREATE TABLE defaults(
    application TEXT NOT NULL,
    key TEXT NOT NULL,
    value TEXT NOT NULL,
    PRIMARY KEY (application, key)) WITHOUT ROWID;

CREATE TABLE characteristics(
    type INTEGER PRIMARY KEY,
    value INTEGER NOT NULL);

CREATE TABLE medical_id(
    only INTEGER PRIMARY KEY CHECK (only = 1),
    content TEXT NOT NULL,
    picture BLOB);

CREATE INDEX samples_by_id ON samples(type, id);
CREATE INDEX samples_long ON samples(type, start) WHERE duration > )sql" VS_LONG_SPAN_SQL R"sql(;
CREATE INDEX members_by_member ON members(member);
CREATE INDEX deleted_by_type ON deleted(type, change);
)sql";

constexpr const char* tableNames[] = {"state",          "types",         "sources",
                                      "devices",        "provenances",   "metadata",
                                      "samples",        "members",       "workouts",
                                      "workout_events", "deleted",       "type_sources",
                                      "rollups",        "merged_orders", "source_order",
                                      "batches",        "batch_claims",  "batch_characteristics",
                                      "authorizations", "defaults",      "characteristics",
                                      "medical_id"};

[[noreturn]] void refuse(VSErrorCode code, std::string message) {
    throw VSDatabaseFailure({code, std::move(message)});
}

/// What was made in a folder is surely there after a lost power supply only when the folder is synced.
void syncFolder(const std::filesystem::path& folder) {
    const int descriptor = ::open(folder.empty() ? "." : folder.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC);
    if (descriptor < 0) return;  // a folder that may be used but not listed: as far as it goes
    ::fsync(descriptor);
    ::close(descriptor);
}

void makeFolder(const std::filesystem::path& given) {
    const auto folder = given.has_filename() ? given : given.parent_path();
    std::error_code error;
    if (folder.empty() || std::filesystem::is_directory(folder, error)) return;
    makeFolder(folder.parent_path());
    if (::mkdir(folder.c_str(), 0700) != 0 && errno != EEXIST)
        throw VSDatabaseFailure(
            VSErrorFromSystem(errno, "the folder " + folder.string() + " cannot be made"));
    syncFolder(folder.parent_path());
}

/// SQLite gives its other files the rights of this one.
void makeFile(const std::filesystem::path& file) {
    const int descriptor = ::open(file.c_str(), O_RDWR | O_CREAT | O_CLOEXEC, 0600);
    if (descriptor >= 0) {
        ::close(descriptor);
        syncFolder(file.parent_path());
        return;
    }
    throw VSDatabaseFailure(VSErrorFromSystem(errno, "the store " + file.string() + " cannot be made"));
}

bool fileExists(const std::filesystem::path& file) {
    std::error_code error;
    return std::filesystem::exists(file, error);
}

uintmax_t sizeOf(const std::filesystem::path& file) {
    std::error_code error;
    const uintmax_t size = std::filesystem::file_size(file, error);
    return error ? 0 : size;
}

/// An empty file is a store about to be made, but not beside a log, which SQLite would throw away, nor where
/// a store was in use before.
void refuseLostFile(const std::filesystem::path& folder) {
    const auto file = folder / VSStoreSchema::fileName;
    const uintmax_t log = sizeOf(file.string() + "-wal");
    const bool used = fileExists(folder / VSStoreSchema::noticeFileName);
    if (sizeOf(file) > 0) return;
    if (log > 0)
        refuse(VSErrorCode::Corrupt, file.string() + " is missing or empty, but its log is still there");
    if (used && fileExists(file))
        refuse(VSErrorCode::Corrupt, file.string() + " is empty, though it held a store");
}

/// 0: an empty database, which may become ours; else its schema version.
int versionOf(VSDatabase& database, const std::filesystem::path& file) {
    const int64_t identity = database.integer("PRAGMA application_id");
    const int64_t version = database.integer("PRAGMA user_version");
    // A writing transaction makes the first page; a store has one for every table.
    if (identity == 0 && version == 0 && database.integer("PRAGMA page_count") <= 1 &&
        database.integer("SELECT count(*) FROM sqlite_master") == 0)
        return 0;
    if (identity != VSStoreSchema::applicationID)
        refuse(VSErrorCode::Refused, file.string() + " is a database of another program");
    if (version > VSStoreSchema::currentVersion)
        refuse(VSErrorCode::Refused, file.string() +
                                         " was written by a newer version of this program (its format is " +
                                         std::to_string(version) + ", this program knows " +
                                         std::to_string(VSStoreSchema::currentVersion) + ")");
    if (version < 1) refuse(VSErrorCode::Corrupt, file.string() + " has no valid format number");
    return static_cast<int>(version);
}

void checkTables(VSDatabase& database, const std::filesystem::path& file) {
    auto statement = database.use("SELECT count(*) FROM sqlite_master WHERE type = 'table' AND name = ?");
    for (const char* name : tableNames) {
        statement.bindText(1, name);
        if (!statement.step() || statement.integer(0) != 1)
            refuse(VSErrorCode::Corrupt, file.string() + " lacks its table " + name);
        statement.reset();
    }
}

void createTables(VSDatabase& database, const std::filesystem::path& file) {
    // Before the first table: it is a property of the file.
    database.execute("PRAGMA auto_vacuum = INCREMENTAL");
    // In the old journal mode, so that the identity stands in the file itself from the first commit on.
    database.execute("BEGIN EXCLUSIVE");
    try {
        if (versionOf(database, file) == 0) {  // else another process was faster
            database.execute(tables);
            database.execute(
                ("PRAGMA application_id = " + std::to_string(VSStoreSchema::applicationID)).c_str());
            database.execute(
                ("PRAGMA user_version = " + std::to_string(VSStoreSchema::currentVersion)).c_str());
        }
        database.execute("COMMIT");
    } catch (const VSDatabaseFailure&) {
        try {
            database.execute("ROLLBACK");
        } catch (const VSDatabaseFailure&) {
            // The failure that brought us here is the one to tell; the connection is closed next.
        }
        throw;
    }
}

/// Opens the file and says its version. While another process brings it to a newer format nobody gets in.
std::unique_ptr<VSDatabase> openOfAnyVersion(const std::filesystem::path& file, VSDuration patience,
                                             const std::atomic<bool>* giveUp, int& version) {
    const bool migrating = VSStoreMigration::mayBeUnderWay(file);
    const auto open = [&](VSDuration most) {
        auto database = std::make_unique<VSDatabase>(file, VSDatabase::Mode::Write, most);
        database->setGiveUp(giveUp);
        version = versionOf(*database, file);
        database->setPatience(patience);
        return database;
    };
    try {
        return open(patience);
    } catch (const VSDatabaseFailure& failure) {
        if (!failure.error().isHeldByOthers || !(migrating || VSStoreMigration::mayBeUnderWay(file))) throw;
    }
    return open(std::max(patience, VSStoreMigration::patienceForOthers));
}

void configure(VSDatabase& database) {
    database.execute("PRAGMA cache_size = -16384; PRAGMA temp_store = MEMORY;");
}

void configureForWriting(VSDatabase& database, bool survivesPowerLoss) {
    // Full: a commit is on the disk before it is acknowledged.
    database.execute(survivesPowerLoss ? "PRAGMA synchronous = FULL" : "PRAGMA synchronous = NORMAL");
    database.execute("PRAGMA journal_size_limit = 67108864; PRAGMA secure_delete = ON;");
}

}  // namespace

std::unique_ptr<VSDatabase> VSStoreSchema::openForWriting(const std::filesystem::path& folder,
                                                          bool createIfMissing, bool survivesPowerLoss,
                                                          VSDuration patience,
                                                          const std::atomic<bool>* giveUp) {
    const auto file = folder / fileName;
    refuseLostFile(folder);
    if (!fileExists(file)) {
        if (!createIfMissing) refuse(VSErrorCode::NotAccessible, "there is no store in " + folder.string());
        makeFolder(folder);
        makeFile(file);
    }
    int version = 0;
    auto database = openOfAnyVersion(file, patience, giveUp, version);
    if (database->isReadOnly())
        refuse(VSErrorCode::NotAccessible, "the store " + file.string() + " cannot be written to");
    if (version == 0) {
        createTables(*database, file);
    } else if (version < currentVersion) {
        database.reset();
        VSStoreMigration::migrate(file, patience);
        database = openOfAnyVersion(file, patience, giveUp, version);
    } else {
        VSStoreMigration::clearUp(file);
    }
    checkTables(*database, file);
    if (auto mode = database->use("PRAGMA journal_mode"); !mode.step() || mode.text(0) != "wal") {
        mode.reset();
        auto change = database->use("PRAGMA journal_mode = WAL");
        if (!change.step() || change.text(0) != "wal")
            refuse(VSErrorCode::NotAccessible,
                   "the store " + file.string() + " cannot use a write-ahead log where it lies");
    }
    configure(*database);
    configureForWriting(*database, survivesPowerLoss);
    // A connection that has not used the log would not move it into the file when it closes last.
    database->integer("SELECT last FROM state");
    return database;
}

bool VSStoreSchema::canShrink(VSDatabase& database) {
    constexpr int64_t incremental = 2;
    return database.integer("PRAGMA auto_vacuum") == incremental;
}

std::unique_ptr<VSDatabase> VSStoreSchema::openForReading(const std::filesystem::path& folder,
                                                          VSDuration patience) {
    const auto file = folder / fileName;
    refuseLostFile(folder);
    if (!fileExists(file)) refuse(VSErrorCode::NotAccessible, "there is no store in " + folder.string());
    auto database = std::make_unique<VSDatabase>(file, VSDatabase::Mode::Read, patience);
    int version = 0;
    try {
        version = versionOf(*database, file);
    } catch (const VSDatabaseFailure& failure) {
        // A write-ahead log needs its index file. Where the folder cannot be written to nobody changes the
        // store: without a log the file alone is complete, with one the index can be in our memory.
        if (failure.error().code != VSErrorCode::NotAccessible || ::access(folder.c_str(), W_OK) == 0) throw;
        const bool logged = sizeOf(file.string() + "-wal") > 0;
        database = std::make_unique<VSDatabase>(
            file, logged ? VSDatabase::Mode::ReadAlone : VSDatabase::Mode::ReadImmutable, patience);
        version = versionOf(*database, file);
    }
    if (version == 0) refuse(VSErrorCode::NotAccessible, "the store in " + folder.string() + " is empty");
    if (version < currentVersion)
        refuse(VSErrorCode::Refused, file.string() +
                                         " has an older format; it gets this program's when it is next "
                                         "opened for writing (by the window or an import)");
    checkTables(*database, file);
    configure(*database);
    return database;
}
