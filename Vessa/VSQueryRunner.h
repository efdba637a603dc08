#pragma once

#include <map>
#include <memory>
#include <mutex>

#include "Vessa/VSChangeNotifier.h"
#include "Vessa/VSQuery.h"
#include "Vessa/VSReaderPool.h"
#include "Vessa/VSStoreAuthorizations.h"
#include "Vessa/VSWorkQueue.h"

/// The executing queries of a store: has them answered on the reading threads, again after changes of their
/// type, and calls their handlers there, one call of one query at a time. Any thread.
class VSQueryRunner {
 public:
    /// References to what outlives it.
    VSQueryRunner(VSReaderPool& readers, VSWorkQueue& threads, const VSStoreAccess& access)
        : readers_(readers), threads_(threads), access_(access) {}

    void execute(std::shared_ptr<VSQuery> query);
    void stop(const VSQuery* query);
    void stopAll();
    void typesChanged(const std::vector<VSChangeNotifier::Change>& changes);

 private:
    struct Running;
    using RunningPtr = std::shared_ptr<Running>;

    void schedule(const RunningPtr& running);  // REQUIRES: mutex_ is held
    void run(const RunningPtr& running);
    /// After an answer: ends the query, or has it answer again where that is due. Returns what ended.
    RunningPtr conclude(const RunningPtr& running, int64_t heard, int64_t answered, bool goesOn);

    VSReaderPool& readers_;
    VSWorkQueue& threads_;
    const VSStoreAccess& access_;
    std::mutex mutex_;
    std::map<const VSQuery*, RunningPtr> running_;  // guarded by mutex_
    bool closed_ = false;                           // guarded by mutex_
};
