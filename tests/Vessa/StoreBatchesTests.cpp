#include <gtest/gtest.h>

#include <algorithm>
#include <map>
#include <random>
#include <set>

#include "StoreTestSupport.h"

using namespace test;

namespace {

VSSamplePtr pulse(double value, int minute, const std::string& source = "Watch") {
    const VSDate start = date("2020-03-01T08:00") + std::chrono::minutes(minute);
    return quantity(heartRate(), value, start, start, from(source));
}

VSSamplePtr pressure(double systolic, double diastolic, int minute) {
    const VSDate when = date("2020-03-01T08:00") + std::chrono::minutes(minute);
    const auto value = [&](VSTypeCode code, double number) {
        return quantity(type(code), number, when, when, from("Cuff"));
    };
    return std::make_shared<VSCorrelation>(
        type(VSCode::BloodPressure), when, when,
        std::vector<VSSamplePtr>{value(VSCode::BloodPressureSystolic, systolic),
                                 value(VSCode::BloodPressureDiastolic, diastolic)},
        from("Cuff"));
}

struct Person {
    std::optional<VSBirthDate> birthDate;
    int sex = 0;
};

struct StoreBatches : testing::Test {
    FixedEnvironment environment;
    TemporaryFolder folder;
    std::shared_ptr<VSHealthStore> store = openStore(folder.path());

    /// The number of its batch; 0: it became none.
    int64_t import(const std::vector<VSSamplePtr>& records, const Person& person = {}) {
        auto transaction = store->beginImport("a.xml, b.zip");
        EXPECT_TRUE(transaction.ok());
        for (const auto& record : records) EXPECT_TRUE((*transaction)->add(*record).ok());
        EXPECT_TRUE((*transaction)->setCharacteristicsIfUnset(person.birthDate, person.sex, 0, 0).ok());
        const size_t before = batches().size();
        EXPECT_OK((*transaction)->commit());
        const auto after = batches();
        return after.size() > before ? after.back().id : 0;
    }
    std::vector<VSBatch> batches() {
        auto list = store->batches();
        EXPECT_TRUE(list.ok()) << list.error().message;
        return *list;
    }
    VSUndoReport undo(int64_t batch) {
        const auto report = store->undoBatch(batch);
        EXPECT_TRUE(report.ok()) << report.error().message;
        return report ? *report : VSUndoReport();
    }
    size_t count(VSTypeCode code) { return allSamples(*store, type(code)).size(); }
};

/// The definition, as simply as possible: each row of the store with what it says and the imports that have
/// it. What nobody has any more goes, unless it was entered by hand.
class Model {
 public:
    struct Row {
        std::string content;
        std::vector<size_t> members;
        int64_t adder = 0;  // 0: by hand
        std::set<int64_t> owners;
        bool alive = true;
    };

    /// Of a sample by itself, and of a correlation's members.
    static std::string contentOf(const VSSample& sample) {
        std::string text = std::string(sample.sampleType()->name()) + " " +
                           std::to_string(sample.startDate().microseconds()) + " " +
                           std::to_string(sample.endDate().microseconds()) + " " +
                           sample.sourceRevision().source.name;
        if (const auto* number = dynamic_cast<const VSQuantitySample*>(&sample))
            text += " " + std::to_string(
                              number->quantity().doubleValueForUnit(sample.sampleType()->canonicalUnit()));
        return text;
    }

    void enter(const VSSample& sample) { insert(sample, 0); }

    /// Returns how many records were there already.
    int import(const std::vector<VSSamplePtr>& records, int64_t batch) {
        const size_t before = rows_.size();
        std::set<size_t> usedAlone, usedAsMember;
        int present = 0;
        for (const auto& record : records) {
            const auto* correlation = dynamic_cast<const VSCorrelation*>(record.get());
            const size_t found = find(*record, usedAlone, correlation ? before : rows_.size());
            if (found < before) ++present;
            if (found < rows_.size()) {
                own(found, batch);
                usedAlone.insert(found);
                for (size_t member : rows_[found].members) own(member, batch), usedAsMember.insert(member);
                continue;
            }
            std::vector<size_t> members;
            if (correlation) {
                for (const auto& object : correlation->objects()) {
                    size_t member = find(*object, usedAsMember, rows_.size());
                    if (member == rows_.size()) insert(*object, batch);
                    own(member, batch);
                    usedAsMember.insert(member);
                    members.push_back(member);
                }
            }
            usedAlone.insert(insert(*record, batch));
            rows_.back().members = members;
        }
        return present;
    }

