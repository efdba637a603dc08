#pragma once

#include <sqlite3.h>

#include <filesystem>
#include <memory>
#include <string>
#include <vector>

#include "Vessa/VSHealthStore.h"

/// A year of a wrist's heart rate: a reading every 72 seconds, 438,000 in all, in UTC days.
struct BenchReading {
    int64_t start;
    double value;
};
std::vector<BenchReading> benchYear(int year);
std::vector<VSSamplePtr> benchSamples(const std::vector<BenchReading>& readings);

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
    void insert(const std::vector<BenchReading>& readings);
    /// Average, minimum and maximum per UTC day; returns the number of days.
    int dailyAggregates(int64_t from, int64_t to);
    double mostRecent();

 private:
    void execute(const char* sql);
    sqlite3* handle_ = nullptr;
    int64_t last_ = 0;
};

std::shared_ptr<VSHealthStore> benchStore(const std::filesystem::path& folder);
