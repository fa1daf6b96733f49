// The path table: unpacking contact frames into the 15 paths, the per-frame counts, the
// bottom-most path, diving-button membership, fastest-finger speeds and the centroid.

#include <gtest/gtest.h>

#include <cmath>
#include <memory>
#include <vector>

#include "filter/FilterLogging.h"
#include "paths/HIDPathStateBasic.h"
#include "platform/Logging.h"
#include "tests/support/FrameBuilder.h"

using namespace orvane;
using orvane::test::ContactFields;
using orvane::test::contactEvent;
using orvane::test::frameEvent;
using orvane::test::TestClock;

namespace {

// Fractions 1/1024 and 1/512 land on whole surface units, so positions read back exactly.
constexpr float kWidth = 1024.0f;
constexpr float kHeight = 512.0f;
// The inner box (not an edge contact) is 204.8 < x < 819.2 and 128 < y < 409.6; the diving
// button is y > 256.

HIDEventRef contactAt(int index, float x, float y, int touch = 1, int type = 1) {
    ContactFields c;
    c.index = index;
    c.x = static_cast<double>(x) / kWidth;
    c.y = 1.0 - static_cast<double>(y) / kHeight;
    c.touch = touch;
    c.range = touch;
    c.type = type;
    return contactEvent(c, 0);
}

HIDEventRef frameOf(const std::vector<HIDEventRef>& children) { return frameEvent(0, children); }

// Puts a contact straight into a slot, as if it had been read there in an earlier frame.
HIDParserPath& place(HIDPathStateBasic& table, int slot, float x, float y, int tip = 1, int confidence = 1,
                     int pathID = -1) {
    HIDParserPath& path = *table.getParserPath(slot);
    HIDContact c{};
    c.fingerTipSwitch = tip;
    c.fingerConfidence = confidence;
    c.path_id = pathID < 0 ? slot : pathID;
    c.finger_id = c.path_id + 1;
    c.position = HIDPoint{x, y};
    path.setCurrentContact(c);
    return path;
}

double ticks(double ms) { return static_cast<double>(TestClock::msToTicks(ms)); }

}  // namespace

// ---- The table ----

TEST(HIDPathStateBasic, TableHoldsFifteenPathsWithTheSurfaceSize) {
    HIDPathStateBasic table(300.0f, 700.0f);
    ASSERT_EQ(table.paths().size(), 15u);
    for (int slot = 0; slot < 15; ++slot) {
        ASSERT_NE(table.getParserPath(slot), nullptr);
        EXPECT_EQ(table.getParserPath(slot)->surfaceDimensions().x, 700.0f);
        EXPECT_EQ(table.getParserPath(slot)->surfaceDimensions().y, 300.0f);
        for (int other = 0; other < slot; ++other) EXPECT_NE(table.getParserPath(slot), table.getParserPath(other));
    }
    EXPECT_EQ(table.getParserPath(15), nullptr);
    EXPECT_EQ(table.getParserPath(-1), nullptr);
}

TEST(HIDPathStateBasic, PathIdZeroFindsNoPathEvenWhenSlotsAreCleared) {
    HIDPathStateBasic table(kHeight, kWidth);
    EXPECT_EQ(table.getParserPathforPathID(0), nullptr);
    EXPECT_EQ(table.getParserPathforPathID(1), nullptr);
}

TEST(HIDPathStateBasic, PathIdLookupScansSlotsInOrderAndIgnoresSlotZero) {
    HIDPathStateBasic table(kHeight, kWidth);
    place(table, 0, 10, 10, 1, 1, 7);
    EXPECT_EQ(table.getParserPathforPathID(7), nullptr);
    place(table, 9, 10, 10, 1, 1, 7);
    place(table, 4, 10, 10, 1, 1, 7);
    EXPECT_EQ(table.getParserPathforPathID(7), table.getParserPath(4));
}

TEST(HIDPathStateBasic, ContactCountIsTheNumberOfDigitizerChildren) {
    HIDPathStateBasic table(kHeight, kWidth);
    auto frame = frameOf({contactAt(0, 300, 300), contactAt(1, 400, 300)});
    frame->appendEvent(HIDEvent::create(kHIDEventTypeVendorDefined, 0));
    EXPECT_EQ(table.getNumberOfContacts(frame), 2);
    EXPECT_EQ(table.getNumberOfContacts(frameOf({})), 0);
    EXPECT_EQ(table.getNumberOfContacts(nullptr), 0);
}

// ---- Unpacking ----

