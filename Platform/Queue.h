#pragma once

#include <functional>
#include <memory>
#include <string>

namespace platform {

/// Where blocks run. async may be called on any thread and returns at once.
class Queue {
 public:
    virtual ~Queue() = default;
    virtual void async(std::function<void()> block) = 0;
};

/// The main thread's queue: blocks run in order, from the event loop of QCoreApplication's thread.
Queue& mainQueue();
bool isMainThread();

/// Blocks run one after the other on a worker thread. Destruction waits for those already queued.
std::shared_ptr<Queue> makeSerialQueue(std::string name);
/// Blocks run side by side on the process's worker threads. Destruction waits for those already queued.
std::shared_ptr<Queue> makeConcurrentQueue(std::string name);

}  // namespace platform
