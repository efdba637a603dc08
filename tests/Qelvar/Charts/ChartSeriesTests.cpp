#include <gtest/gtest.h>

#include <rapidcheck/gtest.h>
#include <QFontMetricsF>

#include "ChartTestSupport.h"
#include "Platform/StyledText.h"
#include "Qelvar/Charts/QVBarSeries.h"
#include "Qelvar/Charts/QVCenteredHorizontalLineSeries.h"
#include "Qelvar/Charts/QVChartDescriptor.h"
#include "Qelvar/Charts/QVLineSeries.h"
#include "Qelvar/Charts/QVMinMaxSeries.h"
#include "Qelvar/Charts/QVStackedDotSeries.h"
#include "Qelvar/Charts/QVStackedHorizontalLineSeries.h"

using namespace test;

namespace {

constexpr int kOpaque = 250;  // as good as opaque, whatever the rounding at edges
constexpr int kClear = 5;

/// A line of one width without markers, so that only the line is there to be seen.
QVLineSeries plainLine(QVLineSeries::WaveForm waveForm = QVLineSeries::WaveForm::SawTooth) {
    QVLineSeries series;
    series.setWaveForm(waveForm);
    series.setLineWidth(2);
    series.setLineColor(Qt::white);
    series.setPointStyle(QVPointStyle::None);
    series.setPointRadius(0);
    return series;
}

}  // namespace

TEST(ChartSeriesMapping, PlacesAreWholePointsFromTheInsets) {
    QVBarSeries series;
    Frame frame;
    frame.size = {137, 80};
    frame.insets = {3, 26, 5, 11};
    frame.minY = 10;
    frame.maxY = 20;
    prepare(series, {}, frame);
    EXPECT_EQ(series.renderSize(), QSizeF(100, 72));
    EXPECT_EQ(series.xForChartPoint(*point(33.9, 0)), 33 + 26);
    EXPECT_EQ(series.xForChartPoint(*point(0, 0)), 26);
    EXPECT_EQ(series.xForChartPoint(*point(100, 0)), 126);
    EXPECT_EQ(series.xForChartPoint(*point(-0.5, 0)), 25) << "floor, not truncation; x may leave the plot";
    EXPECT_EQ(series.xForChartPoint(*point(150, 0)), 176);
    EXPECT_EQ(series.yForValue(20), 3);
    EXPECT_EQ(series.yForValue(10), 75);
    EXPECT_EQ(series.yForValue(13.3), 3 + 48);  // 0.67 of 72 is 48.24
    EXPECT_EQ(series.yForValue(25), 3) << "held at the top";
    EXPECT_EQ(series.yForValue(-5), 75) << "held at the bottom";
    EXPECT_TRUE(series.yValueIsClamped(20.01));
    EXPECT_FALSE(series.yValueIsClamped(20));
    EXPECT_FALSE(series.yValueIsClamped(std::nullopt));
}

TEST(ChartSeriesMapping, ARangeOfNothingIsTheMiddle) {
    QVBarSeries series;
    const auto set = dataSet({});
    series.prepareForRendering({101, 51}, at(5), at(5), 7.0, 7.0, {2, 0, 0, 0}, set);
    EXPECT_EQ(series.yForValue(7), 24 + 2);
    EXPECT_EQ(series.yForValue(1000), 24 + 2);
    EXPECT_EQ(series.xForChartPoint(*point(5, 1)), 50);
    series.prepareForRendering({101, 51}, std::nullopt, std::nullopt, std::nullopt, std::nullopt, {}, set);
    EXPECT_EQ(series.yForValue(std::nullopt), 25);
    EXPECT_EQ(series.xForChartPoint(*point(5, 1)), 50);
}

TEST(ChartSeriesMapping, TakesTheLastOfSeveralValuesOrThatOfAKey) {
    QVBarSeries series;
    const auto both = QVChartPointDictionary::chartPoint(at(50), {{"a", 20.0}, {"b", 60.0}});
    prepare(series, {both}, {});
    EXPECT_EQ(series.pointFromChartPoint(*both), QPointF(50, 40));
    EXPECT_EQ(series.yForValue(both->yValueForKey("a")), 80);
}

