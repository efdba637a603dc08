#include <QFontMetricsF>
#include <cmath>

#include <QDBusVariant>

#include "ChartTestSupport.h"
#include "Platform/Appearance.h"
#include "Platform/StyledText.h"
#include "Platform/SystemEvents.h"
#include "Platform/TextScale.h"
#include "Qelvar/Charts/QVBarSeries.h"
#include "Qelvar/Charts/QVChart.h"
#include "Qelvar/Charts/QVDottedAverageBackgroundView.h"
#include "Qelvar/Charts/QVMonthAxisDescriptor.h"
#include "TestSupport.h"

using namespace test;

namespace {

constexpr QVAnimationTime ms(int milliseconds) {
    return QVAnimationTime(milliseconds * 1000);
}

/// An axis with labels as the test gives them.
class GivenAxis final : public QVCachedAxisDescriptor {
 public:
    struct Given {
        QString text;
        VSDate date;
    };
    std::vector<Given> given;

 protected:
    std::optional<std::vector<QVAxisLabel>> generateAxisLabels() const override {
        std::vector<QVAxisLabel> labels;
        for (const Given& one : given) labels.push_back(label(one.text, one.date, true));
        return labels;
    }
};

/// Fills the whole image with one colour.
class FullSeries final : public QVChartSeries {
 public:
    QColor chart, fill, secondaryFill;
    void renderChart(QPainter& painter) const override { all(painter, chart); }
    void renderFill(QPainter& painter) const override { all(painter, fill); }
    void renderSecondaryFill(QPainter& painter) const override { all(painter, secondaryFill); }

 protected:
    std::unique_ptr<QVChartSeries> clone() const override { return std::make_unique<FullSeries>(*this); }

