#include <gtest/gtest.h>
#include <signal.h>
#include <sys/resource.h>
#include <sys/stat.h>

#include <cstdlib>
#include <fstream>
#include <tuple>

#include "RunProgram.h"
#include "TestSupport.h"

namespace {

namespace fs = std::filesystem;

class ExportCommand : public testing::Test {
 protected:
    void SetUp() override {
        fs::create_directory(folder_.path() / "out");
        program_.set("LC_ALL", "en_US.UTF-8");
    }
    void import(const fs::path& records) const { ASSERT_EQ(program_.run({"import", records}).status, 0); }
    /// So many that an export of them can be met in its midst.
    void importMany() const {
        const fs::path file = folder_.path() / "many.xml";
        std::ofstream text(file);
        text << "<HealthData>\n";
        for (int i = 0; i < 40'000; ++i) {
            char time[64];
            std::snprintf(time, sizeof time, "2020-04-%02d %02d:%02d:00 +0200", 1 + i / 1440, i / 60 % 24,
                          i % 60);
            text << "<Record type=\"VSQuantityTypeIdentifierHeartRate\" sourceName=\"Wrist\" "
                    "unit=\"count/min\" startDate=\""
                 << time << "\" endDate=\"" << time << "\" value=\"70\"/>\n";
        }
        text << "</HealthData>\n";
        text.close();
        import(file);
    }
    static bool isWriting(const std::string& line) { return line.starts_with("HeartRate\t"); }
    /// Nothing is beside the target, which is as it was.
    void expectUntouched() const {
        EXPECT_EQ(test::contentOf(target_), "an older export");
        EXPECT_EQ(std::distance(fs::directory_iterator(target_.parent_path()), {}), 1);
    }

