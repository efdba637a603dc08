#include "Qelvar/Charts/QVAnimation.h"

#include <algorithm>

#include "Platform/Appearance.h"

namespace {

double eased(double progress, QVAnimationCurve curve) {
    switch (curve) {
        case QVAnimationCurve::EaseOut:
            return 1 - (1 - progress) * (1 - progress);
        case QVAnimationCurve::EaseInOut:
            return progress * progress * (3 - 2 * progress);
        case QVAnimationCurve::Linear:
            break;
    }
    return progress;
}

}  // namespace

void QVAnimatedNumber::set(double value) {
    from_ = to_ = current_ = value;
    animating_ = false;
}

void QVAnimatedNumber::animateTo(double target, QVAnimationTime start, QVAnimationTime duration,
                                 QVAnimationCurve curve) {
    if (duration <= QVAnimationTime::zero() || platform::reducedMotion()) {
        set(target);
        return;
    }
    from_ = current_;
    to_ = target;
    start_ = start;
    duration_ = duration;
    curve_ = curve;
    animating_ = from_ != to_;
}

bool QVAnimatedNumber::advance(QVAnimationTime now) {
    if (!animating_) return false;
    const double progress = std::clamp(
        static_cast<double>((now - start_).count()) / static_cast<double>(duration_.count()), 0.0, 1.0);
    if (progress == 1) {
        set(to_);
        return false;
    }
    current_ = from_ + (to_ - from_) * eased(progress, curve_);
    return true;
}
