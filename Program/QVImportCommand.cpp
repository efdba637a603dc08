#include <unistd.h>

#include <charconv>
#include <cstdio>
#include <cstdlib>
#include <optional>

#include "Program/QVCommand.h"
#include "Program/QVInterruption.h"
#include "Program/QVTabOutput.h"
#include "Qelvar/Import/QVFileKind.h"
#include "Qelvar/Import/QVRecordsImporter.h"
#include "Vessa/VSStoreSchema.h"

namespace {

/// A line that is written over again and again on a terminal; a row each time when it was asked for. That an
/// import waits for another program is told in any case.
class ProgressLine {
 public:
    explicit ProgressLine(bool rows) : rows_(rows), line_(!rows && isatty(STDERR_FILENO)) {
        if (rows_) std::fputs("bytes_done\tbytes_total\trecords\n", stderr);
    }
    ~ProgressLine() {
        if (line_) std::fputs("\r\033[K", stderr);
    }
    void show(const QVImportProgress& progress) {
        if (progress.isWaiting) return waiting_.show(progress.holder);
        if (!rows_ && !line_) return;
        const auto done = static_cast<unsigned long long>(progress.bytesDone),
                   total = static_cast<unsigned long long>(progress.bytesTotal);
        const auto records = static_cast<long long>(progress.records);
        if (rows_)
            std::fprintf(stderr, "%llu\t%llu\t%lld\n", done, total, records);
        else if (total > 0)
            std::fprintf(stderr, "\r\033[K%3llu %%  %lld records", done * 100 / total, records);
        else
            std::fprintf(stderr, "\r\033[K%lld records", records);
        std::fflush(stderr);
    }

 private:
    const bool rows_;
    const bool line_;
    QVWaitingLine waiting_;
};

void printReasons(const std::string& what, const std::map<std::string, int64_t>& reasons) {
    std::string line;
    for (const auto& [reason, count] : reasons)
        line += (line.empty() ? what + ": " : "; ") + reason + " " + std::to_string(count);
    if (!line.empty()) QVPrintError(line);
}

void printRefusals(const QVImportReport& report) {
    for (const auto& note : report.notes) QVPrintError(note);
    for (const auto& refusal : report.refusals) {
        QVPrintError(refusal.description());
        if (!refusal.excerpt.empty()) std::fprintf(stderr, "    %s\n", refusal.excerpt.c_str());
    }
    if (report.refusalsNotListed() > 0)
        QVPrintError("and " + std::to_string(report.refusalsNotListed()) + " more");
    printReasons("refused", report.refusalsByReason);
    printReasons("parts refused without their record", report.partRefusalsByReason);
}

VSStatus printReport(const QVImportReport& report) {
    QVTabOutput output;
    output.row({"type", "read", "added", "already_had", "refused"});
    const auto row = [&](const std::string& type, const QVImportCount& count) {
        output.row({type, std::to_string(count.read), std::to_string(count.added),
                    std::to_string(count.alreadyHad), std::to_string(count.refused)});
    };
    for (const auto& [type, count] : report.byType) row(type, count);
    row("total", report.total);
    VSStatus status = output.finish();
    if (report.characteristicsSet > 0)
        QVPrintError(std::to_string(report.characteristicsSet) + " characteristics of the person were set");
    printRefusals(report);
    return status;
}

VSResult<size_t> refusalsToList(const QVCommandArguments& arguments) {
    const auto text = arguments.value("refusals");
    if (!text) return QVImportOptions().listedRefusals;
    size_t number = 0;
    const auto [end, error] = std::from_chars(text->data(), text->data() + text->size(), number);
    if (error != std::errc{} || end != text->data() + text->size())
        return VSError{VSErrorCode::Invalid, "--refusals: " + *text + " is not a number"};
    return number;
}

/// A folder for an empty store, as long as it is needed.
class TrialFolder {
 public:
    TrialFolder() {
        std::error_code error;
        std::string pattern = (std::filesystem::temp_directory_path(error) / "qelvar-trial-XXXXXX").string();
        if (!error && mkdtemp(pattern.data())) path_ = pattern;
    }
    ~TrialFolder() {
        std::error_code ignored;
        if (!path_.empty()) std::filesystem::remove_all(path_, ignored);
    }
    TrialFolder(const TrialFolder&) = delete;
    TrialFolder& operator=(const TrialFolder&) = delete;
    /// Empty: it could not be made.
    const std::filesystem::path& path() const { return path_; }

