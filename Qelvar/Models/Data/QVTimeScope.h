#pragma once

#include <QString>
#include <cstdint>
#include <optional>

#include "Vessa/Base/VSDate.h"
#include "VessaUI/VSDateZoom.h"
#include "VessaUI/VSTimeScopeIndex.h"

/// The span of time that a chart shows. The numbers are kept in the dashboard's restoration state; never
/// reused. A number that is none of these may be cast to it and is treated as "no time scope" by all
/// functions below.
enum class QVTimeScope : int64_t { Hour = 0, Day = 1, Week = 2, Month = 3, Year = 4 };
inline constexpr int QVTimeScopeCount = 5;

constexpr VSTimeScopeIndex QVTimeScopeIndex(QVTimeScope timeScope) {
    return static_cast<VSTimeScopeIndex>(timeScope);
}

/// The localised name; a null string for what is no time scope.
QString QVTimeScopeDisplayName(QVTimeScope timeScope);

/// REQUIRES: a time scope.
VSDateZoom QVDateZoomForTimeScope(QVTimeScope timeScope);
/// The hour level shows a day; numbers that are no level mean hour. REQUIRES: not VSDateZoomCount.
QVTimeScope QVTimeScopeForDateZoom(VSDateZoom zoom);

struct QVDateSpan {
    VSDate start, end;
    friend bool operator==(const QVDateSpan&, const QVDateSpan&) = default;
};

/// The span that ends with the anchor's day (or month, for the year), in the user's calendar and zone as they
/// are now. Each border is the start of its day, whatever the clocks do at midnight. With `noon` its days
/// begin at noon, half a day earlier. The end belongs to the next span, but for the year, whose end is its
/// last second. None for hour and for what is no time scope.
std::optional<QVDateSpan> QVTimeScopeSpan(QVTimeScope timeScope, VSDate anchor, bool noon);
