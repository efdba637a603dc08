#pragma once

#include "Qelvar/Charts/QVStackedValueSeries.h"

/// Rows of horizontal segments: the points of a value pair up in order into starts and ends.
class QVStackedHorizontalLineSeries : public QVStackedValueSeries {
 public:
    const QColor& fillColor() const { return fillColor_; }
    void setFillColor(const QColor& color) { fillColor_ = color; }
    double lineWidth() const { return lineWidth_; }
    void setLineWidth(double width) { lineWidth_ = width; }

    void prepareForRendering(QSizeF size, std::optional<VSDate> minXValue, std::optional<VSDate> maxXValue,
                             std::optional<double> minYValue, std::optional<double> maxYValue,
                             const QVEdgeInsets& insets,
                             std::shared_ptr<const QVChartDataSet> dataSet) override;
    void renderFill(QPainter& painter) const override;
    void renderChart(QPainter& painter) const override;
    bool drawsSecondaryFill() const override { return false; }

 protected:
    std::unique_ptr<QVChartSeries> clone() const override {
        return std::make_unique<QVStackedHorizontalLineSeries>(*this);
    }

 private:
    template <typename Draw>
    void forEachSegment(Draw draw) const;

    QColor fillColor_;
    double lineWidth_ = 0;
};
