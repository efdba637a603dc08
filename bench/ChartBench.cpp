#include <benchmark/benchmark.h>

#include <QGuiApplication>
#include <QPainter>
#include <QPainterPath>
#include <QPen>
#include <algorithm>
#include <chrono>
#include <cmath>
#include <functional>
#include <future>
#include <vector>

#include "Qelvar/Charts/QVBarSeries.h"
#include "Qelvar/Charts/QVChartDrawing.h"
#include "Qelvar/Charts/QVChartRenderer.h"
#include "Qelvar/Charts/QVLineSeries.h"
#include "Qelvar/Charts/QVMinMaxSeries.h"
#include "Qelvar/Models/Data/QVChartPoint.h"

// The three images of a card's chart as the renderer makes them, from the call to the completion, against a
// bare QPainter that draws the same shapes into three images of that size. Both in turn, in the same run.

namespace {

constexpr QSizeF kSize(367, 143);
constexpr double kScale = 2;
const QVEdgeInsets kInsets{0, 13, 0, 39};
const VSDate kStart = VSDate::fromSecondsSinceReferenceDate(600'000'000);
constexpr double kDay = 86'400;

const QColor kHalfWhite = QColor::fromRgbF(1, 1, 1, 0.5f);
constexpr double kRadius = 3, kRingWidth = 1.5, kBarWidth = 5, kBarBottom = 8;

struct Reading {
    double low, high;
};

std::vector<Reading> readings(int count) {
    std::vector<Reading> result;
    for (int i = 0; i < count; ++i) {
        const double low = 48 + 10 * std::sin(i * 1.3);
        result.push_back({low, low + 45 + 40 * std::sin(i * 0.7)});
    }
    return result;
}

class Source final : public QVChartRendererDataSource {
 public:
    std::shared_ptr<QVChartSeries> series;
    std::vector<QVChartPointPtr> points;

    bool dataForChartRendererIsFinishedLoading(const QVChartRenderer&) override { return true; }
    size_t numberOfSeriesInChartRenderer(const QVChartRenderer&) override { return 1; }
    std::shared_ptr<const QVChartSeries> seriesAtIndex(const QVChartRenderer&, size_t) override {
        return series;
    }
    size_t numberOfDataPointsForSeriesAtIndex(const QVChartRenderer&, size_t) override {
        return points.size();
    }
    std::shared_ptr<QVChartPoint> dataPointAtIndex(const QVChartRenderer&, size_t index, size_t) override {
        return points[index];
    }
    VSDataUnitGroupChartingRules::Bounds adjustChartBounds(double, double) override { return {30, 150, 0}; }
    const VSDataUnit* dataUnit() override { return nullptr; }
    VSUnitController* unitController() override { return nullptr; }
};

struct Images {
    QImage chart, fill, secondaryFill;
};

/// The renderer with a client of its own, as a card has one.
class Ours {
 public:
    Ours(std::shared_ptr<QVChartSeries> series, std::vector<QVChartPointPtr> points, int days) {
        source_->series = std::move(series);
        source_->points = std::move(points);
        renderer_->setMinXValue(kStart);
        renderer_->setMaxXValue(kStart + VSDurationFromSeconds(days * kDay));
        renderer_->setChartInsets(kInsets);
    }
    Images draw() {
        std::promise<Images> done;
        renderer_->renderChart(
            kSize, {3, 0, 3, 0}, kScale, true,
            [&done](const QImage& chart, const QImage& fill, const QImage& secondaryFill, bool) {
                done.set_value({chart, fill, secondaryFill});
            });
        return done.get_future().get();
    }

 private:
    std::shared_ptr<platform::Queue> client_ = platform::makeSerialQueue("ChartBench");
    std::shared_ptr<Source> source_ = std::make_shared<Source>();
    std::shared_ptr<QVChartRenderer> renderer_ = QVChartRenderer::create(*client_, source_);
};

/// The same shapes where the series puts them.
class Bare {
 public:
    explicit Bare(const std::vector<Reading>& readings) {
        const double width = kSize.width() - kInsets.left - kInsets.right, height = kSize.height() - 6;
        const auto y = [height](double value) { return 3 + std::floor((150 - value) / 120 * height); };
        for (size_t i = 0; i < readings.size(); ++i) {
            const double x = kInsets.left + std::floor((static_cast<double>(i) + 0.5) * width /
                                                       static_cast<double>(readings.size()));
            low_.emplace_back(x, y(readings[i].low));
            high_.emplace_back(x, y(readings[i].high));
        }
    }

