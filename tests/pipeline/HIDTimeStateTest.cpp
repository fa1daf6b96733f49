// The frame clock shared by the stage classes.

#include <gtest/gtest.h>

#include "pipeline/HIDTimeState.h"

using orvane::HIDTimeState;

TEST(HIDTimeState, NewClockHasBothTimesZeroAndNoInterval) {
    HIDTimeState clock;
    EXPECT_EQ(clock.currentTimestamp(), 0.0);
    EXPECT_EQ(clock.previousTimestamp(), 0.0);
    EXPECT_EQ(clock.frameInterval(), 0.0);
}

TEST(HIDTimeState, FirstFrameIntervalIsTheWholeTimeSinceZero) {
    HIDTimeState clock;
    clock.updateFrameTimestamp(1500.0);
    EXPECT_EQ(clock.currentTimestamp(), 1500.0);
    EXPECT_EQ(clock.previousTimestamp(), 0.0);
    EXPECT_EQ(clock.frameInterval(), 1500.0);
}

TEST(HIDTimeState, SecondFrameIntervalIsTheDifferenceOfTheTwoFrameTimes) {
    HIDTimeState clock;
    clock.updateFrameTimestamp(1500.0);
    clock.updateFrameTimestamp(1508.5);
    EXPECT_EQ(clock.previousTimestamp(), 1500.0);
    EXPECT_EQ(clock.currentTimestamp(), 1508.5);
    EXPECT_EQ(clock.frameInterval(), 8.5);
}

TEST(HIDTimeState, UpdateShiftsCurrentIntoPreviousEvenWhenTimeRepeatsOrGoesBack) {
    HIDTimeState clock;
    clock.updateFrameTimestamp(2000.0);
    clock.updateFrameTimestamp(2000.0);
    EXPECT_EQ(clock.frameInterval(), 0.0);
    clock.updateFrameTimestamp(1990.0);
    EXPECT_EQ(clock.previousTimestamp(), 2000.0);
    EXPECT_EQ(clock.frameInterval(), -10.0);
}

TEST(HIDTimeState, SettersWriteTheTwoTimesDirectly) {
    HIDTimeState clock;
    clock.setCurrentTimestamp(30.0);
    clock.setPreviousTimestamp(12.0);
    EXPECT_EQ(clock.frameInterval(), 18.0);
}
