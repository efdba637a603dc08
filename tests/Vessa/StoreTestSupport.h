#pragma once

#include <gtest/gtest.h>

#include <condition_variable>
#include <cstdlib>
#include <memory>
#include <mutex>
#include <string>
#include <vector>

#include "TestSupport.h"
#include "Vessa/VSHealthStore.h"

namespace test {

/// QELVAR_LONG_TESTS in the environment: every case there is, instead of a selection.
inline bool longTests() {
    return std::getenv("QELVAR_LONG_TESTS") != nullptr;
}

inline const VSObjectType* type(VSTypeCode code) {
    return VSObjectType::dataTypeWithCode(code);
}
inline const VSObjectType* heartRate() {
    return type(VSCode::HeartRate);
}
inline const VSObjectType* steps() {
    return type(VSCode::StepCount);
}

inline VSProvenance from(const std::string& sourceName, const std::string& version = "") {
    VSProvenance provenance;
    provenance.sourceRevision =
        std::make_shared<VSSourceRevision>(VSSourceRevision{VSSource::forImportedName(sourceName), version});
    return provenance;
}

inline VSSamplePtr quantity(const VSObjectType* type, double value, VSDate start, VSDate end,
                            VSProvenance provenance = {}) {
    return std::make_shared<VSQuantitySample>(type, VSQuantity(type->canonicalUnit(), value), start, end,
                                              std::move(provenance));
}
inline VSSamplePtr quantity(const VSObjectType* type, double value, const std::string& start,
                            const std::string& end, VSProvenance provenance = {}) {
    return quantity(type, value, date(start), date(end), std::move(provenance));
}

/// Without waiting for the disk at each save, which is most of the time of a test.
inline std::shared_ptr<VSHealthStore> openStore(const std::filesystem::path& folder,
                                                VSHealthStore::Options options = {}) {
    options.survivesPowerLoss = false;
    auto store = VSHealthStore::open(folder, options);
    if (!store) {
        ADD_FAILURE() << store.error().message;
        return nullptr;
    }
    return *store;
}

inline std::vector<VSSamplePtr> allSamples(VSHealthStore& store, const VSObjectType* type) {
    auto samples = store.samples(type, {}, VSObjectQueryNoLimit, {});
    if (!samples) {
        ADD_FAILURE() << samples.error().message;
        return {};
    }
    return *samples;
}

inline void expectSound(VSHealthStore& store) {
    const auto report = store.check();
    ASSERT_TRUE(report.ok()) << report.error().message;
    for (const std::string& problem : report->problems) ADD_FAILURE() << problem;
}

/// Runs an operation that ends in a completion, and waits for it.
template <typename Start>
VSStatus wait(Start start) {
    auto promise = std::make_shared<Promise<VSStatus>>();
    start([promise](const VSStatus& status) { promise->set(status); });
    auto status = promise->wait();
    if (!status) return VSError{VSErrorCode::Failed, "no completion came"};
    return *status;
}

#define EXPECT_OK(expression)                                   \
    do {                                                        \
        const VSStatus okStatus = (expression);                 \
        EXPECT_TRUE(okStatus.ok()) << okStatus.error().message; \
    } while (false)

/// What handlers were told, in order; a test waits for the n-th.
template <typename T>
class Log {
 public:
    void add(T entry) {
        std::lock_guard lock(mutex_);
        entries_.push_back(std::move(entry));
        condition_.notify_all();
    }
    /// Waits, at most a minute, until there are so many.
    bool waitFor(size_t count) {
        std::unique_lock lock(mutex_);
        return condition_.wait_for(lock, std::chrono::minutes(1), [&] { return entries_.size() >= count; });
    }
    std::vector<T> entries() const {
        std::lock_guard lock(mutex_);
        return entries_;
    }

 private:
    mutable std::mutex mutex_;
    std::condition_variable condition_;
    std::vector<T> entries_;
};

}  // namespace test
