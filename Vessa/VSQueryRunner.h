#pragma once

#include <map>
#include <memory>
#include <mutex>

#include "Vessa/Base/VSCalendar.h"
#include "Vessa/VSChangeNotifier.h"
#include "Vessa/VSQuery.h"
#include "Vessa/VSReaderPool.h"
#include "Vessa/VSWorkQueue.h"

/// The executing queries of a store: answers them on the reading threads, again after changes of their type,
/// and calls their handlers there, one call of one query at a time. Any thread.
class VSQueryRunner {
 public:
    VSQueryRunner(VSReaderPool& readers, VSWorkQueue& threads) : readers_(readers), threads_(threads) {}

    void execute(std::shared_ptr<VSQuery> query);
    void stop(const VSQuery* query);
    void stopAll();
    void typesChanged(const std::vector<VSChangeNotifier::Change>& changes);

 private:
    struct Running;
    using RunningPtr = std::shared_ptr<Running>;
    /// Calls the handler with the answer.
    using Delivery = std::function<void()>;

    void schedule(const RunningPtr& running);  // REQUIRES: mutex_ is held
    void run(const RunningPtr& running);
    Delivery answer(Running& running);
    Delivery answerSamples(Running& running, const VSSampleQuery& query);
    Delivery answerObserver(Running& running, const VSObserverQuery& query);
    Delivery answerChanges(Running& running, const VSAnchoredObjectQuery& query);
    Delivery answerStatistics(Running& running, const VSStatisticsQuery& query);
    Delivery answerCollection(Running& running, const VSStatisticsCollectionQuery& query);
    Delivery answerSources(Running& running, const VSSourceQuery& query);
    template <typename Block>
    auto read(Running& running, Block block);

    VSReaderPool& readers_;
    VSWorkQueue& threads_;
    std::mutex mutex_;
    std::map<const VSQuery*, RunningPtr> running_;  // guarded by mutex_
    bool closed_ = false;                           // guarded by mutex_
};