TEST(HIDPathStateBasic, ContactsWithIndicesZeroAndOneFillSlotsOneAndTwo) {
    HIDPathStateBasic table(kHeight, kWidth);
    EXPECT_TRUE(table.unpackContactFrame(frameOf({contactAt(0, 300, 300), contactAt(1, 400, 200)}), 5.0));
    const HIDContact& a = table.getParserPath(1)->currentContact();
    const HIDContact& b = table.getParserPath(2)->currentContact();
    EXPECT_EQ(a.path_id, 1);
    EXPECT_EQ(a.finger_id, 2);
    EXPECT_EQ(b.path_id, 2);
    EXPECT_EQ(b.finger_id, 3);
    EXPECT_EQ(a.position.x, 300.0f);
    EXPECT_EQ(a.position.y, 300.0f);
    EXPECT_EQ(b.position.x, 400.0f);
    EXPECT_EQ(b.position.y, 200.0f);
    EXPECT_EQ(a.device_timestamp, 5.0);
    EXPECT_EQ(table.getParserPathforPathID(1), table.getParserPath(1));
    EXPECT_EQ(table.getParserPathforPathID(2), table.getParserPath(2));
    EXPECT_EQ(table.getParserPath(3)->currentContact().path_id, 0);
    EXPECT_EQ(table.numNewContacts(), 2);
    EXPECT_TRUE(table.anyNewContact());
    EXPECT_EQ(table.numTouches(), 2);
}

TEST(HIDPathStateBasic, ContactIndexFourteenIsIgnoredAndThirteenGoesToSlotFourteen) {
    HIDPathStateBasic table(kHeight, kWidth);
    table.unpackContactFrame(frameOf({contactAt(14, 300, 300), contactAt(13, 400, 300), contactAt(20, 500, 300)}),
                             5.0);
    EXPECT_EQ(table.getParserPath(14)->currentContact().path_id, 14);
    EXPECT_EQ(table.getParserPath(14)->currentContact().position.x, 400.0f);
    EXPECT_EQ(table.getParserPathforPathID(15), nullptr);
    EXPECT_EQ(table.getParserPathforPathID(21), nullptr);
    EXPECT_EQ(table.numNewContacts(), 1);
    EXPECT_EQ(table.numTouches(), 1);
    for (int slot = 0; slot < 14; ++slot) EXPECT_EQ(table.getParserPath(slot)->currentContact().path_id, 0);
}

TEST(HIDPathStateBasic, ContactIndexMinusOneAddressesSlotZeroAndLowerIsSkipped) {
    HIDPathStateBasic table(kHeight, kWidth);
    table.unpackContactFrame(frameOf({contactAt(-1, 300, 300), contactAt(-2, 400, 300)}), 5.0);
    const HIDContact& c = table.getParserPath(0)->currentContact();
    EXPECT_EQ(c.fingerTipSwitch, 1);
    EXPECT_EQ(c.path_id, 0);
    EXPECT_EQ(c.finger_id, 1);
    EXPECT_EQ(c.position.x, 300.0f);
    // Slot 0 counts as a new contact but is never found by ID.
    EXPECT_EQ(table.numNewContacts(), 1);
    EXPECT_EQ(table.numTouches(), 0);
    EXPECT_EQ(table.getParserPathforPathID(0), nullptr);
    for (int slot = 1; slot < 15; ++slot) EXPECT_EQ(table.getParserPath(slot)->currentContact().fingerTipSwitch, 0);
}

TEST(HIDPathStateBasic, FirstFrameKeepsFormerVelocityAndSecondGivesPositionDifference) {
    HIDPathStateBasic table(kHeight, kWidth);
    table.unpackContactFrame(frameOf({contactAt(0, 300, 300)}), 1.0);
    EXPECT_EQ(table.getParserPath(1)->currentContact().velocity.x, 0.0f);
    EXPECT_EQ(table.getParserPath(1)->currentContact().velocity.y, 0.0f);
    table.unpackContactFrame(frameOf({contactAt(0, 306, 296)}), 2.0);
    EXPECT_EQ(table.getParserPath(1)->currentContact().velocity.x, 6.0f);
    EXPECT_EQ(table.getParserPath(1)->currentContact().velocity.y, -4.0f);
}

