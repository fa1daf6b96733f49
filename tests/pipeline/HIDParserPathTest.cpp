// One finger path: reading contacts, stage tests, stage times, peak displacement, the
// one-axis hysteresis, the screen-UI position filter, velocity damping and clearing.

#include <gtest/gtest.h>

#include <cmath>
#include <memory>

#include "filter/FilterLogging.h"
#include "pipeline/HIDParserPath.h"
#include "platform/Logging.h"
#include "tests/support/FrameBuilder.h"

using namespace orvane;
using orvane::test::ContactFields;
using orvane::test::contactEvent;
using orvane::test::TestClock;

namespace {

// A surface whose fractions 1/1024 and 1/512 land on whole units, so positions are exact.
constexpr float kWidth = 1024.0f;
constexpr float kHeight = 512.0f;

HIDParserPath makePath() { return HIDParserPath(kHeight, kWidth); }

// A contact at surface position (x, y) (y already flipped: larger y nearer the diving button).
HIDEventRef contactAt(float x, float y, int touch = 1, int index = 0, int type = 1) {
    ContactFields c;
    c.index = index;
    c.x = static_cast<double>(x) / kWidth;
    c.y = 1.0 - static_cast<double>(y) / kHeight;
    c.touch = touch;
    c.range = touch;
    c.type = type;
    return contactEvent(c, 0);
}

HIDContact contact(int tip, float x, float y, double time = 0.0, int pathID = 1) {
    HIDContact c{};
    c.fingerTipSwitch = tip;
    c.fingerConfidence = 1;
    c.path_id = pathID;
    c.finger_id = pathID + 1;
    c.position = HIDPoint{x, y};
    c.device_timestamp = time;
    return c;
}

// Reads one contact and runs the UI filter, as the path table does for each child.
void readAndFilter(HIDParserPath& path, const HIDEventRef& e, double time, bool strongDamping = false) {
    path.updateCurPrevContactsWith(*e, time);
    path.filterContactForScreenUI(strongDamping);
}

double ticks(double ms) { return static_cast<double>(TestClock::msToTicks(ms)); }

}  // namespace

// ---- Construction and reading a contact ----

TEST(HIDParserPath, NewPathHasSurfaceDimensionsAndEverythingElseZero) {
    HIDParserPath path(300.0f, 700.0f);
    EXPECT_EQ(path.surfaceDimensions().x, 700.0f);
    EXPECT_EQ(path.surfaceDimensions().y, 300.0f);
    EXPECT_EQ(path.currentContact().fingerTipSwitch, 0);
    EXPECT_EQ(path.currentContact().path_id, 0);
    EXPECT_EQ(path.previousContact().position.x, 0.0f);
    EXPECT_EQ(path.peakDisplacement(), 0.0f);
    EXPECT_EQ(path.timestamps().t_makeTouch, 0.0);
    EXPECT_FALSE(path.isTouching());
}

TEST(HIDParserPath, ContactReadGivesPathIdOneAboveIndexAndFingerIdTwoAbove) {
    auto path = makePath();
    path.updateCurPrevContactsWith(*contactAt(256, 128, 1, 4), 77.0);
    EXPECT_EQ(path.currentContact().path_id, 5);
    EXPECT_EQ(path.currentContact().finger_id, 6);
    EXPECT_EQ(path.currentContact().fingerTipSwitch, 1);
    EXPECT_EQ(path.currentContact().fingerConfidence, 1);
    EXPECT_EQ(path.currentContact().device_timestamp, 77.0);
}

TEST(HIDParserPath, ContactPositionScalesXAndFlipsY) {
    auto path = makePath();
    ContactFields c;
    c.x = 0.25;   // 0.25 × 1024 = 256
    c.y = 0.125;  // (1 − 0.125) × 512 = 448
    path.updateCurPrevContactsWith(*contactEvent(c, 0), 1.0);
    EXPECT_EQ(path.currentContact().position.x, 256.0f);
    EXPECT_EQ(path.currentContact().position.y, 448.0f);
}

TEST(HIDParserPath, FlippedYIsComputedInSinglePrecision) {
    HIDParserPath path(500.0f, 1000.0f);
    ContactFields c;
    c.x = 0.5;
    c.y = 0.058;
    path.updateCurPrevContactsWith(*contactEvent(c, 0), 1.0);
    // (1 − (float)0.058) × 500 in float is 471.000031; in double it would round to 471.
    const float expected = (1.0f - static_cast<float>(0.058)) * 500.0f;
    EXPECT_EQ(path.currentContact().position.y, expected);
    EXPECT_NE(path.currentContact().position.y, 471.0f);
}

TEST(HIDParserPath, PalmTransducerHasNoFingerConfidence) {
    auto path = makePath();
    path.updateCurPrevContactsWith(*contactAt(256, 128, 1, 0, 3), 1.0);
    EXPECT_EQ(path.currentContact().fingerConfidence, 0);
    EXPECT_TRUE(path.isPalmContact());
    EXPECT_FALSE(path.isFingerOrRestingContact());
    // Type 2 (hand) is not a palm.
    path.updateCurPrevContactsWith(*contactAt(256, 128, 1, 0, 2), 2.0);
    EXPECT_EQ(path.currentContact().fingerConfidence, 1);
    EXPECT_FALSE(path.wasFingerOrRestingContact());
}

