#pragma once

#include <QColor>
#include <QFont>
#include <QImage>
#include <QMetaObject>
#include <QPainter>
#include <QRectF>
#include <QSizeF>
#include <QString>
#include <functional>
#include <memory>
#include <optional>
#include <vector>

#include "Qelvar/Charts/QVAnimation.h"
#include "Qelvar/Charts/QVAxisDescriptor.h"
#include "Qelvar/Charts/QVChartBackgroundView.h"
#include "Qelvar/Charts/QVChartRenderer.h"

/// The chart of a card: the renderer's images over a background view, dividers, and the time axis in a gutter
/// beneath. A plain object without a window: its owner gives it a size, paints it, and drives its animations.
/// Main thread only.
class QVChart {
 public:
    enum class AnimationStyle { None = 0, CrossFade = 1 };

    QVChart();
    ~QVChart();
    QVChart(const QVChart&) = delete;
    QVChart& operator=(const QVChart&) = delete;

    // What it shows.

    const std::shared_ptr<QVChartRenderer>& chartRenderer() const { return renderer_; }
    /// Does not draw: reloadData() follows.
    void setChartRenderer(std::shared_ptr<QVChartRenderer> renderer);
    const std::shared_ptr<QVAxisDescriptor>& xAxisDescriptor() const { return xAxisDescriptor_; }
    /// The new descriptor takes over the range of the old one. Null: no labels.
    void setXAxisDescriptor(std::shared_ptr<QVAxisDescriptor> descriptor);
    const std::shared_ptr<QVChartBackgroundView>& chartBackgroundView() const { return backgroundView_; }
    void setChartBackgroundView(std::shared_ptr<QVChartBackgroundView> view);

    /// Shows the images that the renderer has and draws anew; what comes cross-fades in when `animated`.
    void reloadData(bool animated);
    /// Lays out again before the next painting (the axis' range or the background's settings changed).
    void refreshView();

    // How it looks. The defaults: gutter 33 points, divider inset 10, no cross-fade, 0.5 s.

    double xAxisGutterHeight() const { return xAxisGutterHeight_; }
    void setXAxisGutterHeight(double height);
    double dividerInset() const { return dividerInset_; }
    void setDividerInset(double inset);
    AnimationStyle animationStyle() const { return animationStyle_; }
    void setAnimationStyle(AnimationStyle style) { animationStyle_ = style; }
    QVAnimationTime animationDuration() const { return animationDuration_; }
    void setAnimationDuration(QVAnimationTime duration) { animationDuration_ = duration; }
    bool shouldAnimateAxisChanges() const { return shouldAnimateAxisChanges_; }
    void setShouldAnimateAxisChanges(bool animate) { shouldAnimateAxisChanges_ = animate; }
    void setChartCompositingFilter(QPainter::CompositionMode mode) { chartLayer_.filter = mode; }
    void setChartFillCompositingFilter(QPainter::CompositionMode mode) { fillLayer_.filter = mode; }
    void setChartSecondaryFillCompositingFilter(QPainter::CompositionMode mode) {
        secondaryFillLayer_.filter = mode;
    }
    void setDividerCompositingFilter(QPainter::CompositionMode mode) { dividerFilter_ = mode; }

    // Size, painting and time: for the owner.

    /// Size in points, and pixels a point of the screen. A change of either draws anew.
    void setSize(QSizeF size, double screenScale);
    QSizeF size() const { return size_; }
    /// Does a layout that is due. Painting does it too.
    void layoutIfNeeded();
    /// Paints with the chart's top left at `origin`. Modes other than "over" need something opaque beneath.
    void paint(QPainter& painter, QPointF origin = {});
    /// Called when the chart looks different now, or has begun to move: paint it again, and call advance()
    /// before each frame for as long as it moves.
    std::function<void()> onNeedsRepaint;
    /// The time at which animations start. At first the time since the machine's start.
    void setAnimationClock(std::function<QVAnimationTime()> clock) { clock_ = std::move(clock); }
    /// Moves animations to a time; returns whether one is still running.
    bool advance(QVAnimationTime now);
    bool isAnimating() const { return animating_; }
    /// Whether what was drawn last is of the present size. After a change of it the new images come later.
    bool imagesFit() const;

