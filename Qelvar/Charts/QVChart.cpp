#include "Qelvar/Charts/QVChart.h"

#include <chrono>
#include <cmath>

#include "Platform/Queue.h"
#include "Platform/SystemEvents.h"

namespace {

/// The image reaches so far above the top of the view and into the gutter, so that markers at the edges are
/// whole.
constexpr double kChartOverhang = 3;
constexpr QVAnimationTime kBackgroundDuration{250'000};

}  // namespace

QVChart::QVChart()
    : clock_([] {
          return std::chrono::duration_cast<QVAnimationTime>(
              std::chrono::steady_clock::now().time_since_epoch());
      }),
      self_(std::make_shared<QVChart*>(this)) {
    localeConnection_ =
        QObject::connect(&platform::SystemEvents::shared(), &platform::SystemEvents::localeDidChange, [this] {
            if (xAxisDescriptor_) xAxisDescriptor_->invalidateCache();
            refreshView();
        });
}

QVChart::~QVChart() {
    QObject::disconnect(localeConnection_);
}

void QVChart::setChartRenderer(std::shared_ptr<QVChartRenderer> renderer) {
    renderer_ = std::move(renderer);
    if (renderer_)
        renderer_->setLabelRoom([self = std::weak_ptr(self_)](const QVChartRenderer& asking) {
            const auto alive = self.lock();
            return alive ? (*alive)->roomForRange(asking) : 0;
        });
    refreshView();
}

double QVChart::roomForRange(const QVChartRenderer& renderer) const {
    if (!backgroundView_) return 0;
    const double width = backgroundView_->labelWidth({renderer.minYValue(), renderer.maxYValue(),
                                                      renderer.maxYValueInData(), renderer.decimalPrecision(),
                                                      renderer.dataUnit(), renderer.unitController()});
    return width > 0 ? dividerInset_ + width : 0;
}

void QVChart::setXAxisDescriptor(std::shared_ptr<QVAxisDescriptor> descriptor) {
    if (descriptor && xAxisDescriptor_) {
        descriptor->setMinValue(xAxisDescriptor_->minValue());
        descriptor->setMaxValue(xAxisDescriptor_->maxValue());
    }
    xAxisDescriptor_ = std::move(descriptor);
    refreshView();
}

void QVChart::setChartBackgroundView(std::shared_ptr<QVChartBackgroundView> view) {
    backgroundView_ = std::move(view);
    refreshView();
}

void QVChart::setXAxisGutterHeight(double height) {
    xAxisGutterHeight_ = height;
    refreshView();
}

void QVChart::setDividerInset(double inset) {
    dividerInset_ = inset;
    refreshView();
}

void QVChart::setSize(QSizeF size, double screenScale) {
    if (size_ == size && screenScale_ == screenScale) return;
    if (screenScale_ != screenScale) renderedRectangle_ = {};
    size_ = size;
    screenScale_ = screenScale;
    refreshView();
}

void QVChart::refreshView() {
    needsLayout_ = true;
    needsRepaint();
}

// Layout.

double QVChart::onPixelGrid(double value) const {
    return std::round(value * screenScale_) / screenScale_;
}

QRectF QVChart::topDividerFrame() const {
    return {dividerInset_, 0, size_.width() - 2 * dividerInset_, 1 / screenScale_};
}

QRectF QVChart::bottomDividerFrame() const {
    const double pixel = 1 / screenScale_;
    return {dividerInset_, size_.height() - pixel - xAxisGutterHeight_, size_.width() - 2 * dividerInset_,
            pixel};
}

QRectF QVChart::backgroundFrame() const {
    return {dividerInset_, 0, size_.width() - 2 * dividerInset_, bottomDividerFrame().top()};
}

QRectF QVChart::chartRectangle() const {
    return {0, -kChartOverhang, size_.width(), size_.height() - xAxisGutterHeight_ + 2 * kChartOverhang};
}

bool QVChart::imagesFit() const {
    const QImage image = renderer_ ? renderer_->chartImage() : QImage();
    if (image.isNull()) return true;
    const QSizeF pixels = chartRectangle().size() * screenScale_;
    return image.size() ==
           QSize(static_cast<int>(std::ceil(pixels.width())), static_cast<int>(std::ceil(pixels.height())));
}

void QVChart::layoutIfNeeded() {
    if (!needsLayout_ || size_.isEmpty()) return;
    needsLayout_ = false;
    layout();
}

void QVChart::layout() {
    layoutBackgroundView();
    if (renderedRectangle_ != chartRectangle()) renderChart(false);
    layoutAxisLabels();
    if (renderer_) laidOutInsets_ = renderer_->chartInsets();
}

void QVChart::layoutBackgroundView() {
    if (!backgroundView_) return;
    backgroundView_->layout(backgroundFrame().size(), screenScale_);
    backgroundView_->commitChanges(clock_(), QVAnimationTime::zero());
}

// Images.

void QVChart::reloadData(bool animated) {
    if (!renderer_) return;
    showImages(renderer_->chartImage(), renderer_->chartFillImage(), renderer_->chartSecondaryFillImage(),
               animated);
    renderChart(animated);
}

void QVChart::renderChart(bool animated) {
    const QRectF rectangle = chartRectangle();
    // Without a size there is nothing to draw yet: the first layout will.
    if (!renderer_ || size_.isEmpty()) return;
    renderedRectangle_ = rectangle;
    renderer_->renderChart(rectangle.size(), {kChartOverhang, 0, kChartOverhang, 0}, screenScale_, true,
                           [self = std::weak_ptr(self_), renderer = std::weak_ptr(renderer_), animated](
                               const QImage& chart, const QImage& fill, const QImage& secondaryFill, bool) {
                               const auto show = [=] {
                                   const auto alive = self.lock();
                                   const auto origin = renderer.lock();
                                   if (!alive || !origin || (*alive)->renderer_ != origin) return;
                                   (*alive)->showImages(chart, fill, secondaryFill, animated);
                                   (*alive)->updateBackgroundView(animated);
                               };
                               if (platform::isMainThread())
                                   show();
                               else
                                   platform::mainQueue().async(show);
                           });
}

void QVChart::showImages(const QImage& chart, const QImage& fill, const QImage& secondaryFill,
                         bool animated) {
    showImage(secondaryFillLayer_, secondaryFill, animated);
    showImage(fillLayer_, fill, animated);
    showImage(chartLayer_, chart, animated);
    needsRepaint();
}

void QVChart::showImage(ImageLayer& layer, const QImage& image, bool animated) {
    std::vector<ShownImage>& images = layer.images;
    // At once, also when the same image is still fading in.
    if (!animated || animationStyle_ != AnimationStyle::CrossFade) {
        images.clear();
        if (!image.isNull()) images.push_back({image, QVAnimatedNumber(1)});
        return;
    }
    const bool hasCurrent = !images.empty() && images.back().opacity.target() == 1;
    // The same image again would only make it dip.
    if (hasCurrent ? images.back().image.cacheKey() == image.cacheKey() : image.isNull()) return;
    const QVAnimationTime now = clock_();
    // A window that is not shown has no frames, yet goes on getting images.
    advanceLayer(layer, now);
    for (ShownImage& old : images)
        if (old.opacity.target() != 0)
            old.opacity.animateTo(0, now, animationDuration_, QVAnimationCurve::EaseInOut);
    if (!image.isNull()) {
        images.push_back({image, QVAnimatedNumber(0)});
        images.back().opacity.animateTo(1, now, animationDuration_, QVAnimationCurve::EaseInOut);
    }
    startedAnimating();
}

void QVChart::updateBackgroundView(bool animated) {
    if (!renderer_) return;
    if (renderer_->chartInsets() != laidOutInsets_) needsLayout_ = true;  // the dates have moved
    if (!backgroundView_) return;
    const bool hasImages = !renderer_->chartImage().isNull() || !renderer_->chartFillImage().isNull() ||
                           !renderer_->chartSecondaryFillImage().isNull();
    backgroundView_->setChartInsets(renderer_->chartInsets());
    backgroundView_->setValues(renderer_->minYValue(), renderer_->maxYValue(), renderer_->averageYValue(),
                               renderer_->maxYValueInData(), renderer_->decimalPrecision(),
                               renderer_->dataUnit(), renderer_->unitController());
    backgroundView_->setShowNoDataLabel(!hasImages && renderer_->finishedLoadingData());
    backgroundView_->commitChanges(clock_(), animated ? kBackgroundDuration : QVAnimationTime::zero());
    startedAnimating();
}

// Time.

void QVChart::startedAnimating() {
    animating_ = true;
    needsRepaint();
}

void QVChart::needsRepaint() const {
    if (!painting_ && onNeedsRepaint) onNeedsRepaint();
}

/// Moves the fades on and drops what has faded out; returns whether one is still running.
bool QVChart::advanceLayer(ImageLayer& layer, QVAnimationTime now) {
    bool running = false;
    for (ShownImage& shown : layer.images) running |= shown.opacity.advance(now);
    std::erase_if(layer.images, [](const ShownImage& shown) {
        return shown.opacity.target() == 0 && !shown.opacity.isAnimating();
    });
    return running;
}

bool QVChart::advance(QVAnimationTime now) {
    animating_ = backgroundView_ && backgroundView_->advance(now);
    for (ImageLayer* layer : {&secondaryFillLayer_, &fillLayer_, &chartLayer_})
        animating_ |= advanceLayer(*layer, now);
    for (std::vector<AxisLabelView>* views : {&axisLabels_, &leavingAxisLabels_})
        for (AxisLabelView& view : *views)
            for (QVAnimatedNumber* number : {&view.centerX, &view.centerY, &view.opacity})
                animating_ |= number->advance(now);
    std::erase_if(leavingAxisLabels_, [](const AxisLabelView& view) { return !view.opacity.isAnimating(); });
    return animating_;
}

// Painting.

void QVChart::paint(QPainter& painter, QPointF origin) {
    painting_ = true;
    layoutIfNeeded();
    painter.save();
    painter.translate(origin);
    painter.setRenderHints(QPainter::Antialiasing | QPainter::TextAntialiasing |
                           QPainter::SmoothPixmapTransform);
    if (backgroundView_) {
        painter.save();
        painter.translate(backgroundFrame().topLeft());
        backgroundView_->paint(painter);
        painter.restore();
    }
    paintLayer(painter, secondaryFillLayer_);
    paintLayer(painter, fillLayer_);
    paintLayer(painter, chartLayer_);
    paintDividers(painter);
    for (const AxisLabelView& label : leavingAxisLabels_) paintAxisLabel(painter, label);
    for (const AxisLabelView& label : axisLabels_) paintAxisLabel(painter, label);
    painter.restore();
    painting_ = false;
}

/// Each image at its natural size at the left edge, in the middle of the height.
void QVChart::paintLayer(QPainter& painter, const ImageLayer& layer) const {
    const QRectF frame = chartRectangle();
    for (const ShownImage& shown : layer.images) {
        painter.save();
        painter.setOpacity(painter.opacity() * shown.opacity.value());
        painter.setCompositionMode(layer.filter);
        const double top = frame.center().y() - shown.image.deviceIndependentSize().height() / 2;
        painter.drawImage(QPointF(frame.left(), onPixelGrid(top)), shown.image);
        painter.restore();
    }
}

void QVChart::paintDividers(QPainter& painter) const {
    painter.save();
    painter.setCompositionMode(dividerFilter_);
    painter.fillRect(topDividerFrame(), Qt::white);
    painter.fillRect(bottomDividerFrame(), Qt::white);
    painter.restore();
}
