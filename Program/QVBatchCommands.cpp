#include <unistd.h>

#include <charconv>
#include <cstdio>
#include <future>

#include "Program/QVCommand.h"
#include "Program/QVTabOutput.h"
#include "Vessa/VSStoreMigration.h"

namespace {

constexpr auto kSilentPatience = std::chrono::milliseconds(500);

QVExitStatus finish(QVTabOutput& output) {
    const VSStatus status = output.finish();
    return status ? QVExitStatus::Success : QVFail(status.error());
}

QVExitStatus runBatches(const QVCommandContext& context) {
    if (!context.arguments.words().empty()) return QVFailUsage("batches", "batches takes no words");
    auto store = QVOpenStoreForReading(context.storeFolder);
    if (!store) return QVFail(store.error());
    const auto batches = (*store)->batches();
    if (!batches) return QVFail(batches.error());
    QVTabOutput output;
    output.row({"batch", "date", "name", "added", "present"});
    for (const VSBatch& batch : *batches) {
        output.row({std::to_string(batch.id), output.date(batch.date), batch.name,
                    std::to_string(batch.added), std::to_string(batch.present)});
    }
    return finish(output);
}

/// Has no limit to its patience: what holds the store lives and works, and a signal ends the wait.
VSResult<VSUndoReport> undoWaiting(VSHealthStore& store, int64_t batch) {
    auto undone = std::async(std::launch::async, [&store, batch] { return store.undoBatch(batch); });
    QVWaitingLine line;
    while (undone.wait_for(kSilentPatience) == std::future_status::timeout) {
        const auto holder = VSReadStoreHolder(store.folder());
        // Without a note it may be this undoing itself that takes its time to end.
        if (holder && holder->process != getpid()) line.show(holder);
    }
    return undone.get();
}

QVExitStatus runUndo(const QVCommandContext& context) {
    const auto& words = context.arguments.words();
    if (words.size() != 1) return QVFailUsage("undo", "undo needs the number of one batch");
    int64_t batch = 0;
    const char* const end = words[0].data() + words[0].size();
    const auto [stopped, error] = std::from_chars(words[0].data(), end, batch);
    if (error != std::errc{} || stopped != end)
        return QVFailUsage("undo", words[0] + " is not the number of a batch; `qelvar batches` lists them");
    std::error_code ignored;
    if (!std::filesystem::exists(context.storeFolder, ignored))
        return QVFail({VSErrorCode::NotFound, "there is no store in " + context.storeFolder.string()});
    VSHealthStore::Options options;
    options.createIfMissing = false;
    options.quiet = VSDuration::max();  // at the end, not in between
    options.patience = VSDuration::max();
    auto store = VSHealthStore::open(context.storeFolder, options);
    if (!store) return QVFail(store.error());
    const auto report = undoWaiting(**store, batch);
    if (!report) return QVFail(report.error());
    QVTabOutput output;
    output.row({"removed", "kept", "gone", "characteristics"});
    output.row({std::to_string(report->removed), std::to_string(report->kept), std::to_string(report->gone),
                std::to_string(report->characteristics)});
    const QVExitStatus status = finish(output);
    // Where others read or write just now, a program that has the store open does it when they are through.
    (void)(*store)->cleanUp();
    for (const auto& copy : VSStoreMigration::keptCopies(context.storeFolder))
        std::fprintf(
            stderr,
            "qelvar: %s is the store as it was before its format changed, and still holds what it held "
            "then; delete the file when you need it no more\n",
            copy.c_str());
    return status;
}

}  // namespace

const QVCommand QVBatchesCommand{"batches",
                                 "list the imports",
                                 R"(Usage: qelvar batches

Standard output: batch (its number), date, name (of the files), added (how many objects the import added; the
values of a blood pressure count beside it), present (how many of them the store still has); a row for each
import that was not undone, oldest first.
)",
                                 {},
                                 runBatches};

const QVCommand QVUndoCommand{"undo",
                              "take an import back",
                              R"(Usage: qelvar undo BATCH

Takes back what an import did; `qelvar batches` lists the imports by number. What it added is removed, except
what another import had in its documents too. What was entered by hand stays. Characteristics that it set and
that have not been changed since are not set again, unless another import told them too. It is done at once,
without a question, and as a whole; importing the same documents again brings everything back. What was
removed is overwritten on the disk and its space given back. While another program writes to the store, it
waits and says for whom; Ctrl+C ends it.

Standard output: removed, kept (for another import), gone (what had been deleted before), characteristics.
)",
                              {},
                              runUndo};
