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

}  // namespace
