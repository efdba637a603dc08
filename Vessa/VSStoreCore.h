#pragma once

#include <cstdint>
#include <filesystem>
#include <functional>
#include <map>
#include <memory>
#include <mutex>

#include "Vessa/VSChangeNotifier.h"
#include "Vessa/VSHealthStore.h"
#include "Vessa/VSQueryRunner.h"
#include "Vessa/VSReaderPool.h"
#include "Vessa/VSStoreAuthorizations.h"
#include "Vessa/VSStoreCleaning.h"
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
    /// it. While one of these has waited for other programs as long as a reader would, the answer is
    /// NotAccessible: what is committed is not what the asker asked for, and may be written back.
    template <typename Block, typename Handler>
    void readLater(Block block, Handler handler) {
        ask([this, block = std::move(block), handler = std::move(handler)](const VSError* refusal) {
            using Answer = decltype(readers.read(block));
            const Answer answer = refusal ? Answer(*refusal) : readers.read(block);
            if (handler) handler(answer);
        });
    }
    /// Tells the queries of all processes.
    void committed();
    /// The files may hold what is to be cleaned away, here or through another process.
    void filesChanged();
    /// Cleans the files now, as far as others let it. On the calling thread.
    VSStatus cleanUp();

    using DefaultValueHandler = std::function<void(const std::string& key)>;
    std::shared_ptr<const void> observeDefaultValues(DefaultValueHandler handler);

    const std::filesystem::path folder;
    const VSHealthStore::Options options;
    const VSStoreAccess access;  // of the options' application
    VSReaderPool readers;
    VSWorkQueue readingThreads;
    VSQueryRunner queries;
    VSChangeNotifier notifier;

 private:
    struct Writer;
    VSStoreCore(const std::filesystem::path& storeFolder, const VSHealthStore::Options& storeOptions,
                std::unique_ptr<VSDatabase> database);
    VSStatus apply(const Change& change);
    void heard(const VSChangeNotifier::Changes& changes);
    /// Answers, or hands on the error that is given. On a reading thread.
    using Question = std::function<void(const VSError* refusal)>;
    void ask(Question question);
    void refuse(Question question);
    /// Of the writer's thread: whether it has waited too long for others.
    void setWriterIsHeld(bool isHeld);

    bool isBusy() const { return !writing_.isIdle() || !readingThreads.isIdle(); }

    VSWorkQueue writing_;
    VSDatabase::Deadline closingDeadline_;
    std::mutex questionsMutex_;
    std::map<int64_t, Question> questions_;  // that follow writes; guarded by questionsMutex_
    int64_t lastQuestion_ = 0;               // guarded by questionsMutex_
    bool writerIsHeld_ = false;              // guarded by questionsMutex_
    std::mutex observersMutex_;
    std::vector<std::weak_ptr<const DefaultValueHandler>> observers_;  // guarded by observersMutex_
    std::unique_ptr<Writer> writer_;  // of the writer's thread; null when opened for reading
    VSStoreCleaner cleaner_;          // idle when opened for reading
};
