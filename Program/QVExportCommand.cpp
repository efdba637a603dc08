#include <signal.h>
#include <unistd.h>

#include <chrono>
#include <cstdio>
#include <future>

#include "Program/QVCommand.h"
#include "Program/QVInterruption.h"
#include "Program/QVTabOutput.h"
#include "Qelvar/Export/QVExportManager.h"
#include "Qelvar/Export/QVExportTarget.h"
#include "Vessa/Base/VSEnvironment.h"
#include "VessaUI/VSUnitPreferences.h"

namespace {

namespace fs = std::filesystem;
constexpr auto kProgressInterval = std::chrono::milliseconds(100);

VSResult<QVExportUnits> preferredUnits(VSHealthStore& store) {
    auto answer = std::make_shared<std::promise<VSResult<std::optional<VSValue>>>>();
    store.getDefaultValue(VSPreferredUnitsKey, [answer](const auto& value) { answer->set_value(value); });
    const auto value = answer->get_future().get();
    if (!value) return value.error();
    const VSValue::Dictionary* chosen = *value ? (*value)->dictionary() : nullptr;
    return QVExportUnits(VSPreferredUnits(chosen ? *chosen : VSValue::Dictionary(),
                                          VSEnvironment::current()->localeIdentifier()));
}

/// A line that is written over again and again on a terminal; a row each time when it was asked for.
class ProgressLine {
 public:
    explicit ProgressLine(bool rows) : rows_(rows), line_(!rows && isatty(STDERR_FILENO)) {
        if (rows_) std::fputs("type\trecords\trecords_total\tbytes_packed\tbytes_total\n", stderr);
    }
    ~ProgressLine() {
        if (line_) std::fputs("\r\033[K", stderr);
    }
    void show(const QVExportProgress& progress) const {
        const std::string type = progress.type ? std::string(progress.type->name()) : "";
        const auto records = static_cast<long long>(progress.records),
                   total = static_cast<long long>(progress.recordsTotal);
        if (rows_) {
            std::fprintf(stderr, "%s\t%lld\t%lld\t%llu\t%llu\n", type.c_str(), records, total,
                         static_cast<unsigned long long>(progress.bytesPacked),
                         static_cast<unsigned long long>(progress.bytesTotal));
        } else if (line_) {
            const int percent = static_cast<int>(progress.fraction() * 100);
            if (progress.bytesTotal > 0)
                std::fprintf(stderr, "\r\033[K%3d %%  packing", percent);
            else
                std::fprintf(stderr, "\r\033[K%3d %%  %lld of %lld records  %s", percent, records, total,
                             type.c_str());
        }
        std::fflush(stderr);
    }

 private:
    const bool rows_;
    const bool line_;
};

/// Runs an export to its end and tells how far it is.
VSResult<fs::path> exportAll(QVExportManager& manager, const ProgressLine& line) {
    auto ended = std::make_shared<std::promise<VSResult<fs::path>>>();
    auto result = ended->get_future();
    manager.createExportFile([ended](const VSResult<fs::path>& archive) { ended->set_value(archive); });
    while (result.wait_for(kProgressInterval) != std::future_status::ready) {
        line.show(manager.progress());
        if (QVInterrupted()) manager.cancelCurrentExport();
    }
    return result.get();
}

VSStatus printCounts(const QVExportManager& manager) {
    QVTabOutput output;
    output.row({"type", "records"});
    int64_t total = 0;
    for (const auto& [name, count] : manager.exportedCounts()) {
        output.row({name, std::to_string(count)});
        total += count;
    }
    output.row({"total", std::to_string(total)});
    return output.finish();
}

/// The place that --to names, as far as nothing else than an archive of this program would be lost there.
VSResult<QVExportTarget> targetOf(const QVCommandContext& context, const fs::path& given) {
    auto target = QVExportTarget::open(given, context.storeFolder);
    if (!target) return target;
    if (context.arguments.has("replace")) target->allowReplacing();
    if (target->holdsSomethingElse() && !context.arguments.has("replace"))
        return VSError{VSErrorCode::Refused,
                       target->path().string() +
                           " is there already and is no export of this program; --replace writes over it"};
    return target;
}

/// Makes the archive in a folder beside the target, on the same disk, so that it takes its name at once and
/// as a whole.
VSStatus exportTo(QVExportTarget& target, const std::shared_ptr<VSHealthStore>& store,
                  const QVExportUnits& units, bool rows) {
    const auto folder = target.makeWorkFolder();
    if (!folder) return folder.error();
    QVExportManager manager({store, (*folder)->path(), {}, [&units] { return units; }, *folder});
    const auto archive = [&] {
        const ProgressLine line(rows);
        return exportAll(manager, line);
    }();
    if (!archive) return archive.error();
    if (VSStatus status = target.take(**folder, archive->filename().string()); !status) return status;
    return printCounts(manager);
}

QVExitStatus run(const QVCommandContext& context) {
    if (!context.arguments.words().empty()) return QVFailUsage("export", "export takes no words");
    const auto given = context.arguments.value("to");
    if (!given || given->empty()) return QVFailUsage("export", "--to FILE.zip must say where to");
    QVCatchInterruptions(QVSecondInterruption::IsIgnored);
    signal(SIGPIPE, SIG_IGN);  // whoever reads the progress may go; the archive is still wanted
    auto target = targetOf(context, *given);
    if (!target) return QVFail(target.error());
    const auto store = QVOpenStoreForReading(context.storeFolder);
    if (!store) return QVFail(store.error());
    const auto units = preferredUnits(**store);
    if (!units) return QVFail(units.error());
    const VSStatus status = exportTo(*target, *store, *units, context.arguments.has("progress"));
    if (status) return QVExitStatus::Success;
    if (status.error().code != VSErrorCode::Cancelled) return QVFail(status.error());
    QVPrintError(status.error().message);
    return static_cast<QVExitStatus>(QVInterruptedExitStatus());
}

constexpr QVCommandOption kOptions[] = {{"to", true}, {"replace", false}, {"progress", false}};

}  // namespace

const QVCommand QVExportCommand{"export", "write all records into an archive",
                                R"(Usage: qelvar export --to FILE.zip [--replace] [--progress]

Writes everything that the store holds at one moment into an archive of two documents: export.xml, the records, which
`qelvar import` reads, and export_cda.xml, a clinical document with the vital signs and results. Values are in the
units that the application shows. The store may be used meanwhile; what is saved meanwhile is not in it.

The archive appears under its name, in the place of an older one, only when it is complete; only its owner may read
it. Another file than an empty one or such an archive is replaced only with --replace; a store never is, and nothing
is written into its folder. An export that fails or is interrupted (Ctrl+C) leaves nothing; of one that was killed the
next export into the same folder removes what is left (a folder .qelvar-export-... beside the target).

Standard output: type, records; a row for each type and a row "total".

  --to FILE.zip   where to
  --replace       also in the place of a file that is no export of this program
  --progress      write progress as rows to standard error (type, records, records_total, bytes_packed, bytes_total);
                  without it a line of progress is shown when standard error is a terminal
)",
                                kOptions, run};