TEST(HIDPathStateBasic, ContactWhosePreviousXWasZeroGetsNoNewVelocity) {
    HIDPathStateBasic table(kHeight, kWidth);
    table.unpackContactFrame(frameOf({contactAt(0, 0, 300)}), 1.0);
    table.getParserPath(1)->getCurrentContact().velocity = HIDPoint{7.0f, 9.0f};
    table.unpackContactFrame(frameOf({contactAt(0, 10, 290)}), 2.0);
    EXPECT_EQ(table.getParserPath(1)->currentContact().velocity.x, 7.0f);
    EXPECT_EQ(table.getParserPath(1)->currentContact().velocity.y, 9.0f);
    // Frame 2 was steadied to the hysteresis centre (10 − 0.05f, 290 + 0.05f); from that previous
    // position the velocity follows again.
    table.unpackContactFrame(frameOf({contactAt(0, 12, 290)}), 3.0);
    EXPECT_EQ(table.getParserPath(1)->currentContact().velocity.x, 12.0f - (10.0f - 0.05f));
    EXPECT_EQ(table.getParserPath(1)->currentContact().velocity.y, 290.0f - (290.0f + 0.05f));
}

TEST(HIDPathStateBasic, ContactWhosePreviousYWasZeroGetsNoNewVelocity) {
    HIDPathStateBasic table(kHeight, kWidth);
    table.unpackContactFrame(frameOf({contactAt(0, 300, 0)}), 1.0);
    table.getParserPath(1)->getCurrentContact().velocity = HIDPoint{7.0f, 9.0f};
    table.unpackContactFrame(frameOf({contactAt(0, 310, 20)}), 2.0);
    EXPECT_EQ(table.getParserPath(1)->currentContact().velocity.x, 7.0f);
    EXPECT_EQ(table.getParserPath(1)->currentContact().velocity.y, 9.0f);
}

TEST(HIDPathStateBasic, LiftOffFrameKeepsPathFindableAndNextFrameClearsIt) {
    HIDPathStateBasic table(kHeight, kWidth);
    table.unpackContactFrame(frameOf({contactAt(0, 300, 300), contactAt(1, 400, 300)}), 1.0);
    table.unpackContactFrame(frameOf({contactAt(0, 300, 300, 0), contactAt(1, 400, 300)}), 2.0);
    HIDParserPath* lifted = table.getParserPathforPathID(1);
    ASSERT_EQ(lifted, table.getParserPath(1));
    EXPECT_FALSE(lifted->isTouching());
    EXPECT_TRUE(lifted->wasTouching());
    EXPECT_EQ(table.numTouches(), 1);
    table.unpackContactFrame(frameOf({contactAt(1, 400, 300)}), 3.0);
    EXPECT_EQ(table.getParserPathforPathID(1), nullptr);
    EXPECT_EQ(table.getParserPath(1)->currentContact().path_id, 0);
    EXPECT_EQ(table.getParserPath(1)->previousContact().path_id, 0);
    EXPECT_EQ(table.getParserPathforPathID(2), table.getParserPath(2));
}

TEST(HIDPathStateBasic, FrameWithZeroDigitizerChildrenClearsAllSlots) {
    HIDPathStateBasic table(kHeight, kWidth);
    std::vector<HIDEventRef> contacts;
    for (int i = 0; i < 14; ++i) contacts.push_back(contactAt(i, 300.0f + 10.0f * i, 300));
    table.unpackContactFrame(frameOf(contacts), 1.0);
    place(table, 0, 50, 50);
    for (int id = 1; id <= 14; ++id) ASSERT_NE(table.getParserPathforPathID(id), nullptr);
    auto frame = frameOf({});
    frame->appendEvent(HIDEvent::create(kHIDEventTypeVendorDefined, 0));  // not a contact
    table.unpackContactFrame(frame, 2.0);
    for (int slot = 1; slot <= 14; ++slot) {
        EXPECT_EQ(table.getParserPath(slot)->currentContact().path_id, 0);
        EXPECT_EQ(table.getParserPath(slot)->currentContact().fingerTipSwitch, 0);
        EXPECT_EQ(table.getParserPath(slot)->currentContact().position.x, 0.0f);
    }
    // Slot 0 is never cleared.
    EXPECT_EQ(table.getParserPath(0)->currentContact().position.x, 50.0f);
}

TEST(HIDPathStateBasic, ContactThatStopsBeingReportedWhileTouchingKeepsItsPath) {
    HIDPathStateBasic table(kHeight, kWidth);
    table.unpackContactFrame(frameOf({contactAt(0, 300, 300), contactAt(1, 400, 300)}), 1.0);
    table.unpackContactFrame(frameOf({contactAt(1, 400, 300)}), 2.0);
    HIDParserPath* kept = table.getParserPathforPathID(1);
    ASSERT_NE(kept, nullptr);
    EXPECT_TRUE(kept->isTouching());
    EXPECT_EQ(kept->currentContact().device_timestamp, 1.0);
}

