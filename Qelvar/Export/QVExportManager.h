#pragma once

#include <atomic>
#include <functional>
#include <memory>
#include <mutex>
#include <optional>
#include <semaphore>
#include <thread>
#include <vector>

#include "Qelvar/Export/QVClinicalDocument.h"
#include "Qelvar/Export/QVExportFiles.h"
#include "Qelvar/Export/QVExportUnits.h"
#include "Qelvar/Export/QVRecordsDocument.h"
#include "Vessa/VSHealthStore.h"
#include "Vessa/VSStoreSnapshot.h"
#include "Vessa/VSWorkQueue.h"

/// What an export takes from its surroundings: the window's controller manager, or the command line.
struct QVExportSetting {
    std::shared_ptr<VSHealthStore> healthStore;
    std::filesystem::path documentsPath;
    QVExportNames names;
    /// The person's units. Asked at the start of each export, by the thread that starts it; may be empty.
    std::function<QVExportUnits()> preferredUnits;
    /// That of documentsPath, where it was made for this export; null: the export makes and keeps it.
    std::shared_ptr<const VSWorkFolder> folder = nullptr;
};

struct QVExportProgress {
    const VSObjectType* type = nullptr;        // that is being written; null: none yet, or all are
    int64_t records = 0, recordsTotal = 0;     // written; a correlation is one
    uint64_t bytesPacked = 0, bytesTotal = 0;  // of the documents; 0 until they are packed
    /// Of the whole work, 0 to 1.
    double fraction() const;
};

/// Makes one archive of all records: the records document and the clinical document, of one moment of the
/// store, whatever is saved meanwhile. One export at a time.
///
/// A worker thread walks through the types and reads their samples page by page; a serial queue writes them
/// into both documents; then the worker packs these. Whatever fails ends the export with its error, and no
/// file is left.
class QVExportManager {
 public:
    explicit QVExportManager(QVExportSetting setting);
    /// Cancels an export that is under way, waits for its end and removes the files. Not for a completion.
    ~QVExportManager();
    QVExportManager(const QVExportManager&) = delete;
    QVExportManager& operator=(const QVExportManager&) = delete;

    /// The archive, which is there until cleanupExportFiles(); or why there is none. Called on the worker.
    using Completion = std::function<void(const VSResult<std::filesystem::path>&)>;
    /// Starts an export; while one is in progress nothing happens and the completion is never called.
    void createExportFile(Completion completion);
    /// The export ends soon, with Cancelled.
    void cancelCurrentExport();
    /// Removes the documents and the archive. Nothing where there are none.
    void cleanupExportFiles();

    bool exportInProgress() const { return exportInProgress_; }
    bool exportFailed() const { return exportFailed_; }
    /// Any thread.
    QVExportProgress progress() const;
    const QVExportPaths& paths() const { return paths_; }
    /// How many records of each type there are, by the type's name. Of the last export; not while one is in
    /// progress.
    std::vector<std::pair<std::string, int64_t>> exportedCounts() const;

 private:
    using Types = std::vector<const VSObjectType*>;

    // The pass, on the worker:
    void run(const Completion& completion);
    VSResult<std::filesystem::path> exportAll();
    VSStatus createFiles();
    VSStatus takeSnapshot();
    void openDocuments();
    void writePerson();
    void writeAllTypes();
    void writeQuantityType(const VSObjectType* type);
    void writeCategoryType(const VSObjectType* type);
    void writeCorrelationType(const VSObjectType* type);
    void writeWorkoutType();
    void completeAndCloseStreamingXML();
    VSStatus archiveExportDirectory();

    // The writing of a type, on the queue:
    void beginQuantityType(const VSObjectType* type, const VSSample* first);
    void writeDataForQuantityType(const VSObjectType* type, const std::vector<VSSamplePtr>& samples);
    void endQuantityType(const VSObjectType* type, bool hasSamples);

    static void getAllDataTypesOfClass(VSTypeKind kind, Types& types);
    static void getAllDataTypesOfCategory(QVClinicalSection category, Types& types);

    using WritePage = std::function<void(const std::vector<VSSamplePtr>&)>;
    /// Has all samples of a type written, page by page, and waits until they are.
    void writeType(const VSObjectType* type, VSStoreSnapshot::Order order, const WritePage& writePage,
                   const std::function<void()>& atEnd = {});
    void fail(VSError error);
    template <typename T>
    T readPerson(VSResult<T> result, const char* what);

    const QVExportSetting setting_;
    const QVExportPaths paths_;
    VSWorkQueue queue_;
    std::thread worker_;

    // Of the export in progress; of its worker and, between two types, of the queue:
    QVExportUnits units_;
    std::unique_ptr<VSStoreSnapshot> snapshot_;
    std::map<const VSObjectType*, VSStoreSnapshot::Extent> extents_;
    std::unique_ptr<QVRecordsDocument> writer_;
    std::unique_ptr<QVClinicalDocument> writerCDA_;
    std::unique_ptr<std::counting_semaphore<>> sem_;    // signalled when a type is written
    std::unique_ptr<std::counting_semaphore<>> pages_;  // how many more may wait for the queue
    Types resultsTypes_, vitalsTypes_;

    std::atomic<bool> exportInProgress_ = false;
    std::atomic<bool> exportFailed_ = false;
    std::atomic<const VSObjectType*> type_ = nullptr;
    std::atomic<int64_t> records_ = 0, recordsTotal_ = 0;
    std::atomic<uint64_t> bytesPacked_ = 0, bytesTotal_ = 0;

    mutable std::mutex mutex_;
    std::optional<VSError> error_;        // the first of the export; guarded by mutex_
    std::optional<QVExportFiles> files_;  // guarded by mutex_
};
