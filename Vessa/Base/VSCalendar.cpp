#include "Vessa/Base/VSCalendar.h"

#include <unicode/gregocal.h>
#include <unicode/locid.h>

#include <cassert>
#include <map>
#include <mutex>

#include "Vessa/Base/VSCivil.h"
#include "Vessa/Base/VSEnvironment.h"
#include "Vessa/Base/VSZoneTable.h"

using namespace civil;

namespace {

struct LocalTime {
    CivilDay day;
    int64_t timeOfDay;  // microseconds since the clock showed midnight
};

LocalTime localTime(const VSZoneTable& zone, VSDate date) {
    const int64_t local = date.microseconds() + zone.offsetAt(date.microseconds());
    const int64_t days = floorDivide(local, kDay);
    return {civilFromDays(days), local - days * kDay};
}

VSDate startOfDay(const VSZoneTable& zone, const CivilDay& day) {
    return VSDate::fromMicroseconds(zone.startOfDay(daysFromCivil(day)));
}

CivilDay dayOf(const VSZoneTable& zone, VSDate date) {
    return civilFromDays(zone.dayOf(date.microseconds()));
}

int64_t dayBefore(const VSZoneTable& zone, VSDate date) {
    return zone.dayOf(zone.startOfDay(zone.dayOf(date.microseconds())) - 1);
}

VSDate noon(const VSZoneTable& zone, int64_t day) {
    return VSDate::fromMicroseconds(zone.instantOfLocal(day * kDay + kDay / 2));
}

/// A start of a day stays one: the clock may show one o'clock then, but on the day that is meant it will not.
VSDate addToDay(const VSZoneTable& zone, VSDate date, int64_t months, int64_t days) {
    const CivilDay day = dayOf(zone, date);
    if (startOfDay(zone, day) == date)
        return VSDate::fromMicroseconds(zone.startOfDay(daysFromCivil(addMonthsToDay(day, months)) + days));
    const LocalTime local = localTime(zone, date);
    const int64_t dayNumber = daysFromCivil(addMonthsToDay(local.day, months)) + days;
    return VSDate::fromMicroseconds(zone.instantOfLocal(dayNumber * kDay + local.timeOfDay));
}

/// Adds factor times the components. 64 bits, since a factor counts the buckets since an anchor long ago.
VSDate addTimes(const VSZoneTable& zone, VSDate date, const VSDateComponents& components, int64_t factor) {
    const int64_t months = (int64_t{components.years} * 12 + components.months) * factor;
    const int64_t days = components.days * factor;
    // An addition of nothing would take the second of two equal local times to the first.
    if (months != 0 || days != 0) date = addToDay(zone, date, months, days);
    const int64_t seconds =
        int64_t{components.hours} * 3600 + int64_t{components.minutes} * 60 + components.seconds;
    return date + VSDuration(seconds * factor * kSecond);
}

double approximateLength(const VSDateComponents& c) {
    constexpr double kMeanYear = 365.2425 * 86'400;
    const double seconds = (c.years + c.months / 12.0) * kMeanYear + c.days * 86'400.0 + c.hours * 3600.0 +
                           c.minutes * 60.0 + c.seconds;
    return seconds * kSecond;
}

/// What a locale says about weeks.
struct Week {
    int firstDay = 1;
    std::vector<int> weekend;
};

const Week& weekOfLocale(const std::string& identifier) {
    static std::mutex mutex;
    static auto* weeks = new std::map<std::string, Week>;  // entries never change: references stay good
    std::lock_guard lock(mutex);
    const auto known = weeks->find(identifier);
    if (known != weeks->end()) return known->second;

    Week week;
    UErrorCode status = U_ZERO_ERROR;
    const icu::GregorianCalendar calendar(icu::Locale(identifier.c_str()), status);
    if (U_SUCCESS(status)) week.firstDay = calendar.getFirstDayOfWeek(status);
    for (int day = UCAL_SUNDAY; U_SUCCESS(status) && day <= UCAL_SATURDAY; ++day)
        if (calendar.getDayOfWeekType(static_cast<UCalendarDaysOfWeek>(day), status) != UCAL_WEEKDAY)
            week.weekend.push_back(day);
    return weeks->emplace(identifier, std::move(week)).first->second;
}

}  // namespace

VSDateComponents VSDateComponents::operator*(int factor) const {
    return {years * factor, months * factor,  days * factor,
            hours * factor, minutes * factor, seconds * factor};
}

VSCalendar VSCalendar::current() {
    const auto environment = VSEnvironment::current();
    return VSCalendar(environment->timeZoneIdentifier(), environment->localeIdentifier());
}

VSCalendar::VSCalendar(std::string timeZone, std::string locale)
    : timeZone_(std::move(timeZone)), locale_(std::move(locale)) {}

VSDate VSCalendar::startOfDay(VSDate date) const {
    const auto zone = VSZoneTable::forZone(timeZone_);
    return ::startOfDay(*zone, dayOf(*zone, date));
}

VSDate VSCalendar::yesterdayAtNoon(VSDate date) const {
    const auto zone = VSZoneTable::forZone(timeZone_);
    return noon(*zone, dayBefore(*zone, date));
}

VSDate VSCalendar::noonOfDay(VSDate date) const {
    const auto zone = VSZoneTable::forZone(timeZone_);
    return noon(*zone, zone->dayOf(date.microseconds()));
}

VSDate VSCalendar::add(VSDate date, const VSDateComponents& components) const {
    return addTimes(*VSZoneTable::forZone(timeZone_), date, components, 1);
}

