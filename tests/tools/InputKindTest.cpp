#include "tools/formats/InputKind.h"

#include <gtest/gtest.h>

namespace orvane::formats {
namespace {

TEST(InputKind, FrameRecordingStartsWithAJsonObject) {
    EXPECT_EQ(detectInputKind("{\"format\": \"orvane-frames\"}\n").kind, InputKind::FrameRecording);
    const InputKindResult r = detectInputKind("# comment\n\n  {\"format\": 1}\n");
    EXPECT_EQ(r.kind, InputKind::FrameRecording);
    EXPECT_EQ(r.line, 3u);
}

TEST(InputKind, EvemuRecordingsAreRecognised) {
    EXPECT_EQ(detectInputKind("# EVEMU 1.3\n# Kernel: 5.0\nN: SynPS/2\n").kind, InputKind::Evemu);
    EXPECT_EQ(detectInputKind("N: Touchpad\nI: 0011 0002 0007 01b1\n").kind, InputKind::Evemu);
    EXPECT_EQ(detectInputKind("E: 0.000001 0003 0035 1234\n").kind, InputKind::Evemu);
}

TEST(InputKind, AnythingElseIsUnknownAtItsFirstLine) {
    const InputKindResult r = detectInputKind("\nhello world\n");
    EXPECT_EQ(r.kind, InputKind::Unknown);
    EXPECT_EQ(r.line, 2u);
    EXPECT_EQ(detectInputKind("[1, 2]").kind, InputKind::Unknown);
}

TEST(InputKind, EmptyInputIsLeftToTheFrameReader) {
    EXPECT_EQ(detectInputKind("").kind, InputKind::FrameRecording);
}

}  // namespace
}  // namespace orvane::formats