TEST(HIDParserPath, VelocityIsPositionChangePerFrameOnceThereIsAPreviousPosition) {
    auto path = makePath();
    path.updateCurPrevContactsWith(*contactAt(256, 128), 1.0);
    EXPECT_EQ(path.currentContact().velocity.x, 0.0f);
    EXPECT_EQ(path.currentContact().velocity.y, 0.0f);
    path.updateCurPrevContactsWith(*contactAt(260, 126), 2.0);
    EXPECT_EQ(path.currentContact().velocity.x, 4.0f);
    EXPECT_EQ(path.currentContact().velocity.y, -2.0f);
}

TEST(HIDParserPath, VelocityKeepsItsValueWhenPreviousXIsZero) {
    auto path = makePath();
    HIDContact c = contact(1, 0.0f, 128.0f);
    c.velocity = HIDPoint{7.0f, 9.0f};
    path.setCurrentContact(c);
    path.updateCurPrevContactsWith(*contactAt(256, 128), 2.0);
    EXPECT_EQ(path.currentContact().velocity.x, 7.0f);
    EXPECT_EQ(path.currentContact().velocity.y, 9.0f);
}

TEST(HIDParserPath, TouchDownResetsInitialPositionAndPeak) {
    auto path = makePath();
    path.setInitialPosition(HIDPoint{1.0f, 1.0f});
    path.setLongTermPosition(HIDPoint{2.0f, 2.0f});
    path.setPeakDisplacement(50.0f);
    path.updateCurPrevContactsWith(*contactAt(300, 200), 1.0);
    EXPECT_EQ(path.initialPosition().x, 300.0f);
    EXPECT_EQ(path.initialPosition().y, 200.0f);
    EXPECT_EQ(path.longTermPosition().x, 300.0f);
    EXPECT_EQ(path.longTermPosition().y, 200.0f);
    EXPECT_EQ(path.peakDisplacement(), 0.0f);
}

// ---- Stage tests ----

TEST(HIDParserPath, FirstFrameOfTouchIsNewAndLiftOffStageButNotMakeStage) {
    auto path = makePath();
    path.updateCurPrevContactsWith(*contactAt(300, 200), 1234.0);
    EXPECT_TRUE(path.isNewContact());
    EXPECT_TRUE(path.isLiftOffStage());
    EXPECT_FALSE(path.isMakeStage());
    EXPECT_TRUE(path.isTouching());
    EXPECT_FALSE(path.wasTouching());
    EXPECT_EQ(path.timestamps().t_makeTouch, 1234.0);
    EXPECT_EQ(path.timestamps().t_breakTouch, 0.0);
}

TEST(HIDParserPath, FrameAfterLiftIsMakeStageAndStampsBreakTouchOnlyOnce) {
    auto path = makePath();
    path.updateCurPrevContactsWith(*contactAt(300, 200), 100.0);
    path.updateCurPrevContactsWith(*contactAt(300, 200), 200.0);
    EXPECT_FALSE(path.isMakeStage());
    path.updateCurPrevContactsWith(*contactAt(300, 200, 0), 300.0);
    EXPECT_TRUE(path.isMakeStage());
    EXPECT_FALSE(path.isLiftOffStage());
    EXPECT_FALSE(path.isNewContact());
    EXPECT_EQ(path.timestamps().t_breakTouch, 300.0);
    path.updateCurPrevContactsWith(*contactAt(300, 200, 0), 400.0);
    EXPECT_FALSE(path.isMakeStage());
    EXPECT_EQ(path.timestamps().t_breakTouch, 300.0);
    EXPECT_EQ(path.timestamps().t_makeTouch, 100.0);
}

TEST(HIDParserPath, BreakTouchIsNotRestampedWhenAlreadyAfterMakeTouch) {
    auto path = makePath();
    HIDPathTimestamps t{};
    t.t_makeTouch = 100.0;
    t.t_breakTouch = 150.0;  // the touch's end is already recorded
    path.setTimestamps(t);
    path.setPreviousContact(contact(1, 1, 1));
    path.setCurrentContact(contact(0, 1, 1));
    path.updatePathStageTimestamps(300.0);
    EXPECT_EQ(path.timestamps().t_breakTouch, 150.0);
    EXPECT_EQ(path.timestamps().t_makeTouch, 100.0);
}

TEST(HIDParserPath, NoTrackingStageMeansTipSwitchZeroWhateverThePathId) {
    auto path = makePath();
    path.setCurrentContact(contact(0, 10, 10, 0, 3));
    EXPECT_TRUE(path.isNoTrackingStage());
    path.setCurrentContact(contact(1, 10, 10, 0, 0));
    EXPECT_FALSE(path.isNoTrackingStage());
}

TEST(HIDParserPath, NewContactNeedsTipSwitchExactlyOne) {
    auto path = makePath();
    path.setPreviousContact(contact(0, 10, 10));
    path.setCurrentContact(contact(2, 10, 10));
    EXPECT_TRUE(path.isTouching());
    EXPECT_FALSE(path.isNewContact());
    EXPECT_FALSE(path.isLiftOffStage());
}

