#pragma once

#include <QColor>
#include <QPainterPath>

#include "Qelvar/Charts/QVChartSeries.h"
#include "Qelvar/Charts/QVChartSeriesPointMarker.h"
#include "Qelvar/Charts/QVGradientObject.h"

/// A line through the points, solid where points follow each other and dashed over gaps, with a gradient
/// beneath (another one beneath the gaps) and a marker on every point.
class QVLineSeries : public QVChartSeries {
 public:
    enum class WaveForm { Sine = 0, SawTooth = 1, Square = 2 };

    WaveForm waveForm() const { return waveForm_; }
    void setWaveForm(WaveForm waveForm) { waveForm_ = waveForm; }
    double lineWidth() const { return lineWidth_; }
    void setLineWidth(double width) { lineWidth_ = width; }
    /// Invalid: no line is drawn.
    const QColor& lineColor() const { return lineColor_; }
    void setLineColor(const QColor& color) { lineColor_ = color; }
    /// Not valid: no fill is drawn.
    const QVGradientObject& fillGradient() const { return fillGradient_; }
    void setFillGradient(const QVGradientObject& gradient) { fillGradient_ = gradient; }
    const QVGradientObject& secondaryFillGradient() const { return secondaryFillGradient_; }
    void setSecondaryFillGradient(const QVGradientObject& gradient) { secondaryFillGradient_ = gradient; }
    const QColor& pointColor() const { return pointColor_; }
    void setPointColor(const QColor& color) { pointColor_ = color; }
    QVPointStyle pointStyle() const { return pointStyle_; }
    void setPointStyle(QVPointStyle style) { pointStyle_ = style; }
    double pointRadius() const { return pointRadius_; }
    void setPointRadius(double radius) { pointRadius_ = radius; }
    double pointLineWidth() const { return pointLineWidth_; }
    void setPointLineWidth(double width) { pointLineWidth_ = width; }
    /// From 0 (sharp corners) to 0.5 (through the middles of the segments).
    double sineWaveSmoothingFactor() const { return sineWaveSmoothingFactor_; }
    void setSineWaveSmoothingFactor(double factor) { sineWaveSmoothingFactor_ = factor; }

    void prepareForRendering(QSizeF size, std::optional<VSDate> minXValue, std::optional<VSDate> maxXValue,
                             std::optional<double> minYValue, std::optional<double> maxYValue,
                             const QVEdgeInsets& insets,
                             std::shared_ptr<const QVChartDataSet> dataSet) override;
    void renderChart(QPainter& painter) const override;
    void renderFill(QPainter& painter) const override;
    void renderSecondaryFill(QPainter& painter) const override;
    bool drawsFill() const override { return drawsGradient(fillGradient_, regions_.connected); }
    bool drawsSecondaryFill() const override { return drawsGradient(secondaryFillGradient_, regions_.gaps); }

    /// Stretches of the time axis, as full-height rectangles of the image: those where values follow each
    /// other, and those from the last value before missing ones to the first after them.
    struct Regions {
        std::vector<QRectF> connected;
        std::vector<QRectF> gaps;
    };
    const Regions& regions() const { return regions_; }

 protected:
    std::unique_ptr<QVChartSeries> clone() const override { return std::make_unique<QVLineSeries>(*this); }
    void discardPreparation() override;

 private:
    QPainterPath wavePath() const;
    void fillBeneath(QPainter& layer, const QRectF& region, const QBrush& brush) const;
    Regions findRegions() const;
    double heldApartRadius() const;
    bool drawsGradient(const QVGradientObject& gradient, const std::vector<QRectF>& regions) const;
    void renderGradient(QPainter& painter, const QVGradientObject& gradient,
                        const std::vector<QRectF>& regions) const;
    void strokeLine(QPainter& layer, const std::vector<QRectF>& regions, bool dashed) const;

    WaveForm waveForm_ = WaveForm::SawTooth;
    double lineWidth_ = 2.0;
    QColor lineColor_;
    QVGradientObject fillGradient_;
    QVGradientObject secondaryFillGradient_;
    QColor pointColor_ = Qt::white;
    QVPointStyle pointStyle_ = QVPointStyle::Ring;
    double pointRadius_ = 5.0;
    double pointLineWidth_ = 1.0;
    double sineWaveSmoothingFactor_ = 0.5;

    Regions regions_;    // prepared
    double radius_ = 0;  // prepared: as much of the one wanted as there is room for
};