    const test::TemporaryFolder folder_;
    test::Program program_{folder_.path()};
    const fs::path store_ = folder_.path() / "data" / "qelvar";
    const fs::path target_ = folder_.path() / "out" / "all.zip";
};

TEST_F(ExportCommand, WritesAnArchiveThatCanBeImported) {
    import(fs::path(QELVAR_TEST_DATA) / "import" / "every-kind" / "input.xml");
    const auto outcome = program_.run({"export", "--to", target_});
    EXPECT_EQ(outcome.status, 0) << outcome.errors;
    const auto rows = test::rowsOf(outcome.output);
    ASSERT_FALSE(rows.empty());
    EXPECT_EQ(rows.back().at("type"), "total");
    EXPECT_EQ(rows.back().at("records"), "11");
    EXPECT_EQ(fs::status(target_).permissions(), fs::perms::owner_read | fs::perms::owner_write);
    EXPECT_EQ(std::distance(fs::directory_iterator(target_.parent_path()), {}), 1);
    EXPECT_EQ(std::system(("unzip -p '" + target_.string() + "' export.xml | grep -q 'unit=\"lb\"'").c_str()),
              0)
        << "in the units of the region";
    const auto imported = program_.run({"import", "--store", folder_.path() / "other", target_});
    EXPECT_EQ(test::rowsOf(imported.output).back().at("added"), "11") << imported.errors;
    const auto again = program_.run({"import", target_});
    EXPECT_EQ(test::rowsOf(again.output).back().at("added"), "0") << "numbers were rounded on the way";
}

/// Each reason has its own words and status.
TEST_F(ExportCommand, SaysWhatIsWrong) {
    import(fs::path(QELVAR_TEST_DATA) / "import" / "every-kind" / "input.xml");
    EXPECT_EQ(program_.run({"export", "--to", target_, "word"}).status, 2);
    EXPECT_EQ(program_.run({"export", "--to", target_, "--store", folder_.path() / "none"}).status, 3);
    const fs::path file = folder_.path() / "letter.txt", pipe = folder_.path() / "pipe";
    std::ofstream(file) << "Dear Ada,";
    ASSERT_EQ(mkfifo(pipe.c_str(), 0600), 0);
    const std::tuple<fs::path, int, const char*> targets[] = {
        {folder_.path() / "no" / "such" / "folder.zip", 3, "there is no folder"},
        {target_.parent_path(), 4, "is a folder"},
        {target_ / "", 4, "not of a file"},
        {file / "all.zip", 4, "Not a directory"},
        {target_.parent_path() / std::string(300, 'x'), 4, "File name too long"},
        {pipe, 4, "is a pipe"},
        {"/dev/full", 4, "is a device"},
        {file, 5, "--replace"},
        {store_ / "vessa.sqlite", 5, "the folder of a store"},
    };
    for (const auto& [target, status, words] : targets) {
        const auto outcome = program_.run({"export", "--to", target});
        EXPECT_EQ(outcome.status, status) << target;
        EXPECT_NE(outcome.errors.find(words), std::string::npos) << outcome.errors;
    }
    EXPECT_TRUE(fs::is_empty(target_.parent_path()));
    EXPECT_EQ(test::contentOf(file), "Dear Ada,");
    EXPECT_EQ(program_.run({"export", "--to", file, "--replace"}).status, 0);
    EXPECT_EQ(program_.run({"export", "--to", file}).status, 0) << "it is an export now";
}

/// The commands alone, as a shell gives them what they write to.
TEST_F(ExportCommand, NoCommandWritesIntoTheStore) {
    import(fs::path(QELVAR_TEST_DATA) / "import" / "every-kind" / "input.xml");
    const fs::path database = store_ / "vessa.sqlite", inner = store_ / "new";
    const std::string before = test::contentOf(database);
    for (const std::string& command :
         {"export --replace --to '" + database.string() + "'",
          "export --replace --to /dev/stdout 1<>'" + database.string() + "'",
          "types 1<>'" + database.string() + "'", "types nonsense 2>>'" + database.string() + "'",
          "salvage --to '" + inner.string() + "'", "import --store '" + inner.string() + "' x.xml",
          "import /dev/stdin <'" + database.string() + "'",
          "--screenshots '" + inner.string() + "'"})
        EXPECT_EQ(program_.runInShell(command), 5) << command;
    EXPECT_EQ(program_.run({"import", database}).status, 4) << "it is no document";
    EXPECT_EQ(test::contentOf(database), before);
    EXPECT_FALSE(fs::exists(inner));
    // Without standard output and error what is printed would get into the first files that are opened.
    EXPECT_EQ(program_.runInShell("export --progress --to '" + target_.string() + "' >&- 2>&-"), 1);
    EXPECT_EQ(program_.run({"import", target_, "--store", folder_.path() / "other"}).status, 0);
    EXPECT_EQ(program_.run({"check"}).status, 0);
}

TEST_F(ExportCommand, ALimitOfTheFilesSizeIsAFullDisk) {
    importMany();
    struct rlimit before {};
    getrlimit(RLIMIT_FSIZE, &before);
    const struct rlimit limit { 1'000'000, before.rlim_max };
    setrlimit(RLIMIT_FSIZE, &limit);
    const auto outcome = program_.run({"export", "--to", target_});
    setrlimit(RLIMIT_FSIZE, &before);
    EXPECT_EQ(outcome.status, 8) << outcome.errors;
    EXPECT_TRUE(fs::is_empty(target_.parent_path()));
}

TEST_F(ExportCommand, EndedByASignalItLeavesTheTargetAlone) {
    importMany();
    std::ofstream(target_) << "an older export";
    for (const auto& [signal, status] :
         {std::pair(SIGINT, 130), std::pair(SIGTERM, 143), std::pair(SIGHUP, 129)}) {
        test::RunningProgram running({"export", "--progress", "--replace", "--to", target_},
                                     program_.environment());
        ASSERT_TRUE(running.waitForErrorLine(isWriting));
        running.signal(signal);
        const auto outcome = running.wait();
        EXPECT_EQ(outcome.status, status) << outcome.errors;
        EXPECT_EQ(outcome.output, "");
        expectUntouched();
    }
}

TEST_F(ExportCommand, TheNextOneRemovesWhatAKilledOneHasLeft) {
    importMany();
    std::ofstream(target_) << "an older export";
    test::RunningProgram running({"export", "--progress", "--replace", "--to", target_},
                                 program_.environment());
    ASSERT_TRUE(running.waitForErrorLine(isWriting));
    // Meanwhile no other one may have the same place.
    running.signal(SIGSTOP);
    const auto second = program_.run({"export", "--replace", "--to", target_});
    EXPECT_EQ(second.status, 6);
    EXPECT_NE(second.errors.find("another export is under way"), std::string::npos) << second.errors;
    EXPECT_EQ(program_.run({"export", "--to", target_.parent_path() / "other.zip"}).status, 0);
    int seen = 0;
    for (const auto& entry : fs::recursive_directory_iterator(target_.parent_path())) {
        if (entry.path() == target_) continue;
        ++seen;
        EXPECT_EQ(entry.status().permissions() & (fs::perms::group_all | fs::perms::others_all),
                  fs::perms::none)
            << entry.path();
    }
    EXPECT_EQ(seen, 6) << "what another export has there is left alone; with its own archive";
    running.signal(SIGKILL);
    running.wait();
    EXPECT_EQ(test::contentOf(target_), "an older export");
    EXPECT_EQ(program_.run({"export", "--to", target_.parent_path() / "other.zip"}).status, 0);
    EXPECT_EQ(std::distance(fs::directory_iterator(target_.parent_path()), {}), 2);
    EXPECT_EQ(test::contentOf(target_), "an older export");
}

}  // namespace
