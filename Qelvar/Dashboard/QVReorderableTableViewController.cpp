#include "Qelvar/Dashboard/QVReorderableTableViewController.h"

#include <algorithm>
#include <chrono>

namespace {

using namespace std::chrono_literals;

constexpr double kHeldScale = 1.05;
constexpr double kRoomBelowContent = 50;
constexpr QVAnimationTime kLiftDuration = 250ms, kSettleDuration = 300ms, kLeaveDuration = 150ms;
/// The frames that speeds are given for. A display with more of them scrolls no faster, and one that missed
/// some does not leap.
constexpr double kFramesPerMicrosecond = 60e-6;
constexpr double kMostFramesAtOnce = 3;

QVAnimationTime steadyTime() {
    return std::chrono::duration_cast<QVAnimationTime>(std::chrono::steady_clock::now().time_since_epoch());
}

}  // namespace

QVReorderableTableViewController::QVReorderableTableViewController() : clock_(steadyTime) {}

// The table

QVTableGeometry QVReorderableTableViewController::tableGeometry() const {
    QVTableGeometry geometry = geometry_;
    geometry.rowCount = numberOfRows();
    return geometry;
}

void QVReorderableTableViewController::setTableGeometry(double width, double visibleHeight,
                                                        double headerHeight, double rowHeight,
                                                        double bottomInset) {
    geometry_.width = width;
    geometry_.visibleHeight = visibleHeight;
    geometry_.headerHeight = headerHeight;
    geometry_.rowHeight = rowHeight;
    geometry_.bottomInset = bottomInset;
    tableDidLayOut();
    if (phase_ != Phase::Idle) emit draggingViewChanged();
}

void QVReorderableTableViewController::tableDidScroll(double contentOffset) {
    if (placing_ || contentOffset == geometry_.contentOffset) return;
    geometry_.contentOffset = contentOffset;
    emit restorableStateChanged();
    if (isDragging())
        followTouch();
    else if (phase_ != Phase::Idle)
        emit draggingViewChanged();
}

void QVReorderableTableViewController::scrollTo(double contentOffset) {
    geometry_.contentOffset = contentOffset;
    emit scrollRequested(contentOffset);
}

void QVReorderableTableViewController::place(const std::function<void()>& change) {
    // A table whose rows change places may move its content for a moment; the touch must not follow that.
    placing_ = true;
    change();
    if (isDragging()) scrollTo(geometry_.contentOffset);
    placing_ = false;
}

int QVReorderableTableViewController::rowAt(double y) const {
    return tableGeometry().rowAt(y + geometry_.contentOffset).value_or(-1);
}

// A drag

bool QVReorderableTableViewController::pressAndHoldBegan(double y) {
    finishReordering();
    touch_ = y;
    const auto row = tableGeometry().rowAt(touchY());
    if (!row) return false;
    setReordering(true);
    liftRow(*row, now());
    currentRow_ = *row;
    if (const auto told = delegate()) told->reorderingDidBegin(*this, *row);
    setPhase(Phase::Dragging);
    emit draggingViewChanged();
    return true;
}

void QVReorderableTableViewController::liftRow(int row, QVAnimationTime now) {
    image_ = snapshotOfRow(row);
    centerY_ = touchY();
    remainingWay_.set(tableGeometry().rectOfRow(row).center().y() - centerY_);
    remainingWay_.animateTo(0, now, kLiftDuration, QVAnimationCurve::EaseInOut);
    scale_.set(1);
    scale_.animateTo(kHeldScale, now, kLiftDuration, QVAnimationCurve::EaseInOut);
    opacity_.set(1);
    opacity_.animateTo(draggingViewOpacity_, now, kLiftDuration, QVAnimationCurve::EaseInOut);
}

void QVReorderableTableViewController::pressAndHoldChanged(double y) {
    if (!isDragging()) return;
    touch_ = y;
    followTouch();
}

void QVReorderableTableViewController::followTouch() {
    const QVTableGeometry geometry = tableGeometry();
    const double y = touchY();
    if (y >= 0 && y <= geometry.contentHeight() + kRoomBelowContent) centerY_ = y;
    const auto row = geometry.rowAt(y);
    if (row && row != currentRow_) {
        const int from = *currentRow_;
        currentRow_ = row;
        place([&] {
            if (const auto told = delegate()) told->rowDidMove(*this, from, *row);
        });
    }
    if (!isDragging()) return;  // whoever was told has ended it
    scrollSpeed_ = geometry.autoScrollSpeed(y);
    updateMoving();
    emit draggingViewChanged();
}

void QVReorderableTableViewController::autoScroll(QVAnimationTime now) {
    if (!isDragging() || scrollSpeed_ == 0) return;
    const double frames =
        lastScroll_ ? std::clamp(static_cast<double>((now - *lastScroll_).count()) * kFramesPerMicrosecond,
                                 0.0, kMostFramesAtOnce)
                    : 1;
    lastScroll_ = now;
    const double offset = tableGeometry().offsetScrolledBy(scrollSpeed_ * frames);
    if (offset == geometry_.contentOffset) return;
    place([&] { geometry_.contentOffset = offset; });
    followTouch();
}

