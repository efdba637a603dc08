#include <atomic>
#include <thread>

#include "ChartTestSupport.h"
#include "Qelvar/Charts/QVBarSeries.h"
#include "Qelvar/Charts/QVChartRenderer.h"
#include "Qelvar/Charts/QVLineSeries.h"
#include "TestSupport.h"

using namespace test;

namespace {

/// Fills the image with a colour, in each layer another one; can be held up while it draws.
class SolidSeries final : public QVChartSeries {
 public:
    struct Gate {
        Promise<bool> entered;
        Promise<bool> mayGoOn;
    };
    QColor color = Qt::red;
    std::shared_ptr<Gate> gate;

    void renderChart(QPainter& painter) const override {
        if (gate) {
            gate->entered.set(true);
            gate->mayGoOn.wait();
        }
        painter.fillRect(QRectF(0, 0, imageSize().width() / 2, imageSize().height()), color);
    }
    void renderFill(QPainter& painter) const override {
        painter.fillRect(QRectF(QPointF(), imageSize()), Qt::green);
    }
    void renderSecondaryFill(QPainter& painter) const override {
        painter.fillRect(QRectF(0, 0, imageSize().width(), imageSize().height() / 2), Qt::blue);
    }

 protected:
    std::unique_ptr<QVChartSeries> clone() const override { return std::make_unique<SolidSeries>(*this); }
};

class ChartRenderer : public testing::Test {
 protected:
    ManualQueue queue;
    std::shared_ptr<PlainSource> source = std::make_shared<PlainSource>();
    std::shared_ptr<SolidSeries> series = std::make_shared<SolidSeries>();
    std::shared_ptr<QVChartRenderer> renderer = QVChartRenderer::create(queue, source);

    void SetUp() override {
        source->entries = {{series, {point(0, 10), point(50, 30)}}};
        renderer->setMinXValue(at(0));
        renderer->setMaxXValue(at(100));
    }

    struct Result {
        QImage chart, fill, secondaryFill;
        bool finished = false;
        int calls = 0;
    };
    void start(Result& result, QSizeF size = {40, 20}, double scale = 2, bool separate = true) {
        renderer->renderChart(
            size, {3, 0, 3, 0}, scale, separate,
            [&result](const QImage& chart, const QImage& fill, const QImage& secondaryFill, bool finished) {
                result = {chart, fill, secondaryFill, finished, result.calls + 1};
            });
    }
    Result render(QSizeF size = {40, 20}, double scale = 2, bool separate = true) {
        Result result;
        start(result, size, scale, separate);
        queue.runNext();
        while (result.calls == 0 && queue.runNext()) continue;
        return result;
    }
};

}  // namespace

TEST_F(ChartRenderer, DrawsEachLayerIntoAnImageOfItsOwn) {
    EXPECT_EQ(renderer->dataState(), QVChartDataState::NotRendered);
    const Result result = render();
    EXPECT_EQ(result.calls, 1);
    EXPECT_TRUE(result.finished);
    EXPECT_EQ(result.chart.size(), QSize(80, 40));
    EXPECT_EQ(result.chart.devicePixelRatio(), 2);
    EXPECT_EQ(result.chart.pixelColor(10, 10), QColor(Qt::red));
    EXPECT_EQ(result.chart.pixelColor(70, 10).alpha(), 0);
    EXPECT_EQ(result.fill.pixelColor(70, 30), QColor(Qt::green));
    EXPECT_EQ(result.secondaryFill.pixelColor(70, 10), QColor(Qt::blue));
    EXPECT_EQ(result.secondaryFill.pixelColor(70, 30).alpha(), 0);
    EXPECT_EQ(renderer->chartImage(), result.chart);
    EXPECT_EQ(renderer->dataState(), QVChartDataState::RenderedWithData);
    EXPECT_EQ(renderer->averageYValue(), 20);
}

TEST_F(ChartRenderer, LaysTheLayersOverEachOtherWhenTheyShareAnImage) {
    const Result result = render({40, 20}, 1, false);
    EXPECT_TRUE(result.fill.isNull());
    EXPECT_TRUE(result.secondaryFill.isNull());
    EXPECT_EQ(result.chart.pixelColor(5, 5), QColor(Qt::red)) << "chart over all";
    EXPECT_EQ(result.chart.pixelColor(30, 5), QColor(Qt::blue)) << "secondary fill over fill";
    EXPECT_EQ(result.chart.pixelColor(30, 15), QColor(Qt::green));
}

