#include "Qelvar/DataProviders/QVChartSeriesFactory.h"

#include <chrono>

#include "Platform/Appearance.h"
#include "Platform/StyledText.h"
#include "Qelvar/Charts/QVBarSeries.h"
#include "Qelvar/Charts/QVCenteredHorizontalLineSeries.h"
#include "Qelvar/Charts/QVLineSeries.h"
#include "Qelvar/Charts/QVMinMaxSeries.h"
#include "Qelvar/Charts/QVStackedHorizontalLineSeries.h"
#include "Qelvar/Formatters/QVDataUnitGroupLabels.h"

namespace {

constexpr double lineSeriesWidth = 1.0;
constexpr double barWidth = 5.0;
constexpr double barBottomPadding = 8.0;
constexpr double periodLineWidth = 5.0;
constexpr double stackedLabelSize = 10.0;

QColor white(float alpha = 1.0f) {
    return QColor::fromRgbF(1, 1, 1, alpha);
}
QColor black(float alpha = 1.0f) {
    return QColor::fromRgbF(0, 0, 0, alpha);
}
/// Over the card's colour its light is less than half of what lies between that and white: with high
/// contrast, where it is laid on plainly, it stands out from the card by 3 to 1 and white lines on it do too.
constexpr float highContrastFill = 0.42f;
/// Blended into the card a fill cannot reach 3 to 1; its edge does, on the colours of every category.
constexpr float edgeOpacity = 0.75f;

QColor fillColor() {
    return white(platform::highContrast() ? highContrastFill : 0.5f);
}
QColor edgeColor() {
    return white(platform::highContrast() ? 1.0f : edgeOpacity);
}

struct PointLook {
    QVPointStyle style;
    double radius, lineWidth;
};

std::shared_ptr<QVLineSeries> lineSeries(const PointLook& look, bool withLine) {
    auto series = std::make_shared<QVLineSeries>();
    series->setLineWidth(lineSeriesWidth);
    series->setWaveForm(QVLineSeries::WaveForm::SawTooth);
    series->setPointRadius(look.radius);
    series->setPointLineWidth(look.lineWidth);
    series->setPointStyle(look.style);
    const bool fades = !platform::highContrast();
    // With high contrast there is no shade under a gap, which is told by its dashes, and no fill that fades.
    if (fades) series->setSecondaryFillGradient(QVGradientObject::gradientWithTopColor(black(), black(0)));
    if (withLine) {
        series->setLineColor(white());
        series->setFillGradient(fades ? QVGradientObject::gradientWithTopColor(white(0.8f), white(0))
                                      : QVGradientObject::gradientWithTopColor(fillColor(), fillColor()));
    }
    return series;
}

std::shared_ptr<QVMinMaxSeries> minMaxSeries(const PointLook& look) {
    auto series = std::make_shared<QVMinMaxSeries>();
    series->setMinPointStyle(look.style);
    series->setMaxPointStyle(look.style);
    series->setPointRadius(look.radius);
    series->setPointLineWidth(look.lineWidth);
    series->setFillColor(fillColor());
    series->setEdgeColor(edgeColor());
    return series;
}

std::shared_ptr<QVBarSeries> barSeries() {
    auto series = std::make_shared<QVBarSeries>();
    series->setBarWidth(barWidth);
    series->setLineCapStyle(QVLineCapStyle::Round);
    series->setFillColor(fillColor());
    series->setEdgeColor(edgeColor());
    series->setBottomPadding(barBottomPadding);
    return series;
}

std::shared_ptr<QVCenteredHorizontalLineSeries> centeredSeries() {
    auto series = std::make_shared<QVCenteredHorizontalLineSeries>();
    series->setFillColor(fillColor());
    series->setEdgeColor(edgeColor());
    series->setAccentColor(white());
    series->setLineWidth(periodLineWidth);
    return series;
}

std::shared_ptr<QVStackedHorizontalLineSeries> stackedSeries(const VSDataUnitGroup* group) {
    auto series = std::make_shared<QVStackedHorizontalLineSeries>();
    series->setFillColor(fillColor());
    series->setEdgeColor(edgeColor());
    series->setLineWidth(periodLineWidth);
    series->setLabelFont(platform::systemFont(stackedLabelSize));
    series->setLabelColor(white());
    series->setEnumeratedValueOrder(qv_valueOrderForStackedCharts(group));
    series->setValueLabels(qv_enumeratedValueLabels(group));
    return series;
}

std::shared_ptr<QVChartSeries> seriesOfStyle(VSChartStyle style, const PointLook& look,
                                             const VSDataUnitGroup* group) {
    switch (style) {
        case VSChartStyle::None:
            return nullptr;
        case VSChartStyle::Line:
            return lineSeries(look, true);
        case VSChartStyle::Points:
            return lineSeries(look, false);
        case VSChartStyle::MinMax:
            return minMaxSeries(look);
        case VSChartStyle::Bars:
            return barSeries();
        case VSChartStyle::Periods:
        case VSChartStyle::CenteredLine:
            return centeredSeries();
        case VSChartStyle::StackedPeriods:
            return stackedSeries(group);
    }
    return nullptr;
}

/// How long a bucket is at least; none: the scope has none.
std::optional<VSDuration> shortestBucket(const VSDateComponents& interval) {
    using namespace std::chrono;
    if (interval.isZero()) return std::nullopt;
    return hours(24 * 365) * interval.years + hours(24 * 28) * interval.months + hours(24) * interval.days +
           hours(interval.hours) + minutes(interval.minutes) + seconds(interval.seconds);
}

}  // namespace

std::vector<std::shared_ptr<const QVChartSeries>> QVChartSeriesForDataUnitGroup(const VSDataUnitGroup* group,
                                                                                QVTimeScope timeScope) {
    const VSDataUnitGroupChartingRules& rules = group->chartingRules();
    const VSTimeScopeIndex scope = QVTimeScopeIndex(timeScope);
    std::vector<std::shared_ptr<const QVChartSeries>> series;
    for (size_t i = 0; i < group->dataUnits().size(); ++i) {
        const PointLook look{QVPointStyleForDataUnitAtIndex(group, i),
                             rules.chartPointRadiusForTimeScope(scope),
                             rules.chartPointLineWidthForTimeScope(scope)};
        const auto one = seriesOfStyle(rules.chartStyleForTimeScope(scope), look, group);
        if (one) one->setPointInterval(shortestBucket(rules.intervalComponentsForTimeScope(scope)));
        series.push_back(one);
    }
    return series;
}

QVPointStyle QVPointStyleForDataUnitAtIndex(const VSDataUnitGroup* group, size_t index) {
    if (group->dataUnitGroupID() == VSGroupID::BloodPressure)
        return index == 0 ? QVPointStyle::DownwardChevron : QVPointStyle::UpwardChevron;
    return index == 0 && group->dataUnits().size() > 1 ? QVPointStyle::Disc : QVPointStyle::Ring;
}
