#pragma once

#include <filesystem>
#include <string>
#include <string_view>

// How the system says which zone and locale the user has. Apart from VSSystemEnvironment so that tests can
// give their own variables and folder. Pure functions of their arguments and the files; any thread.

/// The zone that the variable TZ names (null: not set), else the one that `etc`/localtime links to, else the
/// one in `etc`/timezone, else "Etc/UTC". A POSIX string gives the zone of its well-known abbreviations, or
/// the fixed offset of its standard time.
std::string VSTimeZoneFromSystem(const char* tz, const std::filesystem::path& etc);

/// The settings of a locale, as the process's environment and the host's files have them; empty: not set.
struct VSLocaleVariables {
    std::string all, time, language;  // LC_ALL, LC_TIME, LANG

    /// The one that counts: POSIX; empty: none is set.
    const std::string& strongest() const { return !all.empty() ? all : !time.empty() ? time : language; }
    /// Takes one of "LANG=de_DE.UTF-8"; other names are left alone.
    void assign(std::string_view assignment);
    friend bool operator==(const VSLocaleVariables&, const VSLocaleVariables&) = default;
};
VSLocaleVariables VSLocaleVariablesOfProcess();
/// Those of `etc`/locale.conf, or where that sets none, of `etc`/default/locale.
VSLocaleVariables VSLocaleVariablesOfHost(const std::filesystem::path& etc);

/// The ICU locale of a POSIX one: "da_DK.UTF-8" is "da_DK"; "C", "POSIX" and what names no language are
/// "en_US".
std::string VSLocaleFromPOSIX(const char* posix);