TEST(HIDPathStateBasic, OnlySecondContactNewGivesFirstNoStrongDampingAndSecondStrongDamping) {
    // Read the frame's contacts straight into slots prepared by hand, so that both paths carry
    // a damped velocity into the frame: slot 1 was touching, slot 2 had lifted.
    HIDPathStateBasic table(kHeight, kWidth);
    HIDParserPath& first = place(table, 1, 300, 300);
    first.getCurrentContact().device_timestamp = ticks(1000.0);
    first.setDampedVelocity(HIDPoint{8.0f, 0.0f});
    HIDParserPath& second = place(table, 2, 400, 300, 0);
    second.getCurrentContact().device_timestamp = ticks(1000.0);
    second.setDampedVelocity(HIDPoint{8.0f, 0.0f});

    table.setCurrentTimestamp(ticks(1014.0));
    table.expandAndFilterPackedContacts(frameOf({contactAt(0, 300, 300), contactAt(1, 400, 300)}));
    ASSERT_FALSE(first.isNewContact());
    ASSERT_TRUE(second.isNewContact());
    EXPECT_EQ(table.numNewContacts(), 1);
    // Neither moved (velocity 0) and k = 2^(−14/14) = 0.5.
    // First, no strong damping: 8 × 0.5 = 4.
    EXPECT_EQ(first.dampedVelocity().x, 4.0f);
    // Second, strong damping: 8 × 0.5 (halved) × 0.5 = 2.
    EXPECT_EQ(second.dampedVelocity().x, 2.0f);
}

TEST(HIDPathStateBasic, EveryContactFromTheFirstNewOneOnGetsStrongDamping) {
    HIDPathStateBasic table(kHeight, kWidth);
    HIDParserPath& before = place(table, 1, 300, 300);
    HIDParserPath& after = place(table, 3, 500, 300);
    for (HIDParserPath* p : {&before, &after}) {
        p->getCurrentContact().device_timestamp = ticks(1000.0);
        p->setDampedVelocity(HIDPoint{8.0f, 0.0f});
    }
    table.setCurrentTimestamp(ticks(1014.0));
    // Child order: slot 1 (old), slot 2 (new), slot 3 (old).
    table.expandAndFilterPackedContacts(
        frameOf({contactAt(0, 300, 300), contactAt(1, 400, 300), contactAt(2, 500, 300)}));
    EXPECT_EQ(table.numNewContacts(), 1);
    EXPECT_EQ(before.dampedVelocity().x, 4.0f);  // 8 × 0.5
    EXPECT_EQ(after.dampedVelocity().x, 2.0f);   // 8 × 0.5 × 0.5
}

TEST(HIDPathStateBasic, ChildrenAreReadByPositionUpToTheDigitizerCount) {
    HIDPathStateBasic table(kHeight, kWidth);
    auto frame = HIDEvent::create(kHIDEventTypeDigitizer, 0);
    frame->appendEvent(HIDEvent::create(kHIDEventTypeVendorDefined, 0));  // position 0, not a contact
    frame->appendEvent(contactAt(3, 300, 300));                           // position 1, past n − 1 = 0
    ASSERT_EQ(table.getNumberOfContacts(frame), 1);
    table.unpackContactFrame(frame, 9.0);
    // The vendor child was read as a contact: its unset fields read 0, so index 0, slot 1, touch 0.
    const HIDContact& read = table.getParserPath(1)->currentContact();
    EXPECT_EQ(read.device_timestamp, 9.0);
    EXPECT_EQ(read.path_id, 1);
    EXPECT_EQ(read.fingerTipSwitch, 0);
    // The digitizer child at position 1 was not read.
    EXPECT_EQ(table.getParserPath(4)->currentContact().path_id, 0);
    EXPECT_EQ(table.getParserPath(4)->currentContact().device_timestamp, 0.0);
}

