#pragma once

#include <QString>
#include <string>

#include "Vessa/Base/VSDate.h"

enum class QVDateStyle { None, Short, Medium, Long, Full };

/// Dates as text in the user's locale, zone and hour cycle, as these are at the call. Plain value; any
/// thread.
class QVDateFormatter {
 public:
    /// A pattern as it stands ("H").
    static QVDateFormatter withPattern(std::string pattern);
    /// The locale's own pattern for these fields ("MMM d, j:mm a"); "j" stands for the hour in the user's
    /// cycle, with the marker of the half day where that is a 12-hour one.
    static QVDateFormatter withTemplate(std::string fields);
    static QVDateFormatter withStyles(QVDateStyle dateStyle, QVDateStyle timeStyle);

    QString stringFromDate(VSDate date) const;
    /// The pattern it comes to now.
    QString pattern() const;

 private:
    enum class Kind { Pattern, Template, Styles };
    std::u16string resolvedPattern() const;
    std::string cacheKey() const;

    QVDateFormatter(Kind kind, std::string text, QVDateStyle dateStyle, QVDateStyle timeStyle)
        : kind_(kind), text_(std::move(text)), dateStyle_(dateStyle), timeStyle_(timeStyle) {}
    Kind kind_;
    std::string text_;
    QVDateStyle dateStyle_, timeStyle_;
};

/// "3 PM"; "15" on a 24-hour clock.
QVDateFormatter QVHourOfDayFormatter();
QVDateFormatter QVShortDateFormatter();
QVDateFormatter QVMediumDateFormatter();
QVDateFormatter QVMediumDateTimeFormatter();
/// "3:04 PM".
QVDateFormatter QVTimeOfDayFormatter();
/// "Mar 31, 3:04 PM".
QVDateFormatter QVMonthDayTimeFormatter();

/// A date of the last twelve months as month, day and time; an earlier one with its year.
QString QVRecentDateString(VSDate date);
/// When something was last updated: "Today, 3:04 PM", "Yesterday, 3:04 PM"; before that the numeric date and
/// time, with the year unless it is this one.
QString QVLastUpdatedString(VSDate date);
