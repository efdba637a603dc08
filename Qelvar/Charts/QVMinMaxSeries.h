#pragma once

#include <QColor>

#include "Qelvar/Charts/QVChartSeries.h"
#include "Qelvar/Charts/QVChartSeriesPointMarker.h"

/// For every point a bar from its "min" to its "max" value with a marker at each end, or one marker where the
/// two are too close for a bar. A value above the top of the plot shows as an upward chevron at the top.
class QVMinMaxSeries : public QVChartSeries {
 public:
    QVPointStyle maxPointStyle() const { return maxPointStyle_; }
    void setMaxPointStyle(QVPointStyle style) { maxPointStyle_ = style; }
    QVPointStyle minPointStyle() const { return minPointStyle_; }
    void setMinPointStyle(QVPointStyle style) { minPointStyle_ = style; }
    const QColor& pointColor() const { return pointColor_; }
    void setPointColor(const QColor& color) { pointColor_ = color; }
    const QColor& fillColor() const { return fillColor_; }
    void setFillColor(const QColor& color) { fillColor_ = color; }
    double pointRadius() const { return pointRadius_; }
    void setPointRadius(double radius) { pointRadius_ = radius; }
    double pointLineWidth() const { return pointLineWidth_; }
    void setPointLineWidth(double width) { pointLineWidth_ = width; }

    void prepareForRendering(QSizeF size, std::optional<VSDate> minXValue, std::optional<VSDate> maxXValue,
                             std::optional<double> minYValue, std::optional<double> maxYValue,
                             const QVEdgeInsets& insets,
                             std::shared_ptr<const QVChartDataSet> dataSet) override;
    void renderChart(QPainter& painter) const override;
    void renderFill(QPainter& painter) const override;
    bool drawsSecondaryFill() const override { return false; }

 protected:
    std::unique_ptr<QVChartSeries> clone() const override { return std::make_unique<QVMinMaxSeries>(*this); }
    void discardPreparation() override;

 private:
    struct ChartPoint {
        QPointF absoluteMinPoint;
        QPointF absoluteMaxPoint;
        bool minIsClamped = false;
        bool maxIsClamped = false;
    };
    bool isCenterPoint(const ChartPoint& point) const;
    void eraseMarkerShapes(QPainter& layer) const;
    QVLineCapStyle barCaps() const;
    template <typename Draw>
    void forEachBar(Draw draw) const;
    void renderEdges(QPainter& painter) const;

    QVPointStyle maxPointStyle_ = QVPointStyle::Disc;
    QVPointStyle minPointStyle_ = QVPointStyle::Disc;
    QColor pointColor_ = Qt::white;
    QColor fillColor_ = QColor::fromRgbF(1, 1, 1, 0.5f);
    double pointRadius_ = 5.0;
    double pointLineWidth_ = 1.0;

    std::vector<ChartPoint> chartPoints_;  // prepared
    double radius_ = 0;                    // prepared: as much of the one wanted as there is room for
};
