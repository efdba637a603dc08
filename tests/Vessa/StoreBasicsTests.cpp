#include <gtest/gtest.h>

#include <cmath>

#include "StoreTestSupport.h"

using namespace test;

namespace {

struct StoreBasics : testing::Test {
    FixedEnvironment environment;
    TemporaryFolder folder;
    std::shared_ptr<VSHealthStore> store = openStore(folder.path() / "store");
};

VSSamplePtr bloodPressure(double systolic, double diastolic, const std::string& when,
                          VSProvenance provenance = {}) {
    const VSDate moment = date(when);
    return std::make_shared<VSCorrelation>(
        type(VSCode::BloodPressure), moment, moment,
        std::vector<VSSamplePtr>{
            quantity(type(VSCode::BloodPressureSystolic), systolic, moment, moment, provenance),
            quantity(type(VSCode::BloodPressureDiastolic), diastolic, moment, moment, provenance)},
        provenance);
}

}  // namespace

TEST_F(StoreBasics, EveryKindOfSampleComesBackAsItWasSaved) {
    VSProvenance provenance = from("Wrist tracker", "2.1");
    VSDevice device;
    device.name = "Wrist: \"tracker\"";
    device.hardwareVersion = "1";
    provenance.device = std::make_shared<VSDevice>(device);
    provenance.metadata = std::make_shared<VSMetadata>(VSMetadata{{"note", "snø ☃"},
                                                                  {"VSMetadataKeyWasUserEntered", true},
                                                                  {"at", date("2020-01-01")},
                                                                  {"n", 3},
                                                                  {"x", 0.1}});
    provenance.creationDate = date("2020-03-02T10:00:00.123456");
    provenance.timeZoneOffset = 20700;

    const auto start = date("1969-12-31T23:59:59.999999Z"), end = date("2020-03-01T08:00");
    const double awkward[] = {0.1 + 0.2, -0.0, 1e-300, 12345678901234.568,
                              75.0,      -3.0, 5e-324, 140737488355327.0};
    std::vector<VSSamplePtr> objects;
    for (double value : awkward) objects.push_back(quantity(heartRate(), value, start, end, provenance));
    objects.push_back(
        std::make_shared<VSCategorySample>(type(VSCode::SleepAnalysis), 1, start, end, provenance));
    objects.push_back(bloodPressure(120, 80, "2020-03-01T08:00", provenance));
    objects.push_back(std::make_shared<VSWorkout>(
        37, date("2020-03-01T08:00"), date("2020-03-01T09:00"), std::chrono::minutes(50),
        VSQuantity(VSUnit::fromString("kJ"), 418.4), VSQuantity(VSUnit::fromString("km"), 10.5),
        std::vector<VSWorkoutEvent>{
            {1, date("2020-03-01T08:20")}, {2, date("2020-03-01T08:30")}, {7, std::nullopt}},
        provenance));
    EXPECT_OK(store->saveObjectsAndWait(objects));
    store.reset();
    store = openStore(folder.path() / "store");

    const auto rates = allSamples(*store, heartRate());
    ASSERT_EQ(rates.size(), std::size(awkward));
    for (size_t i = 0; i < rates.size(); ++i) {
        const auto& sample = dynamic_cast<const VSQuantitySample&>(*rates[i]);
        EXPECT_EQ(sample.quantity().value(), awkward[i]);
        EXPECT_EQ(std::signbit(sample.quantity().value()), std::signbit(awkward[i]));
        EXPECT_EQ(sample.startDate(), start);
        EXPECT_EQ(sample.endDate(), end);
        EXPECT_EQ(sample.sourceRevision(), *provenance.sourceRevision);
        ASSERT_TRUE(sample.device());
        EXPECT_EQ(*sample.device(), device);
        EXPECT_EQ(sample.metadata(), *provenance.metadata);
        EXPECT_EQ(sample.creationDate(), provenance.creationDate);
        EXPECT_EQ(sample.timeZoneOffset(), 20700);
    }
    const auto sleep = allSamples(*store, type(VSCode::SleepAnalysis));
    ASSERT_EQ(sleep.size(), 1u);
    EXPECT_EQ(dynamic_cast<const VSCategorySample&>(*sleep[0]).value(), 1);

    const auto pressures = allSamples(*store, type(VSCode::BloodPressure));
    ASSERT_EQ(pressures.size(), 1u);
    const auto& members = dynamic_cast<const VSCorrelation&>(*pressures[0]).objects();
    ASSERT_EQ(members.size(), 2u);
    EXPECT_EQ(dynamic_cast<const VSQuantitySample&>(*members[1]).quantity().value(), 80);
    EXPECT_EQ(members[0]->dataID(), allSamples(*store, type(VSCode::BloodPressureSystolic)).at(0)->dataID());

    const auto workouts = allSamples(*store, VSObjectType::workoutType());
    ASSERT_EQ(workouts.size(), 1u);
    const auto& workout = dynamic_cast<const VSWorkout&>(*workouts[0]);
    EXPECT_EQ(workout.workoutActivityType(), 37);
    EXPECT_EQ(workout.duration(), std::chrono::minutes(50));
    EXPECT_DOUBLE_EQ(workout.totalEnergyBurned()->doubleValueForUnit(VSUnit::kilocalorieUnit()), 100);
    EXPECT_DOUBLE_EQ(workout.totalDistance()->doubleValueForUnit(VSUnit::fromString("m")), 10500);
    ASSERT_EQ(workout.workoutEvents().size(), 3u);
    EXPECT_EQ(workout.workoutEvents()[1], (VSWorkoutEvent{2, date("2020-03-01T08:30")}));
    EXPECT_FALSE(workout.workoutEvents()[2].date);
    expectSound(*store);
}

