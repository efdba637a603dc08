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

/// What an import adds and finds is compared with its definition in StoreBatchesTests.
struct StoreImport : StoreTest {
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
};

VSSamplePtr pulse(double value, const std::string& start, VSProvenance provenance = from("Watch")) {
    return quantity(heartRate(), value, start, start, std::move(provenance));
}

VSSamplePtr reading(const std::vector<VSSamplePtr>& members) {
    return bloodPressureOf(members, from("Cuff"));
}

std::vector<VSSamplePtr> pressure(double systolic, double diastolic) {
    return membersOf(bloodPressure(systolic, diastolic, date("2020-03-01T08:00"), from("Cuff")));
}

}  // namespace

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
    // What an export leaves of more than six digits, in the unit of its day.
    EXPECT_EQ(import({inUnit("km", 2.3456781), inUnit("km", 2.34568)}), (Tally{2, 0}));
    EXPECT_EQ(import({inUnit("km", 2.34568), inUnit("km", 2.3456781)}), (Tally{0, 2}));
    EXPECT_EQ(import({inUnit("km", 2.34568), inUnit("m", 2345.68)}), (Tally{0, 2}));
    EXPECT_EQ(import({inUnit("mi", 1.45754), inUnit("mi", 1.45754)}), (Tally{0, 2}));
    EXPECT_EQ(import({inUnit("mi", 1.45755), inUnit("km", 2.3456782)}), (Tally{2, 0}));
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

TEST_F(StoreImport, ABadRecordIsRefusedAndTheOthersGoOn) {
    EXPECT_OK(wait([&](auto done) { store->setCharacteristic(type(VSCode::BiologicalSex), 2, done); }));
    auto transaction = store->beginImport("document");
    const VSDate when = date("2020-03-01");
    const auto outcome = (*transaction)->add(VSCategorySample(type(VSCode::SleepAnalysis), 77, when, when));
    ASSERT_FALSE(outcome.ok());
    EXPECT_EQ(outcome.error().code, VSErrorCode::Invalid);
    EXPECT_TRUE((*transaction)->add(*pulse(60, "2020-03-01T08:00")).ok());
    EXPECT_EQ(*(*transaction)->setCharacteristicsIfUnset(VSBirthDate{1970, 1, 1}, 1, 3, 0), 2);
    EXPECT_OK((*transaction)->commit());
    EXPECT_EQ(count(VSCode::HeartRate), 1u);
    EXPECT_EQ(*store->biologicalSex(), 2) << "it was set before";
    EXPECT_EQ(*store->bloodType(), 3);
    EXPECT_EQ(*store->dateOfBirth(), (VSBirthDate{1970, 1, 1}));
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
    const auto document = [](double rounding) {
        std::vector<VSSamplePtr> records;
        VSProvenance created = from("Watch");
        for (int i = 0; i < count; ++i) {
            created.creationDate = date("2020-03-01T09:00") + std::chrono::seconds(i % 2);
            const double value = (i % 4 < 2 ? 60 : 1000 + i) * (1 + (i % 8 < 4 ? rounding : -rounding));
            records.push_back(i % 3 ? pulse(value, "2020-03-01T08:00", created)
                                    : pulse(61, "2020-03-01T08:00"));
        }
        return records;
    };
    EXPECT_EQ(import(document(0)), (Tally{count, 0}));
    auto records = document(4e-13);  // as after conversions to another unit and back
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
