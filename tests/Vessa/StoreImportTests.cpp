#include <gtest/gtest.h>

#include <algorithm>

#include "StoreTestSupport.h"
#include "Vessa/VSDatabase.h"

using namespace test;

namespace {

using Outcome = VSHealthStore::ImportTransaction::Outcome;

struct Tally {
    int added = 0, present = 0;
    friend bool operator==(const Tally&, const Tally&) = default;
};
std::ostream& operator<<(std::ostream& stream, const Tally& tally) {
    return stream << tally.added << " added, " << tally.present << " present";
}

struct StoreImport : testing::Test {
    FixedEnvironment environment;
    TemporaryFolder folder;
    std::shared_ptr<VSHealthStore> store = openStore(folder.path());

    Tally import(const std::vector<VSSamplePtr>& records) {
        auto transaction = store->beginImport("document");
        EXPECT_TRUE(transaction.ok());
        Tally tally;
        for (const auto& record : records) {
            const auto outcome = (*transaction)->add(*record);
            EXPECT_TRUE(outcome.ok()) << outcome.error().message;
            ++(*outcome == Outcome::Added ? tally.added : tally.present);
        }
        EXPECT_OK((*transaction)->commit());
        return tally;
    }
    size_t count(VSTypeCode code) { return allSamples(*store, type(code)).size(); }
};

VSSamplePtr pulse(double value, const std::string& start, VSProvenance provenance = from("Watch")) {
    return quantity(heartRate(), value, start, start, std::move(provenance));
}

VSSamplePtr reading(const std::vector<VSSamplePtr>& members) {
    return std::make_shared<VSCorrelation>(type(VSCode::BloodPressure), members[0]->startDate(),
                                           members[0]->endDate(), members, from("Cuff"));
}

std::vector<VSSamplePtr> pressure(double systolic, double diastolic,
                                  const std::string& when = "2020-03-01T08:00") {
    return {quantity(type(VSCode::BloodPressureSystolic), systolic, when, when, from("Cuff")),
            quantity(type(VSCode::BloodPressureDiastolic), diastolic, when, when, from("Cuff"))};
}

}  // namespace

TEST_F(StoreImport, IdenticalRecordsAreCountedAndNeverAddedTwice) {
    const auto same = pulse(60, "2020-03-01T08:00");
    EXPECT_EQ(import({same, same, pulse(61, "2020-03-01T08:00")}), (Tally{3, 0}));
    EXPECT_EQ(import({same, same, pulse(61, "2020-03-01T08:00")}), (Tally{0, 3}));
    EXPECT_EQ(import({same, same, same}), (Tally{1, 2}));
    EXPECT_EQ(import({same}), (Tally{0, 1}));
    EXPECT_EQ(count(VSCode::HeartRate), 4u);
    expectSound(*store);
}

TEST_F(StoreImport, EqualMeansEverythingThatTheDocumentSays) {
    auto base = from("Watch", "1");
    base.device = std::make_shared<VSDevice>(VSDevice::fromDescription("name:Band, hardware:1"));
    base.metadata = std::make_shared<VSMetadata>(VSMetadata{{"k", "v"}});
    base.creationDate = date("2020-03-01T09:00");
    base.timeZoneOffset = 3600;
    EXPECT_EQ(import({pulse(60, "2020-03-01T08:00", base)}), (Tally{1, 0}));
    std::vector<VSSamplePtr> different(5);
    for (size_t i = 0; i < different.size(); ++i) {
        VSProvenance other = base;
        if (i == 0) other.sourceRevision = from("Watch", "2").sourceRevision;
        if (i == 1) other.device = nullptr;
        if (i == 2) other.metadata = std::make_shared<VSMetadata>(VSMetadata{{"k", "w"}});
        if (i == 3) other.creationDate = date("2020-03-01T09:01");
        different[i] = i == 4 ? quantity(heartRate(), 60, "2020-03-01T08:00", "2020-03-01T08:01", other)
                              : pulse(60, "2020-03-01T08:00", other);
    }
    EXPECT_EQ(import(different), (Tally{5, 0}));
    EXPECT_EQ(import(different), (Tally{0, 5}));
    VSProvenance silent = base;  // says nothing of these
    silent.creationDate = std::nullopt;
    silent.timeZoneOffset = std::nullopt;
    EXPECT_EQ(import({pulse(60, "2020-03-01T08:00", silent)}), (Tally{0, 1}));
    // The same quantity in another unit, which rounds.
    const VSObjectType* distance = type(VSCode::DistanceWalkingRunning);
    const auto inUnit = [&](const char* unit, double value) {
        return std::make_shared<VSQuantitySample>(distance, VSQuantity(VSUnit::fromString(unit), value),
                                                  date("2020-03-01"), date("2020-03-01"), base);
    };
    EXPECT_EQ(import({inUnit("km", 1.1)}), (Tally{1, 0}));
    EXPECT_EQ(import({inUnit("m", 1100)}), (Tally{0, 1}));
    expectSound(*store);
}

