#include <gtest/gtest.h>

#include <functional>
#include <map>
#include <random>
#include <set>

#include "FaultyFileSystem.h"
#include "StoreTestSupport.h"

using namespace test;

// What a store does on a disk that fails, runs full or loses its power, at every single operation of the
// disk.

namespace {

/// One change of a store and how to see whether it is there.
struct Step {
    enum State { Absent, Whole, Torn };
    std::function<VSStatus(VSHealthStore&)> run;
    std::function<State(VSHealthStore&)> state;
    size_t undoneBy = 0;  // the later step that takes it back; 0: none
};

Step::State stateOf(size_t found, size_t whole) {
    return found == 0 ? Step::Absent : found == whole ? Step::Whole : Step::Torn;
}

size_t countFrom(VSHealthStore& store, const VSObjectType* type, const std::string& source) {
    size_t count = 0;
    for (const VSSamplePtr& sample : allSamples(store, type))
        if (sample->sourceRevision().source.name == source) ++count;
    return count;
}

/// Samples of a source of its own, with metadata, so that a save touches many tables.
std::vector<VSSamplePtr> batch(const std::string& source, int count) {
    std::vector<VSSamplePtr> samples;
    auto provenance = from(source);
    provenance.metadata = std::make_shared<VSMetadata>(VSMetadata{{"source", source}});
    for (int i = 0; i < count; ++i) {
        const VSDate start = date("2020-03-01") + std::chrono::minutes(i * 7);
        samples.push_back(quantity(i % 3 ? heartRate() : steps(), 60 + i, start,
                                   start + std::chrono::minutes(i % 3 ? 0 : 40), provenance));
    }
    return samples;
}

size_t batchCount(VSHealthStore& store, const std::string& source) {
    return countFrom(store, heartRate(), source) + countFrom(store, steps(), source);
}

Step save(const std::string& source, int count) {
    return {
        [=](VSHealthStore& store) { return store.saveObjectsAndWait(batch(source, count)); },
        [=](VSHealthStore& store) { return stateOf(batchCount(store, source), static_cast<size_t>(count)); }};
}

Step import(const std::string& source, int count) {
    return {
        [=](VSHealthStore& store) -> VSStatus {
            auto import = store.beginImport(source);
            if (!import) return import.error();
            for (const VSSamplePtr& sample : batch(source, count))
                if (auto added = (*import)->add(*sample); !added) return added.error();
            return (*import)->commit();
        },
        [=](VSHealthStore& store) { return stateOf(batchCount(store, source), static_cast<size_t>(count)); }};
}

/// Deletes what a step before saved.
Step removal(const std::string& source, int count) {
    return {
        [=](VSHealthStore& store) {
            return wait([&](auto done) {
                store.deleteAllSamples({heartRate(), steps()}, "import." + source, done);
            });
        },
        [=](VSHealthStore& store) {
            const size_t left = batchCount(store, source);
            return left == 0 ? Step::Whole : left == static_cast<size_t>(count) ? Step::Absent : Step::Torn;
        }};
}

Step workout() {
    return {
        [](VSHealthStore& store) -> VSStatus {
            auto run = std::make_shared<VSWorkout>(
                37, date("2020-03-02T10:00"), date("2020-03-02T11:00"), VSDuration(0), std::nullopt,
                std::nullopt,
                std::vector<VSWorkoutEvent>{{1, date("2020-03-02T10:10")}, {2, date("2020-03-02T10:11")}});
            return store.saveObjectsAndWait({run, bloodPressure(120, 80, date("2020-03-02"))});
        },
        [](VSHealthStore& store) {
            size_t found = 0;
            for (auto code : {VSCode::Workout, VSCode::BloodPressure, VSCode::BloodPressureSystolic,
                              VSCode::BloodPressureDiastolic})
                found += allSamples(store, type(code)).size();
            for (const auto& sample : allSamples(store, type(VSCode::BloodPressure)))
                found += membersOf(sample).size();
            return stateOf(found, 6);
        }};
}

/// Only sources with samples are told, so looking at the order saves some.
Step sourceOrder() {
    const VSObjectType* flights = type(VSCode::FlightsClimbed);
    return {[=](VSHealthStore& store) {
                return wait([&](auto done) {
                    store.setOrderedSources({VSSource::forImportedName("Late")}, flights, done);
                });
            },
            [=](VSHealthStore& store) {
                EXPECT_OK(store.saveObjectsAndWait(
                    {quantity(flights, 1, "2020-03-01T10:00", "2020-03-01T10:00", from("Early")),
                     quantity(flights, 1, "2020-03-01T11:00", "2020-03-01T11:00", from("Late"))}));
                return sourceOrderOf(store, flights).at(0).name == "Late" ? Step::Whole : Step::Absent;
            }};
}

Step defaultValue() {
    return {[](VSHealthStore& store) {
                return wait([&](auto done) { store.setDefaultValue(VSValue(7), "key", done); });
            },
            [](VSHealthStore& store) { return *defaultValueOf(store, "key") ? Step::Whole : Step::Absent; }};
}

std::vector<Step> everyKind() {
    std::vector<Step> steps{save("A", 30),  import("B", 40), sourceOrder(), removal("A", 30),
                            defaultValue(), workout(),       save("C", 3)};
    steps[0].undoneBy = 3;
    return steps;
}

struct Disk : testing::Test {
    FixedEnvironment environment;
    FaultyFileSystem disk;

