#pragma once

#include <atomic>
#include <filesystem>
#include <functional>
#include <memory>
#include <vector>

#include "Qelvar/Import/QVImportReport.h"
#include "Vessa/Base/VSError.h"
#include "Vessa/VSHealthStore.h"
#include "Vessa/VSStoreHolder.h"

struct QVImportProgress {
    uint64_t bytesDone = 0;               // of the files as they lie on disk
    uint64_t bytesTotal = 0;              // 0: not known (a pipe)
    int64_t records = 0;                  // records handed to the store so far
    bool isWaiting = false;               // for another program that writes to the store
    std::optional<VSStoreHolder> holder;  // while it waits: that program, where it is known
};

struct QVImportOptions {
    /// Called on the importing thread, a few times a second at most and once at the end; while it waits, each
    /// second.
    std::function<void(const QVImportProgress&)> progress;
    /// Set by anyone (also a signal handler) to give up; may be null. REQUIRES: it outlives the import.
    const std::atomic<bool>* cancel = nullptr;
    /// How many refusals the report lists in full.
    size_t listedRefusals = 20;
    /// Everything as in an import, and then nothing of it is kept.
    bool dryRun = false;
};

/// Reads records documents (.xml) and archives that hold them (.zip) into a store.
///
/// The documents are read as a stream: memory does not grow with their length. A second thread reads and
/// checks while the calling one hands the records to the store, all in one transaction: whatever ends an
/// import early leaves no trace of it. What is in the store already is not added again; a document's
/// identical records are all kept. While another program writes to the store an import waits for it, as long
/// as it takes.
///
/// A record that cannot be understood is refused alone and reported. A document that is damaged (not
/// well-formed, not a records document, with entities or an external declaration) is refused as a whole, and
/// with it the import.
class QVRecordsImporter {
 public:
    explicit QVRecordsImporter(std::shared_ptr<VSHealthStore> store) : store_(std::move(store)) {}

    /// Waits; call it on a worker thread. NotFound: no such file. Invalid: a file that is refused as a whole
    /// (the message names it, the line and the reason). Cancelled: the flag was set. Others are the store's.
    VSResult<QVImportReport> importFiles(const std::vector<std::filesystem::path>& files,
                                         const QVImportOptions& options = {});

 private:
    const std::shared_ptr<VSHealthStore> store_;
};
