#pragma once

#include <sqlite3.h>

#include <filesystem>
#include <functional>
#include <memory>
#include <string>
#include <vector>

#include "Vessa/VSHealthStore.h"

/// A reading of heart rate, or of a span of steps.
struct BenchReading {
    int64_t start;
    int64_t duration;
    double value;
};
/// A year of a wrist's heart rate: a reading every 72 seconds, 438,000 in all, in UTC days.
std::vector<BenchReading> benchYear(int year);
/// A year of steps in spans of five minutes without a gap, 105,120 in all, as the n-th source counts them.
std::vector<BenchReading> benchStepsYear(int year, int source);
std::vector<VSSamplePtr> benchSamples(const std::vector<BenchReading>& readings,
                                      VSTypeCode type = VSCode::HeartRate,
                                      const std::string& source = "Wrist tracker");

/// A folder that is removed at the end.
class BenchFolder {
 public:
    BenchFolder();
    ~BenchFolder();
    const std::filesystem::path& path() const { return path_; }

 private:
    std::filesystem::path path_;
};

/// SQLite without us: the same rows in the same table and indexes, the same settings, nothing else.
class BareDatabase {
 public:
    explicit BareDatabase(const std::filesystem::path& folder);
    ~BareDatabase();
    /// One transaction.
    void insert(const std::vector<BenchReading>& readings, VSTypeCode type = VSCode::HeartRate,
                int provenance = 1);
    /// Average, minimum and maximum per UTC day, from an index that covers them; returns the number of days.
    int dailyAggregates(int64_t from, int64_t to);
    /// The sum per UTC day, of all sources together: what counts twice where two of them measured the same.
    int dailySums(int64_t from, int64_t to);
    double mostRecent();

 private:
    void execute(const char* sql);
    int countRows(const char* sql, int64_t from, int64_t to);
    sqlite3* handle_ = nullptr;
    int64_t last_ = 0;
};

/// Opens the folder's store, or makes it.
std::shared_ptr<VSHealthStore> benchStore(const std::filesystem::path& folder);
void benchSave(VSHealthStore& store, const std::vector<VSSamplePtr>& samples);
double secondsOf(const std::function<void()>& work);
[[noreturn]] void benchStop(const char* what);
