#include <gtest/gtest.h>

#include <set>

#include "ChildProcess.h"
#include "StoreTestSupport.h"

using namespace test;

namespace {

struct StoreBasics : StoreTest {};

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
    const auto reading = bloodPressure(120, 80, date("2020-03-01T08:00"), provenance);
    objects.push_back(reading);
    objects.push_back(std::make_shared<VSWorkout>(
        37, date("2020-03-01T08:00"), date("2020-03-01T09:00"), std::chrono::minutes(50),
        VSQuantity(VSUnit::fromString("kJ"), 418.4), VSQuantity(VSUnit::fromString("km"), 10.5),
        std::vector<VSWorkoutEvent>{
            {1, date("2020-03-01T08:20")}, {2, date("2020-03-01T08:30")}, {7, std::nullopt}},
        provenance));
    save(objects);
    store.reset();
    store = openStore(folder.path());

    std::multiset<std::string> saved, found;
    objects.insert(objects.end(), membersOf(reading).begin(), membersOf(reading).end());
    for (const auto& object : objects) saved.insert(saidBy(*object).content + saidBy(*object).origin);
    for (const auto& [number, said] : contentsOf(*store)) found.insert(said.content + said.origin);
    EXPECT_EQ(found, saved);
    const auto members = membersOf(allSamples(*store, type(VSCode::BloodPressure)).at(0));
    EXPECT_EQ(members[0]->dataID(), allSamples(*store, type(VSCode::BloodPressureSystolic)).at(0)->dataID());
    const auto workouts = allSamples(*store, VSObjectType::workoutType());
    EXPECT_FALSE(dynamic_cast<const VSWorkout&>(*workouts.at(0)).workoutEvents().at(2).date);
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
    save(
        {bloodPressure(120, 80, date("2020-03-01T08:00")), bloodPressure(130, 85, date("2020-03-02T08:00"))});
    const auto pressures = allSamples(*store, type(VSCode::BloodPressure));
    VSPredicate alone;
    alone.noCorrelation = true;
    EXPECT_TRUE(store->samples(type(VSCode::BloodPressureSystolic), alone, 0, {})->empty());
    EXPECT_OK(remove({pressures[0]}));
    EXPECT_EQ(count(VSCode::BloodPressure), 1u);
    EXPECT_EQ(count(VSCode::BloodPressureSystolic), 2u);
    EXPECT_EQ(store->samples(type(VSCode::BloodPressureSystolic), alone, 0, {})->size(), 1u);
    EXPECT_EQ(remove({pressures[1], pressures[0]}).error().code, VSErrorCode::NotFound);
    EXPECT_EQ(count(VSCode::BloodPressure), 1u) << "all or nothing";

    // A reading goes with its values: members first, then the correlation.
    const auto& members = membersOf(pressures[1]);
    EXPECT_OK(remove({members[0], members[1], pressures[1]}));
    EXPECT_EQ(count(VSCode::BloodPressureSystolic), 1u);
    expectSound(*store);
    // A number is never used again, also not after a restart.
    const auto newest = pressures[1]->dataID();
    store.reset();
    store = openStore(folder.path());
    save({quantity(heartRate(), 2, "2020-03-01T08:00", "2020-03-01T08:00")});
    EXPECT_GT(allSamples(*store, heartRate()).at(0)->dataID(), newest);
    EXPECT_EQ(remove({pressures[1]}).error().code, VSErrorCode::NotFound);
}

TEST_F(StoreBasics, AllToDeleteAreFoundBeforeAnyGoes) {
    // As they were made, without numbers.
    const VSSamplePtr made = bloodPressure(120, 80, date("2020-03-01T08:00"));
    const auto beat = [] { return quantity(heartRate(), 60, "2020-03-01T08:00", "2020-03-01T08:00"); };
    save({made, beat(), beat(), beat(), beat()});
    EXPECT_OK(remove({membersOf(made)[0], membersOf(made)[1], made}));
    EXPECT_EQ(count(VSCode::BloodPressure), 0u);
    // Equal ones are different ones; the same one twice is one, also beside its like.
    const auto beats = allSamples(*store, heartRate());
    const VSSamplePtr unnumbered = beat();
    EXPECT_OK(remove({unnumbered, beats[3], beats[3], unnumbered}));
    EXPECT_EQ(count(VSCode::HeartRate), 2u);
    EXPECT_EQ(remove({beat(), beat(), beat()}).error().code, VSErrorCode::NotFound) << "there are two";
    EXPECT_OK(remove({beat(), beat()}));
    EXPECT_TRUE(store->typeSummaries()->empty());
    expectSound(*store);
}

