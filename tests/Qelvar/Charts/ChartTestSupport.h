#pragma once

#include <gtest/gtest.h>

#include <QImage>
#include <condition_variable>
#include <deque>
#include <functional>
#include <memory>
#include <mutex>
#include <optional>
#include <string>
#include <vector>

#include "Platform/Queue.h"
#include "Qelvar/Charts/QVChartRendererDataSource.h"
#include "Qelvar/Charts/QVChartSeries.h"
#include "Qelvar/Models/Data/QVChartDataSet.h"
#include "Vessa/Base/VSDate.h"

namespace test {

/// Points of an axis that starts at 0 and counts seconds.
inline VSDate at(double seconds) {
    return VSDate() + VSDurationFromSeconds(seconds);
}
QVChartPointPtr point(double seconds, std::optional<double> value);
QVChartPointPtr minMaxPoint(double seconds, double min, double max);
std::shared_ptr<const QVChartDataSet> dataSet(const std::vector<QVChartPointPtr>& points);

/// The frame in which a series is drawn in these tests; x runs from 0 to `seconds`, y from minY to maxY.
struct Frame {
    QSizeF size{100, 100};
    double seconds = 100;
    double minY = 0, maxY = 100;
    QVEdgeInsets insets;
    double scale = 1;
};
enum class Layer { Chart, Fill, SecondaryFill };

void prepare(QVChartSeries& series, const std::vector<QVChartPointPtr>& points, const Frame& frame);
/// One layer of a prepared series on a transparent image.
QImage draw(const QVChartSeries& series, Layer layer, double scale = 1);
/// Prepares and draws.
QImage draw(QVChartSeries& series, const std::vector<QVChartPointPtr>& points, Layer layer,
            const Frame& frame = {});
/// The alpha of the pixel whose top left is at that point of the image, from 0 to 255.
int alphaAt(const QImage& image, double x, double y);

/// Compares with tests/data/charts/<name>.png.
testing::AssertionResult matchesGolden(const QImage& image, const std::string& name,
                                       int channelTolerance = 12, double share = 0.002);

/// A serial queue whose blocks run when the test says so.
class ManualQueue final : public platform::Queue {
 public:
    void async(std::function<void()> block) override;
    /// Runs what is there, and what that adds.
    void runAll();
    /// Waits for a block, at most a minute, and runs it.
    bool runNext();

 private:
    std::mutex mutex_;
    std::condition_variable arrived_;
    std::deque<std::function<void()>> blocks_;
};

/// A data source made of plain values.
class PlainSource final : public QVChartRendererDataSource {
 public:
    struct Entry {
        std::shared_ptr<QVChartSeries> series;
        std::vector<QVChartPointPtr> points;
    };
    std::vector<Entry> entries;
    bool finished = true;
    std::function<VSDataUnitGroupChartingRules::Bounds(double, double)> bounds = [](double min, double max) {
        return VSDataUnitGroupChartingRules::Bounds{min, max, 0};
    };

    bool dataForChartRendererIsFinishedLoading(const QVChartRenderer&) override { return finished; }
    size_t numberOfSeriesInChartRenderer(const QVChartRenderer&) override { return entries.size(); }
    std::shared_ptr<const QVChartSeries> seriesAtIndex(const QVChartRenderer&, size_t index) override {
        return entries.at(index).series;
    }
    size_t numberOfDataPointsForSeriesAtIndex(const QVChartRenderer&, size_t index) override {
        return entries.at(index).points.size();
    }
    QVChartPointPtr dataPointAtIndex(const QVChartRenderer&, size_t pointIndex, size_t seriesIndex) override {
        return entries.at(seriesIndex).points.at(pointIndex);
    }
    VSDataUnitGroupChartingRules::Bounds adjustChartBounds(double min, double max) override {
        return bounds(min, max);
    }
    const VSDataUnit* dataUnit() override { return nullptr; }
    VSUnitController* unitController() override { return nullptr; }
};

}  // namespace test
