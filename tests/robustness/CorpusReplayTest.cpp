// Every file of the fuzz targets' seed corpora (fuzz/corpus/TARGET/) goes through the
// target's entry function, built here with the project's compiler and sanitizers. An entry
// function aborts on a broken rule, so a corpus file that brings back a fixed finding fails
// the run. New corpus files replay without being listed here.

#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <ostream>
#include <string>
#include <vector>

#include "fuzz/FuzzTargets.h"

namespace orvane::fuzz {
namespace {

namespace fs = std::filesystem;

using Entry = int (*)(const uint8_t*, size_t);

struct Target {
    const char* name;
    Entry entry;
};

const Target kTargets[] = {
    {"event_json", fuzzEventJson},
    {"frame_recording", fuzzFrameRecording},
    {"filter_frames", fuzzFilterFrames},
    {"evemu", fuzzEvemu},
    {"gesture_script", fuzzGestureScript},
};

std::vector<std::string> corpusFiles(const std::string& target) {
    std::vector<std::string> files;
    const fs::path folder = fs::path(ORVANE_FUZZ_CORPUS_DIRECTORY) / target;
    std::error_code ec;
    for (const auto& entry : fs::directory_iterator(folder, ec))
        if (entry.is_regular_file()) files.push_back(entry.path().string());
    std::sort(files.begin(), files.end());
    return files;
}

std::vector<uint8_t> readBytes(const std::string& path) {
    std::ifstream in(path, std::ios::binary);
    return std::vector<uint8_t>(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
}

void PrintTo(const Target& t, std::ostream* os) { *os << t.name; }

class CorpusReplay : public testing::TestWithParam<Target> {};

TEST_P(CorpusReplay, EverySeedRunsThroughTheTarget) {
    const Target target = GetParam();
    const std::vector<std::string> files = corpusFiles(target.name);
    // A target without seeds is a mistake in the tree, not a pass.
    ASSERT_GE(files.size(), 3u) << "seed corpus of " << target.name;
    for (const std::string& file : files) {
        SCOPED_TRACE(file);
        const std::vector<uint8_t> bytes = readBytes(file);
        EXPECT_EQ(target.entry(bytes.data(), bytes.size()), 0);
    }
}

// Inputs no file holds: nothing at all, and each single byte value.
TEST_P(CorpusReplay, EmptyAndOneByteInputsRunThroughTheTarget) {
    const Target target = GetParam();
    EXPECT_EQ(target.entry(nullptr, 0), 0);
    for (int b = 0; b < 256; ++b) {
        const uint8_t byte = static_cast<uint8_t>(b);
        EXPECT_EQ(target.entry(&byte, 1), 0) << "byte " << b;
    }
}

INSTANTIATE_TEST_SUITE_P(Targets, CorpusReplay, testing::ValuesIn(kTargets),
                         [](const testing::TestParamInfo<Target>& info) { return std::string(info.param.name); });

}  // namespace
}  // namespace orvane::fuzz
