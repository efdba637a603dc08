#include "Vessa/VSStoreCore.h"

#include <algorithm>
#include <future>

#include "Vessa/VSStoreSchema.h"

namespace {

constexpr int readingThreadCount = 3;
/// A store that is written to can be opened and read at once: whoever keeps others from that keeps all of it.
constexpr VSDuration mostPatienceToRead = std::chrono::seconds(10);
constexpr VSDuration patienceToClean = std::chrono::seconds(1);
/// For all locks together that the last writes need.
constexpr auto patienceToClose = std::chrono::seconds(5);

}  // namespace

struct VSStoreCore::Writer {
    explicit Writer(std::unique_ptr<VSDatabase> opened) : database(std::move(opened)), writer(*database) {}
    std::unique_ptr<VSDatabase> database;
    VSStoreWriter writer;
};

VSResult<std::shared_ptr<VSStoreCore>> VSStoreCore::open(const std::filesystem::path& folder,
                                                         const VSHealthStore::Options& options) {
    try {
        const VSDuration patience = std::min(options.patience, mostPatienceToRead);
        std::unique_ptr<VSDatabase> database;
        if (options.readOnly) {
            VSStoreSchema::openForReading(folder, patience);  // says now what is wrong with it
        } else {
            database = VSStoreSchema::openForWriting(folder, options.createIfMissing,
                                                     options.survivesPowerLoss, patience);
            database->setPatience(options.patience);
        }
        std::shared_ptr<VSStoreCore> core(new VSStoreCore(folder, options, std::move(database)));
        core->notifier.start(core);
        core->readingThreads.start(readingThreadCount, core);
        if (core->writer_) core->writing_.start(1, core);
        if (core->writer_ && options.quiet < VSDuration::max()) core->cleaner_.start();
        core->cleaner_.wake();  // a process that was killed may have left something
        return core;
    } catch (const VSDatabaseFailure& failure) {
        VSError error = failure.error();
        const std::string where = folder.string();
        if (error.message.find(where) == std::string::npos) error.message = where + ": " + error.message;
        return error;
    }
}

VSStoreCore::VSStoreCore(const std::filesystem::path& storeFolder, const VSHealthStore::Options& storeOptions,
                         std::unique_ptr<VSDatabase> database)
    : folder(storeFolder),
      options(storeOptions),
      access(options.applicationIdentifier, options.applicationName),
      readers(folder, std::min(options.patience, mostPatienceToRead)),
      queries(readers, readingThreads, access),
      notifier(folder, readers, options.applicationIdentifier,
               [this](const VSChangeNotifier::Changes& changes) { heard(changes); }),
      cleaner_(folder, options.quiet, [this] { return isBusy(); }) {
    if (!database) return;
    closingDeadline_ = std::chrono::steady_clock::time_point::max();
    database->setDeadline(&closingDeadline_);
    database->setLongWaitBlock(std::min(options.patience, mostPatienceToRead),
                               [this] { setWriterIsHeld(true); });
    writer_ = std::make_unique<Writer>(std::move(database));
}

VSStoreCore::~VSStoreCore() {
    // The writing connection closes last: only it can move the log into the file.
    readers.close();
}

void VSStoreCore::close() {
    queries.stopAll();
    closingDeadline_ = std::chrono::steady_clock::now() + patienceToClose;
    writing_.finish();
    cleaner_.finish();
    notifier.finish();
    readingThreads.finish();
}

void VSStoreCore::write(Change change, VSHealthStore::Completion completion) {
    if (!writer_) {
        readingThreads.enqueue([completion = std::move(completion)] {
            if (completion)
                completion(VSError{VSErrorCode::NotAccessible, "the store was opened for reading only"});
        });
        return;
    }
    writing_.enqueue([this, change = std::move(change), completion = std::move(completion)] {
        const VSStatus status = apply(change);
        if (completion) completion(status);
    });
}