    Images drawLine() const {
        return {image([this](QPainter& painter) {
                    painter.setPen(QPen(Qt::white, 1));
                    painter.drawPolyline(high_.data(), static_cast<int>(high_.size()));
                    clearCircles(painter, high_);
                    drawRings(painter, high_);
                }),
                image([this](QPainter& painter) {
                    QLinearGradient gradient(0, 0, 0, kSize.height());
                    gradient.setColorAt(0, QColor::fromRgbF(1, 1, 1, 0.8f));
                    gradient.setColorAt(1, QColor::fromRgbF(1, 1, 1, 0));
                    QPolygonF area(QList<QPointF>(high_.begin(), high_.end()));
                    area << QPointF(high_.back().x(), kSize.height())
                         << QPointF(high_.front().x(), kSize.height());
                    painter.setPen(Qt::NoPen);
                    painter.setBrush(gradient);
                    painter.drawPolygon(area);
                    clearCircles(painter, high_);
                }),
                image([](QPainter&) {})};
    }
    Images drawBars() const {
        return {image([](QPainter&) {}), image([this](QPainter& painter) {
                    painter.setPen(QPen(kHalfWhite, kBarWidth, Qt::SolidLine, Qt::RoundCap));
                    for (const QPointF& top : high_)
                        painter.drawLine(QPointF(top.x(), kSize.height() - kBarBottom), top);
                }),
                image([](QPainter&) {})};
    }
    Images drawRanges() const {
        return {image([this](QPainter& painter) {
                    drawRings(painter, high_);
                    drawRings(painter, low_);
                }),
                image([this](QPainter& painter) {
                    painter.setPen(QPen(kHalfWhite, 2 * kRadius, Qt::SolidLine, Qt::FlatCap));
                    for (size_t i = 0; i < low_.size(); ++i) painter.drawLine(low_[i], high_[i]);
                    clearCircles(painter, high_);
                    clearCircles(painter, low_);
                }),
                image([](QPainter&) {})};
    }

 private:
    static QImage image(const std::function<void(QPainter&)>& draw) {
        QImage result((kSize * kScale).toSize(), QImage::Format_ARGB32_Premultiplied);
        result.setDevicePixelRatio(kScale);
        result.fill(Qt::transparent);
        QPainter painter(&result);
        painter.setRenderHint(QPainter::Antialiasing);
        draw(painter);
        return result;
    }
    static void drawRings(QPainter& painter, const std::vector<QPointF>& centers) {
        painter.setPen(QPen(Qt::white, kRingWidth));
        painter.setBrush(Qt::NoBrush);
        const double radius = kRadius - kRingWidth / 2;
        for (const QPointF& center : centers) painter.drawEllipse(center, radius, radius);
    }
    static void clearCircles(QPainter& painter, const std::vector<QPointF>& centers) {
        painter.save();
        painter.setCompositionMode(QPainter::CompositionMode_Clear);
        painter.setPen(Qt::NoPen);
        painter.setBrush(Qt::black);
        for (const QPointF& center : centers) painter.drawEllipse(center, kRadius, kRadius);
        painter.restore();
    }

