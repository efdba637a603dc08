#include "Vessa/VSStoreCore.h"

#include <future>

#include "Vessa/VSStoreSchema.h"

namespace {

constexpr int readingThreadCount = 3;
constexpr VSDuration patienceToOpen = std::chrono::seconds(10);
/// A save waits for an import of another process.
constexpr VSDuration patienceToWrite = std::chrono::minutes(2);

}  // namespace

struct VSStoreCore::Writer {
    explicit Writer(std::unique_ptr<VSDatabase> opened) : database(std::move(opened)), writer(*database) {}
    std::unique_ptr<VSDatabase> database;
    VSStoreWriter writer;
};

VSResult<std::shared_ptr<VSStoreCore>> VSStoreCore::open(const std::filesystem::path& folder,
                                                         const VSHealthStore::Options& options) {
    try {
        std::unique_ptr<VSDatabase> database;
        if (options.readOnly) {
            VSStoreSchema::openForReading(folder, patienceToOpen);  // says now what is wrong with it
        } else {
            database = VSStoreSchema::openForWriting(folder, options.createIfMissing,
                                                     options.survivesPowerLoss, patienceToOpen);
            database->setPatience(patienceToWrite);
        }
        std::shared_ptr<VSStoreCore> core(new VSStoreCore(folder, options, std::move(database)));
        core->notifier.start(core);
        core->readingThreads.start(readingThreadCount, core);
        if (core->writer_) core->writing_.start(1, core);
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
      readers(folder),
      queries(readers, readingThreads),
      notifier(folder, readers, [this](const auto& changes) { queries.typesChanged(changes); }) {
    if (!database) return;
    database->setHurry(&closing_);
    writer_ = std::make_unique<Writer>(std::move(database));
}

VSStoreCore::~VSStoreCore() {
    // The writing connection closes last: only it can move the log into the file.
    readers.close();
}

void VSStoreCore::close() {
    queries.stopAll();
    closing_ = true;
    writing_.finish();
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
        writer.begin();
        if (VSStatus status = change(writer); !status) {
            writer.abandon();
            return status;
        }
        writer.finish();
        transaction.commit();
    } catch (const VSDatabaseFailure& failure) {
        writer.abandon();
        return failure.error();
    }
    committed();
    return {};
}
