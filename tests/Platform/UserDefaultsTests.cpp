#include "Platform/UserDefaults.h"

#include <gtest/gtest.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <fstream>
#include <iterator>

#include "TestSupport.h"
#include "Vessa/Base/VSLog.h"

namespace {

namespace fs = std::filesystem;
using platform::UserDefaults;

class UserDefaultsTest : public testing::Test {
 protected:
    UserDefaultsTest() {
        previousSink_ = VSSetLogSink([this](VSLogLevel, std::string_view line) { log_.emplace_back(line); });
    }
    ~UserDefaultsTest() override { VSSetLogSink(previousSink_); }
    fs::path file() const { return folder_.path() / "settings" / "defaults.json"; }
    size_t filesBeside() const {
        return static_cast<size_t>(
            std::distance(fs::directory_iterator(file().parent_path()), fs::directory_iterator()));
    }

    test::TemporaryFolder folder_;
    std::vector<std::string> log_;
    VSLogSink previousSink_;
};

TEST_F(UserDefaultsTest, ValuesOfEveryKindComeBackFromTheFile) {
    const VSValue::Dictionary dictionary{{"order", VSValue::Array{1, 2.5, "three"}},
                                         {"nested", VSValue::Dictionary{}}};
    {
        UserDefaults defaults(file());
        EXPECT_FALSE(defaults.value("absent"));
        EXPECT_FALSE(defaults.boolean("absent"));
        defaults.setValue("flag", true);
        defaults.setValue("date", VSReferenceDate);
        defaults.setValue("dictionary", dictionary);
        defaults.setValue("text", "Ægte \"tekst\"\n");
        defaults.setValue("gone", 1);
        defaults.removeValue("gone");
    }
    const UserDefaults again(file());
    EXPECT_TRUE(again.boolean("flag"));
    EXPECT_EQ(again.value("date"), VSValue(VSReferenceDate));
    EXPECT_EQ(again.value("dictionary"), VSValue(dictionary));
    EXPECT_EQ(again.value("text"), VSValue("Ægte \"tekst\"\n"));
    EXPECT_FALSE(again.value("gone"));
    EXPECT_FALSE(again.boolean("text"));
    EXPECT_EQ(filesBeside(), 1u);
    struct stat status {};
    ASSERT_EQ(stat(file().c_str(), &status), 0);
    EXPECT_EQ(status.st_mode & 0777, 0600u);
    EXPECT_TRUE(log_.empty());
}

TEST_F(UserDefaultsTest, FileThatCannotBeReadIsKeptAside) {
    fs::create_directories(file().parent_path());
    for (int round = 1; round <= 2; ++round) {
        std::ofstream(file()) << "{\"half a file" << round;
        UserDefaults defaults(file());
        EXPECT_FALSE(defaults.value("flag"));
        defaults.setValue("flag", true);
        ASSERT_EQ(log_.size(), static_cast<size_t>(round));
    }
    EXPECT_TRUE(UserDefaults(file()).boolean("flag"));
    EXPECT_EQ(filesBeside(), 3u);
    std::ifstream aside(fs::path(file()).concat(".unreadable-2"));
    std::string text((std::istreambuf_iterator<char>(aside)), {});
    EXPECT_EQ(text, "{\"half a file2");
}

TEST_F(UserDefaultsTest, FailedWriteLeavesTheOldFileAndSaysSo) {
    UserDefaults defaults(file());
    defaults.setValue("flag", true);
    // The name of the new file is taken by a folder: the write fails whoever runs the test.
    fs::create_directory(fs::path(file()).concat(".new-" + std::to_string(getpid())));
    std::ofstream(fs::path(file()).concat(".new-" + std::to_string(getpid())) / "in the way") << "x";
    defaults.setValue("flag", false);
    EXPECT_EQ(log_.size(), 1u);
    EXPECT_FALSE(defaults.boolean("flag"));
    EXPECT_TRUE(UserDefaults(file()).boolean("flag"));
}

/// Each process adds to one list and sets keys of its own; the other's are there too.
TEST_F(UserDefaultsTest, ProcessesLoseNothingOfEachOther) {
    fs::create_directories(file().parent_path());
    constexpr int times = 50;
    const auto work = [this](const std::string& name) {
        UserDefaults defaults(file());
        for (int i = 0; i < times; ++i) {
            defaults.setValue(name + std::to_string(i), i);
            defaults.updateValue("list", [&](const std::optional<VSValue>& current) {
                VSValue::Array list = current ? *current->array() : VSValue::Array{};
                list.emplace_back(name);
                return VSValue(list);
            });
        }
    };
    UserDefaults before(file());
    before.setValue("list", VSValue::Array{});
    const pid_t other = fork();
    if (other == 0) {
        work("theirs");
        _exit(0);
    }
    work("ours");
    ASSERT_EQ(waitpid(other, nullptr, 0), other);
    EXPECT_EQ(before.value("list")->array()->size(), 2u * times) << "seen without reading anew";
    for (int i = 0; i < times; ++i)
        EXPECT_TRUE(before.value("theirs" + std::to_string(i)) && before.value("ours" + std::to_string(i)));
    EXPECT_TRUE(log_.empty());
}

TEST_F(UserDefaultsTest, LeftOverOfAKilledProcessDoesNoHarm) {
    UserDefaults defaults(file());
    defaults.setValue("flag", true);
    std::ofstream(fs::path(file()).concat(".new-" + std::to_string(getpid()))) << "{\"fl";
    UserDefaults again(file());
    EXPECT_TRUE(again.boolean("flag"));
    again.setValue("flag", false);
    EXPECT_FALSE(UserDefaults(file()).boolean("flag"));
    EXPECT_EQ(filesBeside(), 1u);
}

}  // namespace