    VSUndoReport undo(int64_t batch) {
        VSUndoReport report;
        for (Row& row : rows_) {
            const bool held = row.adder == batch ||
                              (row.adder && undone_.contains(row.adder) && row.owners.contains(batch));
            if (row.adder == batch && !row.alive) ++report.gone;
            row.owners.erase(batch);
            if (!held || !row.alive) continue;
            ++(row.owners.empty() ? report.removed : report.kept);
            row.alive = !row.owners.empty();
        }
        undone_.insert(batch);
        report.removed += leave();
        return report;
    }

    void remove(size_t index) {
        for (size_t i = 0; i < rows_.size(); ++i) {
            if (rows_[i].alive && index-- == 0) {
                rows_[i].alive = false;
                break;
            }
        }
        leave();
    }

    std::multiset<std::string> contents() const {
        std::multiset<std::string> result;
        for (const Row& row : rows_)
            if (row.alive) result.insert(row.content);
        return result;
    }
    /// Added by a batch, and still there.
    std::pair<int64_t, int64_t> addedAndPresent(int64_t batch) const {
        std::pair<int64_t, int64_t> counts;
        for (const Row& row : rows_) {
            if (row.adder != batch) continue;
            ++counts.first;
            counts.second += row.alive;
        }
        return counts;
    }
    bool hasOwned(int64_t batch) const {
        return std::any_of(rows_.begin(), rows_.end(),
                           [&](const Row& row) { return row.owners.contains(batch); });
    }

 private:
    size_t find(const VSSample& sample, const std::set<size_t>& used, size_t end) const {
        const std::string content = contentOf(sample);
        for (size_t i = 0; i < end; ++i) {
            if (rows_[i].alive && rows_[i].content == content && !used.contains(i) &&
                sameMembers(sample, rows_[i]))
                return i;
        }
        return rows_.size();
    }
    bool sameMembers(const VSSample& sample, const Row& row) const {
        std::multiset<std::string> wanted, there;
        if (const auto* correlation = dynamic_cast<const VSCorrelation*>(&sample))
            for (const auto& object : correlation->objects()) wanted.insert(contentOf(*object));
        for (size_t member : row.members) there.insert(rows_[member].content);
        return wanted == there;
    }
    size_t insert(const VSSample& sample, int64_t batch) {
        rows_.push_back({contentOf(sample), {}, batch, {}, true});
        own(rows_.size() - 1, batch);
        return rows_.size() - 1;
    }
    void own(size_t row, int64_t batch) {
        if (batch) rows_[row].owners.insert(batch);
    }
    /// A row that went is nobody's member any more; what has lost its last member goes too. Returns how many.
    int64_t leave() {
        int64_t gone = 0;
        for (Row& row : rows_) {
            const auto left = std::erase_if(row.members, [&](size_t m) { return !rows_[m].alive; });
            if (!row.alive || !left || !row.members.empty()) continue;
            row.alive = false;
            ++gone;
        }
        return gone;
    }

