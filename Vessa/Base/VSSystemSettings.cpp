#include "Vessa/Base/VSSystemSettings.h"

#include <unicode/locid.h>
#include <unicode/timezone.h>

#include <algorithm>
#include <array>
#include <cctype>
#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <memory>
#include <optional>
#include <string_view>

namespace {

constexpr const char* kFallbackZone = "Etc/UTC";

bool isKnownZone(const std::string& identifier) {
    if (identifier.empty() || identifier.find('\0') != std::string::npos) return false;
    // Every computation with the calendar asks, nearly always for the same zone.
    thread_local std::string lastKnown;
    if (identifier == lastKnown) return true;
    const std::unique_ptr<icu::TimeZone> zone(
        icu::TimeZone::createTimeZone(icu::UnicodeString::fromUTF8(identifier)));
    if (*zone == icu::TimeZone::getUnknown()) return false;
    lastKnown = identifier;
    return true;
}

/// "Europe/Paris" of "/usr/share/zoneinfo/Europe/Paris" and of "../usr/share/zoneinfo/posix/Europe/Paris".
std::optional<std::string> zoneOfPath(const std::string& path) {
    constexpr std::string_view kFolder = "zoneinfo/";
    const size_t at = path.rfind(kFolder);
    if (at == std::string::npos) return std::nullopt;
    std::string name = path.substr(at + kFolder.size());
    for (const std::string_view variant : {"posix/", "right/"})
        if (name.starts_with(variant)) name.erase(0, variant.size());
    if (!isKnownZone(name)) return std::nullopt;
    return name;
}

struct PosixZone {
    std::string_view text;  // up to the rules
    const char* identifier;
};

// The POSIX strings that real systems are given. Without a zone of the database their summer time would be
// lost.
constexpr std::array kPosixZones{
    PosixZone{"WET0WEST", "Europe/Lisbon"},       PosixZone{"GMT0BST", "Europe/London"},
    PosixZone{"GMT0IST", "Europe/Dublin"},        PosixZone{"IST-1GMT0", "Europe/Dublin"},
    PosixZone{"CET-1CEST", "Europe/Paris"},       PosixZone{"MET-1MEST", "Europe/Paris"},
    PosixZone{"EET-2EEST", "Europe/Helsinki"},    PosixZone{"IST-2IDT", "Asia/Jerusalem"},
    PosixZone{"NST3:30NDT", "America/St_Johns"},  PosixZone{"AST4ADT", "America/Halifax"},
    PosixZone{"EST5EDT", "America/New_York"},     PosixZone{"CST6CDT", "America/Chicago"},
    PosixZone{"MST7MDT", "America/Denver"},       PosixZone{"PST8PDT", "America/Los_Angeles"},
    PosixZone{"AKST9AKDT", "America/Anchorage"},  PosixZone{"HST10HDT", "America/Adak"},
    PosixZone{"AEST-10AEDT", "Australia/Sydney"}, PosixZone{"ACST-9:30ACDT", "Australia/Adelaide"},
    PosixZone{"NZST-12NZDT", "Pacific/Auckland"},
};

/// The number at the front of the text, at most two digits, or -1.
int takeNumber(std::string_view& text) {
    int value = -1;
    for (int digits = 0; digits < 2 && !text.empty() && text.front() >= '0' && text.front() <= '9';
         ++digits) {
        value = (value < 0 ? 0 : value) * 10 + (text.front() - '0');
        text.remove_prefix(1);
    }
    return value;
}

/// The name of standard time at the front: three letters or more, or anything in angle brackets.
bool skipAbbreviation(std::string_view& text) {
    if (text.starts_with('<')) {
        const size_t end = text.find('>');
        if (end == std::string_view::npos) return false;
        text.remove_prefix(end + 1);
        return true;
    }
    size_t letters = 0;
    while (letters < text.size() && std::isalpha(static_cast<unsigned char>(text[letters]))) ++letters;
    text.remove_prefix(letters);
    return letters >= 3;
}

/// The zone of a POSIX string such as "CET-1CEST,M3.5.0,M10.5.0/3", whose offsets count westward.
std::optional<std::string> zoneOfPosixString(std::string_view text) {
    const std::string_view names = text.substr(0, text.find(','));
    for (const PosixZone& zone : kPosixZones)
        if (zone.text == names) return zone.identifier;

    if (!skipAbbreviation(text)) return std::nullopt;
    const bool eastward = text.starts_with('-');
    if (eastward || text.starts_with('+')) text.remove_prefix(1);
    const int hours = takeNumber(text);
    int minutes = 0;
    if (text.starts_with(':')) {
        text.remove_prefix(1);
        minutes = takeNumber(text);
    }
    if (hours < 0 || hours > 23 || minutes < 0 || minutes > 59) return std::nullopt;
    if (hours == 0 && minutes == 0) return kFallbackZone;
    std::array<char, 16> result{};
    std::snprintf(result.data(), result.size(), "GMT%c%02d:%02d", eastward ? '+' : '-', hours, minutes);
    return result.data();
}

std::string zoneOfVariable(std::string value) {
    if (value.starts_with(':')) value.erase(0, 1);
    if (value.starts_with('/')) return zoneOfPath(value).value_or(kFallbackZone);
    if (isKnownZone(value)) return value;
    return zoneOfPosixString(value).value_or(kFallbackZone);  // what is no zone is UTC, as for the C library
}

/// The link may point at another link: the first target that names a zone counts.
std::optional<std::string> zoneOfLink(std::filesystem::path path) {
    for (int hops = 0; hops < 8; ++hops) {
        std::error_code error;
        const std::filesystem::path target = std::filesystem::read_symlink(path, error);
        if (error) return std::nullopt;
        if (auto zone = zoneOfPath(target.string())) return zone;
        path = target.is_absolute() ? target : path.parent_path() / target;
    }
    return std::nullopt;
}

std::optional<std::string> zoneOfFile(const std::filesystem::path& path) {
    std::ifstream file(path);
    std::string line;
    if (!std::getline(file, line)) return std::nullopt;
    while (!line.empty() && std::isspace(static_cast<unsigned char>(line.back()))) line.pop_back();
    if (!isKnownZone(line)) return std::nullopt;
    return line;
}

/// Assignments as a shell would read them, the way both files are written.
VSLocaleVariables variablesOfFile(const std::filesystem::path& path) {
    VSLocaleVariables variables;
    std::ifstream file(path);
    for (std::string line; std::getline(file, line);) {
        std::string_view text = line;
        while (!text.empty() && std::isspace(static_cast<unsigned char>(text.front()))) text.remove_prefix(1);
        while (!text.empty() && std::isspace(static_cast<unsigned char>(text.back()))) text.remove_suffix(1);
        if (text.starts_with("export ")) text.remove_prefix(7);
        variables.assign(text);
    }
    return variables;
}

}  // namespace

