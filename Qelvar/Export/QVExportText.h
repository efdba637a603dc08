#pragma once

#include <array>
#include <string>

#include "Vessa/Base/VSDate.h"

// The texts of an export. None of them depends on a locale: digits are always 0 to 9 and years those of the
// Gregorian calendar, so that a time means the same wherever the document is read. Pure functions; any
// thread.

/// "%g": six significant digits, without trailing zeros.
std::string QVExportNumberText(double number);
/// All digits that it takes to read the same number back: "41.5", "100000", "1e+300".
std::string QVExportDefaultNumberText(double number);

/// Dates, all with one offset from Greenwich: that of the user's zone at the moment of the export, also for
/// dates on the other side of a change of the clocks. Fractions of seconds are dropped. Used by one thread.
class QVExportDateFormatter {
 public:
    /// An offset that is no whole number of minutes cannot be written; it becomes one.
    explicit QVExportDateFormatter(int secondsFromGMT);
    /// "yyyy-MM-dd HH:mm:ss ZZZ": "2015-03-20 17:15:00 -0700". Valid until the next call.
    const char* recordsString(VSDate date);
    /// "yyyyMMddHHmmssZZZ": "20150320171500-0700". Valid until the next call.
    const char* clinicalString(VSDate date);

 private:
    struct Fields {
        int64_t year;
        int month, day, hour, minute, second;
    };
    Fields fieldsOf(VSDate date) const;

    const int64_t offset_;        // microseconds
    std::array<char, 8> zone_{};  // "-0700"
    std::array<char, 48> buffer_{};
};