    std::vector<Row> rows_;
    std::set<int64_t> undone_;
};

constexpr VSTypeCode recorded[] = {VSCode::HeartRate, VSCode::StepCount, VSCode::BloodPressureSystolic,
                                   VSCode::BloodPressureDiastolic, VSCode::BloodPressure};

std::vector<VSSamplePtr> samplesInOrder(VSHealthStore& store) {
    std::vector<VSSamplePtr> all;
    for (VSTypeCode code : recorded) {
        for (const auto& sample : allSamples(store, type(code))) all.push_back(sample);
    }
    std::sort(all.begin(), all.end(), [](const VSSamplePtr& a, const VSSamplePtr& b) {
        return VSObjectIDValue(a->dataID()) < VSObjectIDValue(b->dataID());
    });
    return all;
}

void expectSame(const Model& model, VSHealthStore& store) {
    std::multiset<std::string> contents;
    for (const auto& sample : samplesInOrder(store)) contents.insert(Model::contentOf(*sample));
    EXPECT_EQ(contents, model.contents());
    const auto batches = store.batches();
    ASSERT_TRUE(batches.ok());
    for (const VSBatch& batch : *batches)
        EXPECT_EQ(std::pair(batch.added, batch.present), model.addedAndPresent(batch.id)) << batch.id;
    expectSound(store);
}

/// Few contents, so that imports overlap all the time.
struct RandomRecords {
    std::mt19937 random;
    int below(int limit) { return static_cast<int>(random() % static_cast<unsigned>(limit)); }
    VSSamplePtr next() {
        const std::string source = below(2) ? "Watch" : "Phone";
        const int minute = below(4), kind = below(5);
        if (kind == 0) return pressure(120 + below(2), 80, minute);
        if (kind == 1)
            return dynamic_cast<const VSCorrelation&>(*pressure(120 + below(2), 80, minute)).objects()[0];
        if (kind == 2) {
            const VSDate start = date("2020-02-29T23:00") + std::chrono::hours(minute);
            return quantity(steps(), 100 + below(2), start, start + std::chrono::hours(40 * below(3)),
                            from(source));
        }
        return pulse(60 + below(2), minute, source);
    }
    std::vector<VSSamplePtr> some(int most) {
        std::vector<VSSamplePtr> records;
        for (int i = below(most) + 1; i > 0; --i) records.push_back(next());
        return records;
    }
};

void expectEmptyAsNew(VSHealthStore& store) {
    EXPECT_EQ(store.typeSummaries()->size(), 0u);
    EXPECT_EQ(store.sourceSummaries()->size(), 0u);
    for (VSTypeCode code : recorded) {
        Promise<size_t> sources;
        store.orderedSources(type(code),
                             [&](const auto& list) { sources.set(list.ok() ? list->size() : 99); });
        EXPECT_EQ(sources.wait(), 0u);
        const auto statistics = store.statistics(type(code), {}, 0);
        if (type(code)->isQuantityType()) {
            ASSERT_TRUE(statistics.ok());
            EXPECT_FALSE(statistics->sumQuantity() || statistics->averageQuantity());
        }
    }
    EXPECT_TRUE(store.batches()->empty());
    expectSound(store);
}

}  // namespace

TEST_F(StoreBatches, AnImportIsABatchAndIsTakenBackWhole) {
    const int64_t first = import({pulse(60, 0), pulse(60, 0), pressure(120, 80, 1)});
    const auto list = batches();
    ASSERT_EQ(list.size(), 1u);
    EXPECT_EQ(list[0].name, "a.xml, b.zip");
    EXPECT_EQ(list[0].date, date("2020-03-31T20:00"));
    EXPECT_EQ(list[0].added, 5);
    EXPECT_EQ(list[0].present, 5);
    EXPECT_EQ(import({}), 0) << "nothing is no batch";
    EXPECT_OK(wait([&](auto done) { store->deleteObject(allSamples(*store, heartRate())[0], done); }));
    EXPECT_EQ(batches()[0].present, 4);
    const VSUndoReport report = undo(first);
    EXPECT_EQ(report.removed, 4);
    EXPECT_EQ(report.kept, 0);
    EXPECT_EQ(report.gone, 1);
    expectEmptyAsNew(*store);
    for (int64_t batch : {first, first + 1, int64_t{0}}) {
        const auto again = store->undoBatch(batch);
        ASSERT_FALSE(again.ok());
        EXPECT_EQ(again.error().code, VSErrorCode::NotFound);
    }
    EXPECT_GT(import({pulse(60, 0)}), first) << "a batch's number is never used again";
}

TEST_F(StoreBatches, WhatAnotherImportHasTooStaysUntilItGoes) {
    const int64_t first = import({pulse(60, 0), pulse(61, 1)});
    const int64_t same = import({pulse(60, 0), pulse(61, 1)});
    const int64_t part = import({pulse(61, 1), pulse(62, 2)});
    ASSERT_NE(same, 0) << "an import that found everything is a batch too";
    EXPECT_EQ(undo(first).kept, 2);
    EXPECT_EQ(count(VSCode::HeartRate), 3u);
    const VSUndoReport ofSame = undo(same);
    EXPECT_EQ(ofSame.removed, 1) << "only this one had it any more";
    EXPECT_EQ(ofSame.kept, 1);
    EXPECT_EQ(undo(part).removed, 2);
    expectEmptyAsNew(*store);
}

