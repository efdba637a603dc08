// What the card of sleep says of nights: made-up ones that are easy to get wrong, and real ones.

#include <fstream>
#include <sstream>

#include "ProviderTestSupport.h"
#include "Qelvar/DataProviders/QVTimePeriodDataProvider.h"
#include "Qelvar/Import/QVRecordsImporter.h"

using namespace test;

namespace {

using Bars = std::map<VSDate, double>;

class NightsTest : public ProviderTest {
 protected:
    /// A line each: source, what it saw, from when to when, and perhaps the offset in hours.
    void saveNights(const std::string& lines) {
        std::vector<VSSamplePtr> samples;
        std::istringstream text(lines);
        for (std::string line; std::getline(text, line);) {
            std::istringstream fields(line);
            std::string source, value, start, end;
            fields >> source >> value >> start >> end;
            VSProvenance provenance;
            provenance.sourceRevision = std::make_shared<const VSSourceRevision>(
                VSSourceRevision{VSSource::forImportedName(source), ""});
            if (int hours = 0; fields >> hours) provenance.timeZoneOffset = hours * 3600;
            samples.push_back(std::make_shared<const VSCategorySample>(
                type(VSCode::SleepAnalysis), value == "asleep" ? 1 : 0, date(start), date(end), provenance));
        }
        save(samples);
    }
    void orderSources(const std::vector<const char*>& names) {
        std::vector<VSSource> sources;
        for (const char* name : names) sources.push_back(VSSource::forImportedName(name));
        Promise<bool> done;
        store->setOrderedSources(sources, type(VSCode::SleepAnalysis),
                                 [&](const VSStatus& status) { done.set(status.ok()); });
        ASSERT_TRUE(done.wait().value_or(false));
    }
    /// The provider of a new card that shows the scope of today, loaded.
    std::shared_ptr<QVTimePeriodDataProvider> shown(QVTimeScope scope) {
        auto provider = this->provider<QVTimePeriodDataProvider>(VSGroupID::SleepAnalysis);
        show(*provider, scope, scope == QVTimeScope::Day);
        EXPECT_TRUE(
            waitUntil([&] { return waitUntilLoaded(*provider) && provider->hasLoadedCurrentValue(); }));
        return provider;
    }
    static Bars bars(const QVDataProvider& provider) {
        Bars result;
        for (const auto& point : provider.historicalData()) result[point->xValue()] = *point->maxYValue();
        return result;
    }
};

double meanOf(const Bars& nights) {
    double sum = 0;
    for (const auto& [noon, hours] : nights) sum += hours;
    return sum / static_cast<double>(nights.size());
}

void expectBars(const Bars& found, const Bars& expected) {
    ASSERT_EQ(found.size(), expected.size());
    for (const auto& [x, hours] : expected) {
        ASSERT_TRUE(found.contains(x)) << ::testing::PrintToString(x);
        EXPECT_NEAR(found.at(x), hours, 1e-9) << ::testing::PrintToString(x);
    }
}

struct Night {
    const char* what;
    std::string tracked;
    const char* now;
    std::string until;                                   // the end of the last sleep
    std::vector<std::pair<std::string, double>> nights;  // of the week; the last is the current value
    std::vector<const char*> order = {};
};

constexpr const char* watchAndRing =
    "Watch bed 2020-03-13T22:30 2020-03-14T07:30\nWatch asleep 2020-03-13T23:00 2020-03-14T03:00\n"
    "Watch asleep 2020-03-14T04:00 2020-03-14T07:00\nRing asleep 2020-03-13T23:00 2020-03-14T08:00";
/// More of them than are asked for at first.
std::string notedWithoutLength() {
    std::string lines;
    for (int i = 0; i < 20; ++i) {
        const std::string at = "2020-03-14T15:" + std::to_string(10 + i);
        lines += "\nWatch asleep " + at + " " + at;
    }
    return lines;
}
constexpr const char* evening = "2020-03-14T20:00";

const std::vector<Night> nights{
    {"in bed, and asleep within",
     "Watch bed 2020-03-13T22:30 2020-03-14T07:30\nWatch asleep 2020-03-13T23:00 2020-03-14T03:00\n"
     "Watch asleep 2020-03-14T02:00 2020-03-14T07:00",
     evening,
     "2020-03-14T07:00",
     {{"2020-03-14", 8}}},
    {"a phone knows when the person lay down, and a watch the sleep",
     "Phone bed 2020-03-13T22:00 2020-03-14T08:00\nWatch asleep 2020-03-13T23:00 2020-03-14T06:00",
     evening,
     "2020-03-14T06:00",
     {{"2020-03-14", 7}}},
    {"two trackers, of which the first saw an hour awake",
     watchAndRing,
     evening,
     "2020-03-14T08:00",
     {{"2020-03-14", 7.5}}},
    {"the same, and the other counts first",
     watchAndRing,
     evening,
     "2020-03-14T08:00",
     {{"2020-03-14", 9}},
     {"Ring", "Watch"}},
    {"an afternoon's nap belongs to the coming night, a morning's to the last",
     "Watch asleep 2020-03-12T23:00 2020-03-13T06:00\nWatch asleep 2020-03-13T09:00 2020-03-13T09:30\n"
     "Watch asleep 2020-03-13T14:00 2020-03-13T15:00\nWatch asleep 2020-03-13T23:00 2020-03-14T06:00",
     evening,
     "2020-03-14T06:00",
     {{"2020-03-13", 7.5}, {"2020-03-14", 8}}},
    {"a night that is not over",
     "Watch asleep 2020-03-13T23:00 2020-03-14T07:00",
     "2020-03-14T05:00",
     "2020-03-14T05:00",
     {{"2020-03-14", 6}}},
    {"a night that nobody ended, and the next one",
     "Watch asleep 2020-03-12T23:00 2041-01-01T00:00\nWatch asleep 2020-03-13T23:00 2020-03-14T06:00",
     evening,
     "2020-03-14T06:00",
     {{"2020-03-13", 13}, {"2020-03-14", 7}}},
    {"nights of which only the beginning was noted",
     "Watch asleep 2020-03-12T23:00 2020-03-13T06:00" + notedWithoutLength(),
     evening,
     "2020-03-13T06:00",
     {{"2020-03-13", 7}}},
    {"a ring saw last what a watch that counts before it knows better",
     "Watch asleep 2020-03-13T23:00 2020-03-14T07:00\nWatch bed 2020-03-14T10:00 2020-03-14T14:00\n"
     "Watch asleep 2020-03-14T10:00 2020-03-14T11:30\nRing asleep 2020-03-14T12:30 2020-03-14T13:30",
     evening,
     "2020-03-14T11:30",
     {{"2020-03-14", 9.5}},
     {"Watch", "Ring"}},
    {"in the middle of nights that are all noted already",
     "Watch asleep 2020-03-12T23:00 2020-03-13T07:00\nWatch asleep 2020-03-13T23:00 2020-03-14T01:00\n"
     "Watch asleep 2020-03-14T02:00 2020-03-14T04:00\nWatch asleep 2020-03-14T05:00 2020-03-14T07:00\n"
     "Watch asleep 2020-03-14T14:00 2020-03-14T15:00\nWatch asleep 2020-03-14T23:00 2020-03-15T07:00",
     "2020-03-14T03:00",
     "2020-03-14T03:00",
     {{"2020-03-13", 8}, {"2020-03-14", 3}}},
    {"the clocks go forward",
     "Watch asleep 2020-03-28T23:00 2020-03-29T07:00",
     "2020-03-29T20:00",
     "2020-03-29T07:00",
     {{"2020-03-29", 7}}},
    {"the clocks go back, and the document was written in winter",
     "Watch asleep 2020-10-24T23:00 2020-10-25T07:00 1",
     "2020-10-25T20:00",
     "2020-10-25T07:00",
     {{"2020-10-25", 9}}},
    {"nights in New York and at home, with a flight between them",
     "Watch asleep 2020-03-10T23:00-04:00 2020-03-11T07:00-04:00 -4\n"
     "Watch asleep 2020-03-11T23:30-04:00 2020-03-12T06:30-04:00 -4\n"
     "Watch asleep 2020-03-12T22:00-04:00 2020-03-13T01:00-04:00 -4\n"
     "Watch asleep 2020-03-13T22:00 2020-03-14T08:00 1",
     evening,
     "2020-03-14T08:00",
     {{"2020-03-11", 8}, {"2020-03-12", 7}, {"2020-03-13", 3}, {"2020-03-14", 10}}},
    {"a night beyond the date line",
     "Watch asleep 2020-03-12T23:00+13:00 2020-03-13T07:00+13:00 13",
     evening,
     "2020-03-13T07:00",
     {{"2020-03-13", 8}}},
};

}  // namespace

