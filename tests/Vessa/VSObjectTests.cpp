#include "Vessa/VSObject.h"

#include <gtest/gtest.h>

namespace {

using std::chrono::minutes;

const VSDate kStart = VSDate::fromSeconds(1'600'000'000);

VSDuration durationOf(std::vector<VSWorkoutEvent> events, VSDuration given = {}) {
    return VSWorkout(37, kStart, kStart + minutes(60), given, {}, {}, std::move(events)).duration();
}

TEST(VSWorkout, DurationLeavesThePausesOut) {
    const auto pause = [](int at) { return VSWorkoutEvent{1, kStart + minutes(at)}; };
    const auto resume = [](int at) { return VSWorkoutEvent{2, kStart + minutes(at)}; };
    EXPECT_EQ(durationOf({}), minutes(60));
    EXPECT_EQ(durationOf({pause(10), resume(15), pause(30), resume(40)}), minutes(45));
    EXPECT_EQ(durationOf({resume(40), pause(10), resume(15), pause(30)}), minutes(45))
        << "events in any order";
    EXPECT_EQ(durationOf({pause(50)}), minutes(50)) << "paused until the end";
    EXPECT_EQ(durationOf({pause(10), pause(20), resume(30), resume(50)}), minutes(40))
        << "a second pause says nothing new";
    EXPECT_EQ(durationOf({pause(-10), resume(5), pause(55), resume(90)}), minutes(50))
        << "pauses beyond the ends";
    EXPECT_EQ(durationOf({pause(10), {2, std::nullopt}, {7, kStart + minutes(20)}}), minutes(10))
        << "events that say nothing";
    EXPECT_EQ(durationOf({pause(10)}, minutes(33)), minutes(33)) << "given";
}

TEST(VSSample, WithoutProvenanceItIsThisApplications) {
    const VSCategorySample sample(VSObjectType::dataTypeWithCode(VSCode::SleepAnalysis), 1, kStart, kStart);
    EXPECT_TRUE(sample.sourceRevision().source.isApplication());
    EXPECT_TRUE(sample.metadata().empty());
    EXPECT_EQ(sample.device(), nullptr);
    EXPECT_FALSE(sample.creationDate());
    EXPECT_EQ(VSObjectIDValue(sample.dataID()), 0);
}

TEST(VSWorkout, IsOfTheWorkoutTypeAndKeepsWhatItWasGiven) {
    VSProvenance provenance;
    provenance.metadata = std::make_shared<VSMetadata>(VSMetadata{{VSMetadataKeyWasUserEntered, true}});
    const VSWorkout workout(13, kStart, kStart + minutes(5), {}, VSQuantity(VSUnit::kilocalorieUnit(), 250),
                            VSQuantity(VSUnit::mileUnit(), 3), {}, provenance, VSObjectID{4});
    EXPECT_EQ(workout.sampleType(), VSObjectType::workoutType());
    EXPECT_EQ(workout.totalDistance()->doubleValueForUnit(VSUnit::fromString("m")), 4828.032);
    EXPECT_EQ(workout.totalEnergyBurned()->value(), 250);
    EXPECT_EQ(workout.metadata().at(VSMetadataKeyWasUserEntered), VSValue(true));
    EXPECT_EQ(VSObjectIDValue(workout.dataID()), 4);
}

}  // namespace