TEST_F(StoreBatches, EntriesByHandAreNeverTouched) {
    EXPECT_OK(store->saveObjectsAndWait({pulse(60, 0), pressure(120, 80, 0)}));
    const int64_t batch = import({pulse(60, 0), pulse(60, 0), pressure(120, 80, 0), pressure(130, 80, 0)});
    EXPECT_OK(store->saveObjectsAndWait({pulse(63, 3)}));
    const VSUndoReport report = undo(batch);
    EXPECT_EQ(report.removed, 4)
        << "the second pulse, and a reading with one value of its own and one in common";
    EXPECT_EQ(count(VSCode::HeartRate), 2u);
    EXPECT_EQ(count(VSCode::BloodPressure), 1u);
    expectSound(*store);
}

TEST_F(StoreBatches, ParentsHearOfMembersThatGo) {
    const int64_t batch = import({pulse(60, 1), pulse(61, 2)});
    const auto imported = allSamples(*store, heartRate());
    const VSDate when = imported[0]->startDate();
    const auto byHand = [&](std::vector<VSSamplePtr> members) -> VSSamplePtr {
        return std::make_shared<VSCorrelation>(type(VSCode::BloodPressure), when, when, std::move(members),
                                               from("I"));
    };
    const VSSamplePtr workout = std::make_shared<VSWorkout>(
        1, when, when, VSDuration(0), std::nullopt, std::nullopt, std::vector<VSWorkoutEvent>(), from("I"));
    EXPECT_OK(
        store->saveObjectsAndWait({byHand({imported[0]}), byHand({imported[1], pulse(62, 3)}), workout}));
    EXPECT_OK(wait([&](auto done) { store->addSamplesToWorkout(imported, workout, done); }));
    Log<size_t> readings;
    const auto query = std::make_shared<VSAnchoredObjectQuery>(
        type(VSCode::BloodPressure), VSPredicate(), VSQueryAnchor(), VSObjectQueryNoLimit,
        [&](const auto& answer) { readings.add(answer->added.size()); });
    query->updateHandler = [&](const auto& answer) { readings.add(answer->deleted.size()); };
    Log<int> workouts;
    const auto observer = std::make_shared<VSObserverQuery>(type(VSCode::Workout), VSPredicate(),
                                                            [&](const auto&) { workouts.add(0); });
    store->executeQuery(query);
    store->executeQuery(observer);
    ASSERT_TRUE(readings.waitFor(1) && workouts.waitFor(1));
    EXPECT_EQ(undo(batch).removed, 3) << "two pulses, and the correlation of nothing else";
    ASSERT_TRUE(readings.waitFor(2) && workouts.waitFor(2));
    EXPECT_EQ(readings.entries(), (std::vector<size_t>{2, 1}));
    ASSERT_EQ(count(VSCode::BloodPressure), 1u);
    const auto left =
        std::dynamic_pointer_cast<const VSCorrelation>(allSamples(*store, type(VSCode::BloodPressure))[0]);
    EXPECT_EQ(left->objects().size(), 1u);
    EXPECT_EQ(count(VSCode::Workout), 1u);
    expectSound(*store);
    EXPECT_OK(wait([&](auto done) { store->deleteObject(left->objects()[0], done); }));
    EXPECT_EQ(count(VSCode::BloodPressure), 0u);
    store.reset();  // before what its handlers use
}

TEST_F(StoreBatches, QueriesHearOfDeletedObjects) {
    EXPECT_OK(store->saveObjectsAndWait({pulse(59, 0)}));
    const int64_t batch = import({pulse(60, 1), pulse(61, 2)});
    struct Told {
        size_t added, deleted;
    };
    Log<Told> told;
    const auto tell = [&](const VSResult<VSAnchoredObjectQuery::Answer>& answer) {
        told.add({answer->added.size(), answer->deleted.size()});
    };
    const auto query = std::make_shared<VSAnchoredObjectQuery>(heartRate(), VSPredicate(), VSQueryAnchor(),
                                                               VSObjectQueryNoLimit, tell);
    query->updateHandler = tell;
    store->executeQuery(query);
    ASSERT_TRUE(told.waitFor(1));
    EXPECT_EQ(told.entries()[0].added, 3u);
    undo(batch);
    ASSERT_TRUE(told.waitFor(2));
    EXPECT_EQ(told.entries()[1].deleted, 2u);
    store.reset();  // before what its handlers use
}

