#include <fcntl.h>
#include <gtest/gtest.h>
#include <signal.h>
#include <sys/stat.h>
#include <unistd.h>

#include "RunProgram.h"
#include "TestSupport.h"

namespace {

namespace fs = std::filesystem;

std::string records(int count) {
    std::string text = "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n<HealthData locale=\"en_DK\">\n";
    for (int i = 0; i < count; ++i) {
        char time[32];
        std::snprintf(time, sizeof time, "2020-04-01 %02d:%02d:%02d +0200", i / 3600 % 24, i / 60 % 60,
                      i % 60);
        text += std::string(
                    " <Record type=\"VSQuantityTypeIdentifierHeartRate\" sourceName=\"Wrist\" "
                    "unit=\"count/min\" startDate=\"") +
                time + "\" endDate=\"" + time + "\" value=\"70\"/>\n";
    }
    return text;
}

/// An import that reads a pipe, of which the other end is held here: it is in the midst of its transaction
/// for as long as one likes.
class InterruptedImport : public testing::Test {
 protected:
    void SetUp() override {
        ::signal(SIGPIPE, SIG_IGN);
        ASSERT_EQ(mkfifo(pipe_.c_str(), 0600), 0);
        const fs::path before = fs::path(QELVAR_TEST_DATA) / "import" / "wrist-two-days" / "input.zip";
        ASSERT_EQ(program_.run({"import", before}).status, 0);
        types_ = program_.run({"types", "--recorded"}).output;
        ASSERT_NE(types_.find("HeartRate"), std::string::npos);
    }

    /// Begins an import, waits until records of it are in the store's hands, sends the signal.
    test::Outcome interrupt(int signal) {
        test::RunningProgram running({"import", "--progress", pipe_}, program_.environment());
        const int end = open(pipe_.c_str(), O_WRONLY | O_CLOEXEC);
        const std::string text = records(30'000);
        size_t written = 0;
        while (written < text.size()) {
            const ssize_t count = write(end, text.data() + written, text.size() - written);
            if (count <= 0) break;
            written += static_cast<size_t>(count);
        }
        EXPECT_EQ(written, text.size());
        EXPECT_TRUE(running.waitForErrorLine([](const std::string& line) {
            const size_t tab = line.rfind('\t');
            return tab != std::string::npos && std::atoll(line.c_str() + tab + 1) > 20'000;
        }));
        running.signal(signal);
        const auto outcome = running.wait();
        close(end);
        return outcome;
    }

    void expectNoTrace() {
        EXPECT_EQ(program_.run({"types", "--recorded"}).output, types_);
        const auto check = program_.run({"check"});
        EXPECT_EQ(check.status, 0) << check.errors;
        const fs::path again = fs::path(QELVAR_TEST_DATA) / "import" / "identical-records" / "input.xml";
        EXPECT_EQ(program_.run({"import", again}).status, 0) << "the store can be written again";
    }

    const test::TemporaryFolder folder_;
    const test::Program program_{folder_.path()};
    const fs::path pipe_ = folder_.path() / "pipe";
    std::string types_;
};

TEST_F(InterruptedImport, KilledItLeavesNoTrace) {
    const auto outcome = interrupt(SIGKILL);
    EXPECT_EQ(outcome.signal, SIGKILL);
    expectNoTrace();
}

TEST_F(InterruptedImport, InterruptedItEndsCleanly) {
    const auto outcome = interrupt(SIGINT);
    EXPECT_EQ(outcome.status, 130);
    EXPECT_NE(outcome.errors.find("nothing of it is kept"), std::string::npos);
    EXPECT_EQ(outcome.output, "");
    expectNoTrace();
}

TEST_F(InterruptedImport, TerminatedItEndsCleanly) {
    EXPECT_EQ(interrupt(SIGTERM).status, 143);
    expectNoTrace();
}

}  // namespace
