#pragma once

#include <filesystem>
#include <string>

// How the system says which zone and locale the user has. Apart from VSSystemEnvironment so that tests can
// give their own variables and folder. Pure functions of their arguments and the files; any thread.

/// The zone that the variable TZ names (null: not set), else the one that `etc`/localtime links to, else the
/// one in `etc`/timezone, else "Etc/UTC". A POSIX string gives the zone of its well-known abbreviations, or
/// the fixed offset of its standard time.
std::string VSTimeZoneFromSystem(const char* tz, const std::filesystem::path& etc);

/// The ICU locale of a POSIX one: "da_DK.UTF-8" is "da_DK"; "C", "POSIX" and what names no language are
/// "en_US".
std::string VSLocaleFromPOSIX(const char* posix);
