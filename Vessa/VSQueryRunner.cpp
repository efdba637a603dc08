#include "Vessa/VSQueryRunner.h"

#include <algorithm>

#include "Vessa/Base/VSLog.h"
#include "Vessa/VSQueryAnswerer.h"

struct VSQueryRunner::Running {
    explicit Running(std::shared_ptr<VSQuery> executed)
        : query(std::move(executed)), answerer(query->answerer()), live(answerer->isLive()) {}

    const std::shared_ptr<VSQuery> query;
    const VSCalendar calendar = VSCalendar::current();
    const std::unique_ptr<VSQueryAnswerer> answerer;  // of the job that runs, one at a time
    const bool live;

    // Guarded by the runner's mutex_:
    bool stopped = false;
    bool queued = false;
    bool busy = false;
    int64_t told = 0;      // the newest change that was heard of
    int64_t answered = 0;  // the newest change that its last answer knew
};

void VSQueryRunner::execute(std::shared_ptr<VSQuery> query) {
    auto running = std::make_shared<Running>(std::move(query));
    std::lock_guard lock(mutex_);
    if (closed_) return;
    const auto [place, isNew] = running_.emplace(running->query.get(), running);
    if (!isNew) {
        VSLog(VSLogLevel::Error,
              "A query that is executing was executed again; the second call does nothing.");
        return;
    }
    schedule(running);
}

void VSQueryRunner::schedule(const RunningPtr& running) {
    if (running->queued || running->busy) return;
    running->queued = threads_.enqueue([this, running] { run(running); });
}

void VSQueryRunner::stop(const VSQuery* query) {
    RunningPtr ended;  // dropped after the lock: handlers may hold anything
    std::lock_guard lock(mutex_);
    const auto found = running_.find(query);
    if (found == running_.end()) return;
    found->second->stopped = true;
    ended = std::move(found->second);
    running_.erase(found);
}

void VSQueryRunner::stopAll() {
    std::map<const VSQuery*, RunningPtr> ended;
    std::lock_guard lock(mutex_);
    closed_ = true;
    for (auto& [query, running] : running_) running->stopped = true;
    ended.swap(running_);
}

void VSQueryRunner::typesChanged(const std::vector<VSChangeNotifier::Change>& changes) {
    std::lock_guard lock(mutex_);
    for (const auto& [query, running] : running_) {
        for (const auto& change : changes) {
            if (query->type() && VSTypeCodeValue(query->type()->code()) != change.type) continue;
            running->told = std::max(running->told, change.number);
        }
        if (running->live && running->told > running->answered) schedule(running);
    }
}

void VSQueryRunner::run(const RunningPtr& running) {
    int64_t heard = 0;  // what it knew of when it began
    {
        std::lock_guard lock(mutex_);
        running->queued = false;
        if (running->stopped) return;
        running->busy = true;
        heard = running->told;
    }
    VSQueryLook look(readers_, access_, running->calendar);
    const auto deliver = running->answerer->answer(look);
    {
        std::lock_guard lock(mutex_);
        running->busy = !running->stopped;
        if (running->stopped) return;
    }
    if (deliver) deliver();
    const RunningPtr ended = conclude(running, heard, look.lastChange(), look.goesOn());
}

VSQueryRunner::RunningPtr VSQueryRunner::conclude(const RunningPtr& running, int64_t heard, int64_t answered,
                                                  bool goesOn) {
    std::lock_guard lock(mutex_);
    running->busy = false;
    running->answered = std::max(running->answered, answered);
    if (running->stopped) return nullptr;
    if (!running->live) {
        const auto found = running_.find(running->query.get());
        if (found == running_.end()) return nullptr;
        RunningPtr ended = std::move(found->second);
        running_.erase(found);
        return ended;
    }
    // After a failed read only a newer change brings it back: an error that lasts must not go round and
    // round.
    if (goesOn || running->told > std::max(running->answered, heard)) schedule(running);
    return nullptr;
}
