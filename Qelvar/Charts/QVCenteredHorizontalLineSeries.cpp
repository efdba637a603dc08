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
            QVFillSegment(layer, points[i], points[i + 1], lineWidth_, QVLineCapStyle::Round,
                          QVOpaque(fillColor_));
    });
}

void QVCenteredHorizontalLineSeries::renderChart(QPainter& painter) const {
    if (!accentColor_.isValid()) return;
    const std::vector<QPointF> points = pointsOfValue(1);
    QVPaintLayer(painter, imageSize(), accentColor_.alphaF(), [&](QPainter& layer) {
        for (const QPointF& point : points)
            QVFillSegment(layer, point, point, lineWidth_, QVLineCapStyle::Round, QVOpaque(accentColor_));
        QVEraseCircles(layer, points, lineWidth_ / 4);
    });
}
