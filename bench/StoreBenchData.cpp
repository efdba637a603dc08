#include "StoreBenchData.h"

#include <stdlib.h>

#include <cstdio>
#include <cstdlib>
#include <random>

namespace {

[[noreturn]] void stop(const char* what) {
    std::fprintf(stderr, "%s\n", what);
    std::exit(1);
}

}  // namespace

std::vector<BenchReading> benchYear(int year) {
    std::mt19937 random(static_cast<unsigned>(year));
    std::vector<BenchReading> readings;
    const auto* type = VSObjectType::dataTypeWithCode(VSCode::HeartRate);
    if (!type) stop("there is no heart rate");
    const int64_t start = (int64_t{year} - 1970) * 31'536'000;
    for (int64_t second = 0; second < 31'536'000; second += 72) {
        readings.push_back({(start + second) * 1'000'000, static_cast<double>(50 + random() % 100)});
    }
    return readings;
}

std::vector<VSSamplePtr> benchSamples(const std::vector<BenchReading>& readings) {
    const auto* type = VSObjectType::dataTypeWithCode(VSCode::HeartRate);
    VSProvenance provenance;
    provenance.sourceRevision =
        std::make_shared<VSSourceRevision>(VSSourceRevision{VSSource::forImportedName("Wrist tracker"), "1"});
    std::vector<VSSamplePtr> samples;
    samples.reserve(readings.size());
    for (const BenchReading& reading : readings) {
        const VSDate start = VSDate::fromMicroseconds(reading.start);
        provenance.creationDate = start;
        samples.push_back(std::make_shared<VSQuantitySample>(
            type, VSQuantity(type->canonicalUnit(), reading.value), start, start, provenance));
    }
    return samples;
}

BenchFolder::BenchFolder() {
    std::string pattern = (std::filesystem::temp_directory_path() / "vessa-bench-XXXXXX").string();
    if (!mkdtemp(pattern.data())) stop("no temporary folder");
    path_ = pattern;
}

BenchFolder::~BenchFolder() {
    std::error_code ignored;
    std::filesystem::remove_all(path_, ignored);
}

BareDatabase::BareDatabase(const std::filesystem::path& folder) {
    if (sqlite3_open((folder / "bare.sqlite").c_str(), &handle_)) stop("no bare database");
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
    if (sqlite3_exec(handle_, sql, nullptr, nullptr, nullptr)) stop(sqlite3_errmsg(handle_));
}

void BareDatabase::insert(const std::vector<BenchReading>& readings) {
    sqlite3_stmt* statement = nullptr;
    if (sqlite3_prepare_v2(handle_, "INSERT INTO samples VALUES (5, ?, ?, 0, ?, 1, 0, NULL)", -1, &statement,
                           nullptr))
        stop(sqlite3_errmsg(handle_));
    execute("BEGIN");
    for (const BenchReading& reading : readings) {
        sqlite3_bind_int64(statement, 1, reading.start);
        sqlite3_bind_int64(statement, 2, ++last_);
        sqlite3_bind_int64(statement, 3, static_cast<int64_t>(reading.value));
        if (sqlite3_step(statement) != SQLITE_DONE) stop(sqlite3_errmsg(handle_));
        sqlite3_reset(statement);
    }
    sqlite3_finalize(statement);
    execute("COMMIT");
}

int BareDatabase::dailyAggregates(int64_t from, int64_t to) {
    sqlite3_stmt* statement = nullptr;
    const char* sql =
        "SELECT start / 86400000000, avg(value), min(value), max(value) FROM samples WHERE type = 5 AND "
        "start >= ? AND start < ? GROUP BY 1";
    if (sqlite3_prepare_v2(handle_, sql, -1, &statement, nullptr)) stop(sqlite3_errmsg(handle_));
    sqlite3_bind_int64(statement, 1, from);
    sqlite3_bind_int64(statement, 2, to);
    int days = 0;
    while (sqlite3_step(statement) == SQLITE_ROW) ++days;
    sqlite3_finalize(statement);
    return days;
}

double BareDatabase::mostRecent() {
    sqlite3_stmt* statement = nullptr;
    const char* sql = "SELECT value FROM samples WHERE type = 5 ORDER BY start DESC, id DESC LIMIT 1";
    if (sqlite3_prepare_v2(handle_, sql, -1, &statement, nullptr)) stop(sqlite3_errmsg(handle_));
    const double value = sqlite3_step(statement) == SQLITE_ROW ? sqlite3_column_double(statement, 0) : 0;
    sqlite3_finalize(statement);
    return value;
}

std::shared_ptr<VSHealthStore> benchStore(const std::filesystem::path& folder) {
    auto store = VSHealthStore::open(folder);
    if (!store) stop(store.error().message.c_str());
    return *store;
}
