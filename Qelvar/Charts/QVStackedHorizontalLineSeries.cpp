#include "Qelvar/Charts/QVStackedHorizontalLineSeries.h"

#include <cmath>

#include "Qelvar/Charts/QVChartDrawing.h"
#include "Qelvar/Models/Data/QVChartDataSet.h"

void QVStackedHorizontalLineSeries::prepareForRendering(QSizeF size, std::optional<VSDate> minXValue,
                                                        std::optional<VSDate> maxXValue,
                                                        std::optional<double> minYValue,
                                                        std::optional<double> maxYValue,
                                                        const QVEdgeInsets& insets,
                                                        std::shared_ptr<const QVChartDataSet> dataSet) {
    QVChartSeries::prepareForRendering(size, minXValue, maxXValue, minYValue, maxYValue, insets,
                                       std::move(dataSet));
    chartPointsByValue_.clear();
    for (const auto& chartPoint : this->dataSet()->allDataPoints()) {
        const std::vector<double> values = chartPoint->allYValues();
        if (values.empty() || !std::isfinite(values.front())) continue;
        chartPointsByValue_[static_cast<int>(values.front())].push_back(xForChartPoint(*chartPoint));
    }
}

template <typename Draw>
void QVStackedHorizontalLineSeries::forEachSegment(Draw draw) const {
    for (size_t row = 0; row < enumeratedValueOrder().size(); ++row) {
        const std::vector<double>& points = pointsOfRow(row);
        const double y = yForRow(row);
        for (size_t i = 0; i + 1 < points.size(); i += 2)
            draw(QPointF(points[i], y), QPointF(points[i + 1], y));
    }
}

void QVStackedHorizontalLineSeries::renderFill(QPainter& painter) const {
    QVPaintLayer(painter, imageSize(), fillColor_.alphaF(), [&](QPainter& layer) {
        forEachSegment([&](QPointF start, QPointF end) {
            QVFillSegment(layer, start, end, lineWidth_, QVLineCapStyle::Round, QVOpaque(fillColor_));
        });
    });
}

void QVStackedHorizontalLineSeries::renderChart(QPainter& painter) const {
    if (edgeColor().isValid()) {
        std::vector<QRectF> outlines;
        forEachSegment([&](QPointF start, QPointF end) {
            outlines.push_back(QVSegmentOutline(painter, start, end, lineWidth_, QVLineCapStyle::Round));
        });
        QVDrawEdges(painter, imageSize(), outlines, edgeColor());
    }
    QVStackedValueSeries::renderChart(painter);
}
