#include "Program/QVProgram.h"

#include <unistd.h>

#include <algorithm>
#include <charconv>
#include <cstdio>
#include <vector>

#include "Platform/Appearance.h"
#include "Platform/TextScale.h"
#include "Qelvar/App/QVApplication.h"
#include "Qelvar/App/QVPictureFolder.h"
#include "Vessa/Base/VSEnvironment.h"
#include "Vessa/VSStoreGuard.h"

namespace {

constexpr const QVCommand* kCommands[] = {
    &QVImportCommand,  &QVExportCommand,  &QVStatisticsCommand, &QVSamplesCommand, &QVTypesCommand,
    &QVSourcesCommand, &QVBatchesCommand, &QVUndoCommand,       &QVCheckCommand,   &QVSalvageCommand};

constexpr QVCommandOption kCommonOptions[] = {{"store", true}, {"now", true}, {"help", false}};
constexpr QVCommandOption kProgramOptions[] = {{"store", true},      {"now", true},     {"help", false},
                                               {"version", false},   {"demo", false},   {"screenshots", true},
                                               {"size", true},       {"scale", true},   {"open", true},
                                               {"text-scale", true}, {"contrast", true}};

constexpr const char* kHelp =
    R"(Usage: qelvar [--demo] [--screenshots DIR] [--size WxH] [--scale S] [--text-scale T] [--contrast C] [--open LINK] [--store DIR] [--now DATE]
       qelvar COMMAND [OPTION]... [WORD]...

Without a command the application is started.

  --demo              with prepared records in a store of their own
  --screenshots DIR   draw every tab and time scope into PNG files in DIR and end; needs no display
  --size WxH          the window's size in points (375x667)
  --scale S           pixels per point of the screenshots
  --text-scale T      how large texts are, from 1 to 2 (QELVAR_TEXT_SCALE, or as the desktop says)
  --contrast C        "high" or "normal" (as the desktop says)
  --open LINK         open a link of the application, such as qelvar://HealthDataTab?DataCategory=2&DataUnit=59

For the application and every command:

  --store DIR         the store's folder ($XDG_DATA_HOME/qelvar or ~/.local/share/qelvar)
  --now DATE          start the clock there: 2020-03-31T20:00
  --help              tell about the program, or with a command about that command
  --version           tell the version
  TZ, LANG            the time zone and the locale

Commands:

)";
constexpr const char* kHelpEnd = R"(
TYPE is an identifier with or without its prefix: HeartRate, VSQuantityTypeIdentifierHeartRate.

Output is tab-separated with a header line; times are ISO 8601 with their offset, numbers read back as the same
numbers. In a field \t, \n, \r and \\ stand for tab, line ends and backslash. Errors go to standard error.

Exit status: 0 done; 1 failed (input or output, a disk for reading only, other trouble of the system); 2 wrong command line;
3 not found (file, folder, type, store); 4 invalid (a document, value or name that cannot be accepted); 5 refused (not permitted,
a target in a store, a file that would be lost, or a store of a newer version); 6 the store is locked or cannot be reached now;
7 the store is damaged; 8 the disk is full; 130 interrupted (143 by SIGTERM).
)";

void printHelp() {
    std::fputs(kHelp, stdout);
    for (const QVCommand* command : kCommands) {
        std::printf("  %-12.*s %.*s\n", static_cast<int>(command->name.size()), command->name.data(),
                    static_cast<int>(command->summary.size()), command->summary.data());
    }
    std::fputs(kHelpEnd, stdout);
}

void printHelp(const QVCommand& command) {
    std::fwrite(command.help.data(), 1, command.help.size(), stdout);
    std::fputs(
        "\nCommon options: --store DIR, --now DATE, --help; see qelvar --help, also for the exit statuses.\n",
        stdout);
}

/// What comes before and after the command's name; the later one counts.
std::optional<std::string> commonValue(std::string_view name, const QVCommandArguments& first,
                                       const QVCommandArguments& second) {
    const auto value = second.value(name);
    return value ? value : first.value(name);
}

VSStatus installClock(const std::optional<std::string>& now) {
    if (!now) return {};
    const auto date = QVDateForArgument("now", *now);
    if (!date) return date.error();
    VSEnvironment::install(std::make_shared<VSSystemEnvironment>(*date));
    return {};
}

std::filesystem::path storeFolder(const std::optional<std::string>& given, bool demo) {
    return given ? std::filesystem::path(*given) : QVStoreFolder(demo);
}

/// No store is made in another's folder, and what is printed must not go into a store's file, as `1<>FILE`
/// and
/// `>>FILE` would have it. (Reading one would take SQLite's locks on it when it is closed.)
VSStatus checkPlaces(const std::filesystem::path& store) {
    const VSStoreGuard guard(store);
    if (VSStatus status = guard.checkOpenFile(STDERR_FILENO, "standard error"); !status) return status;
    if (VSStatus status = guard.checkOpenFile(STDIN_FILENO, "standard input"); !status) return status;
    if (VSStatus status = guard.checkOpenFile(STDOUT_FILENO, "standard output"); !status) return status;
    return VSStoreGuard::checkNewStore(store);
}