    std::vector<QPointF> low_, high_;
};

template <typename Draw>
double milliseconds(Draw draw) {
    const auto start = std::chrono::steady_clock::now();
    benchmark::DoNotOptimize(draw());
    return std::chrono::duration<double, std::milli>(std::chrono::steady_clock::now() - start).count();
}

double median(std::vector<double> values) {
    std::nth_element(values.begin(), values.begin() + values.size() / 2, values.end());
    return values[values.size() / 2];
}

template <typename DrawOurs, typename DrawBare>
void compare(benchmark::State& state, DrawOurs ours, DrawBare bare) {
    std::vector<double> ourTimes, bareTimes;
    for (auto _ : state) {
        ourTimes.push_back(milliseconds(ours));
        bareTimes.push_back(milliseconds(bare));
        state.SetIterationTime(ourTimes.back() / 1000);
    }
    state.counters["median_ms"] = median(ourTimes);
    state.counters["bare_median_ms"] = median(bareTimes);
    state.counters["ratio"] = median(ourTimes) / median(bareTimes);
}

template <typename Point>
std::vector<QVChartPointPtr> points(const std::vector<Reading>& readings, Point point) {
    std::vector<QVChartPointPtr> result;
    for (size_t i = 0; i < readings.size(); ++i)
        result.push_back(
            point(kStart + VSDurationFromSeconds((static_cast<double>(i) + 0.5) * kDay), readings[i]));
    return result;
}

QVChartPointPtr numberPoint(VSDate date, const Reading& reading) {
    return QVChartPointNumeric::chartPoint(date, reading.high);
}
QVChartPointPtr rangePoint(VSDate date, const Reading& reading) {
    return QVChartPointDictionary::chartPoint(date, {{"min", reading.low}, {"max", reading.high}});
}

void WeekOfALine(benchmark::State& state) {
    auto series = std::make_shared<QVLineSeries>();
    series->setWaveForm(QVLineSeries::WaveForm::SawTooth);
    series->setLineWidth(1);
    series->setLineColor(Qt::white);
    series->setPointRadius(kRadius);
    series->setPointLineWidth(kRingWidth);
    series->setPointStyle(QVPointStyle::Ring);
    series->setFillGradient(QVGradientObject::gradientWithTopColor(QColor::fromRgbF(1, 1, 1, 0.8f),
                                                                   QColor::fromRgbF(1, 1, 1, 0)));
    series->setSecondaryFillGradient(
        QVGradientObject::gradientWithTopColor(Qt::black, QColor::fromRgbF(0, 0, 0, 0)));
    const auto data = readings(7);
    Ours ours(series, points(data, numberPoint), 7);
    const Bare bare(data);
    compare(
        state, [&] { return ours.draw(); }, [&] { return bare.drawLine(); });
}

void WeekOfBars(benchmark::State& state) {
    auto series = std::make_shared<QVBarSeries>();
    series->setBarWidth(kBarWidth);
    series->setLineCapStyle(QVLineCapStyle::Round);
    series->setFillColor(kHalfWhite);
    series->setEdgeColor(QColor::fromRgbF(1, 1, 1, 0.75f));
    series->setBottomPadding(kBarBottom);
    const auto data = readings(7);
    Ours ours(series, points(data, numberPoint), 7);
    const Bare bare(data);
    compare(
        state, [&] { return ours.draw(); }, [&] { return bare.drawBars(); });
}

void ranges(benchmark::State& state, int days) {
    auto series = std::make_shared<QVMinMaxSeries>();
    series->setMinPointStyle(QVPointStyle::Ring);
    series->setMaxPointStyle(QVPointStyle::Ring);
    series->setPointRadius(kRadius);
    series->setPointLineWidth(kRingWidth);
    series->setFillColor(kHalfWhite);
    series->setEdgeColor(QColor::fromRgbF(1, 1, 1, 0.75f));
    const auto data = readings(days);
    Ours ours(series, points(data, rangePoint), days);
    const Bare bare(data);
    compare(
        state, [&] { return ours.draw(); }, [&] { return bare.drawRanges(); });
}
void WeekOfRanges(benchmark::State& state) {
    ranges(state, 7);
}
void YearOfDailyRanges(benchmark::State& state) {
    ranges(state, 365);
}

BENCHMARK(WeekOfALine)->UseManualTime()->Unit(benchmark::kMillisecond);
BENCHMARK(WeekOfBars)->UseManualTime()->Unit(benchmark::kMillisecond);
BENCHMARK(WeekOfRanges)->UseManualTime()->Unit(benchmark::kMillisecond);
BENCHMARK(YearOfDailyRanges)->UseManualTime()->Unit(benchmark::kMillisecond);

}  // namespace

int main(int argc, char** argv) {
    qputenv("QT_QPA_PLATFORM", "offscreen");
    QGuiApplication application(argc, argv);
    benchmark::Initialize(&argc, argv);
    benchmark::RunSpecifiedBenchmarks();
    return 0;
}
