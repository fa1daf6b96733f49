// The main of every test program. ORVANE_TEST_TIMEBASE="numer/denom" sets the platform
// timebase before anything reads it, so one program runs under several timebases.

#include <gtest/gtest.h>

#include <cstdio>
#include <cstdlib>

#include "platform/Timebase.h"

int main(int argc, char** argv) {
    if (const char* tb = std::getenv("ORVANE_TEST_TIMEBASE")) {
        unsigned numer = 0, denom = 0;
        if (std::sscanf(tb, "%u/%u", &numer, &denom) != 2 || !orvane::Timebase::set(numer, denom)) {
            std::fprintf(stderr, "ORVANE_TEST_TIMEBASE: expected numer/denom, got %s\n", tb);
            return 2;
        }
    }
    testing::InitGoogleTest(&argc, argv);
    return RUN_ALL_TESTS();
}