    // Where things are, in points of the chart.

    QRectF chartRectangle() const;
    QRectF topDividerFrame() const;
    QRectF bottomDividerFrame() const;
    QRectF backgroundFrame() const;

    /// A label of the time axis as it is shown.
    struct AxisLabelView {
        QString text;
        QFont font;
        QColor color;
        std::optional<QPainter::CompositionMode> filter;
        double fontRatio = 1;
        double width = 0, height = 0;
        QVAnimatedNumber centerX, centerY, opacity;
        QRectF frame() const {
            return {centerX.value() - width / 2, centerY.value() - height / 2, width, height};
        }
    };
    /// The labels shown now, from the left, without those that are fading out.
    const std::vector<AxisLabelView>& xAxisLabels() const { return axisLabels_; }

 private:
    using AxisLabels = std::vector<const QVAxisLabel*>;  // the descriptor's
    struct LayoutContext;                                // of the axis labels
    struct ShownImage {
        QImage image;
        QVAnimatedNumber opacity;
    };
    struct ImageLayer {
        QPainter::CompositionMode filter = QPainter::CompositionMode_SourceOver;
        std::vector<ShownImage> images;  // the last is the one shown; those before it fade out
    };

    void layout();
    void renderChart(bool animated);
    void showImages(const QImage& chart, const QImage& fill, const QImage& secondaryFill, bool animated);
    void showImage(ImageLayer& layer, const QImage& image, bool animated);
    static bool advanceLayer(ImageLayer& layer, QVAnimationTime now);
    void updateBackgroundView(bool animated);
    double roomForRange(const QVChartRenderer& renderer) const;
    void layoutBackgroundView();

    void layoutAxisLabels();
    AxisLabels shownAxisLabels() const;
    LayoutContext axisLabelLayout(const AxisLabels& labels) const;
    double centerForText(double x, double width) const;
    double xForDate(VSDate date) const;
    QRectF plotBounds() const;
    void reuseAxisLabelViews(size_t count, QVAnimationTime now, QVAnimationTime duration);

    void paintLayer(QPainter& painter, const ImageLayer& layer) const;
    void paintDividers(QPainter& painter) const;
    void paintAxisLabel(QPainter& painter, const AxisLabelView& label) const;

    double onPixelGrid(double value) const;
    void startedAnimating();
    void needsRepaint() const;

    std::shared_ptr<QVChartRenderer> renderer_;
    std::shared_ptr<QVAxisDescriptor> xAxisDescriptor_;
    std::shared_ptr<QVChartBackgroundView> backgroundView_;
    double xAxisGutterHeight_ = 33.0;
    double dividerInset_ = 10.0;
    AnimationStyle animationStyle_ = AnimationStyle::None;
    QVAnimationTime animationDuration_{500'000};
    bool shouldAnimateAxisChanges_ = true;
    QPainter::CompositionMode dividerFilter_ = QPainter::CompositionMode_Overlay;
    ImageLayer secondaryFillLayer_, fillLayer_, chartLayer_;
    std::vector<AxisLabelView> axisLabels_;
    std::vector<AxisLabelView> leavingAxisLabels_;

    QSizeF size_;
    double screenScale_ = 1;
    QRectF renderedRectangle_;
    QVEdgeInsets laidOutInsets_;  // in which the axis labels stand
    bool needsLayout_ = true;
    bool painting_ = false;
    bool animating_ = false;
    std::function<QVAnimationTime()> clock_;
    QMetaObject::Connection localeConnection_;
    /// Lets results that come after the chart's end fall away.
    std::shared_ptr<QVChart*> self_;
};
