#include "Qelvar/Models/Data/QVTimeScope.h"

#include <array>
#include <cassert>

#include "Platform/Localization.h"
#include "Vessa/Base/VSCalendar.h"

namespace {

constexpr bool isTimeScope(QVTimeScope timeScope) {
    return timeScope >= QVTimeScope::Hour && timeScope <= QVTimeScope::Year;
}

// What is added to the start of a span to get its end; zero components: there is no span.
VSDateComponents spanLength(QVTimeScope timeScope) {
    switch (timeScope) {
        case QVTimeScope::Day:
            return {.days = 1};
        case QVTimeScope::Week:
            return {.days = 7};
        case QVTimeScope::Month:
            return {.days = 31};
        case QVTimeScope::Year:
            return {.years = 1, .seconds = -1};
        case QVTimeScope::Hour:
            break;
    }
    return {};
}

// The first of the month eleven months before the anchor's. Formed from the month's number, so that noon is
// noon whatever happens to the clocks on that day.
VSDate startOfYearSpan(const VSCalendar& calendar, VSDate anchor, bool noon) {
    const VSDate month = calendar.startOfMonth(anchor);
    const VSDate first = noon ? calendar.noonOfDay(month) : month;
    return calendar.add(first, {.years = -1, .months = 1});
}

}  // namespace

QString QVTimeScopeDisplayName(QVTimeScope timeScope) {
    static constexpr std::array<const char*, QVTimeScopeCount> keys{"HOUR", "DAY", "WEEK", "MONTH", "YEAR"};
    return isTimeScope(timeScope) ? platform::localized(keys[static_cast<size_t>(timeScope)]) : QString();
}

VSDateZoom QVDateZoomForTimeScope(QVTimeScope timeScope) {
    assert(isTimeScope(timeScope));
    return static_cast<VSDateZoom>(VSDateZoomCount - 1 - static_cast<int>(timeScope));
}

QVTimeScope QVTimeScopeForDateZoom(VSDateZoom zoom) {
    assert(static_cast<int>(zoom) != VSDateZoomCount);
    switch (zoom) {
        case VSDateZoom::Year:
            return QVTimeScope::Year;
        case VSDateZoom::Month:
            return QVTimeScope::Month;
        case VSDateZoom::Week:
            return QVTimeScope::Week;
        case VSDateZoom::Day:
        case VSDateZoom::Hour:
            return QVTimeScope::Day;
    }
    return QVTimeScope::Hour;
}

std::optional<VSDate> QVTimeScopeSpanEnd(QVTimeScope timeScope, VSDate start) {
    const VSDateComponents length = spanLength(timeScope);
    if (length.isZero()) return std::nullopt;
    return VSCalendar::current().add(start, length);
}

std::optional<QVDateSpan> QVTimeScopeSpan(QVTimeScope timeScope, VSDate anchor, bool noon) {
    const VSCalendar calendar = VSCalendar::current();
    const auto startOfDay = [&] {
        return noon ? calendar.yesterdayAtNoon(anchor) : calendar.startOfDay(anchor);
    };
    VSDate start;
    switch (timeScope) {
        case QVTimeScope::Day:
            start = startOfDay();
            break;
        case QVTimeScope::Week:
            start = calendar.addDays(startOfDay(), -6);
            break;
        case QVTimeScope::Month:
            start = calendar.addDays(startOfDay(), -30);
            break;
        case QVTimeScope::Year:
            start = startOfYearSpan(calendar, anchor, noon);
            break;
        default:
            return std::nullopt;
    }
    return QVDateSpan{start, *QVTimeScopeSpanEnd(timeScope, start)};
}
