#include "Qelvar/Import/QVRecordsImporter.h"

#include <archive.h>
#include <archive_entry.h>
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <atomic>
#include <fstream>
#include <thread>

#include "RecordsText.h"
#include "TestSupport.h"
#include "Vessa/VSDatabase.h"

namespace {

namespace fs = std::filesystem;

const std::string kHead = "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n<HealthData locale=\"en_DK\">\n";
const std::string kTail = "</HealthData>\n";

std::string record(int number) {
    char time[32];
    std::snprintf(time, sizeof time, "2020-03-%02d %02d:%02d:00 +0100", 1 + number / 1440 % 28,
                  number / 60 % 24, number % 60);
    return std::string(
               " <Record type=\"VSQuantityTypeIdentifierHeartRate\" sourceName=\"Wrist\" unit=\"count/min\" "
               "startDate=\"") +
           time + "\" endDate=\"" + time + "\" value=\"" + std::to_string(50 + number % 100) + "\"/>\n";
}

std::string records(int count) {
    std::string text;
    for (int i = 0; i < count; ++i) text += record(i);
    return text;
}

class QVRecordsImporterTest : public testing::Test {
 protected:
    void SetUp() override {
        auto opened = VSHealthStore::open(folder_.path() / "store");
        ASSERT_TRUE(opened.ok()) << opened.error().message;
        store_ = *opened;
    }
    fs::path write(const std::string& name, const std::string& content) {
        const fs::path path = folder_.path() / name;
        std::ofstream(path, std::ios::binary) << content;
        return path;
    }
    VSResult<QVImportReport> import(const std::vector<fs::path>& files, const QVImportOptions& options = {}) {
        return QVRecordsImporter(store_).importFiles(files, options);
    }
    /// The import is refused with this text in its message, and the store stays empty.
    void expectRefused(const std::vector<fs::path>& files, VSErrorCode code, const std::string& text) {
        const auto report = import(files);
        ASSERT_FALSE(report.ok()) << text;
        EXPECT_EQ(report.error().code, code) << report.error().message;
        EXPECT_NE(report.error().message.find(text), std::string::npos) << report.error().message;
        EXPECT_EQ(test::textOfStore(*store_), "");
    }

    /// Cancelled where it first tells how far it is.
    void expectCancelled(const fs::path& file) {
        std::atomic<bool> cancel = false;
        QVImportOptions options;
        options.cancel = &cancel;
        options.progress = [&](const QVImportProgress&) { cancel = true; };
        const auto report = import({file}, options);
        ASSERT_FALSE(report.ok());
        EXPECT_EQ(report.error().code, VSErrorCode::Cancelled);
    }

