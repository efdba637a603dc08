#pragma once

#include <array>
#include <optional>
#include <utility>
#include <vector>

#include "Vessa/Base/VSCalendar.h"
#include "Vessa/VSUnit.h"
#include "VessaUI/VSTimeScopeIndex.h"

/// Numbers of the chart styles.
enum class VSChartStyle {
    None = 0,
    Line = 1,
    Points = 2,
    MinMax = 3,
    Bars = 4,
    Periods = 5,
    StackedPeriods = 6,
    CenteredLine = 7
};

/// How a display type is charted, per time scope.
class VSDataUnitGroupChartingRules {
 public:
    /// The bucket of a point. Zero components: the scope has none (hour).
    VSDateComponents intervalComponentsForTimeScope(VSTimeScopeIndex timeScope) const;
    VSChartStyle chartStyleForTimeScope(VSTimeScopeIndex timeScope) const;
    VSChartStyle defaultChartStyle() const;
    /// In points of the layout.
    double chartPointRadiusForTimeScope(VSTimeScopeIndex timeScope) const;
    double chartPointLineWidthForTimeScope(VSTimeScopeIndex timeScope) const;
    bool shouldStartDayAtNoon() const { return startDayAtNoon_; }
    bool shouldHideAverageLine() const { return hideAverageLine_; }
    /// The number of fraction digits that values in the unit are shown and entered with.
    int allowedDecimalPrecisionForUnit(const VSUnit& unit) const;

    struct Bounds {
        std::optional<double> minimum, maximum;
        int decimalPrecision = 0;
    };
    /// Widens a range of data, in `unit` as shown, to the bounds of a chart: round numbers with room for the
    /// data. The number of fraction digits is what the round numbers need. Bars always stand on 0. No bounds
    /// when the data is not finite or minimum > maximum.
    Bounds calculateAdjustedBounds(double minimum, double maximum, const VSUnit& unit) const;

 private:
    friend struct VSDataUnitGroupCatalogue;
    Bounds boundsFromZero(double maximum, int precision) const;
    Bounds boundsAround(double minimum, double maximum, int precision) const;

    std::array<VSDateComponents, 5> intervals_{};
    std::array<VSChartStyle, 5> styles_{};
    std::array<double, 5> pointRadius_{};
    std::array<double, 5> pointLineWidth_{};
    VSChartStyle defaultStyle_ = VSChartStyle::None;
    bool startDayAtNoon_ = false;
    bool hideAverageLine_ = false;
    std::optional<double> ceiling_;                   // what a value can never exceed: 100 for percentages
    std::vector<std::pair<VSUnit, int>> precisions_;  // per unit that the user may choose
};