TEST(HIDParserPath, FingerContactExcludesThumbZoneAndWasRestingReportsThumbZone) {
    auto path = makePath();
    path.setCurrentContact(contact(1, 10, 10));
    EXPECT_TRUE(path.isFingerContact());
    path.setRestingContact(true);
    EXPECT_TRUE(path.isResting());
    EXPECT_FALSE(path.wasResting());  // isResting does not feed wasResting
    path.setRestingInThumbZone(true);
    EXPECT_FALSE(path.isFingerContact());
    EXPECT_FALSE(path.wasResting());
    path.setRestingInThumbZone(false);
    EXPECT_TRUE(path.wasResting());
    EXPECT_FALSE(path.isRestingInThumbZone());
    EXPECT_TRUE(path.isFingerContact());
}

TEST(HIDParserPath, SetRestingInThumbZoneCopiesOldFlagFirst) {
    auto path = makePath();
    path.setRestingInThumbZone(true);
    EXPECT_TRUE(path.isRestingInThumbZone());
    EXPECT_FALSE(path.wasRestingInThumbZone());
    path.setRestingInThumbZone(true);
    EXPECT_TRUE(path.wasRestingInThumbZone());
    path.setRestingInThumbZone(false);
    EXPECT_TRUE(path.wasRestingInThumbZone());
    path.setRestingInThumbZone(false);
    EXPECT_FALSE(path.wasRestingInThumbZone());
}

TEST(HIDParserPath, ContactAtSixTenthsOfHeightIsOnDivingButton) {
    HIDParserPath path(500.0f, 1000.0f);
    path.setCurrentContact(contact(1, 500.0f, 300.0f));  // 0.6 × 500
    EXPECT_TRUE(path.isContactOnDivingButton());
}

TEST(HIDParserPath, ContactAtExactlyHalfHeightIsNotOnDivingButton) {
    HIDParserPath path(500.0f, 1000.0f);
    path.setCurrentContact(contact(1, 500.0f, 250.0f));  // 0.5 × 500
    EXPECT_FALSE(path.isContactOnDivingButton());
    path.setCurrentContact(contact(1, 500.0f, std::nextafter(250.0f, 1000.0f)));
    EXPECT_TRUE(path.isContactOnDivingButton());
}

TEST(HIDParserPath, ContactAtExactlyOneFifthOfWidthIsEdgeContact) {
    HIDParserPath path(500.0f, 1000.0f);
    path.setCurrentContact(contact(1, 200.0f, 250.0f));  // 1000 / 5
    EXPECT_TRUE(path.isEdgeContact());
    path.setCurrentContact(contact(1, 200.5f, 250.0f));
    EXPECT_FALSE(path.isEdgeContact());
}

TEST(HIDParserPath, ContactAtExactlyQuarterOfHeightIsEdgeContact) {
    HIDParserPath path(500.0f, 1000.0f);
    path.setCurrentContact(contact(1, 500.0f, 125.0f));  // 500 × 0.25
    EXPECT_TRUE(path.isEdgeContact());
    path.setCurrentContact(contact(1, 500.0f, 125.5f));
    EXPECT_FALSE(path.isEdgeContact());
}

TEST(HIDParserPath, EdgeBandIsOneFifthAtRightAndTopButOneQuarterAtBottom) {
    HIDParserPath path(500.0f, 1000.0f);
    path.setCurrentContact(contact(1, 800.0f, 250.0f));  // 1000 × 4 / 5
    EXPECT_TRUE(path.isEdgeContact());
    path.setCurrentContact(contact(1, 799.5f, 250.0f));
    EXPECT_FALSE(path.isEdgeContact());
    path.setCurrentContact(contact(1, 500.0f, 400.0f));  // 500 × 4 / 5
    EXPECT_TRUE(path.isEdgeContact());
    path.setCurrentContact(contact(1, 500.0f, 399.5f));
    EXPECT_FALSE(path.isEdgeContact());
}

// ---- Peak displacement ----

TEST(HIDParserPath, PeakDisplacementIsDistanceFromTouchDownPoint) {
    auto path = makePath();
    path.updateCurPrevContactsWith(*contactAt(300, 200), 1.0);
    path.updateCurPrevContactsWith(*contactAt(303, 204), 2.0);
    // √(3² + 4²) = 5
    EXPECT_EQ(path.peakDisplacement(), 5.0f);
}

TEST(HIDParserPath, FingerMovingBackTowardTouchDownKeepsPeakDisplacement) {
    auto path = makePath();
    path.updateCurPrevContactsWith(*contactAt(300, 200), 1.0);
    path.updateCurPrevContactsWith(*contactAt(306, 208), 2.0);  // √(36 + 64) = 10
    EXPECT_EQ(path.peakDisplacement(), 10.0f);
    path.updateCurPrevContactsWith(*contactAt(303, 204), 3.0);  // 5 from the start
    EXPECT_EQ(path.peakDisplacement(), 10.0f);
    path.updateCurPrevContactsWith(*contactAt(300, 200), 4.0);
    EXPECT_EQ(path.peakDisplacement(), 10.0f);
}

