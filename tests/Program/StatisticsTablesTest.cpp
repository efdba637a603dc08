#include <gtest/gtest.h>

#include <cmath>
#include <cstdlib>

#include "RunProgram.h"
#include "TestSupport.h"

// Real records are imported, and every statistic of every day is compared with a table that was computed
// apart from this program. A small excerpt always; with QELVAR_REAL_RECORDS=FOLDER each FOLDER/*.zip that has
// a table of its name (.tsv) beside it.

namespace {

namespace fs = std::filesystem;

bool sameNumber(const std::string& a, const std::string& b) {
    if (a.empty() || b.empty()) return a == b;
    const double x = std::strtod(a.c_str(), nullptr), y = std::strtod(b.c_str(), nullptr);
    return std::abs(x - y) <= 1e-6 * std::abs(x);
}

void compareDay(const test::Row& expected, const test::Row& actual, bool addsUp) {
    const std::string what = expected.at("type") + " " + expected.at("day");
    EXPECT_EQ(expected.at("count"), actual.at("count")) << what;
    if (actual.at("unit").empty()) {
        // Records without a quantity have a count only, where the table writes zeros.
        for (const char* column : {"sum", "average", "minimum", "maximum"})
            EXPECT_EQ(actual.at(column), "") << what;
        return;
    }
    for (const char* column : {"sum", "average", "minimum", "maximum"}) {
        if (column == std::string("sum") && !addsUp) {
            EXPECT_EQ(actual.at(column), "") << what;
            continue;
        }
        EXPECT_TRUE(sameNumber(expected.at(column), actual.at(column)))
            << what << " " << column << ": " << expected.at(column) << " and not " << actual.at(column);
    }
}

void compareWithTable(const test::Program& program, const fs::path& table) {
    const auto statistics = program.run(
        {"statistics", "all", "--every", "day", "--unit", "km", "--options", "sum,average,minimum,maximum"});
    ASSERT_EQ(statistics.status, 0) << statistics.errors;
    std::map<std::pair<std::string, std::string>, test::Row> days;
    for (auto& row : test::rowsOf(statistics.output)) days[{row["type"], row["start"].substr(0, 10)}] = row;
    const auto types = program.run({"types", "--recorded"});
    std::map<std::string, std::string> totals, combines;
    for (auto& row : test::rowsOf(types.output)) {
        totals[row["type"]] = row["count"];
        combines[row["type"]] = row["combines"];
    }

    const auto expected = test::rowsOf(test::contentOf(table));
    ASSERT_FALSE(expected.empty());
    for (const auto& row : expected) {
        const auto& type = row.at("type");
        if (row.at("day") == "total") {
            EXPECT_EQ(totals[type], row.at("count")) << type;
            totals.erase(type);
            continue;
        }
        const auto found = days.find({type, row.at("day")});
        ASSERT_NE(found, days.end()) << type << " " << row.at("day");
        compareDay(row, found->second, combines[type] == "sum");
        days.erase(found);
    }
    EXPECT_TRUE(totals.empty());
    std::erase_if(days, [](const auto& day) {
        return day.first.first == "Workout";
    });  // the tables count them as a whole
    for (const auto& [key, row] : days)
        ADD_FAILURE() << "not in the table: " << key.first << " " << key.second;
}

TEST(StatisticsTables, EveryDayOfAnExcerptIsRight) {
    const test::TemporaryFolder folder;
    const test::Program program(folder.path());
    const fs::path data = fs::path(QELVAR_TEST_DATA) / "import" / "wrist-two-days";
    ASSERT_EQ(program.run({"import", data / "input.zip"}).status, 0);
    compareWithTable(program, data / "expected.tsv");
    EXPECT_EQ(program.run({"check"}).status, 0);
}

TEST(StatisticsTables, EveryDayOfAllRealRecordsIsRight) {
    const char* folderName = std::getenv("QELVAR_REAL_RECORDS");
    if (!folderName) GTEST_SKIP() << "QELVAR_REAL_RECORDS names no folder of real records";
    for (const auto& entry : fs::directory_iterator(folderName)) {
        const fs::path table = fs::path(entry.path()).replace_extension(".tsv");
        if (entry.path().extension() != ".zip" || !fs::exists(table)) continue;
        SCOPED_TRACE(entry.path().filename().string());
        const test::TemporaryFolder folder;
        test::Program program(folder.path());
        if (entry.path().filename().string().starts_with("t1d")) program.set("TZ", "Europe/London");
        const auto import = program.run({"import", entry.path()});
        ASSERT_EQ(import.status, 0) << import.errors;
        EXPECT_EQ(import.errors, "");
        compareWithTable(program, table);
    }
}

}  // namespace
