#include <fcntl.h>
#include <gtest/gtest.h>
#include <signal.h>
#include <sys/stat.h>
#include <unistd.h>

#include <memory>

#include "RunProgram.h"
#include "TestSupport.h"
#include "Vessa/VSStoreHolder.h"

namespace {

namespace fs = std::filesystem;

const fs::path kData = fs::path(QELVAR_TEST_DATA) / "import";

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

bool isWaiting(const std::string& line) {
    return line.find(
               "another program writes to the store (an import of pipe from the command line, process ") !=
           std::string::npos;
}

/// An import into a store in use that reads a pipe, of which the other end is held here: it is in the midst
/// of its transaction, with records in the store's hands, for as long as one likes.
class ImportOfAPipe : public testing::Test {
 protected:
    void SetUp() override {
        ::signal(SIGPIPE, SIG_IGN);
        ASSERT_EQ(mkfifo(pipe_.c_str(), 0600), 0);
        ASSERT_EQ(program_.run({"import", kData / "wrist-two-days" / "input.zip"}).status, 0);
        types_ = program_.run({"types", "--recorded"}).output;
        ASSERT_NE(types_.find("HeartRate"), std::string::npos);
        first_ = std::make_unique<test::RunningProgram>(
            std::vector<std::string>{"import", "--progress", pipe_}, program_.environment());
        end_ = open(pipe_.c_str(), O_WRONLY | O_CLOEXEC);
        send(records(30'000));
        ASSERT_TRUE(first_->waitForErrorLine([](const std::string& line) {
            const size_t tab = line.rfind('\t');
            return tab != std::string::npos && std::atoll(line.c_str() + tab + 1) > 20'000;
        }));
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
    const fs::path store_ = folder_.path() / "data" / "qelvar";
    const fs::path pipe_ = folder_.path() / "pipe";
    std::string types_;
    std::unique_ptr<test::RunningProgram> first_;
    int end_ = -1;
};

class InterruptedImport : public ImportOfAPipe, public testing::WithParamInterface<int> {};

TEST_P(InterruptedImport, LeavesNoTrace) {
    const int signal = GetParam();
    ASSERT_TRUE(VSReadStoreHolder(store_));
    first_->signal(signal);
    const auto outcome = first_->wait();
    EXPECT_FALSE(VSReadStoreHolder(store_)) << "a note of the dead says nothing";
    if (signal == SIGKILL) {
        EXPECT_EQ(outcome.signal, SIGKILL);
    } else {
        EXPECT_EQ(outcome.status, 128 + signal);
        EXPECT_NE(outcome.errors.find("nothing of it is kept"), std::string::npos);
        EXPECT_EQ(outcome.output, "");
    }
    EXPECT_EQ(program_.run({"types", "--recorded"}).output, types_);
    const auto check = program_.run({"check"});
    EXPECT_EQ(check.status, 0) << check.errors;
    EXPECT_EQ(program_.run({"import", kData / "identical-records" / "input.xml"}).status, 0)
        << "the store can be written again";
}

INSTANTIATE_TEST_SUITE_P(Signals, InterruptedImport, testing::Values(SIGKILL, SIGINT, SIGTERM));

TEST_F(ImportOfAPipe, AnotherOneWaitsAndBothAreComplete) {
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
    ASSERT_EQ(batches.size(), 3U) << "a trial leaves none";
    EXPECT_EQ(batches[1].at("name"), "pipe");
    EXPECT_EQ(batches[1].at("present"), "30000");
    EXPECT_EQ(batches[2].at("name"), "input.xml");
    EXPECT_EQ(batches[2].at("added"), batches[2].at("present"));
    EXPECT_EQ(program_.run({"check"}).status, 0);
}

TEST_F(ImportOfAPipe, OneThatWaitsEndsAtOnce) {
    test::RunningProgram second({"import", kData / "every-kind" / "input.xml"}, program_.environment());
    ASSERT_TRUE(second.waitForErrorLine(isWaiting));
    test::RunningProgram undo({"undo", "1"}, program_.environment());
    ASSERT_TRUE(undo.waitForErrorLine(isWaiting));
    second.signal(SIGINT);
    const auto outcome = second.wait();  // while the first one still holds the store
    EXPECT_EQ(outcome.status, 130);
    EXPECT_NE(outcome.errors.find("nothing of it is kept"), std::string::npos);
    EXPECT_EQ(finishFirst().status, 0);
    EXPECT_EQ(undo.wait().status, 0);
    EXPECT_EQ(test::rowsOf(program_.run({"batches"}).output).size(), 1U);
    EXPECT_EQ(test::contentOf(store_ / VSHolderNote::fileName), "") << "names of files are not kept";
}

}  // namespace