/// The refusal, too, must not be printed into a store.
QVExitStatus refusePlaces(const VSError& error, const std::filesystem::path& store) {
    return VSStoreGuard(store).checkOpenFile(STDERR_FILENO, {}) ? QVFail(error) : QVExitStatusForError(error);
}

QVExitStatus runCommand(const QVCommand& command, const QVCommandArguments& program) {
    std::vector<QVCommandOption> options(std::begin(kCommonOptions), std::end(kCommonOptions));
    options.insert(options.end(), command.options.begin(), command.options.end());
    const auto arguments = QVCommandArguments::parse(std::span(program.words()).subspan(1), options);
    if (!arguments) return QVFailUsage(command.name, arguments.error().message);
    if (arguments->has("help") || program.has("help")) return printHelp(command), QVExitStatus::Success;
    for (const char* option : {"screenshots", "size", "scale", "text-scale", "contrast", "open"}) {
        if (program.has(option))
            return QVFailUsage({}, std::string("--") + option + " is for the application, not for a command");
    }
    if (const VSStatus status = installClock(commonValue("now", program, *arguments)); !status)
        return QVFailUsage(command.name, status.error().message);
    const auto store = storeFolder(commonValue("store", program, *arguments), program.has("demo"));
    if (const VSStatus status = checkPlaces(store); !status) return refusePlaces(status.error(), store);
    return command.run({*arguments, store});
}

/// "375x667"; none when it is not of this form.
std::optional<QSize> sizeFromText(const std::string& text) {
    int width = 0, height = 0;
    const char* const end = text.data() + text.size();
    const auto first = std::from_chars(text.data(), end, width);
    if (first.ec != std::errc{} || first.ptr == end || *first.ptr != 'x') return std::nullopt;
    const auto second = std::from_chars(first.ptr + 1, end, height);
    if (second.ec != std::errc{} || second.ptr != end || width < 1 || height < 1 || width > 16'384 ||
        height > 16'384)
        return std::nullopt;
    return QSize(width, height);
}

QVExitStatus runApplication(char* program, const QVCommandArguments& arguments) {
    QVApplicationOptions options;
    options.demo = arguments.has("demo");
    if (const auto folder = arguments.value("screenshots")) options.screenshots = *folder;
    if (const auto text = arguments.value("size")) {
        const auto size = sizeFromText(*text);
        if (!size) return QVFailUsage({}, "--size: " + *text + " is not a size such as 375x667");
        options.size = *size;
    }
    if (const auto text = arguments.value("scale")) {
        const auto [end, error] = std::from_chars(text->data(), text->data() + text->size(), options.scale);
        if (error != std::errc{} || end != text->data() + text->size() ||
            !(options.scale > 0 && options.scale <= 8))
            return QVFailUsage({}, "--scale: " + *text + " is not a scale between 0 and 8");
    }
    if (const auto text = arguments.value("text-scale")) {
        const auto factor = platform::TextScale::fromText(QByteArray::fromStdString(*text));
        if (!factor) return QVFailUsage({}, "--text-scale: " + *text + " is not a number from 1 to 2");
        options.textScale = *factor;
    }
    if (const auto text = arguments.value("contrast")) {
        options.highContrast = platform::Appearance::highContrastFromText(QByteArray::fromStdString(*text));
        if (!options.highContrast)
            return QVFailUsage({}, "--contrast: " + *text + " is neither high nor normal");
    }
    if (const auto link = arguments.value("open")) options.openLink = QString::fromStdString(*link);
    if (const VSStatus status = installClock(arguments.value("now")); !status)
        return QVFailUsage({}, status.error().message);
    options.store = storeFolder(arguments.value("store"), options.demo);
    if (const VSStatus status = checkPlaces(options.store); !status)
        return refusePlaces(status.error(), options.store);
    if (options.screenshots) {
        // Before the store is opened, which may make one.
        const auto folder = QVPictureFolder::open(*options.screenshots, options.store);
        if (!folder) return QVFail(folder.error());
    }
    char* argv[] = {program, nullptr};
    return static_cast<QVExitStatus>(QVRunApplication(1, argv, options));
}

}  // namespace

QVExitStatus QVRunProgram(int argc, char** argv, std::span<const std::string> given) {
    const auto arguments = QVCommandArguments::parse(given, kProgramOptions, true);
    if (!arguments) return QVFailUsage({}, arguments.error().message);
    if (arguments->has("version")) return std::puts("qelvar " QELVAR_VERSION), QVExitStatus::Success;
    if (arguments->words().empty()) {
        if (arguments->has("help")) return printHelp(), QVExitStatus::Success;
        static char name[] = "qelvar";
        return runApplication(argc > 0 ? argv[0] : name, *arguments);
    }
    const std::string& word = arguments->words().front();
    if (word == "help") return printHelp(), QVExitStatus::Success;
    for (const QVCommand* command : kCommands) {
        if (command->name == word) return runCommand(*command, *arguments);
    }
    return QVFailUsage({}, "there is no command " + word);
}
