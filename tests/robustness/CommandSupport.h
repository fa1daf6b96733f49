#pragma once
// Running the orvane command from a test, in a scratch folder that is removed afterwards.

#include <string>
#include <vector>

#include "tests/support/OrvaneCommand.h"

namespace orvane::robust {

using testsupport::CommandResult;
using testsupport::kOrvaneCommand;
using testsupport::readFile;
using testsupport::ScratchFolder;
using testsupport::splitLines;

inline CommandResult runOrvane(const std::vector<std::string>& args, const std::string& standardInput = "") {
    return testsupport::runOrvane(args, {}, standardInput);
}

}  // namespace orvane::robust
