#include "Program/QVCommand.h"

#include <cstdio>

QVExitStatus QVExitStatusForError(const VSError& error) {
    switch (error.code) {
        case VSErrorCode::NotFound:
            return QVExitStatus::NotFound;
        case VSErrorCode::Invalid:
            return QVExitStatus::Invalid;
        case VSErrorCode::Refused:
            return QVExitStatus::Refused;
        case VSErrorCode::NotAccessible:
            return QVExitStatus::NotAccessible;
        case VSErrorCode::Corrupt:
            return QVExitStatus::Corrupt;
        case VSErrorCode::DiskFull:
            return QVExitStatus::DiskFull;
        case VSErrorCode::Cancelled:
            return QVExitStatus::Cancelled;
        case VSErrorCode::Failed:
            break;
    }
    return QVExitStatus::Failed;
}

void QVPrintError(std::string_view message) {
    std::fprintf(stderr, "qelvar: %.*s\n", static_cast<int>(message.size()), message.data());
}

QVExitStatus QVFail(const VSError& error) {
    QVPrintError(error.message);
    if (error.code == VSErrorCode::Corrupt)
        QVPrintError("`qelvar salvage` may save what can be read; `qelvar salvage --help` tells how");
    return QVExitStatusForError(error);
}

QVExitStatus QVFailUsage(std::string_view command, std::string_view message) {
    QVPrintError(message);
    std::fprintf(stderr, "Try: qelvar %.*s%s--help\n", static_cast<int>(command.size()), command.data(),
                 command.empty() ? "" : " ");
    return QVExitStatus::Usage;
}

void QVWaitingLine::show(const std::optional<VSStoreHolder>& holder) {
    const std::string who = holder ? " (" + holder->description() + ", since " +
                                         VSISO8601FromDate(holder->since, VSCalendar::current()) + ")"
                                   : "";
    if (told_ == who) return;
    told_ = who;
    QVPrintError("another program writes to the store" + who +
                 "; waiting until it has finished (Ctrl+C ends)");
}

VSResult<std::shared_ptr<VSHealthStore>> QVOpenStoreForReading(const std::filesystem::path& folder) {
    std::error_code error;
    if (!std::filesystem::exists(folder, error))
        return VSError{VSErrorCode::NotFound, "there is no store in " + folder.string()};
    VSHealthStore::Options options;
    options.readOnly = true;
    options.createIfMissing = false;
    return VSHealthStore::open(folder, options);
}

void QVSayNoRecords(const VSObjectType& type) {
    QVPrintError("the store has no records of " + std::string(type.name()) +
                 "; `qelvar types --recorded` lists what it has");
}

namespace {

std::string lowerCase(std::string_view text) {
    std::string lower(text);
    for (char& c : lower)
        if (c >= 'A' && c <= 'Z') c = static_cast<char>(c + 'a' - 'A');
    return lower;
}

/// The types whose names hold the text, whatever its case; a few.
std::string similarTypes(std::string_view text) {
    constexpr int kMost = 5;
    std::string names;
    int count = 0;
    for (const VSObjectType* type : VSObjectType::allTypes()) {
        const bool isSimilar = text.size() > 2 && type->isSampleType() &&
                               lowerCase(type->name()).find(lowerCase(text)) != std::string::npos;
        if (isSimilar && ++count <= kMost) names += (names.empty() ? "" : ", ") + std::string(type->name());
    }
    return names;
}

}  // namespace

VSResult<const VSObjectType*> QVTypeForArgument(std::string_view text) {
    const VSObjectType* type = VSObjectType::typeForIdentifier(text);
    if (!type) {
        const std::string similar = similarTypes(text);
        return VSError{VSErrorCode::NotFound, "there is no type " + std::string(text) +
                                                  (similar.empty() ? "" : "; do you mean " + similar + "?") +
                                                  "; `qelvar types` lists them"};
    }
    if (!type->isSampleType())
        return VSError{VSErrorCode::Invalid,
                       std::string(text) + " is a characteristic of the person and has no records"};
    return type;
}

VSResult<VSDate> QVDateForArgument(std::string_view option, std::string_view text) {
    if (const auto date = VSDateFromISO8601(text, VSCalendar::current())) return *date;
    return VSError{VSErrorCode::Invalid, "--" + std::string(option) + ": " + std::string(text) +
                                             " is not a date such as 2020-03-31 or 2020-03-31T20:00"};
}

VSResult<std::optional<VSDate>> QVDateOption(const QVCommandArguments& arguments, std::string_view option) {
    const auto text = arguments.value(option);
    if (!text) return std::optional<VSDate>();
    const auto date = QVDateForArgument(option, *text);
    if (!date) return date.error();
    return std::optional(*date);
}
