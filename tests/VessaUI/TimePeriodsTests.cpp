#include "VessaUI/VSTimePeriods.h"

#include <gtest/gtest.h>

#include <map>
#include <random>
#include <set>

#include "TestSupport.h"

using namespace test;

namespace {

constexpr VSDuration quarter = std::chrono::minutes(15);
constexpr int inBed = 0, asleep = 1;

struct Tracked {
    int source;  // place in the order
    int value;
    VSDate start, end;
    std::optional<int> offset;
};

VSSource tracker(int number) {
    return VSSource::forImportedName("Tracker " + std::to_string(number));
}

VSSamplePtr sample(const Tracked& tracked) {
    VSProvenance provenance;
    provenance.sourceRevision =
        std::make_shared<const VSSourceRevision>(VSSourceRevision{tracker(tracked.source), ""});
    provenance.timeZoneOffset = tracked.offset;
    return std::make_shared<const VSCategorySample>(VSObjectType::dataTypeWithCode(VSCode::SleepAnalysis),
                                                    tracked.value, tracked.start, tracked.end, provenance);
}

struct Zone {
    const char* name;
    const char* middle;  // of the nights: when the clocks change, where they do
    std::set<int> offsets;
};

/// Counts quarter by quarter of an hour what VSTimePeriods.h says, with nothing but the offset of the zone at
/// a moment.
class QuarterByQuarter {
 public:
    QuarterByQuarter(const Zone& zone, bool nights, VSDate now)
        : zone_(zone), calendar_(zone.name, "en_US"), nights_(nights), now_(now) {}

    /// The hours by day, which is named by its number since 1970.
    std::map<int64_t, double> hoursByDay(const std::vector<Tracked>& samples, bool onlyAsleep) {
        std::map<VSDate, std::map<int, std::vector<const Tracked*>>> seen;  // by quarter and source
        for (const Tracked& each : samples)
            for (VSDate at = each.start; at < std::min(endOf(each), now_); at = at + quarter)
                seen[at][each.source].push_back(&each);
        const auto counts = [&](const Tracked* each) { return !onlyAsleep || each->value == asleep; };
        // A source watches in a run of quarters in which something counts.
        std::map<int, std::set<VSDate>> watched;
        for (int source = 0; source < 4; ++source) {
            std::vector<VSDate> run;
            bool speaks = false;
            const auto close = [&] {
                if (speaks) watched[source].insert(run.begin(), run.end());
                run.clear();
                speaks = false;
            };
            for (const auto& [at, bySource] : seen) {
                const auto own = bySource.find(source);
                if (own == bySource.end() || (!run.empty() && run.back() + quarter < at)) close();
                if (own == bySource.end()) continue;
                run.push_back(at);
                speaks = speaks || std::any_of(own->second.begin(), own->second.end(), counts);
            }
            close();
        }
        std::map<int64_t, int> quarters;
        for (const auto& [at, bySource] : seen)
            for (const auto& [source, covering] : bySource) {
                if (!watched[source].contains(at)) continue;
                const Tracked* first = nullptr;
                for (const Tracked* each : covering)
                    if (counts(each) && (!first || each->start < first->start)) first = each;
                if (first) quarters[dayOf(at + shift(*first))] += 1;
                break;
            }
        std::map<int64_t, double> hours;
        for (const auto& [day, count] : quarters) hours[day] = count / 4.0;
        return hours;
    }

    int64_t dayOf(VSDate at) const {
        const int64_t clock = clockAt(at) / 1'000'000 + (nights_ ? 12 * 3600 : 0);
        return clock / 86'400;
    }

 private:
    int64_t clockAt(VSDate at) const {
        return at.microseconds() + calendar_.secondsFromGMT(at) * int64_t{1'000'000};
    }
    /// By looking at every quarter whether the clock shows the recorded time then.
    VSDuration shift(const Tracked& each) const {
        if (!nights_ || !each.offset || zone_.offsets.contains(*each.offset)) return VSDuration::zero();
        const int64_t recorded = each.start.microseconds() + *each.offset * int64_t{1'000'000};
        for (VSDate at = each.start - std::chrono::hours(26); at < each.start + std::chrono::hours(26);
             at = at + quarter)
            if (clockAt(at) == recorded) return at - each.start;
        ADD_FAILURE() << "no such time";
        return VSDuration::zero();
    }
    VSDate endOf(const Tracked& each) const {
        VSDate end = each.end;
        if (nights_ && end - each.start > std::chrono::hours(24)) {
            const VSDuration moved = shift(each);
            end = each.start + quarter;
            while (dayOf(end + moved) == dayOf(each.start + moved)) end = end + quarter;
        }
        return end;
    }

