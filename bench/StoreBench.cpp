#include <benchmark/benchmark.h>
#include <fcntl.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

#include <condition_variable>
#include <mutex>

#include "StoreBenchData.h"
#include "Vessa/Base/VSEnvironment.h"

namespace {

constexpr int lastYear = 2022;
constexpr int years = 6;
constexpr int64_t microsecondsPerYear = 31'536'000'000'000;

void fixEnvironment() {
    VSEnvironment::install(
        std::make_shared<VSFixedEnvironment>(VSDate::fromSeconds(1'672'531'200), "Etc/UTC", "en_US"));
}

const VSObjectType* heartRate() {
    return VSObjectType::dataTypeWithCode(VSCode::HeartRate);
}

struct Range {
    VSDate from, to;
};
Range lastYears(double count) {
    const VSDate to = VSDate::fromMicroseconds((lastYear + 1 - 1970) * microsecondsPerYear);
    const int64_t length = static_cast<int64_t>(count * 365) * 86'400'000'000;
    return {VSDate::fromMicroseconds(to.microseconds() - length), to};
}

/// Six and a half years of heart rate (2.8 million readings) in a store and in a bare database.
struct SixYears {
    BenchFolder folder;
    std::shared_ptr<VSHealthStore> store = benchStore(folder.path() / "store");
    BareDatabase bare{folder.path()};

    SixYears() {
        for (int year = lastYear - years; year <= lastYear; ++year) {
            auto readings = benchYear(year);
            if (year == lastYear - years) readings.erase(readings.begin(), readings.begin() + 219'000);
            bare.insert(readings);
            benchSave(*store, benchSamples(readings));
        }
    }
};
SixYears& sixYears() {
    static SixYears instance;
    return instance;
}

/// A store with the last year of heart rate and other records, so many in all.
struct Sized {
    BenchFolder folder;
    std::shared_ptr<VSHealthStore> store = benchStore(folder.path() / "store");

    explicit Sized(int64_t samples) {
        int64_t left = samples;
        const auto save = [&](std::vector<BenchReading> readings, VSTypeCode type, const char* source) {
            readings.resize(std::min(readings.size(), static_cast<size_t>(std::max<int64_t>(left, 0))));
            left -= static_cast<int64_t>(readings.size());
            benchSave(*store, benchSamples(readings, type, source));
        };
        for (int year = lastYear; left > 0; --year) {
            save(benchYear(year), VSCode::HeartRate, "Wrist tracker");
            save(benchYear(year), VSCode::ActiveEnergyBurned, "Wrist tracker");
            save(benchStepsYear(year, 0), VSCode::StepCount, "Wrist tracker");
            save(benchStepsYear(year, 1), VSCode::StepCount, "Phone");
            save(benchStepsYear(year, 1), VSCode::DistanceWalkingRunning, "Phone");
        }
    }
};
Sized& small() {
    static Sized instance(500'000);
    return instance;
}
Sized& large() {
    static Sized instance(10'000'000);
    return instance;
}

/// A year of steps of two sources that overlap everywhere.
struct TwoSources {
    BenchFolder folder;
    std::shared_ptr<VSHealthStore> store = benchStore(folder.path() / "store");
    BareDatabase bare{folder.path()};

    TwoSources() {
        for (int source : {0, 1}) {
            const auto readings = benchStepsYear(lastYear, source);
            bare.insert(readings, VSCode::StepCount, source + 1);
            benchSave(*store, benchSamples(readings, VSCode::StepCount, source ? "Phone" : "Wrist tracker"));
        }
    }
};
TwoSources& twoSources() {
    static TwoSources instance;
    return instance;
}

/// Runs both in turn. The best time of each counts: other programs of the machine only ever add to it. A
/// ratio over 1: the store is faster than what it is held against.
void compare(benchmark::State& state, const std::function<void()>& ours, const std::function<void()>& bares) {
    double best = 1e9, bareBest = 1e9;
    for (auto _ : state) {
        best = std::min(best, secondsOf(ours));
        state.PauseTiming();
        bareBest = std::min(bareBest, secondsOf(bares));
        state.ResumeTiming();
    }
    state.counters["best_ms"] = best * 1e3;
    state.counters["bare_ms"] = bareBest * 1e3;
    state.counters["ratio"] = bareBest / best;
}

void dailyStatistics(VSHealthStore& store, const VSObjectType* type, int options, Range range) {
    const auto result =
        store.statisticsCollection(type, VSPredicate::samplesWithStartDate(range.from, range.to, 0), options,
                                   range.from, {0, 0, 1, 0, 0, 0});
    const auto days = (range.to - range.from).count() / 86'400'000'000;
    if (!result || (*result)->statistics().size() != static_cast<size_t>(days)) benchStop("days are missing");
}

constexpr int averageMinimumMaximum =
    VSStatisticsOptionDiscreteAverage | VSStatisticsOptionDiscreteMin | VSStatisticsOptionDiscreteMax;

void daily(benchmark::State& state, double numberOfYears) {
    SixYears& data = sixYears();
    const Range range = lastYears(numberOfYears);
    compare(
        state, [&] { dailyStatistics(*data.store, heartRate(), averageMinimumMaximum, range); },
        [&] {
            const auto days = (range.to - range.from).count() / 86'400'000'000;
            if (data.bare.dailyAggregates(range.from.microseconds(), range.to.microseconds()) != days)
                benchStop("days are missing");
        });
}
void BM_DailyOverOneYear(benchmark::State& state) {
    daily(state, 1);
}
void BM_DailyOverSixAndAHalfYears(benchmark::State& state) {
    daily(state, 6.5);
}

/// `ratio`: the time in a store of 500,000 samples over the time in one of ten million.
void BM_YearInALargeStore(benchmark::State& state) {
    compare(
        state, [] { dailyStatistics(*large().store, heartRate(), averageMinimumMaximum, lastYears(1)); },
        [] { dailyStatistics(*small().store, heartRate(), averageMinimumMaximum, lastYears(1)); });
}

/// The bare database sums both sources, without seeing that they measured the same.
void BM_TwoSourcesSumOverOneYear(benchmark::State& state) {
    TwoSources& data = twoSources();
    const Range range = lastYears(1);
    compare(
        state,
        [&] {
            dailyStatistics(*data.store, VSObjectType::dataTypeWithCode(VSCode::StepCount),
                            VSStatisticsOptionCumulativeSum, range);
        },
        [&] {
            if (data.bare.dailySums(range.from.microseconds(), range.to.microseconds()) != 365)
                benchStop("days are missing");
        });
}

/// One sample more in a day that two sources fill, against one row more.
void BM_SaveOneWhereTwoSourcesMeet(benchmark::State& state) {
    TwoSources& data = twoSources();
    BenchReading reading = benchStepsYear(lastYear, 0)[50'000];
    const auto sample = benchSamples({reading}, VSCode::StepCount);
    compare(
        state, [&] { benchSave(*data.store, sample); },
        [&] { data.bare.insert({reading}, VSCode::StepCount); });
}

void BM_MostRecentSample(benchmark::State& state) {
    SixYears& data = sixYears();
    compare(
        state,
        [&] {
            const auto result = data.store->samples(
                heartRate(), VSPredicate::samplesStartingBefore(VSDate::fromSeconds(1'700'000'000)), 1,
                {{VSSampleSortIdentifierEndDate, false}, {VSObjectSortIdentifierDataID, false}});
            if (result->size() != 1) benchStop("no sample");
        },
        [&] { benchmark::DoNotOptimize(data.bare.mostRecent()); });
}

/// A million readings in one save, and the space that they take.
void BM_BulkSave(benchmark::State& state) {
    std::vector<BenchReading> readings;
    for (int year = lastYear - 2; year <= lastYear; ++year) {
        const auto more = benchYear(year);
        readings.insert(readings.end(), more.begin(), more.end());
    }
    readings.resize(1'000'000);
    const auto samples = benchSamples(readings);
    std::vector<std::unique_ptr<BenchFolder>> folders;
    const auto folder = [&] { return folders.emplace_back(std::make_unique<BenchFolder>())->path(); };
    compare(
        state, [&] { benchSave(*benchStore(folder()), samples); },
        [&] { BareDatabase(folder()).insert(readings); });
    const auto bytes = [&](size_t index, const char* name) {
        return static_cast<double>(std::filesystem::file_size(folders[index]->path() / name)) /
               static_cast<double>(readings.size());
    };
    state.counters["bytes_per_sample"] = bytes(0, "vessa.sqlite");
    state.counters["bare_bytes"] = bytes(1, "bare.sqlite");
}

void BM_OpenALargeStore(benchmark::State& state) {
    const auto path = large().folder.path() / "store";
    compare(
        state, [&] { benchmark::DoNotOptimize(benchStore(path)); },
        [&] {
            sqlite3* handle = nullptr;
            if (sqlite3_open((path / "vessa.sqlite").c_str(), &handle) ||
                sqlite3_exec(handle, "SELECT count(*) FROM sqlite_master", nullptr, nullptr, nullptr))
                benchStop("no database");
            sqlite3_close(handle);
        });
}

/// Counts what an observer is told.
class Observer {
 public:
    explicit Observer(VSHealthStore& store) {
        store.executeQuery(std::make_shared<VSObserverQuery>(heartRate(), VSPredicate(), [this](const auto&) {
            std::lock_guard lock(mutex_);
            ++told_;
            condition_.notify_all();
        }));
        waitForOneMore();
    }
    void waitForOneMore() {
        std::unique_lock lock(mutex_);
        ++expected_;
        condition_.wait(lock, [this] { return told_ >= expected_; });
    }

 private:
    std::mutex mutex_;
    std::condition_variable condition_;
    int64_t told_ = 0, expected_ = 0;
};

/// From the call that saves one sample to the call of an observer's handler; against a bare commit.
void BM_SaveToObserver(benchmark::State& state) {
    BenchFolder folder;
    const auto store = benchStore(folder.path() / "store");
    BareDatabase bare(folder.path());
    const BenchReading reading{0, 0, 60};
    const auto sample = benchSamples({reading});
    Observer observer(*store);
    compare(
        state,
        [&] {
            store->saveObjects(sample, nullptr);
            observer.waitForOneMore();
        },
        [&] { bare.insert({reading}); });
}

/// Another process that saves a sample whenever it reads a byte.
class OtherProcess {
 public:
    explicit OtherProcess(const std::filesystem::path& store) {
        int ends[2];
        if (pipe2(ends, O_CLOEXEC)) benchStop("no pipe");
        posix_spawn_file_actions_t actions;
        posix_spawn_file_actions_init(&actions);
        posix_spawn_file_actions_adddup2(&actions, ends[0], 0);
        std::string option = "--save-into=" + store.string(), name = "StoreBench";
        char* const arguments[] = {name.data(), option.data(), nullptr};
        if (posix_spawn(&child_, "/proc/self/exe", &actions, nullptr, arguments, environ))
            benchStop("no other process");
        posix_spawn_file_actions_destroy(&actions);
        ::close(ends[0]);
        pipe_ = ends[1];
    }
    ~OtherProcess() {
        ::close(pipe_);
        waitpid(child_, nullptr, 0);
    }
    void save() const {
        if (::write(pipe_, "s", 1) != 1) benchStop("the other process is gone");
    }
    static int main(const std::filesystem::path& folder) {
        const auto store = benchStore(folder);
        const auto sample = benchSamples({{0, 0, 60}});
        for (char byte; ::read(0, &byte, 1) == 1;) benchSave(*store, sample);
        return 0;
    }

 private:
    pid_t child_ = 0;
    int pipe_ = -1;
};

void BM_SaveInAnotherProcessToObserver(benchmark::State& state) {
    BenchFolder folder;
    const auto store = benchStore(folder.path() / "store");
    BareDatabase bare(folder.path());
    Observer observer(*store);
    const OtherProcess other(folder.path() / "store");
    double worst = 0;
    other.save();  // it has opened the store when this is heard of
    observer.waitForOneMore();
    compare(
        state,
        [&] {
            worst = std::max(worst, secondsOf([&] {
                                 other.save();
                                 observer.waitForOneMore();
                             }));
        },
        [&] {
            bare.insert({{0, 0, 60}});
        });
    state.counters["worst_ms"] = worst * 1e3;
}

BENCHMARK(BM_BulkSave)->Iterations(3)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_DailyOverOneYear)->Iterations(30)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_DailyOverSixAndAHalfYears)->Iterations(15)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_MostRecentSample)->Iterations(300)->Unit(benchmark::kMicrosecond);
BENCHMARK(BM_TwoSourcesSumOverOneYear)->Iterations(30)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_SaveOneWhereTwoSourcesMeet)->Iterations(100)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_SaveToObserver)->Iterations(100)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_SaveInAnotherProcessToObserver)->Iterations(100)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_YearInALargeStore)->Iterations(30)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_OpenALargeStore)->Iterations(50)->Unit(benchmark::kMillisecond);

}  // namespace

int main(int argc, char** argv) {
    fixEnvironment();
    const std::string_view saveInto = "--save-into=";
    if (argc == 2 && std::string_view(argv[1]).starts_with(saveInto))
        return OtherProcess::main(argv[1] + saveInto.size());
    benchmark::Initialize(&argc, argv);
    if (benchmark::ReportUnrecognizedArguments(argc, argv)) return 1;
    benchmark::RunSpecifiedBenchmarks();
    return 0;
}