void QVReorderableTableViewController::pressAndHoldEnded() {
    if (!isDragging()) return;
    setReordering(false);
    scrollSpeed_ = 0;
    lastScroll_.reset();
    setPhase(Phase::Settling);
    settle();
}

void QVReorderableTableViewController::settle() {
    const double from = centerY_ + remainingWay_.value();
    const QVAnimationTime start = now();
    centerY_ = tableGeometry().rectOfRow(*currentRow_).center().y();
    remainingWay_.set(from - centerY_);
    remainingWay_.animateTo(0, start, kSettleDuration, QVAnimationCurve::EaseInOut);
    scale_.animateTo(1, start, kSettleDuration, QVAnimationCurve::EaseInOut);
    opacity_.animateTo(1, start, kSettleDuration, QVAnimationCurve::EaseInOut);
    updateMoving();
    emit draggingViewChanged();
}

void QVReorderableTableViewController::cancelReordering() {
    if (!isDragging()) return;
    restoreRows();
    pressAndHoldEnded();
}

void QVReorderableTableViewController::finishReordering() {
    if (phase_ == Phase::Idle) return;
    if (isDragging()) setReordering(false);
    const bool told = phase_ == Phase::Leaving;
    scrollSpeed_ = 0;
    lastScroll_.reset();
    image_ = {};
    setPhase(Phase::Idle);
    if (!told) finish();
    emit draggingViewChanged();
}

void QVReorderableTableViewController::finish() {
    currentRow_.reset();
    if (const auto told = delegate()) told->reorderingDidFinish(*this);
}

void QVReorderableTableViewController::rowsDidChange(std::optional<int> currentRow) {
    if (phase_ != Phase::Dragging && phase_ != Phase::Settling) return;
    if (!currentRow) return finishReordering();
    currentRow_ = currentRow;
    if (phase_ == Phase::Settling) settle();
    updateMoving();
}

bool QVReorderableTableViewController::moveRow(int row, int places) {
    const int count = numberOfRows(), target = row + places;
    if (isDragging() || places == 0 || row < 0 || row >= count || target < 0 || target >= count) return false;
    finishReordering();
    setReordering(true);
    if (const auto told = delegate()) {
        told->reorderingDidBegin(*this, row);
        // One place after the other: those that are passed keep their order.
        const int step = places > 0 ? 1 : -1;
        for (int at = row; at != target; at += step) told->rowDidMove(*this, at, at + step);
        told->reorderingDidFinish(*this);
    }
    setReordering(false);
    return true;
}

void QVReorderableTableViewController::setReordering(bool reordering) {
    reordering ? willBeginReordering() : didEndReordering();
}

// What is seen

std::optional<QVReorderableTableViewController::DraggingView> QVReorderableTableViewController::draggingView()
    const {
    if (phase_ == Phase::Idle) return std::nullopt;
    DraggingView view;
    view.image = image_;
    view.frame = QRectF(0, 0, geometry_.width, geometry_.rowHeight);
    view.frame.moveCenter({geometry_.width / 2, centerY_ + remainingWay_.value() - geometry_.contentOffset});
    view.scale = scale_.value();
    view.opacity = opacity_.value();
    return view;
}

void QVReorderableTableViewController::advance(QVAnimationTime now) {
    if (phase_ == Phase::Idle) return;
    for (QVAnimatedNumber* number : {&remainingWay_, &scale_, &opacity_, &leaving_}) number->advance(now);
    autoScroll(now);
    const bool arrived = !remainingWay_.isAnimating() && !scale_.isAnimating() && !opacity_.isAnimating();
    if (phase_ == Phase::Settling && arrived) {
        leaving_.set(0);
        leaving_.animateTo(1, now, kLeaveDuration, QVAnimationCurve::Linear);
        setPhase(Phase::Leaving);
        finish();
    } else if (phase_ == Phase::Leaving && !leaving_.isAnimating()) {
        image_ = {};
        setPhase(Phase::Idle);
    }
    updateMoving();
    emit draggingViewChanged();
}

void QVReorderableTableViewController::setPhase(Phase phase) {
    const bool wasDragging = isDragging();
    phase_ = phase;
    if (wasDragging != isDragging()) emit draggingChanged();
    updateMoving();
}

void QVReorderableTableViewController::updateMoving() {
    const bool scrolls =
        scrollSpeed_ != 0 && tableGeometry().offsetScrolledBy(scrollSpeed_) != geometry_.contentOffset;
    const bool moving =
        phase_ != Phase::Idle && (phase_ != Phase::Dragging || scrolls || remainingWay_.isAnimating() ||
                                  scale_.isAnimating() || opacity_.isAnimating());
    if (!scrolls) lastScroll_.reset();
    if (moving == moving_) return;
    moving_ = moving;
    emit movingChanged();
}
