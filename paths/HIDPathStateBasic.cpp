#include "HIDPathStateBasic.h"

#include <array>
#include <cmath>

#include "filter/FilterLogging.h"

namespace orvane {

namespace {

// Slots 1..14 carry contacts; contact indices above this are dropped.
constexpr int kFirstPathID = 1;
constexpr int kLastPathID = 14;
constexpr int32_t kHighestContactIndex = 13;
// Index −1 still addresses a slot (slot 0); anything lower is skipped.
constexpr int32_t kLowestContactIndex = -1;
// Scores of the bottom-most search start far below any position.
constexpr float kNoBottomScore_mm = -100000.0f;
// A second finger this close to the bottom-most one presses the diving button with it.
constexpr float kDivingPairMaxVerticalGap_mm = 19.0f;
constexpr float kDivingPairMaxHorizontalGap_mm = 30.0f;

}  // namespace

HIDPathStateBasic::HIDPathStateBasic(float height, float width) {
    paths_.reserve(kNumPaths);
    for (int i = 0; i < kNumPaths; ++i) {
        paths_.push_back(HIDParserPath::initWithHeight(height, width));
        slots_[static_cast<size_t>(i)] = paths_.back().get();
    }
    for (int slot = kFirstPathID; slot <= kLastPathID; ++slot) paths_[slot]->linkToTable(slot, &marks_);
}

HIDPathStateBasic::~HIDPathStateBasic() {
    // Paths handed out by paths() may outlive the table.
    for (int slot = kFirstPathID; slot <= kLastPathID; ++slot) paths_[slot]->linkToTable(-1, nullptr);
}

[[gnu::flatten]] bool HIDPathStateBasic::unpackContactFrame(const HIDEventRef& frame, double time) {
    marks_.diagnostics.takeCopy();
    updateFrameTimestamp(time);
    if (frame) {
        // Clearing paths leaves the frame as it is, so both steps see the same contact count.
        const int numContacts = getNumberOfContacts(frame);
        clearExistingPathLiftoffsAndMasks(numContacts);
        expandAndFilterPackedContacts(*frame, numContacts);
        // While no contact is loose, the diving-button count visits exactly the paths the
        // fastest finger's walk visits, in the same order, so one walk does both.
        if (marks_.looseSlots == 0) {
            countFingersOnDivingButton(true);
            return true;
        }
        countFingersOnDivingButton(false);
    }
    updateFastestFingerSpeed();
    return true;
}

void HIDPathStateBasic::clearExistingPathLiftoffsAndMasks(const HIDEventRef& frame) {
    if (frame) clearExistingPathLiftoffsAndMasks(getNumberOfContacts(frame));
}

void HIDPathStateBasic::clearExistingPathLiftoffsAndMasks(int numContacts) {
    const bool noContacts = numContacts == 0;
    // A path that is already clear stays as it is when cleared again, so only the others are
    // looked at; clearing one leaves the rest of the table's marks as they were.
    for (uint32_t bits = marks_.dirtySlots & ~1u; bits != 0; bits &= bits - 1) {
        HIDParserPath* path = slots_[static_cast<size_t>(std::countr_zero(bits))];
        if (noContacts || path->currentContact().fingerTipSwitch == 0) {
            // A lift-off stays visible for exactly one frame and is wiped here, on the next.
            path->clear();
        }
    }
}

void HIDPathStateBasic::clearExistingPathLiftoffsAndMasksOneByOne(const HIDEventRef& frame) {
    if (!frame) return;
    const bool noContacts = getNumberOfContacts(frame) == 0;
    for (int slot = kFirstPathID; slot <= kLastPathID; ++slot) {
        HIDParserPath* path = slots_[static_cast<size_t>(slot)];
        if (noContacts) {
            path->clear();
        } else if (path->currentContact().fingerTipSwitch == 0) {
            // A lift-off stays visible for exactly one frame and is wiped here, on the next.
            path->clear();
        }
    }
}

void HIDPathStateBasic::expandAndFilterPackedContacts(const HIDEventRef& frame) {
    numNewContacts_ = 0;
    if (frame) {
        expandAndFilterPackedContacts(*frame, getNumberOfContacts(frame));
        countFingersOnDivingButton();
    }
}

void HIDPathStateBasic::expandAndFilterPackedContacts(const HIDEvent& frame, int n) {
    numNewContacts_ = 0;
    const std::vector<HIDEventRef>& children = frame.children();
    for (int i = 0; i < n; ++i) {
        // Children are read by position, whatever their type.
        const HIDEvent& child = *children[static_cast<size_t>(i)];
        const int32_t index = static_cast<int32_t>(child.integerValueForField(kHIDEventFieldDigitizerIndex));
        if (index > kHighestContactIndex || index < kLowestContactIndex) continue;
        HIDParserPath* path = slots_[static_cast<size_t>(index + 1)];
        path->updateCurPrevContactsWith(child, currentTimestamp());
        if (path->isNewContact()) ++numNewContacts_;
        // Contacts read before the frame's first new contact get no strong damping and every one
        // from it on does: the result depends on child order, on purpose.
        path->filterContactForScreenUI(numNewContacts_ > 0);
    }
}

int HIDPathStateBasic::getNumberOfContacts(const HIDEventRef& frame) const {
    if (!frame) return 0;
    int count = 0;
    for (const HIDEventRef& child : frame->children()) count += child->conformsToEventType(kHIDEventTypeDigitizer) ? 1 : 0;
    return count;
}

HIDParserPath* HIDPathStateBasic::findParserPathforPathIDBySearch(int pathID) const {
    if (pathID == 0) return nullptr;
    for (int slot = kFirstPathID; slot <= kLastPathID; ++slot) {
        HIDParserPath* path = slots_[static_cast<size_t>(slot)];
        if (path->currentContact().path_id == pathID) return path;
    }
    return nullptr;
}

int HIDPathStateBasic::countFingersOnDivingButton() { return countFingersOnDivingButton(false); }

inline int HIDPathStateBasic::countFingersOnDivingButton(bool noteDamping) {
    static constexpr const char* kSignature = "-[HIDPathStateBasic countFingersOnDivingButton]";

    lastNumTouches_ = numTouches_;
    numNonEdgeTouches_ = 0;
    numTouches_ = 0;
    numPalms_ = 0;
    // The paths are gathered in the first walk and looked at again from the list: nothing
    // between the two looks changes a path.
    struct Found {
        const HIDParserPath* path;
        int id;
    };
    std::array<Found, kNumPaths> found;
    size_t numFound = 0;
    if (noteDamping) startNotingDamping();
    forEachPathByID([&](const HIDParserPath* path, int id) {
        found[numFound++] = Found{path, id};
        if (noteDamping) noteDampingOf(*path);
        const bool touchingFinger = path->isTouching() && path->isFingerOrRestingContact();
        if (touchingFinger && !path->isEdgeContact()) ++numNonEdgeTouches_;
        if (touchingFinger) ++numTouches_;
        if (path->isPalmContact()) ++numPalms_;
    });

    // The bottom-most path: the largest y less the downward excursion it has built up.
    float bestScore = kNoBottomScore_mm;
    float secondScore = kNoBottomScore_mm;
    int bestID = 0;
    int secondID = 0;
    const HIDParserPath* best = nullptr;
    const HIDParserPath* second = nullptr;
    for (size_t k = 0; k < numFound; ++k) {
        const HIDParserPath* path = found[k].path;
        const int id = found[k].id;
        // Asked first, so the edge test of every path runs only for the diagnostics.
        if (frameDiagnostics().verboseDebugEnabled()) {
            frameDiagnostics().logVerbose(
                "%s [parserPath isEdgeContact] %d _numNonEdgeTouches %d [parserPath isTouching] %d "
                "[parserPath isFingerOrRestingContact ] %d",
                kSignature, path->isEdgeContact(), numNonEdgeTouches_, path->isTouching(),
                path->isFingerOrRestingContact());
        }
        // An edge-only palm-type contact counts only while at most one non-edge finger touches.
        const bool takesPart = path->isTouching() && (path->isFingerOrRestingContact() ||
                                                      (path->isEdgeContact() && numNonEdgeTouches_ <= 1));
        if (!takesPart) continue;
        const float score = path->currentContact().position.y - path->peakDisplacement();
        frameDiagnostics().logVerbose(
            "%s in here bottom_most_pidx %d peakdisplacement %f ypos_plus %f bottom_most_y_mm%f", kSignature, bestID,
            path->peakDisplacement(), score, bestScore);
        if (score > bestScore) {
            secondScore = bestScore;
            secondID = bestID;
            second = best;
            bestScore = score;
            bestID = id;
            best = path;
        } else if (score > secondScore) {
            secondScore = score;
            secondID = id;
            second = path;
        }
    }
    bottomDivingPathIndex_ = bestID;

    numFingersOnDivingButton_ = 0;
    numEdgeTouchesOnDivingButton_ = 0;
    if (bottomDivingPathIndex_ != 0) {
        // The paths the walk found for these IDs, as looking them up again would find them.
        if (best && best->isContactOnDivingButton()) {
            numFingersOnDivingButton_ = 1;
            if (best->isEdgeContact()) numEdgeTouchesOnDivingButton_ = 1;
        }
        if (secondID == 0) second = nullptr;
        if (best && second && numFingersOnDivingButton_ >= 1) {
            const HIDPoint b = best->currentContact().position;
            const HIDPoint s = second->currentContact().position;
            // The second finger counts by closeness alone, never by its own half of the surface:
            // two fingers pressing the click together.
            if (fabsf(b.y - s.y) < kDivingPairMaxVerticalGap_mm && fabsf(b.x - s.x) < kDivingPairMaxHorizontalGap_mm) {
                ++numFingersOnDivingButton_;
                if (second->isEdgeContact()) ++numEdgeTouchesOnDivingButton_;
            }
        }
    }
    frameDiagnostics().logVerbose("%s _numFingersOnDivingButton %d _numEdgeTouchesOnDivingButton %d", kSignature,
                                  numFingersOnDivingButton_, numEdgeTouchesOnDivingButton_);
    return numFingersOnDivingButton_;
}

void HIDPathStateBasic::updateFastestFingerSpeed() {
    startNotingDamping();
    // By slot: a path whose contact carries another ID takes no part.
    forEachPathInOwnSlot([this](const HIDParserPath* path, int) { noteDampingOf(*path); });
}

inline void HIDPathStateBasic::startNotingDamping() {
    maxFingerSpeed_ = 0.0f;
    numKeptDamping_ = 0;
    fastestSpeedKept_ = true;
    fastestVelocityKept_ = true;
}

inline void HIDPathStateBasic::noteDampingOf(const HIDParserPath& path) {
    if (!path.isTouching()) return;
    keptDamping_[numKeptDamping_++] = Damping{path.dampedSpeed(), path.dampedVelocity()};

    const HIDPoint d = path.currentContact().velocity;
    const float squares = d.x * d.x + d.y * d.y;
    const double length = std::sqrt(static_cast<double>(squares));
    if (length > maxFingerSpeed_) maxFingerSpeed_ = static_cast<float>(length);
}

// Weighted means that favour the fastest finger, summed in the order the paths were found; the
// velocity components come out as magnitudes (the sign is squared away), on purpose.
float HIDPathStateBasic::dampedSpeedOfFastestFinger() const {
    if (!fastestSpeedKept_) return dampedSpeedOfFastestFinger_;
    float sumSpeed = 0.0f, sumSpeedSquared = 0.0f;
    for (size_t i = 0; i < numKeptDamping_; ++i) {
        const float s = keptDamping_[i].speed;
        sumSpeed += s;
        sumSpeedSquared += s * s;
    }
    return sumSpeed > 0 ? sumSpeedSquared / sumSpeed : 0.0f;
}

HIDPoint HIDPathStateBasic::dampedVelocityOfFastestFinger() const {
    if (!fastestVelocityKept_) return dampedVelocityOfFastestFinger_;
    float sumAbsX = 0.0f, sumXSquared = 0.0f;
    float sumAbsY = 0.0f, sumYSquared = 0.0f;
    for (size_t i = 0; i < numKeptDamping_; ++i) {
        const HIDPoint v = keptDamping_[i].velocity;
        sumAbsX += fabsf(v.x);
        sumXSquared += v.x * v.x;
        sumAbsY += fabsf(v.y);
        sumYSquared += v.y * v.y;
    }
    HIDPoint velocity{0.0f, 0.0f};
    if (sumAbsX > 0) velocity.x = sumXSquared / sumAbsX;
    if (sumAbsY > 0) velocity.y = sumYSquared / sumAbsY;
    return velocity;
}

void HIDPathStateBasic::updateFastestFingerSpeedLiteral() {
    fastestSpeedKept_ = false;
    fastestVelocityKept_ = false;
    dampedSpeedOfFastestFinger_ = 0.0f;
    dampedVelocityOfFastestFinger_ = HIDPoint{0.0f, 0.0f};
    maxFingerSpeed_ = 0.0f;

    float sumSpeed = 0.0f, sumSpeedSquared = 0.0f;
    float sumAbsX = 0.0f, sumXSquared = 0.0f;
    float sumAbsY = 0.0f, sumYSquared = 0.0f;
    // By slot: a path whose contact carries another ID takes no part.
    forEachPathInOwnSlot([&](const HIDParserPath* path, int) {
        if (!path->isTouching()) return;
        const float s = path->dampedSpeed();
        const HIDPoint v = path->dampedVelocity();
        sumSpeed += s;
        sumSpeedSquared += s * s;
        sumAbsX += fabsf(v.x);
        sumXSquared += v.x * v.x;
        sumAbsY += fabsf(v.y);
        sumYSquared += v.y * v.y;

        const HIDPoint d = path->currentContact().velocity;
        const float squares = d.x * d.x + d.y * d.y;
        const double length = std::sqrt(static_cast<double>(squares));
        if (length > maxFingerSpeed_) maxFingerSpeed_ = static_cast<float>(length);
    });
    // Weighted means that favour the fastest finger; the velocity components come out as
    // magnitudes (the sign is squared away), on purpose.
    if (sumSpeed > 0) dampedSpeedOfFastestFinger_ = sumSpeedSquared / sumSpeed;
    if (sumAbsX > 0) dampedVelocityOfFastestFinger_.x = sumXSquared / sumAbsX;
    if (sumAbsY > 0) dampedVelocityOfFastestFinger_.y = sumYSquared / sumAbsY;
}

bool HIDPathStateBasic::calculateCentroidOfPaths(HIDPoint* centroid) const {
    HIDPoint sum{0.0f, 0.0f};
    int count = 0;
    forEachPathInOwnSlot([&](const HIDParserPath* path, int) {
        if (!path->isFingerOrRestingContact() || !path->isTouching()) return;
        sum.x += path->stablePositionForUI().x;
        sum.y += path->stablePositionForUI().y;
        ++count;
    });
    if (count > 0 && centroid) {
        centroid->x = sum.x / static_cast<float>(count);
        centroid->y = sum.y / static_cast<float>(count);
    }
    return count > 0;
}

}  // namespace orvane
