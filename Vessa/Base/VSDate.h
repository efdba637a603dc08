#pragma once

#include <chrono>
#include <compare>
#include <cstdint>
#include <functional>

/// A span of time in whole microseconds. May be negative.
using VSDuration = std::chrono::microseconds;

/// Whole microseconds of a number of seconds, rounded to nearest.
/// REQUIRES: |seconds| < 9e12.
VSDuration VSDurationFromSeconds(double seconds);
double VSSecondsFromDuration(VSDuration duration);

/// A point in time with microseconds, in the proleptic Gregorian reckoning of the system's clocks (UTC
/// without leap seconds). A plain value; it knows no calendar and no time zone (VSCalendar does).
class VSDate {
 public:
    using TimePoint = std::chrono::sys_time<VSDuration>;

    /// 1970-01-01 00:00:00 UTC.
    constexpr VSDate() = default;
    constexpr explicit VSDate(TimePoint time) : time_(time) {}

    static constexpr VSDate fromMicroseconds(int64_t sinceUnixEpoch) {
        return VSDate(TimePoint(VSDuration(sinceUnixEpoch)));
    }
    static constexpr VSDate fromSeconds(int64_t sinceUnixEpoch) {
        return fromMicroseconds(sinceUnixEpoch * 1'000'000);
    }
    /// Seconds since VSReferenceDate, rounded to the microsecond.
    static VSDate fromSecondsSinceReferenceDate(double seconds);
    static constexpr VSDate distantPast() { return fromMicroseconds(INT64_MIN / 4); }
    static constexpr VSDate distantFuture() { return fromMicroseconds(INT64_MAX / 4); }

    constexpr int64_t microseconds() const { return time_.time_since_epoch().count(); }
    /// Milliseconds since 1970, rounded towards the past: what ICU reckons in.
    double icuMilliseconds() const;
    double secondsSinceReferenceDate() const;
    constexpr TimePoint timePoint() const { return time_; }

    friend constexpr auto operator<=>(const VSDate&,
                                      const VSDate&) = default;  // NOLINT(modernize-use-nullptr)
    friend constexpr VSDate operator+(VSDate date, VSDuration duration) {
        return VSDate(date.time_ + duration);
    }
    friend constexpr VSDate operator-(VSDate date, VSDuration duration) {
        return VSDate(date.time_ - duration);
    }
    friend constexpr VSDuration operator-(VSDate a, VSDate b) { return a.time_ - b.time_; }

 private:
    TimePoint time_{};
};

/// 2001-01-01 00:00:00 UTC. Dates that are kept as numbers count seconds from here.
inline constexpr VSDate VSReferenceDate = VSDate::fromSeconds(978'307'200);

/// The date whose seconds since the reference date are the mean of those of the two.
VSDate VSMidDate(VSDate a, VSDate b);

template <>
struct std::hash<VSDate> {
    size_t operator()(const VSDate& date) const noexcept { return std::hash<int64_t>()(date.microseconds()); }
};
