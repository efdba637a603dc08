// The time-axis labels of QVChart: where they stand, and how they come, move and go.

#include <QFontMetricsF>
#include <algorithm>

#include "Platform/TextScale.h"
#include "Qelvar/Charts/QVChart.h"
#include "Qelvar/Charts/QVChartDrawing.h"
#include "Qelvar/Charts/QVChartSeries.h"

namespace {

constexpr QVAnimationTime kAxisDuration{250'000};
/// A text wider than its column by no more than this still fits.
constexpr double kOverflowTolerance = 1.1920928955078125e-07;
/// Larger texts shrink no further; rather some are left out.
constexpr double kSmallestLargeRatio = 0.8;
/// A text that would come nearer to the edge of the chart seems cut.
constexpr double kEdgeMargin = 4;

double textWidth(const QVAxisLabel& label) {
    return QFontMetricsF(label.labelFont).horizontalAdvance(label.text);
}

double widestText(const std::vector<const QVAxisLabel*>& labels) {
    double widest = 0;
    for (const QVAxisLabel* label : labels) widest = std::max(widest, textWidth(*label));
    return widest;
}

/// 1 when the text fits, else the first of 0.9, 0.8, ... 0.1 at which it does, else practically 0.
double fittingRatio(double width, double columnWidth) {
    if (width - columnWidth <= kOverflowTolerance) return 1;
    int tenths = 9;
    while (tenths > 0 && width * tenths / 10 > columnWidth) --tenths;
    return tenths / 10.0;
}

void move(QVAnimatedNumber& number, double target, QVAnimationTime now, QVAnimationTime duration) {
    if (number.target() != target) number.animateTo(target, now, duration, QVAnimationCurve::EaseInOut);
}

}  // namespace

struct QVChart::LayoutContext {
    double fontRatio = 1;
    std::vector<QRectF> targetFrames;
};

QRectF QVChart::plotBounds() const {
    const QVEdgeInsets insets = renderer_ ? renderer_->chartInsets() : QVEdgeInsets();
    return QRectF(QPointF(0, 0), size_).adjusted(insets.left, insets.top, -insets.right, -insets.bottom);
}

double QVChart::xForDate(VSDate date) const {
    double position = 0.5;
    if (renderer_ && renderer_->minXValue() && renderer_->maxXValue()) {
        const VSDate start = *renderer_->minXValue();
        position = QVChartSeries::relativePosition(VSSecondsFromDuration(date - start), 0,
                                                   VSSecondsFromDuration(*renderer_->maxXValue() - start));
    }
    return onPixelGrid(plotBounds().left() + position * plotBounds().width());
}

/// Under its date; where the edge would cut it, it begins or ends with the divider.
double QVChart::centerForText(double x, double width) const {
    const double room = size_.width();
    if (width > room - 2 * dividerInset_) return x;
    if (x - width / 2 < kEdgeMargin) return dividerInset_ + width / 2;
    if (x + width / 2 > room - kEdgeMargin) return room - dividerInset_ - width / 2;
    return x;
}

QVChart::LayoutContext QVChart::axisLabelLayout(const AxisLabels& labels) const {
    LayoutContext context;
    const double columnWidth = plotBounds().width() / static_cast<double>(labels.size());
    const double centerLine = onPixelGrid(size_.height() - xAxisGutterHeight_ / 2);
    context.fontRatio = fittingRatio(widestText(labels), columnWidth);
    for (const QVAxisLabel* label : labels) {
        QRectF frame(0, 0, columnWidth, QFontMetricsF(label->labelFont).height());
        const double width = textWidth(*label) * context.fontRatio;
        frame.moveCenter({centerForText(xForDate(label->location), width), centerLine});
        context.targetFrames.push_back(frame);
    }
    return context;
}

/// The labels of the axis; where larger texts are wanted and do not fit, the first and the last (the one
/// names the month or the year, the other is now) and as many evenly between them as do.
QVChart::AxisLabels QVChart::shownAxisLabels() const {
    AxisLabels labels;
    if (!xAxisDescriptor_ || !xAxisDescriptor_->axisLabels()) return labels;
    for (const QVAxisLabel& label : *xAxisDescriptor_->axisLabels()) labels.push_back(&label);
    if (platform::textScale() <= 1 || labels.size() < 2) return labels;
    const double widest = widestText(labels);
    const size_t spaces = labels.size() - 1;
    const auto fits = [&](size_t step) {
        const double columnWidth = plotBounds().width() / static_cast<double>(spaces / step + 1);
        return fittingRatio(widest, columnWidth) >= kSmallestLargeRatio;
    };
    size_t step = 1;
    while (step < spaces && (spaces % step != 0 || !fits(step))) ++step;
    AxisLabels shown;
    for (size_t i = 0; i < labels.size(); i += step) shown.push_back(labels[i]);
    return shown;
}

void QVChart::layoutAxisLabels() {
    const AxisLabels labels = shownAxisLabels();
    const LayoutContext context = axisLabelLayout(labels);

    const QVAnimationTime now = clock_();
    const bool animated = shouldAnimateAxisChanges_ && !axisLabels_.empty();
    const QVAnimationTime duration = animated ? kAxisDuration : QVAnimationTime::zero();
    reuseAxisLabelViews(labels.size(), now, duration);
    for (size_t i = 0; i < labels.size(); ++i) {
        AxisLabelView& view = axisLabels_[i];
        view.text = labels[i]->text;
        view.font = labels[i]->labelFont;
        view.color = labels[i]->labelColor;
        view.filter = labels[i]->compositingFilter;
        view.fontRatio = context.fontRatio;
        view.width = context.targetFrames[i].width();
        view.height = context.targetFrames[i].height();
        move(view.centerX, context.targetFrames[i].center().x(), now, duration);
        move(view.centerY, context.targetFrames[i].center().y(), now, duration);
        move(view.opacity, 1, now, duration);
    }
    if (animated) startedAnimating();
}

/// Makes or drops views to the number wanted, alternately at the right end and at the front.
void QVChart::reuseAxisLabelViews(size_t count, QVAnimationTime now, QVAnimationTime duration) {
    const double centerLine = onPixelGrid(size_.height() - xAxisGutterHeight_ / 2);
    for (bool atEnd = true; axisLabels_.size() < count; atEnd = !atEnd) {
        AxisLabelView view;
        view.centerX.set(atEnd ? size_.width() : 0);
        view.centerY.set(centerLine);
        axisLabels_.insert(atEnd ? axisLabels_.end() : axisLabels_.begin(), view);
    }
    for (bool atEnd = true; axisLabels_.size() > count; atEnd = !atEnd) {
        const auto surplus = atEnd ? axisLabels_.end() - 1 : axisLabels_.begin();
        surplus->opacity.animateTo(0, now, duration, QVAnimationCurve::EaseInOut);
        if (surplus->opacity.isAnimating()) leavingAxisLabels_.push_back(*surplus);
        axisLabels_.erase(surplus);
    }
}

void QVChart::paintAxisLabel(QPainter& painter, const AxisLabelView& label) const {
    if (label.opacity.value() <= 0 || label.fontRatio <= 0 || !label.color.isValid()) return;
    painter.save();
    painter.setOpacity(painter.opacity() * label.opacity.value());
    if (label.filter) painter.setCompositionMode(*label.filter);
    painter.setFont(label.font);
    painter.setPen(label.color);
    // The painter is scaled rather than the font, whose sizes are whole pixels.
    painter.translate(label.centerX.value(), label.centerY.value());
    painter.scale(label.fontRatio, label.fontRatio);
    const QFontMetricsF metrics(label.font);
    QVDrawText(painter, {-metrics.horizontalAdvance(label.text) / 2, -metrics.height() / 2}, label.text);
    painter.restore();
}