// ---- One-axis hysteresis ----

TEST(HIDParserPath, HysteresisCentreStepsPastPreviousQuantizedValue) {
    float c = 0.0f;
    // 1.5 − 0 > 1, so the centre would be 1.5 − 1 = 0.5, equal to q: one step more, 0.525.
    EXPECT_TRUE(HIDParserPath::applyMinimumIncrementHysteresis(1.5f, c, 0.5f, 1.0f));
    EXPECT_EQ(c, static_cast<float>(0.5 + 0.025));
    EXPECT_EQ(c, 0.525f);
}

TEST(HIDParserPath, HysteresisHoldsCentreInsideRadius) {
    float c = 0.0f;
    EXPECT_FALSE(HIDParserPath::applyMinimumIncrementHysteresis(0.9f, c, 0.5f, 1.0f));
    EXPECT_EQ(c, 0.0f);
    EXPECT_FALSE(HIDParserPath::applyMinimumIncrementHysteresis(-1.0f, c, 0.5f, 1.0f));  // |diff| = r exactly
    EXPECT_EQ(c, 0.0f);
}

TEST(HIDParserPath, HysteresisStepGoesDownWhenValueFell) {
    float c = 0.0f;
    // −1.5 − 0 < −1: centre −1.5 + 1 = −0.5 = q, stepped on to −0.525.
    EXPECT_TRUE(HIDParserPath::applyMinimumIncrementHysteresis(-1.5f, c, -0.5f, 1.0f));
    EXPECT_EQ(c, -0.525f);
}

TEST(HIDParserPath, HysteresisCentreFollowsValueAtRadiusWhenNotRepeating) {
    float c = 10.0f;
    EXPECT_TRUE(HIDParserPath::applyMinimumIncrementHysteresis(12.0f, c, 10.0f, 0.5f));
    EXPECT_EQ(c, 11.5f);
}

TEST(HIDParserPath, PixelHysteresisRunsBothAxesAndReportsEitherMoving) {
    HIDPoint c{0.0f, 0.0f};
    EXPECT_TRUE(HIDParserPath::applyAbsolutePixelHysteresis(HIDPoint{0.5f, 3.0f}, c, HIDPoint{9.0f, 9.0f}, 1.0f));
    EXPECT_EQ(c.x, 0.0f);
    EXPECT_EQ(c.y, 2.0f);
    EXPECT_TRUE(HIDParserPath::applyAbsolutePixelHysteresis(HIDPoint{-3.0f, 2.5f}, c, HIDPoint{9.0f, 9.0f}, 1.0f));
    EXPECT_EQ(c.x, -2.0f);
    EXPECT_EQ(c.y, 2.0f);
    EXPECT_FALSE(HIDParserPath::applyAbsolutePixelHysteresis(HIDPoint{-2.5f, 1.5f}, c, HIDPoint{9.0f, 9.0f}, 1.0f));
    EXPECT_TRUE(HIDParserPath::applyAbsolutePixelHysteresis(HIDPoint{-4.0f, 5.0f}, c, HIDPoint{9.0f, 9.0f}, 1.0f));
    EXPECT_EQ(c.x, -3.0f);
    EXPECT_EQ(c.y, 4.0f);
}

// ---- The screen-UI filter ----

TEST(HIDParserPath, FirstTouchingFrameTakesResetBranch) {
    auto path = makePath();
    path.setStablePositionForUI(HIDPoint{5.0f, 6.0f});
    path.setPixelDelta(HIDPoint{1.0f, 1.0f});
    path.setCumulativeDeltas(HIDPoint{3.0f, 3.0f});
    readAndFilter(path, contactAt(300, 200), 1.0);
    EXPECT_EQ(path.pixelDelta().x, 0.0f);
    EXPECT_EQ(path.pixelDelta().y, 0.0f);
    EXPECT_EQ(path.cumulativeDeltas().x, 0.0f);
    EXPECT_EQ(path.cumulativeDeltas().y, 0.0f);
    EXPECT_EQ(path.stablePositionForUI().x, 300.0f);
    EXPECT_EQ(path.stablePositionForUI().y, 200.0f);
    EXPECT_EQ(path.previousStablePositionForUI().x, 5.0f);
    EXPECT_EQ(path.previousStablePositionForUI().y, 6.0f);
    EXPECT_EQ(path.hysteresisCenter().x, 300.0f);
    EXPECT_EQ(path.hysteresisCenter().y, 200.0f);
    EXPECT_EQ(path.currentContact().position.x, 300.0f);
    EXPECT_EQ(path.currentContact().position.y, 200.0f);
}