VSStatus VSStoreCore::writeAndWait(Change change) {
    if (!writer_) return VSError{VSErrorCode::NotAccessible, "the store was opened for reading only"};
    if (writing_.isOnThread()) return apply(change);
    std::promise<VSStatus> promise;
    write(std::move(change), [&promise](const VSStatus& status) { promise.set_value(status); });
    return promise.get_future().get();
}

VSStatus VSStoreCore::apply(const Change& change) {
    VSStoreWriter& writer = writer_->writer;
    try {
        VSTransaction transaction(*writer_->database, VSTransaction::Kind::Write);
        setWriterIsHeld(false);
        writer.begin();
        if (VSStatus status = change(writer); !status) {
            writer.abandon();
            return status;
        }
        writer.finish();
        transaction.commit();
    } catch (const VSDatabaseFailure& failure) {
        setWriterIsHeld(false);  // the next write waits anew
        writer.abandon();
        return VSErrorNamingStore(failure.error(), folder);
    }
    committed();
    return {};
}

void VSStoreCore::committed() {
    notifier.announce();
    filesChanged();
}

void VSStoreCore::filesChanged() {
    cleaner_.wake();
}

void VSStoreCore::heard(const VSChangeNotifier::Changes& changes) {
    if (!changes.types.empty()) queries.typesChanged(changes.types);
    filesChanged();
    if (changes.defaultKeys.empty()) return;
    std::vector<std::shared_ptr<const DefaultValueHandler>> handlers;
    {
        std::lock_guard lock(observersMutex_);
        std::erase_if(observers_, [](const auto& observer) { return observer.expired(); });
        for (const auto& observer : observers_) handlers.push_back(observer.lock());
    }
    for (const auto& handler : handlers) {
        for (const std::string& key : changes.defaultKeys)
            if (handler) (*handler)(key);
    }
}

std::shared_ptr<const void> VSStoreCore::observeDefaultValues(DefaultValueHandler handler) {
    auto observer = std::make_shared<const DefaultValueHandler>(std::move(handler));
    std::lock_guard lock(observersMutex_);
    observers_.push_back(observer);
    notifier.watchDefaults();
    return observer;
}

VSStatus VSStoreCore::cleanUp() {
    if (!writer_) return VSError{VSErrorCode::NotAccessible, "the store was opened for reading only"};
    try {
        VSStoreCleaning cleaning(folder, std::min(options.patience, patienceToClean), nullptr);
        for (;;) {
            const auto outcome = cleaning.step();
            if (outcome == VSStoreCleaning::Outcome::Clean) return {};
            if (outcome == VSStoreCleaning::Outcome::Held)
                return VSError{VSErrorCode::NotAccessible, "the store's files are in use", true};
        }
    } catch (const VSDatabaseFailure& failure) {
        return VSErrorNamingStore(failure.error(), folder);
    }
}

void VSStoreCore::ask(Question question) {
    if (writing_.isIdle()) {
        readingThreads.enqueue([question = std::move(question)] { question(nullptr); });
        return;
    }
    int64_t number = 0;
    {
        std::lock_guard lock(questionsMutex_);
        if (writerIsHeld_) return refuse(std::move(question));
        number = ++lastQuestion_;
        questions_.emplace(number, std::move(question));
    }
    const bool taken = writing_.enqueue([this, number] {
        std::lock_guard lock(questionsMutex_);
        auto asked = questions_.extract(number);
        if (asked) readingThreads.enqueue([question = std::move(asked.mapped())] { question(nullptr); });
    });
    std::lock_guard lock(questionsMutex_);
    if (!taken) questions_.erase(number);
}

void VSStoreCore::refuse(Question question) {
    readingThreads.enqueue([question = std::move(question)] {
        const VSError error{VSErrorCode::NotAccessible,
                            "the store is held by another program, and a change that was asked for before "
                            "waits for it",
                            true};
        question(&error);
    });
}

void VSStoreCore::setWriterIsHeld(bool isHeld) {
    std::lock_guard lock(questionsMutex_);
    writerIsHeld_ = isHeld;
    if (!isHeld) return;
    for (auto& [number, question] : questions_) refuse(std::move(question));
    questions_.clear();
}
