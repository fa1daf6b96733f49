// The path table's walks visit only the paths that can take part and skip clearing paths that
// are already clear; they give what looking at every slot in turn gives: on every frame of the
// random sessions, and on tables whose paths are changed in every way a path allows, from
// outside included. The fastest finger's figures, kept as the damping of each touching path and
// worked out when read (noted in the diving-button walk while no contact is loose), are what
// working them out at once in their own walk gives.

#include <gtest/gtest.h>

#include <cstdio>
#include <random>
#include <string>
#include <utility>
#include <vector>

#include "paths/HIDPathStates.h"
#include "tools/formats/FrameRecording.h"
#include "PerfSessions.h"

namespace orvane {
namespace {

using Visits = std::vector<std::pair<const HIDParserPath*, int>>;

Visits byIDWalk(const HIDPathStateBasic& table) {
    Visits v;
    table.forEachPathByID([&v](const HIDParserPath* p, int id) { v.emplace_back(p, id); });
    return v;
}
Visits byIDOneByOne(const HIDPathStateBasic& table) {
    Visits v;
    table.forEachPathByIDOneByOne([&v](const HIDParserPath* p, int id) { v.emplace_back(p, id); });
    return v;
}
Visits ownSlotWalk(const HIDPathStateBasic& table) {
    Visits v;
    table.forEachPathInOwnSlot([&v](const HIDParserPath* p, int slot) { v.emplace_back(p, slot); });
    return v;
}
Visits ownSlotOneByOne(const HIDPathStateBasic& table) {
    Visits v;
    table.forEachPathInOwnSlotOneByOne([&v](const HIDParserPath* p, int slot) { v.emplace_back(p, slot); });
    return v;
}

// A walk stopped at its k-th visit sees the first k visits of the whole walk and says it stopped.
bool stopsAtEveryVisitAsTheWholeWalkSays(const HIDPathStateBasic& table, const Visits& whole) {
    for (size_t k = 1; k <= whole.size(); ++k) {
        Visits seen;
        const bool stopped = table.forEachPathByID([&](const HIDParserPath* p, int id) {
            seen.emplace_back(p, id);
            return seen.size() == k;
        });
        if (!stopped || seen != Visits(whole.begin(), whole.begin() + static_cast<long>(k))) return false;
    }
    return !table.forEachPathByID([](const HIDParserPath*, int) { return false; });
}

std::string hex(float v) {
    char b[32];
    std::snprintf(b, sizeof b, "%a ", static_cast<double>(v));
    return b;
}
std::string hex(double v) {
    char b[32];
    std::snprintf(b, sizeof b, "%a ", v);
    return b;
}
std::string text(HIDPoint p) { return hex(p.x) + hex(p.y); }
std::string text(const HIDContact& c) {
    return std::to_string(c.fingerTipSwitch) + " " + std::to_string(c.fingerConfidence) + " " +
           std::to_string(c.path_id) + " " + std::to_string(c.finger_id) + " " + text(c.velocity) +
           hex(c.device_timestamp) + text(c.position);
}

// Everything a path shows, bit for bit.
std::string stateOf(const HIDParserPath& p) {
    const HIDPathTimestamps& t = p.timestamps();
    return text(p.currentContact()) + "| " + text(p.previousContact()) + "| " + std::to_string(p.isResting()) +
           std::to_string(p.isRestingInThumbZone()) + std::to_string(p.wasRestingInThumbZone()) +
           std::to_string(p.thumbMovementTimedOut()) + std::to_string(p.thumbAboveTRZOnTouchdown()) + " " +
           hex(p.engagedSpeed()) + hex(p._2F_speed_symmetry()) + hex(p.dampedSpeed()) + hex(p.peakDisplacement()) +
           text(p.surfaceDimensions()) + text(p.initialPosition()) + text(p.longTermPosition()) +
           text(p.stablePositionForUI()) + text(p.previousStablePositionForUI()) + text(p.hysteresisCenter()) +
           text(p.ellipseHysteresisOffset()) + text(p.pixelDelta()) + text(p.cumulativeDeltas()) +
           text(p.engagedVelocity()) + text(p.dampedVelocity()) + hex(t.t_cleanStartInRange) + hex(t.t_startInRange) +
           hex(t.t_makeTouch) + hex(t.t_startHover) + hex(t.t_endHover) + hex(t.t_breakTouch) + hex(t.t_endOutRange);
}

// Slots the table takes for clear whose path clearing would still change.
int clearSlotsThatAreNot(const HIDPathStateBasic& table) {
    int wrong = 0;
    for (int s = 1; s < HIDPathStateBasic::kNumPaths; ++s) {
        if (table.slotsNotClear() & (1u << s)) continue;
        const HIDParserPath& path = *table.getParserPath(s);
        HIDParserPath cleared = path;  // a copy belongs to no table
        cleared.clear();
        if (stateOf(cleared) != stateOf(path)) ++wrong;
    }
    return wrong;
}

struct Tally {
    int walkDifferences = 0;
    int stopDifferences = 0;
    int wronglyClear = 0;
    int visits = 0;
    int skippedAsClear = 0;
};

void check(const HIDPathStateBasic& table, Tally& tally) {
    const Visits whole = byIDWalk(table);
    if (whole != byIDOneByOne(table)) ++tally.walkDifferences;
    if (ownSlotWalk(table) != ownSlotOneByOne(table)) ++tally.walkDifferences;
    if (!stopsAtEveryVisitAsTheWholeWalkSays(table, whole)) ++tally.stopDifferences;
    tally.wronglyClear += clearSlotsThatAreNot(table);
    tally.visits += static_cast<int>(whole.size());
    for (int s = 1; s < HIDPathStateBasic::kNumPaths; ++s) tally.skippedAsClear += (table.slotsNotClear() >> s & 1u) ? 0 : 1;
}

TEST(PathWalk, WalksAgreeWithLookingAtEverySlotOnEveryFrameOfTheRandomSessions) {
    Tally tally;
    int frames = 0;
    perf::replayRandomSessions([&](HIDParser& parser, const HIDEventRef&) {
        check(*parser.pathStates(), tally);
        ++frames;
    });
    EXPECT_EQ(tally.walkDifferences, 0);
    EXPECT_EQ(tally.stopDifferences, 0);
    EXPECT_EQ(tally.wronglyClear, 0);
    // Fingers were walked over on most frames and most slots were skipped as clear, so the
    // agreement says something.
    EXPECT_GT(tally.visits, frames);
    EXPECT_GT(tally.skippedAsClear, frames * 5);
}

// Applies one random change of the kinds a path allows to a path of the table.
class RandomChanges {
public:
    explicit RandomChanges(unsigned seed) : random_(seed) {}
    int pick(int low, int high) { return std::uniform_int_distribution<int>(low, high)(random_); }
    float any() { return pick(0, 3) == 0 ? 0.0f : static_cast<float>(pick(-50, 50)) / 4.0f; }

