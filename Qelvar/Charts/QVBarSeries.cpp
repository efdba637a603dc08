#include "Qelvar/Charts/QVBarSeries.h"

#include <algorithm>
#include <cmath>

#include "Qelvar/Charts/QVChartDrawing.h"
#include "Qelvar/Models/Data/QVChartDataSet.h"

void QVBarSeries::prepareForRendering(QSizeF size, std::optional<VSDate> minXValue,
                                      std::optional<VSDate> maxXValue, std::optional<double> minYValue,
                                      std::optional<double> maxYValue, const QVEdgeInsets& insets,
                                      std::shared_ptr<const QVChartDataSet> dataSet) {
    QVChartSeries::prepareForRendering(size, minXValue, maxXValue, minYValue, maxYValue, insets,
                                       std::move(dataSet));
    dataPoints_.clear();
    for (const auto& chartPoint : this->dataSet()->allDataPoints()) {
        const QPointF point = pointFromChartPoint(*chartPoint);
        if (std::isfinite(point.y())) dataPoints_.push_back(point);
    }
}

void QVBarSeries::renderFill(QPainter& painter) const {
    const double base = imageSize().height() - bottomPadding_, width = widthHeldApart(barWidth_);
    QVPaintLayer(painter, imageSize(), fillColor_.alphaF(), [&](QPainter& layer) {
        for (const QPointF& point : dataPoints_)
            QVFillSegment(layer, {point.x(), base}, {point.x(), std::min(point.y(), base)}, width,
                          lineCapStyle_, QVOpaque(fillColor_));
    });
}

void QVBarSeries::renderChart(QPainter& painter) const {
    if (!edgeColor().isValid()) return;
    const double base = imageSize().height() - bottomPadding_, width = widthHeldApart(barWidth_);
    std::vector<QRectF> outlines;
    for (const QPointF& point : dataPoints_)
        outlines.push_back(QVSegmentOutline(painter, {point.x(), base},
                                            {point.x(), std::min(point.y(), base)}, width, lineCapStyle_));
    if (lineCapStyle_ == QVLineCapStyle::Round)
        QVDrawEdges(painter, imageSize(), outlines, edgeColor());
    else
        QVDrawSideEdges(painter, outlines, edgeColor());
}
