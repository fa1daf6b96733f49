// The events of a frame: the pointer event, its children in order, their phases, the flags,
// the log lines, and taps that go out through the dispatcher.

#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <vector>

#include "gestures/HIDGestureParser.h"
#include "motion/HIDHandMotion.h"
#include "platform/Logging.h"
#include "stats/HIDHandStatistics.h"
#include "tests/support/FrameBuilder.h"

namespace orvane {
namespace {

using test::TestClock;

const std::string kCreate =
    "-[HIDGestureParser createGestureEvents:handMotion:handEvent:pointerEvent:gestureEvent:dispatcher:"
    "tapToClickEnabled:twoFingersSecondaryClickEnabled:]";
const std::string kCancel = "-[HIDGestureParser cancelScrollMayBegin:pointerEvent:]";

std::string created(const char* what) { return kCreate + " GESTURE " + what; }
const std::string kCancelled = kCancel + " GESTURE SCROLL CANCELLED";

double ticks(double ms) { return static_cast<double>(TestClock::msToTicks(ms)); }

class GestureEventsTest : public ::testing::Test {
protected:
    static constexpr double kNow = 2000.0;
    static constexpr uint64_t kSender = 0x42;

    void SetUp() override {
        Logging::setSink(sink);
        stats.setCurrentTimestamp(ticks(kNow));
        hand = HIDEvent::create(kHIDEventTypeDigitizer, TestClock::msToTicks(kNow));
        hand->setSenderID(kSender);
        pointer = HIDEvent::pointerEvent(hand->timestamp(), 0.0, 0.0, 0.0, 0, 0);
        dispatcher = [this](const HIDEventRef& e) {
            sentObjects.push_back(e);
            sentCopies.push_back(e->copy());
        };
    }
    void TearDown() override { Logging::setSink(std::make_shared<StandardErrorLogSink>()); }

    // The recogniser's results for this frame.
    void gesture(int32_t current, int32_t previous, uint16_t phase = 0, uint16_t previousPhase = 0) {
        parser.setCurrentGesture(current);
        parser.setPrevGesture(previous);
        parser.setCurrentPhase(phase);
        parser.setPrevPhase(previousPhase);
    }
    void button(int current, int last) {
        stats.setCurrentButtonState(current);
        stats.setLastButtonState(last);
    }
    HIDEventRef create(bool tapToClick = true, bool secondaryClick = true) {
        return parser.createGestureEvents(stats, motion, hand, pointer, nullptr, dispatcher, tapToClick,
                                          secondaryClick);
    }
    const HIDEventRef& child(size_t i) const { return pointer->children().at(i); }
    size_t childCount() const { return pointer->children().size(); }

    static void expectEvent(const HIDEventRef& e, uint32_t type, uint16_t phase, double x, double y, double z) {
        ASSERT_NE(e, nullptr);
        EXPECT_EQ(e->type(), type);
        EXPECT_EQ(e->phase(), phase);
        EXPECT_EQ(e->doubleValueForField(hidFieldSelector(type, 0)), x);
        EXPECT_EQ(e->doubleValueForField(hidFieldSelector(type, 1)), y);
        EXPECT_EQ(e->doubleValueForField(hidFieldSelector(type, 2)), z);
        EXPECT_EQ(e->timestamp(), TestClock::msToTicks(kNow));
        EXPECT_EQ(e->options(), 0u);
    }
    static void expectButton(const HIDEventRef& e, int64_t mask, int64_t number, int64_t state) {
        ASSERT_NE(e, nullptr);
        EXPECT_EQ(e->type(), kHIDEventTypeButton);
        EXPECT_EQ(e->integerValueForField(kHIDEventFieldButtonMask), mask);
        EXPECT_EQ(e->integerValueForField(kHIDEventFieldButtonNumber), number);
        EXPECT_EQ(e->integerValueForField(kHIDEventFieldButtonState), state);
        EXPECT_EQ(e->timestamp(), TestClock::msToTicks(kNow));
        EXPECT_EQ(e->options(), 0u);
    }

