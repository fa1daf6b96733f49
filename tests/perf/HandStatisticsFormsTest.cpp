// The hand statistics counted over only the paths that can take part (with the timestamps
// read in place and the lift-off edge test asked only of paths that no longer touch) agree
// with asking the table for every ID in turn: on every frame of the random sessions, and on
// random tables whose contacts sit in their own slots, in others' or in none.

#include <gtest/gtest.h>

#include <cstdio>
#include <random>
#include <string>

#include "paths/HIDPathStates.h"
#include "stats/HIDHandStatistics.h"
#include "PerfSessions.h"

namespace orvane {
namespace {

std::string hex(double v) {
    char b[40];
    std::snprintf(b, sizeof b, "%a ", v);
    return b;
}
std::string hex(HIDPoint p) { return hex(static_cast<double>(p.x)) + hex(static_cast<double>(p.y)); }
std::string num(int v) { return std::to_string(v) + " "; }

// Everything the statistics show, bit for bit.
std::string stateOf(const HIDHandStatistics& s) {
    return num(s.engagedinGesture()) + num(s.twoFingersClose()) + num(s.palmsRemoved()) +
           num(s.werePalmsRemoved()) + num(s.recentFingerLiftedWasOnEdge()) + num(s.recentFingerLiftedWasThumb()) +
           num(s.handsign()) + num(s.pathID_recentFingerTouched()) + num(s.pathID_recentFingerLifted()) +
           num(s.numFingersTouching()) + num(s.numFingersRestingInZone()) + num(s.lastNumFingersTouching()) +
           num(s.maxFingersTouching()) + num(s.numFingersReidentifiedAsPalms()) +
           num(s.numConsecutiveLiftoffsCountingThumb()) + num(s.numPaths()) + num(s.lastNumPaths()) +
           num(s.currentButtonState()) + num(s.lastButtonState()) + "| " + hex(s.t_recentReset()) +
           hex(s.t_firstFingerTouchDown()) + hex(s.t_recentFingerTouchDown()) +
           hex(s.t_previousRecentFingerTouchDown()) + hex(s.t_recentTwoFingerTap()) +
           hex(s.t_recentSingleFingerTap()) + hex(s.t_recentScrollEnd()) + hex(s.t_recentSwipeEnd()) +
           hex(s.t_recentRotateEnd()) + hex(s.t_recentScaleEnd()) + hex(s.t_recentFingerLiftoff()) +
           hex(s.t_recentButtonActivity()) + "| " + hex(s.previousFingerLiftoffLocation()) +
           hex(s.recentFingerLiftoffLocation()) + "| " + hex(s.currentTimestamp()) + hex(s.previousTimestamp());
}

// Both forms from the same statistics and table; `stats` is left as it was. The state each
// form leaves, with its answer, or "" for `differs` when they agree.
std::string differenceOf(const HIDHandStatistics& stats, const HIDPathStates& table) {
    HIDHandStatistics plain = stats;
    HIDHandStatistics walked = stats;
    const bool plainAnswer = plain.processHandStateOneByOne(table);
    const bool walkedAnswer = walked.processHandState(table);
    const std::string a = num(plainAnswer) + stateOf(plain);
    const std::string b = num(walkedAnswer) + stateOf(walked);
    return a == b ? std::string() : "one by one: " + a + "\nwalked:     " + b;
}

TEST(HandStatisticsForms, WalkAgreesWithEveryIDInTurnOnTheRandomSessions) {
    int frames = 0;
    int differences = 0;
    int lifts = 0;
    int severalFingers = 0;
    std::string first;
    perf::replayRandomSessions([&](HIDParser& parser, const HIDEventRef&) {
        ++frames;
        const std::string d = differenceOf(*parser.handStats(), *parser.pathStates());
        if (!d.empty() && differences++ == 0) first = d;
        if (parser.handStats()->numFingersTouching() >= 2) ++severalFingers;
        for (int s = 1; s < HIDPathStateBasic::kNumPaths; ++s) {
            const HIDParserPath* p = parser.pathStates()->getParserPath(s);
            if (p->currentContact().path_id == s && !p->isTouching() && p->wasTouching()) ++lifts;
        }
    });
    EXPECT_EQ(differences, 0) << first;
    // The sessions had several fingers down and lifting on many frames, so the agreement says something.
    EXPECT_GT(severalFingers, frames / 10);
    EXPECT_GT(lifts, 100);
}

TEST(HandStatisticsForms, WalkAgreesWithEveryIDInTurnOnRandomTables) {
    std::mt19937 random(20261123);
    auto pick = [&random](int low, int high) { return std::uniform_int_distribution<int>(low, high)(random); };
    // Few distinct times, so ties between lift-offs are common.
    auto time = [&] { return static_cast<double>(pick(0, 6) * 1000); };
    auto coordinate = [&] { return static_cast<float>(pick(-50, 600)); };
    HIDPathStates table(500.0f, 1000.0f);
    HIDHandStatistics stats;
    int differences = 0;
    int loose = 0;
    int lifts = 0;
    std::string first;
    for (int step = 0; step < 5000; ++step) {
        table.updateFrameTimestamp(static_cast<double>(step) * 1000.0);
        table.setButtonState(pick(0, 9) == 0 ? pick(0, 1) : table.buttonState());
        for (int s = 1; s < HIDPathStateBasic::kNumPaths; ++s) {
            HIDParserPath* path = table.getParserPath(s);
            HIDContact previous = path->currentContact();
            HIDContact c = previous;
            c.fingerTipSwitch = pick(0, 2) == 0 ? 0 : 1;
            c.fingerConfidence = pick(0, 5) == 0 ? 0 : 1;
            // Now and then a contact in another's slot, or none.
            c.path_id = pick(0, 14) == 0 ? pick(0, 14) : (pick(0, 6) == 0 ? 0 : s);
            c.finger_id = c.path_id + 1;
            c.position = HIDPoint{coordinate(), coordinate()};
            c.velocity = HIDPoint{static_cast<float>(pick(-3, 3)), static_cast<float>(pick(-3, 3))};
            c.device_timestamp = static_cast<double>(step);
            path->setPreviousContact(previous);
            path->setCurrentContact(c);
            path->setRestingInThumbZone(pick(0, 4) == 0);
            path->setTimestamps(HIDPathTimestamps{time(), time(), time(), time(), time(), time(), time()});
            if (c.path_id != 0 && c.path_id != s) ++loose;
            if (c.fingerTipSwitch == 0 && previous.fingerTipSwitch != 0) ++lifts;
        }
        const std::string d = differenceOf(stats, table);
        if (!d.empty() && differences++ == 0) first = d;
        stats.processHandState(table);
        // Now and then the full reset, as the gesture stage does.
        if (pick(0, 49) == 0) stats.clear(false);
    }
    EXPECT_EQ(differences, 0) << first;
    EXPECT_GT(loose, 1000);
    EXPECT_GT(lifts, 5000);
}

}  // namespace
}  // namespace orvane