    const test::FixedEnvironment environment_{"2020-04-02T12:00"};
    const test::TemporaryFolder folder_;
    std::shared_ptr<VSHealthStore> store_;
};

/// Writes an archive of one entry, whose content is `block` so many times over.
void writeArchive(const fs::path& path, const std::string& name, const std::string& begin,
                  const std::string& block, size_t times, const char* passphrase = nullptr) {
    archive* a = archive_write_new();
    ASSERT_EQ(archive_write_set_format_zip(a), ARCHIVE_OK);
    if (passphrase) {
        ASSERT_EQ(archive_write_set_options(a, "zip:encryption=traditional"), ARCHIVE_OK);
        ASSERT_EQ(archive_write_set_passphrase(a, passphrase), ARCHIVE_OK);
    }
    ASSERT_EQ(archive_write_open_filename(a, path.c_str()), ARCHIVE_OK);
    archive_entry* entry = archive_entry_new();
    archive_entry_set_pathname(entry, name.c_str());
    archive_entry_set_filetype(entry, AE_IFREG);
    archive_entry_set_perm(entry, 0600);
    archive_entry_set_size(entry, static_cast<int64_t>(begin.size() + block.size() * times));
    ASSERT_EQ(archive_write_header(a, entry), ARCHIVE_OK);
    archive_write_data(a, begin.data(), begin.size());
    for (size_t i = 0; i < times; ++i) archive_write_data(a, block.data(), block.size());
    archive_entry_free(entry);
    ASSERT_EQ(archive_write_close(a), ARCHIVE_OK);
    archive_write_free(a);
}

TEST_F(QVRecordsImporterTest, OneDamagedFileKeepsAllOthersOut) {
    const auto good = write("good.xml", kHead + records(3000) + kTail);
    const auto bad = write("bad.xml", kHead + records(3000));
    expectRefused({good, bad}, VSErrorCode::Invalid, "bad.xml:");
    expectRefused({good, folder_.path() / "missing.xml"}, VSErrorCode::NotFound, "missing.xml");
    const auto report = import({good, good});
    ASSERT_TRUE(report.ok()) << report.error().message;
    EXPECT_EQ(report->total.read, 6000);
}

TEST_F(QVRecordsImporterTest, WhatIsNoDocumentIsRefused) {
    expectRefused({folder_.path()}, VSErrorCode::Invalid, "is a folder");
    expectRefused({write("empty.xml", "")}, VSErrorCode::Invalid, "is empty");
    expectRefused({write("x.xml", "<")}, VSErrorCode::Invalid, "not a well-formed");
    expectRefused({write("x.zip", "PK\x03\x04")}, VSErrorCode::Invalid, "truncated or damaged");
    // Gigabytes of nothing, and what is encrypted.
    const auto archive = folder_.path() / "archive.zip";
    writeArchive(archive, "export.xml", kHead + record(1), std::string(1'000'000, ' '), 120);
    EXPECT_LT(fs::file_size(archive), 400'000U);
    expectRefused({archive}, VSErrorCode::Invalid, "expands to more than");
    writeArchive(archive, "export.xml", "", std::string(1'000'000, '\0'), 120);
    expectRefused({archive}, VSErrorCode::Invalid, "holds no records document");
    writeArchive(archive, "export.xml", kHead + records(10) + kTail, "", 0, "secret");
    expectRefused({archive}, VSErrorCode::Invalid, "encrypted");
}

TEST_F(QVRecordsImporterTest, HugeAttributesAreRefused) {
    const auto withSource = [](size_t length) {
        std::string text = record(7);
        return text.replace(text.find("Wrist"), 5, std::string(length, 'w'));
    };
    expectRefused({write("huge.xml", kHead + record(1) + withSource(12'000'000) + kTail)},
                  VSErrorCode::Invalid, "huge.xml:4: a part of it is longer than 10 MB");
    const auto report = import({write("large.xml", kHead + record(1) + withSource(100'000) + kTail)});
    ASSERT_TRUE(report.ok()) << report.error().message;
    EXPECT_EQ(report->total.added, 1);
    ASSERT_EQ(report->refusals.size(), 1U);
    EXPECT_EQ(report->refusals[0].reason, "attribute too long");
    EXPECT_LT(report->refusals[0].description().size() + report->refusals[0].excerpt.size(), 1000U);
}

TEST_F(QVRecordsImporterTest, ProgressEndsAtTheEnd) {
    const auto file = write("long.xml", kHead + records(5000) + kTail);
    QVImportOptions options;
    std::vector<QVImportProgress> seen;
    options.progress = [&](const QVImportProgress& progress) { seen.push_back(progress); };
    ASSERT_TRUE(import({file, file}, options).ok());
    ASSERT_FALSE(seen.empty());
    EXPECT_EQ(seen.back().bytesTotal, 2 * fs::file_size(file));
    EXPECT_EQ(seen.back().bytesDone, seen.back().bytesTotal);
    EXPECT_EQ(seen.back().records, 10'000);
    EXPECT_TRUE(std::is_sorted(seen.begin(), seen.end(), [](const auto& a, const auto& b) {
        return a.records < b.records || a.bytesDone < b.bytesDone;
    }));
}

TEST_F(QVRecordsImporterTest, WaitsForAnotherWriterButNotForAStoreThatIsGone) {
    const auto file = write("short.xml", kHead + records(5) + kTail);
    const fs::path database = folder_.path() / "store" / "vessa.sqlite";
    VSDatabase other(database, VSDatabase::Mode::Write, VSDuration(0));
    other.execute("BEGIN IMMEDIATE");
    QVImportOptions options;
    int waits = 0;
    options.progress = [&](const QVImportProgress& progress) {
        if (!progress.isWaiting) return;
        ++waits;
        other.execute("ROLLBACK");
    };
    const auto report = import({file}, options);
    ASSERT_TRUE(report.ok()) << report.error().message;
    EXPECT_EQ(report->total.added, 5);
    EXPECT_EQ(waits, 1);

    fs::rename(folder_.path() / "store", folder_.path() / "away");
    const auto gone = import({file}, options);
    ASSERT_FALSE(gone.ok());
    EXPECT_EQ(gone.error().code, VSErrorCode::NotAccessible) << gone.error().message;
    EXPECT_EQ(waits, 1);
}

TEST_F(QVRecordsImporterTest, ACancelledImportLeavesNothing) {
    expectCancelled(write("long.xml", kHead + records(20'000) + kTail));
    const auto archive = folder_.path() / "long.zip";
    writeArchive(archive, "export.xml", kHead, records(1000), 50);
    expectCancelled(archive);
    EXPECT_EQ(test::textOfStore(*store_), "");
}

TEST_F(QVRecordsImporterTest, APipeIsReadAndCanBeGivenUp) {
    const fs::path pipe = folder_.path() / "pipe";
    ASSERT_EQ(mkfifo(pipe.c_str(), 0600), 0);
    {
        const std::jthread writer([&] { std::ofstream(pipe) << kHead + records(3000) + kTail; });
        const auto report = import({pipe});
        ASSERT_TRUE(report.ok()) << report.error().message;
        EXPECT_EQ(report->total.added, 3000);
    }
    expectCancelled(pipe);  // nobody writes
}

TEST_F(QVRecordsImporterTest, RefusalsBeyondTheListAreCounted) {
    std::string bad = record(1);
    bad.replace(bad.find("VSQuantityTypeIdentifierHeartRate"), 33, "VSQuantityTypeIdentifierAura");
    std::string document = kHead;
    for (int i = 0; i < 5000; ++i) document += bad;
    QVImportOptions options;
    options.listedRefusals = 3;
    const auto report = import({write("bad.xml", document + kTail)}, options);
    ASSERT_TRUE(report.ok()) << report.error().message;
    EXPECT_EQ(report->refusals.size(), 3U);
    EXPECT_EQ(report->refusals[2].line, 5);
    EXPECT_EQ(report->refusalsNotListed(), 4997);
    EXPECT_EQ(report->byType.at("VSQuantityTypeIdentifierAura"), (QVImportCount{5000, 0, 0, 5000}));
}

}  // namespace
