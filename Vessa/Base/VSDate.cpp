#include "Vessa/Base/VSDate.h"

#include <cmath>

namespace {

constexpr double kMicrosecondsPerSecond = 1e6;

// Whole and fractional seconds are converted apart: the product of the whole number would round a second
// time, and a date of 2140 would come back a microsecond off.
int64_t microsecondsFromSeconds(double seconds) {
    const double whole = std::floor(seconds);
    const double fraction = seconds - whole;  // exact
    return static_cast<int64_t>(whole) * 1'000'000 + std::llround(fraction * kMicrosecondsPerSecond);
}

}  // namespace

VSDuration VSDurationFromSeconds(double seconds) {
    return VSDuration(microsecondsFromSeconds(seconds));
}

double VSSecondsFromDuration(VSDuration duration) {
    return static_cast<double>(duration.count()) / kMicrosecondsPerSecond;
}

VSDate VSDate::fromSecondsSinceReferenceDate(double seconds) {
    constexpr double kLimit = 2e12;  // more than 60,000 years: inside distantPast and distantFuture
    if (!(seconds > -kLimit)) return distantPast();  // also what is not a number
    if (seconds > kLimit) return distantFuture();
    return VSReferenceDate + VSDurationFromSeconds(seconds);
}

double VSDate::icuMilliseconds() const {
    return static_cast<double>(
        std::chrono::floor<std::chrono::milliseconds>(time_).time_since_epoch().count());
}

double VSDate::secondsSinceReferenceDate() const {
    return VSSecondsFromDuration(*this - VSReferenceDate);
}

VSDate VSMidDate(VSDate a, VSDate b) {
    return a + (b - a) / 2;
}