TEST(HIDPathStateBasic, NoneFrameUpdatesTimeAndFastestFingerButKeepsPathsAndCounts) {
    HIDPathStateBasic table(kHeight, kWidth);
    table.unpackContactFrame(frameOf({contactAt(0, 300, 300)}), 10.0);
    table.unpackContactFrame(frameOf({contactAt(0, 300, 300, 0)}), 20.0);
    ASSERT_EQ(table.numTouches(), 0);
    ASSERT_EQ(table.lastNumTouches(), 1);
    table.getParserPath(1)->getCurrentContact().fingerTipSwitch = 1;
    table.getParserPath(1)->setDampedSpeed(3.0f);
    table.setMaxFingerSpeed(99.0f);

    EXPECT_TRUE(table.unpackContactFrame(nullptr, 30.0));
    EXPECT_EQ(table.currentTimestamp(), 30.0);
    EXPECT_EQ(table.previousTimestamp(), 20.0);
    // Nothing was cleared, nothing read and nothing counted.
    EXPECT_EQ(table.getParserPath(1)->currentContact().path_id, 1);
    EXPECT_EQ(table.getParserPath(1)->currentContact().device_timestamp, 20.0);
    EXPECT_EQ(table.numTouches(), 0);
    EXPECT_EQ(table.lastNumTouches(), 1);
    EXPECT_EQ(table.numNewContacts(), 0);
    // The fastest finger ran over the existing paths: s = 3 → 3² / 3 = 3.
    EXPECT_EQ(table.dampedSpeedOfFastestFinger(), 3.0f);
    EXPECT_EQ(table.maxFingerSpeed(), 0.0f);
}

TEST(HIDPathStateBasic, NoneFrameLeavesNewContactCountFromEarlierFrame) {
    HIDPathStateBasic table(kHeight, kWidth);
    table.unpackContactFrame(frameOf({contactAt(0, 300, 300)}), 10.0);
    ASSERT_EQ(table.numNewContacts(), 1);
    table.unpackContactFrame(nullptr, 20.0);
    EXPECT_EQ(table.numNewContacts(), 1);
    table.unpackContactFrame(frameOf({contactAt(0, 300, 300)}), 30.0);
    EXPECT_EQ(table.numNewContacts(), 0);
    EXPECT_FALSE(table.anyNewContact());
}

TEST(HIDPathStateBasic, PalmContactLivesInItsSlotWithoutFingerConfidence) {
    HIDPathStateBasic table(kHeight, kWidth);
    table.unpackContactFrame(frameOf({contactAt(2, 300, 300, 1, 3)}), 1.0);
    HIDParserPath* palm = table.getParserPathforPathID(3);
    ASSERT_EQ(palm, table.getParserPath(3));
    EXPECT_EQ(palm->currentContact().fingerConfidence, 0);
    EXPECT_EQ(table.numPalms(), 1);
    EXPECT_EQ(table.numTouches(), 0);
    EXPECT_EQ(table.numNewContacts(), 1);
}

// ---- Counts ----

TEST(HIDPathStateBasic, CountsSplitTouchesEdgeTouchesAndPalms) {
    HIDPathStateBasic table(kHeight, kWidth);
    table.setNumTouches(5);
    place(table, 1, 300, 300);        // touching, inside
    place(table, 2, 100, 300);        // touching, edge (x < 204.8)
    place(table, 3, 500, 200, 1, 0);  // touching palm
    place(table, 4, 600, 200, 0, 0);  // lifted palm: still a palm
    place(table, 5, 700, 300, 0);     // lifted finger
    table.countFingersOnDivingButton();
    EXPECT_EQ(table.lastNumTouches(), 5);
    EXPECT_EQ(table.numTouches(), 2);
    EXPECT_EQ(table.numNonEdgeTouches(), 1);
    EXPECT_EQ(table.numPalms(), 2);
}

TEST(HIDPathStateBasic, CountsOnlyPathsFoundByTheirId) {
    HIDPathStateBasic table(kHeight, kWidth);
    place(table, 0, 300, 300, 1, 1, 0);  // slot 0
    place(table, 2, 300, 300, 1, 1, 0);  // a touching contact with ID 0
    place(table, 3, 300, 300, 1, 1, 9);
    place(table, 9, 300, 300, 1, 1, 9);  // ID 9 is found at slot 3 only, so it counts once
    table.countFingersOnDivingButton();
    EXPECT_EQ(table.numTouches(), 1);
}

// ---- Bottom-most path and the diving button ----

TEST(HIDPathStateBasic, NoTouchingPathsGiveNoBottomPathAndZeroCounts) {
    HIDPathStateBasic table(kHeight, kWidth);
    table.setBottomDivingPathIndex(4);
    table.setNumFingersOnDivingButton(2);
    table.setNumEdgeTouchesOnDivingButton(1);
    table.setDampedSpeedOfFastestFinger(5.0f);
    table.setDampedVelocityOfFastestFinger(HIDPoint{1.0f, 1.0f});
    table.setMaxFingerSpeed(5.0f);
    place(table, 1, 300, 300, 0);
    table.unpackContactFrame(frameOf({contactAt(0, 300, 300, 0)}), 1.0);
    EXPECT_EQ(table.bottomDivingPathIndex(), 0);
    EXPECT_EQ(table.numFingersOnDivingButton(), 0);
    EXPECT_EQ(table.numEdgeTouchesOnDivingButton(), 0);
    EXPECT_EQ(table.dampedSpeedOfFastestFinger(), 0.0f);
    EXPECT_EQ(table.dampedVelocityOfFastestFinger().x, 0.0f);
    EXPECT_EQ(table.dampedVelocityOfFastestFinger().y, 0.0f);
    EXPECT_EQ(table.maxFingerSpeed(), 0.0f);
}

