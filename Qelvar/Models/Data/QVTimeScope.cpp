#include "Qelvar/Models/Data/QVTimeScope.h"

#include <array>
#include <cassert>

#include "Platform/Localization.h"
#include "Vessa/Base/VSCalendar.h"

namespace {

constexpr bool isTimeScope(QVTimeScope timeScope) {
    return timeScope >= QVTimeScope::Hour && timeScope <= QVTimeScope::Year;
}

QVDateSpan spanOfDays(const VSCalendar& calendar, VSDate anchor, int days, bool noon) {
    const VSDate today = calendar.startOfDay(anchor);
    const QVDateSpan span{calendar.addDays(today, 1 - days), calendar.addDays(today, 1)};
    return noon ? QVDateSpan{calendar.yesterdayAtNoon(span.start), calendar.yesterdayAtNoon(span.end)} : span;
}

// From the first of the month eleven months before the anchor's.
QVDateSpan spanOfYear(const VSCalendar& calendar, VSDate anchor, bool noon) {
    const VSDate month = calendar.startOfMonth(anchor);
    const VSDate start = calendar.addMonths(month, -11), end = calendar.addMonths(month, 1);
    constexpr auto aSecond = std::chrono::seconds(1);
    return noon ? QVDateSpan{calendar.noonOfDay(start), calendar.noonOfDay(end) - aSecond}
                : QVDateSpan{start, end - aSecond};
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

std::optional<QVDateSpan> QVTimeScopeSpan(QVTimeScope timeScope, VSDate anchor, bool noon) {
    const VSCalendar calendar = VSCalendar::current();
    switch (timeScope) {
        case QVTimeScope::Day:
            return spanOfDays(calendar, anchor, 1, noon);
        case QVTimeScope::Week:
            return spanOfDays(calendar, anchor, 7, noon);
        case QVTimeScope::Month:
            return spanOfDays(calendar, anchor, 31, noon);
        case QVTimeScope::Year:
            return spanOfYear(calendar, anchor, noon);
        default:
            return std::nullopt;
    }
}