    const Zone& zone_;
    VSCalendar calendar_;
    bool nights_;
    VSDate now_;
};

std::vector<Tracked> randomNights(std::mt19937& random, const Zone& zone, VSDate middle) {
    const auto between = [&](int low, int high) {
        return std::uniform_int_distribution<int>(low, high)(random);
    };
    std::vector<int> offsets(zone.offsets.begin(), zone.offsets.end());
    std::vector<Tracked> samples;
    for (int i = between(1, 24); i > 0; --i) {
        Tracked each{
            between(0, 3), between(0, 2) ? asleep : inBed, middle + between(-200, 200) * quarter, {}, {}};
        each.end = each.start + (between(0, 40) ? between(0, 40) : between(94, 270)) * quarter;
        switch (between(0, 3)) {
            case 0:
                each.offset = -3 * 3600;  // of none of the zones
                break;
            case 1:
                each.offset = offsets[static_cast<size_t>(between(0, int(offsets.size()) - 1))];
                break;
        }
        // The clock of the zone may leave this hour out, and then there is nothing to compare with.
        const auto clock = each.start + std::chrono::seconds(each.offset.value_or(0));
        const auto hour = clock.microseconds() / 3'600'000'000 % 24;
        if (each.offset == -3 * 3600 && hour <= 2) each.offset.reset();
        samples.push_back(each);
    }
    return samples;
}

}  // namespace

TEST(TimePeriods, AgreeWithCountingQuarters) {
    const Zone zones[] = {{"Europe/Copenhagen", "2020-03-29T01:00", {3600, 7200}},
                          {"Europe/Copenhagen", "2020-10-25T01:00", {3600, 7200}},
                          {"America/New_York", "2020-11-01T06:00", {-18000, -14400}},
                          {"Asia/Beirut", "2022-03-26T22:00", {7200, 10800}},
                          {"America/Havana", "2019-11-03T05:00", {-18000, -14400}},
                          {"Australia/Lord_Howe", "2019-10-05T15:30", {37800, 39600}},
                          {"Asia/Kathmandu", "2020-06-10T18:15", {20700}}};
    std::mt19937 random(20200329);
    for (const Zone& zone : zones) {
        FixedEnvironment environment("2020-06-01T12:00", zone.name);
        const VSCalendar calendar = VSCalendar::current();
        const VSDate middle = date(std::string(zone.middle) + "Z");
        for (int round = 0; round < 60; ++round) {
            SCOPED_TRACE(std::string(zone.name) + ", round " + std::to_string(round));
            const auto tracked = randomNights(random, zone, middle);
            const bool nights = round % 3 != 0, onlyAsleep = round % 2 == 0;
            VSTimePeriodRules rules{std::nullopt,
                                    {tracker(0), tracker(1), tracker(2)},
                                    middle + std::chrono::hours(round),
                                    nights};
            if (onlyAsleep) rules.counted = VSPredicate::withCategoryValue(asleep);
            std::vector<VSSamplePtr> samples;
            for (const Tracked& each : tracked) samples.push_back(sample(each));

            const auto spans = VSCoalesceTimePeriodsFromSamples(samples, rules, calendar);
            EXPECT_TRUE(std::is_sorted(spans.begin(), spans.end(),
                                       [](const auto& a, const auto& b) { return a.start < b.start; }));
            QuarterByQuarter oracle(zone, nights, rules.now);
            const auto expected = oracle.hoursByDay(tracked, onlyAsleep);
            const VSDate first = calendar.startOfDay(middle - std::chrono::hours(24 * 6));
            const VSDate last = calendar.addDays(first, 14);
            const auto totals = VSCalculateTotalDurations(
                spans, nights ? calendar.yesterdayAtNoon(first) : first,
                nights ? calendar.yesterdayAtNoon(last) : last, {.days = 1}, nights, calendar);
            std::map<int64_t, double> hours;
            for (const VSDurationInBucket& total : totals) {
                hours[oracle.dayOf(total.bucket.start)] = total.hours;
                EXPECT_EQ(oracle.dayOf(total.bucket.end), oracle.dayOf(total.bucket.start) + 1);
            }
            ASSERT_EQ(hours.size(), expected.size());
            for (const auto& [day, amount] : expected) EXPECT_NEAR(hours[day], amount, 1e-9) << day;
        }
    }
}

TEST(TimePeriods, HoursThatAreLeftOutAndMonthsOfNights) {
    FixedEnvironment environment("2020-03-31T12:00");
    const VSCalendar calendar = VSCalendar::current();
    // The clock of Copenhagen leaves 2:30 out: its end is meant, and the length stays.
    const Tracked inNewYork{0, asleep, date("2020-03-29T07:30Z"), date("2020-03-29T09:30Z"), -5 * 3600};
    EXPECT_EQ(VSCoalesceTimePeriodsFromSamples({sample(inNewYork)},
                                               {std::nullopt, {}, environment->now(), true}, calendar),
              (std::vector<VSTimeSpan>{{date("2020-03-29T03:00"), date("2020-03-29T05:00")}}));
    // Months of nights are calendar months; the last day of a month ends at its noon.
    const auto months = VSCalculateTotalDurations({{date("2020-01-31T11:00"), date("2020-01-31T14:00")},
                                                   {date("2020-02-29T10:00"), date("2020-02-29T13:00")}},
                                                  date("2019-11-30T12:00"), date("2020-03-31T12:00"),
                                                  {.months = 1}, true, calendar);
    ASSERT_EQ(months.size(), 3u);
    EXPECT_DOUBLE_EQ(months[0].hours, 1);
    EXPECT_DOUBLE_EQ(months[1].hours, 4);
    EXPECT_EQ(months[1].bucket, (VSTimeSpan{date("2020-01-31T12:00"), date("2020-02-29T12:00")}));
}
