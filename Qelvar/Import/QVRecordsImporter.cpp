#include "Qelvar/Import/QVRecordsImporter.h"

#include <algorithm>
#include <thread>

#include "Qelvar/Import/QVImportBatch.h"
#include "Qelvar/Import/QVImportFile.h"
#include "Qelvar/Import/QVRecordsBuilder.h"
#include "Qelvar/Import/QVRecordsReader.h"

namespace {

using std::chrono::milliseconds;
constexpr auto kProgressInterval = milliseconds(100);
constexpr VSDuration kSilentPatience = milliseconds(500);  // for another writer, before it is told
constexpr VSDuration kToldPatience = milliseconds(1000);   // before it is told again
constexpr VSDuration kPopPatience = milliseconds(100);
constexpr size_t kListedNotes = 100;

bool isSet(const std::atomic<bool>* flag) {
    return flag && flag->load(std::memory_order_relaxed);
}

VSError cancelled() {
    return VSError{VSErrorCode::Cancelled, "the import was cancelled; nothing of it is kept"};
}

/// The reading half: runs through the files on a thread of its own and fills the queue.
class Reading {
 public:
    Reading(const std::vector<std::filesystem::path>& files, const QVImportOptions& options)
        : files_(files), builder_(options.listedRefusals, queue_), thread_([this] { run(); }) {}
    /// Gives up what is not read yet.
    ~Reading() {
        givenUp_ = true;
        queue_.close();
    }

    QVImportQueue& queue() { return queue_; }
    uint64_t bytesDone() const { return bytesDone_.load(std::memory_order_relaxed); }
    /// What was read, or why it ended. Waits for the end.
    VSResult<QVImportReport> finish() {
        thread_.join();
        if (error_) return *error_;
        return builder_.takeReport();
    }
    const std::vector<std::string>& notes() const { return notes_; }

 private:
    void run() {
        for (const auto& path : files_) {
            if (const VSStatus status = readFile(path); !status) {
                error_ = status.error();
                break;
            }
        }
        queue_.close();
    }

    VSStatus readFile(const std::filesystem::path& path) {
        auto opened = QVImportFile::open(path, &givenUp_);
        if (!opened) return opened.error();
        QVImportFile& file = **opened;
        const uint64_t before = bytesDone_;
        size_t documents = 0;
        while (true) {
            const auto next = file.nextDocument();
            if (!next) return next.error();
            if (!*next) break;
            if (VSStatus status = readDocument(file, before, documents); !status) return status;
        }
        for (const auto& text : file.notes()) note(text);
        if (documents == 0)
            return QVUnfitFileError(path.filename().string(), {QVFileKind::ArchiveWithoutRecords, {}});
        bytesDone_ = before + file.bytesTotal();
        return {};
    }

    VSStatus readDocument(QVImportFile& file, uint64_t before, size_t& documents) {
        QVRecordsReader reader(file, builder_, &givenUp_);
        reader.setProgress([&] { bytesDone_.store(before + file.bytesDone(), std::memory_order_relaxed); });
        builder_.beginDocument(file.documentName());
        const auto outcome = reader.read();
        if (!outcome) return outcome.error();
        if (*outcome == QVRecordsReader::Outcome::OtherDocument) {
            const std::string what = "its root element is " + reader.otherRoot() + " and not HealthData";
            if (!file.isArchive())
                return QVUnfitFileError(file.documentName(), {QVFileKind::OtherXML, reader.otherRoot()});
            builder_.abandonDocument();
            note(file.documentName() + ": " + what + "; passed over");
            return {};
        }
        builder_.endDocument();
        ++documents;
        return givenUp_ || builder_.isStopped() ? VSStatus(cancelled()) : VSStatus();
    }

    void note(const std::string& text) {
        if (notes_.size() < kListedNotes) notes_.push_back(text);
    }

    const std::vector<std::filesystem::path>& files_;
    std::atomic<bool> givenUp_ = false;
    std::atomic<uint64_t> bytesDone_ = 0;
    QVImportQueue queue_;
    // Of the reading thread until it ends:
    QVRecordsBuilder builder_;
    std::optional<VSError> error_;
    std::vector<std::string> notes_;
    std::jthread thread_;  // last: it uses all the others
};

/// The storing half, on the calling thread.
class Storing {
 public:
    explicit Storing(size_t listedRefusals) : listedRefusals_(listedRefusals) {}

    VSStatus store(VSHealthStore::ImportTransaction& transaction, const QVImportBatch& batch) {
        if (document_ && batch.document != document_) {
            if (VSStatus status = transaction.endDocument(); !status) return status;
        }
        document_ = batch.document;
        if (batch.person) {
            if (VSStatus status = storePerson(transaction, *batch.person); !status) return status;
        }
        for (const QVImportItem& item : batch.items) {
            const auto outcome =
                item.relations ? transaction.add(item.get(), *item.relations) : transaction.add(item.get());
            if (outcome) {
                const auto code = static_cast<size_t>(VSTypeCodeValue(item.get().sampleType()->code()));
                ++(*outcome == VSHealthStore::ImportTransaction::Outcome::Added ? added_ : had_)[code];
            } else if (outcome.error().code == VSErrorCode::Invalid) {
                refuse(*batch.document, item, outcome.error().message);
            } else {
                return outcome.error();
            }
        }
        records_ += static_cast<int64_t>(batch.items.size());
        return {};
    }

    int64_t records() const { return records_; }

