#include "VessaUI/VSDataUnitGroupCatalogue.h"

// How display types are charted, scope by scope (hour, day, week, month, year). The hour scope has no span
// and no bucket; its style and sizes are those of the day.
//
// Sizes: a bucket of the day is about 12 points wide on a phone, of the week 45, of the month 10, of the
// year 25; markers and ranges stay narrower than that.

namespace {

constexpr VSDateComponents noInterval{};
constexpr VSDateComponents quarterHour{.minutes = 15};
constexpr VSDateComponents hour{.hours = 1};
constexpr VSDateComponents day{.days = 1};
constexpr VSDateComponents month{.months = 1};

constexpr std::array<VSDateComponents, 5> hourly{noInterval, hour, day, day, month};
/// Readings taken now and then stand where they were taken; a rollup is a quarter of an hour too.
constexpr std::array<VSDateComponents, 5> spotReadings{noInterval, quarterHour, day, day, month};

constexpr std::array<double, 5> markerRadius{4, 4, 5, 3, 3.5};
constexpr std::array<double, 5> rangeRadius{4, 4, 5, 3, 3.5};
constexpr std::array<double, 5> markerLineWidth{1.5, 1.5, 1.5, 1, 1};

constexpr std::array<VSChartStyle, 5> always(VSChartStyle style) {
    return {style, style, style, style, style};
}
constexpr std::array<VSChartStyle, 5> inDayAndLonger(VSChartStyle inDay, VSChartStyle longer) {
    return {inDay, inDay, longer, longer, longer};
}

constexpr VSChartingProfile profile(VSChartStyle style, const std::array<VSChartStyle, 5>& styles,
                                    const std::array<VSDateComponents, 5>& intervals,
                                    const std::array<double, 5>& radius) {
    return {.style = style,
            .styles = styles,
            .intervals = intervals,
            .pointRadius = radius,
            .pointLineWidth = markerLineWidth};
}

// A day's spans lie in one row or in rows by value: no average of their heights means anything, and the
// flag holds for all scopes of a display type.
constexpr VSChartingProfile withoutAverageLine(VSChartingProfile profile) {
    profile.hideAverageLine = true;
    return profile;
}
constexpr VSChartingProfile fromNoon(VSChartingProfile profile) {
    profile.startDayAtNoon = true;
    return profile;
}

using Style = VSChartStyle;

}  // namespace

namespace VSChartingProfiles {

const VSChartingProfile Bars = profile(Style::Bars, always(Style::Bars), hourly, markerRadius);
const VSChartingProfile Line = profile(Style::Line, always(Style::Line), spotReadings, markerRadius);
const VSChartingProfile MinMax = profile(Style::MinMax, always(Style::MinMax), hourly, rangeRadius);
const VSChartingProfile BasalTemperature =
    profile(Style::Line, {Style::Line, Style::Line, Style::Line, Style::Line, Style::MinMax}, spotReadings,
            markerRadius);
const VSChartingProfile Periods = withoutAverageLine(
    profile(Style::Bars, inDayAndLonger(Style::Periods, Style::Bars), hourly, markerRadius));
const VSChartingProfile NoonPeriods = fromNoon(Periods);
const VSChartingProfile StackedPeriods = withoutAverageLine(
    profile(Style::Bars, inDayAndLonger(Style::StackedPeriods, Style::Bars), hourly, markerRadius));
const VSChartingProfile Presence =
    withoutAverageLine(profile(Style::CenteredLine, always(Style::CenteredLine), hourly, markerRadius));
const VSChartingProfile Counts =
    withoutAverageLine(profile(Style::Bars, always(Style::Bars), hourly, markerRadius));
const VSChartingProfile NotCharted =
    withoutAverageLine(profile(Style::None, always(Style::None), {}, markerRadius));

}  // namespace VSChartingProfiles
