#include <gtest/gtest.h>

#include <fstream>

#include "RunProgram.h"
#include "TestSupport.h"

namespace {

/// Steps of a phone over an hour and twenty minutes, and of a watch over its second half.
constexpr const char* kDocument = R"(<?xml version="1.0" encoding="UTF-8"?>
<HealthData locale="en_DK">
 <Record type="VSQuantityTypeIdentifierStepCount" sourceName="Phone" unit="count" startDate="2020-03-01 23:30:00 +0100" endDate="2020-03-02 00:50:00 +0100" value="1573"/>
 <Record type="VSQuantityTypeIdentifierStepCount" sourceName="Watch" unit="count" startDate="2020-03-02 00:10:00 +0100" endDate="2020-03-02 01:10:00 +0100" value="60"/>
 <Record type="VSQuantityTypeIdentifierDistanceWalkingRunning" sourceName="Phone" unit="km" startDate="2020-03-01 10:00:00 +0100" endDate="2020-03-01 10:07:00 +0100" value="0.061"/>
</HealthData>
)";

class ExplainedStatistics : public testing::Test {
 protected:
    ExplainedStatistics() {
        const auto file = folder_.path() / "document.xml";
        std::ofstream(file) << kDocument;
        program_.set("TZ", "Europe/Copenhagen");
        EXPECT_EQ(program_.run({"import", file}).status, 0);
    }
    std::vector<test::Row> rows(const std::vector<std::string>& arguments) {
        const auto outcome = program_.run(arguments);
        EXPECT_EQ(outcome.status, 0) << outcome.errors;
        return test::rowsOf(outcome.output);
    }

    const test::TemporaryFolder folder_;
    test::Program program_{folder_.path()};
};

}  // namespace

TEST_F(ExplainedStatistics, ListRecordsAndWhatTookTheRest) {
    const auto all = rows({"statistics", "StepCount", "--every", "day", "--explain"});
    ASSERT_EQ(all.size(), 4U);  // the phone's first day; its second day, the watch, and what the phone took
    // clang-format off
    const std::tuple<size_t, const char*, const char*> fields[] = {
        {0, "end", "2020-03-02T00:00:00+01:00"}, {0, "source", "Phone"}, {0, "value", "1573"},
        {0, "starts", "1"}, {0, "counted", "589.875"}, {1, "starts", "0"}, {1, "counted", "983.125"},
        {2, "source", "Watch"}, {2, "in_interval", "60"}, {2, "counted", "20"}, {2, "taken", ""},
        {3, "counted", ""}, {3, "source", "Watch"}, {3, "taken", "40"},
        {3, "taken_from", "2020-03-02T00:10:00+01:00"}, {3, "taken_to", "2020-03-02T00:50:00+01:00"},
        {3, "by_source", "Phone"}, {3, "by_start", "2020-03-01T23:30:00+01:00"},
        {3, "by_value", "1573"}, {3, "unit", "count"}};
    // clang-format on
    for (const auto& [row, column, value] : fields)
        EXPECT_EQ(all[row].at(column), value) << "row " << row << ", " << column;
    EXPECT_EQ(program_.run({"statistics", "StepCount", "--explain", "--by-source"}).status, 2);
}

/// However a record is split over quarters of an hour, its sum is its value.
TEST_F(ExplainedStatistics, SumsAreExact) {
    const auto whole = rows({"statistics", "StepCount", "--by-source", "--options", "sum"});
    EXPECT_EQ(whole.at(0).at("sum"), "1593");
    EXPECT_EQ(whole.at(1).at("sum"), "1573");
    EXPECT_EQ(rows({"statistics", "DistanceWalkingRunning"}).at(0).at("sum"), "61");
    EXPECT_EQ(
        rows({"statistics", "DistanceWalkingRunning", "--unit", "km", "--every", "hour"}).at(0).at("sum"),
        "0.061");
}