    void apply(HIDPathStateBasic& table) {
        HIDParserPath* path = table.getParserPath(pick(0, HIDPathStateBasic::kNumPaths - 1));
        // Mostly an ordinary ID or none, now and then any number.
        const int id = pick(0, 9) < 7 ? pick(0, 1) * pick(1, 14) : pick(-1, 16);
        switch (pick(0, 14)) {
        case 0: {
            HIDContact c = path->currentContact();
            c.path_id = id;
            c.fingerTipSwitch = pick(0, 1);
            path->setCurrentContact(c);
            break;
        }
        case 1: path->getCurrentContact().path_id = id; break;
        case 2: path->getCurrentContact().fingerTipSwitch = pick(0, 1); break;
        case 3: path->getPreviousContact().position.x = any(); break;
        case 4:
        case 5: path->clear(); break;
        case 6: path->setDampedVelocity(HIDPoint{any(), any()}); break;
        case 7: path->setStablePositionForUI(HIDPoint{any(), any()}); break;
        case 8: path->setPeakDisplacement(any()); break;
        case 9: path->filterContactForScreenUI(pick(0, 1) == 1); break;
        case 10: path->weakenDampedVelocity(0.5f); break;
        case 11: path->setIsRestingInThumbZone(pick(0, 1) == 1); break;
        default: {
            HIDEventRef contact = HIDEvent::create(kHIDEventTypeDigitizer, 1);
            contact->setIntegerValue(id - 1, kHIDEventFieldDigitizerIndex);
            contact->setIntegerValue(pick(0, 1), kHIDEventFieldDigitizerTouch);
            contact->setDoubleValue(any() / 20.0f, kHIDEventFieldDigitizerX);
            contact->setDoubleValue(any() / 20.0f, kHIDEventFieldDigitizerY);
            path->updateCurPrevContactsWith(*contact, static_cast<double>(pick(1, 100)));
            break;
        }
        }
    }

private:
    std::mt19937 random_;
};

TEST(PathWalk, WalksAgreeWithLookingAtEverySlotWhenPathsAreChangedInEveryWay) {
    RandomChanges changes(20261122);
    HIDPathStates table(500.0f, 1000.0f);
    Tally tally;
    for (int step = 0; step < 20000; ++step) {
        changes.apply(table);
        check(table, tally);
    }
    EXPECT_EQ(tally.walkDifferences, 0);
    EXPECT_EQ(tally.stopDifferences, 0);
    EXPECT_EQ(tally.wronglyClear, 0);
    EXPECT_GT(tally.visits, 20000);
    EXPECT_GT(tally.skippedAsClear, 20000);
}

// Two tables changed the same way; one clears lift-offs by the marks, the other by looking at
// every slot, now and then with a frame without contacts. They stay alike throughout.
TEST(PathWalk, ClearingOnlyTheSlotsNotClearLeavesTheTableAsClearingEverySlotDoes) {
    RandomChanges first(77), second(77);
    RandomChanges frames(5);
    HIDPathStates byMarks(500.0f, 1000.0f);
    HIDPathStates everySlot(500.0f, 1000.0f);
    HIDEventRef empty = HIDEvent::create(kHIDEventTypeDigitizer, 1);
    HIDEventRef oneContact = HIDEvent::create(kHIDEventTypeDigitizer, 1);
    oneContact->appendEvent(HIDEvent::create(kHIDEventTypeDigitizer, 1));
    int differences = 0;
    int cleared = 0;
    for (int step = 0; step < 20000; ++step) {
        first.apply(byMarks);
        second.apply(everySlot);
        if (frames.pick(0, 3) == 0) {
            const HIDEventRef& frame = frames.pick(0, 4) == 0 ? empty : oneContact;
            byMarks.clearExistingPathLiftoffsAndMasks(frame);
            everySlot.clearExistingPathLiftoffsAndMasksOneByOne(frame);
            ++cleared;
        }
        for (int s = 0; s < HIDPathStateBasic::kNumPaths; ++s) {
            if (stateOf(*byMarks.getParserPath(s)) != stateOf(*everySlot.getParserPath(s))) ++differences;
        }
        // The lookups by ID agree as well, loose slots included.
        for (int id = -1; id <= 16; ++id) {
            const HIDParserPath* a = byMarks.getParserPathforPathID(id);
            const HIDParserPath* b = everySlot.getParserPathforPathID(id);
            if ((a == nullptr) != (b == nullptr) || (a && stateOf(*a) != stateOf(*b))) ++differences;
        }
    }
    EXPECT_EQ(differences, 0);
    EXPECT_GT(cleared, 4000);
}

// Everything post-filtering leaves in a table, bit for bit.
std::string tableStateOf(const HIDPathStates& t) {
    std::string text;
    for (int s = 0; s < HIDPathStateBasic::kNumPaths; ++s) text += stateOf(*t.getParserPath(s)) + "\n";
    text += std::to_string(t.restingThumbExists()) + std::to_string(t.restingThumbDidExist()) + " " +
            hex(t.speedSimilarity()) + hex(t.earliestNonDivingTimestamp()) + hex(t.divingButtonChangeTimestamp()) +
            std::to_string(t.handledDivingButtonStateChange());
    return text;
}

// Post-filtering in one walk leaves the table and the frame as the steps one after the other
// do: on every frame of the random sessions, with the gesture state the whole pipeline fed
// back at that point, and with that state mixed up at random.
TEST(PathWalk, PostFilteringInOneWalkDoesWhatTheStepsOneAfterTheOtherDo) {
    std::mt19937 random(31);
    int frames = 0;
    int differences = 0;
    int restingFrames = 0;
    for (const std::string& path : perf::randomSessions()) {
        formats::FrameRecording recording;
        std::string error;
        ASSERT_TRUE(formats::readFrameRecordingFile(path, &recording, &error)) << error;
        const float height = perf::surfaceSide(recording, "Height");
        const float width = perf::surfaceSide(recording, "Width");
        HIDParser parser([](const HIDEventRef&) {}, height, width);
        HIDPathStates oneWalk(height, width);
        HIDPathStates stepByStep(height, width);
        for (const formats::InputRecord& record : recording.records) {
            if (record.kind != formats::InputRecord::Kind::Event) continue;
            const double time = static_cast<double>(record.event->timestamp());
            HIDEventRef a = record.event->copy();
            HIDEventRef b = record.event->copy();
            const HIDPathStates& fed = *parser.pathStates();
            const bool mixUp = std::uniform_int_distribution<int>(0, 3)(random) == 0;
            const bool engaged = mixUp ? std::uniform_int_distribution<int>(0, 1)(random) == 1 : fed.engagedinGesture();
            for (HIDPathStates* table : {&oneWalk, &stepByStep}) {
                table->unpackContactFrame(table == &oneWalk ? a : b, time);
                table->updateButtonState(table == &oneWalk ? a : b);
                table->setEngagedinGesture(engaged);
                table->setMotionDeltas(fed.motionDeltas());
                table->setMotionDeltasResting(fed.motionDeltasResting());
                table->setMaxMotionDeltas(fed.maxMotionDeltas());
                table->setMaxMotionDeltasResting(fed.maxMotionDeltasResting());
            }
            oneWalk.postFilteringTasks(a);
            stepByStep.postFilteringTasksOneByOne(b);
            if (tableStateOf(oneWalk) != tableStateOf(stepByStep) || a->description() != b->description()) ++differences;
            if (oneWalk.restingThumbExists()) ++restingFrames;
            parser.handleContactFrame(time, record.event->copy());
            ++frames;
        }
    }
    EXPECT_EQ(differences, 0);
    EXPECT_GT(frames, 5000);
    EXPECT_GT(restingFrames, frames / 50);  // resting thumbs were among them
}

// What the unpacking leaves of the fastest finger and the diving-button count, bit for bit.
std::string fastestFingerOf(const HIDPathStateBasic& t) {
    return hex(t.dampedSpeedOfFastestFinger()) + text(t.dampedVelocityOfFastestFinger()) + hex(t.maxFingerSpeed());
}
std::string countsOf(const HIDPathStateBasic& t) {
    return std::to_string(t.numTouches()) + " " + std::to_string(t.numNonEdgeTouches()) + " " +
           std::to_string(t.numPalms()) + " " + std::to_string(t.bottomDivingPathIndex()) + " " +
           std::to_string(t.numFingersOnDivingButton()) + " " + std::to_string(t.numEdgeTouchesOnDivingButton());
}

// "" when the fastest finger's figures the table shows (kept damping, worked out when read,
// noted in the diving-button walk while no contact is loose) are what working them out at once
// in their own walk gives, and the diving-button count is what counting again gives. Leaves
// the table as the plain forms set it.
std::string fastestFingerDifference(HIDPathStateBasic& table) {
    const std::string kept = fastestFingerOf(table);
    const std::string counted = countsOf(table);
    const int lastNumTouches = table.lastNumTouches();
    table.updateFastestFingerSpeedLiteral();
    table.countFingersOnDivingButton();
    table.setLastNumTouches(lastNumTouches);
    const std::string literal = fastestFingerOf(table);
    if (kept != literal) return "fastest finger: " + kept + "\nat once:       " + literal;
    if (counted != countsOf(table)) return "counts: " + counted + "\nagain:  " + countsOf(table);
    return "";
}

// True when some contact carries an ID other than its slot's or none.
bool anyLooseContact(const HIDPathStateBasic& table) {
    for (int s = 1; s < HIDPathStateBasic::kNumPaths; ++s) {
        const int32_t id = table.getParserPath(s)->currentContact().path_id;
        if (id != 0 && id != s) return true;
    }
    return false;
}

TEST(PathWalk, FastestFingerFromKeptDampingIsWhatWorkingItOutAtOnceGivesOnTheRandomSessions) {
    int frames = 0;
    int differences = 0;
    int movingFrames = 0;
    perf::replayRandomSessions([&](HIDParser& parser, const HIDEventRef&) {
        HIDPathStates& table = *parser.pathStates();
        if (table.dampedSpeedOfFastestFinger() > 0.0f && table.numTouches() >= 2) ++movingFrames;
        const std::string difference = fastestFingerDifference(table);
        if (!difference.empty() && differences++ < 3) ADD_FAILURE() << "frame " << frames << ": " << difference;
        ++frames;
    });
    EXPECT_EQ(differences, 0);
    EXPECT_GT(movingFrames, frames / 4);  // several fingers moving on many of them
}

// Paths changed from outside, loose contacts among them, between frames of one, two or three
// contacts: the unpacking's figures agree with the plain forms whether or not a contact was
// loose, and stay as they were, like stored figures, when the paths change afterwards.
TEST(PathWalk, FastestFingerFromKeptDampingAgreesAfterPathsAreChangedInEveryWay) {
    RandomChanges changes(4242);
    HIDPathStates table(500.0f, 1000.0f);
    int differences = 0;
    int looseFrames = 0;
    int plainFrames = 0;
    int keptThroughChanges = 0;
    for (int step = 0; step < 20000; ++step) {
        changes.apply(table);
        if (changes.pick(0, 2) != 0) continue;
        const bool loose = anyLooseContact(table);
        HIDEventRef frame = HIDEvent::create(kHIDEventTypeDigitizer, 1);
        const int contacts = changes.pick(1, 3);
        for (int c = 0; c < contacts; ++c) {
            HIDEventRef contact = HIDEvent::create(kHIDEventTypeDigitizer, 1);
            contact->setIntegerValue(changes.pick(0, 12), kHIDEventFieldDigitizerIndex);
            contact->setIntegerValue(changes.pick(0, 3) == 0 ? 0 : 1, kHIDEventFieldDigitizerTouch);
            contact->setDoubleValue(changes.pick(1, 99) / 100.0, kHIDEventFieldDigitizerX);
            contact->setDoubleValue(changes.pick(1, 99) / 100.0, kHIDEventFieldDigitizerY);
            frame->appendEvent(contact);
        }
        const double time = static_cast<double>(step) * 8000000.0;
        table.unpackContactFrame(frame->copy(), time);
        (anyLooseContact(table) || loose ? looseFrames : plainFrames) += 1;
        const std::string difference = fastestFingerDifference(table);
        if (!difference.empty() && differences++ < 3) ADD_FAILURE() << "step " << step << ": " << difference;

        // Stored figures do not follow the paths: changes after the unpacking leave them.
        table.unpackContactFrame(frame->copy(), time + 1.0);
        const std::string before = fastestFingerOf(table);
        changes.apply(table);
        changes.apply(table);
        if (fastestFingerOf(table) == before) ++keptThroughChanges;
    }
    EXPECT_EQ(differences, 0);
    EXPECT_EQ(keptThroughChanges, looseFrames + plainFrames);
    EXPECT_GT(looseFrames, 500);
    EXPECT_GT(plainFrames, 500);
}

// A figure set from outside stays until the next unpacking and leaves the other as it was.
TEST(PathWalk, FastestFingerFiguresSetFromOutsideStayUntilTheNextUnpacking) {
    HIDPathStates table(500.0f, 1000.0f);
    HIDEventRef frame = HIDEvent::create(kHIDEventTypeDigitizer, 1);
    for (int c = 0; c < 2; ++c) {
        HIDEventRef contact = HIDEvent::create(kHIDEventTypeDigitizer, 1);
        contact->setIntegerValue(c, kHIDEventFieldDigitizerIndex);
        contact->setIntegerValue(1, kHIDEventFieldDigitizerTouch);
        contact->setDoubleValue(0.3 + 0.3 * c, kHIDEventFieldDigitizerX);
        contact->setDoubleValue(0.5, kHIDEventFieldDigitizerY);
        frame->appendEvent(contact);
    }
    table.unpackContactFrame(frame, 8000000.0);
    // The second frame moves both fingers, so the damped speeds are not 0.
    HIDEventRef moved = frame->copy();
    for (const HIDEventRef& contact : moved->children()) {
        contact->setDoubleValue(contact->doubleValueForField(kHIDEventFieldDigitizerX) + 0.05,
                                kHIDEventFieldDigitizerX);
    }
    table.unpackContactFrame(moved, 16000000.0);
    const HIDPoint velocity = table.dampedVelocityOfFastestFinger();
    ASSERT_GT(table.dampedSpeedOfFastestFinger(), 0.0f);
    ASSERT_GT(velocity.x, 0.0f);

    table.setDampedSpeedOfFastestFinger(42.0f);
    EXPECT_EQ(table.dampedSpeedOfFastestFinger(), 42.0f);
    EXPECT_EQ(text(table.dampedVelocityOfFastestFinger()), text(velocity));
    table.setDampedVelocityOfFastestFinger(HIDPoint{1.0f, 2.0f});
    EXPECT_EQ(text(table.dampedVelocityOfFastestFinger()), text(HIDPoint{1.0f, 2.0f}));
    EXPECT_EQ(table.dampedSpeedOfFastestFinger(), 42.0f);

    table.unpackContactFrame(moved->copy(), 24000000.0);
    EXPECT_NE(table.dampedSpeedOfFastestFinger(), 42.0f);
    EXPECT_EQ(fastestFingerDifference(table), "");
}

}  // namespace
}  // namespace orvane
