#include <gtest/gtest.h>

#include <fstream>
#include <map>
#include <random>
#include <set>

#include "FaultyFileSystem.h"
#include "StoreTestSupport.h"
#include "Vessa/VSDatabase.h"
#include "Vessa/VSPageReader.h"

using namespace test;

namespace {

void write(const std::filesystem::path& file, const std::string& bytes) {
    std::ofstream(file, std::ios::binary) << bytes;
}

using Contents = std::map<int64_t, Said>;

/// A store with something in every table, some of it on several pages.
void fill(VSHealthStore& store) {
    auto provenance = from("Wrist", "1.0");
    provenance.device = std::make_shared<VSDevice>(VSDevice{"Tracker", "Maker", {}, "2", {}, {}, {}, {}});
    std::vector<VSSamplePtr> samples;
    for (int i = 0; i < 700; ++i) {
        const VSDate start = date("2020-03-01") + std::chrono::minutes(i * 5);
        if (i % 50 == 0) {
            provenance.metadata = std::make_shared<VSMetadata>(
                VSMetadata{{"note", std::string(i == 100 ? 9000 : 20, 'a') + std::to_string(i)}});
            provenance.timeZoneOffset = i;
        }
        samples.push_back(quantity(heartRate(), 60 + i * 0.25, start, start, provenance));
        samples.push_back(quantity(steps(), i, start, start + std::chrono::hours(i % 90), from("Phone")));
    }
    EXPECT_OK(store.saveObjectsAndWait(samples));
    samples = {std::make_shared<VSCategorySample>(type(VSCode::SleepAnalysis), 1, date("2020-03-01T22:00"),
                                                  date("2020-03-02T06:00")),
               std::make_shared<VSWorkout>(
                   37, date("2020-03-02T10:00"), date("2020-03-02T11:00"), VSDuration(0),
                   VSQuantity(VSUnit::kilocalorieUnit(), 300), std::nullopt,
                   std::vector<VSWorkoutEvent>{{1, date("2020-03-02T10:10")}, {2, date("2020-03-02T10:20")}}),
               bloodPressure(120, 80, date("2020-03-02"))};
    EXPECT_OK(store.saveObjectsAndWait(samples));
    auto import = store.beginImport("document");
    ASSERT_TRUE(import.ok());
    for (int i = 0; i < 200; ++i)
        ASSERT_TRUE((*import)
                        ->add(*quantity(type(VSCode::BodyMass), 70 + i * 0.1,
                                        date("2019-01-01") + std::chrono::hours(i),
                                        date("2019-01-01") + std::chrono::hours(i), from("Scale")))
                        .ok());
    ASSERT_TRUE((*import)->setCharacteristicsIfUnset(VSBirthDate{1980, 2, 3}, 1, 2, 0).ok());
    EXPECT_OK((*import)->commit());
    EXPECT_OK(wait([&](auto done) {
        store.deleteObjects({allSamples(store, heartRate())[3], allSamples(store, steps())[5]}, done);
    }));
    EXPECT_OK(wait([&](auto done) {
        store.setOrderedSources({VSSource::forImportedName("Phone"), VSSource::forImportedName("Wrist")},
                                steps(), done);
    }));
    EXPECT_OK(wait([&](auto done) { store.setDefaultValue(VSValue(7), "key", done); }));
    VSMedicalIDData medical;
    medical.name = "Ada";
    EXPECT_OK(wait([&](auto done) { store.updateMedicalIDData(medical, done); }));
}

struct StoreSalvage : testing::Test {
    FixedEnvironment environment;
    FaultyFileSystem disk;  // whose syncs cost nothing
    TemporaryFolder whole;
    const std::filesystem::path wholeFile = whole.path() / "vessa.sqlite";
    std::string bytes;
    Contents contents;
    std::map<uint32_t, std::string> tables;        // by page
    std::map<uint32_t, std::set<int64_t>> onPage;  // the samples whose rows stand on a page

