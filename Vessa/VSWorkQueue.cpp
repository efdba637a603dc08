#include "Vessa/VSWorkQueue.h"

void VSWorkQueue::start(int threads, std::shared_ptr<void> owner) {
    std::lock_guard lock(mutex_);
    for (int index = 0; index < threads; ++index) {
        threads_.emplace_back([this, keep = owner]() mutable {
            run();
            keep.reset();  // may end the life of this queue
        });
    }
}

bool VSWorkQueue::enqueue(Job job) {
    {
        std::lock_guard lock(mutex_);
        if (finishing_) return false;
        jobs_.push_back(std::move(job));
    }
    condition_.notify_one();
    return true;
}

bool VSWorkQueue::isIdle() const {
    std::lock_guard lock(mutex_);
    return jobs_.empty() && running_ == 0;
}

bool VSWorkQueue::isOnThread() const {
    std::lock_guard lock(mutex_);
    for (const std::thread& thread : threads_) {
        if (thread.get_id() == std::this_thread::get_id()) return true;
    }
    return false;
}

void VSWorkQueue::run() {
    std::unique_lock lock(mutex_);
    for (;;) {
        condition_.wait(lock, [this] { return finishing_ || !jobs_.empty(); });
        if (jobs_.empty()) return;
        Job job = std::move(jobs_.front());
        jobs_.pop_front();
        ++running_;
        lock.unlock();
        job();
        job = nullptr;  // what it holds must go before it counts as done
        lock.lock();
        --running_;
    }
}

void VSWorkQueue::finish() {
    std::vector<std::thread> threads;
    {
        std::lock_guard lock(mutex_);
        finishing_ = true;
        threads.swap(threads_);
    }
    condition_.notify_all();
    for (std::thread& thread : threads) {
        if (thread.get_id() == std::this_thread::get_id())
            thread.detach();
        else
            thread.join();
    }
}
