#include <signal.h>
#include <sys/resource.h>
#include <sys/stat.h>

#include <thread>

#include "ExportTestSupport.h"
#include "Vessa/Base/VSLog.h"
#include "Vessa/VSStoreSchema.h"

namespace {

namespace fs = std::filesystem;

class ExportFlow : public testing::Test {
 protected:
    void SetUp() override { store_ = open(); }
    std::shared_ptr<VSHealthStore> open() const {
        VSHealthStore::Options options;
        options.survivesPowerLoss = false;
        auto store = VSHealthStore::open(folder_.path() / "store", options);
        EXPECT_TRUE(store.ok());
        return *store;
    }
    static VSSamplePtr reading(VSTypeCode code, int minute) {
        const auto* type = VSObjectType::dataTypeWithCode(code);
        const VSDate date = test::date("2020-01-01") + std::chrono::minutes(minute);
        return std::make_shared<VSQuantitySample>(type, VSQuantity(type->canonicalUnit(), 60 + minute % 50),
                                                  date, date);
    }
    void save(int count) {
        std::vector<VSSamplePtr> samples;
        for (int i = 0; i < count; ++i) samples.push_back(reading(VSCode::HeartRate, i));
        ASSERT_TRUE(store_->saveObjectsAndWait(std::move(samples)).ok());
    }
    void expectNoFiles() const {
        EXPECT_TRUE(!fs::exists(documents_) || fs::is_empty(documents_)) << "an export has left files";
    }