    void SetUp() override {
        {
            const auto store = openStore(whole.path());
            fill(*store);
            contents = contentsOf(*store);
        }
        bytes = contentOf(wholeFile);
        {
            VSDatabase database(wholeFile, VSDatabase::Mode::Read, VSDuration(0));
            auto rows = database.use("SELECT pageno, name FROM dbstat");
            while (rows.step()) tables[static_cast<uint32_t>(rows.integer(0))] = rows.text(1);
        }
        VSPageReader pages(wholeFile, 4096);
        for (const auto& [page, table] : tables) {
            if (table != "samples") continue;
            pages.forEachRow(page, [&](const VSPageRow& row) { onPage[page].insert(row.fields[2].integer); });
        }
        ASSERT_GT(onPage.size(), 10u);
    }

    size_t pageCount() const { return bytes.size() / 4096; }

    /// Salvages a file and looks at what came out: sound, and nothing that was not there before.
    struct Outcome {
        VSSalvageReport report;
        Contents contents;
    };
    Outcome salvage(const std::string& damaged) {
        TemporaryFolder from, parent;
        write(from.path() / "vessa.sqlite", damaged);
        const auto target = parent.path() / "new";
        const auto report = VSHealthStore::salvage(from.path(), target);
        EXPECT_EQ(contentOf(from.path() / "vessa.sqlite"), damaged) << "the damaged file is never changed";
        Outcome outcome;
        if (!report) {
            ADD_FAILURE() << report.error().message;
            return outcome;
        }
        outcome.report = *report;
        const auto store = openStore(target);
        if (!store) return outcome;
        expectSound(*store);
        outcome.contents = contentsOf(*store);
        EXPECT_EQ(static_cast<int64_t>(outcome.contents.size()), report->samples);
        return outcome;
    }

    /// Every sample that is not on the page is there, as it was but for what the page's table said of it.
    void expectAllBut(const Contents& found, const std::set<int64_t>& lost, const std::string& damagedTable) {
        const bool originMayDiffer = damagedTable != "samples" && damagedTable != "rollups";
        for (const auto& [id, said] : contents) {
            if (lost.contains(id)) continue;
            const auto there = found.find(id);
            if (there == found.end()) {
                ADD_FAILURE() << "sample " << id << " is lost: " << said.content;
                return;
            }
            EXPECT_EQ(there->second.content, said.content);
            if (!originMayDiffer && said.content.find("VSCorrelation") == std::string::npos) {
                EXPECT_EQ(there->second.origin, said.origin);
            }
        }
    }
};

}  // namespace

TEST_F(StoreSalvage, OfASoundStoreIsACopy) {
    TemporaryFolder parent;
    const auto report = VSHealthStore::salvage(whole.path(), parent.path() / "new");
    ASSERT_TRUE(report.ok()) << report.error().message;
    EXPECT_EQ(report->lost, 0);
    EXPECT_EQ(report->losses, std::vector<std::string>());
    const auto before = openStore(whole.path()), after = openStore(parent.path() / "new");
    EXPECT_EQ(contentsOf(*after), contents);
    expectSound(*after);
    // Row for row; what follows from the samples may stand in another order only.
    EXPECT_GT(expectSameRows(wholeFile, parent.path() / "new" / "vessa.sqlite"), 20);
}

TEST_F(StoreSalvage, ABrokenPageCostsWhatWasOnIt) {
    std::mt19937 random(7);
    for (uint32_t page = 1; page <= pageCount(); ++page) {
        for (unsigned manner = 0; manner < 2; ++manner) {
            if (!longTests() && manner != page % 2) continue;
            SCOPED_TRACE("page " + std::to_string(page) + " of " + tables[page] +
                         (manner ? " random" : " zeroed"));
            std::string damaged = bytes;
            for (size_t at = 0; at < 4096; ++at)
                damaged[(page - 1) * 4096 + at] = manner ? static_cast<char>(random()) : '\0';
            const auto outcome = salvage(damaged);
            EXPECT_EQ(outcome.contents.size(), contents.size() - onPage[page].size());
            EXPECT_EQ(outcome.report.lost, static_cast<int64_t>(onPage[page].size()));
            if (!onPage[page].empty()) {
                EXPECT_FALSE(outcome.report.losses.empty());
            }
            expectAllBut(outcome.contents, onPage[page], tables[page]);
            if (HasFailure()) return;
        }
    }
}