TEST_F(StoreBasics, WhatHasNoProvenanceIsTheApplicationsOwnAndOfNow) {
    EXPECT_OK(store->saveObjectsAndWait({quantity(heartRate(), 60, "2020-03-01T08:00", "2020-03-01T08:00")}));
    const auto sample = allSamples(*store, heartRate()).at(0);
    EXPECT_TRUE(sample->sourceRevision().source.isApplication());
    EXPECT_EQ(sample->creationDate(), date("2020-03-31T20:00"));
    EXPECT_EQ(sample->device(), nullptr);
    EXPECT_FALSE(sample->timeZoneOffset());
}

TEST_F(StoreBasics, OneBadObjectKeepsAllOut) {
    const auto good = quantity(heartRate(), 60, "2020-03-01T08:00", "2020-03-01T08:00");
    const std::vector<VSSamplePtr> bad = {
        std::make_shared<VSCategorySample>(type(VSCode::SleepAnalysis), 77, date("2020-03-01T08:00"),
                                           date("2020-03-01T08:00")),
        quantity(heartRate(), 60, VSDate::distantPast(), date("2020-03-01T08:00")),
        quantity(heartRate(), 60, date("2020-03-01T08:00"), VSDate::distantFuture()),
        quantity(heartRate(), -0x1p47, "2020-03-01T08:00", "2020-03-01T08:00"),
    };
    for (const auto& object : bad) {
        const VSStatus status = store->saveObjectsAndWait({good, object});
        ASSERT_FALSE(status.ok());
        EXPECT_EQ(status.error().code, VSErrorCode::Invalid);
        EXPECT_NE(status.error().message.find(object->sampleType()->name()), std::string::npos)
            << status.error().message;
    }
    EXPECT_TRUE(allSamples(*store, heartRate()).empty());
    expectSound(*store);
}

TEST_F(StoreBasics, DeletionTakesTheObjectAndLeavesMembers) {
    EXPECT_OK(store->saveObjectsAndWait(
        {bloodPressure(120, 80, "2020-03-01T08:00"), bloodPressure(130, 85, "2020-03-02T08:00")}));
    const auto pressures = allSamples(*store, type(VSCode::BloodPressure));
    VSPredicate alone;
    alone.noCorrelation = true;
    EXPECT_TRUE(store->samples(type(VSCode::BloodPressureSystolic), alone, 0, {})->empty());
    EXPECT_OK(wait([&](auto done) { store->deleteObject(pressures[0], done); }));
    EXPECT_EQ(allSamples(*store, type(VSCode::BloodPressure)).size(), 1u);
    EXPECT_EQ(allSamples(*store, type(VSCode::BloodPressureSystolic)).size(), 2u);
    EXPECT_EQ(store->samples(type(VSCode::BloodPressureSystolic), alone, 0, {})->size(), 1u);

    const VSStatus again = wait([&](auto done) { store->deleteObjects({pressures[1], pressures[0]}, done); });
    ASSERT_FALSE(again.ok());
    EXPECT_EQ(again.error().code, VSErrorCode::NotFound);
    EXPECT_EQ(allSamples(*store, type(VSCode::BloodPressure)).size(), 1u) << "all or nothing";
    expectSound(*store);

    // A reading goes with its values: members first, then the correlation.
    const auto& reading = dynamic_cast<const VSCorrelation&>(*pressures[1]);
    EXPECT_OK(wait([&](auto done) {
        store->deleteObjects({reading.objects()[0], reading.objects()[1], pressures[1]}, done);
    }));
    EXPECT_EQ(allSamples(*store, type(VSCode::BloodPressureSystolic)).size(), 1u);
    expectSound(*store);
}