TEST(HIDParserPath, StationaryFingerUnderJitterStaysExactlyAtCentre) {
    HIDParserPath path(500.0f, 1000.0f);
    auto at = [](double x, double y) {
        ContactFields c;
        c.x = x / 1000.0;
        c.y = 1.0 - y / 500.0;
        return contactEvent(c, 0);
    };
    readAndFilter(path, at(500.0, 250.0), 1.0);
    const HIDPoint centre = path.currentContact().position;
    // Every reading lies within 0.05 of the centre on both axes.
    const double jitter[][2] = {{500.03, 250.02}, {499.97, 249.96}, {500.04, 250.04}, {499.96, 249.97}};
    double t = 2.0;
    for (const auto& j : jitter) {
        readAndFilter(path, at(j[0], j[1]), t);
        t += 1.0;
        EXPECT_EQ(path.currentContact().position.x, centre.x);
        EXPECT_EQ(path.currentContact().position.y, centre.y);
        EXPECT_EQ(path.pixelDelta().x, 0.0f);
        EXPECT_EQ(path.pixelDelta().y, 0.0f);
        EXPECT_EQ(path.cumulativeDeltas().x, 0.0f);
        EXPECT_EQ(path.cumulativeDeltas().y, 0.0f);
    }
}

TEST(HIDParserPath, MovingFingerTrailsByTheRadiusAndAccumulatesPixelDeltas) {
    auto path = makePath();
    readAndFilter(path, contactAt(512, 256), 1.0);
    readAndFilter(path, contactAt(515, 254), 2.0);
    // Centre x: 515 − 0.05f; y: 254 + 0.05f (all in float).
    const float cx = 515.0f - 0.05f;
    const float cy = 254.0f + 0.05f;
    EXPECT_EQ(path.hysteresisCenter().x, cx);
    EXPECT_EQ(path.hysteresisCenter().y, cy);
    EXPECT_EQ(path.currentContact().position.x, cx);
    EXPECT_EQ(path.currentContact().position.y, cy);
    EXPECT_EQ(path.pixelDelta().x, cx - 512.0f);
    EXPECT_EQ(path.pixelDelta().y, cy - 256.0f);
    EXPECT_EQ(path.cumulativeDeltas().x, cx - 512.0f);
    // The velocity is the raw reading less the previous (steadied) position: (3, −2).
    EXPECT_EQ(path.engagedVelocity().x, 3.0f);
    EXPECT_EQ(path.engagedVelocity().y, -2.0f);
    EXPECT_EQ(path.engagedSpeed(), sqrtf(13.0f));
    // The stable position stays where the touch began.
    EXPECT_EQ(path.stablePositionForUI().x, 512.0f);

    readAndFilter(path, contactAt(518, 254.0625f), 3.0);
    const float cx2 = 518.0f - 0.05f;
    EXPECT_EQ(path.pixelDelta().x, cx2 - cx);
    EXPECT_EQ(path.pixelDelta().y, 0.0f);  // 254.0625 is within 0.05 of 254.05
    EXPECT_EQ(path.cumulativeDeltas().x, (cx - 512.0f) + (cx2 - cx));
    EXPECT_EQ(path.cumulativeDeltas().y, cy - 256.0f);
}

TEST(HIDParserPath, CentreThatWouldRepeatPreviousPositionStepsOnByAQuarterOfTheRadiusMore) {
    auto path = makePath();
    readAndFilter(path, contactAt(512, 256), 1.0);
    readAndFilter(path, contactAt(512, 254), 2.0);
    const float cy = 254.0f + 0.05f;  // the steadied y, which becomes the previous position
    ASSERT_EQ(path.currentContact().position.y, cy);
    // The raw 254 again: 254 − 254.05f = −0.050003 < −0.05f, so the centre would be 254 + 0.05f,
    // the previous position itself; it moves 0.025 further down (in double, stored as float).
    readAndFilter(path, contactAt(512, 254), 3.0);
    const float stepped = static_cast<float>(static_cast<double>(cy) - 0.025);
    EXPECT_EQ(path.currentContact().position.y, stepped);
    EXPECT_EQ(path.pixelDelta().y, stepped - cy);
    EXPECT_EQ(path.pixelDelta().x, 0.0f);
}

TEST(HIDParserPath, ReidentifiedPathTakesResetBranch) {
    auto path = makePath();
    readAndFilter(path, contactAt(512, 256, 1, 0), 1.0);
    readAndFilter(path, contactAt(530, 256, 1, 3), 2.0);  // a different path ID in the same object
    EXPECT_EQ(path.pixelDelta().x, 0.0f);
    EXPECT_EQ(path.stablePositionForUI().x, 530.0f);
    EXPECT_EQ(path.previousStablePositionForUI().x, 512.0f);
    EXPECT_EQ(path.currentContact().position.x, 530.0f);
}

TEST(HIDParserPath, LiftFrameTakesResetBranchAndReanchorsInitialPosition) {
    auto path = makePath();
    readAndFilter(path, contactAt(512, 256), 1.0);
    readAndFilter(path, contactAt(520, 256), 2.0);
    readAndFilter(path, contactAt(540, 256, 0), 3.0);
    EXPECT_EQ(path.pixelDelta().x, 0.0f);
    EXPECT_EQ(path.currentContact().position.x, 540.0f);
    EXPECT_EQ(path.stablePositionForUI().x, 540.0f);
    EXPECT_EQ(path.initialPosition().x, 540.0f);
    EXPECT_EQ(path.longTermPosition().x, 540.0f);
}

// ---- Velocity damping ----

