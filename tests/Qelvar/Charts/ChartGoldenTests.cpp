// Pictures of the series, against tests/data/charts; whole charts are in those of the cards. Text may
// differ by the version of the fonts: pictures with text have a wider tolerance. QELVAR_UPDATE_GOLDEN=1
// ChartsTests writes them anew.

#include <QLinearGradient>
#include <cmath>

#include "ChartTestSupport.h"
#include "Platform/StyledText.h"
#include "Qelvar/Charts/QVBarSeries.h"
#include "Qelvar/Charts/QVCenteredHorizontalLineSeries.h"
#include "Qelvar/Charts/QVLineSeries.h"
#include "Qelvar/Charts/QVMinMaxSeries.h"
#include "Qelvar/Charts/QVStackedDotSeries.h"
#include "Qelvar/Charts/QVStackedHorizontalLineSeries.h"
#include "TestSupport.h"

using namespace test;

namespace {

const QColor kWhite = Qt::white;
const QColor kHalfWhite = QColor::fromRgbF(1, 1, 1, 0.5f);
const QColor kEdge = QColor::fromRgbF(1, 1, 1, 0.75f);
constexpr double kTextShare = 0.008;

QLinearGradient cardGradient(double height) {
    QLinearGradient gradient(0, 0, 0, height);
    gradient.setColorAt(0, QColor(132, 74, 22));
    gradient.setColorAt(1, QColor(131, 65, 27));
    return gradient;
}

std::vector<QVChartPointPtr> wave(int count, double step, double low, double high) {
    std::vector<QVChartPointPtr> points;
    for (int i = 0; i < count; ++i)
        points.push_back(
            point(i * step, low + (high - low) * (0.5 + 0.5 * std::sin(i * 1.9 + 0.7 * std::sin(i * 1.0)))));
    return points;
}

/// The three layers of a series over a card's colours, one over the other.
QImage picture(QVChartSeries& series, const std::vector<QVChartPointPtr>& points, double scale) {
    Frame frame;
    frame.size = {320, 116};
    frame.insets = {3, 24, 3, 36};
    frame.seconds = 30;
    frame.scale = scale;
    prepare(series, points, frame);
    QImage image((frame.size * scale).toSize(), QImage::Format_ARGB32_Premultiplied);
    image.setDevicePixelRatio(scale);
    QPainter painter(&image);
    painter.fillRect(QRectF(0, 0, 320, 116), cardGradient(116));
    painter.setCompositionMode(QPainter::CompositionMode_SoftLight);
    painter.drawImage(0, 0, draw(series, Layer::SecondaryFill, scale));
    painter.setCompositionMode(QPainter::CompositionMode_Overlay);
    painter.drawImage(0, 0, draw(series, Layer::Fill, scale));
    painter.setCompositionMode(QPainter::CompositionMode_SourceOver);
    painter.drawImage(0, 0, draw(series, Layer::Chart, scale));
    return image;
}

/// On a screen of large pixels and on a phone's.
void expectPictures(QVChartSeries& series, const std::vector<QVChartPointPtr>& points,
                    const std::string& name, double share = 0.002) {
    EXPECT_TRUE(matchesGolden(picture(series, points, 1), name + "-1x", 12, share));
    EXPECT_TRUE(matchesGolden(picture(series, points, 2), name, 12, share));
}

/// As the cards set a line up.
void styleLine(QVLineSeries& series) {
    series.setLineWidth(1);
    series.setPointRadius(3);
    series.setPointLineWidth(1.5);
    series.setLineColor(kWhite);
    series.setFillGradient(QVGradientObject::gradientWithTopColor(QColor::fromRgbF(1, 1, 1, 0.8f),
                                                                  QColor::fromRgbF(1, 1, 1, 0)));
    series.setSecondaryFillGradient(
        QVGradientObject::gradientWithTopColor(Qt::black, QColor::fromRgbF(0, 0, 0, 0)));
}

std::vector<QVChartPointPtr> withGaps(std::vector<QVChartPointPtr> points) {
    for (const size_t i : {4, 5, 6, 12, 13, 15})
        points[i] = point(VSSecondsFromDuration(points[i]->xValue() - VSDate()), std::nullopt);
    return points;
}

}  // namespace