TEST(LineSeries, FindsConnectedStretchesAndGaps) {
    QVLineSeries series;
    const auto regions = [&](const std::vector<QVChartPointPtr>& points) {
        prepare(series, points, {});
        return series.regions();
    };
    const auto rectangle = [](double from, double to) { return QRectF(from, 0, to - from, 100); };
    using List = std::vector<QRectF>;

    const auto gapInside =
        regions({point(0, 1), point(10, 1), point(20, {}), point(40, {}), point(60, 1), point(70, 1)});
    EXPECT_EQ(gapInside.connected, (List{rectangle(0, 10), rectangle(60, 70)}));
    EXPECT_EQ(gapInside.gaps, (List{rectangle(10, 60)})) << "from the last value before to the first after";

    const auto loneInside = regions(
        {point(0, 1), point(10, 1), point(20, {}), point(30, 1), point(40, {}), point(50, 1), point(60, 1)});
    EXPECT_EQ(loneInside.gaps, (List{rectangle(10, 50)}))
        << "a value between missing ones does not end the gap";

    const auto ends = regions({point(0, 1), point(10, {}), point(20, 1), point(30, 1), point(40, {})});
    EXPECT_EQ(ends.gaps, (List{rectangle(0, 20), rectangle(30, 40)}));
    EXPECT_EQ(ends.connected, (List{rectangle(20, 30)}));

    EXPECT_TRUE(regions({point(0, 1)}).gaps.empty());
    EXPECT_TRUE(regions({}).connected.empty());
    EXPECT_TRUE(regions({point(0, 1), point(10, 2)}).gaps.empty());
}

TEST(LineSeries, ConnectedPointsAreSolidAndGapsAreDashedFromEachPoint) {
    QVLineSeries series = plainLine();
    const QImage image = draw(series,
                              {point(0, 50), point(20, 50), point(30, {}), point(40, 50), point(50, {}),
                               point(60, 50), point(80, 50)},
                              Layer::Chart);
    for (int x = 0; x < 20; ++x) EXPECT_GT(alphaAt(image, x, 50), kOpaque) << x;
    for (int x = 60; x < 80; ++x) EXPECT_GT(alphaAt(image, x, 49), kOpaque) << x;
    // 3 on and 5 off from 20, and again from 40, where a pattern running on would be in its gap.
    for (int x = 20; x < 60; ++x) {
        if ((x - 20) % 20 % 8 < 3)
            EXPECT_GT(alphaAt(image, x, 50), kOpaque) << x;
        else
            EXPECT_LT(alphaAt(image, x, 50), kClear) << x;
    }
    EXPECT_LT(alphaAt(image, 10, 47), kClear);
    EXPECT_LT(alphaAt(image, 85, 50), kClear);
}

TEST(LineSeries, WaveFormsBendWhereTheyShould) {
    const std::vector<QVChartPointPtr> peak = {point(0, 0), point(50, 100), point(100, 0)};
    QVLineSeries sine = plainLine(QVLineSeries::WaveForm::Sine);
    QImage image = draw(sine, peak, Layer::Chart);
    EXPECT_GT(alphaAt(image, 25, 50), 150) << "through the middle of the segment";
    EXPECT_LT(alphaAt(image, 50, 2), kClear) << "rounds the corner";
    EXPECT_GT(alphaAt(image, 50, 25), 100) << "the top of the curve is halfway between corner and middles";
    sine.setSineWaveSmoothingFactor(0);
    image = draw(sine, peak, Layer::Chart);
    EXPECT_GT(alphaAt(image, 50, 2), 150) << "without smoothing the corner is sharp";

    QVLineSeries square = plainLine(QVLineSeries::WaveForm::Square);
    image = draw(square, {point(10, 20), point(50, 80), point(90, 40)}, Layer::Chart);
    EXPECT_GT(alphaAt(image, 30, 80), kOpaque) << "keeps the value until the next point";
    EXPECT_GT(alphaAt(image, 50, 50), kOpaque) << "then steps";
    EXPECT_GT(alphaAt(image, 70, 20), kOpaque);
    EXPECT_LT(alphaAt(image, 70, 40), kClear);
}

