// Pictures of the series and of whole charts as the cards show them, against tests/data/charts. Text may
// differ by the version of the fonts: pictures with text have a wider tolerance. QELVAR_UPDATE_GOLDEN=1
// ChartsTests writes them anew.

#include <QLinearGradient>
#include <cmath>

#include "ChartTestSupport.h"
#include "Platform/Localization.h"
#include "Platform/StyledText.h"
#include "Qelvar/Charts/QVBarSeries.h"
#include "Qelvar/Charts/QVCenteredHorizontalLineSeries.h"
#include "Qelvar/Charts/QVChart.h"
#include "Qelvar/Charts/QVDottedAverageBackgroundView.h"
#include "Qelvar/Charts/QVHourAxisDescriptor.h"
#include "Qelvar/Charts/QVLineSeries.h"
#include "Qelvar/Charts/QVMinMaxSeries.h"
#include "Qelvar/Charts/QVMonthAxisDescriptor.h"
#include "Qelvar/Charts/QVStackedDotSeries.h"
#include "Qelvar/Charts/QVStackedHorizontalLineSeries.h"
#include "Qelvar/Charts/QVYearAxisDescriptor.h"
#include "TestSupport.h"

using namespace test;

namespace {

const QColor kWhite = Qt::white;
const QColor kHalfWhite = QColor::fromRgbF(1, 1, 1, 0.5f);
constexpr double kTextShare = 0.008;

QLinearGradient cardGradient(double height) {
    QLinearGradient gradient(0, 0, 0, height);
    gradient.setColorAt(0, QColor(255, 149, 80));
    gradient.setColorAt(1, QColor(255, 60, 90));
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

/// A whole chart as a card shows it.
class CardChart {
 public:
    CardChart(std::shared_ptr<QVChartSeries> series, const std::vector<QVChartPointPtr>& points, VSDate start,
              VSDate end, const QVEdgeInsets& insets, const std::shared_ptr<QVCachedAxisDescriptor>& axis) {
        platform::loadTranslations();
        source_->entries = {{std::move(series), points}};
        source_->bounds = [](double min, double max) {
            return VSDataUnitGroupChartingRules::Bounds{std::floor(min / 10) * 10, std::ceil(max / 10) * 10,
                                                        0};
        };
        renderer_->setMinXValue(start);
        renderer_->setMaxXValue(end);
        renderer_->setChartInsets(insets);
        background_->setLabelColor(kHalfWhite);
        background_->setNoDataLabelColor(kHalfWhite);
        background_->setNoDataLabelFont(platform::systemFont(27));
        background_->setLabelCompositingFilter(QPainter::CompositionMode_Plus);
        background_->setNoDataLabelCompositingFilter(QPainter::CompositionMode_Plus);
        background_->setAverageLineCompositingFilter(QPainter::CompositionMode_Overlay);
        axis->setHighlightedLabelColor(kWhite);
        axis->setHighlightedLabelFont(platform::boldSystemFont(10));
        axis->setUnhighlightedLabelColor(kHalfWhite);
        axis->setUnhighlightedLabelFilter(QPainter::CompositionMode_Plus);
        axis->setMinValue(start);
        axis->setMaxValue(end);
        chart_.setChartFillCompositingFilter(QPainter::CompositionMode_Overlay);
        chart_.setChartSecondaryFillCompositingFilter(QPainter::CompositionMode_SoftLight);
        chart_.setDividerInset(12);
        chart_.setChartRenderer(renderer_);
        chart_.setChartBackgroundView(background_);
        chart_.setXAxisDescriptor(axis);
    }
    QImage paint() {
        const QSizeF size(367, 143);
        chart_.setSize(size, 2);
        chart_.layoutIfNeeded();
        queue_.runNext();
        queue_.runNext();
        QImage image((size * 2).toSize(), QImage::Format_ARGB32_Premultiplied);
        image.setDevicePixelRatio(2);
        QPainter painter(&image);
        painter.fillRect(QRectF(QPointF(), size), cardGradient(size.height()));
        chart_.paint(painter);
        return image;
    }

 private:
    ManualQueue queue_;
    std::shared_ptr<PlainSource> source_ = std::make_shared<PlainSource>();
    std::shared_ptr<QVChartRenderer> renderer_ = QVChartRenderer::create(queue_, source_);
    std::shared_ptr<QVDottedAverageBackgroundView> background_ =
        std::make_shared<QVDottedAverageBackgroundView>();
    QVChart chart_;
};

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
    expectPictures(
        centered,
        {point(1, 0), point(6, 0), point(10, 1), point(14, 0), point(22, 0), point(16, 1), point(28, 1)},
        "centered-line");
}

TEST(ChartGoldens, DayOfMinMax) {
    const FixedEnvironment environment;
    const VSDate start = date("2020-03-31");
    std::vector<QVChartPointPtr> points;
    for (int hour = 0; hour < 24; ++hour) {
        const double low = 58 + 14 * std::sin(hour / 3.5);
        auto one = QVChartPointDictionary::chartPoint(
            start + std::chrono::minutes(60 * hour + 30),
            {{"min", low}, {"max", low + 4 + 40 * std::pow(std::sin(hour * 0.7), 2)}});
        points.push_back(one);
    }
    auto series = std::make_shared<QVMinMaxSeries>();
    series->setPointRadius(3);
    series->setPointLineWidth(1);
    series->setMinPointStyle(QVPointStyle::Ring);
    series->setMaxPointStyle(QVPointStyle::Ring);
    const auto axis = std::make_shared<QVHourAxisDescriptor>();
    axis->setAlwaysHighlight(true);
    CardChart chart(series, points, start, date("2020-04-01"), {0, 26, 0, 38}, axis);
    EXPECT_TRUE(matchesGolden(chart.paint(), "card-day", 12, kTextShare));
}

TEST(ChartGoldens, WeekOfBars) {
    const FixedEnvironment environment("2020-03-31T20:00", "Europe/Copenhagen", "de_DE");
    const VSDate start = date("2020-03-26");
    std::vector<QVChartPointPtr> points;
    for (int day = 0; day < 7; ++day)
        points.push_back(QVChartPointNumeric::chartPoint(
            VSCalendar::current().noonOfDay(VSCalendar::current().addDays(start, day)),
            2000 + 1500 * ((day * 5) % 7)));
    auto series = std::make_shared<QVBarSeries>();
    series->setBarWidth(5);
    series->setBottomPadding(8);
    CardChart chart(series, points, start, date("2020-04-02"), {0, 13, 0, 39},
                    std::make_shared<QVMonthAxisDescriptor>());
    EXPECT_TRUE(matchesGolden(chart.paint(), "card-week", 12, kTextShare));
}

TEST(ChartGoldens, YearOfALineWithAGap) {
    const FixedEnvironment environment("2020-03-31T20:00", "Europe/Copenhagen", "ar_EG");
    const VSDate start = date("2019-04-01");
    std::vector<QVChartPointPtr> points;
    for (int month = 0; month < 12; ++month)
        points.push_back(QVChartPointNumeric::chartPoint(
            VSCalendar::current().middleOfMonth(VSCalendar::current().addMonths(start, month)),
            month == 4 || month == 5 || month == 9 ? std::nullopt
                                                   : std::optional(72 + 6 * std::sin(month * 1.1))));
    auto series = std::make_shared<QVLineSeries>();
    styleLine(*series);
    CardChart chart(series, points, start, date("2020-04-01"), {0, 14, 0, 41},
                    std::make_shared<QVYearAxisDescriptor>());
    EXPECT_TRUE(matchesGolden(chart.paint(), "card-year", 12, kTextShare));
}

TEST(ChartGoldens, MonthWithoutData) {
    const FixedEnvironment environment("2020-03-31T20:00", "Asia/Kathmandu", "hi_IN");
    const auto axis = std::make_shared<QVMonthAxisDescriptor>();
    axis->setDayOffset(7);
    CardChart chart(std::make_shared<QVBarSeries>(), {}, date("2020-03-01"), date("2020-04-01"),
                    {0, 24, 0, 36}, axis);
    EXPECT_TRUE(matchesGolden(chart.paint(), "card-no-data", 12, kTextShare));
}