TEST_F(StoreBasics, RelatesSamplesToAWorkoutOnce) {
    const VSSamplePtr workout = plainWorkout(date("2020-03-01T08:00"), date("2020-03-01T09:00"));
    const auto distance =
        quantity(type(VSCode::DistanceWalkingRunning), 5000, "2020-03-01T08:00", "2020-03-01T09:00");
    const auto relate = [&] {
        return wait([&](auto done) { store->addSamplesToWorkout({distance}, workout, done); });
    };
    EXPECT_EQ(relate().error().code, VSErrorCode::NotFound);
    save({workout});
    EXPECT_OK(relate());
    EXPECT_OK(relate());
    EXPECT_EQ(allSamples(*store, distance->sampleType()).size(), 1u) << "it was saved already";
    expectSound(*store);
}

/// Two processes count in one value; each is told of what the other wrote.
TEST_F(StoreBasics, DefaultValuesAreChangedInTurn) {
    constexpr int times = 50;
    const auto countUp = [](VSHealthStore& counting) {
        for (int i = 0; i < times; ++i)
            EXPECT_TRUE(answerOf<std::optional<VSValue>>([&](auto done) {
                            counting.updateDefaultValue(
                                "count",
                                [](const std::optional<VSValue>& current) {
                                    return VSValue(current ? *current->integer() + 1 : 1);
                                },
                                done);
                        }).ok());
    };
    store = nullptr;
    Child other([&](const auto& say, const auto& listen) {
        listen();
        const auto theirs = openStore(folder.path());
        countUp(*theirs);
        say('+');
    });
    store = openStore(folder.path());
    Log<std::string> told;
    const auto observation = store->observeDefaultValues([&](const std::string& key) { told.add(key); });
    other.tell();
    EXPECT_TRUE(told.waitFor(1)) << "nothing was written here";
    countUp(*store);
    EXPECT_TRUE(other.hear());
    EXPECT_EQ(*defaultValueOf(*store, "count"), VSValue(2 * times));
    for (const std::string& key : told.entries()) EXPECT_EQ(key, "count");
}

TEST_F(StoreBasics, KeepsDefaultsCharacteristicsAndMedicalID) {
    const VSValue value(VSValue::Dictionary{{"list", VSValue::Array{1, 2.5, "three"}}, {"yes", true}});
    EXPECT_OK(wait([&](auto done) { store->setDefaultValue(value, "key", done); }));
    EXPECT_EQ(*defaultValueOf(*store, "key"), value);
    store->setDefaultValue(7, "key", nullptr);
    EXPECT_EQ(*defaultValueOf(*store, "key"), VSValue(7)) << "accepted before the question";
    VSHealthStore::Options other;
    other.applicationIdentifier = "org.example.other";
    EXPECT_EQ(*defaultValueOf(*openStore(store->folder(), other), "key"), std::nullopt)
        << "another application has its own";

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
    const auto medicalID = [&] {
        return *answerOf<std::optional<VSMedicalIDData>>([&](auto done) { store->fetchMedicalIDData(done); });
    };
    EXPECT_EQ(medicalID(), std::nullopt);
    EXPECT_OK(wait([&](auto done) { store->updateMedicalIDData(data, done); }));
    EXPECT_EQ(medicalID(), std::optional(data));
    expectSound(*store);
}

TEST_F(StoreBasics, AnObjectSavedAloneAndAsAMemberIsOne) {
    const auto reading = bloodPressure(120, 80, date("2020-03-01T08:00"));
    save({membersOf(reading)[0], membersOf(reading)[1], reading, reading});
    ASSERT_EQ(count(VSCode::BloodPressure), 1u);
    const auto systolic = allSamples(*store, type(VSCode::BloodPressureSystolic));
    ASSERT_EQ(systolic.size(), 1u);
    const auto saved = allSamples(*store, type(VSCode::BloodPressure)).at(0);
    EXPECT_EQ(membersOf(saved).at(0)->dataID(), systolic[0]->dataID());
    save({reading});  // another save is another reading
    EXPECT_EQ(count(VSCode::BloodPressureSystolic), 2u);
    expectSound(*store);
}