VSDate VSCalendar::addDays(VSDate date, int days) const {
    return add(date, {.days = days});
}

VSDate VSCalendar::addMonths(VSDate date, int months) const {
    return add(date, {.months = months});
}

VSDate VSCalendar::startOfMonth(VSDate date) const {
    const auto zone = VSZoneTable::forZone(timeZone_);
    CivilDay day = dayOf(*zone, date);
    day.day = 1;
    return ::startOfDay(*zone, day);
}

VSDate VSCalendar::middleOfMonth(VSDate date) const {
    const auto zone = VSZoneTable::forZone(timeZone_);
    CivilDay day = dayOf(*zone, date);
    day.day = 1;
    return VSMidDate(::startOfDay(*zone, day), ::startOfDay(*zone, addMonthsToDay(day, 1)));
}

VSDate VSCalendar::startOfHour(VSDate date) const {
    const auto zone = VSZoneTable::forZone(timeZone_);
    const VSDate fullHour = date - VSDuration(localTime(*zone, date).timeOfDay % kHour);
    // Behind a change of the clock the hour begins with the change: in the second of two equal hours, and
    // where the clock jumped into the middle of an hour.
    return std::max(fullHour, VSDate::fromMicroseconds(zone->lastChangeAt(date.microseconds())));
}

int VSCalendar::component(VSCalendarUnit unit, VSDate date) const {
    const LocalTime local = localTime(*VSZoneTable::forZone(timeZone_), date);
    switch (unit) {
        case VSCalendarUnit::Era:
            return local.day.year > 0 ? 1 : 0;
        case VSCalendarUnit::Year:
            return static_cast<int>(local.day.year > 0 ? local.day.year : 1 - local.day.year);
        case VSCalendarUnit::Month:
            return local.day.month;
        case VSCalendarUnit::Day:
            return local.day.day;
        case VSCalendarUnit::Hour:
            return static_cast<int>(local.timeOfDay / kHour);
        case VSCalendarUnit::Minute:
            return static_cast<int>(local.timeOfDay / kMinute % 60);
        case VSCalendarUnit::Second:
            return static_cast<int>(local.timeOfDay / kSecond % 60);
        case VSCalendarUnit::Weekday:
            return weekdayOfDays(daysFromCivil(local.day));
    }
    return 0;
}

std::optional<VSDate> VSCalendar::date(int year, int month, int day, int hour, int minute, int second) const {
    if (month < 1 || month > 12 || day < 1 || day > daysInMonth(year, month)) return std::nullopt;
    if (hour < 0 || hour > 23 || minute < 0 || minute > 59 || second < 0 || second > 59) return std::nullopt;
    if (year < -kYearLimit || year > kYearLimit) return std::nullopt;
    const auto zone = VSZoneTable::forZone(timeZone_);
    const CivilDay civil{year, month, day};
    const int64_t timeOfDay = hour * kHour + minute * kMinute + second * kSecond;
    if (timeOfDay == 0) return ::startOfDay(*zone, civil);
    return VSDate::fromMicroseconds(zone->instantOfLocal(daysFromCivil(civil) * kDay + timeOfDay));
}

int VSCalendar::wholeYearsBetween(VSDate from, VSDate to) const {
    if (to < from) return -wholeYearsBetween(to, from);
    const auto zone = VSZoneTable::forZone(timeZone_);
    auto years = static_cast<int>(localTime(*zone, to).day.year - localTime(*zone, from).day.year);
    while (years > 0 && addTimes(*zone, from, {.years = years}, 1) > to) --years;
    return years;
}

bool VSCalendar::isSameDay(VSDate a, VSDate b) const {
    const auto zone = VSZoneTable::forZone(timeZone_);
    return zone->dayOf(a.microseconds()) == zone->dayOf(b.microseconds());
}

bool VSCalendar::isToday(VSDate date) const {
    return isSameDay(date, VSEnvironment::current()->now());
}

bool VSCalendar::isYesterday(VSDate date) const {
    const auto zone = VSZoneTable::forZone(timeZone_);
    return zone->dayOf(date.microseconds()) == dayBefore(*zone, VSEnvironment::current()->now());
}

std::vector<int> VSCalendar::weekendDays() const {
    return weekOfLocale(locale_).weekend;
}

int VSCalendar::firstWeekday() const {
    return weekOfLocale(locale_).firstDay;
}

int VSCalendar::secondsFromGMT(VSDate date) const {
    return static_cast<int>(VSZoneTable::forZone(timeZone_)->offsetAt(date.microseconds()) / kSecond);
}

std::vector<VSDate> VSCalendar::bucketBoundaries(VSDate anchor, const VSDateComponents& interval,
                                                 VSDate start, VSDate end) const {
    const double length = approximateLength(interval);
    assert(length > 0 && start < end);
    if (!(length > 0) || !(start < end)) return {};

    const auto zone = VSZoneTable::forZone(timeZone_);
    const auto boundary = [&](int64_t n) { return addTimes(*zone, anchor, interval, n); };
    auto n = static_cast<int64_t>(static_cast<double>((start - anchor).count()) / length);
    while (boundary(n) > start) --n;
    while (boundary(n + 1) <= start) ++n;

    std::vector<VSDate> boundaries;
    boundaries.reserve(static_cast<size_t>(static_cast<double>((end - start).count()) / length) + 3);
    boundaries.push_back(boundary(n));
    while (boundaries.back() < end) {
        const VSDate next = boundary(++n);
        // A day that a zone left out has no length and is no bucket.
        if (next > boundaries.back()) boundaries.push_back(next);
    }
    return boundaries;
}
