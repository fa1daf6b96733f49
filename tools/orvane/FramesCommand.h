#pragma once
// `orvane frames INPUT --out FILE`: writes the frame recording the filter would be given
// for INPUT.

#include <string>

#include "tools/evemu/EvemuConversion.h"

namespace orvane::cli {

struct FramesOptions {
    std::string input;
    std::string out;
    evemu::EvemuOptions evemu;  // how to read an evemu recording
};

// The process exit status: 0 on success; 2, with one line on standard error, for an output
// that is one of the inputs or another output; 1 with one line for anything else.
int runFrames(const FramesOptions& options);

}  // namespace orvane::cli