TEST_F(ChartRenderer, GivesSeriesTheInsetsAndRanges) {
    const auto bars = std::make_shared<QVBarSeries>();
    bars->setFillColor(Qt::white);
    bars->setBarWidth(4);
    bars->setLineCapStyle(QVLineCapStyle::Butt);
    source->entries = {{bars, {point(0, 10), point(100, 30)}}};
    source->bounds = [](double min, double max) {
        return VSDataUnitGroupChartingRules::Bounds{min - 10, max + 10, 2};
    };
    renderer->setChartInsets({0, 10, 0, 20});
    const Result result = render({130, 46}, 1);
    EXPECT_EQ(renderer->minYValue(), 0);
    EXPECT_EQ(renderer->maxYValue(), 40);
    EXPECT_EQ(renderer->maxYValueInData(), 30);
    EXPECT_EQ(renderer->decimalPrecision(), 2);
    // The plot is 100 x 40, from (10, 3).
    EXPECT_GT(alphaAt(result.fill, 10, 40), 250);
    EXPECT_GT(alphaAt(result.fill, 10, 33), 250);
    EXPECT_EQ(alphaAt(result.fill, 10, 32), 0);
    EXPECT_GT(alphaAt(result.fill, 110, 13), 250);
    EXPECT_EQ(alphaAt(result.fill, 110, 12), 0);
}

TEST_F(ChartRenderer, WithoutDataOrSizeThereAreNoImagesButACompletion) {
    const Result sizeless = render({0, 20});
    EXPECT_EQ(sizeless.calls, 1);
    EXPECT_TRUE(sizeless.chart.isNull());
    EXPECT_EQ(renderer->dataState(), QVChartDataState::RenderedWithData) << "there is data all the same";

    source->entries[0].points.clear();
    source->finished = false;
    const Result empty = render();
    EXPECT_TRUE(empty.chart.isNull() && empty.fill.isNull() && empty.secondaryFill.isNull());
    EXPECT_FALSE(empty.finished);
    EXPECT_EQ(renderer->dataState(), QVChartDataState::RenderedWithoutData);
    EXPECT_FALSE(renderer->minYValue());
    EXPECT_FALSE(renderer->maxYValue());

    source = nullptr;
    const Result sourceless = render();
    EXPECT_EQ(sourceless.calls, 1);
    EXPECT_TRUE(sourceless.chart.isNull());
    EXPECT_EQ(renderer->dataUnit(), nullptr);
}

TEST_F(ChartRenderer, BoundsThatAreNoNumbersAreNone) {
    source->bounds = [](double, double max) {
        return VSDataUnitGroupChartingRules::Bounds{std::numeric_limits<double>::quiet_NaN(), max, 0};
    };
    render();
    EXPECT_FALSE(renderer->minYValue());
    EXPECT_EQ(renderer->maxYValue(), 30);
}

TEST_F(ChartRenderer, ASeriesThatIsMissingLeavesTheOthersAlone) {
    source->entries.insert(source->entries.begin(), PlainSource::Entry{nullptr, {point(0, 1)}});
    EXPECT_EQ(render().chart.pixelColor(10, 10), QColor(Qt::red));
}

TEST_F(ChartRenderer, ADrawingUnderWayDoesNotSeeChanges) {
    series->gate = std::make_shared<SolidSeries::Gate>();
    Result result;
    start(result);
    queue.runNext();
    ASSERT_TRUE(series->gate->entered.wait());
    const auto gate = series->gate;
    series->gate = nullptr;
    series->color = Qt::yellow;
    source->entries[0].points.clear();
    renderer->dataGroup()->reloadData();
    renderer->setMaxXValue(at(5));
    gate->mayGoOn.set(true);
    queue.runNext();
    EXPECT_EQ(result.calls, 1);
    EXPECT_EQ(result.chart.pixelColor(10, 10), QColor(Qt::red));
    EXPECT_EQ(renderer->dataState(), QVChartDataState::RenderedWithData);
}

