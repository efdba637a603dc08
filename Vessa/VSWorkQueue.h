#pragma once

#include <condition_variable>
#include <deque>
#include <functional>
#include <memory>
#include <mutex>
#include <thread>
#include <vector>

/// Jobs in order on a few threads of their own. Any thread.
class VSWorkQueue {
 public:
    using Job = std::function<void()>;

    VSWorkQueue() = default;
    VSWorkQueue(const VSWorkQueue&) = delete;
    VSWorkQueue& operator=(const VSWorkQueue&) = delete;

    /// The threads hold `owner` until they end, so that a job may drop the last other reference to it.
    void start(int threads, std::shared_ptr<void> owner);
    /// False after `finish`: the job is not taken.
    bool enqueue(Job job);
    /// No job waits or runs.
    bool isIdle() const;
    bool isOnThread() const;
    /// Runs what is queued and ends the threads. Called on one of them it does not wait for that one, which
    /// goes on by itself. Once.
    void finish();

 private:
    void run();

    mutable std::mutex mutex_;
    std::condition_variable condition_;
    std::deque<Job> jobs_;              // guarded by mutex_
    int running_ = 0;                   // guarded by mutex_
    bool finishing_ = false;            // guarded by mutex_
    std::vector<std::thread> threads_;  // guarded by mutex_
};
