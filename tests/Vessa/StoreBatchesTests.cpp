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
    return bloodPressure(systolic, diastolic, date("2020-03-01T08:00") + std::chrono::minutes(minute),
                         from("Cuff"));
}

struct Person {
    std::optional<VSBirthDate> birthDate;
    int sex = 0;
};

struct StoreBatches : StoreTest {
    /// The number of its batch; 0: it became none.
    int64_t import(const std::vector<VSSamplePtr>& records, const Person& person = {}) {
        auto transaction = store->beginImport("a.xml, b.zip");
        EXPECT_TRUE(transaction.ok());
        alreadyPresent = 0;
        for (const auto& record : records) {
            const auto outcome = (*transaction)->add(*record);
            EXPECT_TRUE(outcome.ok());
            alreadyPresent += *outcome == VSHealthStore::ImportTransaction::Outcome::AlreadyPresent;
        }
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
    int alreadyPresent = 0;  // of the last import's records
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

    /// Of a sample with its members.
    static std::string wholeContentOf(const VSSample& sample) {
        const auto* correlation = dynamic_cast<const VSCorrelation*>(&sample);
        return contentOf(sample) + together(correlation ? correlation->objects() : std::vector<VSSamplePtr>(),
                                            [](const VSSamplePtr& member) { return contentOf(*member); });
    }
    /// Of a sample by itself.
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

    void enter(const VSSample& sample) {
        std::vector<size_t> members;
        if (const auto* correlation = dynamic_cast<const VSCorrelation*>(&sample))
            for (const auto& object : correlation->objects()) members.push_back(insert(*object, 0));
        insert(sample, 0);
        rows_.back().members = members;
    }

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
            if (row.alive) result.insert(wholeContentOf(row));
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

 private:
    template <typename Members, typename Content>
    static std::string together(const Members& members, Content content) {
        std::multiset<std::string> contents;
        for (const auto& member : members) contents.insert(content(member));
        std::string text;
        for (const auto& one : contents) text += " (" + one + ")";
        return text;
    }
    size_t find(const VSSample& sample, const std::set<size_t>& used, size_t end) const {
        const std::string content = wholeContentOf(sample);
        for (size_t i = 0; i < end; ++i)
            if (rows_[i].alive && !used.contains(i) && wholeContentOf(rows_[i]) == content) return i;
        return rows_.size();
    }
    std::string wholeContentOf(const Row& row) const {
        return row.content + together(row.members, [&](size_t member) { return rows_[member].content; });
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
    for (const auto& sample : samplesInOrder(store)) contents.insert(Model::wholeContentOf(*sample));
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
        if (kind == 1) return membersOf(pressure(120 + below(2), 80, minute))[static_cast<size_t>(below(2))];
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
        EXPECT_TRUE(sourceOrderOf(store, type(code)).empty());
        if (!type(code)->isQuantityType()) continue;
        const auto statistics = store.statistics(type(code), {}, 0);
        ASSERT_TRUE(statistics.ok());
        EXPECT_FALSE(statistics->sumQuantity() || statistics->averageQuantity());
    }
    EXPECT_TRUE(store.batches()->empty());
    expectSound(store);
}

}  // namespace

TEST_F(StoreBatches, AnImportIsABatchAndIsTakenBackWhole) {
    const int64_t first = import({pulse(60, 0), pulse(60, 0), pressure(120, 80, 1)});
    ASSERT_EQ(batches().size(), 1u);
    EXPECT_EQ(batches()[0].name, "a.xml, b.zip");
    EXPECT_EQ(batches()[0].date, date("2020-03-31T20:00"));
    EXPECT_EQ(import({}), 0) << "nothing is no batch";
    EXPECT_EQ(undo(first).removed, 5);
    expectEmptyAsNew(*store);
    for (int64_t batch : {first, first + 1, int64_t{0}}) {
        const auto again = store->undoBatch(batch);
        ASSERT_FALSE(again.ok());
        EXPECT_EQ(again.error().code, VSErrorCode::NotFound);
    }
    EXPECT_GT(import({pulse(60, 0)}), first) << "a batch's number is never used again";
}

TEST_F(StoreBatches, QueriesHearOfWhatGoesAndSoDoParents) {
    const int64_t batch = import({pulse(60, 1), pulse(61, 2)});
    const auto imported = allSamples(*store, heartRate());
    const VSDate when = imported[0]->startDate();
    const VSSamplePtr workout = plainWorkout(when, when);
    save({bloodPressureOf({imported[0]}), bloodPressureOf({imported[1], pulse(62, 3)}), workout});
    EXPECT_OK(wait([&](auto done) { store->addSamplesToWorkout(imported, workout, done); }));
    Log<size_t> readings, pulses, workouts;
    const auto listen = [&](VSTypeCode code, Log<size_t>& told) {
        const auto query = std::make_shared<VSAnchoredObjectQuery>(
            type(code), VSPredicate(), VSQueryAnchor(), VSObjectQueryNoLimit,
            [&](const auto& answer) { told.add(answer->added.size()); });
        query->updateHandler = [&](const auto& answer) { told.add(answer->deleted.size()); };
        store->executeQuery(query);
        EXPECT_TRUE(told.waitFor(1));
    };
    listen(VSCode::BloodPressure, readings);
    listen(VSCode::HeartRate, pulses);
    store->executeQuery(std::make_shared<VSObserverQuery>(type(VSCode::Workout), VSPredicate(),
                                                          [&](const auto&) { workouts.add(0); }));
    ASSERT_TRUE(workouts.waitFor(1));
    EXPECT_EQ(undo(batch).removed, 3) << "two pulses, and the correlation of nothing else";
    ASSERT_TRUE(readings.waitFor(2) && pulses.waitFor(2) && workouts.waitFor(2));
    EXPECT_EQ(readings.entries(), (std::vector<size_t>{2, 1}));
    EXPECT_EQ(pulses.entries(), (std::vector<size_t>{3, 2}));
    ASSERT_EQ(count(VSCode::BloodPressure), 1u);
    const auto left = membersOf(allSamples(*store, type(VSCode::BloodPressure))[0]);
    EXPECT_EQ(left.size(), 1u);
    EXPECT_EQ(count(VSCode::Workout), 1u);
    expectSound(*store);
    EXPECT_OK(remove({left[0]}));
    EXPECT_EQ(count(VSCode::BloodPressure), 0u);
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
                const auto sample = records.next();
                model.enter(*sample);
                save({sample});
            } else if (what == 1 && !model.contents().empty()) {
                const auto samples = samplesInOrder(*store);
                const size_t index = static_cast<size_t>(records.below(static_cast<int>(samples.size())));
                model.remove(index);
                EXPECT_OK(remove({samples[index]}));
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
                EXPECT_EQ(alreadyPresent, model.import(document, batch));
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
