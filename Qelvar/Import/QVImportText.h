#pragma once

#include <optional>
#include <string>
#include <string_view>

#include "Vessa/Base/VSDate.h"
#include "Vessa/VSHealthStore.h"

// The texts of attributes, read strictly and without any locale. Pure functions; any thread.

struct QVImportDate {
    VSDate date;
    int offset = 0;  // seconds east of Greenwich
    friend bool operator==(const QVImportDate&, const QVImportDate&) = default;
};

/// "2020-03-20 17:15:00 +0100", exactly so; other scripts' digits are taken too, since a writer under an
/// Arabic locale uses them. None when it is not such a text or no such date (30 February, 24:00, an offset
/// beyond 18 hours).
std::optional<QVImportDate> QVImportDateFromText(std::string_view text);

/// "1985-07-21". None when it is not such a date.
std::optional<VSBirthDate> QVImportBirthDateFromText(std::string_view text);

/// A finite decimal number with a point ("72", "-0.5", "1.23457e+06"), the whole text. None for all else.
std::optional<double> QVImportNumberFromText(std::string_view text);

/// What a metadata entry's text means: a text, but yes or no under those keys of which the application itself
/// asks for yes or no.
VSValue QVMetadataValueFromText(std::string_view key, std::string_view text);

/// The text for a message: quoted, control characters as blanks, cut after `length` bytes at a character's
/// border.
std::string QVImportQuoted(std::string_view text, size_t length = 80);
