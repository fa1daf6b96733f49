// The hand motion's faster forms agree with the plain ones:
// - the finger-to-path map built over only the paths that can take part, clearing only the
//   entries the last mapping set, agrees with clearing every entry and asking the table for
//   every ID in turn, on every frame of the random sessions and on random tables with finger
//   IDs repeated, out of range, in others' slots or none; and every entry outside the set of
//   mapped finger IDs is 0;
// - the separation without its direction has the same x, y and magnitude as the full one;
// - the WithResting extraction of the plain view's pair gives the plain deltas bit for bit,
//   so a frame whose views picked the same pair shares them;
// - the location's rotate, worked out when read, is bit for bit the direction the extraction
//   gave (0 without a pair), through every way the location is set or cleared.
// - the smoothed clipped velocity, worked out when read, is bit for bit what clipping at once
//   leaves, through every way the velocities are set, cleared or copied.

#include <gtest/gtest.h>

#include <cmath>
#include <cstdio>
#include <cstring>
#include <random>
#include <string>

#include "motion/HIDHandMotion.h"
#include "paths/HIDPathStates.h"
#include "stats/HIDHandStatistics.h"
#include "PerfSessions.h"

namespace orvane {
namespace {

std::string num(int v) { return std::to_string(v) + " "; }
std::string hex(float v) {
    char b[40];
    std::snprintf(b, sizeof b, "%a ", static_cast<double>(v));
    return b;
}
std::string hex(const HIDMotion& m) { return hex(m.x) + hex(m.y) + hex(m.scale) + hex(m.rotate); }
bool sameBits(float a, float b) { return std::memcmp(&a, &b, sizeof a) == 0; }
bool sameBits(const HIDMotion& a, const HIDMotion& b) { return std::memcmp(&a, &b, sizeof a) == 0; }

// Everything the map shows.
std::string mapStateOf(const HIDFingerToPathMap& m) {
    std::string s;
    for (int32_t id : m.fingersToPathIDs()) s += num(id);
    s += "| ";
    for (int32_t id : m.fingersToPathIDsWithResting()) s += num(id);
    return s + "| " + num(m.numFingersTouching()) + num(m.numFingersTouchingWithResting()) +
           num(m.maxFingersTouching()) + num(m.numFingersStraddlingEdge()) + num(m.numPalmContacts()) +
           num(m.handIdentity()) + num(m.innermostTouchingFingerID()) + num(m.nextInnermostTouchingFingerID()) +
           num(m.outermostTouchingFingerID()) + num(m.innermostTouchingFingerIDWithResting()) +
           num(m.outermostTouchingFingerIDWithResting());
}

// "" when every entry of both maps outside mappedFingerIDs is 0 and every one in it is not.
std::string unmappedEntriesOf(const HIDFingerToPathMap& m) {
    std::string s;
    for (uint32_t id = 0; id < HIDFingerToPathMap::kNumFingerIDs; ++id) {
        const bool mapped = (m.mappedFingerIDs() >> id & 1u) != 0;
        const bool plainSet = m.fingersToPathIDs()[id] != 0;
        const bool restingSet = m.fingersToPathIDsWithResting()[id] != 0;
        if (plainSet != mapped || restingSet != mapped) s += num(static_cast<int>(id));
    }
    return s.empty() ? s : "entries against the mask: " + s;
}

// Both forms from the same map and table; "" when they agree.
std::string mapDifferenceOf(const HIDFingerToPathMap& map, const HIDPathStateBasic& table) {
    HIDFingerToPathMap plain = map;
    HIDFingerToPathMap walked = map;
    plain.updateFingerPathMappingsOneByOne(table);
    walked.updateFingerPathMappings(table);
    const std::string a = mapStateOf(plain);
    const std::string b = mapStateOf(walked);
    if (a != b) return "one by one: " + a + "\nwalked:     " + b;
    const std::string before = unmappedEntriesOf(map);
    if (!before.empty()) return "before: " + before;
    const std::string after = unmappedEntriesOf(walked);
    return after.empty() ? after : "after: " + after;
}

const HIDContact kNoContact{};
const HIDContact& currentOf(const HIDParserPath* p) { return p ? p->currentContact() : kNoContact; }

// The location's rotate as the extraction worked it out in full: the direction of the
// separation when the outermost path carries a contact of its own, else 0.
float directionReference(const HIDParserPath* inner, const HIDParserPath* outer) {
    const HIDContact& i = currentOf(inner);
    const HIDContact& o = currentOf(outer);
    if (outer == nullptr || o.path_id == 0 || o.path_id == i.path_id) return 0.0f;
    return HIDHandMotion::computeSeparationVector(i, o).direction;
}

TEST(HandMotionForms, MapWalkAgreesWithEveryIDInTurnOnTheRandomSessions) {
    int frames = 0;
    int differences = 0;
    int pairs = 0;
    int directionDifferences = 0;
    int deltaDifferences = 0;
    int withScale = 0;
    int sameViews = 0;
    int otherViews = 0;
    std::string first;
    perf::replayRandomSessions([&](HIDParser& parser, const HIDEventRef&) {
        ++frames;
        const HIDPathStates& table = *parser.pathStates();
        const HIDHandMotion& motion = *parser.handMotionExtractor();
        const std::string d = mapDifferenceOf(motion, table);
        if (!d.empty() && differences++ == 0) first = d;

        // The extraction of this frame ran on this table with these mappings whenever a
        // finger touched; its location's rotate is the direction worked out in full.
        if (parser.handStats()->numFingersTouching() >= 1) {
            const HIDParserPath* inner = motion.getInnermostTouchingPath(table, false);
            const HIDParserPath* outer = motion.getOutermostTouchingPath(table, false);
            const float expected = directionReference(inner, outer);
            if (expected != 0.0f) ++pairs;
            if (!sameBits(motion.absoluteLocation().rotate, expected)) ++directionDifferences;
        }

        // And extractions from a copy, with both views' pairs: the location's rotate, and the
        // WithResting extraction of the same pair giving the plain one's deltas.
        for (bool withResting : {false, true}) {
            for (int touching = 0; touching < 4; ++touching) {
                HIDHandMotion copy = motion;
                HIDParserPath* inner = copy.getInnermostTouchingPath(table, withResting);
                HIDParserPath* outer = copy.getOutermostTouchingPath(table, withResting);
                const bool are = (touching & 1) != 0;
                const bool were = (touching & 2) != 0;
                copy.extractHandMotion(table, inner, outer, are, were);
                copy.extractHandMotionWithResting(table, inner, outer, are, were);
                if (!sameBits(copy.absoluteLocation().rotate, directionReference(inner, outer))) {
                    ++directionDifferences;
                }
                if (!sameBits(copy.pixelDeltas(), copy.pixelDeltasWithResting())) ++deltaDifferences;
                if (copy.pixelDeltas().scale != 0.0f) ++withScale;
            }
        }
        // The frame shared the plain deltas whenever both views had the same fingers.
        if (motion.innermostTouchingFingerIDWithResting() == motion.innermostTouchingFingerID() &&
            motion.outermostTouchingFingerIDWithResting() == motion.outermostTouchingFingerID()) {
            ++sameViews;
        } else {
            ++otherViews;
        }
    });
    EXPECT_EQ(differences, 0) << first;
    EXPECT_EQ(directionDifferences, 0);
    EXPECT_EQ(deltaDifferences, 0);
    // Two or more fingers on many frames, so the agreement says something; and frames of
    // both kinds, a resting thumb in one view only included.
    EXPECT_GT(pairs, frames / 10);
    EXPECT_GT(withScale, frames / 10);
    EXPECT_GT(sameViews, frames / 10);
    EXPECT_GT(otherViews, 0) << "no frame had a resting thumb";
}

TEST(HandMotionForms, MapWalkAgreesWithEveryIDInTurnOnRandomTables) {
    std::mt19937 random(20261124);
    auto pick = [&random](int low, int high) { return std::uniform_int_distribution<int>(low, high)(random); };
    HIDPathStates table(500.0f, 1000.0f);
    HIDFingerToPathMap map;
    int differences = 0;
    int crowded = 0;
    int staleCleared = 0;
    std::string first;
    for (int step = 0; step < 5000; ++step) {
        for (int s = 1; s < HIDPathStateBasic::kNumPaths; ++s) {
            HIDParserPath* path = table.getParserPath(s);
            HIDContact c = path->currentContact();
            c.fingerTipSwitch = pick(0, 3) == 0 ? 0 : 1;
            c.fingerConfidence = pick(0, 5) == 0 ? 0 : 1;
            // Now and then a contact in another's slot, or none.
            c.path_id = pick(0, 19) == 0 ? pick(0, 14) : s;
            // Finger IDs repeated, out of the mapped range, negative and 0.
            c.finger_id = pick(0, 9) == 0 ? pick(-2, 20) : c.path_id + 1;
            path->setCurrentContact(c);
            path->setRestingInThumbZone(pick(0, 4) == 0);
        }
        const std::string d = mapDifferenceOf(map, table);
        if (!d.empty() && differences++ == 0) first = d;
        const uint32_t before = map.mappedFingerIDs();
        map.updateFingerPathMappings(table);
        // Entries of the last mapping that this one does not set again are the ones cleared.
        if ((before & ~map.mappedFingerIDs()) != 0) ++staleCleared;
        if (map.numFingersTouching() >= 8) ++crowded;
        if (pick(0, 49) == 0) map.clearFingerPathMappings();
    }
    EXPECT_EQ(differences, 0) << first;
    EXPECT_GT(crowded, 500);
    EXPECT_GT(staleCleared, 500);
}

TEST(HandMotionForms, SeparationWithoutDirectionKeepsTheOtherParts) {
    std::mt19937 random(20261125);
    std::uniform_real_distribution<float> coordinate(-2000.0f, 2000.0f);
    const float specials[] = {0.0f, -0.0f, 1e-30f, -1e-30f, 3.0e38f, -3.0e38f, INFINITY, -INFINITY, NAN};
    int differences = 0;
    for (int n = 0; n < 200000; ++n) {
        HIDContact a{};
        HIDContact b{};
        a.position = HIDPoint{coordinate(random), coordinate(random)};
        b.position = HIDPoint{coordinate(random), coordinate(random)};
        if (n % 7 == 0) b.position.x = a.position.x;
        if (n % 11 == 0) b.position = a.position;
        if (n % 13 == 0) b.position.y = specials[static_cast<size_t>(n / 13) % std::size(specials)];
        const HIDSeparationVector full = HIDHandMotion::computeSeparationVector(a, b);
        const HIDSeparationVector part = HIDHandMotion::computeSeparationVectorWithoutDirection(a, b);
        if (!sameBits(full.x, part.x) || !sameBits(full.y, part.y) || !sameBits(full.magnitude, part.magnitude) ||
            !sameBits(part.direction, 0.0f)) {
            ++differences;
        }
    }
    EXPECT_EQ(differences, 0);
}

TEST(HandMotionForms, WithRestingExtractionOfThePlainPairGivesThePlainDeltas) {
    std::mt19937 random(20261128);
    auto pick = [&random](int low, int high) { return std::uniform_int_distribution<int>(low, high)(random); };
    // Few distinct values, so equal positions, zero separations and -0 sums come up.
    const float values[] = {0.0f, -0.0f, 0.5f, -1.25f, 3.0f, 7.75f, -20.0f, 1e-3f};
    auto value = [&] { return values[static_cast<size_t>(pick(0, static_cast<int>(std::size(values)) - 1))]; };
    HIDPathStates table(500.0f, 1000.0f);
    HIDHandMotion motion;
    int differences = 0;
    int full = 0;
    for (int step = 0; step < 50000; ++step) {
        for (int s = 1; s <= 3; ++s) {
            HIDParserPath* path = table.getParserPath(s);
            HIDContact c{};
            c.fingerTipSwitch = pick(0, 3) == 0 ? 0 : 1;
            c.fingerConfidence = 1;
            c.path_id = pick(0, 5) == 0 ? pick(0, 3) : s;
            c.position = HIDPoint{value(), value()};
            HIDContact p = c;
            p.path_id = pick(0, 5) == 0 ? 0 : s;
            p.position = HIDPoint{value(), value()};
            path->setPreviousContact(p);
            path->setCurrentContact(c);
            path->setPixelDelta(HIDPoint{value(), value()});
            path->setEngagedVelocity(HIDPoint{value(), value()});
        }
        HIDParserPath* inner = pick(0, 7) == 0 ? nullptr : table.getParserPath(pick(1, 3));
        HIDParserPath* outer = pick(0, 7) == 0 ? nullptr : table.getParserPath(pick(1, 3));
        const bool are = pick(0, 3) != 0;
        const bool were = pick(0, 3) != 0;
        motion.extractHandMotion(table, inner, outer, are, were);
        motion.extractHandMotionWithResting(table, inner, outer, are, were);
        if (!sameBits(motion.pixelDeltas(), motion.pixelDeltasWithResting())) {
            if (differences++ == 0) ADD_FAILURE() << hex(motion.pixelDeltas()) << "vs " << hex(motion.pixelDeltasWithResting());
        }
        if (motion.pixelDeltas().scale != 0.0f) ++full;
    }
    EXPECT_EQ(differences, 0);
    EXPECT_GT(full, 5000);
}

TEST(HandMotionForms, LocationDirectionFollowsEverySetAndClear) {
    std::mt19937 random(20261126);
    auto pick = [&random](int low, int high) { return std::uniform_int_distribution<int>(low, high)(random); };
    HIDPathStates table(500.0f, 1000.0f);
    HIDHandMotion motion;
    // The location as the extraction used to leave it, rotate worked out at once.
    HIDMotion expected{};
    int differences = 0;
    int withDirection = 0;
    for (int step = 0; step < 20000; ++step) {
        for (int s = 1; s <= 4; ++s) {
            HIDContact c{};
            c.fingerTipSwitch = 1;
            c.fingerConfidence = 1;
            c.path_id = pick(0, 5) == 0 ? 0 : s;
            c.finger_id = s + 1;
            c.position = HIDPoint{static_cast<float>(pick(0, 40)), static_cast<float>(pick(0, 40))};
            table.getParserPath(s)->setPreviousContact(table.getParserPath(s)->currentContact());
            table.getParserPath(s)->setCurrentContact(c);
        }
        switch (pick(0, 9)) {
            case 0: {
                const HIDMotion m{static_cast<float>(pick(0, 9)), 1.0f, 2.0f, static_cast<float>(pick(-3, 3))};
                motion.setAbsoluteLocation(m);
                expected = m;
                break;
            }
            case 1: {
                const bool clearLocation = pick(0, 1) == 1;
                motion.clearHandMotion(clearLocation);
                if (clearLocation) expected = HIDMotion{};
                break;
            }
            default: {
                // Pairs of every kind: both, the same path twice, one missing, the outer without a contact.
                HIDParserPath* inner = pick(0, 5) == 0 ? nullptr : table.getParserPath(pick(1, 4));
                HIDParserPath* outer = pick(0, 5) == 0 ? nullptr : table.getParserPath(pick(1, 4));
                motion.extractHandMotion(table, inner, outer, pick(0, 1) == 1, pick(0, 1) == 1);
                const HIDMotion got = motion.absoluteLocation();
                expected.x = got.x;
                expected.y = got.y;
                expected.scale = got.scale;
                expected.rotate = directionReference(inner, outer);
                if (expected.rotate != 0.0f) ++withDirection;
                break;
            }
        }
        if (!sameBits(motion.absoluteLocation(), expected)) {
            if (differences++ == 0) ADD_FAILURE() << "step " << step << ": " << hex(motion.absoluteLocation())
                                                  << "expected " << hex(expected);
        }
    }
    EXPECT_EQ(differences, 0);
    EXPECT_GT(withDirection, 5000);
}

// Everything the clipping leaves, bit for bit.
std::string clippingStateOf(const HIDHandMotion& m) {
    return hex(m.smoothedClippedVelocity()) + "| " + hex(m.smoothedVelocity()) + "| " + hex(m.pixelDeltas()) + "| " +
           hex(m.pixelDeltasWithResting()) + "| " + hex(m.nondominantAxesRatio()) + hex(m.smoothedTranslationSpeed());
}

// The smoothed clipped velocity, worked out when read from the smoothed velocity and the axes
// the clipping kept, is bit for bit what clipping it at once leaves, through every way the
// velocities are set or cleared in between; the rest of what the clipping leaves is the same
// too. Two motions go through the same steps, one clipping each way.
TEST(HandMotionForms, ClippedVelocityWorkedOutWhenReadFollowsEverySetAndClear) {
    std::mt19937 random(20261122);
    auto pick = [&random](int low, int high) { return std::uniform_int_distribution<int>(low, high)(random); };
    // Small steps, so that the scale and rotation speeds often tie; now and then 0.
    auto any = [&]() { return pick(0, 4) == 0 ? 0.0f : static_cast<float>(pick(-40, 40)) / 4.0f; };
    auto anyMotion = [&]() { return HIDMotion{any(), any(), any(), any()}; };
    HIDHandMotion whenRead;
    HIDHandMotion atOnce;
    // The same change to both motions.
    auto both = [&](const auto& change) {
        change(whenRead);
        change(atOnce);
    };
    int differences = 0;
    int clips = 0;
    int kinds[4] = {0, 0, 0, 0};  // translation, scale, rotation, scale and rotation tied
    for (int step = 0; step < 40000; ++step) {
        switch (pick(0, 11)) {
            case 0: {
                const HIDMotion v = anyMotion();
                both([&](HIDHandMotion& m) { m.setSmoothedVelocity(v); });
                break;
            }
            case 1: {
                const HIDMotion v = anyMotion();
                both([&](HIDHandMotion& m) { m.setSmoothedClippedVelocity(v); });
                break;
            }
            case 2: {
                const bool clearLocation = pick(0, 1) == 1;
                both([&](HIDHandMotion& m) { m.clearHandMotion(clearLocation); });
                break;
            }
            case 3: {
                // A copy carries what the clipping kept.
                const HIDHandMotion copy = whenRead;
                whenRead = copy;
                break;
            }
            case 4: {
                const float separation = static_cast<float>(pick(0, 120));
                both([&](HIDHandMotion& m) { m.setInnermostOutermostSeparation_mm(separation); });
                break;
            }
            case 5: {
                const HIDMotion d = anyMotion();
                both([&](HIDHandMotion& m) {
                    m.setPixelDeltas(d);
                    m.setPixelDeltasWithResting(d);
                });
                break;
            }
            default: {
                const HIDMotion v = anyMotion();
                both([&](HIDHandMotion& m) { m.setVelocity(v); });
                // Frame intervals in ticks: none, and ordinary ones of 8 ms and 11 ms.
                const double interval = pick(0, 5) == 0 ? 0.0 : (pick(0, 1) == 0 ? 8000000.0 : 11000000.0);
                whenRead.clipMotionToDominantAxes(interval);
                atOnce.clipMotionToDominantAxesLiteral(interval);
                const HIDMotion c = atOnce.smoothedClippedVelocity();
                if (c.x != 0.0f || c.y != 0.0f) {
                    ++kinds[0];
                } else if (c.scale != 0.0f && c.rotate != 0.0f) {
                    ++kinds[3];
                } else if (c.scale != 0.0f) {
                    ++kinds[1];
                } else if (c.rotate != 0.0f) {
                    ++kinds[2];
                }
                ++clips;
                break;
            }
        }
        const std::string a = clippingStateOf(whenRead);
        const std::string b = clippingStateOf(atOnce);
        if (a != b && differences++ < 3)
            ADD_FAILURE() << "step " << step << ":\n when read: " << a << "\n at once:   " << b;
    }
    EXPECT_EQ(differences, 0);
    EXPECT_GT(clips, 20000);
    // Every way the clipping goes was taken, ties of scale and rotation too.
    for (int kind : kinds) EXPECT_GT(kind, 50);
}

}  // namespace
}  // namespace orvane