TEST(HIDParserPath, DampedVelocityHalvesOldWeightEveryFourteenMilliseconds) {
    auto path = makePath();
    HIDContact prev = contact(1, 10, 10, ticks(1000.0));
    HIDContact cur = contact(1, 12, 6, ticks(1014.0));
    cur.velocity = HIDPoint{2.0f, -4.0f};
    path.setPreviousContact(prev);
    path.setCurrentContact(cur);
    path.updateDampedVelocity(false);
    // k = 2^(−14/14) = 0.5: 0 × 0.5 + v × 0.5 = v / 2.
    EXPECT_EQ(path.dampedVelocity().x, 1.0f);
    EXPECT_EQ(path.dampedVelocity().y, -2.0f);
    EXPECT_EQ(path.dampedSpeed(), sqrtf(5.0f));
}

TEST(HIDParserPath, DampedVelocityOverSevenMillisecondsUsesSinglePrecisionWeight) {
    auto path = makePath();
    path.setDampedVelocity(HIDPoint{8.0f, 0.0f});
    HIDContact cur = contact(1, 12, 6, ticks(1007.0));
    cur.velocity = HIDPoint{0.0f, 4.0f};
    path.setPreviousContact(contact(1, 10, 10, ticks(1000.0)));
    path.setCurrentContact(cur);
    path.updateDampedVelocity(false);
    // k = 2^(−0.5) stored as a float ≈ 0.70710677; x = 8k, y = 4(1 − k), both in float.
    const float k = static_cast<float>(std::pow(2.0, -0.5));
    EXPECT_EQ(path.dampedVelocity().x, 8.0f * k);
    EXPECT_EQ(path.dampedVelocity().y, 4.0f * (1.0f - k));
    EXPECT_NEAR(path.dampedVelocity().x, 5.656854f, 1e-5);
    EXPECT_NEAR(path.dampedVelocity().y, 1.171573f, 1e-5);
}

TEST(HIDParserPath, DampedVelocityDoesNotDecayWithoutPreviousFrameTime) {
    auto path = makePath();
    path.setDampedVelocity(HIDPoint{3.0f, 4.0f});
    HIDContact cur = contact(1, 12, 6, ticks(1014.0));
    cur.velocity = HIDPoint{100.0f, 100.0f};
    path.setPreviousContact(contact(1, 10, 10, 0.0));
    path.setCurrentContact(cur);
    path.updateDampedVelocity(false);
    // dt = 0 → k = 1: the old value stays and the new velocity has no weight.
    EXPECT_EQ(path.dampedVelocity().x, 3.0f);
    EXPECT_EQ(path.dampedVelocity().y, 4.0f);
    EXPECT_EQ(path.dampedSpeed(), 5.0f);
}

TEST(HIDParserPath, DampedVelocityIsZeroedBeforeDecayOnFrameAfterLift) {
    auto path = makePath();
    path.setDampedVelocity(HIDPoint{3.0f, 4.0f});
    path.setDampedSpeed(5.0f);
    HIDContact cur = contact(0, 12, 6, ticks(1014.0));
    cur.velocity = HIDPoint{2.0f, -4.0f};
    path.setPreviousContact(contact(1, 10, 10, ticks(1000.0)));
    path.setCurrentContact(cur);
    ASSERT_TRUE(path.isMakeStage());
    path.updateDampedVelocity(false);
    // (3, 4) × 0 = 0, then 0 × 0.5 + (2, −4) × 0.5 = (1, −2); without the zeroing it would be (2.5, 0).
    EXPECT_EQ(path.dampedVelocity().x, 1.0f);
    EXPECT_EQ(path.dampedVelocity().y, -2.0f);
    EXPECT_EQ(path.dampedSpeed(), sqrtf(5.0f));
}

TEST(HIDParserPath, DampedVelocityAndSpeedAreZeroOnLiftFrameWithoutMotion) {
    auto path = makePath();
    path.setDampedVelocity(HIDPoint{3.0f, 4.0f});
    path.setDampedSpeed(5.0f);
    path.setPreviousContact(contact(1, 10, 10, ticks(1000.0)));
    path.setCurrentContact(contact(0, 10, 10, ticks(1008.0)));
    path.updateDampedVelocity(false);
    EXPECT_EQ(path.dampedVelocity().x, 0.0f);
    EXPECT_EQ(path.dampedVelocity().y, 0.0f);
    EXPECT_EQ(path.dampedSpeed(), 0.0f);
}

TEST(HIDParserPath, StrongDampingHalvesBeforeDecay) {
    auto path = makePath();
    path.setDampedVelocity(HIDPoint{4.0f, 8.0f});
    HIDContact cur = contact(1, 12, 6, ticks(1014.0));
    cur.velocity = HIDPoint{2.0f, -4.0f};
    path.setPreviousContact(contact(1, 10, 10, ticks(1000.0)));
    path.setCurrentContact(cur);
    path.updateDampedVelocity(true);
    // (4, 8) × 0.5 = (2, 4); then (2, 4) × 0.5 + (2, −4) × 0.5 = (2, 0).
    EXPECT_EQ(path.dampedVelocity().x, 2.0f);
    EXPECT_EQ(path.dampedVelocity().y, 0.0f);
    EXPECT_EQ(path.dampedSpeed(), 2.0f);
}

