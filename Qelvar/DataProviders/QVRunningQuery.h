#pragma once

#include <memory>

#include "Vessa/VSHealthStore.h"

/// A query in the store, ended when this goes away or starts another. Main thread only.
class QVRunningQuery {
 public:
    QVRunningQuery() = default;
    ~QVRunningQuery() { stop(); }
    QVRunningQuery(const QVRunningQuery&) = delete;
    QVRunningQuery& operator=(const QVRunningQuery&) = delete;

    void start(const std::shared_ptr<VSHealthStore>& healthStore, std::shared_ptr<VSQuery> query) {
        stop();
        healthStore_ = healthStore;
        query_ = std::move(query);
        healthStore_->executeQuery(query_);
    }
    void stop() {
        if (query_) healthStore_->stopQuery(query_);
        query_.reset();
        healthStore_.reset();
    }
    bool isRunning() const { return query_ != nullptr; }

 private:
    std::shared_ptr<VSHealthStore> healthStore_;
    std::shared_ptr<VSQuery> query_;
};