    static VSResult<std::shared_ptr<VSHealthStore>> open(const std::filesystem::path& folder,
                                                         bool survivesPowerLoss = true) {
        VSHealthStore::Options options;
        options.survivesPowerLoss = survivesPowerLoss;
        options.patience = std::chrono::seconds(5);
        return VSHealthStore::open(folder, options);
    }

    /// A store that had been used before.
    static void prepare(const std::filesystem::path& folder) {
        auto store = open(folder, false);
        ASSERT_TRUE(store.ok());
        EXPECT_OK((*store)->saveObjectsAndWait(batch("Before", 200)));
    }

    /// Acknowledged steps are there, the others whole or not at all; the store is sound.
    static void expectKept(VSHealthStore& store, const std::vector<Step>& steps,
                           const std::set<size_t>& kept) {
        for (size_t i = 0; i < steps.size(); ++i) {
            const auto state = steps[i].state(store);
            EXPECT_NE(state, Step::Torn) << "step " << i;
            const size_t undone = steps[i].undoneBy;
            if (kept.contains(i) && !(undone && steps[undone].state(store) == Step::Whole)) {
                EXPECT_EQ(state, Step::Whole) << "step " << i;
            }
        }
        expectSound(store);
    }

    /// Runs the steps against a store while the n-th operation of the disk fails. True: it failed, so there
    /// may be a later one.
    bool runWithFault(int n, FaultyFileSystem::Fault fault, const std::filesystem::path* ready) {
        TemporaryFolder folder;
        if (ready) std::filesystem::copy(*ready, folder.path(), std::filesystem::copy_options::recursive);
        const std::vector<Step> steps = everyKind();
        std::set<size_t> acknowledged;
        const auto judge = [&](const VSError& error) {
            EXPECT_NE(error.message, "");
            if (fault == FaultyFileSystem::Fault::FullDisk) {
                EXPECT_EQ(error.code, VSErrorCode::DiskFull) << error.message;
            } else {
                EXPECT_TRUE(error.code == VSErrorCode::Failed || error.code == VSErrorCode::NotAccessible)
                    << error.message;
            }
        };
        disk.failAt(n, fault);
        auto store = open(folder.path());
        if (store) {
            for (size_t i = 0; i < steps.size(); ++i) {
                if (const VSStatus status = steps[i].run(**store); status.ok())
                    acknowledged.insert(i);
                else
                    judge(status.error());
            }
        } else {
            judge(store.error());
        }
        const bool reached = disk.operations() > n;
        disk.heal();
        if (store) {
            // The same connection goes on, with what it had.
            EXPECT_OK(save("After", 5).run(**store));
            expectKept(**store, steps, acknowledged);
            store = VSError{};  // closes it, and moves the log into the file
        }
        auto again = open(folder.path());
        EXPECT_TRUE(again.ok()) << again.error().message;
        if (again) expectKept(**again, steps, acknowledged);
        if (again && ready) {
            EXPECT_EQ(batchCount(**again, "Before"), 200u);
        }
        return reached;
    }

    /// Strides through the operations, of a store in use and of a new one; a long test leaves none out.
    void failEverywhere(FaultyFileSystem::Fault fault, int strideInUse, int strideNew) {
        TemporaryFolder used;
        prepare(used.path());
        const auto ready = used.path();
        for (const bool fresh : {false, true}) {
            for (int n = 0;; n += longTests() ? 1 : fresh ? strideNew : strideInUse) {
                SCOPED_TRACE("operation " + std::to_string(n) + (fresh ? " of a new store" : ""));
                if (!runWithFault(n, fault, fresh ? nullptr : &ready) || HasFailure()) break;
            }
        }
    }
};

}  // namespace

TEST_F(Disk, OneFailedOperationFailsOneChangeAndHurtsNothing) {
    failEverywhere(FaultyFileSystem::Fault::OneFailure, 3, 7);
}

TEST_F(Disk, AFullDiskIsSaidToBeFullAndHurtsNothing) {
    failEverywhere(FaultyFileSystem::Fault::FullDisk, 5, 7);
}

TEST_F(Disk, ABrokenDiskFailsEverythingUntilItIsWellAgain) {
    failEverywhere(FaultyFileSystem::Fault::BrokenDisk, 11, 13);
}