TEST(HIDParserPath, WeakenScalesDampedVelocityAndSpeed) {
    auto path = makePath();
    path.setDampedVelocity(HIDPoint{3.0f, -4.0f});
    path.setDampedSpeed(5.0f);
    path.weakenDampedVelocity(0.25f);
    EXPECT_EQ(path.dampedVelocity().x, 0.75f);
    EXPECT_EQ(path.dampedVelocity().y, -1.0f);
    EXPECT_EQ(path.dampedSpeed(), 1.25f);
}

TEST(HIDParserPath, FilterUsesFrameTimesOfContactsForDamping) {
    auto path = makePath();
    readAndFilter(path, contactAt(512, 256), ticks(1000.0));
    EXPECT_EQ(path.dampedVelocity().x, 0.0f);  // no previous frame time: k = 1, old value 0
    readAndFilter(path, contactAt(520, 256), ticks(1014.0));
    // velocity (8, 0), k = 0.5 → damped (4, 0).
    EXPECT_EQ(path.engagedVelocity().x, 8.0f);
    EXPECT_EQ(path.dampedVelocity().x, 4.0f);
    EXPECT_EQ(path.dampedSpeed(), 4.0f);
}

// ---- Lift-off near the edge, averaged velocity ----

TEST(HIDParserPath, LiftoffNearEdgeIsFalseWhileTouchingOrWithoutTouchBefore) {
    auto path = makePath();
    path.setPreviousContact(contact(1, 300, 10, 1000.0));
    path.setCurrentContact(contact(1, 300, 10, 2000.0));
    EXPECT_FALSE(path.fingerLiftoffNearEdgeframeInterval());
    path.setPreviousContact(contact(0, 300, 10, 1000.0));
    path.setCurrentContact(contact(0, 300, 10, 2000.0));
    EXPECT_FALSE(path.fingerLiftoffNearEdgeframeInterval());
    HIDContact palm = contact(1, 300, 10, 1000.0);
    palm.fingerConfidence = 0;
    path.setPreviousContact(palm);
    EXPECT_FALSE(path.fingerLiftoffNearEdgeframeInterval());
}

TEST(HIDParserPath, LiftoffNearEdgeComparesLastPositionWithQuarterHeight) {
    auto path = makePath();  // 512 × 0.25 = 128
    path.setPreviousContact(contact(1, 300, 128.0f, 1000.0));
    path.setCurrentContact(contact(0, 300, 128.0f, 2000.0));
    EXPECT_TRUE(path.fingerLiftoffNearEdgeframeInterval());
    path.setPreviousContact(contact(1, 300, 128.5f, 1000.0));
    EXPECT_FALSE(path.fingerLiftoffNearEdgeframeInterval());
}

TEST(HIDParserPath, LiftoffNearEdgeMultipliesPerFrameVelocityByRawTickInterval) {
    auto path = makePath();
    HIDContact prev = contact(1, 300, 140.0f, 1000.0);
    prev.velocity = HIDPoint{0.0f, -0.0078125f};  // 2^−7 per frame
    path.setPreviousContact(prev);
    // 2048 ticks: 140 − 2048 / 128 = 124 ≤ 128.
    path.setCurrentContact(contact(0, 300, 140.0f, 3048.0));
    EXPECT_TRUE(path.fingerLiftoffNearEdgeframeInterval());
    // 1024 ticks: 140 − 8 = 132 > 128.
    path.setCurrentContact(contact(0, 300, 140.0f, 2024.0));
    EXPECT_FALSE(path.fingerLiftoffNearEdgeframeInterval());
}

TEST(HIDParserPath, AverageVelocityIsMeanOfPreviousAndCurrent) {
    auto path = makePath();
    HIDContact prev = contact(1, 1, 1);
    prev.velocity = HIDPoint{1.0f, 3.0f};
    HIDContact cur = contact(1, 1, 1);
    cur.velocity = HIDPoint{2.0f, -5.0f};
    path.setPreviousContact(prev);
    path.setCurrentContact(cur);
    const HIDPoint v = path.getAverageVelocity_mm_s();
    EXPECT_EQ(v.x, 1.5f);
    EXPECT_EQ(v.y, -1.0f);
}

// ---- Clearing ----

TEST(HIDParserPath, ClearLeavesMakeAndBreakTouchTimes) {
    auto path = makePath();
    path.updateCurPrevContactsWith(*contactAt(300, 200), 100.0);
    path.updateCurPrevContactsWith(*contactAt(300, 200, 0), 200.0);
    path.clear();
    EXPECT_EQ(path.timestamps().t_makeTouch, 100.0);
    EXPECT_EQ(path.timestamps().t_breakTouch, 200.0);
}

