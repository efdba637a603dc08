#include <signal.h>
#include <unistd.h>

#include <atomic>
#include <charconv>
#include <cstdio>

#include "Program/QVCommand.h"
#include "Program/QVTabOutput.h"
#include "Qelvar/Import/QVRecordsImporter.h"

namespace {

std::atomic<bool> cancelled = false;
std::atomic<int> cancellingSignal = 0;
static_assert(std::atomic<bool>::is_always_lock_free && std::atomic<int>::is_always_lock_free);

/// The first signal asks for a clean end; the second one ends the process at once, which leaves no trace
/// either.
void handleSignals() {
    struct sigaction action {};
    action.sa_handler = [](int signal) {
        cancellingSignal = signal;
        cancelled = true;
    };
    action.sa_flags = static_cast<int>(SA_RESETHAND);
    sigaction(SIGINT, &action, nullptr);
    sigaction(SIGTERM, &action, nullptr);
}

/// A line that is written over again and again on a terminal; a row each time when it was asked for.
class ProgressLine {
 public:
    explicit ProgressLine(bool rows) : rows_(rows), line_(!rows && isatty(STDERR_FILENO)) {
        if (rows_) std::fputs("bytes_done\tbytes_total\trecords\n", stderr);
    }
    ~ProgressLine() {
        if (line_) std::fputs("\r\033[K", stderr);
    }
    bool isWanted() const { return rows_ || line_; }
    void show(const QVImportProgress& progress) const {
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
};

void printRefusals(const QVImportReport& report) {
    for (const auto& note : report.notes) QVPrintError(note);
    for (const auto& refusal : report.refusals) {
        QVPrintError(refusal.description());
        if (!refusal.excerpt.empty()) std::fprintf(stderr, "    %s\n", refusal.excerpt.c_str());
    }
    if (report.refusalsByReason.empty()) return;
    if (report.refusalsNotListed() > 0)
        QVPrintError("and " + std::to_string(report.refusalsNotListed()) + " more");
    std::string counts = "refused";
    for (const auto& [reason, count] : report.refusalsByReason) {
        counts += (counts.size() > 7 ? "; " : ": ") + reason + " " + std::to_string(count);
    }
    QVPrintError(counts);
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

QVExitStatus run(const QVCommandContext& context) {
    const auto& words = context.arguments.words();
    if (words.empty()) return QVFailUsage("import", "import needs at least one file");
    const std::vector<std::filesystem::path> files(words.begin(), words.end());
    const auto listed = refusalsToList(context.arguments);
    if (!listed) return QVFailUsage("import", listed.error().message);
    handleSignals();
    for (const auto& file : files) {
        std::error_code error;
        if (!std::filesystem::exists(file, error))
            return QVFail({VSErrorCode::NotFound, file.string() + ": there is no such file"});
    }
    auto store = VSHealthStore::open(context.storeFolder);
    if (!store) return QVFail(store.error());

    QVImportOptions options;
    options.cancel = &cancelled;
    options.listedRefusals = *listed;
    const auto report = [&] {
        const ProgressLine line(context.arguments.has("progress"));
        if (line.isWanted())
            options.progress = [&line](const QVImportProgress& progress) { line.show(progress); };
        return QVRecordsImporter(*store).importFiles(files, options);
    }();
    if (!report) {
        QVPrintError(report.error().message);
        if (report.error().code == VSErrorCode::Cancelled)
            return static_cast<QVExitStatus>(128 + cancellingSignal);
        return QVExitStatusForError(report.error());
    }
    if (const VSStatus status = printReport(*report); !status) return QVFail(status.error());
    return QVExitStatus::Success;
}

constexpr QVCommandOption kOptions[] = {{"progress", false}, {"refusals", true}};

}  // namespace

const QVCommand QVImportCommand{"import", "read records documents (.xml) and archives that hold them (.zip)",
                                R"(Usage: qelvar import [--progress] [--refusals N] FILE...

Reads records documents, plain or inside .zip archives, into the store. All files are one transaction: when one
of them cannot be read as a whole, or the import is interrupted (Ctrl+C), nothing of any is kept. Records that
the store already has are not added again. A record that makes no sense is refused alone and told on standard
error with its line; the others are kept.

Standard output: type, read, added, already_had, refused; a row for each type and a row "total".

  --refusals N    tell the first N refusals in full (20); all are counted by reason
  --progress      write progress as rows to standard error (bytes_done, bytes_total, records); without it a line
                  of progress is shown when standard error is a terminal
)",
                                kOptions, run};
