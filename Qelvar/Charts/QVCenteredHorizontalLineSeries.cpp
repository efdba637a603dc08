#include "Qelvar/Charts/QVCenteredHorizontalLineSeries.h"

#include <cmath>

#include "Qelvar/Charts/QVChartDrawing.h"
#include "Qelvar/Models/Data/QVChartDataSet.h"

std::vector<QPointF> QVCenteredHorizontalLineSeries::pointsOfValue(int value) const {
    std::vector<QPointF> points;
    if (!dataSet()) return points;
    for (const auto& chartPoint : dataSet()->allDataPoints()) {
        const std::vector<double> values = chartPoint->allYValues();
        if (!values.empty() && std::trunc(values.front()) == value)
            points.emplace_back(xForChartPoint(*chartPoint), imageSize().height() / 2);
    }
    return points;
}

void QVCenteredHorizontalLineSeries::renderFill(QPainter& painter) const {
    const std::vector<QPointF> points = pointsOfValue(0);
    QVPaintLayer(painter, imageSize(), fillColor_.alphaF(), [&](QPainter& layer) {
        for (size_t i = 0; i + 1 < points.size(); i += 2)
            QVFillSegment(layer, points[i], points[i + 1], widthHeldApart(lineWidth_), QVLineCapStyle::Round,
                          QVOpaque(fillColor_));
    });
}

void QVCenteredHorizontalLineSeries::renderChart(QPainter& painter) const {
    const double width = widthHeldApart(lineWidth_);
    const std::vector<QPointF> ends = pointsOfValue(0), accents = pointsOfValue(1);
    if (edgeColor().isValid()) {
        std::vector<QRectF> outlines;
        for (size_t i = 0; i + 1 < ends.size(); i += 2)
            outlines.push_back(QVSegmentOutline(painter, ends[i], ends[i + 1], width, QVLineCapStyle::Round));
        QVDrawEdges(painter, imageSize(), outlines, edgeColor());
    }
    if (!accentColor_.isValid()) return;
    QVPaintLayer(painter, imageSize(), accentColor_.alphaF(), [&](QPainter& layer) {
        for (const QPointF& point : accents)
            QVFillSegment(layer, point, point, width, QVLineCapStyle::Round, QVOpaque(accentColor_));
        QVEraseCircles(layer, accents, width / 4);
    });
}