    const test::FixedEnvironment environment_;
    const test::TemporaryFolder folder_;
    const fs::path documents_ = folder_.path() / "documents";
    std::shared_ptr<VSHealthStore> store_;
};

TEST_F(ExportFlow, KeepsItsFilesToTheirOwnerUntilTheyAreCleanedUp) {
    save(1000);
    QVExportManager manager(test::exportSetting(store_, documents_));
    ASSERT_TRUE(test::exportAll(manager, [&] {
                    manager.createExportFile(
                        [](const auto&) { ADD_FAILURE() << "there is one in progress"; });
                }).ok());
    const auto modeOf = [](const fs::path& path) {
        struct stat status {};
        return stat(path.c_str(), &status) == 0 ? status.st_mode & 0777 : 0;
    };
    EXPECT_EQ(modeOf(documents_), 0700U);
    EXPECT_EQ(modeOf(manager.paths().exportPath), 0700U);
    for (const auto& file :
         {manager.paths().filePath, manager.paths().CDAFilePath, manager.paths().archivePath})
        EXPECT_EQ(modeOf(file), 0600U) << file;
    test::expectAccepted(
        "zipinfo '" + manager.paths().archivePath.string() +
        "' | awk '/^-rw-r--r--/ { print $NF }' | tr '\\n' ' ' | grep -qx 'export.xml export_cda.xml '");
    EXPECT_EQ(manager.progress().fraction(), 1);
    manager.cleanupExportFiles();
    expectNoFiles();
    manager.cleanupExportFiles();
}

/// Whatever the place at which there is no more room.
TEST_F(ExportFlow, AFullDiskFailsTheExport) {
    save(3000);
    QVExportManager manager(test::exportSetting(store_, documents_));
    ASSERT_TRUE(test::exportAll(manager).ok());
    const auto largest = fs::file_size(manager.paths().CDAFilePath),
               zip = fs::file_size(manager.paths().archivePath);
    while (manager.exportInProgress()) std::this_thread::yield();
    ::signal(SIGXFSZ, SIG_IGN);
    struct rlimit before {};
    getrlimit(RLIMIT_FSIZE, &before);
    for (const rlim_t room :
         {rlim_t(0), rlim_t(zip - 1), rlim_t(largest / 2), rlim_t(largest - 1), rlim_t(largest)}) {
        const struct rlimit limit { room, before.rlim_max };
        setrlimit(RLIMIT_FSIZE, &limit);
        const auto archive = test::exportAll(manager);
        setrlimit(RLIMIT_FSIZE, &before);
        EXPECT_EQ(archive.ok(), room == largest) << room;
        if (!archive) {
            EXPECT_EQ(archive.error().code, VSErrorCode::DiskFull) << archive.error().message;
            expectNoFiles();
        }
        while (manager.exportInProgress()) std::this_thread::yield();
    }
}

TEST_F(ExportFlow, FilesThatCannotBeCreatedAreReportedOnce) {
    std::ofstream(documents_) << "not a folder";
    std::vector<std::string> lines;
    const auto before = VSSetLogSink([&](VSLogLevel, std::string_view line) { lines.emplace_back(line); });
    std::atomic<int> completions = 0;
    std::optional<QVExportManager> manager;
    manager.emplace(test::exportSetting(store_, documents_));
    manager->createExportFile([&](const VSResult<fs::path>& archive) {
        ++completions;
        EXPECT_EQ(archive.error().message, "Export file(s) could not be created.");
    });
    const std::string expected = "File(s) not created: " + manager->paths().filePath.string() + "; " +
                                 manager->paths().CDAFilePath.string();
    manager.reset();
    VSSetLogSink(before);
    EXPECT_EQ(completions, 1);
    ASSERT_FALSE(lines.empty());
    EXPECT_EQ(lines.front(), expected);
}

/// Each save brings a heart rate and a step count; an export of one moment has as many of the one as of the
/// other.
TEST_F(ExportFlow, IsOfOneMomentWhileOthersSave) {
    constexpr int kBefore = 5000;
    for (int i = 0; i < kBefore; i += 500) {
        std::vector<VSSamplePtr> samples;
        for (int j = i; j < i + 500; ++j) {
            samples.push_back(reading(VSCode::HeartRate, j));
            samples.push_back(reading(VSCode::StepCount, j));
        }
        ASSERT_TRUE(store_->saveObjectsAndWait(std::move(samples)).ok());
    }
    QVExportManager manager(test::exportSetting(store_, documents_));
    int saved = 0;
    ASSERT_TRUE(test::exportAll(manager, [&] {
                    for (; manager.progress().bytesTotal == 0; ++saved) {
                        const int minute = kBefore + saved;
                        ASSERT_TRUE(store_
                                        ->saveObjectsAndWait({reading(VSCode::HeartRate, minute),
                                                              reading(VSCode::StepCount, minute)})
                                        .ok());
                    }
                }).ok());
    const std::string records = test::contentOf(manager.paths().filePath);
    const auto count = [&](const char* type) {
        int number = 0;
        for (size_t at = 0; (at = records.find(type, at)) != std::string::npos; ++at) ++number;
        return number;
    };
    EXPECT_GT(saved, 0);
    EXPECT_EQ(count("TypeIdentifierHeartRate"), count("TypeIdentifierStepCount"));
    EXPECT_LT(count("TypeIdentifierHeartRate"), kBefore + saved)
        << "all that was saved meanwhile was waited for";
}

TEST_F(ExportFlow, AStoreThatCannotBeReadFailsTheExport) {
    save(20'000);
    store_.reset();
    const fs::path file = folder_.path() / "store" / VSStoreSchema::fileName;
    std::fstream database(file, std::ios::binary | std::ios::in | std::ios::out);
    const std::string garbage(4096, 'x');
    for (uintmax_t page = fs::file_size(file) / 8192 * 4096; page + 4096 * 16 < fs::file_size(file);
         page += 4096 * 8) {
        database.seekp(static_cast<std::streamoff>(page));
        database.write(garbage.data(), 4096);
    }
    database.close();
    QVExportManager manager(test::exportSetting(open(), documents_));
    const auto archive = test::exportAll(manager);
    ASSERT_FALSE(archive.ok());
    EXPECT_EQ(archive.error().code, VSErrorCode::Corrupt) << archive.error().message;
    expectNoFiles();
}

}  // namespace