TEST_F(NightsTest, TheCardSaysWhatAPersonWouldSay) {
    for (const Night& night : nights) {
        SCOPED_TRACE(night.what);
        environment->setNow(date(night.now));
        deleteAll(VSCode::SleepAnalysis);
        saveNights(night.tracked);
        orderSources(night.order);
        const auto week = shown(QVTimeScope::Week);
        ASSERT_TRUE(week->currentValue() && week->averageValue());
        EXPECT_NEAR(*week->currentValue(), night.nights.back().second, 1e-9);
        EXPECT_EQ(week->lastUpdatedDate(), date(night.until));
        Bars expected;
        for (const auto& [day, hours] : night.nights) expected[date(day + "T12:00")] = hours;
        expectBars(bars(*week), expected);
        EXPECT_NEAR(*week->averageValue(), meanOf(expected), 1e-9);
    }
}

TEST_F(NightsTest, ANightElsewhereIsDrawnAtItsOwnHours) {
    environment->setNow(date("2020-03-14T11:00"));
    saveNights("Watch asleep 2020-03-13T23:00-04:00 2020-03-14T05:00-04:00 -4");
    const auto day = shown(QVTimeScope::Day);
    ASSERT_EQ(day->historicalData().size(), 2u);
    EXPECT_EQ(day->historicalData()[0]->xValue(), date("2020-03-13T23:00"));
    EXPECT_EQ(day->historicalData()[1]->xValue(), date("2020-03-14T05:00"));
}

