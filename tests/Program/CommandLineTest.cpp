#include <gtest/gtest.h>

#include <fstream>
#include <sstream>

#include "RunProgram.h"
#include "TestSupport.h"

namespace {

namespace fs = std::filesystem;

const fs::path kData = fs::path(QELVAR_TEST_DATA) / "import";

class CommandLine : public testing::Test {
 protected:
    test::Outcome run(const std::vector<std::string>& arguments) { return program_.run(arguments); }
    void import(const std::string& name) {
        const auto outcome = run(
            {"import", kData / name / (fs::exists(kData / name / "input.zip") ? "input.zip" : "input.xml")});
        ASSERT_EQ(outcome.status, 0) << outcome.errors;
    }

    const test::TemporaryFolder folder_;
    test::Program program_{folder_.path()};
};

TEST_F(CommandLine, TellsAboutItself) {
    const auto help = run({"--help"});
    EXPECT_EQ(help.status, 0);
    for (const char* command :
         {"import", "statistics", "samples", "types", "sources", "batches", "undo", "check"}) {
        EXPECT_NE(help.output.find(std::string("\n  ") + command), std::string::npos) << command;
        const auto ofCommand = run({command, "--help"});
        EXPECT_EQ(ofCommand.status, 0);
        EXPECT_EQ(ofCommand.output.find(std::string("Usage: qelvar ") + command), 0U);
    }
    EXPECT_EQ(run({"--version"}).output.find("qelvar "), 0U);
}

TEST_F(CommandLine, WrongCommandLinesAreTwo) {
    // clang-format off
    const std::vector<std::vector<std::string>> wrong{
        {"--nonsense"}, {"nonsense"}, {"export"}, {"export", "--to"}, {"import"},
        {"import", "--loud", "x"}, {"statistics"}, {"statistics", "HeartRate", "StepCount"},
        {"statistics", "HeartRate", "--every", "fortnight"},
        {"statistics", "HeartRate", "--options", "median"},
        {"statistics", "HeartRate", "--from", "soon"}, {"statistics", "HeartRate", "--from"},
        {"statistics", "HeartRate", "--from", "2020-03-02", "--to", "2020-03-01"}, {"samples"},
        {"samples", "HeartRate", "--limit", "few"}, {"types", "all"}, {"batches", "1"}, {"undo"},
        {"undo", "last"}, {"undo", "1", "2"}, {"check", "--help=yes"}, {"--size", "big"},
        {"--now", "later", "types"}, {"--size", "1x1", "types"}};
    // clang-format on
    for (const auto& arguments : wrong) {
        const auto outcome = run(arguments);
        EXPECT_EQ(outcome.status, 2) << arguments[0] << ": " << outcome.errors;
        EXPECT_EQ(outcome.output, "");
        EXPECT_EQ(outcome.errors.find("qelvar: "), 0U);
    }
}

TEST_F(CommandLine, EachKindOfFailureHasItsStatus) {
    EXPECT_EQ(run({"sources"}).status, 3);
    EXPECT_EQ(run({"samples", "Aura"}).status, 3);
    EXPECT_EQ(run({"samples", "BloodType"}).status, 4);
    EXPECT_EQ(run({"import", folder_.path() / "missing.zip"}).status, 3);
    EXPECT_FALSE(fs::exists(folder_.path() / "data" / "qelvar")) << "no store is made for nothing";
    const auto refused = run({"import", kData / "refused-entity-bomb" / "input.xml"});
    EXPECT_EQ(refused.status, 4);
    EXPECT_NE(refused.errors.find("input.xml:3: declares the entity"), std::string::npos);
    import("identical-records");
    EXPECT_EQ(run({"samples", "HeartRate", "--source", "Nobody"}).status, 3);
    std::ofstream(folder_.path() / "data" / "qelvar" / "vessa.sqlite", std::ios::binary)
        << std::string(10'000, 'x');
    const int damaged = run({"types"}).status;
    EXPECT_TRUE(damaged == 5 || damaged == 7) << damaged;
}

TEST_F(CommandLine, TheStoreIsWhereItIsAskedFor) {
    const std::string store = folder_.path() / "elsewhere";
    EXPECT_EQ(run({"--store", store, "import", kData / "identical-records" / "input.xml"}).status, 0);
    EXPECT_EQ(test::rowsOf(run({"types", "--recorded", "--store=" + store}).output).size(), 2U);
    EXPECT_FALSE(fs::exists(folder_.path() / "data" / "qelvar"));
}

TEST_F(CommandLine, ImportTellsWhatItDid) {
    const auto first = run({"import", "--refusals", "2", kData / "refused-records" / "input.xml"});
    EXPECT_EQ(first.status, 0);
    EXPECT_NE(first.output.find("\ntotal\t49\t8\t0\t41\n"), std::string::npos) << first.output;
    EXPECT_NE(first.errors.find("qelvar: input.xml:5: Record VSQuantityTypeIdentifierHeartRate: not a "
                                "number: value \"NaN\"\n    <Record "),
              std::string::npos)
        << first.errors;
    EXPECT_NE(first.errors.find("and 39 more"), std::string::npos);
    EXPECT_NE(first.errors.find("not a date 6; "), std::string::npos);
    const auto second =
        run({"import", kData / "refused-records" / "input.xml", kData / "identical-records" / "input.xml"});
    EXPECT_NE(second.output.find("\ntotal\t54\t5\t8\t41\n"), std::string::npos) << second.output;
}

TEST_F(CommandLine, ATrialTellsWhatAnImportWouldDoAndKeepsNothing) {
    const std::string file = kData / "refused-records" / "input.xml";
    const auto trial = run({"import", "--dry-run", file});
    EXPECT_EQ(trial.status, 0);
    EXPECT_NE(trial.errors.find("nothing of it is kept"), std::string::npos);
    EXPECT_FALSE(fs::exists(folder_.path() / "data" / "qelvar")) << "no store is made for a trial";
    const auto real = run({"import", file});
    EXPECT_EQ(trial.output, real.output);
    const auto types = run({"types", "--recorded"}).output;
    EXPECT_NE(run({"import", "--dry-run", file}).output.find("\ntotal\t49\t0\t8\t41\n"), std::string::npos);
    EXPECT_EQ(run({"import", "--dry-run", kData / "refused-entity-bomb" / "input.xml"}).status, 4);
    EXPECT_EQ(run({"types", "--recorded"}).output, types);
    EXPECT_EQ(test::rowsOf(run({"batches"}).output).size(), 1U);
}

TEST_F(CommandLine, ATrialMakesNoStoreAndChangesNone) {
    const std::string file = kData / "refused-records" / "input.xml";
    const fs::path store = folder_.path() / "data" / "qelvar";
    fs::create_directories(store);
    EXPECT_EQ(run({"import", "--dry-run", file}).status, 0);
    EXPECT_TRUE(fs::is_empty(store)) << "a folder is no store";
    program_.set("TMPDIR", folder_.path() / "missing");
    EXPECT_EQ(run({"import", "--dry-run", file}).status, 6) << "nowhere to try it";
    EXPECT_FALSE(fs::exists("vessa.sqlite"));
    // One of an older version is not brought to this one.
    fs::copy_file(fs::path(QELVAR_TEST_DATA) / "stores" / "version-1" / "vessa.sqlite",
                  store / "vessa.sqlite");
    const auto bytes = [&] {
        std::ifstream stream(store / "vessa.sqlite", std::ios::binary);
        return std::string(std::istreambuf_iterator<char>(stream), {});
    };
    const std::string before = bytes();
    const auto refused = run({"import", "--dry-run", file});
    EXPECT_EQ(refused.status, 5) << refused.errors;
    EXPECT_NE(refused.errors.find("older format"), std::string::npos) << refused.errors;
    EXPECT_EQ(bytes(), before);
}

TEST_F(CommandLine, ImportsAreListedAndTakenBack) {
    EXPECT_EQ(run({"undo", "1"}).status, 3);
    import("wrist-two-days");
    import("every-kind");
    import("wrist-two-days");
    const auto batches = test::rowsOf(run({"batches"}).output);
    ASSERT_EQ(batches.size(), 3U);
    EXPECT_EQ(batches[0].at("batch"), "1");
    EXPECT_EQ(batches[0].at("name"), "input.zip");
    EXPECT_EQ(batches[0].at("added"), batches[0].at("present"));
    EXPECT_EQ(batches[2].at("added"), "0");
    const auto first = test::rowsOf(run({"undo", "1"}).output).at(0);
    EXPECT_EQ(first.at("removed"), "0");
    EXPECT_EQ(first.at("kept"), batches[0].at("added"));
    EXPECT_EQ(test::rowsOf(run({"undo", "3"}).output).at(0).at("removed"), batches[0].at("added"));
    EXPECT_EQ(run({"undo", "3"}).status, 3);
    EXPECT_GT(std::stoi(test::rowsOf(run({"undo", "2"}).output).at(0).at("characteristics")), 0);
    EXPECT_TRUE(test::rowsOf(run({"types", "--recorded"}).output).empty());
    EXPECT_EQ(run({"check"}).status, 0);
}

TEST_F(CommandLine, StatisticsFollowZoneUnitAndSource) {
    import("every-kind");
    const auto days = test::rowsOf(
        run({"statistics", "VSQuantityTypeIdentifierStepCount", "--every", "day", "--options", "sum,maximum"})
            .output);
    ASSERT_EQ(days.size(), 2U);
    EXPECT_EQ(days[0].at("start"), "2020-03-01T00:00:00+01:00");
    EXPECT_EQ(days[1].at("end"), "2020-03-03T00:00:00+01:00");
    EXPECT_EQ(days[0].at("sum"), "617283.5");
    EXPECT_EQ(days[1].at("count"), "0");
    EXPECT_EQ(days[1].at("maximum"), "");
    EXPECT_FALSE(days[0].contains("average"));
    program_.set("TZ", "America/New_York");
    const auto elsewhere = test::rowsOf(run({"statistics", "StepCount", "--every", "day"}).output);
    ASSERT_EQ(elsewhere.size(), 1U);
    EXPECT_EQ(elsewhere[0].at("start"), "2020-03-01T00:00:00-05:00");

    const auto mass = test::rowsOf(run({"statistics", "BodyMass", "--unit", "lb", "--by-source"}).output);
    ASSERT_EQ(mass.size(), 2U);
    EXPECT_EQ(mass[0].at("source"), "");
    EXPECT_EQ(mass[1].at("source"), "Kent & Søn");
    EXPECT_NEAR(std::stod(mass[1].at("average")), 150, 1e-9);
    EXPECT_EQ(mass[1].at("unit"), "lb");
    EXPECT_EQ(run({"statistics", "BodyMass", "--unit", "km"}).status, 4);
}

TEST_F(CommandLine, EachKindGetsTheStatisticsThatMakeSenseOfIt) {
    import("wrist-two-days");
    import("every-kind");
    for (const auto& [type, columns] : std::map<std::string, std::string>{
             {"StepCount", "start\tend\tcount\tsum\tunit"},
             {"HeartRate", "start\tend\tcount\taverage\tminimum\tmaximum\tunit"},
             {"BloodPressure", "start\tend\tcount\tunit"},
             {"Workout", "start\tend\tvalue\tcount\tduration\tunit"}})
        EXPECT_EQ(run({"statistics", type}).output.substr(0, columns.size() + 1), columns + "\n");
    for (const char* type : {"HeartRate", "SleepAnalysis", "BloodPressure"})
        EXPECT_EQ(run({"statistics", type, "--options", "sum"}).status, 2) << type;
    for (const auto& workout : test::rowsOf(run({"statistics", "Workout", "--unit", "s"}).output))
        EXPECT_TRUE(workout.at("value") != "VSWorkoutActivityTypeRunning" || workout.at("duration") == "1830")
            << "the pause does not count: " << workout.at("duration");
    // A record over midnight is counted where it starts and lasts on both days; added up in another way.
    double whole = 0, days = 0;
    for (const auto& row : test::rowsOf(run({"statistics", "SleepAnalysis"}).output))
        whole += std::stod(row.at("duration"));
    for (const auto& row : test::rowsOf(run({"statistics", "SleepAnalysis", "--every", "day"}).output))
        days += std::stod(row.at("duration"));
    EXPECT_GT(whole, 0);
    EXPECT_NEAR(whole, days, 1e-6);
    for (const auto& row : test::rowsOf(run({"statistics", "all", "--every", "week"}).output))
        EXPECT_TRUE(row.at("sum").empty() || row.at("average").empty()) << row.at("type");
}

TEST_F(CommandLine, SamplesAreListedInOrderAndWithinTheirLimits) {
    import("wrist-two-days");
    const auto all = test::rowsOf(run({"samples", "HeartRate"}).output);
    ASSERT_EQ(all.size(), 2366U);
    EXPECT_TRUE(std::is_sorted(all.begin(), all.end(), [](const auto& a, const auto& b) {
        return a.at("start").substr(0, 10) < b.at("start").substr(0, 10);
    }));
    EXPECT_EQ(all[0].at("device"), "name:Wrist tracker, hardware:1");
    EXPECT_EQ(all[0].at("offset"), "3600");
    const auto newest = test::rowsOf(run({"samples", "HeartRate", "--limit", "2", "--newest-first"}).output);
    ASSERT_EQ(newest.size(), 2U);
    EXPECT_EQ(newest[0], all.back());
    const auto hour = test::rowsOf(run({"samples", "HeartRate", "--from", "2020-03-29T10:00", "--to",
                                        "2020-03-29T11:00", "--source", "Wrist tracker"})
                                       .output);
    ASSERT_FALSE(hour.empty());
    for (const auto& row : hour) EXPECT_EQ(row.at("start").substr(0, 14), "2020-03-29T10:");
    const auto sources = test::rowsOf(run({"sources"}).output);
    ASSERT_EQ(sources.size(), 2U);
    EXPECT_EQ(sources[0].at("count"), "2545");
}

TEST_F(CommandLine, SamplesOfEveryKindShowWhatTheySay) {
    import("every-kind");
    EXPECT_EQ(test::rowsOf(run({"samples", "SleepAnalysis"}).output).at(0).at("value"),
              "VSCategoryValueSleepAnalysisAsleep");
    const auto workout = test::rowsOf(run({"samples", "Workout"}).output).at(0);
    EXPECT_EQ(workout.at("value"), "VSWorkoutActivityTypeRunning");
    EXPECT_EQ(workout.at("details"),
              "duration=1830 s; distance=5200 m; pause=2020-03-01T10:10:00+01:00; "
              "resume=2020-03-01T10:19:30+01:00");
    const auto pressure = test::rowsOf(run({"samples", "BloodPressure"}).output).at(0);
    EXPECT_NE(pressure.at("value").find("BloodPressureSystolic=120 mmHg"), std::string::npos);
    EXPECT_NE(test::rowsOf(run({"samples", "BodyMass"}).output).at(0).at("metadata").find("after"),
              std::string::npos);
}

}  // namespace