TEST_F(Disk, AFailedReadIsAnErrorAndNeverAnEmptyAnswer) {
    TemporaryFolder folder;
    prepare(folder.path());
    for (int n = 0;; ++n) {
        SCOPED_TRACE(n);
        disk.failAt(n, FaultyFileSystem::Fault::OneFailure, true);
        auto store = open(folder.path());
        if (store) {
            const auto samples = (*store)->samples(heartRate(), {}, VSObjectQueryNoLimit, {});
            if (samples) {
                EXPECT_EQ(samples->size(), 133u);
            } else {
                EXPECT_EQ(samples.error().code, VSErrorCode::Failed) << samples.error().message;
            }
            const auto sums = (*store)->statistics(steps(), {}, VSStatisticsOptionCumulativeSum);
            if (sums) {
                EXPECT_EQ(sums->sumQuantity()->value(), 10653);
            }
        }
        const bool reached = disk.operations() > n;
        disk.heal();
        if (store) {
            EXPECT_EQ(batchCount(**store, "Before"), 200u);
        }
        if (!reached || HasFailure()) break;
    }
}

TEST_F(Disk, ClosingOnABadDiskLosesNothing) {
    const std::vector<Step> steps = everyKind();
    for (const auto fault : {FaultyFileSystem::Fault::OneFailure, FaultyFileSystem::Fault::BrokenDisk,
                             FaultyFileSystem::Fault::FullDisk}) {
        for (int n = 0;; ++n) {
            SCOPED_TRACE(n);
            TemporaryFolder folder;
            std::set<size_t> acknowledged;
            auto store = open(folder.path());
            ASSERT_TRUE(store.ok());
            for (size_t i = 0; i < steps.size(); ++i) {
                EXPECT_OK(steps[i].run(**store));
                acknowledged.insert(i);
            }
            disk.failAt(n, fault);
            store = VSError{};
            const bool reached = disk.operations() > n;
            disk.heal();
            auto again = open(folder.path());
            ASSERT_TRUE(again.ok()) << again.error().message;
            expectKept(**again, steps, acknowledged);
            if (!reached || HasFailure()) break;
        }
    }
}

namespace {

/// A recorded run of the steps: the disk's events, and after how many of them each was acknowledged.
struct Recording {
    std::vector<FaultyFileSystem::Event> events;
    std::map<size_t, size_t> acknowledged;  // step -> events
};

struct PowerCut : Disk {
    Recording record(const std::filesystem::path& folder, const std::vector<Step>& steps,
                     bool survivesPowerLoss) {
        Recording recording;
        disk.startRecording(folder);
        auto store = open(folder, survivesPowerLoss);
        EXPECT_TRUE(store.ok());
        for (size_t i = 0; i < steps.size(); ++i) {
            EXPECT_OK(steps[i].run(**store));
            recording.acknowledged[i] = disk.recordedCount();
        }
        store = VSError{};
        recording.events = disk.recorded();
        return recording;
    }

    /// Cuts the power after every event, several times each.
    void cutEverywhere(const std::filesystem::path& before, const Recording& recording,
                       const std::vector<Step>& steps, bool survivesPowerLoss, size_t stride) {
        DiskModel model(before);
        for (size_t at = 0; at <= recording.events.size() && !HasFailure(); ++at) {
            if (at % (longTests() ? 1 : stride) == 0) {
                for (unsigned seed = 0; seed < (longTests() ? 8u : 2u); ++seed) {
                    SCOPED_TRACE("power cut after event " + std::to_string(at) + ", seed " +
                                 std::to_string(seed));
                    std::mt19937 random(static_cast<unsigned>(at) * 100 + seed);
                    TemporaryFolder left;
                    model.cut(left.path(), random);
                    std::set<size_t> acknowledged;
                    for (const auto& [step, events] : recording.acknowledged)
                        if (events <= at) acknowledged.insert(step);
                    auto store = open(left.path(), false);
                    ASSERT_TRUE(store.ok()) << store.error().message;
                    if (survivesPowerLoss)
                        expectKept(**store, steps, acknowledged);
                    else
                        expectPrefix(**store, steps);
                }
            }
            if (at < recording.events.size()) model.play(recording.events[at]);
        }
    }

    void playAndCut(const std::vector<Step>& steps, bool survivesPowerLoss, bool inUse, size_t stride) {
        TemporaryFolder folder, before;
        if (inUse) prepare(folder.path());
        std::filesystem::copy(folder.path(), before.path(), std::filesystem::copy_options::recursive);
        const Recording recording = record(folder.path(), steps, survivesPowerLoss);
        cutEverywhere(before.path(), recording, steps, survivesPowerLoss, stride);
    }

    /// What is there is what was saved first: only the last saves may be lost.
    static void expectPrefix(VSHealthStore& store, const std::vector<Step>& steps) {
        bool lost = false;
        for (size_t i = 0; i < steps.size(); ++i) {
            const auto state = steps[i].state(store);
            EXPECT_NE(state, Step::Torn) << "step " << i;
            EXPECT_FALSE(lost && state == Step::Whole) << "step " << i << " is there and an earlier one not";
            if (state != Step::Whole) lost = true;
        }
        expectSound(store);
    }
};

}  // namespace

TEST_F(PowerCut, NoAcknowledgedChangeIsLost) {
    playAndCut(everyKind(), true, true, 5);
    playAndCut(everyKind(), true, false, 7);
}

TEST_F(PowerCut, WithoutSurvivingItOnlyTheLastChangesAreLost) {
    playAndCut({save("1", 20), import("2", 300), save("3", 5), defaultValue(), save("4", 1)}, false, true, 3);
}
