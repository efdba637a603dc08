#include <benchmark/benchmark.h>

#include <chrono>
#include <condition_variable>
#include <mutex>

#include "StoreBenchData.h"
#include "Vessa/Base/VSEnvironment.h"

namespace {

constexpr int lastYear = 2022;
constexpr int years = 6;

double secondsOf(const std::function<void()>& work) {
    const auto start = std::chrono::steady_clock::now();
    work();
    return std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count();
}

/// Six years of readings in a store and in a bare database, made once.
struct Filled {
    BenchFolder folder;
    std::shared_ptr<VSHealthStore> store;
    std::unique_ptr<BareDatabase> bare;
    double storeSeconds = 0, bareSeconds = 0;
    int64_t samples = 0;

    Filled() {
        VSEnvironment::install(
            std::make_shared<VSFixedEnvironment>(VSDate::fromSeconds(1'672'531'200), "Etc/UTC", "en_US"));
        store = benchStore(folder.path() / "store");
        bare = std::make_unique<BareDatabase>(folder.path());
        for (int year = lastYear - years + 1; year <= lastYear; ++year) {
            const auto readings = benchYear(year);
            const auto objects = benchSamples(readings);
            bareSeconds += secondsOf([&] { bare->insert(readings); });
            storeSeconds += secondsOf([&] {
                if (!store->saveObjectsAndWait(objects).ok()) std::abort();
            });
            samples += static_cast<int64_t>(readings.size());
        }
    }
};

Filled& filled() {
    static Filled instance;
    return instance;
}

const VSObjectType* heartRate() {
    return VSObjectType::dataTypeWithCode(VSCode::HeartRate);
}

/// A ratio over 1: the store is faster than the bare database.
void compare(benchmark::State& state, const std::function<void()>& ours, const std::function<void()>& bares) {
    double bareSeconds = 0;
    double best = 1e9, bareBest = 1e9;
    for (auto _ : state) {
        best = std::min(best, secondsOf(ours));
        state.PauseTiming();
        bareSeconds = secondsOf(bares);
        bareBest = std::min(bareBest, bareSeconds);
        state.ResumeTiming();
    }
    state.counters["best_ms"] = best * 1e3;
    state.counters["bare_ms"] = bareBest * 1e3;
    state.counters["ratio"] = bareBest / best;
}

void daily(benchmark::State& state, int numberOfYears) {
    Filled& data = filled();
    const VSDate from = VSDate::fromMicroseconds(benchYear(lastYear - numberOfYears + 1).front().start);
    const VSDate to = from + std::chrono::seconds(31'536'000) * numberOfYears;
    compare(
        state,
        [&] {
            const auto result = data.store->statisticsCollection(
                heartRate(), VSPredicate::samplesWithStartDate(from, to, 0),
                VSStatisticsOptionDiscreteAverage | VSStatisticsOptionDiscreteMin |
                    VSStatisticsOptionDiscreteMax,
                from, {0, 0, 1, 0, 0, 0});
            if ((*result)->statistics().size() != static_cast<size_t>(365 * numberOfYears)) std::abort();
        },
        [&] {
            if (data.bare->dailyAggregates(from.microseconds(), to.microseconds()) != 365 * numberOfYears)
                std::abort();
        });
}

void BM_DailyOverOneYear(benchmark::State& state) {
    daily(state, 1);
}
void BM_DailyOverSixYears(benchmark::State& state) {
    daily(state, years);
}

void BM_MostRecentSample(benchmark::State& state) {
    Filled& data = filled();
    compare(
        state,
        [&] {
            const auto result = data.store->samples(
                heartRate(), VSPredicate::samplesStartingBefore(VSDate::fromSeconds(1'700'000'000)), 1,
                {{VSSampleSortIdentifierEndDate, false}, {VSObjectSortIdentifierDataID, false}});
            if (result->size() != 1) std::abort();
        },
        [&] { benchmark::DoNotOptimize(data.bare->mostRecent()); });
}

/// The bulk save itself happened when the data were made.
void BM_BulkSave(benchmark::State& state) {
    Filled& data = filled();
    for (auto _ : state) benchmark::DoNotOptimize(data.samples);
    state.counters["ours_s"] = data.storeSeconds;
    state.counters["bare_s"] = data.bareSeconds;
    state.counters["ratio"] = data.bareSeconds / data.storeSeconds;
    state.counters["bytes_per_sample"] =
        static_cast<double>(std::filesystem::file_size(data.folder.path() / "store" / "vessa.sqlite")) /
        static_cast<double>(data.samples);
}

void BM_Open(benchmark::State& state) {
    Filled& data = filled();
    for (auto _ : state) benchmark::DoNotOptimize(benchStore(data.folder.path() / "store"));
}

/// From the call that saves one sample to the call of an observer's handler.
void BM_SaveToObserver(benchmark::State& state) {
    BenchFolder folder;
    const auto store = benchStore(folder.path());
    const auto reading = benchSamples({{0, 60}});
    std::mutex mutex;
    std::condition_variable condition;
    int64_t told = 0, expected = 1;
    store->executeQuery(std::make_shared<VSObserverQuery>(heartRate(), VSPredicate(), [&](const auto&) {
        std::lock_guard lock(mutex);
        ++told;
        condition.notify_all();
    }));
    const auto wait = [&] {
        std::unique_lock lock(mutex);
        condition.wait(lock, [&] { return told >= expected; });
    };
    wait();
    for (auto _ : state) {
        ++expected;
        store->saveObjects(reading, nullptr);
        wait();
    }
}

BENCHMARK(BM_BulkSave)->Iterations(1);
BENCHMARK(BM_DailyOverOneYear)->Iterations(20)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_DailyOverSixYears)->Iterations(10)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_MostRecentSample)->Iterations(200)->Unit(benchmark::kMicrosecond);
BENCHMARK(BM_Open)->Iterations(50)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_SaveToObserver)->Iterations(100)->Unit(benchmark::kMillisecond);

}  // namespace

BENCHMARK_MAIN();
