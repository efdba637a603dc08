#include <fcntl.h>
#include <gtest/gtest.h>
#include <signal.h>
#include <sys/stat.h>
#include <unistd.h>

#include <memory>

#include "RunProgram.h"
#include "TestSupport.h"

namespace {

namespace fs = std::filesystem;

const fs::path kData = fs::path(QELVAR_TEST_DATA) / "import";

bool isProgress(const std::string& line) {
    const size_t tab = line.rfind('\t');
    return tab != std::string::npos && std::atoll(line.c_str() + tab + 1) > 0;
}

bool isWaiting(const std::string& line) {
    return line.find("another program writes to the store") != std::string::npos;
}

/// An import that is in the midst of its transaction until its pipe is closed.
class TwoImports : public testing::Test {
 protected:
    void SetUp() override {
        ::signal(SIGPIPE, SIG_IGN);
        ASSERT_EQ(mkfifo(pipe_.c_str(), 0600), 0);
        first_ = std::make_unique<test::RunningProgram>(
            std::vector<std::string>{"import", "--progress", pipe_}, program_.environment());
        end_ = open(pipe_.c_str(), O_WRONLY | O_CLOEXEC);
        std::string text = "<?xml version=\"1.0\"?><HealthData>";
        for (int i = 0; i < 3000; ++i)
            text +=
                "<Record type=\"VSQuantityTypeIdentifierBodyMass\" sourceName=\"Scales\" unit=\"kg\" "
                "startDate=\"2020-03-01 10:00:00 +0100\" endDate=\"2020-03-01 10:00:00 +0100\" "
                "value=\"70\"/>";
        send(text);
        ASSERT_TRUE(first_->waitForErrorLine(isProgress));
    }
    void TearDown() override {
        if (end_ >= 0) close(end_);
    }
    void send(const std::string& text) {
        for (size_t written = 0; written < text.size();) {
            const ssize_t count = write(end_, text.data() + written, text.size() - written);
            ASSERT_GT(count, 0);
            written += static_cast<size_t>(count);
        }
    }
    test::Outcome finishFirst() {
        send("</HealthData>");
        close(std::exchange(end_, -1));
        return first_->wait();
    }

    const test::TemporaryFolder folder_;
    const test::Program program_{folder_.path()};
    const fs::path pipe_ = folder_.path() / "pipe";
    std::unique_ptr<test::RunningProgram> first_;
    int end_ = -1;
};

TEST_F(TwoImports, TheSecondWaitsAndBothAreComplete) {
    test::RunningProgram second({"import", kData / "identical-records" / "input.xml"},
                                program_.environment());
    ASSERT_TRUE(second.waitForErrorLine(isWaiting));
    test::RunningProgram trial({"import", "--dry-run", kData / "every-kind" / "input.xml"},
                               program_.environment());
    ASSERT_TRUE(trial.waitForErrorLine(isWaiting));
    EXPECT_EQ(program_.run({"check"}).status, 0) << "readers do not wait";
    EXPECT_EQ(finishFirst().status, 0);
    EXPECT_EQ(second.wait().status, 0);
    EXPECT_EQ(trial.wait().status, 0);
    const auto batches = test::rowsOf(program_.run({"batches"}).output);
    ASSERT_EQ(batches.size(), 2U) << "a trial leaves none";
    EXPECT_EQ(batches[0].at("name"), "pipe");
    EXPECT_EQ(batches[0].at("present"), "3000");
    EXPECT_EQ(batches[1].at("name"), "input.xml");
    EXPECT_EQ(batches[1].at("added"), batches[1].at("present"));
    EXPECT_EQ(program_.run({"check"}).status, 0);
}

TEST_F(TwoImports, OneThatWaitsEndsAtOnce) {
    test::RunningProgram second({"import", kData / "every-kind" / "input.xml"}, program_.environment());
    ASSERT_TRUE(second.waitForErrorLine(isWaiting));
    second.signal(SIGINT);
    const auto outcome = second.wait();  // while the first one still holds the store
    EXPECT_EQ(outcome.status, 130);
    EXPECT_NE(outcome.errors.find("nothing of it is kept"), std::string::npos);
    EXPECT_EQ(finishFirst().status, 0);
    EXPECT_EQ(test::rowsOf(program_.run({"batches"}).output).size(), 1U);
}

}  // namespace