TEST(LineSeries, NothingShowsInsideAMarker) {
    QVLineSeries series = plainLine();
    series.setPointStyle(QVPointStyle::Ring);
    series.setPointRadius(6);
    series.setPointLineWidth(1);
    series.setFillGradient(QVGradientObject::gradientWithTopColor(Qt::white, Qt::white));
    const std::vector<QVChartPointPtr> points = {point(20, 50), point(80, 50)};
    const QImage chart = draw(series, points, Layer::Chart);
    EXPECT_LT(alphaAt(chart, 20, 50), kClear);
    EXPECT_LT(alphaAt(chart, 23, 50), kClear);
    EXPECT_GT(alphaAt(chart, 25.5, 50), 200) << "the ring";
    EXPECT_GT(alphaAt(chart, 50, 50), kOpaque);
    const QImage fill = draw(series, Layer::Fill);
    EXPECT_LT(alphaAt(fill, 22, 53), kClear);
    EXPECT_GT(alphaAt(fill, 50, 53), kOpaque);
}

TEST(LineSeries, FillsBeneathWithOneGradientAndBeneathGapsWithTheOther) {
    QVLineSeries series = plainLine();
    series.setFillGradient(
        QVGradientObject::gradientWithTopColor(QColor(255, 255, 255, 200), QColor(255, 255, 255, 0)));
    series.setSecondaryFillGradient(QVGradientObject::gradientWithTopColor(Qt::black, QColor(0, 0, 0, 0)));
    const std::vector<QVChartPointPtr> points = {point(0, 80), point(30, 80), point(45, {}), point(60, 80),
                                                 point(100, 80)};
    const QImage fill = draw(series, points, Layer::Fill);
    EXPECT_LT(alphaAt(fill, 15, 15), kClear) << "above the line";
    EXPECT_NEAR(alphaAt(fill, 15, 25), 150, 3) << "the gradient spans the image, not the fill";
    EXPECT_NEAR(alphaAt(fill, 15, 75), 50, 3);
    EXPECT_LT(alphaAt(fill, 45, 50), kClear);
    const QImage secondary = draw(series, Layer::SecondaryFill);
    EXPECT_LT(alphaAt(secondary, 15, 50), kClear);
    EXPECT_NEAR(alphaAt(secondary, 45, 50), 127, 3);
    EXPECT_EQ(qRed(secondary.pixel(45, 50)), 0);
}

TEST(LineSeries, OnePointIsOnlyAMarker) {
    QVLineSeries series = plainLine();
    series.setPointStyle(QVPointStyle::Disc);
    series.setPointRadius(4);
    series.setFillGradient(QVGradientObject::gradientWithTopColor(Qt::white, Qt::white));
    for (const auto waveForm :
         {QVLineSeries::WaveForm::SawTooth, QVLineSeries::WaveForm::Sine, QVLineSeries::WaveForm::Square}) {
        series.setWaveForm(waveForm);
        const QImage chart = draw(series, {point(50, 50)}, Layer::Chart);
        EXPECT_GT(alphaAt(chart, 50, 50), kOpaque);
        EXPECT_LT(alphaAt(chart, 50, 56), kClear);
        EXPECT_LT(alphaAt(draw(series, Layer::Fill), 50, 60), kClear);
    }
}

TEST(ChartSeries, ACopyHasTheSettingsAndNotThePoints) {
    QVLineSeries series = plainLine(QVLineSeries::WaveForm::Square);
    series.setFillGradient(QVGradientObject::gradientWithTopColor(Qt::red, Qt::blue));
    const std::vector<QVChartPointPtr> points = {point(0, 10), point(40, {}), point(100, 90)};
    const QImage original = draw(series, points, Layer::Chart);
    const auto copy = series.copy();
    EXPECT_TRUE(copy->dataPoints().empty());
    EXPECT_EQ(copy->dataSet(), nullptr);
    EXPECT_TRUE(dynamic_cast<QVLineSeries&>(*copy).regions().gaps.empty());
    series.setLineColor(Qt::green);
    EXPECT_EQ(draw(*copy, points, Layer::Chart), original);
}

