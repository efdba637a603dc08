#pragma once

#include <QColor>
#include <QPainter>
#include <QPointF>
#include <QSizeF>
#include <memory>
#include <optional>
#include <vector>

#include "Qelvar/Charts/QVEdgeInsets.h"
#include "Vessa/Base/VSDate.h"

class QVChartDataSet;
class QVChartPoint;

/// How the ends of a stroke look. The numbers are those of stroke settings that are passed as numbers.
enum class QVLineCapStyle { Butt = 0, Round = 1, Square = 2 };

/// Draws one data set, in up to three layers. Geometry is in points, with the origin at the top left. A
/// series is configured by whoever feeds it on one thread; the renderer draws with copies of its own on any
/// thread.
class QVChartSeries {
 public:
    virtual ~QVChartSeries() = default;
    QVChartSeries& operator=(const QVChartSeries&) = delete;

    /// A series of the same class with the same settings, not yet prepared.
    std::unique_ptr<QVChartSeries> copy() const;

    /// Takes the size of the image, the ranges, the margins of the plot inside the image and the points, and
    /// computes what is to be drawn. Called once for each drawing, before any of the render operations.
    virtual void prepareForRendering(QSizeF size, std::optional<VSDate> minXValue,
                                     std::optional<VSDate> maxXValue, std::optional<double> minYValue,
                                     std::optional<double> maxYValue, const QVEdgeInsets& insets,
                                     std::shared_ptr<const QVChartDataSet> dataSet);
    /// Each draws one layer with a painter whose origin is the image's top left. None changes the series.
    virtual void renderChart(QPainter& painter) const;
    virtual void renderFill(QPainter& painter) const;
    virtual void renderSecondaryFill(QPainter& painter) const;
    /// Whether the layer has anything on it, once prepared: one that is empty needs no image.
    virtual bool drawsFill() const { return true; }
    virtual bool drawsSecondaryFill() const { return true; }
    virtual void selectedPointIndexesUpdated(const std::vector<size_t>& indexes);

    /// The time between one point and the next; none: not known. What is drawn for a point is at most 0.8 of
    /// that wide, so that neighbours stay apart however narrow the plot is.
    std::optional<VSDuration> pointInterval() const { return pointInterval_; }
    void setPointInterval(std::optional<VSDuration> interval) { pointInterval_ = interval; }
    /// Of a hairline along the inside of what is filled; invalid: none. A series that fills nothing with
    /// sides of its own (a line) draws none.
    const QColor& edgeColor() const { return edgeColor_; }
    void setEdgeColor(const QColor& color) { edgeColor_ = color; }
    /// What the series' own labels at the right need of the image, in points.
    virtual double labelRoom() const { return 0; }

    QSizeF imageSize() const { return imageSize_; }
    const QVEdgeInsets& insets() const { return insets_; }
    /// The size of the plot area: the image less the insets.
    QSizeF renderSize() const;
    std::optional<VSDate> minXValue() const { return minXValue_; }
    std::optional<VSDate> maxXValue() const { return maxXValue_; }
    std::optional<double> minYValue() const { return minYValue_; }
    std::optional<double> maxYValue() const { return maxYValue_; }
    const std::shared_ptr<const QVChartDataSet>& dataSet() const { return dataSet_; }
    /// The image points prepared for drawing.
    const std::vector<QPointF>& dataPoints() const { return dataPoints_; }

    /// Where a value lies between two bounds: 0 at the lower, 1 at the upper, 0.5 when they are equal.
    static double relativePosition(double value, double lower, double upper);
    /// Whole points from the left of the image; not held inside the plot area.
    double xForChartPoint(const QVChartPoint& point) const;
    /// Whole points from the top of the plot area, held inside it; the maximum is at the top. Missing counts
    /// as 0.
    double yForValue(std::optional<double> value) const;
    /// The image point of the last of the point's values, or of its value under a key.
    QPointF pointFromChartPoint(const QVChartPoint& point) const;
    /// Whether the value lies above the top of the plot area.
    bool yValueIsClamped(std::optional<double> value) const;

 protected:
    QVChartSeries() = default;
    QVChartSeries(const QVChartSeries&) = default;
    virtual std::unique_ptr<QVChartSeries> clone() const = 0;
    /// How wide, in points, something drawn for one point may be when it would like to be `width`. Once
    /// prepared.
    double widthHeldApart(double width) const;
    /// The same where points are `pitch` points apart.
    static double widthHeldApart(double width, double pitch);
    /// Forgets what prepareForRendering() computed and took.
    virtual void discardPreparation();

    std::vector<QPointF> dataPoints_;

 private:
    std::optional<VSDuration> pointInterval_;
    QColor edgeColor_;
    QSizeF imageSize_;
    QVEdgeInsets insets_;
    std::optional<VSDate> minXValue_, maxXValue_;
    std::optional<double> minYValue_, maxYValue_;
    std::shared_ptr<const QVChartDataSet> dataSet_;
};