TEST(HIDPathStateBasic, OneFingerAtSixTenthsOfHeightIsBottomMostAndOnDivingButton) {
    HIDPathStateBasic table(500.0f, 1000.0f);
    place(table, 3, 500, 300);  // 0.6 × 500
    EXPECT_EQ(table.countFingersOnDivingButton(), 1);
    EXPECT_EQ(table.bottomDivingPathIndex(), 3);
    EXPECT_EQ(table.numFingersOnDivingButton(), 1);
    EXPECT_EQ(table.numEdgeTouchesOnDivingButton(), 0);
}

TEST(HIDPathStateBasic, FingerOnUpperHalfIsBottomMostButNotOnDivingButton) {
    HIDPathStateBasic table(500.0f, 1000.0f);
    place(table, 3, 500, 240);
    EXPECT_EQ(table.countFingersOnDivingButton(), 0);
    EXPECT_EQ(table.bottomDivingPathIndex(), 3);
}

TEST(HIDPathStateBasic, EdgeFingerOnDivingButtonCountsAsEdgeTouch) {
    HIDPathStateBasic table(kHeight, kWidth);
    place(table, 1, 512, 450);  // y ≥ 409.6: bottom band
    EXPECT_EQ(table.countFingersOnDivingButton(), 1);
    EXPECT_EQ(table.numEdgeTouchesOnDivingButton(), 1);
}

TEST(HIDPathStateBasic, SecondFingerCloseToBottomMostCountsEvenAboveTheHalfLine) {
    HIDPathStateBasic table(kHeight, kWidth);
    place(table, 1, 500, 262);  // on the button (262 > 256)
    place(table, 2, 510, 247);  // 15 above, 10 to the side, itself on the upper half
    ASSERT_FALSE(table.getParserPath(2)->isContactOnDivingButton());
    EXPECT_EQ(table.countFingersOnDivingButton(), 2);
    EXPECT_EQ(table.bottomDivingPathIndex(), 1);
    EXPECT_EQ(table.numEdgeTouchesOnDivingButton(), 0);
}

TEST(HIDPathStateBasic, SecondFingerThirtyToTheSideDoesNotCount) {
    HIDPathStateBasic table(kHeight, kWidth);
    place(table, 1, 500, 300);
    place(table, 2, 530, 290);
    EXPECT_EQ(table.countFingersOnDivingButton(), 1);
    place(table, 2, 529.5f, 290);
    EXPECT_EQ(table.countFingersOnDivingButton(), 2);
}

TEST(HIDPathStateBasic, SecondFingerNineteenAboveDoesNotCount) {
    HIDPathStateBasic table(kHeight, kWidth);
    place(table, 1, 500, 300);
    place(table, 2, 500, 281);
    EXPECT_EQ(table.countFingersOnDivingButton(), 1);
    place(table, 2, 500, 281.5f);
    EXPECT_EQ(table.countFingersOnDivingButton(), 2);
}

TEST(HIDPathStateBasic, SecondFingerDoesNotCountWhenBottomMostIsOffTheButton) {
    HIDPathStateBasic table(kHeight, kWidth);
    place(table, 1, 500, 250);
    place(table, 2, 505, 245);
    EXPECT_EQ(table.countFingersOnDivingButton(), 0);
    EXPECT_EQ(table.numEdgeTouchesOnDivingButton(), 0);
}

TEST(HIDPathStateBasic, CloseSecondFingerInEdgeBandAddsAnEdgeTouch) {
    HIDPathStateBasic table(kHeight, kWidth);
    place(table, 1, 210, 300);  // inside
    place(table, 2, 200, 295);  // x < 204.8: edge
    EXPECT_EQ(table.countFingersOnDivingButton(), 2);
    EXPECT_EQ(table.numEdgeTouchesOnDivingButton(), 1);
}

