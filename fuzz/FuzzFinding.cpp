#include <cstdio>
#include <cstdlib>

#include "FuzzTargets.h"

namespace orvane::fuzz {

void fuzzFinding(const char* rule) {
    std::fprintf(stderr, "orvane fuzz: broken rule: %s\n", rule);
    std::abort();
}

}  // namespace orvane::fuzz