 private:
    void all(QPainter& painter, const QColor& color) const {
        if (color.isValid()) painter.fillRect(QRectF(QPointF(), imageSize()), color);
    }
};

class ChartView : public testing::Test {
 protected:
    FixedEnvironment environment;
    ManualQueue queue;
    QVAnimationTime now{ms(10'000)};
    std::shared_ptr<PlainSource> source = std::make_shared<PlainSource>();
    std::shared_ptr<FullSeries> series = std::make_shared<FullSeries>();
    std::shared_ptr<QVChartRenderer> renderer = makeRenderer();
    std::shared_ptr<QVDottedAverageBackgroundView> background =
        std::make_shared<QVDottedAverageBackgroundView>();
    std::shared_ptr<GivenAxis> axis = std::make_shared<GivenAxis>();
    QVChart chart;
    int repaints = 0;

    std::shared_ptr<QVChartRenderer> makeRenderer() {
        auto made = QVChartRenderer::create(queue, source);
        made->setMinXValue(at(0));
        made->setMaxXValue(at(100));
        made->setChartInsets({0, 20, 0, 30});
        return made;
    }
    void SetUp() override {
        source->entries = {{series, {point(0, 0), point(100, 10)}}};
        axis->setMinValue(at(0));
        axis->setMaxValue(at(100));
        axis->setHighlightedLabelColor(Qt::white);
        chart.setAnimationClock([this] { return now; });
        chart.onNeedsRepaint = [this] { ++repaints; };
        chart.setChartRenderer(renderer);
        chart.setChartBackgroundView(background);
        chart.setXAxisDescriptor(axis);
    }
    /// Lays out and lets everything drawn arrive.
    void show(QSizeF size = {150, 103}, double scale = 2) {
        chart.setSize(size, scale);
        chart.layoutIfNeeded();
        settle();
    }
    /// The reload, the drawing and its result.
    void settle() {
        queue.runNext();
        queue.runNext();
    }
    QImage paint(const QColor& beneath = Qt::black) {
        QImage image((chart.size() * 2).toSize(), QImage::Format_ARGB32_Premultiplied);
        image.setDevicePixelRatio(2);
        image.fill(beneath);
        QPainter painter(&image);
        chart.paint(painter);
        return image;
    }
    QColor colorAt(double x, double y, const QColor& beneath = Qt::black) {
        return paint(beneath).pixelColor(static_cast<int>(x * 2), static_cast<int>(y * 2));
    }
    std::vector<double> labelCenters() const {
        std::vector<double> result;
        for (const auto& label : chart.xAxisLabels()) result.push_back(label.centerX.value());
        return result;
    }
};

}  // namespace

TEST_F(ChartView, LaysOutPlotGutterAndDividers) {
    chart.setDividerInset(12);
    show({367, 143});
    EXPECT_EQ(chart.topDividerFrame(), QRectF(12, 0, 343, 0.5));
    EXPECT_EQ(chart.bottomDividerFrame(), QRectF(12, 109.5, 343, 0.5));
    EXPECT_EQ(chart.backgroundFrame(), QRectF(12, 0, 343, 109.5));
    EXPECT_EQ(chart.chartRectangle(), QRectF(0, -3, 367, 116));
    EXPECT_EQ(renderer->chartImage().deviceIndependentSize(), QSizeF(367, 116));
    EXPECT_EQ(colorAt(100, 0, QColor(60, 60, 60)), QColor(120, 120, 120)) << "white, overlaid";
    EXPECT_EQ(colorAt(5, 0, QColor(60, 60, 60)), QColor(60, 60, 60));
    EXPECT_EQ(colorAt(100, 109.5, QColor(60, 60, 60)), QColor(120, 120, 120));
}

TEST_F(ChartView, StacksItsLayersInTheirModes) {
    chart.setChartFillCompositingFilter(QPainter::CompositionMode_Overlay);
    chart.setChartSecondaryFillCompositingFilter(QPainter::CompositionMode_SoftLight);
    series->fill = Qt::white;
    show();
    EXPECT_EQ(colorAt(75, 50, QColor(50, 100, 200)), QColor(100, 200, 255)) << "the fill lightens";
    series->fill = QColor();
    series->secondaryFill = Qt::black;
    chart.reloadData(false);
    settle();
    const QColor darker = colorAt(75, 50, QColor(128, 128, 128));
    EXPECT_NEAR(darker.red(), 64, 2) << "soft light with black squares";
    series->chart = QColor(255, 0, 0, 128);
    chart.reloadData(false);
    settle();
    EXPECT_NEAR(colorAt(75, 50, QColor(128, 128, 128)).red(), 160, 3) << "the chart lies over it";
    EXPECT_GT(colorAt(75, 72.5).red(), 100) << "3 points into the gutter";
    EXPECT_EQ(colorAt(75, 73), QColor(Qt::black)) << "and no further";
}

TEST_F(ChartView, NewImagesCrossFade) {
    chart.setAnimationStyle(QVChart::AnimationStyle::CrossFade);
    series->chart = QColor(200, 0, 0);
    show();
    EXPECT_EQ(colorAt(75, 50).red(), 200) << "the first layout does not animate";
    chart.advance(now);
    EXPECT_FALSE(chart.isAnimating());

    series->chart = QColor(0, 200, 0);
    repaints = 0;
    chart.reloadData(true);
    settle();
    EXPECT_GT(repaints, 0);
    EXPECT_TRUE(chart.isAnimating());
    EXPECT_EQ(colorAt(75, 50), QColor(200, 0, 0)) << "the new image starts clear";
    EXPECT_TRUE(chart.advance(now + ms(250)));
    const QColor half = colorAt(75, 50);
    EXPECT_NEAR(half.green(), 100, 3);
    EXPECT_NEAR(half.red(), 50, 3) << "the old one fades beneath it";
    EXPECT_FALSE(chart.advance(now + ms(500)));
    EXPECT_EQ(colorAt(75, 50), QColor(0, 200, 0));

    series->chart = QColor(0, 0, 200);
    chart.reloadData(false);
    settle();
    EXPECT_EQ(colorAt(75, 50), QColor(0, 0, 200)) << "not animated: at once";
}

TEST_F(ChartView, NothingFadesOrMovesForAPersonWhoWantsLessMotion) {
    // As the desktop says it.
    const auto desktopSays = [](uint wanted) {
        QMetaObject::invokeMethod(&platform::Appearance::shared(), "portalSettingChanged",
                                  Q_ARG(QString, QStringLiteral("org.freedesktop.appearance")),
                                  Q_ARG(QString, QStringLiteral("reduced-motion")),
                                  Q_ARG(QDBusVariant, QDBusVariant(wanted)));
    };
    desktopSays(1);
    chart.setAnimationStyle(QVChart::AnimationStyle::CrossFade);
    axis->given = {{"a", at(0)}};
    series->chart = QColor(200, 0, 0);
    show();
    series->chart = QColor(0, 200, 0);
    axis->given = {{"a", at(40)}, {"b", at(100)}};
    axis->invalidateCache();
    chart.reloadData(true);
    chart.refreshView();
    settle();
    EXPECT_EQ(colorAt(75, 50), QColor(0, 200, 0));
    EXPECT_EQ(labelCenters(), (std::vector<double>{60, 120}));
    EXPECT_FALSE(chart.advance(now));
    desktopSays(0);
}

TEST_F(ChartView, ThePlotEndsBeforeTheLabelsOfItsBounds) {
    background->setBoundFormatter(
        [](double value, const VSNumberFormatter&) { return value > 5 ? "a long bound" : "0"; });
    show({250, 103});
    const double label = chart.backgroundFrame().left() + background->maximumLabelFrame().left();
    EXPECT_GT(250 - renderer->chartInsets().right, label - 7);
    EXPECT_LE(250 - renderer->chartInsets().right, label - 5);
    EXPECT_EQ(background->chartInsets(), renderer->chartInsets());
    axis->given = {{"a", at(100)}};
    axis->invalidateCache();
    chart.refreshView();
    paint();
    EXPECT_NEAR(chart.xAxisLabels()[0].centerX.target(), 250 - renderer->chartInsets().right, 0.5)
        << "dates stand where the plot has them";
}

TEST_F(ChartView, AReloadWithoutAnimationEndsAFadeAtOnce) {
    series->chart = QColor(200, 0, 0);
    show();
    // As when a card comes back into view: its item has images already.
    chart.setAnimationStyle(QVChart::AnimationStyle::CrossFade);
    const auto empty = makeRenderer();
    chart.setChartRenderer(empty);
    chart.reloadData(false);
    EXPECT_EQ(colorAt(75, 50), QColor(Qt::black));
    chart.setChartRenderer(renderer);
    chart.reloadData(true);
    EXPECT_EQ(colorAt(75, 50), QColor(Qt::black)) << "fading in";
    chart.reloadData(false);
    EXPECT_EQ(colorAt(75, 50), QColor(200, 0, 0));
}

TEST_F(ChartView, ImagesThatFadedOutUnseenAreDropped) {
    chart.setAnimationStyle(QVChart::AnimationStyle::CrossFade);
    show();
    // No frames while the window is hidden: nobody calls advance().
    const QImage first = renderer->chartImage();
    for (int i = 0; i < 2; ++i) {
        EXPECT_FALSE(first.isDetached());
        now += ms(600);
        chart.reloadData(true);
        settle();
    }
    EXPECT_TRUE(first.isDetached()) << "nobody else holds it any more";
}

TEST_F(ChartView, TheSameImagesDoNotFadeAndStyleNoneSwaps) {
    series->chart = QColor(200, 0, 0);
    chart.setAnimationStyle(QVChart::AnimationStyle::CrossFade);
    show();
    chart.reloadData(true);  // shows what is shown already
    chart.advance(now);
    EXPECT_EQ(colorAt(75, 50), QColor(200, 0, 0));
    settle();
    chart.advance(now + ms(500));
    chart.setAnimationStyle(QVChart::AnimationStyle::None);
    series->chart = QColor(0, 200, 0);
    chart.reloadData(true);
    settle();
    EXPECT_EQ(colorAt(75, 50), QColor(0, 200, 0));
}

TEST_F(ChartView, ShowsOnlyImagesOfTheRendererThatItHas) {
    series->chart = QColor(200, 0, 0);
    chart.setSize({150, 103}, 2);
    chart.layoutIfNeeded();
    queue.runNext();
    const auto other = makeRenderer();
    chart.setChartRenderer(other);
    queue.runNext();
    EXPECT_FALSE(renderer->chartImage().isNull());
    EXPECT_EQ(colorAt(75, 50), QColor(Qt::black));
    chart.reloadData(false);
    settle();
    EXPECT_EQ(colorAt(75, 50), QColor(200, 0, 0));
}

TEST_F(ChartView, MayGoAwayBeforeItsImagesCome) {
    auto shortLived = std::make_unique<QVChart>();
    shortLived->setChartRenderer(renderer);
    shortLived->setSize({150, 103}, 2);
    shortLived->layoutIfNeeded();
    shortLived = nullptr;
    settle();
    EXPECT_FALSE(renderer->chartImage().isNull());
}

TEST_F(ChartView, DrawsAnewOnlyWhenItsRectangleChanges) {
    show();
    const qint64 key = renderer->chartImage().cacheKey();
    chart.refreshView();
    chart.layoutIfNeeded();
    queue.runAll();
    EXPECT_EQ(renderer->chartImage().cacheKey(), key);
    show({160, 103});
    EXPECT_EQ(renderer->chartImage().width(), 320);
    show({160, 103}, 3);
    EXPECT_EQ(renderer->chartImage().width(), 480);
}

TEST_F(ChartView, TellsItsBackgroundTheRange) {
    source->bounds = [](double min, double max) {
        return VSDataUnitGroupChartingRules::Bounds{min - 5, max + 5, 1};
    };
    show();
    EXPECT_EQ(background->minValue(), -5);
    EXPECT_EQ(background->maxValue(), 15);
    EXPECT_EQ(background->averageValue(), 5);
    EXPECT_EQ(background->maxDataValue(), 10);
    EXPECT_EQ(background->decimalPrecision(), 1);
    EXPECT_EQ(background->chartInsets(), renderer->chartInsets());
    EXPECT_FALSE(background->showNoDataLabel());

    source->entries[0].points.clear();
    source->finished = false;
    chart.reloadData(true);
    settle();
    EXPECT_FALSE(background->showNoDataLabel()) << "more may come";
    source->finished = true;
    chart.reloadData(true);
    settle();
    EXPECT_TRUE(background->showNoDataLabel());
    EXPECT_FALSE(background->minValue());
    // The range changes: what is to come is not known yet.
    renderer->dropCachedImages();
    source->entries[0].points = {point(0, 1)};
    chart.reloadData(true);
    settle();
    EXPECT_FALSE(background->showNoDataLabel());
}

TEST_F(ChartView, AxisLabelsStandUnderTheirDates) {
    axis->given = {{"a", at(0)}, {"b", at(33.3)}, {"c", at(100)}};
    show();
    // The plot is 100 wide from 20; 53.3 goes to the grid of half points.
    EXPECT_EQ(labelCenters(), (std::vector<double>{20, 53.5, 120}));
    const auto& label = chart.xAxisLabels()[1];
    EXPECT_NEAR(label.frame().width(), 100.0 / 3, 1e-9);
    EXPECT_EQ(label.frame().center().y(), 86.5);
    EXPECT_EQ(label.fontRatio, 1);
    EXPECT_EQ(label.opacity.value(), 1) << "the first labels are there at once";
    renderer->setMaxXValue(at(0));
    chart.refreshView();
    chart.layoutIfNeeded();
    chart.advance(now + ms(250));
    EXPECT_EQ(labelCenters(), std::vector<double>(3, 70)) << "no range: the middle";
}

TEST_F(ChartView, LabelsThatDoNotFitShrinkTogether) {
    const double one = QFontMetricsF(axis->highlightedLabelFont()).horizontalAdvance("mmmm");
    const auto ratioFor = [&](double columnWidth) {
        axis->given = {{"mmmm", at(0)}, {"i", at(100)}};
        axis->invalidateCache();
        chart.setSize({50 + 2 * columnWidth, 103}, 2);
        chart.layoutIfNeeded();
        EXPECT_EQ(chart.xAxisLabels()[0].fontRatio, chart.xAxisLabels()[1].fontRatio);
        return chart.xAxisLabels()[0].fontRatio;
    };
    EXPECT_EQ(ratioFor(one), 1);
    EXPECT_EQ(ratioFor(one * 0.99), 0.9);
    EXPECT_EQ(ratioFor(one * 0.85), 0.8);
    EXPECT_EQ(ratioFor(one * 0.11), 0.1);
    EXPECT_EQ(ratioFor(one * 0.05), 0) << "one step beyond the last try";
}

TEST_F(ChartView, TheFirstAndTheLastLabelStayAndAreWhole) {
    const double one = QFontMetricsF(axis->highlightedLabelFont()).horizontalAdvance("mmmm");
    chart.setDividerInset(12);
    background->setHideMinMaxLabels(true);
    axis->given = {{"mmmm", at(0)}, {"b", at(50)}, {"mmmm", at(100)}};
    renderer->setChartInsets({0, 20, 0, 20});
    const double width = 40 + 4 * std::ceil(one);
    show({width, 103});
    EXPECT_EQ(labelCenters(), (std::vector<double>{12 + one / 2, width / 2, width - 12 - one / 2}));

    platform::TextScale::shared().set(2);
    axis->given = {{"1st m", at(0)}, {"mmmm", at(33)}, {"mmmm", at(67)}, {"now", at(100)}};
    axis->invalidateCache();
    show({40 + 2.5 * one, 103});
    platform::TextScale::shared().set(1);
    ASSERT_EQ(chart.xAxisLabels().size(), 2u);
    EXPECT_EQ(chart.xAxisLabels()[0].text, "1st m");
    EXPECT_EQ(chart.xAxisLabels()[1].text, "now");
}

TEST_F(ChartView, LabelViewsComeAndGoAtAlternateEnds) {
    axis->given = {{"a", at(0)}, {"b", at(100)}};
    show();
    axis->given = {{"a", at(0)}, {"b", at(20)}, {"c", at(40)}, {"d", at(60)}, {"e", at(100)}};
    axis->invalidateCache();
    chart.refreshView();
    chart.layoutIfNeeded();
    // New ones: at the right edge, at the front, at the right edge. The two old ones set out from where they
    // were.
    EXPECT_EQ(labelCenters(), (std::vector<double>{0, 20, 120, 150, 150}));
    EXPECT_TRUE(chart.advance(now + ms(125)));
    EXPECT_EQ(labelCenters()[1], 30) << "halfway from 20 to 40";
    EXPECT_EQ(chart.xAxisLabels()[0].opacity.value(), 0.5);
    EXPECT_EQ(chart.xAxisLabels()[1].opacity.value(), 1);
    EXPECT_FALSE(chart.advance(now + ms(250)));
    EXPECT_EQ(labelCenters(), (std::vector<double>{20, 40, 60, 80, 120}));

    axis->given = {{"x", at(0)}, {"y", at(100)}};
    axis->invalidateCache();
    chart.refreshView();
    chart.layoutIfNeeded();
    EXPECT_EQ(labelCenters(), (std::vector<double>{40, 60})) << "the last, the first and the last went";
    const QImage fading = paint();
    chart.advance(now + ms(250));
    EXPECT_NE(paint(), fading);
    EXPECT_EQ(labelCenters(), (std::vector<double>{20, 120}));

    chart.setShouldAnimateAxisChanges(false);
    axis->given = {{"x", at(50)}};
    axis->invalidateCache();
    chart.refreshView();
    chart.layoutIfNeeded();
    EXPECT_EQ(labelCenters(), (std::vector<double>{70}));
    chart.setXAxisDescriptor(nullptr);
    chart.layoutIfNeeded();
    EXPECT_TRUE(chart.xAxisLabels().empty());
}

TEST_F(ChartView, LabelsAddTheirLightWhereAsked) {
    axis->given = {{QString(QChar(0x2588)), at(50)}};  // a full block
    axis->setHighlightedLabelColor(QColor(255, 255, 255, 128));
    axis->setHighlightedLabelFilter(QPainter::CompositionMode_Plus);
    show();
    const QColor over = colorAt(70, 86.5, QColor(100, 50, 0));
    EXPECT_NEAR(over.red(), 228, 4);
    EXPECT_NEAR(over.green(), 178, 4);
    EXPECT_NEAR(over.blue(), 128, 4);
}

TEST_F(ChartView, ANewDescriptorTakesOverTheRange) {
    const auto next = std::make_shared<QVMonthAxisDescriptor>();
    chart.setXAxisDescriptor(next);
    EXPECT_EQ(next->minValue(), at(0));
    EXPECT_EQ(next->maxValue(), at(100));
}

TEST_F(ChartView, ANewLocaleRenamesTheLabels) {
    const auto month = std::make_shared<QVMonthAxisDescriptor>();
    chart.setXAxisDescriptor(month);
    month->setMinValue(date("2020-03-31"));
    month->setMaxValue(date("2020-04-01"));
    show();
    ASSERT_EQ(chart.xAxisLabels().size(), 1u);
    EXPECT_EQ(chart.xAxisLabels()[0].text, "Mar 31");
    environment->setLocale("de_DE");
    platform::SystemEvents::shared().postLocaleChange();
    chart.layoutIfNeeded();
    EXPECT_EQ(chart.xAxisLabels()[0].text, "31. März");
}
