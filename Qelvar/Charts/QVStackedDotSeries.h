#pragma once

#include "Qelvar/Charts/QVChartSeriesPointMarker.h"
#include "Qelvar/Charts/QVStackedValueSeries.h"

/// Rows of dots: a point marks every row whose value it holds as true, that is, has a number other than 0
/// under the value's decimal digits ("3") as the key.
class QVStackedDotSeries : public QVStackedValueSeries {
 public:
    const QColor& pointColor() const { return pointColor_; }
    void setPointColor(const QColor& color) { pointColor_ = color; }
    QVPointStyle pointStyle() const { return pointStyle_; }
    void setPointStyle(QVPointStyle style) { pointStyle_ = style; }
    double pointRadius() const { return pointRadius_; }
    void setPointRadius(double radius) { pointRadius_ = radius; }
    double pointLineWidth() const { return pointLineWidth_; }
    void setPointLineWidth(double width) { pointLineWidth_ = width; }

    void prepareForRendering(QSizeF size, std::optional<VSDate> minXValue, std::optional<VSDate> maxXValue,
                             std::optional<double> minYValue, std::optional<double> maxYValue,
                             const QVEdgeInsets& insets,
                             std::shared_ptr<const QVChartDataSet> dataSet) override;
    void renderChart(QPainter& painter) const override;
    bool drawsFill() const override { return false; }
    bool drawsSecondaryFill() const override { return false; }

 protected:
    std::unique_ptr<QVChartSeries> clone() const override {
        return std::make_unique<QVStackedDotSeries>(*this);
    }

 private:
    QColor pointColor_;
    QVPointStyle pointStyle_ = QVPointStyle::Disc;
    double pointRadius_ = 0;
    double pointLineWidth_ = 0;
};