TEST(BarSeries, BarsStandOnTheirPaddingWithCapsBeyondTheEnds) {
    QVBarSeries series;
    series.setFillColor(Qt::white);
    series.setBarWidth(10);
    series.setBottomPadding(20);
    const QImage image = draw(series, {point(50, 50), point(80, {}), point(20, 5)}, Layer::Fill);
    EXPECT_GT(alphaAt(image, 46, 60), kOpaque);
    EXPECT_GT(alphaAt(image, 54, 60), kOpaque);
    EXPECT_LT(alphaAt(image, 44, 60), kClear);
    EXPECT_LT(alphaAt(image, 55, 60), kClear);
    EXPECT_GT(alphaAt(image, 50, 46), kOpaque) << "the cap reaches half a width above the value";
    EXPECT_LT(alphaAt(image, 50, 44), kClear);
    EXPECT_GT(alphaAt(image, 50, 84), 200) << "and below the foot";
    EXPECT_LT(alphaAt(image, 50, 85), kClear);
    EXPECT_GT(alphaAt(image, 80, 76), 200) << "no value counts as 0: a dot on the foot";
    EXPECT_GT(alphaAt(image, 20, 76), 200) << "a value beneath the foot too";
    EXPECT_LT(alphaAt(image, 20, 74), kClear);

    series.setLineCapStyle(QVLineCapStyle::Butt);
    const QImage butt = draw(series, Layer::Fill);
    EXPECT_LT(alphaAt(butt, 50, 49), kClear);
    EXPECT_LT(alphaAt(butt, 50, 80), kClear);
    EXPECT_GT(alphaAt(butt, 46, 50), kOpaque);
}

TEST(LineSeries, TheFillHasNoSeamsAtAnyScale) {
    QVLineSeries series = plainLine();
    series.setFillGradient(
        QVGradientObject::gradientWithTopColor(QColor(255, 255, 255, 128), QColor(255, 255, 255, 128)));
    std::vector<QVChartPointPtr> points;
    for (int i = 0; i <= 20; ++i) points.push_back(point(5 * i, 90));
    for (const double scale : {1.0, 1.25, 1.5, 2.0}) {
        Frame frame;
        frame.scale = scale;
        const QImage fill = draw(series, points, Layer::Fill, frame);
        for (int x = 1; x < fill.width() - 1; ++x)
            EXPECT_NEAR(qAlpha(fill.pixel(x, fill.height() / 2)), 128, 3) << x << " at " << scale;
    }
}

/// The first and the last column of each run of columns with something on them in a row of pixels.
std::vector<std::pair<int, int>> runs(const QImage& image, int y) {
    std::vector<std::pair<int, int>> found;
    for (int x = 0; x < image.width(); ++x) {
        if (qAlpha(image.pixel(x, y)) < 160) continue;
        if (found.empty() || found.back().second != x - 1) found.emplace_back(x, x);
        found.back().second = x;
    }
    return found;
}

RC_GTEST_PROP(ChartSeries, WhatIsDrawnForOnePointKeepsApartFromThatOfTheNext, ()) {
    const int count = *rc::gen::inRange(2, 60);
    const double pitch = *rc::gen::inRange(40, 500) / 10.0;
    Frame frame;
    frame.size = {pitch * count, 80};
    frame.seconds = count;
    frame.scale = *rc::gen::element(1.0, 2.0, 3.0);
    std::vector<QVChartPointPtr> numbers, ranges;
    for (int i = 0; i < count; ++i) {
        numbers.push_back(point(i + 0.5, 70));
        ranges.push_back(minMaxPoint(i + 0.5, 10, 90));
    }
    QVBarSeries bars;
    QVMinMaxSeries minMax;
    bars.setFillColor(Qt::white);
    minMax.setFillColor(Qt::white);
    QVLineSeries markers;
    for (QVChartSeries* series : std::initializer_list<QVChartSeries*>{&bars, &minMax})
        series->setPointInterval(std::chrono::seconds(1));
    markers.setPointStyle(QVPointStyle::Disc);
    prepare(markers, numbers, frame);
    for (const auto& [image, y] :
         {std::pair(draw(bars, numbers, Layer::Fill, frame), 50.0),
          {draw(minMax, ranges, Layer::Fill, frame), 40.0},
          {draw(markers, numbers, Layer::Chart, frame), markers.dataPoints().front().y()}}) {
        const auto found = runs(image, static_cast<int>(y * frame.scale));
        RC_ASSERT(found.size() == static_cast<size_t>(count));
        for (size_t i = 1; i < found.size(); ++i)
            RC_ASSERT(found[i - 1].second + 1 - found[i - 1].first <=
                      0.8 * (found[i].first - found[i - 1].first) + 1);
    }
}

