#pragma once

#include <condition_variable>
#include <cstdint>
#include <deque>
#include <memory>
#include <mutex>
#include <optional>
#include <string>
#include <utility>
#include <variant>
#include <vector>

#include "Vessa/VSHealthStore.h"

/// What a document says of the person.
struct QVImportPerson {
    std::optional<VSBirthDate> birthDate;
    int biologicalSex = 0, bloodType = 0, skinType = 0;  // 0: not set
    std::optional<VSMedicalIDData> medicalID;
};

/// A top-level record that was understood, and where it stands.
struct QVImportItem {
    std::variant<VSQuantitySample, VSCategorySample, VSCorrelation, VSWorkout> sample;
    int64_t line = 0;
    std::unique_ptr<const VSImportRelations> relations;  // null: none

    const VSSample& get() const {
        return std::visit([](const auto& kind) -> const VSSample& { return kind; }, sample);
    }
};

/// Some consecutive records of one document.
struct QVImportBatch {
    static constexpr size_t kSize = 1024;
    std::shared_ptr<const std::string> document;
    std::vector<QVImportItem> items;
    std::optional<QVImportPerson> person;
};

/// Batches on their way from the reading thread to the one that drives the store. Any thread.
class QVImportQueue {
 public:
    /// Waits while the queue is full. False when it was closed: nobody will take it.
    bool push(QVImportBatch batch) {
        std::unique_lock lock(mutex_);
        changed_.wait(lock, [this] { return closed_ || batches_.size() < kCapacity; });
        if (closed_) return false;
        batches_.push_back(std::move(batch));
        changed_.notify_all();
        return true;
    }
    /// Waits for the next batch, at most `patience`. None: nothing came, or there will be no more (see
    /// isDrained).
    std::optional<QVImportBatch> pop(VSDuration patience) {
        std::unique_lock lock(mutex_);
        changed_.wait_for(lock, patience, [this] { return closed_ || !batches_.empty(); });
        if (batches_.empty()) return std::nullopt;
        std::optional<QVImportBatch> batch(std::move(batches_.front()));
        batches_.pop_front();
        changed_.notify_all();
        return batch;
    }
    /// No more batches are taken in; those in the queue can still be popped.
    void close() {
        std::lock_guard lock(mutex_);
        closed_ = true;
        changed_.notify_all();
    }
    bool isDrained() const {
        std::lock_guard lock(mutex_);
        return closed_ && batches_.empty();
    }

 private:
    static constexpr size_t kCapacity = 8;

    mutable std::mutex mutex_;
    std::condition_variable changed_;
    std::deque<QVImportBatch> batches_;  // guarded by mutex_
    bool closed_ = false;                // guarded by mutex_
};
