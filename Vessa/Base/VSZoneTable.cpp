#include "Vessa/Base/VSZoneTable.h"

#include <unicode/basictz.h>
#include <unicode/tztrans.h>

#include <algorithm>
#include <map>
#include <mutex>

#include "Vessa/Base/VSCivil.h"
#include "Vessa/Base/VSLog.h"

namespace {

// The Gregorian calendar, its weekdays included, repeats after 400 years: whatever rule is in force in the
// last 400 years of the table holds for all time after it.
constexpr int64_t kPeriod = civil::kDaysOfEra * civil::kDay;
constexpr int64_t kEndOfTable = int64_t{16'725'225'600} * civil::kSecond;  // 2500-01-01 00:00:00 UTC

int64_t intoTable(int64_t time) {
    if (time < kEndOfTable) return time;
    return time - ((time - kEndOfTable) / kPeriod + 1) * kPeriod;
}

int64_t microseconds(double milliseconds) {
    return static_cast<int64_t>(milliseconds) * 1000;
}

}  // namespace

std::shared_ptr<const VSZoneTable> VSZoneTable::forZone(const std::string& identifier) {
    // Each thread remembers the zone that it asked for last: nearly always the same one.
    thread_local std::string lastIdentifier;
    thread_local std::shared_ptr<const VSZoneTable> last;
    if (last && lastIdentifier == identifier) return last;

    static std::mutex mutex;
    static auto* tables = new std::map<std::string, std::shared_ptr<const VSZoneTable>>;
    std::lock_guard lock(mutex);
    auto& table = (*tables)[identifier];
    if (!table) table = std::make_shared<const VSZoneTable>(identifier);
    lastIdentifier = identifier;
    last = table;
    return table;
}

VSZoneTable::VSZoneTable(const std::string& identifier) {
    readChanges(identifier);
    changes_.shrink_to_fit();
}

void VSZoneTable::readChanges(const std::string& identifier) {
    const std::unique_ptr<icu::TimeZone> zone(
        icu::TimeZone::createTimeZone(icu::UnicodeString::fromUTF8(identifier)));
    const auto* rules = dynamic_cast<const icu::BasicTimeZone*>(zone.get());
    if (!rules || *zone == icu::TimeZone::getUnknown()) {
        VSLog(VSLogLevel::Error, "Unknown time zone \"" + identifier + "\": UTC is used");
        changes_ = {{INT64_MIN, 0}};
        return;
    }

    constexpr double kBeforeAllZones = -5'000'000'000'000.0;  // 1811, in milliseconds
    int32_t raw = 0, saving = 0;
    UErrorCode status = U_ZERO_ERROR;
    zone->getOffset(kBeforeAllZones, false, raw, saving, status);
    changes_.push_back({INT64_MIN, microseconds(raw + saving)});

    icu::TimeZoneTransition transition;
    UDate time = kBeforeAllZones;
    while (rules->getNextTransition(time, false, transition)) {
        time = transition.getTime();
        if (microseconds(time) >= kEndOfTable) break;
        const icu::TimeZoneRule* rule = transition.getTo();
        const int64_t offset = microseconds(rule->getRawOffset() + rule->getDSTSavings());
        // Some changes only move hours between standard and summer time; the clock does not notice.
        if (offset != changes_.back().offset) changes_.push_back({microseconds(time), offset});
    }
}

int64_t VSZoneTable::offsetAt(int64_t time) const {
    const auto after = std::upper_bound(changes_.begin(), changes_.end(), intoTable(time),
                                        [](int64_t t, const Change& change) { return t < change.time; });
    return std::prev(after)->offset;
}

int64_t VSZoneTable::lastChangeAt(int64_t time) const {
    const int64_t inside = intoTable(time);
    const auto after = std::upper_bound(changes_.begin(), changes_.end(), inside,
                                        [](int64_t t, const Change& change) { return t < change.time; });
    const int64_t change = std::prev(after)->time;
    return change == INT64_MIN ? change : change + (time - inside);
}

/// The first period of constant offset whose wall clock ends after the local time holds it, or lies behind
/// the gap that holds it. The ends ascend, for no change takes back more than the period before it lasted.
const VSZoneTable::Change* VSZoneTable::periodOfLocal(int64_t local) const {
    return &*std::partition_point(changes_.begin(), changes_.end(), [&](const Change& change) {
        const auto* next = &change + 1;
        return next != changes_.data() + changes_.size() && next->time + change.offset <= local;
    });
}

int64_t VSZoneTable::instantOfLocal(int64_t local) const {
    const int64_t inside = intoTable(local);
    const Change* period = periodOfLocal(inside);
    return std::max(inside - period->offset, period->time) + (local - inside);
}

int64_t VSZoneTable::startOfDay(int64_t day) const {
    const int64_t midnight = day * civil::kDay;
    const int64_t inside = intoTable(midnight);
    const Change* period = periodOfLocal(inside);
    for (const Change* next = period + 1;
         next != changes_.data() + changes_.size() && next->time + next->offset < inside; ++next)
        period = next;
    return std::max(inside - period->offset, period->time) + (midnight - inside);
}

int64_t VSZoneTable::dayOf(int64_t time) const {
    const int64_t shown = civil::floorDivide(time + offsetAt(time), civil::kDay);
    return startOfDay(shown) <= time ? shown : shown - 1;
}