TEST(BarSeries, BarsThatOverlapAreNotPaintedTwice) {
    QVBarSeries series;
    series.setBarWidth(20);
    const QImage image = draw(series, {point(50, 90), point(60, 90)}, Layer::Fill);
    EXPECT_NEAR(alphaAt(image, 44, 50), 128, 2);
    EXPECT_NEAR(alphaAt(image, 55, 50), 128, 2);
}

TEST(MinMaxSeries, DrawsBarsBetweenMarkers) {
    QVMinMaxSeries series;
    series.setFillColor(Qt::white);
    series.setPointRadius(5);
    prepare(series, {minMaxPoint(50, 20, 80)}, {});
    const QImage fill = draw(series, Layer::Fill);
    EXPECT_GT(alphaAt(fill, 46, 50), kOpaque);
    EXPECT_LT(alphaAt(fill, 44, 50), kClear);
    EXPECT_LT(alphaAt(fill, 50, 22), kClear) << "free for the marker at the maximum";
    EXPECT_LT(alphaAt(fill, 50, 18), kClear);
    EXPECT_GT(alphaAt(fill, 45.5, 24), 100) << "the bar's corner beside the marker";
    EXPECT_LT(alphaAt(fill, 50, 84), kClear);
    const QImage chart = draw(series, Layer::Chart);
    EXPECT_GT(alphaAt(chart, 50, 20), kOpaque);
    EXPECT_GT(alphaAt(chart, 50, 80), kOpaque);
    EXPECT_LT(alphaAt(chart, 50, 50), kClear);
}

TEST(MinMaxSeries, CloseValuesAreOneMarkerInTheMiddle) {
    QVMinMaxSeries series;
    series.setFillColor(Qt::white);
    series.setPointRadius(5);
    prepare(series, {minMaxPoint(20, 46, 54), minMaxPoint(80, 45, 55)}, {});
    const QImage chart = draw(series, Layer::Chart);
    EXPECT_GT(alphaAt(chart, 20, 50), kOpaque);
    EXPECT_LT(alphaAt(chart, 20, 44), kClear) << "one marker of 10 points, not two";
    EXPECT_GT(alphaAt(chart, 80, 46), 200) << "twice the radius apart are two";
    EXPECT_GT(alphaAt(chart, 80, 42), 150);
    const QImage fill = draw(series, Layer::Fill);
    for (int y = 0; y < 100; ++y) EXPECT_LT(alphaAt(fill, 20, y), kClear) << y;
}

TEST(MinMaxSeries, AValueAboveTheTopIsAnUpwardChevronThere) {
    QVMinMaxSeries series;
    series.setFillColor(Qt::white);
    series.setPointRadius(10);
    series.setPointLineWidth(2);
    Frame frame;
    frame.insets = {20, 0, 0, 0};
    prepare(series, {minMaxPoint(50, 20, 500), minMaxPoint(20, 300, 500)}, frame);
    const QImage chart = draw(series, Layer::Chart);
    // The tip of the chevron is 0.15 of the side and half a line beneath the marker's top; its middle is
    // open.
    EXPECT_GT(alphaAt(chart, 50, 14), 200);
    EXPECT_LT(alphaAt(chart, 50, 22), kClear) << "no disc";
    EXPECT_GT(alphaAt(chart, 50, 84), kOpaque) << "the minimum keeps its disc";
    EXPECT_GT(alphaAt(chart, 20, 14), 200) << "both above: one chevron";
    const QImage fill = draw(series, Layer::Fill);
    EXPECT_GT(alphaAt(fill, 50, 22), kOpaque) << "a chevron cuts nothing out of the bar";
    EXPECT_LT(alphaAt(fill, 50, 84), kClear);
}

