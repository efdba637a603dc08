#include "ChartTestSupport.h"

#include <QPainter>
#include <algorithm>
#include <chrono>
#include <cstdlib>

#include "PictureTestSupport.h"
#include "Qelvar/Charts/QVChartDrawing.h"

namespace test {

QVChartPointPtr point(double seconds, std::optional<double> value) {
    return QVChartPointNumeric::chartPoint(at(seconds), value);
}

QVChartPointPtr minMaxPoint(double seconds, double min, double max) {
    return QVChartPointDictionary::chartPoint(at(seconds), {{"min", min}, {"max", max}});
}

namespace {

struct PointsSource : QVChartDataSetDataSource {
    std::vector<QVChartPointPtr> points;
    size_t numberOfDataPointsForDataSet(const QVChartDataSet&) override { return points.size(); }
    QVChartPointPtr chartPointForIndex(const QVChartDataSet&, size_t index) override { return points[index]; }
};

}  // namespace

std::shared_ptr<const QVChartDataSet> dataSet(const std::vector<QVChartPointPtr>& points) {
    const auto source = std::make_shared<PointsSource>();
    source->points = points;
    const auto result = std::make_shared<QVChartDataSet>();
    result->setDataSource(source);
    result->reloadData();
    return result;
}

void prepare(QVChartSeries& series, const std::vector<QVChartPointPtr>& points, const Frame& frame) {
    series.prepareForRendering(frame.size, at(0), at(frame.seconds), frame.minY, frame.maxY, frame.insets,
                               dataSet(points));
}

QImage draw(const QVChartSeries& series, Layer layer, double scale) {
    QImage image = QVTransparentImage(series.imageSize(), scale);
    QPainter painter(&image);
    painter.setRenderHints(QPainter::Antialiasing | QPainter::TextAntialiasing |
                           QPainter::SmoothPixmapTransform);
    if (layer == Layer::Chart) series.renderChart(painter);
    if (layer == Layer::Fill) series.renderFill(painter);
    if (layer == Layer::SecondaryFill) series.renderSecondaryFill(painter);
    return image;
}

QImage draw(QVChartSeries& series, const std::vector<QVChartPointPtr>& points, Layer layer,
            const Frame& frame) {
    prepare(series, points, frame);
    return draw(series, layer, frame.scale);
}

int alphaAt(const QImage& image, double x, double y) {
    const double scale = image.devicePixelRatio();
    return qAlpha(image.pixel(static_cast<int>(x * scale), static_cast<int>(y * scale)));
}

testing::AssertionResult matchesGolden(const QImage& image, const std::string& name, int channelTolerance,
                                       double share) {
    return matchesPicture(image, "charts/" + name, channelTolerance, share);
}

void ManualQueue::async(std::function<void()> block) {
    const std::lock_guard lock(mutex_);
    blocks_.push_back(std::move(block));
    arrived_.notify_all();
}

bool ManualQueue::runNext() {
    std::function<void()> block;
    {
        std::unique_lock lock(mutex_);
        if (!arrived_.wait_for(lock, std::chrono::minutes(1), [this] { return !blocks_.empty(); }))
            return false;
        block = std::move(blocks_.front());
        blocks_.pop_front();
    }
    block();
    return true;
}

void ManualQueue::runAll() {
    while (true) {
        {
            const std::lock_guard lock(mutex_);
            if (blocks_.empty()) return;
        }
        runNext();
    }
}

}  // namespace test