    void completeReport(QVImportReport& report) {
        for (size_t code = 0; code < added_.size(); ++code) {
            if (added_[code] == 0 && had_[code] == 0 && refused_[code] == 0) continue;
            QVImportCount& count =
                report.byType[std::string(VSObjectType::dataTypeWithCode(static_cast<int>(code))->name())];
            count.added += added_[code];
            count.alreadyHad += had_[code];
            count.refused += refused_[code];
            report.total.added += added_[code];
            report.total.alreadyHad += had_[code];
            report.total.refused += refused_[code];
        }
        report.characteristicsSet = characteristics_;
        for (const auto& [reason, count] : reasons_) report.refusalsByReason[reason] += count;
        for (auto& refusal : refusals_) report.refusals.push_back(std::move(refusal));
        inDocumentOrder(report);
        if (report.refusals.size() > listedRefusals_) report.refusals.resize(listedRefusals_);
    }

 private:
    VSStatus storePerson(VSHealthStore::ImportTransaction& transaction, const QVImportPerson& person) {
        const auto set = transaction.setCharacteristicsIfUnset(person.birthDate, person.biologicalSex,
                                                               person.bloodType, person.skinType);
        if (!set) return set.error();
        characteristics_ += *set;
        if (!person.medicalID) return {};
        const auto isSet = transaction.setMedicalIDIfUnset(*person.medicalID);
        if (!isSet) return isSet.error();
        characteristics_ += *isSet;
        return {};
    }

    void refuse(const std::string& document, const QVImportItem& item, const std::string& message) {
        static constexpr const char* kReason = "the store refuses it";
        const VSSample& sample = item.get();
        ++refused_[static_cast<size_t>(VSTypeCodeValue(sample.sampleType()->code()))];
        ++reasons_[kReason];
        if (refusals_.size() >= listedRefusals_) return;
        const VSTypeKind kind = sample.sampleType()->kind();
        const char* element = kind == VSTypeKind::Correlation ? "Correlation"
                              : kind == VSTypeKind::Workout   ? "Workout"
                                                              : "Record";
        refusals_.push_back(
            {document, item.line, element, sample.sampleType()->identifier(), kReason, message, {}});
    }

    static void inDocumentOrder(QVImportReport& report) {
        const auto place = [&](const QVImportRefusal& refusal) {
            return std::find(report.documents.begin(), report.documents.end(), refusal.document) -
                   report.documents.begin();
        };
        std::stable_sort(report.refusals.begin(), report.refusals.end(), [&](const auto& a, const auto& b) {
            return std::make_pair(place(a), a.line) < std::make_pair(place(b), b.line);
        });
    }

    static constexpr size_t kCodes = 128;
    const size_t listedRefusals_;
    std::vector<int64_t> added_ = std::vector<int64_t>(kCodes), had_ = added_, refused_ = added_;
    std::map<std::string, int64_t> reasons_;
    std::vector<QVImportRefusal> refusals_;
    std::shared_ptr<const std::string> document_;  // of the last batch
    int64_t records_ = 0;
    int characteristics_ = 0;
};

std::string importName(const std::vector<std::filesystem::path>& files) {
    std::string name;
    for (const auto& file : files) name += (name.empty() ? "" : ", ") + file.filename().string();
    return name;
}

/// Tells at most a few times a second.
class Progress {
 public:
    Progress(const QVImportOptions& options, const std::vector<std::filesystem::path>& files)
        : options_(options) {
        for (const auto& file : files) total_ += QVImportFileSize(file);
    }
    void tell(uint64_t bytesDone, int64_t records, bool always = false) {
        if (!options_.progress) return;
        const auto now = std::chrono::steady_clock::now();
        if (!always && now - last_ < kProgressInterval) return;
        last_ = now;
        options_.progress({bytesDone, total_, records, false, {}});
    }
    void tellWaiting(std::optional<VSStoreHolder> holder) const {
        if (options_.progress) options_.progress({0, total_, 0, true, std::move(holder)});
    }

 private:
    const QVImportOptions& options_;
    uint64_t total_ = 0;
    std::chrono::steady_clock::time_point last_{};
};

/// Waits for the store's writer. As long as another program holds it, that one lives and works: its locks go
/// with it. So there is no limit but the person's patience.
VSResult<std::unique_ptr<VSHealthStore::ImportTransaction>> begin(VSHealthStore& store,
                                                                  const std::string& name,
                                                                  const std::atomic<bool>* cancel,
                                                                  Progress& progress) {
    auto transaction = store.beginImport(name, kSilentPatience, cancel);
    while (!transaction && transaction.error().isHeldByOthers && !isSet(cancel)) {
        progress.tellWaiting(VSReadStoreHolder(store.folder()));
        transaction = store.beginImport(name, kToldPatience, cancel);
    }
    if (isSet(cancel)) return cancelled();
    progress.tell(0, 0, true);  // it does not wait any more
    return transaction;
}

}  // namespace

VSResult<QVImportReport> QVRecordsImporter::importFiles(const std::vector<std::filesystem::path>& files,
                                                        const QVImportOptions& options) {
    Reading reading(files, options);
    Progress progress(options, files);
    auto transaction = begin(*store_, importName(files), options.cancel, progress);
    if (!transaction) return transaction.error();
    Storing storing(options.listedRefusals);
    while (!reading.queue().isDrained()) {
        if (isSet(options.cancel)) return cancelled();
        const auto batch = reading.queue().pop(kPopPatience);
        if (batch) {
            if (const VSStatus status = storing.store(**transaction, *batch); !status) return status.error();
        }
        progress.tell(reading.bytesDone(), storing.records());
    }
    auto report = reading.finish();
    if (isSet(options.cancel)) return cancelled();
    if (!report) return report;
    storing.completeReport(*report);
    report->notes = reading.notes();
    if (!options.dryRun) {
        if (const VSStatus status = (*transaction)->commit(); !status) return status.error();
    }
    progress.tell(reading.bytesDone(), storing.records(), true);
    return report;
}
