#pragma once
// Helpers the tools' tests share: the plug-ins and recordings they use, a scratch folder,
// files, running the orvane command and capturing log lines.

#include <gtest/gtest.h>
#include <memory>
#include <string>
#include <vector>

#include "platform/Logging.h"
#include "tests/support/OrvaneCommand.h"

namespace orvane::tooltest {

inline constexpr const char* kFakePlugInDirectory = ORVANE_TEST_FAKE_PLUGIN_DIRECTORY;
inline constexpr const char* kFakePlugInModule = ORVANE_TEST_FAKE_PLUGIN_MODULE;
inline constexpr const char* kRealPlugInDirectory = ORVANE_TEST_REAL_PLUGIN_DIRECTORY;
using testsupport::kOrvaneCommand;
inline constexpr const char* kDemoRecording = ORVANE_TEST_DEMO_RECORDING;

using testsupport::CommandResult;
using testsupport::fileExists;
using testsupport::readFile;
using testsupport::runOrvane;
using testsupport::ScratchFolder;
using testsupport::shellQuote;
inline std::vector<std::string> lines(const std::string& text) { return testsupport::splitLines(text); }

// Sends every log line to a capture for the length of a test, then back to standard error.
class CapturedLog {
public:
    CapturedLog() : sink_(std::make_shared<CaptureLogSink>()) { Logging::setSink(sink_); }
    ~CapturedLog() { Logging::setSink(std::make_shared<StandardErrorLogSink>()); }
    std::vector<std::string> messages(const std::string& category) const {
        std::vector<std::string> out;
        for (const auto& e : sink_->entries())
            if (e.category == category) out.push_back(e.message);
        return out;
    }
    CaptureLogSink& sink() { return *sink_; }

private:
    std::shared_ptr<CaptureLogSink> sink_;
};

}  // namespace orvane::tooltest
