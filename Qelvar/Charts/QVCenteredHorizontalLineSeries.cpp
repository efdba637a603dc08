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
    QPainterPath path;
    path.setFillRule(Qt::WindingFill);
    for (size_t i = 0; i + 1 < points.size(); i += 2)
        QVAddSegment(path, points[i], points[i + 1], lineWidth_, QVLineCapStyle::Round);
    painter.fillPath(path, fillColor_);
}

void QVCenteredHorizontalLineSeries::renderChart(QPainter& painter) const {
    if (!accentColor_.isValid()) return;
    QPainterPath dots, holes;
    dots.setFillRule(Qt::WindingFill);
    holes.setFillRule(Qt::WindingFill);
    for (const QPointF& point : pointsOfValue(1)) {
        QVAddSegment(dots, point, point, lineWidth_, QVLineCapStyle::Round);
        QVAddSegment(holes, point, point, lineWidth_ / 2, QVLineCapStyle::Round);
    }
    QVPaintWithHoles(painter, imageSize(), holes,
                     [&](QPainter& layer) { layer.fillPath(dots, accentColor_); });
}
