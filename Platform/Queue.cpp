#include "Platform/Queue.h"

#include <pthread.h>

#include <QAbstractEventDispatcher>
#include <QCoreApplication>
#include <QEvent>
#include <QThread>
#include <QThreadPool>
#include <algorithm>
#include <condition_variable>
#include <deque>
#include <mutex>
#include <thread>
#include <utility>

namespace platform {

namespace {

using Block = std::function<void()>;

// Static objects are made on the thread that enters main().
const std::thread::id mainThreadID = std::this_thread::get_id();

// Each block has an event of its own, so that a block which runs an event loop (a dialog) does not hold up
// those behind it. Never destroyed: other threads may post to it until the process is gone.
class MainQueue final : public QObject, public Queue {
 public:
    void async(Block block) override {
        {
            std::lock_guard lock(mutex_);
            blocks_.push_back(std::move(block));
        }
        QCoreApplication::postEvent(this, new QEvent(QEvent::User));
    }
    bool event(QEvent* event) override {
        if (event->type() != QEvent::User) return QObject::event(event);
        Block block;
        bool more = false;
        {
            std::lock_guard lock(mutex_);
            if (blocks_.empty()) return true;
            block = std::move(blocks_.front());
            blocks_.pop_front();
            more = !blocks_.empty();
        }
        // A loop inside the block would sleep on the events that are posted already (GLib's does): it must
        // look again.
        if (more) QAbstractEventDispatcher::instance()->wakeUp();
        block();
        return true;
    }

 private:
    std::mutex mutex_;
    std::deque<Block> blocks_;  // guarded by mutex_
};

// Made with the other static objects, so that it belongs to the main thread whoever uses it first.
MainQueue* const theMainQueue = new MainQueue;

QThreadPool& workerPool() {
    static QThreadPool* pool = [] {
        // Blocks may wait for the disk: more threads than processors. The pool outlives all static objects;
        // queues wait for their blocks when they go.
        auto* result = new QThreadPool;
        result->setMaxThreadCount(std::max(4, QThread::idealThreadCount() + 2));
        result->setThreadPriority(QThread::InheritPriority);
        return result;
    }();
    return *pool;
}

thread_local bool isWorkerThread = false;

void runOnPool(std::function<void()> function) {
    workerPool().start([function = std::move(function)] {
        isWorkerThread = true;
        function();
    });
}

// What a queue and its running blocks share. `limit` blocks run at the same time; 0 means any number.
class WorkQueueState : public std::enable_shared_from_this<WorkQueueState> {
 public:
    WorkQueueState(std::string name, int limit) : name_(std::move(name)), limit_(limit) {}

    void async(Block block) {
        {
            std::lock_guard lock(mutex_);
            blocks_.push_back(std::move(block));
            if (limit_ > 0 && running_ >= limit_) return;
            ++running_;
        }
        runOnPool([self = shared_from_this()] { self->run(); });
    }

    // Returns when all blocks have run. Called from one of the blocks themselves (the last owner let go of
    // the queue there) it returns at once: those left still run.
    void drain() {
        if (current_ == this) return;
        std::unique_lock lock(mutex_);
        if (running_ == 0) return;
        // A waiting worker gives its place to another, or all of them could wait for a block that never gets
        // one.
        if (isWorkerThread) workerPool().releaseThread();
        idle_.wait(lock, [this] { return running_ == 0; });
        lock.unlock();
        if (isWorkerThread) workerPool().reserveThread();
    }

 private:
    void run() {
        const WorkQueueState* const outer = std::exchange(current_, this);
        // For debuggers and profilers; the kernel takes 15 characters.
        pthread_setname_np(pthread_self(), name_.substr(0, 15).c_str());
        while (true) {
            Block block;
            {
                std::lock_guard lock(mutex_);
                if (blocks_.empty()) break;
                block = std::move(blocks_.front());
                blocks_.pop_front();
            }
            block();
            block = nullptr;  // what it holds goes before the queue counts as idle
            if (limit_ == 0) break;
        }
        current_ = outer;
        std::lock_guard lock(mutex_);
        // A block that came in between the last look and here found the place taken.
        if (limit_ > 0 && !blocks_.empty()) {
            runOnPool([self = shared_from_this()] { self->run(); });
            return;
        }
        if (--running_ == 0) idle_.notify_all();
    }

    static thread_local const WorkQueueState* current_;  // the queue whose block this thread runs

    const std::string name_;
    const int limit_;
    std::mutex mutex_;
    std::condition_variable idle_;
    std::deque<Block> blocks_;  // guarded by mutex_
    int running_ = 0;           // guarded by mutex_
};

thread_local const WorkQueueState* WorkQueueState::current_ = nullptr;

class WorkQueue final : public Queue {
 public:
    WorkQueue(std::string name, int limit)
        : state_(std::make_shared<WorkQueueState>(std::move(name), limit)) {}
    ~WorkQueue() override { state_->drain(); }
    void async(Block block) override { state_->async(std::move(block)); }

 private:
    std::shared_ptr<WorkQueueState> state_;
};

}  // namespace

Queue& mainQueue() {
    return *theMainQueue;
}

bool isMainThread() {
    return std::this_thread::get_id() == mainThreadID;
}

std::shared_ptr<Queue> makeSerialQueue(std::string name) {
    return std::make_shared<WorkQueue>(std::move(name), 1);
}

std::shared_ptr<Queue> makeConcurrentQueue(std::string name) {
    return std::make_shared<WorkQueue>(std::move(name), 0);
}

}  // namespace platform
