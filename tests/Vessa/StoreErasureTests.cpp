#include <gtest/gtest.h>
#include <poll.h>
#include <rapidcheck/gtest.h>
#include <sys/inotify.h>
#include <unistd.h>

#include <bit>
#include <cstring>
#include <random>

#include "ChildProcess.h"
#include "StoreTestSupport.h"
#include "Vessa/VSStoreSchema.h"
#include "Vessa/VSStoreSnapshot.h"

using namespace test;

namespace {

namespace fs = std::filesystem;

constexpr std::string_view tracePrefix = "trace-";
constexpr size_t traceLength = 18;
constexpr uint64_t valuePrefix = 0x405ab7;  // of a double near 106.9

/// Values that nothing else in a file looks like, and the samples that hold them.
struct Traces {
    explicit Traces(uint32_t seed) : random(seed) {}

    std::string text() {
        char digits[32];
        std::snprintf(digits, sizeof digits, "%012llx",
                      static_cast<unsigned long long>(random()) & 0xffffffffffff);
        return std::string(tracePrefix) + digits;
    }
    static std::string bytesOf(uint64_t bits) { return {reinterpret_cast<const char*>(&bits), 8}; }

    /// Of one source and device; what it holds is noted in `held`.
    VSSamplePtr sample(const std::string& source, const std::string& device, std::set<std::string>& held,
                       size_t size = 0) {
        VSProvenance provenance = from(source);
        VSDevice made;
        made.name = device;
        provenance.device = std::make_shared<VSDevice>(made);
        const std::string content = text();
        std::string padded;
        do padded += content + std::string(size ? 1000 : 0, 'x');
        while (padded.size() < size);
        if (random() % 3 || size)
            provenance.metadata = std::make_shared<VSMetadata>(VSMetadata{{"note", padded}});
        const uint64_t bits = valuePrefix << 40 | (random() & 0xffffffffff) | 1;
        held.insert(bytesOf(bits));
        if (provenance.metadata) held.insert(content);
        const VSDate start = date("2020-01-01") + VSDuration(int64_t(random() % 2'000'000) * 1'000'000);
        return quantity(random() % 2 ? heartRate() : steps(), std::bit_cast<double>(bits), start,
                        start + std::chrono::minutes(random() % 2 * 20), provenance);
    }

