#include "DaysOfICU.h"

#include <unicode/basictz.h>
#include <unicode/tztrans.h>

#include <algorithm>

namespace test {

namespace {

constexpr int64_t kDay = 86'400'000'000;
constexpr int64_t kAround = kDay + kDay / 8;  // no zone is further from Greenwich, nor jumps further

int64_t numberOf(DaysOfICU::Civil day) {
    return std::chrono::sys_days(day).time_since_epoch().count();
}

int64_t dayNumber(int64_t local) {
    return local / kDay - (local % kDay < 0 ? 1 : 0);
}

}  // namespace

struct DaysOfICU::Zone {
    std::unique_ptr<icu::TimeZone> zone;
};

DaysOfICU::DaysOfICU(const std::string& zone)
    : zone_(new Zone{std::unique_ptr<icu::TimeZone>(
          icu::TimeZone::createTimeZone(icu::UnicodeString::fromUTF8(zone)))}) {
    const auto& rules = dynamic_cast<const icu::BasicTimeZone&>(*zone_->zone);
    icu::TimeZoneTransition transition;
    UDate time = -631'152'000'000.0;
    while (rules.getNextTransition(time, false, transition) && transition.getTime() < 2'114'380'800'000.0) {
        time = transition.getTime();
        changes_.push_back(VSDate::fromMicroseconds(static_cast<int64_t>(time) * 1000));
    }
}

DaysOfICU::~DaysOfICU() = default;

int64_t DaysOfICU::local(int64_t time) const {
    int32_t raw = 0, saving = 0;
    UErrorCode status = U_ZERO_ERROR;
    zone_->zone->getOffset(static_cast<double>(time) / 1000, false, raw, saving, status);
    return time + (raw + saving) * int64_t{1000};
}

DaysOfICU::Civil DaysOfICU::shown(VSDate date) const {
    return std::chrono::sys_days(std::chrono::days(dayNumber(local(date.microseconds()))));
}

VSDate DaysOfICU::start(Civil day) const {
    const int64_t midnight = numberOf(day) * kDay;
    // The clock passes midnight where it shows it, or where it is changed.
    std::vector<int64_t> moments;
    for (const VSDate change : changes_)
        if (std::abs(change.microseconds() - midnight) < 2 * kAround)
            moments.push_back(change.microseconds());
    const size_t changes = moments.size();
    for (const int64_t around : {-kAround, kAround})
        moments.push_back(2 * midnight - local(midnight + around) + around);
    for (size_t i = 0; i < changes; ++i) moments.push_back(midnight - (local(moments[i]) - moments[i]));
    std::sort(moments.rbegin(), moments.rend());
    for (const int64_t moment : moments)
        if (local(moment) >= midnight && local(moment - 1000) < midnight)
            return VSDate::fromMicroseconds(moment);
    return {};
}

VSDate DaysOfICU::startOfDay(VSDate date) const {
    Civil day = plusDays(shown(date), 1);
    while (start(day) > date) day = plusDays(day, -1);
    return start(day);
}

DaysOfICU::Civil plusMonths(DaysOfICU::Civil day, int months) {
    const auto month = day.year() / day.month() + std::chrono::months(months);
    const DaysOfICU::Civil same = month / day.day();
    return same.ok() ? same : DaysOfICU::Civil(std::chrono::sys_days(month / std::chrono::last));
}

DaysOfICU::Civil plusDays(DaysOfICU::Civil day, int days) {
    return std::chrono::sys_days(day) + std::chrono::days(days);
}

}  // namespace test