    std::shared_ptr<CaptureLogSink> sink = std::make_shared<CaptureLogSink>();
    HIDGestureParser parser;
    HIDHandStatistics stats;
    HIDHandMotion motion;
    HIDEventRef hand;
    HIDEventRef pointer;
    HIDDispatchHandler dispatcher;
    std::vector<HIDEventRef> sentObjects;
    std::vector<HIDEventRef> sentCopies;
};

using Messages = std::vector<std::string>;

// ---------------------------------------------------------------------------------------
// The frame's pointer event

TEST_F(GestureEventsTest, PointerEventCarriesTheHandEventsTimestampSenderAndButtonState) {
    stats.setCurrentButtonState(1);
    HIDEventRef handEvent = HIDEvent::create(kHIDEventTypeDigitizer, 777);
    handEvent->setSenderID(9);
    HIDEventRef result =
        parser.parseHandGesturesCreateHIDEvents(stats, motion, handEvent, dispatcher, true, true);
    ASSERT_NE(result, nullptr);
    EXPECT_EQ(result->type(), kHIDEventTypePointer);
    EXPECT_EQ(result->timestamp(), 777u);
    EXPECT_EQ(result->senderID(), 9u);
    EXPECT_EQ(result->options(), 0u);
    EXPECT_EQ(result->integerValueForField(kHIDEventFieldPointerButtonMask), 1);
    EXPECT_EQ(result->doubleValueForField(kHIDEventFieldPointerX), 0.0);
    EXPECT_EQ(result->doubleValueForField(kHIDEventFieldPointerY), 0.0);
    EXPECT_EQ(result->doubleValueForField(kHIDEventFieldPointerZ), 0.0);
    ASSERT_FALSE(result->children().empty());
}

TEST_F(GestureEventsTest, FirstFrameAfterAllContactsVanishedGetsABarePointerEvent) {
    stats.setPalmsRemoved(true);
    stats.setWerePalmsRemoved(false);
    stats.setCurrentButtonState(1);
    HIDEventRef result = parser.parseHandGesturesCreateHIDEvents(stats, motion, nullptr, dispatcher, true, true);
    ASSERT_NE(result, nullptr);
    EXPECT_EQ(result->type(), kHIDEventTypePointer);
    EXPECT_EQ(result->timestamp(), 0u);
    EXPECT_EQ(result->senderID(), 0u);
    EXPECT_EQ(result->integerValueForField(kHIDEventFieldPointerButtonMask), 1);
    EXPECT_TRUE(result->children().empty());
}

TEST_F(GestureEventsTest, LaterFramesWithoutAHandEventGetNothing) {
    stats.setPalmsRemoved(true);
    stats.setWerePalmsRemoved(true);
    EXPECT_EQ(parser.parseHandGesturesCreateHIDEvents(stats, motion, nullptr, dispatcher, true, true), nullptr);
    stats.setPalmsRemoved(false);
    stats.setWerePalmsRemoved(false);
    EXPECT_EQ(parser.parseHandGesturesCreateHIDEvents(stats, motion, nullptr, dispatcher, true, true), nullptr);
    stats.setWerePalmsRemoved(true);
    EXPECT_EQ(parser.parseHandGesturesCreateHIDEvents(stats, motion, nullptr, dispatcher, true, true), nullptr);
}

TEST_F(GestureEventsTest, WithoutAHandEventTheRecogniserDoesNotRun) {
    gesture(kHIDGestureTypeScroll, kHIDGestureTypeNone, kHIDGesturePhaseChanged);
    stats.setPalmsRemoved(true);
    parser.parseHandGesturesCreateHIDEvents(stats, motion, nullptr, dispatcher, true, true);
    EXPECT_EQ(parser.currentGesture(), kHIDGestureTypeScroll);
    EXPECT_EQ(parser.prevGesture(), kHIDGestureTypeNone);
    EXPECT_EQ(parser.currentPhase(), kHIDGesturePhaseChanged);
    EXPECT_TRUE(sink->messages().empty());
}

// ---------------------------------------------------------------------------------------
// The diving button

TEST_F(GestureEventsTest, ButtonPressComesFirstAndIsLogged) {
    button(1, 0);
    ASSERT_EQ(create(), pointer);
    ASSERT_EQ(childCount(), 2u);
    expectButton(child(0), 1, 1, 1);
    EXPECT_EQ(child(1), hand);
    EXPECT_TRUE(parser.buttonStateWasSent());
    EXPECT_EQ(sink->messages(), Messages{created("BUTTON PRESSED")});
}

TEST_F(GestureEventsTest, ButtonPressedWithTwoCloseFingersAndTheSecondarySettingIsTheSecondaryButton) {
    stats.setTwoFingersClose(true);
    button(1, 0);
    create(true, true);
    ASSERT_EQ(childCount(), 2u);
    expectButton(child(0), 2, 2, 1);
    EXPECT_TRUE(parser.buttonStateWasSent());
    EXPECT_EQ(sink->messages(), Messages{created("BUTTON PRESSED")});

    // Its release is sent because the press was.
    sink->clear();
    pointer = HIDEvent::pointerEvent(hand->timestamp(), 0.0, 0.0, 0.0, 0, 0);
    button(0, 1);
    create(true, true);
    ASSERT_EQ(childCount(), 2u);
    expectButton(child(0), 0, 1, 0);
    EXPECT_FALSE(parser.buttonStateWasSent());
    EXPECT_EQ(sink->messages(), Messages{created("BUTTON RELEASED")});
}

TEST_F(GestureEventsTest, SecondaryButtonNeedsTheSetting) {
    stats.setTwoFingersClose(true);
    button(1, 0);
    create(true, false);
    expectButton(child(0), 1, 1, 1);
}

TEST_F(GestureEventsTest, SecondaryButtonNeedsCloseFingers) {
    button(1, 0);
    create(true, true);
    expectButton(child(0), 1, 1, 1);
}

TEST_F(GestureEventsTest, PointerEventKeepsTheButtonStateWhileTheButtonEventSaysSecondary) {
    stats.setTwoFingersClose(true);
    stats.setNumFingersTouching(2);
    stats.setLastNumFingersTouching(2);
    motion.setInnermostOutermostSeparation_mm(100.0f);
    motion.setInnermostOutermostVerticalSeparation_mm(10.0f);
    button(1, 0);
    HIDEventRef result = parser.parseHandGesturesCreateHIDEvents(stats, motion, hand, dispatcher, true, true);
    ASSERT_NE(result, nullptr);
    EXPECT_EQ(result->integerValueForField(kHIDEventFieldPointerButtonMask), 1);
    expectButton(result->children().at(0), 2, 2, 1);
}

TEST_F(GestureEventsTest, ReleaseWithoutAnEarlierPressIsNotSent) {
    button(0, 1);
    ASSERT_EQ(create(), pointer);
    ASSERT_EQ(childCount(), 1u);
    EXPECT_EQ(child(0), hand);
    EXPECT_TRUE(sink->messages().empty());
}

TEST_F(GestureEventsTest, UnchangedButtonSendsNoButtonEvent) {
    button(1, 1);
    create();
    ASSERT_EQ(childCount(), 1u);
    EXPECT_EQ(child(0), hand);
}

// ---------------------------------------------------------------------------------------
// Ending gestures

TEST_F(GestureEventsTest, PointerEndIsLoggedAndTimed) {
    gesture(kHIDGestureTypeNone, kHIDGestureTypePointer);
    ASSERT_EQ(create(), pointer);
    ASSERT_EQ(childCount(), 1u);
    EXPECT_EQ(child(0), hand);
    EXPECT_EQ(stats.t_recentSwipeEnd(), ticks(kNow));
    EXPECT_EQ(sink->messages(), Messages{created("POINTER ENDED")});
}

TEST_F(GestureEventsTest, ScaleEndsAfterAScale) {
    parser.setShouldEndScale(true);
    gesture(kHIDGestureTypeNone, kHIDGestureTypeScale, kHIDGesturePhaseNone, kHIDGesturePhaseChanged);
    ASSERT_EQ(create(), pointer);
    ASSERT_EQ(childCount(), 2u);
    EXPECT_EQ(child(0), hand);
    expectEvent(child(1), kHIDEventTypeScale, kHIDGesturePhaseEnded, 0, 0, 0);
    EXPECT_EQ(parser.currentPhase(), kHIDGesturePhaseEnded);
    EXPECT_FALSE(parser.shouldEndScale());
    EXPECT_EQ(stats.t_recentScaleEnd(), ticks(kNow));
    EXPECT_EQ(sink->messages(), Messages{created("END SCALE")});
}

TEST_F(GestureEventsTest, RotationEndsAfterARotation) {
    parser.setShouldEndRotate(true);
    gesture(kHIDGestureTypeNone, kHIDGestureTypeRotate);
    ASSERT_EQ(create(), pointer);
    ASSERT_EQ(childCount(), 2u);
    EXPECT_EQ(child(0), hand);
    expectEvent(child(1), kHIDEventTypeRotation, kHIDGesturePhaseEnded, 0, 0, 0);
    EXPECT_EQ(parser.currentPhase(), kHIDGesturePhaseEnded);
    EXPECT_FALSE(parser.shouldEndRotate());
    EXPECT_EQ(stats.t_recentRotateEnd(), ticks(kNow));
    EXPECT_EQ(sink->messages(), Messages{created("END ROTATION")});
}

TEST_F(GestureEventsTest, ScaleAndRotationInProgressBothEndScaleFirst) {
    parser.setShouldEndScale(true);
    parser.setShouldEndRotate(true);
    gesture(kHIDGestureTypeNone, kHIDGestureTypeRotate);
    create();
    ASSERT_EQ(childCount(), 3u);
    EXPECT_EQ(child(0), hand);
    expectEvent(child(1), kHIDEventTypeScale, kHIDGesturePhaseEnded, 0, 0, 0);
    expectEvent(child(2), kHIDEventTypeRotation, kHIDGesturePhaseEnded, 0, 0, 0);
    EXPECT_EQ(sink->messages(), (Messages{created("END SCALE"), created("END ROTATION")}));
}

TEST_F(GestureEventsTest, ScaleLeftPendingEndsAfterAnyOtherGesture) {
    parser.setShouldEndScale(true);
    gesture(kHIDGestureTypeNone, kHIDGestureTypePointer);
    create();
    ASSERT_EQ(childCount(), 2u);
    expectEvent(child(1), kHIDEventTypeScale, kHIDGesturePhaseEnded, 0, 0, 0);
    EXPECT_EQ(sink->messages(), (Messages{created("POINTER ENDED"), created("END SCALE")}));
}

TEST_F(GestureEventsTest, ScaleEndsAfterAScaleEvenWhenAlreadyEnded) {
    gesture(kHIDGestureTypeNone, kHIDGestureTypeScale);  // shouldEndScale is false
    create();
    ASSERT_EQ(childCount(), 2u);
    expectEvent(child(1), kHIDEventTypeScale, kHIDGesturePhaseEnded, 0, 0, 0);
}

TEST_F(GestureEventsTest, ScrollEndsAfterAScroll) {
    gesture(kHIDGestureTypeNone, kHIDGestureTypeScroll, kHIDGesturePhaseNone, kHIDGesturePhaseChanged);
    ASSERT_EQ(create(), pointer);
    ASSERT_EQ(childCount(), 2u);
    EXPECT_EQ(child(0), hand);
    expectEvent(child(1), kHIDEventTypeScroll, kHIDGesturePhaseEnded, 0, 0, 0);
    EXPECT_EQ(parser.currentPhase(), kHIDGesturePhaseEnded);
    EXPECT_EQ(stats.t_recentScrollEnd(), ticks(kNow));
    EXPECT_EQ(pointer->doubleValueForField(kHIDEventFieldPointerX), 0.0);
    EXPECT_EQ(pointer->doubleValueForField(kHIDEventFieldPointerY), 0.0);
    EXPECT_EQ(sink->messages(), Messages{created("END SCROLL")});
}

TEST_F(GestureEventsTest, ScrollEndLeavesAPendingScaleForLater) {
    parser.setShouldEndScale(true);
    gesture(kHIDGestureTypeNone, kHIDGestureTypeScroll);
    create();
    ASSERT_EQ(childCount(), 2u);
    EXPECT_EQ(child(1)->type(), kHIDEventTypeScroll);
    EXPECT_TRUE(parser.shouldEndScale());
}

TEST_F(GestureEventsTest, ScrollDoesNotEndWhileItMayBegin) {
    gesture(kHIDGestureTypeNone, kHIDGestureTypeScroll, kHIDGesturePhaseMayBegin, kHIDGesturePhaseMayBegin);
    create();
    ASSERT_EQ(childCount(), 1u);
    EXPECT_EQ(child(0), hand);
    EXPECT_EQ(parser.currentPhase(), kHIDGesturePhaseMayBegin);
    EXPECT_TRUE(sink->messages().empty());
}

TEST_F(GestureEventsTest, ButtonComesBeforeTheEndingEvents) {
    button(1, 0);
    gesture(kHIDGestureTypeNone, kHIDGestureTypeScale);
    create();
    ASSERT_EQ(childCount(), 3u);
    EXPECT_EQ(child(0)->type(), kHIDEventTypeButton);
    EXPECT_EQ(child(1), hand);
    EXPECT_EQ(child(2)->type(), kHIDEventTypeScale);
    EXPECT_EQ(sink->messages(), (Messages{created("BUTTON PRESSED"), created("END SCALE")}));
}

// ---------------------------------------------------------------------------------------
// Pointer

TEST_F(GestureEventsTest, PointerMovesByTheMotionDeltas) {
    gesture(kHIDGestureTypePointer, kHIDGestureTypeNone);
    motion.setMotionDeltas({1.27f, -0.635f, 0.0f, 0.0f});
    ASSERT_EQ(create(), pointer);
    EXPECT_EQ(pointer->doubleValueForField(kHIDEventFieldPointerX), static_cast<double>(1.27f));
    EXPECT_EQ(pointer->doubleValueForField(kHIDEventFieldPointerY), static_cast<double>(-0.635f));
    ASSERT_EQ(childCount(), 1u);
    EXPECT_EQ(child(0), hand);
    EXPECT_EQ(sink->messages(), Messages{created("POINTER BEGAN")});
}

TEST_F(GestureEventsTest, PointerInProgressLogsNothing) {
    gesture(kHIDGestureTypePointer, kHIDGestureTypePointer);
    motion.setMotionDeltas({0.635f, 0.0f, 0.0f, 0.0f});
    create();
    EXPECT_EQ(childCount(), 1u);
    EXPECT_TRUE(sink->messages().empty());
}

TEST_F(GestureEventsTest, PointerBeginWithdrawsAMayBeginScrollAfterTheHandEvent) {
    parser.setShouldCancelScrollMayBegin(true);
    button(1, 0);
    gesture(kHIDGestureTypePointer, kHIDGestureTypeNone, kHIDGesturePhaseMayBegin, kHIDGesturePhaseMayBegin);
    create();
    ASSERT_EQ(childCount(), 3u);
    EXPECT_EQ(child(0)->type(), kHIDEventTypeButton);
    EXPECT_EQ(child(1), hand);
    expectEvent(child(2), kHIDEventTypeScroll, kHIDGesturePhaseCancelled, 0, 0, 0);
    EXPECT_FALSE(parser.shouldCancelScrollMayBegin());
    EXPECT_EQ(sink->messages(), (Messages{created("BUTTON PRESSED"), kCancelled, created("POINTER BEGAN")}));
}

// ---------------------------------------------------------------------------------------
// Scroll

TEST_F(GestureEventsTest, StillScrollMayBegin) {
    gesture(kHIDGestureTypeScroll, kHIDGestureTypeNone);
    ASSERT_EQ(create(), pointer);
    ASSERT_EQ(childCount(), 2u);
    EXPECT_EQ(child(0), hand);
    expectEvent(child(1), kHIDEventTypeScroll, kHIDGesturePhaseMayBegin, 0, 0, 0);
    EXPECT_EQ(parser.currentGesture(), kHIDGestureTypeNone);
    EXPECT_EQ(parser.currentPhase(), kHIDGesturePhaseMayBegin);
    EXPECT_TRUE(parser.shouldCancelScrollMayBegin());
    EXPECT_EQ(sink->messages(), Messages{created("SCROLL MAY BEGIN")});
}

TEST_F(GestureEventsTest, NewMayBeginWithdrawsTheOutstandingOneFirst) {
    parser.setShouldCancelScrollMayBegin(true);
    gesture(kHIDGestureTypeScroll, kHIDGestureTypePointer);
    create();
    ASSERT_EQ(childCount(), 3u);
    EXPECT_EQ(child(0), hand);
    expectEvent(child(1), kHIDEventTypeScroll, kHIDGesturePhaseCancelled, 0, 0, 0);
    expectEvent(child(2), kHIDEventTypeScroll, kHIDGesturePhaseMayBegin, 0, 0, 0);
    EXPECT_TRUE(parser.shouldCancelScrollMayBegin());
    EXPECT_EQ(sink->messages(), (Messages{kCancelled, created("SCROLL MAY BEGIN")}));
}

TEST_F(GestureEventsTest, ScrollBeginsWithMotion) {
    parser.setShouldCancelScrollMayBegin(true);
    gesture(kHIDGestureTypeScroll, kHIDGestureTypeNone, kHIDGesturePhaseMayBegin, kHIDGesturePhaseMayBegin);
    motion.setMotionDeltas({0.0f, -2.54f, 0.0f, 0.0f});
    create();
    ASSERT_EQ(childCount(), 2u);
    EXPECT_EQ(child(0), hand);
    expectEvent(child(1), kHIDEventTypeScroll, kHIDGesturePhaseBegan, 0, static_cast<double>(-2.54f), 0);
    EXPECT_EQ(parser.currentGesture(), kHIDGestureTypeScroll);
    EXPECT_EQ(parser.currentPhase(), kHIDGesturePhaseBegan);
    // The scroll takes over from its may-begin: nothing is cancelled.
    EXPECT_FALSE(parser.shouldCancelScrollMayBegin());
    EXPECT_EQ(sink->messages(), Messages{created("SCROLL BEGAN")});
    EXPECT_EQ(pointer->doubleValueForField(kHIDEventFieldPointerX), 0.0);
    EXPECT_EQ(pointer->doubleValueForField(kHIDEventFieldPointerY), 0.0);
}

TEST_F(GestureEventsTest, StillScrollAfterAMayBeginBegins) {
    gesture(kHIDGestureTypeScroll, kHIDGestureTypeNone, kHIDGesturePhaseMayBegin);
    create();
    ASSERT_EQ(childCount(), 2u);
    expectEvent(child(1), kHIDEventTypeScroll, kHIDGesturePhaseBegan, 0, 0, 0);
}

TEST_F(GestureEventsTest, ScrollInProgressChanges) {
    gesture(kHIDGestureTypeScroll, kHIDGestureTypeScroll, kHIDGesturePhaseBegan, kHIDGesturePhaseBegan);
    motion.setMotionDeltas({1.27f, 0.0f, 0.0f, 0.0f});
    create();
    ASSERT_EQ(childCount(), 2u);
    expectEvent(child(1), kHIDEventTypeScroll, kHIDGesturePhaseChanged, static_cast<double>(1.27f), 0, 0);
    EXPECT_EQ(parser.currentPhase(), kHIDGesturePhaseChanged);
    EXPECT_TRUE(sink->messages().empty());
}

TEST_F(GestureEventsTest, StillFrameInTheMiddleOfAScrollSendsNoScrollEvent) {
    gesture(kHIDGestureTypeScroll, kHIDGestureTypeScroll, kHIDGesturePhaseChanged, kHIDGesturePhaseChanged);
    ASSERT_EQ(create(), pointer);
    ASSERT_EQ(childCount(), 1u);
    EXPECT_EQ(child(0), hand);
    EXPECT_EQ(parser.currentGesture(), kHIDGestureTypeScroll);
    EXPECT_EQ(parser.currentPhase(), kHIDGesturePhaseChanged);
}

TEST_F(GestureEventsTest, TwoFingersThatRestThenMoveSendMayBeginBeganChangedAndEnded) {
    // Each frame through the whole stage; the scroll sits after the hand event in a pointer
    // event that does not move.
    stats.setNumFingersTouching(2);
    stats.setLastNumFingersTouching(2);
    stats.setMaxFingersTouching(2);
    motion.setLastMaxFingerSpeed(10.0f);
    struct Frame {
        HIDMotion accumulated;
        HIDMotion pixels;
        int fingers;
        uint16_t phase;
        double y;  // the scroll's y: the quantised pixels x -2
    };
    const Frame frames[] = {
        {{0, 0, 0, 0}, {0, 0, 0, 0}, 2, kHIDGesturePhaseMayBegin, 0.0},
        {{0, 6, 0, 0}, {0, 0.635f, 0, 0}, 2, kHIDGesturePhaseBegan, -1.27},
        {{0, 8, 0, 0}, {0, 1.27f, 0, 0}, 2, kHIDGesturePhaseChanged, -2.54},
        {{0, 10, 0, 0}, {0, 1.3f, 0, 0}, 2, kHIDGesturePhaseChanged, -2.54},
        {{0, 0, 0, 0}, {0, 0, 0, 0}, 1, kHIDGesturePhaseEnded, 0.0},
    };
    int last = 2;
    double t = kNow;
    for (const Frame& f : frames) {
        SCOPED_TRACE(t);
        stats.setCurrentTimestamp(ticks(t));
        stats.setNumFingersTouching(f.fingers);
        stats.setLastNumFingersTouching(last);
        if (f.fingers < last) stats.setT_recentFingerLiftoff(ticks(t));
        motion.setAccumulatedDeltas(f.accumulated);
        motion.setPixelDeltas(f.pixels);
        HIDEventRef frameHand = HIDEvent::create(kHIDEventTypeDigitizer, TestClock::msToTicks(t));
        HIDEventRef result = parser.parseHandGesturesCreateHIDEvents(stats, motion, frameHand, dispatcher, true, true);
        ASSERT_NE(result, nullptr);
        ASSERT_EQ(result->children().size(), 2u);
        EXPECT_EQ(result->children()[0], frameHand);
        const HIDEventRef& scroll = result->children()[1];
        EXPECT_EQ(scroll->type(), kHIDEventTypeScroll);
        EXPECT_EQ(scroll->phase(), f.phase);
        EXPECT_EQ(static_cast<float>(scroll->doubleValueForField(kHIDEventFieldScrollY)), static_cast<float>(f.y));
        EXPECT_EQ(result->doubleValueForField(kHIDEventFieldPointerX), 0.0);
        EXPECT_EQ(result->doubleValueForField(kHIDEventFieldPointerY), 0.0);
        last = f.fingers;
        t += 8;
    }
    EXPECT_EQ(sink->messages(),
              (Messages{created("SCROLL MAY BEGIN"), created("SCROLL BEGAN"), created("END SCROLL")}));
}

TEST_F(GestureEventsTest, TwoFingersThatRestAndLiftSendMayBeginThenCancelled) {
    motion.setLastMaxFingerSpeed(10.0f);
    stats.setNumFingersTouching(2);
    stats.setLastNumFingersTouching(0);
    stats.setMaxFingersTouching(2);
    HIDEventRef first = parser.parseHandGesturesCreateHIDEvents(stats, motion, hand, dispatcher, true, true);
    ASSERT_NE(first, nullptr);
    ASSERT_EQ(first->children().size(), 2u);
    EXPECT_EQ(first->children()[1]->phase(), kHIDGesturePhaseMayBegin);

    stats.setCurrentTimestamp(ticks(kNow + 8));
    stats.setNumFingersTouching(1);
    stats.setLastNumFingersTouching(2);
    stats.setT_recentFingerLiftoff(ticks(kNow + 8));
    HIDEventRef second = HIDEvent::create(kHIDEventTypeDigitizer, TestClock::msToTicks(kNow + 8));
    HIDEventRef result = parser.parseHandGesturesCreateHIDEvents(stats, motion, second, dispatcher, true, true);
    ASSERT_NE(result, nullptr);
    ASSERT_EQ(result->children().size(), 2u);
    const HIDEventRef& cancel = result->children()[0];
    EXPECT_EQ(cancel->type(), kHIDEventTypeScroll);
    EXPECT_EQ(cancel->phase(), kHIDGesturePhaseCancelled);
    EXPECT_EQ(cancel->timestamp(), TestClock::msToTicks(kNow + 8));
    EXPECT_EQ(result->children()[1], second);
    EXPECT_EQ(parser.currentPhase(), kHIDGesturePhaseCancelled);
    EXPECT_EQ(stats.t_recentScrollEnd(), ticks(kNow + 8));
    EXPECT_EQ(sink->messages(), (Messages{created("SCROLL MAY BEGIN"), kCancelled}));
}

// ---------------------------------------------------------------------------------------
// Scale and rotation

TEST_F(GestureEventsTest, ScaleBeginsAfterTheCancelAndTheHandEvent) {
    parser.setShouldCancelScrollMayBegin(true);
    button(1, 0);
    gesture(kHIDGestureTypeScale, kHIDGestureTypeNone, kHIDGesturePhaseMayBegin, kHIDGesturePhaseMayBegin);
    motion.setMotionDeltas({0.0f, 0.0f, 0.05f, 0.0f});
    create();
    ASSERT_EQ(childCount(), 4u);
    EXPECT_EQ(child(0)->type(), kHIDEventTypeButton);
    expectEvent(child(1), kHIDEventTypeScroll, kHIDGesturePhaseCancelled, 0, 0, 0);
    EXPECT_EQ(child(2), hand);
    expectEvent(child(3), kHIDEventTypeScale, kHIDGesturePhaseBegan, 0, 0, static_cast<double>(0.05f));
    EXPECT_TRUE(parser.shouldEndScale());
    EXPECT_EQ(parser.currentPhase(), kHIDGesturePhaseBegan);
    EXPECT_EQ(sink->messages(), (Messages{created("BUTTON PRESSED"), kCancelled, created("SCALE BEGAN")}));
}

TEST_F(GestureEventsTest, ScaleInProgressChanges) {
    parser.setShouldEndScale(true);
    gesture(kHIDGestureTypeScale, kHIDGestureTypeScale, kHIDGesturePhaseBegan, kHIDGesturePhaseBegan);
    motion.setMotionDeltas({0.0f, 0.0f, -0.02f, 0.0f});
    create();
    ASSERT_EQ(childCount(), 2u);
    expectEvent(child(1), kHIDEventTypeScale, kHIDGesturePhaseChanged, 0, 0, static_cast<double>(-0.02f));
    EXPECT_TRUE(sink->messages().empty());
}

TEST_F(GestureEventsTest, ScaleWithoutMotionSendsOnlyTheHandEvent) {
    gesture(kHIDGestureTypeScale, kHIDGestureTypeScale, kHIDGesturePhaseChanged, kHIDGesturePhaseChanged);
    create();
    ASSERT_EQ(childCount(), 1u);
    EXPECT_EQ(child(0), hand);
    EXPECT_EQ(parser.currentPhase(), kHIDGesturePhaseChanged);
}

TEST_F(GestureEventsTest, RotationBegins) {
    gesture(kHIDGestureTypeRotate, kHIDGestureTypeNone);
    motion.setMotionDeltas({0.0f, 0.0f, 0.0f, -0.045f});
    create();
    ASSERT_EQ(childCount(), 2u);
    EXPECT_EQ(child(0), hand);
    expectEvent(child(1), kHIDEventTypeRotation, kHIDGesturePhaseBegan, 0, 0, static_cast<double>(-0.045f));
    EXPECT_TRUE(parser.shouldEndRotate());
    EXPECT_EQ(sink->messages(), Messages{created("ROTATE BEGAN")});
}

TEST_F(GestureEventsTest, RotationStillInProgressAfterAScaleChanges) {
    // Back from a scale to a rotation that never ended: it goes on, no new begin.
    parser.setShouldEndRotate(true);
    parser.setShouldEndScale(true);
    gesture(kHIDGestureTypeRotate, kHIDGestureTypeScale, kHIDGesturePhaseChanged, kHIDGesturePhaseChanged);
    motion.setMotionDeltas({0.0f, 0.0f, 0.0f, 0.01f});
    create();
    ASSERT_EQ(childCount(), 2u);
    expectEvent(child(1), kHIDEventTypeRotation, kHIDGesturePhaseChanged, 0, 0, static_cast<double>(0.01f));
    EXPECT_TRUE(sink->messages().empty());
}

TEST_F(GestureEventsTest, RotationWithoutMotionSendsOnlyTheHandEvent) {
    gesture(kHIDGestureTypeRotate, kHIDGestureTypeNone);
    create();
    ASSERT_EQ(childCount(), 1u);
    EXPECT_FALSE(parser.shouldEndRotate());
    EXPECT_TRUE(sink->messages().empty());
}

// ---------------------------------------------------------------------------------------
// Taps

TEST_F(GestureEventsTest, OneFingerTapSendsThePressAtOnceAndReturnsTheRelease) {
    gesture(kHIDGestureTypeOneFingerTap, kHIDGestureTypeNone);
    HIDEventRef result = create(true, false);

    // Delivered twice, the same object: first through the dispatcher carrying the press...
    ASSERT_EQ(sentObjects.size(), 1u);
    EXPECT_EQ(sentObjects[0], pointer);
    const HIDEventRef& sent = sentCopies[0];
    ASSERT_EQ(sent->children().size(), 2u);
    EXPECT_EQ(sent->children()[0]->type(), kHIDEventTypeDigitizer);
    expectButton(sent->children()[1], 1, 1, 1);
    // ...then as the return value, its button event turned into the release.
    ASSERT_EQ(result, pointer);
    ASSERT_EQ(childCount(), 2u);
    EXPECT_EQ(child(0), hand);
    expectButton(child(1), 0, 1, 0);

    EXPECT_EQ(parser.currentGesture(), kHIDGestureTypeNone);
    EXPECT_EQ(parser.currentPhase(), kHIDGesturePhaseNone);
    EXPECT_FALSE(parser.buttonStateWasSent());
    EXPECT_EQ(sink->messages(), Messages{created("1F TAP")});
}

TEST_F(GestureEventsTest, OneFingerTapWithoutTapToClickSendsOnlyTheHandEventAndNoLog) {
    gesture(kHIDGestureTypeOneFingerTap, kHIDGestureTypeNone);
    ASSERT_EQ(create(false, true), pointer);
    EXPECT_TRUE(sentObjects.empty());
    ASSERT_EQ(childCount(), 1u);
    EXPECT_EQ(child(0), hand);
    EXPECT_TRUE(sink->messages().empty());
    EXPECT_EQ(parser.currentGesture(), kHIDGestureTypeOneFingerTap);
}

TEST_F(GestureEventsTest, TapWithAButtonChangeKeepsTheButtonFirst) {
    button(1, 0);
    gesture(kHIDGestureTypeOneFingerTap, kHIDGestureTypeNone);
    create();
    ASSERT_EQ(childCount(), 3u);
    expectButton(child(0), 1, 1, 1);
    EXPECT_EQ(child(1), hand);
    expectButton(child(2), 0, 1, 0);
}

TEST_F(GestureEventsTest, OneFingerTapWithoutADispatcherStillReturnsTheRelease) {
    gesture(kHIDGestureTypeOneFingerTap, kHIDGestureTypeNone);
    HIDEventRef result =
        parser.createGestureEvents(stats, motion, hand, pointer, nullptr, HIDDispatchHandler(), true, true);
    ASSERT_EQ(result, pointer);
    ASSERT_EQ(childCount(), 2u);
    expectButton(child(1), 0, 1, 0);
}

TEST_F(GestureEventsTest, TwoFingerTapPressesTheSecondaryButtonAndSendsTheCancelWithThePressOnly) {
    parser.setShouldCancelScrollMayBegin(true);
    gesture(kHIDGestureTypeTwoFingerTap, kHIDGestureTypeNone, kHIDGesturePhaseNone, kHIDGesturePhaseMayBegin);
    HIDEventRef result = create(true, true);

    ASSERT_EQ(sentCopies.size(), 1u);
    const HIDEventRef& sent = sentCopies[0];
    ASSERT_EQ(sent->children().size(), 3u);
    expectEvent(sent->children()[0], kHIDEventTypeScroll, kHIDGesturePhaseCancelled, 0, 0, 0);
    EXPECT_EQ(sent->children()[1]->type(), kHIDEventTypeDigitizer);
    expectButton(sent->children()[2], 2, 2, 1);

    ASSERT_EQ(result, pointer);
    ASSERT_EQ(childCount(), 2u);
    EXPECT_EQ(child(0), hand);
    expectButton(child(1), 0, 1, 0);
    EXPECT_EQ(parser.currentGesture(), kHIDGestureTypeNone);
    EXPECT_EQ(parser.currentPhase(), kHIDGesturePhaseNone);
    EXPECT_EQ(sink->messages(), (Messages{kCancelled, created("2F TAP")}));
}

TEST_F(GestureEventsTest, TwoFingerTapWithoutAMayBeginSendsNoCancel) {
    gesture(kHIDGestureTypeTwoFingerTap, kHIDGestureTypeNone);
    create(true, true);
    ASSERT_EQ(sentCopies.size(), 1u);
    ASSERT_EQ(sentCopies[0]->children().size(), 2u);
    EXPECT_EQ(sentCopies[0]->children()[0]->type(), kHIDEventTypeDigitizer);
    expectButton(sentCopies[0]->children()[1], 2, 2, 1);
    EXPECT_EQ(sink->messages(), Messages{created("2F TAP")});
}

TEST_F(GestureEventsTest, TwoFingerTapNeedsBothSettings) {
    const bool settings[][2] = {{true, false}, {false, true}, {false, false}};
    for (const auto& s : settings) {
        SCOPED_TRACE(testing::Message() << "tap-to-click " << s[0] << ", secondary " << s[1]);
        pointer = HIDEvent::pointerEvent(hand->timestamp(), 0.0, 0.0, 0.0, 0, 0);
        gesture(kHIDGestureTypeTwoFingerTap, kHIDGestureTypeNone);
        ASSERT_EQ(create(s[0], s[1]), pointer);
        ASSERT_EQ(childCount(), 1u);
        EXPECT_EQ(child(0), hand);
        EXPECT_EQ(parser.currentGesture(), kHIDGestureTypeTwoFingerTap);
    }
    EXPECT_TRUE(sentObjects.empty());
    EXPECT_TRUE(sink->messages().empty());
}

// ---------------------------------------------------------------------------------------
// Nothing to send, and withdrawing a may-begin

TEST_F(GestureEventsTest, QuietFrameSendsTheHandEventAlone) {
    ASSERT_EQ(create(), pointer);
    ASSERT_EQ(childCount(), 1u);
    EXPECT_EQ(child(0), hand);
    EXPECT_TRUE(sink->messages().empty());
}

TEST_F(GestureEventsTest, HandLeavingAMayBeginWithdrawsItBeforeTheHandEvent) {
    parser.setShouldCancelScrollMayBegin(true);
    gesture(kHIDGestureTypeNone, kHIDGestureTypeNone, kHIDGesturePhaseNone, kHIDGesturePhaseMayBegin);
    create();
    ASSERT_EQ(childCount(), 2u);
    expectEvent(child(0), kHIDEventTypeScroll, kHIDGesturePhaseCancelled, 0, 0, 0);
    EXPECT_EQ(child(1), hand);
    EXPECT_EQ(parser.currentPhase(), kHIDGesturePhaseCancelled);
    EXPECT_FALSE(parser.shouldCancelScrollMayBegin());
    EXPECT_EQ(sink->messages(), Messages{kCancelled});
}

TEST_F(GestureEventsTest, NothingOutstandingIsNotCancelledAgainButThePhaseSaysCancelled) {
    gesture(kHIDGestureTypeNone, kHIDGestureTypeNone, kHIDGesturePhaseNone, kHIDGesturePhaseMayBegin);
    create();
    ASSERT_EQ(childCount(), 1u);
    EXPECT_EQ(child(0), hand);
    EXPECT_EQ(parser.currentPhase(), kHIDGesturePhaseCancelled);
    EXPECT_TRUE(sink->messages().empty());
    EXPECT_EQ(stats.t_recentScrollEnd(), 0.0);
}

TEST_F(GestureEventsTest, CancellingWithNothingOutstandingDoesNothing) {
    EXPECT_EQ(parser.cancelScrollMayBegin(stats, pointer), nullptr);
    EXPECT_TRUE(pointer->children().empty());
    EXPECT_EQ(stats.t_recentScrollEnd(), 0.0);
    EXPECT_TRUE(sink->messages().empty());
}

TEST_F(GestureEventsTest, CancellingAnOutstandingMayBeginAppendsACancelledScroll) {
    parser.setShouldCancelScrollMayBegin(true);
    HIDEventRef other = HIDEvent::pointerEvent(1234, 0.0, 0.0, 0.0, 0, 0);
    HIDEventRef cancel = parser.cancelScrollMayBegin(stats, other);
    ASSERT_NE(cancel, nullptr);
    ASSERT_EQ(other->children().size(), 1u);
    EXPECT_EQ(other->children()[0], cancel);
    EXPECT_EQ(cancel->type(), kHIDEventTypeScroll);
    EXPECT_EQ(cancel->timestamp(), 1234u);  // the pointer event's
    EXPECT_EQ(cancel->phase(), kHIDGesturePhaseCancelled);
    EXPECT_EQ(cancel->doubleValueForField(kHIDEventFieldScrollX), 0.0);
    EXPECT_EQ(cancel->doubleValueForField(kHIDEventFieldScrollY), 0.0);
    EXPECT_EQ(cancel->doubleValueForField(kHIDEventFieldScrollZ), 0.0);
    EXPECT_EQ(stats.t_recentScrollEnd(), ticks(kNow));
    EXPECT_FALSE(parser.shouldCancelScrollMayBegin());
    EXPECT_EQ(sink->messages(), Messages{kCancelled});
    // Once only.
    EXPECT_EQ(parser.cancelScrollMayBegin(stats, other), nullptr);
}

TEST_F(GestureEventsTest, WithoutAHandEventNothingIsMade) {
    button(1, 0);
    gesture(kHIDGestureTypePointer, kHIDGestureTypeNone);
    EXPECT_EQ(parser.createGestureEvents(stats, motion, nullptr, pointer, nullptr, dispatcher, true, true), nullptr);
    EXPECT_TRUE(pointer->children().empty());
    EXPECT_FALSE(parser.buttonStateWasSent());
    EXPECT_TRUE(sink->messages().empty());
}

TEST_F(GestureEventsTest, GestureLinesGoToTheFilterLogAtDefaultLevel) {
    gesture(kHIDGestureTypePointer, kHIDGestureTypeNone);
    create();
    const auto entries = sink->entries();
    ASSERT_EQ(entries.size(), 1u);
    EXPECT_EQ(entries[0].category, "ServiceFilter");
    EXPECT_EQ(entries[0].level, LogLevel::Default);
}

TEST_F(GestureEventsTest, EveryEventMadeCarriesTheHandEventsTimestamp) {
    parser.setShouldCancelScrollMayBegin(true);
    button(1, 0);
    gesture(kHIDGestureTypeRotate, kHIDGestureTypeNone);
    motion.setMotionDeltas({0.0f, 0.0f, 0.0f, 0.5f});
    create();
    ASSERT_EQ(childCount(), 4u);
    for (const HIDEventRef& c : pointer->children()) {
        EXPECT_EQ(c->timestamp(), hand->timestamp());
        EXPECT_EQ(c->options(), 0u);
    }
}

}  // namespace
}  // namespace orvane