TEST_F(StoreBasics, AllToDeleteAreFoundBeforeAnyGoes) {
    // As they were made, without numbers.
    const VSSamplePtr made = bloodPressure(120, 80, "2020-03-01T08:00");
    const auto members = dynamic_cast<const VSCorrelation&>(*made).objects();
    const auto beat = [] { return quantity(heartRate(), 60, "2020-03-01T08:00", "2020-03-01T08:00"); };
    EXPECT_OK(store->saveObjectsAndWait({made, beat(), beat(), beat(), beat()}));
    const auto remove = [&](std::vector<VSSamplePtr> objects) {
        return wait([&](auto done) { store->deleteObjects(std::move(objects), done); });
    };
    EXPECT_OK(remove({members[0], members[1], made}));
    EXPECT_TRUE(allSamples(*store, type(VSCode::BloodPressure)).empty());
    // Equal ones are different ones; the same one twice is one, also beside its like.
    const auto beats = allSamples(*store, heartRate());
    const VSSamplePtr unnumbered = beat();
    EXPECT_OK(remove({unnumbered, beats[3], beats[3], unnumbered}));
    EXPECT_EQ(allSamples(*store, heartRate()).size(), 2u);
    EXPECT_EQ(remove({beat(), beat(), beat()}).error().code, VSErrorCode::NotFound) << "there are two";
    EXPECT_OK(remove({beat(), beat()}));
    EXPECT_TRUE(store->typeSummaries()->empty());
    expectSound(*store);
}

TEST_F(StoreBasics, DeletesByTypeAndSource) {
    std::vector<VSSamplePtr> objects;
    for (int i = 0; i < 40; ++i) {
        const VSDate start = date("2020-03-01") + std::chrono::hours(7 * i);
        objects.push_back(
            quantity(steps(), i, start, start + std::chrono::hours(3), from(i % 2 ? "Phone" : "Watch")));
        objects.push_back(quantity(heartRate(), i, start, start, from("Watch")));
    }
    EXPECT_OK(store->saveObjectsAndWait(objects));
    EXPECT_OK(wait([&](auto done) {
        store->deleteAllSamples({steps()}, VSSource::forImportedName("Phone").bundleIdentifier, done);
    }));
    EXPECT_EQ(allSamples(*store, steps()).size(), 20u);
    expectSound(*store);
    EXPECT_OK(wait([&](auto done) { store->deleteAllSamples({steps(), heartRate()}, std::nullopt, done); }));
    EXPECT_TRUE(store->typeSummaries()->empty());
    EXPECT_TRUE(store->sourceSummaries()->empty());
    expectSound(*store);
}

TEST_F(StoreBasics, RelatesSamplesToAWorkoutOnce) {
    const VSSamplePtr workout =
        std::make_shared<VSWorkout>(37, date("2020-03-01T08:00"), date("2020-03-01T09:00"), VSDuration(0),
                                    std::nullopt, std::nullopt, std::vector<VSWorkoutEvent>{});
    const auto distance =
        quantity(type(VSCode::DistanceWalkingRunning), 5000, "2020-03-01T08:00", "2020-03-01T09:00");
    const VSStatus early = wait([&](auto done) { store->addSamplesToWorkout({distance}, workout, done); });
    ASSERT_FALSE(early.ok());
    EXPECT_EQ(early.error().code, VSErrorCode::NotFound);
    EXPECT_OK(store->saveObjectsAndWait({workout}));
    EXPECT_OK(wait([&](auto done) { store->addSamplesToWorkout({distance}, workout, done); }));
    EXPECT_OK(wait([&](auto done) { store->addSamplesToWorkout({distance}, workout, done); }));
    EXPECT_EQ(allSamples(*store, distance->sampleType()).size(), 1u) << "it was saved already";
    expectSound(*store);
}

