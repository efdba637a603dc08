#pragma once

#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "Vessa/Base/VSDate.h"

/// A calendar interval: so many years, months, days, hours, minutes and seconds, added in this order.
struct VSDateComponents {
    int years = 0;
    int months = 0;
    int days = 0;
    int hours = 0;
    int minutes = 0;
    int seconds = 0;

    friend bool operator==(const VSDateComponents&, const VSDateComponents&) = default;
    bool isZero() const { return *this == VSDateComponents{}; }
    VSDateComponents operator*(int factor) const;
    VSDateComponents operator-() const { return *this * -1; }
};

enum class VSCalendarUnit { Era, Year, Month, Day, Hour, Minute, Second, Weekday };

/// The user's calendar: the Gregorian calendar of a time zone and locale, by ICU. A value made anew for each
/// computation (`VSCalendar::current()`), so that changes of zone and locale are seen; the ICU objects behind
/// it are kept per thread. Any thread.
///
/// Where a local time does not exist (clocks going forward) the first moment after the gap is meant; where it
/// exists twice, the first of the two. Days have no gaps and no overlaps: VSZoneTable says where they start.
class VSCalendar {
 public:
    /// In the zone and locale of VSEnvironment::current().
    static VSCalendar current();
    VSCalendar(std::string timeZone, std::string locale);

    VSDate startOfDay(VSDate date) const;
    /// Noon of the day before the date's day; days that the zone left out are not counted.
    VSDate yesterdayAtNoon(VSDate date) const;
    VSDate noonOfDay(VSDate date) const;
    /// Adds calendar days, whatever their length, and keeps the time of day; the start of a day stays one.
    VSDate add(VSDate date, const VSDateComponents& components) const;
    VSDate addDays(VSDate date, int days) const;
    VSDate addMonths(VSDate date, int months) const;
    VSDate startOfMonth(VSDate date) const;
    /// The instant halfway between the first instant of the date's month and that of the next.
    VSDate middleOfMonth(VSDate date) const;
    VSDate startOfHour(VSDate date) const;
    /// Year, month (1 to 12), day of the month, hour, minute, second, weekday (1 Sunday to 7 Saturday).
    int component(VSCalendarUnit unit, VSDate date) const;
    /// Local date and time to an instant. Months from 1. None when the date does not exist (30 February).
    std::optional<VSDate> date(int year, int month, int day, int hour = 0, int minute = 0,
                               int second = 0) const;
    /// Whole years from one date to a later one, as birthdays count them; negative when `to` is earlier.
    int wholeYearsBetween(VSDate from, VSDate to) const;
    bool isSameDay(VSDate a, VSDate b) const;
    bool isToday(VSDate date) const;
    bool isYesterday(VSDate date) const;
    /// Weekday numbers (1 Sunday) that are weekend in the locale.
    std::vector<int> weekendDays() const;
    int firstWeekday() const;
    /// Seconds east of Greenwich at that moment.
    int secondsFromGMT(VSDate date) const;

    /// The starts of the buckets that cover [start, end): anchor + n * interval for whole n, beginning with
    /// the last one not after `start`, and closed by the first one not before `end`; so n buckets give n + 1
    /// dates. Each start is computed from the anchor, not from its neighbour (31 January plus months keeps
    /// the 31st where it exists). REQUIRES: interval is positive, start < end.
    std::vector<VSDate> bucketBoundaries(VSDate anchor, const VSDateComponents& interval, VSDate start,
                                         VSDate end) const;

    const std::string& timeZoneIdentifier() const { return timeZone_; }
    const std::string& localeIdentifier() const { return locale_; }

 private:
    std::string timeZone_;
    std::string locale_;
};

/// "2020-03-31T20:00", with optional seconds, fraction and offset ("+02:00", "+0200", "Z"); a day alone is
/// its midnight; without an offset the calendar's zone is meant. None when it is not such a date.
std::optional<VSDate> VSDateFromISO8601(std::string_view text, const VSCalendar& calendar);
/// "2020-03-31T20:00:00+02:00", with six decimals of the second only where they are not zero.
std::string VSISO8601FromDate(VSDate date, const VSCalendar& calendar);
