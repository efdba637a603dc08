#include "StoreBenchData.h"

#include <stdlib.h>

#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <random>

namespace {

constexpr int64_t secondsPerYear = 31'536'000;  // of 365 days

int64_t startOfYear(int year) {
    return (int64_t{year} - 1970) * secondsPerYear;
}

}  // namespace

void benchStop(const char* what) {
    std::fprintf(stderr, "%s\n", what);
    std::exit(1);
}

double secondsOf(const std::function<void()>& work) {
    const auto start = std::chrono::steady_clock::now();
    work();
    return std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count();
}

std::vector<BenchReading> benchYear(int year) {
    std::mt19937 random(static_cast<unsigned>(year));
    std::vector<BenchReading> readings;
    for (int64_t second = 0; second < secondsPerYear; second += 72) {
        readings.push_back(
            {(startOfYear(year) + second) * 1'000'000, 0, static_cast<double>(50 + random() % 100)});
    }
    return readings;
}

std::vector<BenchReading> benchStepsYear(int year, int source) {
    std::mt19937 random(static_cast<unsigned>(year + source));
    std::vector<BenchReading> readings;
    // Each source begins its spans at its own seconds, as devices do.
    for (int64_t second = 37 * source; second + 300 <= secondsPerYear; second += 300) {
        readings.push_back(
            {(startOfYear(year) + second) * 1'000'000, 300'000'000, static_cast<double>(random() % 500)});
    }
    return readings;
}

std::vector<VSSamplePtr> benchSamples(const std::vector<BenchReading>& readings, VSTypeCode code,
                                      const std::string& source) {
    const auto* type = VSObjectType::dataTypeWithCode(code);
    if (!type) benchStop("there is no such type");
    VSProvenance provenance;
    provenance.sourceRevision =
        std::make_shared<VSSourceRevision>(VSSourceRevision{VSSource::forImportedName(source), "1"});
    std::vector<VSSamplePtr> samples;
    samples.reserve(readings.size());
    for (const BenchReading& reading : readings) {
        const VSDate start = VSDate::fromMicroseconds(reading.start);
        provenance.creationDate = start;
        samples.push_back(std::make_shared<VSQuantitySample>(
            type, VSQuantity(type->canonicalUnit(), reading.value), start,
            VSDate::fromMicroseconds(reading.start + reading.duration), provenance));
    }
    return samples;
}

BenchFolder::BenchFolder() {
    std::string pattern = (std::filesystem::temp_directory_path() / "vessa-bench-XXXXXX").string();
    if (!mkdtemp(pattern.data())) benchStop("no temporary folder");
    path_ = pattern;
}

BenchFolder::~BenchFolder() {
    std::error_code ignored;
    std::filesystem::remove_all(path_, ignored);
}

BareDatabase::BareDatabase(const std::filesystem::path& folder) {
    if (sqlite3_open((folder / "bare.sqlite").c_str(), &handle_)) benchStop("no bare database");
    execute(
        "PRAGMA journal_mode = WAL; PRAGMA synchronous = FULL; PRAGMA cache_size = -16384;"
        "CREATE TABLE samples(type INTEGER NOT NULL, start INTEGER NOT NULL, id INTEGER NOT NULL, duration "
        "INTEGER NOT NULL, value,"
        " provenance INTEGER NOT NULL, created INTEGER NOT NULL, metadata INTEGER, PRIMARY KEY (type, start, "
        "id)) WITHOUT ROWID;"
        "CREATE INDEX samples_by_id ON samples(type, id);"
        "CREATE INDEX samples_long ON samples(type, start) WHERE duration > 172800000000;");
}

BareDatabase::~BareDatabase() {
    sqlite3_close(handle_);
}

void BareDatabase::execute(const char* sql) {
    if (sqlite3_exec(handle_, sql, nullptr, nullptr, nullptr)) benchStop(sqlite3_errmsg(handle_));
}

void BareDatabase::insert(const std::vector<BenchReading>& readings, VSTypeCode type, int provenance) {
    sqlite3_stmt* statement = nullptr;
    if (sqlite3_prepare_v2(handle_, "INSERT INTO samples VALUES (?, ?, ?, ?, ?, ?, 0, NULL)", -1, &statement,
                           nullptr))
        benchStop(sqlite3_errmsg(handle_));
    execute("BEGIN IMMEDIATE");
    for (const BenchReading& reading : readings) {
        sqlite3_bind_int(statement, 1, VSTypeCodeValue(type));
        sqlite3_bind_int64(statement, 2, reading.start);
        sqlite3_bind_int64(statement, 3, ++last_);
        sqlite3_bind_int64(statement, 4, reading.duration);
        sqlite3_bind_int64(statement, 5, static_cast<int64_t>(reading.value));
        sqlite3_bind_int(statement, 6, provenance);
        if (sqlite3_step(statement) != SQLITE_DONE) benchStop(sqlite3_errmsg(handle_));
        sqlite3_reset(statement);
    }
    sqlite3_finalize(statement);
    execute("COMMIT");
}

int BareDatabase::countRows(const char* sql, int64_t from, int64_t to) {
    sqlite3_stmt* statement = nullptr;
    if (sqlite3_prepare_v2(handle_, sql, -1, &statement, nullptr)) benchStop(sqlite3_errmsg(handle_));
    sqlite3_bind_int64(statement, 1, from);
    sqlite3_bind_int64(statement, 2, to);
    int rows = 0;
    while (sqlite3_step(statement) == SQLITE_ROW) ++rows;
    sqlite3_finalize(statement);
    return rows;
}

int BareDatabase::dailyAggregates(int64_t from, int64_t to) {
    // The table itself is ordered by type and start and holds the values: an index that covers all.
    return countRows(
        "SELECT start / 86400000000, avg(value), min(value), max(value) FROM samples WHERE type = 5 AND "
        "start >= ? AND start < ? GROUP BY 1",
        from, to);
}

int BareDatabase::dailySums(int64_t from, int64_t to) {
    return countRows(
        "SELECT start / 86400000000, sum(value) FROM samples WHERE type = 7 AND start >= ? AND start < ? "
        "GROUP BY 1",
        from, to);
}

double BareDatabase::mostRecent() {
    sqlite3_stmt* statement = nullptr;
    const char* sql = "SELECT value FROM samples WHERE type = 5 ORDER BY start DESC, id DESC LIMIT 1";
    if (sqlite3_prepare_v2(handle_, sql, -1, &statement, nullptr)) benchStop(sqlite3_errmsg(handle_));
    const double value = sqlite3_step(statement) == SQLITE_ROW ? sqlite3_column_double(statement, 0) : 0;
    sqlite3_finalize(statement);
    return value;
}

std::shared_ptr<VSHealthStore> benchStore(const std::filesystem::path& folder) {
    auto store = VSHealthStore::open(folder);
    if (!store) benchStop(store.error().message.c_str());
    return *store;
}

void benchSave(VSHealthStore& store, const std::vector<VSSamplePtr>& samples) {
    if (const VSStatus status = store.saveObjectsAndWait(samples); !status)
        benchStop(status.error().message.c_str());
}