TEST(HIDParserPath, ClearZeroesContactsPositionsAndDampingButKeepsFlagsAndEngagedMotion) {
    auto path = makePath();
    readAndFilter(path, contactAt(512, 256), 1.0);
    readAndFilter(path, contactAt(520, 250), 2.0);
    path.setDampedVelocity(HIDPoint{1.0f, 2.0f});
    path.setDampedSpeed(3.0f);
    path.setPreviousStablePositionForUI(HIDPoint{4.0f, 4.0f});
    path.setRestingContact(true);
    path.setRestingInThumbZone(true);
    path.setRestingInThumbZone(true);
    path.setThumbMovementTimedOut(true);
    path.setThumbAboveTRZOnTouchdown(true);
    path.set_2F_speed_symmetry(0.75f);
    path.setEllipseHysteresisOffset(HIDPoint{0.5f, 0.25f});
    const HIDPoint engaged = path.engagedVelocity();
    const float engagedSpeed = path.engagedSpeed();
    ASSERT_NE(engagedSpeed, 0.0f);

    path.clear();

    EXPECT_EQ(path.currentContact().fingerTipSwitch, 0);
    EXPECT_EQ(path.currentContact().path_id, 0);
    EXPECT_EQ(path.currentContact().position.x, 0.0f);
    EXPECT_EQ(path.currentContact().velocity.x, 0.0f);
    EXPECT_EQ(path.currentContact().device_timestamp, 0.0);
    EXPECT_EQ(path.previousContact().path_id, 0);
    EXPECT_EQ(path.previousContact().position.x, 0.0f);
    EXPECT_EQ(path.dampedVelocity().x, 0.0f);
    EXPECT_EQ(path.dampedVelocity().y, 0.0f);
    EXPECT_EQ(path.dampedSpeed(), 0.0f);
    EXPECT_EQ(path.peakDisplacement(), 0.0f);
    EXPECT_EQ(path.initialPosition().x, 0.0f);
    EXPECT_EQ(path.longTermPosition().x, 0.0f);
    EXPECT_EQ(path.stablePositionForUI().x, 0.0f);
    EXPECT_EQ(path.previousStablePositionForUI().x, 0.0f);
    EXPECT_EQ(path.hysteresisCenter().x, 0.0f);
    EXPECT_EQ(path.pixelDelta().x, 0.0f);
    EXPECT_EQ(path.cumulativeDeltas().x, 0.0f);

    EXPECT_TRUE(path.isResting());
    EXPECT_TRUE(path.isRestingInThumbZone());
    EXPECT_TRUE(path.wasRestingInThumbZone());
    EXPECT_TRUE(path.thumbMovementTimedOut());
    EXPECT_TRUE(path.thumbAboveTRZOnTouchdown());
    EXPECT_EQ(path._2F_speed_symmetry(), 0.75f);
    EXPECT_EQ(path.ellipseHysteresisOffset().x, 0.5f);
    EXPECT_EQ(path.ellipseHysteresisOffset().y, 0.25f);
    EXPECT_EQ(path.engagedVelocity().x, engaged.x);
    EXPECT_EQ(path.engagedVelocity().y, engaged.y);
    EXPECT_EQ(path.engagedSpeed(), engagedSpeed);
    EXPECT_EQ(path.surfaceDimensions().x, kWidth);
    EXPECT_EQ(path.surfaceDimensions().y, kHeight);
}

TEST(HIDParserPath, ClearTimestampsKeepsCleanStartInRange) {
    HIDPathTimestamps t{1.0, 2.0, 3.0, 4.0, 5.0, 6.0, 7.0};
    HIDParserPath::clearTimestamps(t);
    EXPECT_EQ(t.t_cleanStartInRange, 1.0);
    EXPECT_EQ(t.t_startInRange, 0.0);
    EXPECT_EQ(t.t_makeTouch, 0.0);
    EXPECT_EQ(t.t_startHover, 0.0);
    EXPECT_EQ(t.t_endHover, 0.0);
    EXPECT_EQ(t.t_breakTouch, 0.0);
    EXPECT_EQ(t.t_endOutRange, 0.0);
}

TEST(HIDParserPath, ClearPathSpeedSymmetrySetsItToZero) {
    auto path = makePath();
    path.set_2F_speed_symmetry(0.5f);
    path.clearPathSpeedSymmetry();
    EXPECT_EQ(path._2F_speed_symmetry(), 0.0f);
}

TEST(HIDParserPath, ContactRecordsAreReachableInPlace) {
    auto path = makePath();
    path.getCurrentContact().position.x = 12.0f;
    path.getPreviousContact().fingerTipSwitch = 1;
    EXPECT_EQ(path.currentContact().position.x, 12.0f);
    EXPECT_TRUE(path.wasTouching());
}

// ---- Diagnostics ----

TEST(HIDParserPath, NoVerboseLinesOutsideAnInternalBuildEvenAtDebugLevel) {
    ASSERT_FALSE(_isInternalBuild());
    auto sink = std::make_shared<CaptureLogSink>();
    Logging::setSink(sink);
    Logging::setDebugEnabled(true);
    auto path = makePath();
    readAndFilter(path, contactAt(300, 200), 1.0);
    readAndFilter(path, contactAt(310, 200), 2.0);
    Logging::setDebugEnabled(false);
    Logging::setSink(std::make_shared<StandardErrorLogSink>());
    EXPECT_TRUE(sink->entries().empty());
}
