#pragma once

#include <QColor>

#include "Qelvar/Charts/QVChartSeries.h"

/// A vertical bar for every point, standing on the bottom of the image.
class QVBarSeries : public QVChartSeries {
 public:
    const QColor& fillColor() const { return fillColor_; }
    void setFillColor(const QColor& color) { fillColor_ = color; }
    double barWidth() const { return barWidth_; }
    void setBarWidth(double width) { barWidth_ = width; }
    /// A round cap reaches half a bar width past both ends.
    QVLineCapStyle lineCapStyle() const { return lineCapStyle_; }
    void setLineCapStyle(QVLineCapStyle style) { lineCapStyle_ = style; }
    /// From the bottom of the image to the foot of the bars.
    double bottomPadding() const { return bottomPadding_; }
    void setBottomPadding(double padding) { bottomPadding_ = padding; }

    void prepareForRendering(QSizeF size, std::optional<VSDate> minXValue, std::optional<VSDate> maxXValue,
                             std::optional<double> minYValue, std::optional<double> maxYValue,
                             const QVEdgeInsets& insets,
                             std::shared_ptr<const QVChartDataSet> dataSet) override;
    void renderFill(QPainter& painter) const override;
    void renderChart(QPainter& painter) const override;
    bool drawsSecondaryFill() const override { return false; }

 protected:
    std::unique_ptr<QVChartSeries> clone() const override { return std::make_unique<QVBarSeries>(*this); }

 private:
    QColor fillColor_ = QColor::fromRgbF(1, 1, 1, 0.5f);
    double barWidth_ = 10.0;
    QVLineCapStyle lineCapStyle_ = QVLineCapStyle::Round;
    double bottomPadding_ = 0;
};