TEST_F(NightsTest, RealNightsAreAsLongAsTheirRecordsSay) {
    environment->setTimeZone("Europe/London");
    environment->setNow(date("2024-01-18T20:00"));
    const std::string folderOfNights = QELVAR_TEST_DATA "/nights";
    const auto report = QVRecordsImporter(store).importFiles({folderOfNights + "/input.zip"});
    ASSERT_TRUE(report.ok()) << report.error().message;
    std::map<std::string, double> table;
    std::ifstream file(folderOfNights + "/expected.tsv");
    std::string day;
    for (double seconds = 0; file >> day >> seconds;) table[day] = seconds / 3600;
    ASSERT_EQ(table.size(), 87u);
    const auto expected = [&table](VSDate start, VSDate end) {
        Bars result;
        for (const auto& [name, hours] : table) {
            const VSDate noon = date(name + "T12:00");
            if (noon >= start && noon < end) result[noon] = hours;
        }
        return result;
    };

    const auto year = shown(QVTimeScope::Year);
    EXPECT_NEAR(*year->currentValue(), table.rbegin()->second, 1e-9);
    EXPECT_EQ(year->lastUpdatedDate(), date("2024-01-18T07:27"));
    EXPECT_NEAR(*year->averageValue(), meanOf(expected(date("2023-10-01"), date("2024-02-01"))), 1e-9);
    std::vector<double> months(4);
    for (const auto& [name, hours] : table)
        months[name.starts_with("2024") ? 3 : static_cast<size_t>(std::stoi(name.substr(5, 2)) - 10)] +=
            hours;
    ASSERT_EQ(year->historicalData().size(), 4u);
    for (size_t i = 0; i < 4; ++i) EXPECT_NEAR(*year->historicalData()[i]->maxYValue(), months[i], 1e-9) << i;

    for (const char* today :
         {"2023-10-31T20:00", "2023-11-30T20:00", "2023-12-31T20:00", "2024-01-18T20:00"}) {
        SCOPED_TRACE(today);
        environment->setNow(date(today));
        const auto month = shown(QVTimeScope::Month);
        const Bars ofMonth = expected(*month->startDate(), *month->endDate());
        expectBars(bars(*month), ofMonth);
        EXPECT_NEAR(*month->averageValue(), meanOf(ofMonth), 1e-9);
        const auto dayCard = shown(QVTimeScope::Day);
        EXPECT_NEAR(*dayCard->averageValue(),
                    meanOf(expected(*month->endDate() - std::chrono::hours(7 * 24), *month->endDate())),
                    1e-9);
    }
}