TEST(MinMaxSeries, ChevronsCutTheirShapeAndNoStyleGivesRoundEnds) {
    QVMinMaxSeries series;
    series.setFillColor(Qt::white);
    series.setPointRadius(6);
    series.setMinPointStyle(QVPointStyle::UpwardChevron);
    series.setMaxPointStyle(QVPointStyle::DownwardChevron);
    prepare(series, {minMaxPoint(50, 20, 80)}, {});
    QImage fill = draw(series, Layer::Fill);
    // Upper end: base at 18, triangle to (50, 24).
    EXPECT_LT(alphaAt(fill, 50, 22), kClear);
    EXPECT_GT(alphaAt(fill, 45, 23), 200) << "beside the tip";
    EXPECT_LT(alphaAt(fill, 50, 17), kClear) << "ends 2 above the value";
    // Lower end: base at 82, triangle up to (50, 76).
    EXPECT_LT(alphaAt(fill, 50, 79), kClear);
    EXPECT_GT(alphaAt(fill, 55, 77), 200);

    series.setMinPointStyle(QVPointStyle::DownwardChevron);
    fill = draw(series, Layer::Fill);
    // A notch: two triangles at the sides, whole in the middle.
    EXPECT_GT(alphaAt(fill, 50, 79), 200);
    EXPECT_LT(alphaAt(fill, 45, 79), 60);
    EXPECT_LT(alphaAt(fill, 54, 79), 60);

    series.setMaxPointStyle(QVPointStyle::None);
    series.setMinPointStyle(QVPointStyle::Disc);
    fill = draw(series, Layer::Fill);
    EXPECT_GT(alphaAt(fill, 50, 15), 200) << "a round end half a width above";
    EXPECT_GT(alphaAt(fill, 50, 80), kOpaque) << "and nothing cut out";
    const QImage chart = draw(series, Layer::Chart);
    EXPECT_LT(alphaAt(chart, 50, 20), kClear);
    EXPECT_GT(alphaAt(chart, 50, 80), kOpaque);
}

TEST(StackedSeries, RowsAreEvenlySpacedAndHoldTheirPoints) {
    QVStackedDotSeries series;
    series.setEnumeratedValueOrder({3, 1, 7});
    series.setPointColor(Qt::white);
    series.setPointRadius(3);
    Frame frame;
    frame.size = {100, 90};
    const auto flags = [](double seconds, QVChartYValues values) {
        return QVChartPointDictionary::chartPoint(at(seconds), std::move(values));
    };
    prepare(series, {flags(20, {{"3", 1}, {"7", 1}}), flags(60, {{"1", 1}, {"3", 0}})}, frame);
    EXPECT_EQ(series.yForRow(0), 22.5);
    EXPECT_EQ(series.yForRow(1), 45);
    EXPECT_EQ(series.yForRow(2), 67.5);
    const QImage chart = draw(series, Layer::Chart, 2);
    EXPECT_GT(alphaAt(chart, 20, 22.5), kOpaque);
    EXPECT_LT(alphaAt(chart, 20, 45), kClear);
    EXPECT_GT(alphaAt(chart, 20, 67.5), kOpaque);
    EXPECT_GT(alphaAt(chart, 60, 45), kOpaque);
    EXPECT_LT(alphaAt(chart, 60, 22.5), kClear) << "0 is not true";
    series.setEnumeratedValueOrder({});
    const QImage empty = draw(series, {flags(20, {{"3", 1}})}, Layer::Chart, frame);
    for (int y = 0; y < 90; ++y) EXPECT_EQ(alphaAt(empty, 20, y), 0) << y;
}

TEST(StackedSeries, PairsOfPointsAreSegments) {
    QVStackedHorizontalLineSeries series;
    series.setEnumeratedValueOrder({0, 1});
    series.setFillColor(Qt::white);
    series.setLineWidth(6);
    Frame frame;
    frame.size = {100, 90};
    prepare(series, {point(10, 0), point(20, 1), point(30, 0), point(60, 0), point(70, 1), point(80, 5)},
            frame);
    const QImage fill = draw(series, Layer::Fill);
    EXPECT_GT(alphaAt(fill, 20, 30), kOpaque);
    EXPECT_GT(alphaAt(fill, 8, 30), 200) << "round cap";
    EXPECT_LT(alphaAt(fill, 45, 30), kClear);
    EXPECT_LT(alphaAt(fill, 60, 30), kClear) << "a start without an end draws nothing";
    EXPECT_GT(alphaAt(fill, 45, 60), kOpaque) << "the other row has its own pairs";
}