void VSLocaleVariables::assign(std::string_view assignment) {
    const size_t equals = assignment.find('=');
    if (equals == std::string_view::npos) return;
    const std::string_view name = assignment.substr(0, equals);
    std::string_view value = assignment.substr(equals + 1);
    if (value.size() >= 2 && (value.front() == '"' || value.front() == '\'') && value.back() == value.front())
        value = value.substr(1, value.size() - 2);
    if (name == "LC_ALL") all = value;
    if (name == "LC_TIME") time = value;
    if (name == "LANG") language = value;
}

VSLocaleVariables VSLocaleVariablesOfProcess() {
    const auto value = [](const char* name) {
        const char* found = std::getenv(name);
        return std::string(found ? found : "");
    };
    return {value("LC_ALL"), value("LC_TIME"), value("LANG")};
}

VSLocaleVariables VSLocaleVariablesOfHost(const std::filesystem::path& etc) {
    const VSLocaleVariables variables = variablesOfFile(etc / "locale.conf");
    return variables.strongest().empty() ? variablesOfFile(etc / "default/locale") : variables;
}

std::string VSTimeZoneFromSystem(const char* tz, const std::filesystem::path& etc) {
    if (tz) return zoneOfVariable(tz);
    if (auto zone = zoneOfLink(etc / "localtime")) return *zone;
    return zoneOfFile(etc / "timezone").value_or(kFallbackZone);
}

std::string VSLocaleFromPOSIX(const char* posix) {
    constexpr const char* kFallbackLocale = "en_US";
    const std::string_view name = posix ? posix : "";
    // language[_REGION][.charset][@modifier]; of the modifiers only a script changes what a person reads.
    const std::string_view base = name.substr(0, name.find_first_of(".@"));
    const std::string_view language = base.substr(0, base.find('_'));
    const bool isWord = std::all_of(language.begin(), language.end(),
                                    [](char c) { return (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z'); });
    if (language.empty() || !isWord || language == "C" || language == "POSIX") return kFallbackLocale;

    std::string identifier(language);
    if (name.ends_with("@latin")) identifier += "_Latn";
    if (name.ends_with("@cyrillic")) identifier += "_Cyrl";
    if (name.ends_with("@devanagari")) identifier += "_Deva";
    identifier += base.substr(language.size());
    const icu::Locale locale = icu::Locale::createCanonical(identifier.c_str());
    if (locale.isBogus() || !*locale.getLanguage()) return kFallbackLocale;
    return locale.getName();
}
