#pragma once

#include <algorithm>
#include <array>
#include <cstdint>

/// Days of the proleptic Gregorian calendar, as numbers since 1970-01-01 and as year, month and day. Years
/// are astronomical: 0 is 1 BC. Unlike std::chrono's these hold for the whole range of VSDate.
namespace civil {

inline constexpr int64_t kSecond = 1'000'000;  // in the microseconds of VSDate
inline constexpr int64_t kMinute = 60 * kSecond;
inline constexpr int64_t kHour = 60 * kMinute;
inline constexpr int64_t kDay = 24 * kHour;
inline constexpr int kYearLimit = 70'000;  // further away VSDate does not reach

struct CivilDay {
    int64_t year;
    int month;  // 1 to 12
    int day;    // 1 to 31
    friend bool operator==(const CivilDay&, const CivilDay&) = default;
};

constexpr int64_t floorDivide(int64_t a, int64_t b) {
    return a / b - (a % b < 0 ? 1 : 0);
}

constexpr bool isLeapYear(int64_t year) {
    return year % 4 == 0 && (year % 100 != 0 || year % 400 == 0);
}

constexpr int daysInMonth(int64_t year, int month) {
    constexpr std::array kDays{31, 28, 31, 30, 31, 30, 31, 31, 30, 31, 30, 31};
    return month == 2 && isLeapYear(year) ? 29 : kDays[static_cast<size_t>(month - 1)];
}

// Both count in eras of 400 years that begin on 1 March, so that the leap day is the last of its year.
constexpr int64_t kDaysOfEra = 146'097;
constexpr int64_t kDaysTo1970 = 719'468;  // from 0000-03-01

constexpr int64_t daysFromCivil(const CivilDay& civil) {
    const int64_t year = civil.year - (civil.month <= 2 ? 1 : 0);
    const int64_t era = floorDivide(year, 400);
    const int64_t yearOfEra = year - era * 400;
    const int64_t dayOfYear = (153 * (civil.month + (civil.month > 2 ? -3 : 9)) + 2) / 5 + civil.day - 1;
    const int64_t dayOfEra = yearOfEra * 365 + yearOfEra / 4 - yearOfEra / 100 + dayOfYear;
    return era * kDaysOfEra + dayOfEra - kDaysTo1970;
}

constexpr CivilDay civilFromDays(int64_t days) {
    days += kDaysTo1970;
    const int64_t era = floorDivide(days, kDaysOfEra);
    const int64_t dayOfEra = days - era * kDaysOfEra;
    const int64_t yearOfEra = (dayOfEra - dayOfEra / 1460 + dayOfEra / 36'524 - dayOfEra / 146'096) / 365;
    const int64_t dayOfYear = dayOfEra - (365 * yearOfEra + yearOfEra / 4 - yearOfEra / 100);
    const int64_t marchMonth = (5 * dayOfYear + 2) / 153;
    const auto day = static_cast<int>(dayOfYear - (153 * marchMonth + 2) / 5 + 1);
    const auto month = static_cast<int>(marchMonth < 10 ? marchMonth + 3 : marchMonth - 9);
    return {yearOfEra + era * 400 + (month <= 2 ? 1 : 0), month, day};
}

/// 1 Sunday to 7 Saturday; 1970-01-01 was a Thursday.
constexpr int weekdayOfDays(int64_t days) {
    return static_cast<int>(days + 4 - floorDivide(days + 4, 7) * 7) + 1;
}

/// The same day of a later or earlier month, or the last one of a month that is too short for it.
constexpr CivilDay addMonthsToDay(const CivilDay& from, int64_t months) {
    const int64_t month = from.year * 12 + (from.month - 1) + months;
    const int64_t year = floorDivide(month, 12);
    const auto monthOfYear = static_cast<int>(month - year * 12) + 1;
    return {year, monthOfYear, std::min(from.day, daysInMonth(year, monthOfYear))};
}

}  // namespace civil
