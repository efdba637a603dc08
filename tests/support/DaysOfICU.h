#pragma once

#include <chrono>
#include <memory>
#include <string>
#include <vector>

#include "Vessa/Base/VSDate.h"

namespace test {

/// The days of a zone, each computed by itself by asking ICU what its clock shows: the slow truth.
class DaysOfICU {
 public:
    using Civil = std::chrono::year_month_day;

    explicit DaysOfICU(const std::string& zone);
    ~DaysOfICU();
    /// What the clock on the wall shows, as microseconds since 1970.
    int64_t local(int64_t time) const;
    Civil shown(VSDate date) const;
    /// The last moment at which the clock passes into the day or a later one from an earlier one.
    VSDate start(Civil day) const;
    /// The start of the day that the moment lies in.
    VSDate startOfDay(VSDate date) const;
    /// The changes of the clock from 1950 to 2037.
    const std::vector<VSDate>& changes() const { return changes_; }

 private:
    struct Zone;
    const std::unique_ptr<Zone> zone_;
    std::vector<VSDate> changes_;
};

/// As calendars add them: the last day of a month that is too short.
DaysOfICU::Civil plusMonths(DaysOfICU::Civil day, int months);
DaysOfICU::Civil plusDays(DaysOfICU::Civil day, int days);

/// Zones whose clocks do the oddest things: they skip midnight, have it twice, leave days out, change by half
/// an hour or by two, stand between whole hours.
inline const std::vector<std::string> oddZones{
    "America/Santiago", "America/Havana",      "America/Asuncion",  "America/Sao_Paulo",
    "Asia/Beirut",      "Africa/Cairo",        "Asia/Tehran",       "Asia/Gaza",
    "Asia/Amman",       "Pacific/Apia",        "Pacific/Kwajalein", "Australia/Lord_Howe",
    "Asia/Kathmandu",   "Antarctica/Troll",    "America/St_Johns",  "Africa/Casablanca",
    "Asia/Pyongyang",   "America/Scoresbysund"};

}  // namespace test
