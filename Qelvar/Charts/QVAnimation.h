#pragma once

#include <chrono>

/// A moment of the clock that drives animations; it never goes back. It has nothing to do with dates.
using QVAnimationTime = std::chrono::microseconds;

enum class QVAnimationCurve { Linear, EaseOut, EaseInOut };

/// A number that may be on its way to another one.
class QVAnimatedNumber {
 public:
    explicit QVAnimatedNumber(double value = 0) : from_(value), to_(value), current_(value) {}
    double value() const { return current_; }
    double target() const { return to_; }
    bool isAnimating() const { return animating_; }
    void set(double value);
    /// Starts from where the number is now. A duration of 0 is set(), and
    /// so is any for a person who wants less motion.
    void animateTo(double target, QVAnimationTime start, QVAnimationTime duration, QVAnimationCurve curve);
    /// Moves the number to where it is at that time. Returns whether it is still on its way.
    bool advance(QVAnimationTime now);

 private:
    double from_, to_, current_;
    QVAnimationTime start_{0}, duration_{0};
    QVAnimationCurve curve_ = QVAnimationCurve::Linear;
    bool animating_ = false;
};
