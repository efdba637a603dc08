#include "Vessa/VSQueryRunner.h"

#include <algorithm>

#include "Vessa/Base/VSLog.h"
#include "Vessa/VSStatisticsEngine.h"

struct VSQueryRunner::Running {
    explicit Running(std::shared_ptr<VSQuery> executed) : query(std::move(executed)) {}

    const std::shared_ptr<VSQuery> query;
    const VSCalendar calendar = VSCalendar::current();

    // Guarded by the runner's mutex_:
    bool stopped = false;
    bool queued = false;
    bool busy = false;
    int64_t told = 0;      // the newest change of its type that was heard of
    int64_t answered = 0;  // the newest change that its last answer knew

    // Of the job that runs, one at a time:
    bool live = false;  // lives on after its first answer
    bool first = true;
    int64_t snapshot = 0;  // the newest change that the answer under way knows
    VSQueryAnchor anchor;
};

void VSQueryRunner::execute(std::shared_ptr<VSQuery> query) {
    auto running = std::make_shared<Running>(std::move(query));
    if (const auto* anchored = dynamic_cast<const VSAnchoredObjectQuery*>(running->query.get())) {
        running->anchor = anchored->anchor;
        running->live = static_cast<bool>(anchored->updateHandler);
    } else if (const auto* collection =
                   dynamic_cast<const VSStatisticsCollectionQuery*>(running->query.get())) {
        running->live = static_cast<bool>(collection->statisticsUpdateHandler);
    } else {
        running->live = dynamic_cast<const VSObserverQuery*>(running->query.get()) != nullptr;
    }
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
        const int type = VSTypeCodeValue(query->type()->code());
        const auto change =
            std::find_if(changes.begin(), changes.end(), [type](const auto& c) { return c.type == type; });
        if (change == changes.end()) continue;
        running->told = std::max(running->told, change->number);
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
    const Delivery deliver = answer(*running);
    {
        std::lock_guard lock(mutex_);
        running->busy = !running->stopped;
        if (running->stopped) return;
    }
    if (deliver) deliver();
    running->first = false;
    RunningPtr ended;
    std::lock_guard lock(mutex_);
    running->busy = false;
    running->answered = std::max(running->answered, running->snapshot);
    if (running->stopped) return;
    if (!running->live) {
        const auto found = running_.find(running->query.get());
        if (found != running_.end()) {
            ended = std::move(found->second);
            running_.erase(found);
        }
    } else if (running->told > std::max(running->answered, heard)) {
        // After a failed read only a newer change brings it back: an error that lasts must not go round and
        // round.
        schedule(running);
    }
}

/// Reads in one snapshot and notes how new it is.
template <typename Block>
auto VSQueryRunner::read(Running& running, Block block) {
    return readers_.read([&](VSStoreReader& reader) {
        running.snapshot = reader.lastChange(running.query->type());
        return block(reader);
    });
}

VSQueryRunner::Delivery VSQueryRunner::answer(Running& running) {
    const VSQuery* query = running.query.get();
    if (const auto* samples = dynamic_cast<const VSSampleQuery*>(query))
        return answerSamples(running, *samples);
    if (const auto* observer = dynamic_cast<const VSObserverQuery*>(query))
        return answerObserver(running, *observer);
    if (const auto* anchored = dynamic_cast<const VSAnchoredObjectQuery*>(query))
        return answerChanges(running, *anchored);
    if (const auto* statistics = dynamic_cast<const VSStatisticsQuery*>(query))
        return answerStatistics(running, *statistics);
    if (const auto* collection = dynamic_cast<const VSStatisticsCollectionQuery*>(query))
        return answerCollection(running, *collection);
    if (const auto* sources = dynamic_cast<const VSSourceQuery*>(query))
        return answerSources(running, *sources);
    VSLog(VSLogLevel::Error, "A query of an unknown kind was executed.");
    return {};
}

VSQueryRunner::Delivery VSQueryRunner::answerSamples(Running& running, const VSSampleQuery& query) {
    return [&query, result = read(running, [&](VSStoreReader& reader) {
                        return reader.samples(query.type(), query.predicate(), query.limit, query.sort);
                    })] {
        if (query.handler) query.handler(result);
    };
}

VSQueryRunner::Delivery VSQueryRunner::answerObserver(Running& running, const VSObserverQuery& query) {
    const auto result = read(running, [](VSStoreReader&) { return true; });
    std::optional<VSError> error;
    if (!result) error = result.error();
    return [&query, error] {
        if (query.updateHandler) query.updateHandler(error);
    };
}

VSQueryRunner::Delivery VSQueryRunner::answerChanges(Running& running, const VSAnchoredObjectQuery& query) {
    const bool first = running.first;
    auto result = read(running, [&](VSStoreReader& reader) {
        return reader.changes(query.type(), query.predicate(), running.anchor,
                              first ? query.limit : VSObjectQueryNoLimit);
    });
    if (result) running.anchor = result->anchor;
    if (!first && result && result->added.empty() && result->deleted.empty())
        return {};  // changes that the predicate leaves out
    return [&query, first, result = std::move(result)] {
        const auto& handler = first ? query.initialResultsHandler : query.updateHandler;
        if (handler) handler(result);
    };
}

VSQueryRunner::Delivery VSQueryRunner::answerStatistics(Running& running, const VSStatisticsQuery& query) {
    return
        [&query,
         result = read(running, [&](VSStoreReader& reader) {
             return VSStatisticsEngine(reader, query.type(), query.predicate(), query.options).statistics();
         })] {
            if (query.completionHandler) query.completionHandler(result);
        };
}

VSQueryRunner::Delivery VSQueryRunner::answerCollection(Running& running,
                                                        const VSStatisticsCollectionQuery& query) {
    auto result = read(running, [&](VSStoreReader& reader) -> std::shared_ptr<const VSStatisticsCollection> {
        auto buckets = VSStatisticsEngine(reader, query.type(), query.predicate(), query.options)
                           .buckets(query.anchorDate, query.interval, running.calendar);
        return std::make_shared<VSStatisticsCollection>(query.type(), query.anchorDate, query.interval,
                                                        running.calendar, std::move(buckets));
    });
    return [&query, first = running.first, result = std::move(result)] {
        const auto& handler = first ? query.initialResultsHandler : query.statisticsUpdateHandler;
        if (handler) handler(result);
    };
}

VSQueryRunner::Delivery VSQueryRunner::answerSources(Running& running, const VSSourceQuery& query) {
    return [&query, result = read(running, [&](VSStoreReader& reader) {
                        return reader.sources(query.type(), query.predicate());
                    })] {
        if (query.completionHandler) query.completionHandler(result);
    };
}
