#pragma once

#include <filesystem>
#include <memory>
#include <span>
#include <string>
#include <string_view>

#include "Program/QVCommandArguments.h"
#include "Vessa/Base/VSError.h"
#include "Vessa/VSHealthStore.h"
#include "Vessa/VSStoreHolder.h"

/// The exit statuses. Scripts know them: never change a number.
enum class QVExitStatus : int {
    Success = 0,
    Failed = 1,
    Usage = 2,
    NotFound = 3,
    Invalid = 4,
    Refused = 5,
    NotAccessible = 6,
    Corrupt = 7,
    DiskFull = 8,
    Cancelled = 130,
};

QVExitStatus QVExitStatusForError(const VSError& error);

/// "qelvar: message" on standard error.
void QVPrintError(std::string_view message);
/// The same, and the status to end with.
QVExitStatus QVFail(const VSError& error);
QVExitStatus QVFailUsage(std::string_view command, std::string_view message);

/// What a sub-command is run with.
struct QVCommandContext {
    const QVCommandArguments& arguments;
    std::filesystem::path storeFolder;
};

/// A sub-command: its name, its options (beside --store, --now and --help), what runs it.
struct QVCommand {
    std::string_view name;
    std::string_view summary;
    std::string_view help;
    std::span<const QVCommandOption> options;
    QVExitStatus (*run)(const QVCommandContext& context);
};

/// Tells, each time that it is another, whom a command waits for that wants to write to the store.
class QVWaitingLine {
 public:
    void show(const std::optional<VSStoreHolder>& holder);

 private:
    std::optional<std::string> told_;
};

/// The store for reading. NotFound when there is none in the folder.
VSResult<std::shared_ptr<VSHealthStore>> QVOpenStoreForReading(const std::filesystem::path& folder);

/// On standard error, that the store has no records of the type: no rows alone do not tell why.
void QVSayNoRecords(const VSObjectType& type);

/// A type by identifier with or without its prefix. NotFound.
VSResult<const VSObjectType*> QVTypeForArgument(std::string_view text);
/// A date of the command line, in the user's zone. Invalid.
VSResult<VSDate> QVDateForArgument(std::string_view option, std::string_view text);
/// The date of an option; none when it is not given.
VSResult<std::optional<VSDate>> QVDateOption(const QVCommandArguments& arguments, std::string_view option);

extern const QVCommand QVImportCommand, QVExportCommand, QVStatisticsCommand, QVSamplesCommand,
    QVTypesCommand, QVSourcesCommand, QVCheckCommand, QVBatchesCommand, QVUndoCommand, QVSalvageCommand;
