#pragma once

#include <cstddef>
#include <memory>

#include "VessaUI/VSDataUnitGroupChartingRules.h"

class QVChartPoint;
class QVChartRenderer;
class QVChartSeries;
class VSDataUnit;
class VSUnitController;

/// Where a chart renderer gets its series, points and vertical range from. Asked on the renderer's client
/// queue.
class QVChartRendererDataSource {
 public:
    virtual ~QVChartRendererDataSource() = default;

    /// Whether all data of the current range has arrived.
    virtual bool dataForChartRendererIsFinishedLoading(const QVChartRenderer& renderer) = 0;
    virtual size_t numberOfSeriesInChartRenderer(const QVChartRenderer& renderer) = 0;
    /// Null: nothing is drawn for that index.
    virtual std::shared_ptr<const QVChartSeries> seriesAtIndex(const QVChartRenderer& renderer,
                                                               size_t index) = 0;
    virtual size_t numberOfDataPointsForSeriesAtIndex(const QVChartRenderer& renderer,
                                                      size_t seriesIndex) = 0;
    virtual std::shared_ptr<QVChartPoint> dataPointAtIndex(const QVChartRenderer& renderer, size_t pointIndex,
                                                           size_t seriesIndex) = 0;
    /// Widens the range of the data to the bounds of the chart, and says how many fraction digits they need.
    virtual VSDataUnitGroupChartingRules::Bounds adjustChartBounds(double min, double max) = 0;
    virtual const VSDataUnit* dataUnit() = 0;
    /// Outlives whoever draws the chart. May be null.
    virtual VSUnitController* unitController() = 0;
};
