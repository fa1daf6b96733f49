// The speed symmetries of all paths worked out with the touching fingers gathered once per
// frame agree with asking every path in turn: on every frame of the random sessions, and on
// tables of up to fourteen fingers with random, tied and zero velocities.

#include <gtest/gtest.h>

#include <array>
#include <cmath>
#include <cstring>
#include <limits>
#include <random>

#include "paths/HIDPathStates.h"
#include "PerfSessions.h"

namespace orvane {
namespace {

using Symmetries = std::array<uint32_t, HIDPathStateBasic::kNumPaths>;

// The bits of every path's symmetry, so that NaN and -0 compare as well.
Symmetries symmetriesOf(const HIDPathStates& table) {
    Symmetries bits{};
    for (int s = 0; s < HIDPathStateBasic::kNumPaths; ++s) {
        const float v = table.getParserPath(s)->_2F_speed_symmetry();
        std::memcpy(&bits[static_cast<size_t>(s)], &v, sizeof v);
    }
    return bits;
}

void setSymmetries(HIDPathStates& table, const Symmetries& bits) {
    for (int s = 0; s < HIDPathStateBasic::kNumPaths; ++s) {
        float v;
        std::memcpy(&v, &bits[static_cast<size_t>(s)], sizeof v);
        table.getParserPath(s)->set_2F_speed_symmetry(v);
    }
}

// Both forms from the same state; the table is left as it was. True when they agree.
bool formsAgree(HIDPathStates& table) {
    const Symmetries before = symmetriesOf(table);
    table.updateSpeedSymmetriesOfAllPathsOneByOne();
    const Symmetries plain = symmetriesOf(table);
    setSymmetries(table, before);
    table.updateSpeedSymmetriesOfAllPaths();
    const Symmetries gathered = symmetriesOf(table);
    setSymmetries(table, before);
    return plain == gathered;
}

int touchingFingers(const HIDPathStates& table) {
    int n = 0;
    for (int s = 1; s < HIDPathStateBasic::kNumPaths; ++s) {
        const HIDParserPath* p = table.getParserPath(s);
        n += (p->isTouching() && p->isFingerOrRestingContact()) ? 1 : 0;
    }
    return n;
}

TEST(SpeedSymmetry, GatheredOnceAgreesWithEveryPathInTurnOnTheRandomSessions) {
    int frames = 0;
    int differences = 0;
    int withSeveralFingers = 0;
    int nonZero = 0;
    perf::replayRandomSessions([&](HIDParser& parser, const HIDEventRef&) {
        HIDPathStates& table = *parser.pathStates();
        ++frames;
        if (!formsAgree(table)) ++differences;
        if (touchingFingers(table) >= 2) ++withSeveralFingers;
        for (int s = 1; s < HIDPathStateBasic::kNumPaths; ++s) {
            if (table.getParserPath(s)->_2F_speed_symmetry() != 0.0f) ++nonZero;
        }
    });
    EXPECT_EQ(differences, 0);
    // The sessions had several fingers moving on many frames, so the agreement says something.
    EXPECT_GT(withSeveralFingers, frames / 10);
    EXPECT_GT(nonZero, frames / 10);
}

TEST(SpeedSymmetry, GatheredOnceAgreesWithEveryPathInTurnOnRandomTables) {
    std::mt19937 random(20261122);
    auto pick = [&random](int low, int high) { return std::uniform_int_distribution<int>(low, high)(random); };
    // Few distinct values, so equal speeds and equal lengths (ties in the sorts) are common.
    const std::array<float, 7> values{0.0f, 0.5f, -0.5f, 1.0f, -2.0f, 3.25f, 0.75f};
    auto value = [&] { return values[static_cast<size_t>(pick(0, static_cast<int>(values.size()) - 1))]; };
    HIDPathStates table(500.0f, 1000.0f);
    int differences = 0;
    int crowded = 0;
    for (int step = 0; step < 5000; ++step) {
        for (int s = 1; s < HIDPathStateBasic::kNumPaths; ++s) {
            HIDParserPath* path = table.getParserPath(s);
            HIDContact c = path->currentContact();
            c.fingerTipSwitch = pick(0, 3) == 0 ? 0 : 1;
            c.fingerConfidence = pick(0, 5) == 0 ? 0 : 1;
            // Now and then a contact in another's slot, or none.
            c.path_id = pick(0, 19) == 0 ? pick(0, 14) : s;
            path->setCurrentContact(c);
            path->setDampedVelocity(HIDPoint{value(), value()});
            path->setDampedSpeed(pick(0, 3) == 0 ? 0.0f : std::fabs(value()));
            path->set_2F_speed_symmetry(value());
        }
        if (touchingFingers(table) >= 8) ++crowded;
        if (!formsAgree(table)) ++differences;
    }
    EXPECT_EQ(differences, 0);
    EXPECT_GT(crowded, 1000);  // many tables had most of the fourteen fingers down
}

// The bits of a float, so that NaN and -0 compare as well.
uint32_t bitsOf(float v) {
    uint32_t b;
    std::memcpy(&b, &v, sizeof b);
    return b;
}

// With one other finger the symmetry is worked out without sorting and from the one cosine it
// reads; for every kind of value, zeros of both signs, NaN and infinities included, it is the
// symmetry the full working gives.
TEST(SpeedSymmetry, OneOtherFingerGivesWhatTheFullWorkingGivesForEveryKindOfValue) {
    const float nan = std::numeric_limits<float>::quiet_NaN();
    const float inf = std::numeric_limits<float>::infinity();
    const std::array<float, 13> values{0.0f, -0.0f, 0.25f, -0.25f, 0.75f, 1.0f, -1.0f, 3.5f, -7.0f, 1e-30f, 1e30f, inf, nan};
    std::mt19937 random(4711);
    auto value = [&] { return values[std::uniform_int_distribution<size_t>(0, values.size() - 1)(random)]; };
    int differences = 0;
    int nonZero = 0;
    int negative = 0;
    for (int i = 0; i < 200000; ++i) {
        const HIDPoint desired{value(), value()};
        const HIDPoint other{value(), value()};
        // Speeds mostly as the paths keep them (lengths, so never negative), now and then anything.
        const float desiredSpeed = i % 7 == 0 ? value() : std::fabs(value());
        const float otherSpeed = i % 5 == 0 ? value() : std::fabs(value());
        const float fast = HIDPathStates::speedSymmetryAmongFingers(desired, desiredSpeed, &other, &otherSpeed, 1);
        const float full = HIDPathStates::speedSymmetryAmongFingersInFull(desired, desiredSpeed, &other, &otherSpeed, 1);
        if (bitsOf(fast) != bitsOf(full)) ++differences;
        if (full != 0.0f) ++nonZero;
        if (full < 0.0f) ++negative;
    }
    EXPECT_EQ(differences, 0);
    EXPECT_GT(nonZero, 50000);
    EXPECT_GT(negative, 10000);  // fingers moving apart, whose cosine is negative, were among them
}

// Two fingers on the table: each one's symmetry comes from the one cosine between them, which
// is the same both ways round; for every kind of velocity and speed it is what the full
// working gives for each finger against the other.
TEST(SpeedSymmetry, TwoFingersShareTheirCosineAndGetWhatTheFullWorkingGives) {
    const float nan = std::numeric_limits<float>::quiet_NaN();
    const float inf = std::numeric_limits<float>::infinity();
    const std::array<float, 12> values{0.0f, -0.0f, 0.25f, -0.25f, 0.75f, 1.0f, -1.0f, 3.5f, -7.0f, 1e30f, inf, nan};
    std::mt19937 random(99);
    auto value = [&] { return values[std::uniform_int_distribution<size_t>(0, values.size() - 1)(random)]; };
    HIDPathStates table(500.0f, 1000.0f);
    int differences = 0;
    int negative = 0;
    for (int step = 0; step < 50000; ++step) {
        for (int s = 1; s <= 2; ++s) {
            HIDParserPath* path = table.getParserPath(s);
            HIDContact c = path->currentContact();
            c.fingerTipSwitch = 1;
            c.fingerConfidence = 1;
            c.path_id = s;
            path->setCurrentContact(c);
            path->setDampedVelocity(HIDPoint{value(), value()});
            path->setDampedSpeed(step % 3 == 0 ? value() : std::fabs(value()));
        }
        const HIDParserPath* a = table.getParserPath(1);
        const HIDParserPath* b = table.getParserPath(2);
        const HIDPoint va = a->dampedVelocity(), vb = b->dampedVelocity();
        const float sa = a->dampedSpeed(), sb = b->dampedSpeed();
        const float expectedA = HIDPathStates::speedSymmetryAmongFingersInFull(va, sa, &vb, &sb, 1);
        const float expectedB = HIDPathStates::speedSymmetryAmongFingersInFull(vb, sb, &va, &sa, 1);
        table.updateSpeedSymmetriesOfAllPaths();
        if (bitsOf(a->_2F_speed_symmetry()) != bitsOf(expectedA)) ++differences;
        if (bitsOf(b->_2F_speed_symmetry()) != bitsOf(expectedB)) ++differences;
        if (expectedA < 0.0f) ++negative;
    }
    EXPECT_EQ(differences, 0);
    EXPECT_GT(negative, 2000);
}

}  // namespace
}  // namespace orvane
