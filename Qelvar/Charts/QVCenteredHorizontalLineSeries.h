#pragma once

#include <QColor>

#include "Qelvar/Charts/QVChartSeries.h"

/// One band of segments in the vertical middle: points of value 0 pair up into segments, points of value 1
/// are rings.
class QVCenteredHorizontalLineSeries : public QVChartSeries {
 public:
    const QColor& fillColor() const { return fillColor_; }
    void setFillColor(const QColor& color) { fillColor_ = color; }
    /// Invalid: no rings are drawn.
    const QColor& accentColor() const { return accentColor_; }
    void setAccentColor(const QColor& color) { accentColor_ = color; }
    double lineWidth() const { return lineWidth_; }
    void setLineWidth(double width) { lineWidth_ = width; }

    void renderChart(QPainter& painter) const override;
    void renderFill(QPainter& painter) const override;
    bool drawsSecondaryFill() const override { return false; }

 protected:
    std::unique_ptr<QVChartSeries> clone() const override {
        return std::make_unique<QVCenteredHorizontalLineSeries>(*this);
    }

 private:
    std::vector<QPointF> pointsOfValue(int value) const;

    QColor fillColor_ = QColor::fromRgbF(1, 1, 1, 0.5f);
    QColor accentColor_;
    double lineWidth_ = 3.0;
};