TEST_F(StoreSalvage, FlippedBitsCostAtMostTheirPage) {
    std::mt19937 random(8);
    for (uint32_t page = 1; page <= pageCount(); page += longTests() ? 1 : 4) {
        SCOPED_TRACE("page " + std::to_string(page) + " of " + tables[page]);
        std::string damaged = bytes;
        std::set<int64_t> touched = onPage[page];
        for (int flip = 0; flip < 6; ++flip) {
            // The format number and the application's are no damage that can be told from a stranger's file.
            const size_t at = page == 1 ? 100 + random() % 3996 : random() % 4096;
            char& byte = damaged[(page - 1) * 4096 + at];
            byte = static_cast<char>(byte ^ (1 << random() % 8));
        }
        const auto outcome = salvage(damaged);
        expectAllBut(outcome.contents, touched, tables[page] == "samples" ? "samples" : "other");
        if (HasFailure()) return;
    }
}

TEST_F(StoreSalvage, ATruncatedFileCostsWhatWasCutOff) {
    const size_t step = longTests() ? 1 : 7;
    for (size_t pages = pageCount() - 1; pages >= 1; pages -= std::min(pages, step)) {
        SCOPED_TRACE(pages);
        std::set<int64_t> lost;
        for (const auto& [page, ids] : onPage)
            if (page > pages) lost.insert(ids.begin(), ids.end());
        TemporaryFolder from, parent;
        write(from.path() / "vessa.sqlite", bytes.substr(0, pages * 4096));
        if (lost.size() < contents.size()) {
            const auto outcome = salvage(bytes.substr(0, pages * 4096));
            EXPECT_EQ(outcome.contents.size(), contents.size() - lost.size());
            if (outcome.report.lost) {
                EXPECT_EQ(outcome.report.lost, static_cast<int64_t>(lost.size()));
            } else {
                EXPECT_FALSE(outcome.report.losses.empty());
            }
            expectAllBut(outcome.contents, lost, "other");
        }
        if (HasFailure()) return;
    }
}

TEST_F(StoreSalvage, WhatIsStillInTheLogIsThere) {
    TemporaryFolder live, parent;
    std::filesystem::copy(whole.path(), live.path(), std::filesystem::copy_options::recursive);
    TemporaryFolder killed;
    Contents both;
    {
        const auto store = openStore(live.path());
        EXPECT_OK(
            store->saveObjectsAndWait({quantity(heartRate(), 99, "2021-01-01", "2021-01-01", from("New"))}));
        both = contentsOf(*store);
        std::filesystem::copy(live.path(), killed.path(), std::filesystem::copy_options::recursive);
    }
    ASSERT_GT(contentOf(killed.path() / "vessa.sqlite-wal").size(), 0u);
    const auto log = contentOf(killed.path() / "vessa.sqlite-wal");
    for (const bool headLost : {false, true}) {
        if (headLost) write(killed.path() / "vessa.sqlite", std::string(4096, '\0') + bytes.substr(4096));
        const auto target = parent.path() / (headLost ? "b" : "a");
        const auto report = VSHealthStore::salvage(killed.path(), target);
        ASSERT_TRUE(report.ok()) << report.error().message;
        EXPECT_EQ(contentOf(killed.path() / "vessa.sqlite-wal"), log);
        const auto store = openStore(target);
        EXPECT_EQ(contentsOf(*store), both);
        expectSound(*store);
    }
    // A damaged frame ends the log there.
    std::string broken = log;
    broken[broken.size() - 100] = static_cast<char>(broken[broken.size() - 100] ^ 1);
    write(killed.path() / "vessa.sqlite", bytes);
    write(killed.path() / "vessa.sqlite-wal", broken);
    ASSERT_TRUE(VSHealthStore::salvage(killed.path(), parent.path() / "c").ok());
    EXPECT_EQ(contentsOf(*openStore(parent.path() / "c")), contents);
}