TEST(StackedSeries, LabelsEndTwelvePointsFromTheRight) {
    QVStackedHorizontalLineSeries series;
    series.setEnumeratedValueOrder({0, 1});
    series.setValueLabels({{0, QStringLiteral("IIII")}, {1, QString()}});
    series.setLabelColor(Qt::white);
    series.setLabelFont(platform::systemFont(10));
    prepare(series, {}, {});
    const QImage chart = draw(series, Layer::Chart, 2);
    QRect ink;
    for (int y = 0; y < chart.height(); ++y)
        for (int x = 0; x < chart.width(); ++x)
            if (qAlpha(chart.pixel(x, y)) > 60) ink |= QRect(x, y, 1, 1);
    ASSERT_FALSE(ink.isEmpty());
    EXPECT_NEAR(ink.right() / 2.0, 88, 2);
    EXPECT_NEAR(ink.center().y() / 2.0, 100.0 / 3, 2);
}

TEST(CenteredLineSeries, SegmentsAndRingsInTheMiddle) {
    QVCenteredHorizontalLineSeries series;
    series.setFillColor(Qt::white);
    series.setAccentColor(Qt::red);
    series.setLineWidth(12);
    prepare(series, {point(10, 0), point(20, 1), point(40, 0.9), point(60, 0), point(80, 1.2)}, {});
    const QImage fill = draw(series, Layer::Fill);
    EXPECT_GT(alphaAt(fill, 25, 50), kOpaque);
    EXPECT_GT(alphaAt(fill, 5, 50), 200);
    EXPECT_LT(alphaAt(fill, 60, 50), kClear) << "the third has no partner";
    const QImage chart = draw(series, Layer::Chart, 2);
    EXPECT_LT(alphaAt(chart, 20, 50), kClear) << "open in the middle";
    EXPECT_LT(alphaAt(chart, 22, 50), kClear);
    EXPECT_GT(alphaAt(chart, 24.5, 50), kOpaque) << "a ring of 12 with a hole of 6";
    EXPECT_LT(alphaAt(chart, 27, 50), kClear);
    EXPECT_GT(alphaAt(chart, 80, 45), kOpaque);
}

TEST(PointMarker, HasTheSizeAndShapeOfItsStyle) {
    const auto marker = [](QVPointStyle style) {
        return QVChartSeriesPointMarker::chartPointWithColor(Qt::white, 10, 2, style, 2);
    };
    EXPECT_TRUE(marker(QVPointStyle::None).isNull());
    const QImage disc = marker(QVPointStyle::Disc);
    EXPECT_EQ(disc.size(), QSize(40, 40));
    EXPECT_EQ(disc.deviceIndependentSize(), QSizeF(20, 20));
    EXPECT_GT(alphaAt(disc, 10, 10), kOpaque);
    EXPECT_GT(alphaAt(disc, 10, 0.5), 200) << "fills its square";
    const QImage ring = marker(QVPointStyle::Ring);
    EXPECT_GT(alphaAt(ring, 10, 1), kOpaque);
    EXPECT_LT(alphaAt(ring, 10, 2.5), kClear) << "the line lies inside the square";
    const QImage down = marker(QVPointStyle::DownwardChevron);
    EXPECT_GT(alphaAt(down, 1, 4), kOpaque);
    EXPECT_GT(alphaAt(down, 19, 4), kOpaque);
    EXPECT_GT(alphaAt(down, 10, 16), kOpaque);
    EXPECT_LT(alphaAt(down, 10, 6), kClear);
    const QImage up = marker(QVPointStyle::UpwardChevron);
    for (int y = 0; y < 20; ++y)
        for (int x = 0; x < 20; ++x)
            EXPECT_NEAR(alphaAt(up, x + 0.25, y + 0.25), alphaAt(down, x + 0.25, 19.75 - y), 40)
                << x << ", " << y;
}

TEST(ChartDescriptor, MakesLineSeriesOnly) {
    const auto series = QVChartDescriptor(VSValue::Dictionary{{"type", "lineSeries"}, {"pointRadius", 2.5}})
                            .generateChartSeries();
    ASSERT_TRUE(series);
    EXPECT_EQ(dynamic_cast<QVLineSeries&>(*series).pointRadius(), 2.5);
    const auto plain = QVChartDescriptor(VSValue::Dictionary{{"type", "lineSeries"}}).generateChartSeries();
    EXPECT_EQ(dynamic_cast<QVLineSeries&>(*plain).pointRadius(), 4);
    EXPECT_FALSE(QVChartDescriptor(VSValue::Dictionary{{"type", "barSeries"}}).generateChartSeries());
    EXPECT_FALSE(QVChartDescriptor(VSValue::Dictionary()).generateChartSeries());
}
