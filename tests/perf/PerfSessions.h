#pragma once
// The committed random sessions replayed through a parser, with a look at the parser after
// every frame: the ground on which a faster form of a rule is compared with the plain one.

#include <gtest/gtest.h>

#include <algorithm>
#include <filesystem>
#include <functional>
#include <string>
#include <vector>

#include "pipeline/HIDParser.h"
#include "tools/formats/FrameRecording.h"

namespace orvane::perf {

inline std::vector<std::string> randomSessions() {
    std::vector<std::string> paths;
    for (const auto& entry : std::filesystem::directory_iterator(ORVANE_PERF_RECORDINGS)) {
        const std::string name = entry.path().filename().string();
        if (name.rfind("random-", 0) == 0) paths.push_back(entry.path().string());
    }
    std::sort(paths.begin(), paths.end());
    return paths;
}

inline float surfaceSide(const formats::FrameRecording& recording, const char* key) {
    const PropertyValue* dimensions = nullptr;
    const auto it = recording.header.service.properties.find("SurfaceDimensions");
    if (it != recording.header.service.properties.end()) dimensions = &it->second;
    const PropertyValue* side = dimensions ? dimensions->find(key) : nullptr;
    // 16.16 fixed point, and the pipeline works in tenths of it.
    return side ? static_cast<float>(side->int32Value() / 65536.0 * 10.0) : 100.0f;
}

// Replays every random session, calling `afterFrame` with the parser and the frame (as the
// parser left it) after each contact frame. Returns the number of sessions replayed.
inline int replayRandomSessions(const std::function<void(HIDParser&, const HIDEventRef&)>& afterFrame) {
    const std::vector<std::string> sessions = randomSessions();
    EXPECT_GE(sessions.size(), 8u) << "recordings unpacked into " << ORVANE_PERF_RECORDINGS;
    for (const std::string& path : sessions) {
        formats::FrameRecording recording;
        std::string error;
        EXPECT_TRUE(formats::readFrameRecordingFile(path, &recording, &error)) << error;
        HIDParser parser([](const HIDEventRef&) {}, surfaceSide(recording, "Height"), surfaceSide(recording, "Width"));
        for (const formats::InputRecord& record : recording.records) {
            if (record.kind != formats::InputRecord::Kind::Event) continue;
            HIDEventRef frame = record.event->copy();
            parser.handleContactFrame(static_cast<double>(record.event->timestamp()), frame);
            afterFrame(parser, frame);
        }
    }
    return static_cast<int>(sessions.size());
}

}  // namespace orvane::perf