TEST(ChartGoldens, Lines) {
    QVLineSeries series;
    styleLine(series);
    expectPictures(series, withGaps(wave(31, 1, 10, 90)), "line-saw-tooth");
    series.setWaveForm(QVLineSeries::WaveForm::Sine);
    expectPictures(series, wave(31, 1, 10, 90), "line-sine");
    series.setWaveForm(QVLineSeries::WaveForm::Square);
    series.setPointStyle(QVPointStyle::UpwardChevron);
    series.setPointRadius(5);
    expectPictures(series, withGaps(wave(31, 1, 10, 90)), "line-square");
}

TEST(ChartGoldens, Bars) {
    QVBarSeries series;
    series.setBarWidth(5);
    series.setBottomPadding(8);
    series.setEdgeColor(kEdge);
    expectPictures(series, wave(31, 1, 0, 100), "bars");
}

TEST(ChartGoldens, MinMax) {
    std::vector<QVChartPointPtr> points;
    for (int i = 0; i <= 30; ++i) {
        const double low = 30 + 20 * std::sin(i * 1.3);
        points.push_back(
            minMaxPoint(i, low, i == 9 ? 130 : low + (i % 5 == 0 ? 4 : 30 + 20 * std::sin(i * 2.1))));
    }
    QVMinMaxSeries series;
    series.setPointRadius(3);
    series.setPointLineWidth(1.5);
    series.setEdgeColor(kEdge);
    series.setMinPointStyle(QVPointStyle::Ring);
    series.setMaxPointStyle(QVPointStyle::Ring);
    expectPictures(series, points, "min-max-rings");
    series.setMinPointStyle(QVPointStyle::UpwardChevron);
    series.setMaxPointStyle(QVPointStyle::DownwardChevron);
    series.setPointRadius(4);
    expectPictures(series, points, "min-max-chevrons");
}

TEST(ChartGoldens, Rows) {
    QVStackedHorizontalLineSeries lines;
    lines.setEnumeratedValueOrder({0, 1});
    lines.setValueLabels({{0, "In Bed"}, {1, "Asleep"}});
    lines.setLabelColor(kWhite);
    lines.setLabelFont(platform::systemFont(10));
    lines.setFillColor(kHalfWhite);
    lines.setLineWidth(5);
    lines.setEdgeColor(kEdge);
    expectPictures(lines,
                   {point(1, 0), point(9, 0), point(2, 1), point(5, 1), point(6, 1), point(8.5, 1),
                    point(15, 0), point(25, 0), point(15.5, 1), point(24, 1)},
                   "stacked-lines", kTextShare);
    QVStackedDotSeries dots;
    dots.setEnumeratedValueOrder({1, 2, 3});
    dots.setValueLabels({{1, "Dry"}, {2, "Sticky"}, {3, "Creamy"}});
    dots.setLabelColor(kWhite);
    dots.setLabelFont(platform::systemFont(10));
    dots.setPointColor(kWhite);
    dots.setPointStyle(QVPointStyle::Ring);
    dots.setPointRadius(3);
    dots.setPointLineWidth(1.5);
    std::vector<QVChartPointPtr> points;
    for (int i = 0; i <= 30; i += 2)
        points.push_back(QVChartPointDictionary::chartPoint(
            at(i), {{"1", i % 4 == 0}, {"2", i % 6 == 0}, {"3", i % 10 == 0}}));
    expectPictures(dots, points, "stacked-dots", kTextShare);

    QVCenteredHorizontalLineSeries centered;
    centered.setAccentColor(kWhite);
    centered.setLineWidth(5);
    centered.setEdgeColor(kEdge);
    expectPictures(
        centered,
        {point(1, 0), point(6, 0), point(10, 1), point(14, 0), point(22, 0), point(16, 1), point(28, 1)},
        "centered-line");
}
