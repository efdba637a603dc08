#pragma once

#include <atomic>
#include <filesystem>
#include <memory>

#include "Vessa/VSChangeNotifier.h"
#include "Vessa/VSHealthStore.h"
#include "Vessa/VSQueryRunner.h"
#include "Vessa/VSReaderPool.h"
#include "Vessa/VSStoreWriter.h"
#include "Vessa/VSWorkQueue.h"

/// The threads and connections behind a store: one writer with the only connection that writes (imports
/// aside, which bring their own), three readers, one notifier. Lives until the last of its threads has ended.
/// Any thread.
class VSStoreCore : public std::enable_shared_from_this<VSStoreCore> {
 public:
    static VSResult<std::shared_ptr<VSStoreCore>> open(const std::filesystem::path& folder,
                                                       const VSHealthStore::Options& options);
    ~VSStoreCore();

    /// Ends queries, writes what was accepted, ends the threads. Once; on a thread of the core it does not
    /// wait for that one.
    void close();

    using Change = std::function<VSStatus(VSStoreWriter&)>;
    /// A transaction on the writer's thread, rolled back when the change fails; then the completion there.
    void write(Change change, VSHealthStore::Completion completion);
    VSStatus writeAndWait(Change change);
    /// A question, and its answer's handler on a reading thread, after the writes that were accepted before
    /// it.
    template <typename Block, typename Handler>
    void readLater(Block block, Handler handler) {
        auto ask = [this, block = std::move(block), handler = std::move(handler)] {
            const auto answer = readers.read(block);
            if (handler) handler(answer);
        };
        if (writing_.isIdle())
            readingThreads.enqueue(std::move(ask));
        else
            writing_.enqueue([this, ask = std::move(ask)] { readingThreads.enqueue(ask); });
    }
    /// Tells the queries of all processes.
    void committed() { notifier.announce(); }

    const std::filesystem::path folder;
    const VSHealthStore::Options options;
    VSReaderPool readers;
    VSWorkQueue readingThreads;
    VSQueryRunner queries;
    VSChangeNotifier notifier;

 private:
    struct Writer;
    VSStoreCore(const std::filesystem::path& storeFolder, const VSHealthStore::Options& storeOptions,
                std::unique_ptr<VSDatabase> database);
    VSStatus apply(const Change& change);

    VSWorkQueue writing_;
    std::atomic<bool> closing_ = false;
    std::unique_ptr<Writer> writer_;  // of the writer's thread; null when opened for reading
};
