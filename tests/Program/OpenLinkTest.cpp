#include <gtest/gtest.h>
#include <signal.h>

#include <fstream>

#include "RunProgram.h"
#include "TestSupport.h"

namespace {

namespace fs = std::filesystem;

/// The application itself, without a display: what it shows is what it leaves for the next session.
class OpenLinkTest : public testing::Test {
 protected:
    OpenLinkTest() {
        program_.set("QT_QPA_PLATFORM", "offscreen");
        program_.set("QT_QUICK_BACKEND", "software");
        program_.set("QELVAR_TRACE_STARTUP", "1");
        fs::create_directories(state_.parent_path());
    }
    test::Outcome run(std::vector<std::string> arguments, int end = SIGTERM) {
        if (!arguments.empty() && !arguments[0].starts_with("--"))
            arguments.insert(arguments.begin(), "--open");
        test::RunningProgram running(arguments, program_.environment());
        EXPECT_TRUE(running.waitForErrorLine(
            [](const std::string& line) { return line.find("first frame") != std::string::npos; }));
        running.signal(end);
        const test::Outcome outcome = running.wait();
        if (end == SIGTERM) {
            EXPECT_EQ(outcome.status, 128 + SIGTERM) << outcome.errors;
        }
        return outcome;
    }
    /// The stack that is selected, and how deep the one of health data is.
    std::string place() const {
        const std::string text = test::contentOf(state_);
        const std::string key = "\"Selected Stack\":\"";
        const size_t at = text.find(key);
        if (at == std::string::npos) return text;
        std::string result = text.substr(at + key.size(), text.find(" Navigation", at) - at - key.size());
        for (const char* screen : {"Data Category Detail", "Data Unit Group Detail"})
            if (text.find("\"Identifier\":\"" + std::string(screen)) != std::string::npos) result += " >";
        return result;
    }

    test::TemporaryFolder folder_;
    test::Program program_{folder_.path()};
    const fs::path state_ = folder_.path() / "data/qelvar/state.json";
};

TEST_F(OpenLinkTest, TheLinkGoesBeforeTheSessionBefore) {
    run({});
    EXPECT_EQ(place(), "Dashboard");
    run({"qelvar://healthdatatab?DataCategory=2&DataUnit=59"});
    EXPECT_EQ(place(), "Health Data > >");
    run({});
    EXPECT_EQ(place(), "Health Data > >") << "restored";
    run({"qelvar://SourcesTab"});
    EXPECT_EQ(place(), "Sources > >");
    run({"qelvar://HealthDataTab?DataCategory=2"});
    EXPECT_EQ(place(), "Health Data >");
    run({"qelvar://HealthDataTab?Calendar=1"});
    EXPECT_EQ(place(), "Health Data");
    EXPECT_NE(run({"mailto:somebody"}).errors.find("not a link of the application"), std::string::npos);
    EXPECT_EQ(place(), "Health Data");

    // Pictures and the demonstration leave it alone, and what cannot be read is no reason not to start.
    const std::string kept = test::contentOf(state_);
    run({"--screenshots", folder_.path() / "pictures"}, 0);
    run({"--demo", "--store", folder_.path() / "demo"});
    EXPECT_FALSE(fs::exists(folder_.path() / "demo/state.json"));
    EXPECT_EQ(test::contentOf(state_), kept);
    std::ofstream(state_) << "\xff{";
    run({});
    EXPECT_EQ(place(), "Dashboard");

    // Nobody has seen the dashboard, or chosen its time scope, which begins with the week.
    fs::remove(state_);
    run({"qelvar://SourcesTab"});
    EXPECT_NE(test::contentOf(state_).find("\"Time Scope\":2"), std::string::npos) << test::contentOf(state_);
}

}  // namespace