TEST(HIDPathStateBasic, EqualScoresMakeLowerPathIdBottomMost) {
    HIDPathStateBasic table(kHeight, kWidth);
    place(table, 5, 300, 300);
    place(table, 2, 600, 300);
    table.countFingersOnDivingButton();
    EXPECT_EQ(table.bottomDivingPathIndex(), 2);
    // The tie goes to the second place too: path 5 counts as the second path but is 300 to the side.
    EXPECT_EQ(table.numFingersOnDivingButton(), 1);
}

TEST(HIDPathStateBasic, ScoreSubtractsPeakDisplacement) {
    HIDPathStateBasic table(kHeight, kWidth);
    place(table, 1, 300, 320).setPeakDisplacement(30.0f);  // 320 − 30 = 290
    place(table, 2, 700, 300);                              // 300 − 0 = 300
    table.countFingersOnDivingButton();
    EXPECT_EQ(table.bottomDivingPathIndex(), 2);
}

TEST(HIDPathStateBasic, ThirdBestDoesNotDisplaceSecondUnlessHigher) {
    HIDPathStateBasic table(kHeight, kWidth);
    place(table, 1, 500, 300);  // best
    place(table, 2, 700, 290);  // second by score, far to the side
    place(table, 3, 510, 285);  // third: close to the best but not the second
    EXPECT_EQ(table.countFingersOnDivingButton(), 1);
    place(table, 3, 510, 295);  // now the second
    EXPECT_EQ(table.countFingersOnDivingButton(), 2);
}

TEST(HIDPathStateBasic, PalmEdgeContactWithTwoNonEdgeFingersTakesNoPartInBottomSearch) {
    HIDPathStateBasic table(kHeight, kWidth);
    place(table, 1, 300, 260);
    place(table, 2, 400, 270);
    place(table, 3, 500, 480, 1, 0);  // palm in the bottom band
    table.countFingersOnDivingButton();
    ASSERT_EQ(table.numNonEdgeTouches(), 2);
    EXPECT_EQ(table.bottomDivingPathIndex(), 2);
}

TEST(HIDPathStateBasic, PalmEdgeContactTakesPartWithOneNonEdgeFinger) {
    HIDPathStateBasic table(kHeight, kWidth);
    place(table, 1, 300, 260);
    place(table, 3, 500, 480, 1, 0);
    table.countFingersOnDivingButton();
    EXPECT_EQ(table.bottomDivingPathIndex(), 3);
    EXPECT_EQ(table.numFingersOnDivingButton(), 1);
    EXPECT_EQ(table.numEdgeTouchesOnDivingButton(), 1);
}

TEST(HIDPathStateBasic, PalmInsideTheBoxNeverTakesPart) {
    HIDPathStateBasic table(kHeight, kWidth);
    place(table, 3, 500, 300, 1, 0);
    table.countFingersOnDivingButton();
    EXPECT_EQ(table.bottomDivingPathIndex(), 0);
}

// ---- Fastest finger ----

TEST(HIDPathStateBasic, FastestFingerTakesSpeedWeightedMeansAsMagnitudes) {
    HIDPathStateBasic table(kHeight, kWidth);
    HIDParserPath& a = place(table, 1, 300, 300);
    a.setDampedSpeed(3.0f);
    a.setDampedVelocity(HIDPoint{3.0f, -1.0f});
    a.getCurrentContact().velocity = HIDPoint{3.0f, 4.0f};
    HIDParserPath& b = place(table, 4, 400, 300);
    b.setDampedSpeed(1.0f);
    b.setDampedVelocity(HIDPoint{-1.0f, -2.0f});
    b.getCurrentContact().velocity = HIDPoint{-6.0f, 8.0f};
    HIDParserPath& lifted = place(table, 6, 500, 300, 0);
    lifted.setDampedSpeed(100.0f);
    lifted.getCurrentContact().velocity = HIDPoint{100.0f, 0.0f};
    table.updateFastestFingerSpeed();
    // Speed: (9 + 1) / (3 + 1) = 2.5. x: (9 + 1) / (3 + 1) = 2.5. y: (1 + 4) / (1 + 2) = 5/3.
    EXPECT_EQ(table.dampedSpeedOfFastestFinger(), 2.5f);
    EXPECT_EQ(table.dampedVelocityOfFastestFinger().x, 2.5f);
    EXPECT_EQ(table.dampedVelocityOfFastestFinger().y, 5.0f / 3.0f);
    // Displacement lengths 5 and 10.
    EXPECT_EQ(table.maxFingerSpeed(), 10.0f);
}

