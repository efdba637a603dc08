#include "Program/QVCommand.h"
#include "Program/QVTabOutput.h"

namespace {

QVExitStatus runSalvage(const QVCommandContext& context) {
    if (!context.arguments.words().empty()) return QVFailUsage("salvage", "salvage takes no words");
    const auto target = context.arguments.value("to");
    if (!target || target->empty())
        return QVFailUsage("salvage", "--to DIR must say where the new store is to be made");
    std::error_code error;
    if (!std::filesystem::exists(context.storeFolder, error))
        return QVFail({VSErrorCode::NotFound, "there is no store in " + context.storeFolder.string()});
    const auto report = VSHealthStore::salvage(context.storeFolder, *target);
    if (!report) return QVFail(report.error());
    QVTabOutput output;
    output.row({"store", "samples", "lost"});
    output.row({*target, std::to_string(report->samples),
                report->lost ? std::to_string(*report->lost) : std::string()});
    const VSStatus status = output.finish();
    for (const std::string& loss : report->losses) QVPrintError(loss);
    return status ? QVExitStatus::Success : QVFail(status.error());
}

constexpr QVCommandOption kSalvageOptions[] = {{"to", true}};

}  // namespace

const QVCommand QVSalvageCommand{"salvage", "make a sound store of what can be read of a damaged one",
                                 R"(Usage: qelvar salvage --to DIR [--store DIR]

Reads what can be read of the store, also of one that cannot be opened any more, and makes a sound store of it
in the folder DIR, which must not hold one yet nor be in another's folder. The damaged store is not changed. No other program may have it
open. There must be room for the store twice.
Standard output: store (the new folder), samples (that are in it), lost (how many could not be read; empty when
that cannot be told). Each loss is a line on standard error.

To go on with the new store, close the application and put DIR in the place of the damaged folder; keep that one
until you are sure.

  --to DIR      where to make the new store
)",
                                 kSalvageOptions, runSalvage};