 private:
    std::filesystem::path path_;
};

bool holdsStore(const std::filesystem::path& folder) {
    std::error_code error;
    for (const char* suffix : {"", "-wal"}) {
        const auto status =
            std::filesystem::status((folder / VSStoreSchema::fileName).string() + suffix, error);
        // What cannot be told apart from a store is taken for one; then it fails to open.
        if (status.type() != std::filesystem::file_type::not_found) return true;
    }
    return false;
}

using OpenedStore = VSResult<std::shared_ptr<VSHealthStore>>;

/// Makes no store where there is none, and brings none to a newer form: that is not undone.
OpenedStore openForTrial(const std::filesystem::path& folder, std::optional<TrialFolder>& trial) {
    if (!holdsStore(folder)) {
        trial.emplace();
        if (trial->path().empty())
            return VSError{VSErrorCode::NotAccessible, "a folder for the trial cannot be made; see TMPDIR"};
        return VSHealthStore::open(trial->path());
    }
    VSHealthStore::Options options;
    options.readOnly = true;
    options.createIfMissing = false;
    if (auto reading = VSHealthStore::open(folder, options); !reading) return reading.error();
    options.readOnly = false;
    return VSHealthStore::open(folder, options);
}

/// Tells of every file that cannot be imported, and the first error.
VSStatus checkFiles(const std::vector<std::filesystem::path>& files) {
    std::optional<VSError> first;
    std::string fit;
    for (const auto& path : files) {
        const QVRecognisedFile file = QVRecogniseFile(path);
        if (file.mayHoldRecords()) {
            fit += " " + path.string();
            continue;
        }
        const VSError error = QVUnfitFileError(path.string(), file);
        QVPrintError(error.message);
        if (!first) first = error;
    }
    if (!first) return {};
    if (!fit.empty())
        QVPrintError(
            "nothing was imported, since all files of a command are imported together or none; without the "
            "others try: qelvar import" +
            fit);
    return *first;
}

QVExitStatus run(const QVCommandContext& context) {
    const auto& words = context.arguments.words();
    if (words.empty()) return QVFailUsage("import", "import needs at least one file");
    const std::vector<std::filesystem::path> files(words.begin(), words.end());
    const auto listed = refusalsToList(context.arguments);
    if (!listed) return QVFailUsage("import", listed.error().message);
    // A second signal ends the process at once, which leaves no trace either.
    QVCatchInterruptions(QVSecondInterruption::EndsProcess);
    if (const VSStatus status = checkFiles(files); !status) return QVExitStatusForError(status.error());
    QVImportOptions options;
    options.dryRun = context.arguments.has("dry-run");
    std::optional<TrialFolder> trial;
    auto store =
        options.dryRun ? openForTrial(context.storeFolder, trial) : VSHealthStore::open(context.storeFolder);
    if (!store) return QVFail(store.error());

    options.cancel = &QVInterrupted();
    options.listedRefusals = *listed;
    const auto report = [&] {
        ProgressLine line(context.arguments.has("progress"));
        options.progress = [&line](const QVImportProgress& progress) { line.show(progress); };
        return QVRecordsImporter(*store).importFiles(files, options);
    }();
    if (!report) {
        QVPrintError(report.error().message);
        if (report.error().code == VSErrorCode::Cancelled)
            return static_cast<QVExitStatus>(QVInterruptedExitStatus());
        return QVExitStatusForError(report.error());
    }
    if (const VSStatus status = printReport(*report); !status) return QVFail(status.error());
    if (options.dryRun) QVPrintError("this was a trial; nothing of it is kept");
    return QVExitStatus::Success;
}

constexpr QVCommandOption kOptions[] = {{"progress", false}, {"refusals", true}, {"dry-run", false}};

}  // namespace

const QVCommand QVImportCommand{"import", "read records documents (.xml) and archives that hold them (.zip)",
                                R"(Usage: qelvar import [--dry-run] [--progress] [--refusals N] FILE...

Reads records documents, plain or inside .zip archives, into the store. All files are one transaction: when one
of them cannot be read as a whole, or the import is interrupted (Ctrl+C), nothing of any is kept. Records that
the store already has are not added again. A record that makes no sense is refused alone and told on standard
error with its line; the others are kept. While another program writes to the store, the import waits and says
so. `qelvar undo` takes an import back.

Standard output: type, read, added, already_had, refused; a row for each type and a row "total".

  --dry-run       do and tell everything as in an import, and then keep nothing; refused for a store of an older
                  version, which opening it for writing would change
  --refusals N    tell the first N refusals in full (20); all are counted by reason
  --progress      write progress as rows to standard error (bytes_done, bytes_total, records); without it a line
                  of progress is shown when standard error is a terminal
)",
                                kOptions, run};