TEST(HIDPathStateBasic, MaxFingerSpeedSumsSquaresInSinglePrecision) {
    HIDPathStateBasic table(kHeight, kWidth);
    const float vy = 109.0f / 1024.0f;
    place(table, 1, 300, 300).getCurrentContact().velocity = HIDPoint{4.0f, vy};
    table.updateFastestFingerSpeed();
    // 16 + vy² rounded to a float first, then the root in double: 4.00141573, where summing the
    // squares in double would give 4.00141621.
    const float squares = 4.0f * 4.0f + vy * vy;
    EXPECT_EQ(table.maxFingerSpeed(), static_cast<float>(std::sqrt(static_cast<double>(squares))));
    EXPECT_NE(table.maxFingerSpeed(), static_cast<float>(std::sqrt(16.0 + static_cast<double>(vy) * vy)));
}

TEST(HIDPathStateBasic, PathWhoseContactIdDiffersFromItsSlotTakesNoPartInFastestFinger) {
    HIDPathStateBasic table(kHeight, kWidth);
    HIDParserPath& odd = place(table, 3, 300, 300, 1, 1, 5);
    odd.setDampedSpeed(4.0f);
    odd.setDampedVelocity(HIDPoint{4.0f, 4.0f});
    odd.getCurrentContact().velocity = HIDPoint{3.0f, 4.0f};
    ASSERT_EQ(table.getParserPathforPathID(5), &odd);
    table.updateFastestFingerSpeed();
    EXPECT_EQ(table.dampedSpeedOfFastestFinger(), 0.0f);
    EXPECT_EQ(table.dampedVelocityOfFastestFinger().x, 0.0f);
    EXPECT_EQ(table.dampedVelocityOfFastestFinger().y, 0.0f);
    EXPECT_EQ(table.maxFingerSpeed(), 0.0f);
}

TEST(HIDPathStateBasic, FastestFingerRunsAtTheEndOfEveryUnpacking) {
    HIDPathStateBasic table(kHeight, kWidth);
    table.unpackContactFrame(frameOf({contactAt(0, 300, 300)}), 1.0);
    table.unpackContactFrame(frameOf({contactAt(0, 303, 304)}), 2.0);
    EXPECT_EQ(table.maxFingerSpeed(), 5.0f);  // √(3² + 4²)
}

// ---- Centroid ----

TEST(HIDPathStateBasic, CentroidIsMeanOfStablePositionsOfTouchingFingers) {
    HIDPathStateBasic table(kHeight, kWidth);
    place(table, 1, 0, 0).setStablePositionForUI(HIDPoint{10.0f, 20.0f});
    place(table, 2, 0, 0).setStablePositionForUI(HIDPoint{20.0f, 41.0f});
    place(table, 3, 0, 0, 1, 0).setStablePositionForUI(HIDPoint{900.0f, 900.0f});  // palm
    place(table, 4, 0, 0, 0).setStablePositionForUI(HIDPoint{900.0f, 900.0f});     // lifted
    place(table, 5, 0, 0, 1, 1, 8).setStablePositionForUI(HIDPoint{900.0f, 900.0f});
    HIDPoint c{-1.0f, -1.0f};
    EXPECT_TRUE(table.calculateCentroidOfPaths(&c));
    EXPECT_EQ(c.x, 15.0f);
    EXPECT_EQ(c.y, 30.5f);
    EXPECT_TRUE(table.calculateCentroidOfPaths(nullptr));
}

TEST(HIDPathStateBasic, CentroidWithoutTouchingFingersLeavesPointUntouched) {
    HIDPathStateBasic table(kHeight, kWidth);
    place(table, 1, 0, 0, 0).setStablePositionForUI(HIDPoint{10.0f, 20.0f});
    HIDPoint c{-1.0f, -2.0f};
    EXPECT_FALSE(table.calculateCentroidOfPaths(&c));
    EXPECT_EQ(c.x, -1.0f);
    EXPECT_EQ(c.y, -2.0f);
}

// ---- Diagnostics ----

TEST(HIDPathStateBasic, NoVerboseLinesOutsideAnInternalBuildEvenAtDebugLevel) {
    ASSERT_FALSE(_isInternalBuild());
    auto sink = std::make_shared<CaptureLogSink>();
    Logging::setSink(sink);
    Logging::setDebugEnabled(true);
    HIDPathStateBasic table(kHeight, kWidth);
    table.unpackContactFrame(frameOf({contactAt(0, 300, 300), contactAt(1, 310, 290)}), 1.0);
    table.unpackContactFrame(frameOf({contactAt(0, 302, 300), contactAt(1, 312, 290)}), 2.0);
    Logging::setDebugEnabled(false);
    Logging::setSink(std::make_shared<StandardErrorLogSink>());
    EXPECT_TRUE(sink->entries().empty());
}