TEST_F(ChartRenderer, AnOlderDrawingNeverReplacesALaterOne) {
    series->gate = std::make_shared<SolidSeries::Gate>();
    const auto gate = series->gate;
    Result first, second;
    start(first);
    queue.runNext();
    ASSERT_TRUE(gate->entered.wait());
    series->gate = nullptr;
    series->color = Qt::yellow;
    start(second);
    queue.runNext();
    queue.runNext();
    EXPECT_EQ(second.calls, 1);
    gate->mayGoOn.set(true);
    queue.runNext();
    EXPECT_EQ(first.calls, 1);
    EXPECT_EQ(first.chart.pixelColor(10, 10), QColor(Qt::yellow)) << "its completion gets the later images";
    EXPECT_EQ(renderer->chartImage().pixelColor(10, 10), QColor(Qt::yellow));
}

TEST_F(ChartRenderer, ADrawingOvertakenBeforeItBeganIsDoneWithTheLaterOne) {
    Result first, second;
    start(first);
    start(second);
    queue.runNext();
    queue.runNext();
    while ((first.calls == 0 || second.calls == 0) && queue.runNext()) continue;
    queue.runAll();
    EXPECT_EQ(first.calls, 1);
    EXPECT_EQ(second.calls, 1);
    EXPECT_FALSE(first.chart.isNull());
    EXPECT_EQ(first.chart.cacheKey(), second.chart.cacheKey());
}

TEST_F(ChartRenderer, ImagesOfADroppedRangeAreNotKept) {
    render();
    series->gate = std::make_shared<SolidSeries::Gate>();
    const auto gate = series->gate;
    Result late;
    start(late);
    queue.runNext();
    ASSERT_TRUE(gate->entered.wait());
    renderer->dropCachedImages();
    EXPECT_TRUE(renderer->chartImage().isNull());
    EXPECT_FALSE(renderer->finishedLoadingData());
    gate->mayGoOn.set(true);
    queue.runNext();
    EXPECT_EQ(late.calls, 1);
    EXPECT_TRUE(late.chart.isNull());
    EXPECT_TRUE(renderer->chartImage().isNull());
    series->gate = nullptr;
    EXPECT_FALSE(render().chart.isNull());
}

TEST_F(ChartRenderer, ADrawingOvertakenByADroppedOneIsDoneToo) {
    series->gate = std::make_shared<SolidSeries::Gate>();
    Result first, second;
    start(first);
    start(second);
    queue.runNext();
    queue.runNext();
    ASSERT_TRUE(series->gate->entered.wait());
    renderer->dropCachedImages();
    series->gate->mayGoOn.set(true);
    queue.runNext();
    queue.runNext();
    EXPECT_EQ(first.calls, 1);
    EXPECT_EQ(second.calls, 1);
    EXPECT_TRUE(renderer->chartImage().isNull());
}

TEST_F(ChartRenderer, MayGoAwayWhileADrawingIsUnderWay) {
    series->gate = std::make_shared<SolidSeries::Gate>();
    Result result;
    start(result);
    queue.runNext();
    ASSERT_TRUE(series->gate->entered.wait());
    const std::weak_ptr<QVChartRenderer> weak = renderer;
    std::thread destroyer([this] { renderer = nullptr; });
    series->gate->mayGoOn.set(true);
    destroyer.join();
    EXPECT_TRUE(weak.expired());
    queue.runAll();
    EXPECT_EQ(result.calls, 0);
}

TEST_F(ChartRenderer, MayGoAwayBeforeItsReload) {
    Result result;
    start(result);
    renderer = nullptr;
    queue.runAll();
    EXPECT_EQ(result.calls, 0);
}

TEST_F(ChartRenderer, ManyDrawingsEndWithTheNewestAndEveryCompletion) {
    std::vector<Result> results(50);
    for (size_t i = 0; i < results.size(); ++i) {
        series->color = QColor(static_cast<int>(i), 0, 0);
        start(results[i]);
        queue.runNext();
    }
    const auto open = [&] {
        return std::any_of(results.begin(), results.end(), [](const Result& one) { return one.calls == 0; });
    };
    while (open() && queue.runNext()) continue;
    for (const Result& one : results) EXPECT_EQ(one.calls, 1);
    EXPECT_EQ(renderer->chartImage().pixelColor(10, 10), QColor(49, 0, 0));
}