    std::mt19937_64 random;
};

/// The traces that the files of a folder hold.
std::set<std::string> tracesIn(const fs::path& folder) {
    std::set<std::string> found;
    for (const auto& entry : fs::directory_iterator(folder)) {
        const std::string bytes = contentOf(entry.path());
        for (size_t at = 0; (at = bytes.find(tracePrefix, at)) != bytes.npos; ++at)
            found.insert(bytes.substr(at, traceLength));
        // Of a number in the machine's order the beginning comes last, on SQLite's pages first.
        const std::string first = Traces::bytesOf(valuePrefix).substr(0, 3),
                          last(first.rbegin(), first.rend());
        for (size_t at = 0; (at = bytes.find(first, at)) != bytes.npos; ++at)
            if (at >= 5) found.insert(bytes.substr(at - 5, 8));
        for (size_t at = 0; (at = bytes.find(last, at)) != bytes.npos; ++at) {
            std::string value = bytes.substr(at, 8);
            std::reverse(value.begin(), value.end());
            found.insert(value);
        }
    }
    return found;
}

std::set<std::string> shared(const std::set<std::string>& a, const std::set<std::string>& b) {
    std::set<std::string> both;
    std::set_intersection(a.begin(), a.end(), b.begin(), b.end(), std::inserter(both, both.end()));
    return both;
}

std::unique_ptr<VSHealthStore::ImportTransaction> import(VSHealthStore& store,
                                                         const std::vector<VSSamplePtr>& records) {
    auto transaction = store.beginImport("import of " + std::string(tracePrefix) + "0123456789ab");
    for (const auto& record : records) EXPECT_TRUE((*transaction)->add(*record).ok());
    return std::move(*transaction);
}

struct StoreErasure : StoreTest {
    /// Waits for what happens in the folder until `done`.
    void waitInFolder(const std::function<bool()>& done) {
        const int events = inotify_init1(IN_CLOEXEC | IN_NONBLOCK);
        ASSERT_GE(inotify_add_watch(events, folder.path().c_str(), IN_MODIFY | IN_DELETE | IN_MOVED_TO), 0);
        pollfd ready{events, POLLIN, 0};
        while (!done()) {
            ASSERT_EQ(poll(&ready, 1, 60'000), 1) << "nothing happens any more";
            char buffer[8192];
            while (read(events, buffer, sizeof buffer) > 0) {
            }
        }
        close(events);
    }
    uintmax_t sizeOf(const char* name) const { return fs::file_size(folder.path() / name); }
};

enum class Way { Objects, Source, Undo };

}  // namespace

/// However what is kept and what goes lie among each other, and in whatever portions they came.
RC_GTEST_PROP(StoreErasureOfAnything, WhatWasDeletedIsNowhereInTheFolder, ()) {
    const FixedEnvironment environment;
    const TemporaryFolder folder;
    const auto store = openStore(folder.path());
    Traces traces(*rc::gen::arbitrary<uint32_t>());
    const Way way = *rc::gen::element(Way::Objects, Way::Source, Way::Undo);
    const int count = *rc::gen::inRange(1, 700), portion = *rc::gen::inRange(1, 200);
    const std::string sourceThatGoes = traces.text(), deviceThatGoes = traces.text();
    std::set<std::string> kept,
        gone{sourceThatGoes, deviceThatGoes, std::string(tracePrefix) + "0123456789ab"};
    std::vector<VSSamplePtr> saved, deleted;
    for (int i = 0; i < count; ++i) {
        const bool goes = traces.random() % 3 == 0;
        const auto sample = goes ? traces.sample(sourceThatGoes, deviceThatGoes, gone)
                                 : traces.sample("Phone", "a phone", kept);
        if (goes) deleted.push_back(sample);
        if (!goes || way != Way::Undo) saved.push_back(sample);
        if (static_cast<int>(saved.size()) < portion) continue;
        RC_ASSERT(store->saveObjectsAndWait(std::exchange(saved, {})).ok());
    }
    RC_ASSERT(store->saveObjectsAndWait(saved).ok());
    if (way == Way::Undo) {
        RC_ASSERT(import(*store, deleted)->commit().ok());
        if (!deleted.empty()) RC_ASSERT(store->undoBatch(1).ok());
    } else if (way == Way::Objects) {
        RC_ASSERT(wait([&](auto done) { store->deleteObjects(deleted, done); }).ok());
    } else {
        const auto source = VSSource::forImportedName(sourceThatGoes).bundleIdentifier;
        RC_ASSERT(wait([&](auto done) {
                      store->deleteAllSamples({heartRate(), steps()}, source, done);
                  }).ok());
    }
    RC_ASSERT(store->cleanUp().ok());
    const auto found = tracesIn(folder.path());
    RC_ASSERT(shared(found, gone) == std::set<std::string>());
    RC_ASSERT(shared(found, kept) == kept);
    RC_ASSERT(store->check()->problems == std::vector<std::string>());
    // What came back would have its name again.
    if (!deleted.empty()) RC_ASSERT(store->saveObjectsAndWait({deleted[0]}).ok());
    RC_ASSERT(store->check()->problems == std::vector<std::string>());
}

/// So much that most of it is in the log long before the end. Nobody asks for the cleaning.
TEST_F(StoreErasure, WhatWasNeverCommittedGoesByItself) {
    Traces traces(1);
    std::set<std::string> kept, gone;
    save({traces.sample("Phone", "a phone", kept)});
    std::vector<VSSamplePtr> records;
    for (int i = 0; i < 300; ++i) records.push_back(traces.sample(traces.text(), "a watch", gone, 150'000));
    const auto nothingLeft = [&] {
        return sizeOf("vessa.sqlite-wal") == 0 && shared(tracesIn(folder.path()), gone).empty();
    };
    {
        const auto transaction = import(*store, records);
        EXPECT_FALSE(nothingLeft());
    }
    EXPECT_TRUE(nothingLeft());

    // One that a reader of another program keeps from it, until that ends.
    VSHealthStore::Options options;
    options.quiet = VSDuration(1);
    store = nullptr;
    store = openStore(folder.path(), options);
    auto snapshot = VSStoreSnapshot::take(*store);
    save({traces.sample("Phone", "a phone", gone)});
    import(*store, records).reset();
    EXPECT_OK(wait([&](auto done) { store->deleteAllSamples({heartRate(), steps()}, {}, done); }));
    EXPECT_FALSE(nothingLeft());
    snapshot->reset();
    waitInFolder(nothingLeft);
    EXPECT_EQ(shared(tracesIn(folder.path()), kept), std::set<std::string>());
}

TEST_F(StoreErasure, WhatAKilledImportLeftGoesAtTheNextOpening) {
    Traces traces(2);
    std::set<std::string> gone;
    std::vector<VSSamplePtr> records;
    for (int i = 0; i < 300; ++i) records.push_back(traces.sample("Watch", "a watch", gone, 150'000));
    store = nullptr;
    Child child([&](const auto& say, const auto& listen) {
        const auto mine = openStore(folder.path());
        const auto transaction = import(*mine, records);
        say('+');
        listen();
    });
    ASSERT_TRUE(child.hear());
    child.kill();
    EXPECT_FALSE(shared(tracesIn(folder.path()), gone).empty());
    VSHealthStore::Options options;
    options.quiet = VSDuration(1);
    store = openStore(folder.path(), options);
    waitInFolder([&] { return shared(tracesIn(folder.path()), gone).empty(); });
}

/// A file of an earlier program, too, under the eyes of one that has it open.
TEST_F(StoreErasure, SpaceReturnsToTheDisk) {
    store = nullptr;
    fs::remove_all(folder.path());
    fs::create_directories(folder.path());
    const fs::path stored = fs::path(QELVAR_TEST_DATA) / "stores" / "version-2" / "vessa.sqlite";
    fs::copy_file(stored, folder.path() / "vessa.sqlite");
    store = openStore(folder.path());
    const auto other = openStore(folder.path());
    const auto before = contentsOf(*other);
    EXPECT_OK(store->cleanUp());
    EXPECT_TRUE(VSStoreSchema::canShrink(*VSStoreSchema::openForReading(folder.path(), VSDuration(0))));
    EXPECT_TRUE(contentsOf(*other) == before);
    expectSound(*other);
    const auto size = sizeOf("vessa.sqlite");

    Traces traces(3);
    std::set<std::string> ignored;
    std::vector<VSSamplePtr> records;
    for (int i = 0; i < 20000; ++i) records.push_back(traces.sample("Watch", "a watch", ignored));
    const size_t batches = store->batches()->size();
    EXPECT_OK(import(*store, records)->commit());
    EXPECT_OK(store->cleanUp());
    EXPECT_GT(sizeOf("vessa.sqlite"), size + 2'000'000);
    ASSERT_EQ(store->batches()->size(), batches + 1);
    EXPECT_EQ(store->undoBatch(store->batches()->back().id)->removed, 20000);
    EXPECT_OK(store->cleanUp());
    // But for what says that so many were deleted.
    EXPECT_LT(sizeOf("vessa.sqlite"), size + 20000 * 30);
    EXPECT_EQ(VSStoreSchema::openForReading(folder.path(), VSDuration(0))->integer("PRAGMA freelist_count"),
              0);
    EXPECT_TRUE(contentsOf(*other) == before);
    expectSound(*other);
}