TEST_F(StoreImport, MembersJoinTheirTopLevelRecordsInAnyOrder) {
    const auto first = pressure(120, 80), second = pressure(120, 80);  // the same reading twice
    const std::vector<std::vector<VSSamplePtr>> documents = {
        {first[0], first[1], second[0], second[1], reading(first), reading(second)},
        {reading(first), reading(second), first[0], second[0], first[1], second[1]},
        {first[0], reading(first), first[1], second[0], second[1], reading(second)},
    };
    for (const auto& document : documents) {
        SCOPED_TRACE(&document - documents.data());
        TemporaryFolder other;
        store = openStore(other.path());
        EXPECT_EQ(import(document), (Tally{6, 0}));
        EXPECT_EQ(count(VSCode::BloodPressure), 2u);
        EXPECT_EQ(count(VSCode::BloodPressureSystolic), 2u);
        EXPECT_EQ(count(VSCode::BloodPressureDiastolic), 2u);
        VSPredicate alone;
        alone.noCorrelation = true;
        EXPECT_TRUE(store->samples(type(VSCode::BloodPressureSystolic), alone, 0, {})->empty())
            << "each is a member of one";
        for (const auto& again : documents) EXPECT_EQ(import(again), (Tally{0, 6}));
        expectSound(*store);
        store.reset();
    }
}

TEST_F(StoreImport, ANewReadingTakesValuesThatWereAloneBefore) {
    const auto values = pressure(120, 80);
    EXPECT_EQ(import({values[0], values[1]}), (Tally{2, 0}));
    EXPECT_EQ(import({values[0], values[1], reading(values)}), (Tally{1, 2}));
    EXPECT_EQ(count(VSCode::BloodPressureSystolic), 1u);
    expectSound(*store);
}

TEST_F(StoreImport, WhatIsNotCommittedLeavesNoTraceAndBlocksNobodyAfterwards) {
    EXPECT_EQ(import({pulse(60, "2020-03-01T08:00")}), (Tally{1, 0}));
    {
        auto transaction = store->beginImport("cancelled");
        ASSERT_TRUE(transaction.ok());
        for (int i = 0; i < 1000; ++i)
            ASSERT_TRUE((*transaction)->add(*pulse(i, "2020-03-02T08:00", from("New"))).ok());
        EXPECT_EQ(*(*transaction)->setCharacteristicsIfUnset(VSBirthDate{1970, 1, 1}, 1, 0, 0), 2);
        EXPECT_EQ(count(VSCode::HeartRate), 1u) << "nobody sees it before the commit";
        const auto second = store->beginImport("second", std::chrono::milliseconds(50));
        ASSERT_FALSE(second.ok());
        EXPECT_EQ(second.error().code, VSErrorCode::NotAccessible);
    }
    EXPECT_EQ(count(VSCode::HeartRate), 1u);
    EXPECT_EQ(*store->biologicalSex(), 0);
    EXPECT_EQ(store->sourceSummaries()->size(), 1u);
    EXPECT_OK(store->saveObjectsAndWait({pulse(1, "2020-03-03T08:00")}));
    expectSound(*store);
}

TEST_F(StoreImport, ASaveWaitsForAnImportAndQueriesHearOfItsCommit) {
    Log<size_t> told;
    auto query =
        std::make_shared<VSObserverQuery>(heartRate(), VSPredicate(), [&](const auto&) { told.add(0); });
    store->executeQuery(query);
    ASSERT_TRUE(told.waitFor(1));
    auto transaction = store->beginImport("document");
    ASSERT_TRUE((*transaction)->add(*pulse(60, "2020-03-01T08:00")).ok());
    Promise<bool> saved;
    store->saveObject(pulse(61, "2020-03-01T08:01"), [&](const VSStatus& status) { saved.set(status.ok()); });
    EXPECT_OK((*transaction)->commit());
    EXPECT_FALSE((*transaction)->commit().ok()) << "it has ended";
    EXPECT_EQ(saved.wait(), true);
    ASSERT_TRUE(told.waitFor(2));
    EXPECT_EQ(count(VSCode::HeartRate), 2u);
    store.reset();  // before what its handlers use
}

