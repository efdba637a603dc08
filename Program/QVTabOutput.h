#pragma once

#include <initializer_list>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "Vessa/Base/VSCalendar.h"
#include "Vessa/Base/VSError.h"

/// Rows of tab-separated fields on standard output, the first of them the header. A backslash, tab or line
/// end in a field is written as \\, \t, \n or \r; a field without a value is empty.
class QVTabOutput {
 public:
    QVTabOutput() : calendar_(VSCalendar::current()) {}

    void row(std::initializer_list<std::string_view> fields);
    void row(const std::vector<std::string>& fields);
    /// Writes what is left. Failed: standard output does not take it.
    VSStatus finish();

    /// ISO 8601 in the user's zone.
    std::string date(VSDate date) const { return VSISO8601FromDate(date, calendar_); }
    /// The shortest text that reads back as the same number.
    static std::string number(double value);
    static std::string number(const std::optional<double>& value) {
        return value ? number(*value) : std::string();
    }

 private:
    void append(std::string_view field, bool first);
    void endRow();

    const VSCalendar calendar_;
    std::string buffer_;
    bool failed_ = false;
};