TEST_F(StoreSalvage, AFreeListThatCannotBeTrueIsNotFollowed) {
    // Pages 2 and 3 hold the list; its count stands in the head of the file.
    const auto freePages = [&](uint32_t count, std::vector<uint32_t> second, std::vector<uint32_t> third) {
        std::string file = bytes.substr(0, 8 * 4096);
        const auto put = [&](size_t at, uint32_t value) {
            for (size_t i = 0; i < 4; ++i) file[at + i] = static_cast<char>(value >> (24 - 8 * i));
        };
        put(32, 2);
        put(36, count);
        for (size_t i = 0; i < second.size(); ++i) put(4096 + 4 * i, second[i]);
        for (size_t i = 0; i < third.size(); ++i) put(2 * 4096 + 4 * i, third[i]);
        TemporaryFolder folder;
        write(folder.path() / "file", file);
        return VSPageReader(folder.path() / "file", 4096).freePages();
    };
    using Pages = std::vector<uint32_t>;
    EXPECT_EQ(freePages(5, {3, 2, 5, 6}, {0, 1, 8}), (Pages{2, 5, 6, 3, 8}));
    ASSERT_EQ(freePages(5, {3, 2, 5, 6}, {0, 1, 5}), Pages()) << "a page stands twice";
    EXPECT_EQ(freePages(5, {3, 2, 5, 6}, {0, 1, 9}), Pages()) << "beyond the end";
    EXPECT_EQ(freePages(4, {3, 2, 5, 6}, {0, 1, 8}), Pages()) << "another count";
    EXPECT_EQ(freePages(UINT32_MAX, {3, 0}, {2, 0}), Pages()) << "a ring";
}

TEST_F(StoreSalvage, OldNumbersAreNotGivenAgain) {
    std::string damaged = bytes;
    uint32_t last = 0;
    for (const auto& [page, table] : tables)
        if (table == "state" || table == "types")
            last = page, damaged.replace((page - 1) * 4096, 4096, 4096, '\0');
    ASSERT_GT(last, 0u);
    TemporaryFolder from, parent;
    write(from.path() / "vessa.sqlite", damaged);
    ASSERT_TRUE(VSHealthStore::salvage(from.path(), parent.path() / "new").ok());
    const auto store = openStore(parent.path() / "new");
    EXPECT_OK(store->saveObjectsAndWait({quantity(heartRate(), 1, "2022-01-01", "2022-01-01")}));
    const auto newest = allSamples(*store, heartRate()).back();
    EXPECT_GT(VSObjectIDValue(newest->dataID()), contents.rbegin()->first);
    expectSound(*store);
}

TEST_F(StoreSalvage, IsRefusedWhereItMakesNoSense) {
    TemporaryFolder empty, strange, target;
    const auto code = [&](const std::filesystem::path& from, const std::filesystem::path& to) {
        const auto report = VSHealthStore::salvage(from, to);
        EXPECT_FALSE(report.ok());
        return report.ok() ? VSErrorCode::NotFound : report.error().code;
    };
    EXPECT_EQ(code(empty.path(), target.path()), VSErrorCode::NotAccessible);
    EXPECT_EQ(code(whole.path(), whole.path()), VSErrorCode::Refused);
    write(strange.path() / "vessa.sqlite", "");
    VSDatabase(strange.path() / "vessa.sqlite", VSDatabase::Mode::Write, VSDuration(0))
        .execute("CREATE TABLE theirs(a)");
    EXPECT_EQ(code(strange.path(), target.path()), VSErrorCode::Refused);
    write(strange.path() / "vessa.sqlite", std::string(50000, 'x'));
    EXPECT_EQ(code(strange.path(), target.path()), VSErrorCode::Corrupt);
    EXPECT_TRUE(std::filesystem::is_empty(target.path()));
}

TEST(StoreSalvageOfOldFormats, AVersion1StoreBecomesACurrentOne) {
    FixedEnvironment environment;
    const auto old = std::filesystem::path(QELVAR_TEST_DATA) / "stores" / "version-1";
    TemporaryFolder from, target, migrated;
    std::filesystem::copy(old / "vessa.sqlite", from.path() / "vessa.sqlite");
    std::filesystem::copy(old / "vessa.sqlite", migrated.path() / "vessa.sqlite");
    const auto report = VSHealthStore::salvage(from.path(), target.path());
    ASSERT_TRUE(report.ok()) << report.error().message;
    EXPECT_EQ(report->lost, 0);
    EXPECT_EQ(report->losses, std::vector<std::string>());
    const auto store = openStore(target.path()), other = openStore(migrated.path());
    expectSound(*store);
    EXPECT_EQ(contentsOf(*store), contentsOf(*other));
    EXPECT_EQ(store->batches()->size(), other->batches()->size());
}