TEST_F(StoreBatches, CharacteristicsFollowTheirImports) {
    const VSBirthDate birth{1970, 1, 1};
    const int64_t first = import({pulse(60, 0)}, {birth, 1});
    const int64_t second = import({}, {birth, 2});
    EXPECT_EQ(*store->biologicalSex(), 1);
    EXPECT_EQ(undo(first).characteristics, 1);
    EXPECT_EQ(*store->biologicalSex(), 0);
    EXPECT_EQ(*store->dateOfBirth(), birth) << "the second one told it too";
    EXPECT_EQ(undo(second).characteristics, 1);
    EXPECT_EQ(*store->dateOfBirth(), std::nullopt);
    // A value by hand is not the import's, be it another or the same.
    const int64_t third = import({}, {birth, 1});
    EXPECT_OK(wait([&](auto done) { store->setCharacteristic(type(VSCode::BiologicalSex), 2, done); }));
    EXPECT_EQ(undo(third).characteristics, 1);
    EXPECT_EQ(*store->biologicalSex(), 2);
    EXPECT_EQ(undo(import({}, {std::nullopt, 2})).characteristics, 0);
    EXPECT_EQ(*store->biologicalSex(), 2);
    // Also the import's own value, once the person has said it.
    const int64_t fourth = import({}, {birth});
    for (const VSBirthDate& entered : {VSBirthDate{1971, 1, 1}, birth})
        EXPECT_OK(wait([&](auto done) { store->setDateOfBirth(entered, done); }));
    EXPECT_EQ(undo(fourth).characteristics, 0);
    EXPECT_EQ(*store->dateOfBirth(), birth);
}

TEST_F(StoreBatches, RandomImportsAndUndosAgreeWithTheDefinition) {
    for (unsigned seed = 1; seed <= 25; ++seed) {
        SCOPED_TRACE(seed);
        TemporaryFolder other;
        store = openStore(other.path());
        RandomRecords records{std::mt19937(seed)};
        Model model;
        for (int step = 0; step < 18 && !HasFailure(); ++step) {
            SCOPED_TRACE(step);
            const auto live = batches();
            const int what = records.below(6);
            if (what == 0) {
                const auto sample = pulse(60 + records.below(2), records.below(4));
                model.enter(*sample);
                EXPECT_OK(store->saveObjectsAndWait({sample}));
            } else if (what == 1 && !model.contents().empty()) {
                const auto samples = samplesInOrder(*store);
                const size_t index = static_cast<size_t>(records.below(static_cast<int>(samples.size())));
                model.remove(index);
                EXPECT_OK(wait([&](auto done) { store->deleteObject(samples[index], done); }));
            } else if (what == 2 && !live.empty()) {
                const int64_t batch =
                    live[static_cast<size_t>(records.below(static_cast<int>(live.size())))].id;
                const VSUndoReport expected = model.undo(batch), report = undo(batch);
                EXPECT_EQ(report.removed, expected.removed);
                EXPECT_EQ(report.kept, expected.kept);
                EXPECT_EQ(report.gone, expected.gone);
            } else {
                const auto document = records.some(12);
                const int64_t batch = import(document);
                model.import(document, batch);
            }
            expectSame(model, *store);
        }
        for (auto live = batches(); !live.empty(); live = batches()) {
            const int64_t batch = live[static_cast<size_t>(records.below(static_cast<int>(live.size())))].id;
            model.undo(batch);
            undo(batch);
            expectSame(model, *store);
        }
        EXPECT_OK(wait([&](auto done) {
            store->deleteAllSamples(
                {heartRate(), steps(), type(VSCode::BloodPressure), type(VSCode::BloodPressureSystolic),
                 type(VSCode::BloodPressureDiastolic)},
                std::nullopt, done);
        }));
        expectEmptyAsNew(*store);
        store.reset();
    }
}
