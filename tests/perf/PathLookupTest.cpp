// Finding a path by its ID without a search gives the answer the search gives: on every
// frame of the random sessions, and on tables whose contacts are changed from outside in
// every way the path allows.

#include <gtest/gtest.h>

#include <algorithm>
#include <filesystem>
#include <random>
#include <string>
#include <vector>

#include "paths/HIDPathStates.h"
#include "pipeline/HIDParser.h"
#include "PerfSessions.h"

namespace orvane {
namespace {

// IDs asked for: every slot's, 0, and some no contact carries.
constexpr int kLowestAskedID = -2;
constexpr int kHighestAskedID = 17;

// Counts the IDs whose two answers differ, and how many answers found a path.
struct Agreement {
    int differences = 0;
    int found = 0;
};

void compareForms(const HIDPathStateBasic& table, Agreement& agreement) {
    for (int id = kLowestAskedID; id <= kHighestAskedID; ++id) {
        HIDParserPath* direct = table.getParserPathforPathID(id);
        HIDParserPath* searched = table.findParserPathforPathIDBySearch(id);
        if (direct != searched) ++agreement.differences;
        if (searched) ++agreement.found;
    }
}

TEST(PathLookup, DirectLookupAgreesWithTheSearchOnEveryFrameOfTheRandomSessions) {
    Agreement agreement;
    int frames = 0;
    perf::replayRandomSessions([&](HIDParser& parser, const HIDEventRef&) {
        compareForms(*parser.pathStates(), agreement);
        ++frames;
    });
    EXPECT_EQ(agreement.differences, 0);
    // Fingers were found on most frames, so the agreement says something.
    EXPECT_GT(agreement.found, frames);
}

TEST(PathLookup, DirectLookupAgreesWithTheSearchWhenContactsAreChangedFromOutside) {
    std::mt19937 random(20240611);
    auto pick = [&random](int low, int high) { return std::uniform_int_distribution<int>(low, high)(random); };
    HIDPathStates table(500.0f, 1000.0f);
    Agreement agreement;
    int loose = 0;
    for (int step = 0; step < 20000; ++step) {
        HIDParserPath* path = table.getParserPath(pick(0, HIDPathStateBasic::kNumPaths - 1));
        // Mostly an ordinary ID or none, now and then any number.
        const int id = pick(0, 9) < 7 ? pick(0, 1) * pick(1, 14) : pick(-1, 16);
        switch (pick(0, 3)) {
        case 0: {
            HIDContact c = path->currentContact();
            c.path_id = id;
            path->setCurrentContact(c);
            break;
        }
        case 1: path->getCurrentContact().path_id = id; break;
        case 2: path->clear(); break;
        default: {
            HIDEventRef contact = HIDEvent::create(kHIDEventTypeDigitizer, 1);
            contact->setIntegerValue(id - 1, kHIDEventFieldDigitizerIndex);
            contact->setIntegerValue(1, kHIDEventFieldDigitizerTouch);
            path->updateCurPrevContactsWith(*contact, 1.0);
            break;
        }
        }
        for (int s = 1; s < HIDPathStateBasic::kNumPaths; ++s) {
            const int carried = table.getParserPath(s)->currentContact().path_id;
            if (carried != 0 && carried != s) ++loose;
        }
        compareForms(table, agreement);
    }
    EXPECT_EQ(agreement.differences, 0);
    EXPECT_GT(agreement.found, 20000);
    EXPECT_GT(loose, 1000);  // tables with contacts in others' slots were among them
}

}  // namespace
}  // namespace orvane