TEST_F(StoreImport, SetsOnlyCharacteristicsThatAreNotSet) {
    EXPECT_OK(wait([&](auto done) { store->setCharacteristic(type(VSCode::BiologicalSex), 2, done); }));
    auto transaction = store->beginImport("document");
    EXPECT_EQ(*(*transaction)->setCharacteristicsIfUnset(VSBirthDate{1970, 1, 1}, 1, 3, 0), 2);
    EXPECT_OK((*transaction)->commit());
    EXPECT_EQ(*store->biologicalSex(), 2);
    EXPECT_EQ(*store->bloodType(), 3);
    EXPECT_EQ(*store->dateOfBirth(), (VSBirthDate{1970, 1, 1}));
}

TEST_F(StoreImport, ABadRecordIsRefusedAndTheOthersGoOn) {
    auto transaction = store->beginImport("document");
    const auto bad = std::make_shared<VSCategorySample>(type(VSCode::SleepAnalysis), 77, date("2020-03-01"),
                                                        date("2020-03-01"));
    const auto outcome = (*transaction)->add(*bad);
    ASSERT_FALSE(outcome.ok());
    EXPECT_EQ(outcome.error().code, VSErrorCode::Invalid);
    EXPECT_TRUE((*transaction)->add(*pulse(60, "2020-03-01T08:00")).ok());
    EXPECT_OK((*transaction)->commit());
    EXPECT_EQ(count(VSCode::HeartRate), 1u);
}

TEST_F(StoreImport, ADocumentOfAnotherSeasonSaysTheSame) {
    const auto made = [](std::optional<int> offset, const std::string& created) {
        VSProvenance provenance = from("Wrist tracker", "1.0");
        provenance.timeZoneOffset = offset;
        provenance.creationDate = date(created);
        return quantity(type(VSCode::StepCount), 100, date("2020-01-09T10:00"), date("2020-01-09T11:00"),
                        provenance);
    };
    EXPECT_OK(store->saveObjectsAndWait({made(std::nullopt, "2020-01-09T11:00:05.75")}));
    EXPECT_EQ(import({made(3600, "2020-01-09T11:00:05")}), (Tally{0, 1}));
    EXPECT_EQ(import({made(7200, "2020-01-09T11:00:05")}), (Tally{0, 1}));
    EXPECT_EQ(import({made(3600, "2020-01-09T11:00:06")}), (Tally{1, 0})) << "another record";
    EXPECT_EQ(import({made(7200, "2020-01-09T11:00:06")}), (Tally{0, 1}));
    EXPECT_EQ(count(VSCode::StepCount), 2u);
    expectSound(*store);
}

TEST_F(StoreImport, ManyRecordsOfOneStartAreFoundAgainInNoTime) {
    // All alike, with two creations and without any, and all different:
    // looked at one by one, these would be ten billion comparisons.
    constexpr int count = 100'000;
    std::vector<VSSamplePtr> records;
    VSProvenance created = from("Watch");
    for (int i = 0; i < count; ++i) {
        created.creationDate = date("2020-03-01T09:00") + std::chrono::seconds(i % 2);
        records.push_back(i % 3 ? pulse(i % 4 < 2 ? 60 : 1000 + i, "2020-03-01T08:00", created)
                                : pulse(61, "2020-03-01T08:00"));
    }
    EXPECT_EQ(import(records), (Tally{count, 0}));
    std::reverse(records.begin() + count / 2, records.end());
    EXPECT_EQ(import(records), (Tally{0, count}));
    records.push_back(pulse(61, "2020-03-01T08:00"));
    records.push_back(pulse(61 * (1 + 1e-13), "2020-03-01T08:00"));
    EXPECT_EQ(import(records), (Tally{2, count}));
    EXPECT_EQ(import(records), (Tally{0, count + 2}));
    // Members too, which join the records of the same moment.
    std::vector<VSSamplePtr> readings;
    for (int i = 0; i < 300; ++i) readings.push_back(reading(pressure(120 + i % 3, 80)));
    EXPECT_EQ(import(readings), (Tally{300, 0}));
    for (int i = 0; i < 300; ++i) readings.push_back(pressure(120 + i % 3, 80)[0]);
    EXPECT_EQ(import(readings), (Tally{0, 600}));
    EXPECT_EQ(this->count(VSCode::BloodPressureSystolic), 300u);
    expectSound(*store);
}