TEST_F(StoreBasics, KeepsDefaultsCharacteristicsAndMedicalID) {
    const VSValue value(VSValue::Dictionary{{"list", VSValue::Array{1, 2.5, "three"}}, {"yes", true}});
    EXPECT_OK(wait([&](auto done) { store->setDefaultValue(value, "key", done); }));
    Promise<std::optional<VSValue>> read;
    store->getDefaultValue("key",
                           [&](const auto& result) { read.set(result.ok() ? *result : std::nullopt); });
    EXPECT_EQ(read.wait(), std::optional(std::optional(value)));
    // What was accepted before the question is in the answer.
    Promise<std::optional<VSValue>> overtaking;
    store->setDefaultValue(7, "key", nullptr);
    store->getDefaultValue("key",
                           [&](const auto& result) { overtaking.set(result.ok() ? *result : std::nullopt); });
    EXPECT_EQ(overtaking.wait(), std::optional(std::optional(VSValue(7))));
    VSHealthStore::Options other;
    other.applicationIdentifier = "org.example.other";
    Promise<std::optional<VSValue>> foreign;
    openStore(store->folder(), other)->getDefaultValue("key", [&](const auto& result) {
        foreign.set(result.ok() ? *result : VSValue("failed"));
    });
    const auto foreignValue = foreign.wait();
    ASSERT_TRUE(foreignValue);
    EXPECT_FALSE(*foreignValue) << "another application has its own";

    EXPECT_EQ(*store->dateOfBirth(), std::nullopt);
    EXPECT_OK(wait([&](auto done) { store->setDateOfBirth(VSBirthDate{1970, 2, 28}, done); }));
    EXPECT_EQ(*store->dateOfBirth(), (VSBirthDate{1970, 2, 28}));
    EXPECT_OK(wait([&](auto done) { store->setDateOfBirth(std::nullopt, done); }));
    EXPECT_EQ(*store->dateOfBirth(), std::nullopt);
    EXPECT_EQ(*store->bloodType(), 0);
    EXPECT_OK(wait([&](auto done) { store->setCharacteristic(type(VSCode::BloodType), 3, done); }));
    EXPECT_EQ(*store->bloodType(), 3);
    EXPECT_EQ(*store->biologicalSex(), 0);

    VSMedicalIDData data;
    data.name = "Ada";
    data.medicalNotes = "";
    data.birthdate = VSBirthDate{1815, 12, 10};
    data.pictureData = VSValue::Data{0, 1, 255, 0};
    data.other = {{"height", 1.65}, {"organDonor", true}};
    Promise<VSResult<std::optional<VSMedicalIDData>>> none, some;
    store->fetchMedicalIDData([&](const auto& result) { none.set(result); });
    EXPECT_EQ(**none.wait(), std::nullopt);
    EXPECT_OK(wait([&](auto done) { store->updateMedicalIDData(data, done); }));
    store->fetchMedicalIDData([&](const auto& result) { some.set(result); });
    EXPECT_EQ(**some.wait(), std::optional(data));
    expectSound(*store);
}

TEST_F(StoreBasics, AnObjectSavedAloneAndAsAMemberIsOne) {
    const auto reading = bloodPressure(120, 80, "2020-03-01T08:00");
    const auto& values = dynamic_cast<const VSCorrelation&>(*reading).objects();
    EXPECT_OK(store->saveObjectsAndWait({values[0], values[1], reading, reading}));
    EXPECT_EQ(allSamples(*store, type(VSCode::BloodPressure)).size(), 1u);
    const auto systolic = allSamples(*store, type(VSCode::BloodPressureSystolic));
    ASSERT_EQ(systolic.size(), 1u);
    const auto saved = allSamples(*store, type(VSCode::BloodPressure)).at(0);
    EXPECT_EQ(dynamic_cast<const VSCorrelation&>(*saved).objects().at(0)->dataID(), systolic[0]->dataID());
    EXPECT_OK(store->saveObjectsAndWait({reading}));  // another save is another reading
    EXPECT_EQ(allSamples(*store, type(VSCode::BloodPressureSystolic)).size(), 2u);
    expectSound(*store);
}
