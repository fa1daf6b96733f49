// A finger path's reading of a contact, its screen-UI filter and its velocity damping, in the
// forms the frame runs (one table mark per step, the damping weights kept per frame interval),
// agree bit for bit with their step-by-step forms (each step marking the table, the power of
// two worked out on every call): on every contact of the random sessions, and on random paths
// and contacts with NaN, -0, infinities and tiny values in every place.

#include <gtest/gtest.h>

#include <array>
#include <cmath>
#include <cstring>
#include <limits>
#include <new>
#include <random>
#include <sstream>
#include <string>
#include <vector>

#include "paths/HIDPathStates.h"
#include "PerfSessions.h"
#include "pipeline/HIDParserPath.h"
#include "tests/support/FrameBuilder.h"

namespace orvane {
namespace {

template <typename T>
bool sameBits(const T& a, const T& b) {
    return std::memcmp(&a, &b, sizeof(T)) == 0;
}

// Bit for bit, -0 and infinities included, except that any NaN equals any NaN: when both
// operands of an operation are NaN, which one comes out (and so its sign and payload) is the
// compiler's choice of operand order, not the rule's, and the two forms are compiled apart.
bool sameBits(float a, float b) { return (std::isnan(a) && std::isnan(b)) || std::memcmp(&a, &b, sizeof a) == 0; }
bool sameBits(double a, double b) { return (std::isnan(a) && std::isnan(b)) || std::memcmp(&a, &b, sizeof a) == 0; }

bool sameTimes(const HIDPathTimestamps& a, const HIDPathTimestamps& b) {
    return sameBits(a.t_cleanStartInRange, b.t_cleanStartInRange) && sameBits(a.t_startInRange, b.t_startInRange) &&
           sameBits(a.t_makeTouch, b.t_makeTouch) && sameBits(a.t_startHover, b.t_startHover) &&
           sameBits(a.t_endHover, b.t_endHover) && sameBits(a.t_breakTouch, b.t_breakTouch) &&
           sameBits(a.t_endOutRange, b.t_endOutRange);
}

bool sameContact(const HIDContact& a, const HIDContact& b) {
    return a.fingerTipSwitch == b.fingerTipSwitch && a.fingerConfidence == b.fingerConfidence &&
           a.path_id == b.path_id && a.finger_id == b.finger_id && sameBits(a.velocity.x, b.velocity.x) &&
           sameBits(a.velocity.y, b.velocity.y) && sameBits(a.device_timestamp, b.device_timestamp) &&
           sameBits(a.position.x, b.position.x) && sameBits(a.position.y, b.position.y);
}

bool samePoint(HIDPoint a, HIDPoint b) { return sameBits(a.x, b.x) && sameBits(a.y, b.y); }

// The first member in which two paths (and their tables' marks) differ, or "" when none does.
std::string firstDifference(const HIDParserPath& a, const HIDPathTableMarks& marksA, const HIDParserPath& b,
                            const HIDPathTableMarks& marksB) {
    if (!sameContact(a.currentContact(), b.currentContact())) return "currentContact";
    if (!sameContact(a.previousContact(), b.previousContact())) return "previousContact";
    if (a.isResting() != b.isResting()) return "isResting";
    if (a.isRestingInThumbZone() != b.isRestingInThumbZone()) return "isRestingInThumbZone";
    if (a.wasRestingInThumbZone() != b.wasRestingInThumbZone()) return "wasRestingInThumbZone";
    if (a.thumbMovementTimedOut() != b.thumbMovementTimedOut()) return "thumbMovementTimedOut";
    if (a.thumbAboveTRZOnTouchdown() != b.thumbAboveTRZOnTouchdown()) return "thumbAboveTRZOnTouchdown";
    if (!sameBits(a.engagedSpeed(), b.engagedSpeed())) return "engagedSpeed";
    if (!sameBits(a._2F_speed_symmetry(), b._2F_speed_symmetry())) return "_2F_speed_symmetry";
    if (!sameBits(a.dampedSpeed(), b.dampedSpeed())) return "dampedSpeed";
    if (!sameBits(a.peakDisplacement(), b.peakDisplacement())) return "peakDisplacement";
    if (!samePoint(a.surfaceDimensions(), b.surfaceDimensions())) return "surfaceDimensions";
    if (!samePoint(a.initialPosition(), b.initialPosition())) return "initialPosition";
    if (!samePoint(a.longTermPosition(), b.longTermPosition())) return "longTermPosition";
    if (!samePoint(a.stablePositionForUI(), b.stablePositionForUI())) return "stablePositionForUI";
    if (!samePoint(a.previousStablePositionForUI(), b.previousStablePositionForUI()))
        return "previousStablePositionForUI";
    if (!samePoint(a.hysteresisCenter(), b.hysteresisCenter())) return "hysteresisCenter";
    if (!samePoint(a.ellipseHysteresisOffset(), b.ellipseHysteresisOffset())) return "ellipseHysteresisOffset";
    if (!samePoint(a.pixelDelta(), b.pixelDelta())) return "pixelDelta";
    if (!samePoint(a.cumulativeDeltas(), b.cumulativeDeltas())) return "cumulativeDeltas";
    if (!samePoint(a.engagedVelocity(), b.engagedVelocity())) return "engagedVelocity";
    if (!samePoint(a.dampedVelocity(), b.dampedVelocity())) return "dampedVelocity";
    if (!sameTimes(a.timestamps(), b.timestamps())) return "timestamps";
    if (a.isEdgeContact() != b.isEdgeContact()) return "isEdgeContact";
    if (a.isContactOnDivingButton() != b.isContactOnDivingButton()) return "isContactOnDivingButton";
    if (marksA.looseSlots != marksB.looseSlots) return "marks.looseSlots";
    if (marksA.ownSlots != marksB.ownSlots) return "marks.ownSlots";
    if (marksA.dirtySlots != marksB.dirtySlots) return "marks.dirtySlots";
    return "";
}

// Two copies of one path, each in a table of its own at the same slot: one runs the
// step-by-step forms, the other the forms the frame runs.
struct PathPair {
    HIDPathTableMarks literalMarks;
    HIDPathTableMarks fastMarks;
    HIDParserPath literal;
    HIDParserPath fast;
    PathPair(const HIDParserPath& from, int slot, const HIDPathTableMarks& marks)
        : literalMarks(marks), fastMarks(marks), literal(from), fast(from) {
        literal.linkToTable(slot, &literalMarks);
        fast.linkToTable(slot, &fastMarks);
    }
    PathPair(const PathPair&) = delete;
    PathPair& operator=(const PathPair&) = delete;
    ~PathPair() {
        literal.linkToTable(-1, nullptr);
        fast.linkToTable(-1, nullptr);
    }
    std::string difference() const { return firstDifference(literal, literalMarks, fast, fastMarks); }
    void read(const HIDEvent& contact, double time) {
        literal.updateCurPrevContactsWithLiteral(contact, time);
        fast.updateCurPrevContactsWith(contact, time);
    }
    void filter(bool strongDamping) {
        literal.filterContactForScreenUILiteral(strongDamping);
        fast.filterContactForScreenUI(strongDamping);
    }
    void damp(bool strongDamping) {
        literal.updateDampedVelocityLiteral(strongDamping);
        fast.updateDampedVelocity(strongDamping);
    }
    void peak() {
        // Both are the one public form: kept in step so later steps start alike.
        literal.setPeakDisplacement();
        fast.setPeakDisplacement();
    }
};

// Every recorded frame, in the order replayRandomSessions replays them, as recorded (the
// parser changes the frames it is given), and whether it starts a session.
struct RecordedFrames {
    std::vector<HIDEventRef> frames;
    std::vector<bool> first;
};

RecordedFrames recordedFrames() {
    RecordedFrames out;
    for (const std::string& path : perf::randomSessions()) {
        formats::FrameRecording recording;
        std::string error;
        EXPECT_TRUE(formats::readFrameRecordingFile(path, &recording, &error)) << error;
        bool first = true;
        for (const formats::InputRecord& record : recording.records) {
            if (record.kind != formats::InputRecord::Kind::Event) continue;
            out.frames.push_back(record.event->copy());
            out.first.push_back(first);
            first = false;
        }
    }
    return out;
}

constexpr int kSlots = HIDPathStateBasic::kNumPaths;

TEST(ParserPathForms, OneMarkAndKeptDampingWeightsAgreeWithTheStepByStepFormsOnTheRandomSessions) {
    const RecordedFrames recorded = recordedFrames();
    // The paths as the previous frame left them; none before a session's first frame.
    std::vector<HIDParserPath> before;
    size_t index = 0;
    int contacts = 0;
    int differences = 0;
    int hysteresisMoves = 0;
    int strongDampings = 0;
    int newContacts = 0;
    int matchesTable = 0;
    std::string firstDiff;
    perf::replayRandomSessions([&](HIDParser& parser, const HIDEventRef&) {
        ASSERT_LT(index, recorded.frames.size());
        const HIDEventRef& frame = recorded.frames[index];
        const bool first = recorded.first[index];
        ++index;
        HIDPathStates& table = *parser.pathStates();
        if (!first && frame && before.size() == static_cast<size_t>(kSlots)) {
            // The frame's own steps before the contacts are read: lifted paths are cleared,
            // every one of them when the frame has no contacts.
            int n = 0;
            for (const HIDEventRef& child : frame->children()) n += child->conformsToEventType(kHIDEventTypeDigitizer);
            for (int s = 1; s <= 14; ++s) {
                HIDParserPath& p = before[static_cast<size_t>(s)];
                if (n == 0 || p.currentContact().fingerTipSwitch == 0) p.clear();
            }
            const double time = table.currentTimestamp();
            int numNew = 0;
            for (int i = 0; i < n; ++i) {
                const HIDEvent& child = *frame->children()[static_cast<size_t>(i)];
                const int32_t contactIndex = static_cast<int32_t>(child.integerValueForField(kHIDEventFieldDigitizerIndex));
                if (contactIndex > 13 || contactIndex < -1) continue;
                const int slot = contactIndex + 1;
                HIDParserPath& start = before[static_cast<size_t>(slot)];
                PathPair pair(start, slot, HIDPathTableMarks{});
                pair.read(child, time);
                std::string diff = pair.difference();
                if (pair.fast.isNewContact()) ++numNew;
                const HIDPoint centre = pair.fast.hysteresisCenter();
                pair.filter(numNew > 0);
                if (diff.empty()) diff = pair.difference();
                if (!diff.empty()) {
                    ++differences;
                    if (firstDiff.empty()) firstDiff = diff;
                }
                ++contacts;
                newContacts += pair.fast.isNewContact() ? 1 : 0;
                strongDampings += numNew > 0 ? 1 : 0;
                hysteresisMoves += samePoint(centre, pair.fast.hysteresisCenter()) ? 0 : 1;
                // The replay here follows the table's own: the damping, which no later step of
                // the frame touches, comes out as the table's.
                const HIDParserPath& live = *table.getParserPath(slot);
                matchesTable += samePoint(live.dampedVelocity(), pair.fast.dampedVelocity()) &&
                                sameBits(live.peakDisplacement(), pair.fast.peakDisplacement());
                // The next contact of the same slot in this frame reads on from here.
                start.~HIDParserPath();
                new (&start) HIDParserPath(pair.fast);
            }
        }
        before.clear();
        before.reserve(kSlots);
        for (int s = 0; s < kSlots; ++s) before.push_back(*table.getParserPath(s));
    });
    EXPECT_EQ(index, recorded.frames.size());
    EXPECT_EQ(differences, 0) << "first difference in " << firstDiff;
    // The sessions have enough of every case for the agreement to say something.
    EXPECT_GT(contacts, 1000);
    EXPECT_GT(hysteresisMoves, contacts / 10);
    EXPECT_GT(strongDampings, 10);
    EXPECT_GT(newContacts, 10);
    EXPECT_GT(matchesTable, contacts - contacts / 100);
}

// ---- Random paths and contacts ----

float specialFloat(std::mt19937& rng) {
    static const std::array<float, 16> specials = {
        0.0f,
        -0.0f,
        std::numeric_limits<float>::quiet_NaN(),
        -std::numeric_limits<float>::quiet_NaN(),
        std::numeric_limits<float>::infinity(),
        -std::numeric_limits<float>::infinity(),
        std::numeric_limits<float>::denorm_min(),
        -std::numeric_limits<float>::denorm_min(),
        std::numeric_limits<float>::max(),
        1.0f,
        0.05f,
        -0.05f,
        0.025f,
        10.0f,
        50.0f,
        1e-30f,
    };
    std::uniform_int_distribution<int> pick(0, 3);
    switch (pick(rng)) {
        case 0: return specials[std::uniform_int_distribution<size_t>(0, specials.size() - 1)(rng)];
        case 1: return std::uniform_real_distribution<float>(-0.2f, 0.2f)(rng);
        default: return std::uniform_real_distribution<float>(-120.0f, 120.0f)(rng);
    }
}

HIDPoint specialPoint(std::mt19937& rng) { return HIDPoint{specialFloat(rng), specialFloat(rng)}; }

double specialDouble(std::mt19937& rng) {
    std::uniform_int_distribution<int> pick(0, 7);
    switch (pick(rng)) {
        case 0: return std::numeric_limits<double>::quiet_NaN();
        case 1: return -0.0;
        case 2: return std::numeric_limits<double>::infinity();
        case 3: return 1e300;
        default: return static_cast<double>(specialFloat(rng));
    }
}

HIDContact randomContact(std::mt19937& rng) {
    HIDContact c{};
    c.fingerTipSwitch = std::uniform_int_distribution<int>(0, 3)(rng) == 3 ? 2 : std::uniform_int_distribution<int>(0, 1)(rng);
    c.fingerConfidence = std::uniform_int_distribution<int>(0, 1)(rng);
    c.path_id = std::uniform_int_distribution<int>(0, 15)(rng);
    c.finger_id = c.path_id + 1;
    c.velocity = specialPoint(rng);
    c.position = specialPoint(rng);
    const int time = std::uniform_int_distribution<int>(0, 5)(rng);
    c.device_timestamp = time == 0 ? 0.0 : time == 1 ? specialDouble(rng) : 1000.0 * time;
    return c;
}

HIDParserPath randomPath(std::mt19937& rng) {
    const float height = std::uniform_int_distribution<int>(0, 5)(rng) == 0 ? specialFloat(rng) : 80.0f;
    const float width = std::uniform_int_distribution<int>(0, 5)(rng) == 0 ? specialFloat(rng) : 120.0f;
    HIDParserPath p(height, width);
    p.setCurrentContact(randomContact(rng));
    p.setPreviousContact(randomContact(rng));
    p.setDampedSpeed(specialFloat(rng));
    p.setPeakDisplacement(specialFloat(rng));
    p.setInitialPosition(specialPoint(rng));
    p.setLongTermPosition(specialPoint(rng));
    p.setStablePositionForUI(specialPoint(rng));
    p.setPreviousStablePositionForUI(specialPoint(rng));
    p.setHysteresisCenter(specialPoint(rng));
    p.setPixelDelta(specialPoint(rng));
    p.setCumulativeDeltas(specialPoint(rng));
    p.setEngagedVelocity(specialPoint(rng));
    p.setDampedVelocity(specialPoint(rng));
    HIDPathTimestamps t{};
    t.t_makeTouch = specialDouble(rng);
    t.t_breakTouch = specialDouble(rng);
    p.setTimestamps(t);
    return p;
}

// A contact near the path's last one, or anywhere, with special values now and then.
HIDEventRef randomContactEvent(std::mt19937& rng, const HIDParserPath& path) {
    test::ContactFields c;
    c.index = std::uniform_int_distribution<int>(0, 7)(rng) == 0 ? std::uniform_int_distribution<int>(-1, 13)(rng)
                                                                  : path.currentContact().path_id - 1;
    const HIDPoint side = path.surfaceDimensions();
    const HIDPoint at = path.currentContact().position;
    const auto coordinate = [&](float position, float length, bool flip) {
        switch (std::uniform_int_distribution<int>(0, 5)(rng)) {
            case 0: return static_cast<double>(specialFloat(rng));
            case 1: return std::uniform_real_distribution<double>(0.0, 1.0)(rng);
            default: {
                // Within a few hysteresis radii of where the contact was.
                const double step = std::uniform_real_distribution<double>(-0.2, 0.2)(rng);
                const double unit = (static_cast<double>(position) + step) / static_cast<double>(length);
                return flip ? 1.0 - unit : unit;
            }
        }
    };
    c.x = coordinate(at.x, side.x, false);
    c.y = coordinate(at.y, side.y, true);
    const int touch = std::uniform_int_distribution<int>(0, 9)(rng);
    c.touch = touch < 7 ? 1 : touch < 9 ? 0 : 2;
    c.range = c.touch;
    c.type = std::uniform_int_distribution<int>(0, 9)(rng) == 0 ? 3 : 1;
    return test::contactEvent(c, 0);
}

TEST(ParserPathForms, OneMarkAndKeptDampingWeightsAgreeWithTheStepByStepFormsOnRandomPaths) {
    std::mt19937 rng(20240611);
    int checked = 0;
    for (int round = 0; round < 4000; ++round) {
        const HIDParserPath start = randomPath(rng);
        const int slot = std::uniform_int_distribution<int>(-1, kSlots - 1)(rng);
        HIDPathTableMarks marks;
        marks.looseSlots = static_cast<uint32_t>(rng());
        marks.ownSlots = static_cast<uint32_t>(rng());
        marks.dirtySlots = static_cast<uint32_t>(rng());
        PathPair pair(start, slot < 0 ? 0 : slot, marks);
        if (slot < 0) {
            pair.literal.linkToTable(-1, nullptr);
            pair.fast.linkToTable(-1, nullptr);
        }
        ASSERT_EQ(pair.difference(), "");
        // A few frames, mostly one interval apart so the kept weights are used again.
        double time = pair.fast.currentContact().device_timestamp;
        if (!std::isfinite(time)) time = 0.0;
        for (int frame = 0; frame < 8; ++frame) {
            switch (std::uniform_int_distribution<int>(0, 9)(rng)) {
                case 0: time = specialDouble(rng); break;
                case 1: time += std::uniform_real_distribution<double>(0.0, 50000.0)(rng); break;
                case 2: break;
                default: time += 8333.0;
            }
            const bool strong = std::uniform_int_distribution<int>(0, 3)(rng) == 0;
            const int step = std::uniform_int_distribution<int>(0, 9)(rng);
            if (step == 0) {
                pair.damp(strong);
            } else if (step == 1) {
                pair.peak();
            } else if (step == 2) {
                pair.filter(strong);
            } else {
                const HIDEventRef contact = randomContactEvent(rng, pair.fast);
                pair.read(*contact, time);
                ASSERT_EQ(pair.difference(), "") << "reading, round " << round << " frame " << frame;
                pair.filter(strong);
            }
            ASSERT_EQ(pair.difference(), "") << "round " << round << " frame " << frame << " step " << step;
            ++checked;
        }
    }
    EXPECT_EQ(checked, 4000 * 8);
}

// engagedSpeed, worked out when read, is the length of the velocity the screen-UI filter last
// set, as working it out at once gave, through every way the speed and the velocity are set:
// a model keeps the speed as the plain form would.
TEST(ParserPathForms, EngagedSpeedWorkedOutWhenReadFollowsEverySet) {
    std::mt19937 rng(20261122);
    auto pick = [&rng](int low, int high) { return std::uniform_int_distribution<int>(low, high)(rng); };
    HIDParserPath path(50.0f, 100.0f);
    float model = 0.0f;
    int differences = 0;
    int filtered = 0;
    for (int step = 0; step < 20000; ++step) {
        switch (pick(0, 7)) {
            case 0: {
                const float speed = static_cast<float>(pick(0, 40)) / 4.0f;
                path.setEngagedSpeed(speed);
                model = speed;
                break;
            }
            case 1:
                // The speed stays as it was.
                path.setEngagedVelocity(HIDPoint{static_cast<float>(pick(-9, 9)), static_cast<float>(pick(-9, 9))});
                break;
            case 2:
                // The speed survives a clear.
                path.clear();
                break;
            case 3: {
                const HIDParserPath copy = path;
                if (!sameBits(copy.engagedSpeed(), model)) ++differences;
                break;
            }
            default: {
                HIDEventRef contact = HIDEvent::create(kHIDEventTypeDigitizer, 1);
                contact->setIntegerValue(pick(0, 1), kHIDEventFieldDigitizerIndex);
                contact->setIntegerValue(pick(0, 4) == 0 ? 0 : 1, kHIDEventFieldDigitizerTouch);
                contact->setDoubleValue(pick(1, 99) / 100.0, kHIDEventFieldDigitizerX);
                contact->setDoubleValue(pick(1, 99) / 100.0, kHIDEventFieldDigitizerY);
                path.updateCurPrevContactsWith(*contact, static_cast<double>(step) * 8000000.0);
                path.filterContactForScreenUI(pick(0, 1) == 1);
                const HIDPoint v = path.engagedVelocity();
                model = sqrtf(v.x * v.x + v.y * v.y);
                if (model > 0.0f) ++filtered;
                break;
            }
        }
        if (!sameBits(path.engagedSpeed(), model) && differences++ < 3) {
            ADD_FAILURE() << "step " << step << ": " << path.engagedSpeed() << " expected " << model;
        }
    }
    EXPECT_EQ(differences, 0);
    EXPECT_GT(filtered, 2000);
}

}  // namespace
}  // namespace orvane
