// The gesture timeline: episodes built from what a replay saw, and the text for people.

#include <gtest/gtest.h>

#include <sstream>
#include <string>
#include <vector>

#include "tools/analysis/Timeline.h"

namespace orvane::analysis {
namespace {

constexpr uint64_t kStart = 1'000'000'000;  // the first frame, in ticks (nanoseconds)

uint64_t at(double ms) { return kStart + static_cast<uint64_t>(ms * 1'000'000.0); }

HIDEventRef hand(int64_t touch = 1) {
    HIDEventRef e = HIDEvent::create(kHIDEventTypeDigitizer, 0);
    e->setIntegerValue(touch, kHIDEventFieldDigitizerTouch);
    return e;
}

HIDEventRef pointer(std::vector<HIDEventRef> children, double x = 0.0, double y = 0.0) {
    HIDEventRef e = HIDEvent::pointerEvent(0, x, y, 0.0, 0, 0);
    for (const HIDEventRef& c : children) e->appendEvent(c);
    return e;
}

HIDEventRef scroll(uint16_t phase, double x = 0.0, double y = 0.0) {
    HIDEventRef e = HIDEvent::scrollEvent(0, x, y, 0.0, 0);
    e->setPhase(phase);
    return e;
}

HIDEventRef scale(uint16_t phase, double z) {
    HIDEventRef e = HIDEvent::createScaleEvent(0, 0.0, 0.0, z, 0);
    e->setPhase(phase);
    return e;
}

HIDEventRef rotation(uint16_t phase, double z) {
    HIDEventRef e = HIDEvent::createRotationEvent(0, 0.0, 0.0, z, 0);
    e->setPhase(phase);
    return e;
}

HIDEventRef button(uint32_t mask) { return HIDEvent::createButtonEvent(0, mask, 0); }

// A frame record whose returned event is `returned` (none when null).
void frame(TimelineBuilder& b, int64_t input, double ms, const HIDEventRef& returned) {
    b.addFrame(input, at(ms));
    b.addReturned(input, returned.get());
}

std::string text(const Timeline& t) {
    std::ostringstream out;
    writeTimeline(out, t);
    return out.str();
}

TEST(Timeline, NothingHappenedSaysSo) {
    TimelineBuilder b;
    frame(b, 0, 0, nullptr);
    const Timeline t = b.finish();
    EXPECT_TRUE(t.episodes.empty());
    EXPECT_EQ(t.counts.frames, 1u);
    EXPECT_EQ(t.counts.returnedNone, 1u);
    EXPECT_EQ(text(t), "Timeline (ms from the first frame, #N = input record N)\n  no gestures\nCounts: no gestures\n");
}

TEST(Timeline, PointerMotionIsSummedUntilTheHandLifts) {
    TimelineBuilder b;
    frame(b, 0, 0, pointer({hand()}));                   // touch-down, no motion
    frame(b, 1, 8, pointer({hand()}, 0.635, -1.27));     // the pointer begins
    frame(b, 2, 16, nullptr);                            // a still frame
    frame(b, 3, 24, pointer({hand()}, 0.635, 0.0));
    frame(b, 4, 32, pointer({hand(0)}));                 // the finger lifts
    frame(b, 5, 1000, pointer({hand()}, 1.27, 0.0));     // a new touch: a new episode
    const Timeline t = b.finish();
    ASSERT_EQ(t.episodes.size(), 2u);
    const Episode& p = t.episodes[0];
    EXPECT_EQ(p.kind, EpisodeKind::Pointer);
    EXPECT_EQ(p.start.input, 1);
    EXPECT_EQ(p.end.input, 3);
    EXPECT_DOUBLE_EQ(p.start.ms, 8.0);
    EXPECT_DOUBLE_EQ(p.end.ms, 24.0);
    EXPECT_EQ(p.inputs, (std::vector<int64_t>{1, 3}));
    EXPECT_EQ(p.events, 2u);
    EXPECT_DOUBLE_EQ(p.x, 1.27);   // 0.635 + 0.635
    EXPECT_DOUBLE_EQ(p.y, -1.27);
    EXPECT_EQ(describeEpisode(p), "moved x +1.27 y -1.27 (2 events)");
    EXPECT_EQ(t.episodes[1].start.input, 5);
    EXPECT_EQ(t.counts.pointer, 2u);
}

TEST(Timeline, AScrollCollectsItsPhasesAndMotion) {
    TimelineBuilder b;
    frame(b, 0, 0, pointer({hand(), scroll(0x80)}));
    frame(b, 1, 8, pointer({hand(), scroll(1, 0.0, -1.27)}));
    frame(b, 2, 16, pointer({hand(), scroll(2, 0.0, -1.27)}));
    frame(b, 3, 24, pointer({hand(), scroll(2, 1.27, -2.54)}));
    frame(b, 4, 32, pointer({hand(0), scroll(4)}));
    const Timeline t = b.finish();
    ASSERT_EQ(t.episodes.size(), 1u);
    const Episode& s = t.episodes[0];
    EXPECT_EQ(s.kind, EpisodeKind::Scroll);
    EXPECT_TRUE(s.finished);
    EXPECT_FALSE(s.cancelled);
    EXPECT_EQ(s.events, 5u);
    ASSERT_EQ(s.phases.size(), 4u);
    EXPECT_EQ(s.phases[0].phase, 0x80);
    EXPECT_EQ(s.phases[1].phase, 1);
    EXPECT_EQ(s.phases[2].phase, 2);
    EXPECT_EQ(s.phases[2].count, 2u);
    EXPECT_EQ(s.phases[3].phase, 4);
    EXPECT_DOUBLE_EQ(s.x, 1.27);
    EXPECT_DOUBLE_EQ(s.y, -5.08);  // -1.27 - 1.27 - 2.54
    EXPECT_EQ(describeEpisode(s), "may-begin, began, 2 changed, ended | x +1.27 y -5.08");
    EXPECT_EQ(t.counts.scroll, 1u);
    EXPECT_EQ(t.counts.scrollCancelled, 0u);
}

TEST(Timeline, AWithdrawnMayBeginIsACancelledScroll) {
    TimelineBuilder b;
    frame(b, 0, 0, pointer({hand(), scroll(0x80)}));
    frame(b, 1, 300, pointer({scroll(8), hand(0)}));
    const Timeline t = b.finish();
    ASSERT_EQ(t.episodes.size(), 1u);
    EXPECT_TRUE(t.episodes[0].cancelled);
    EXPECT_EQ(describeEpisode(t.episodes[0]), "may-begin, cancelled (withdrawn)");
    EXPECT_EQ(t.counts.scrollCancelled, 1u);
    EXPECT_EQ(describeCounts(t.counts), "1 scroll (1 withdrawn)");
}

TEST(Timeline, APointerThatWithdrawsAMayBeginGoesOn) {
    TimelineBuilder b;
    frame(b, 0, 0, pointer({hand(), scroll(0x80)}));
    frame(b, 1, 48, pointer({hand(), scroll(8)}, 0.635, 0.0));  // pointer began, cancel beside it
    frame(b, 2, 56, pointer({hand()}, 0.635, 0.0));
    const Timeline t = b.finish();
    ASSERT_EQ(t.episodes.size(), 2u);
    EXPECT_EQ(t.episodes[0].kind, EpisodeKind::Scroll);
    EXPECT_EQ(t.episodes[1].kind, EpisodeKind::Pointer);
    EXPECT_EQ(t.episodes[1].events, 2u);
}

TEST(Timeline, AScrollEndsThePointerEpisode) {
    TimelineBuilder b;
    frame(b, 0, 0, pointer({hand()}, 0.635, 0.0));
    frame(b, 1, 8, pointer({hand(), scroll(1, 0.0, -1.27)}));
    frame(b, 2, 16, pointer({hand()}, 0.635, 0.0));
    const Timeline t = b.finish();
    ASSERT_EQ(t.episodes.size(), 3u);
    EXPECT_EQ(t.episodes[0].kind, EpisodeKind::Pointer);
    EXPECT_EQ(t.episodes[1].kind, EpisodeKind::Scroll);
    EXPECT_FALSE(t.episodes[1].finished);
    EXPECT_EQ(describeEpisode(t.episodes[1]), "began, not ended | x +0.00 y -1.27");
    EXPECT_EQ(t.episodes[2].kind, EpisodeKind::Pointer);
}

TEST(Timeline, ScaleAndRotationSumTheirZ) {
    TimelineBuilder b;
    frame(b, 0, 0, pointer({scroll(8), hand(), scale(1, 0.0125)}));
    frame(b, 1, 8, pointer({hand(), scale(2, 0.0125)}));
    frame(b, 2, 16, pointer({hand(), rotation(1, -0.01)}));   // a scale may turn into a rotation
    frame(b, 3, 24, pointer({hand(0), scale(4, 0.0), rotation(4, 0.0)}));
    const Timeline t = b.finish();
    ASSERT_EQ(t.episodes.size(), 3u);  // the cancel, the scale, the rotation
    const Episode& sc = t.episodes[1];
    EXPECT_EQ(sc.kind, EpisodeKind::Scale);
    EXPECT_DOUBLE_EQ(sc.z, 0.025);
    EXPECT_EQ(sc.end.input, 3);
    EXPECT_EQ(describeEpisode(sc), "began, changed, ended | z +0.0250");
    const Episode& ro = t.episodes[2];
    EXPECT_EQ(ro.kind, EpisodeKind::Rotation);
    EXPECT_EQ(ro.start.input, 2);
    EXPECT_EQ(describeEpisode(ro), "began, ended | z -0.0100");
    EXPECT_EQ(t.counts.scale, 1u);
    EXPECT_EQ(t.counts.rotation, 1u);
}

TEST(Timeline, AClickLastsFromItsPressToItsRelease) {
    TimelineBuilder b;
    frame(b, 0, 0, pointer({hand()}));
    frame(b, 1, 8, pointer({button(2), hand()}));
    frame(b, 2, 16, nullptr);
    frame(b, 3, 168, pointer({button(0), hand()}));
    frame(b, 4, 500, pointer({button(1), hand()}));
    const Timeline t = b.finish();
    ASSERT_EQ(t.episodes.size(), 2u);
    const Episode& secondary = t.episodes[0];
    EXPECT_EQ(secondary.kind, EpisodeKind::Button);
    EXPECT_EQ(secondary.buttonMask, 2u);
    EXPECT_TRUE(secondary.finished);
    EXPECT_EQ(secondary.release.input, 3);
    EXPECT_EQ(secondary.end.input, 3);
    EXPECT_EQ(describeEpisode(secondary), "mask 0x2 (secondary) pressed, released after 160.0 ms");
    EXPECT_EQ(describeEpisode(t.episodes[1]), "mask 0x1 pressed, not released");
    EXPECT_EQ(t.counts.clicks, 2u);
    EXPECT_EQ(t.counts.secondaryClicks, 1u);
}

TEST(Timeline, ATapIsADispatchedPressAndAReturnedRelease) {
    TimelineBuilder b;
    b.addFrame(0, at(0));
    b.addReturned(0, pointer({hand()}).get());
    b.addFrame(1, at(88));
    b.addDispatched(1, *pointer({hand(0), button(1)}));
    b.addReturned(1, pointer({hand(0), button(0)}).get());
    b.addFrame(2, at(1000));
    b.addDispatched(2, *pointer({scroll(8), hand(0), button(2)}));
    b.addReturned(2, pointer({hand(0), button(0)}).get());
    const Timeline t = b.finish();
    ASSERT_EQ(t.episodes.size(), 3u);
    EXPECT_EQ(t.episodes[0].kind, EpisodeKind::Tap);
    EXPECT_EQ(t.episodes[0].buttonMask, 1u);
    EXPECT_TRUE(t.episodes[0].finished);
    EXPECT_EQ(t.episodes[0].events, 2u);
    EXPECT_EQ(describeEpisode(t.episodes[0]), "one finger: press 0x1 dispatched, release returned");
    EXPECT_EQ(t.episodes[1].kind, EpisodeKind::Scroll);  // the withdrawn may-begin that went with the press
    EXPECT_TRUE(t.episodes[1].cancelled);
    EXPECT_EQ(describeEpisode(t.episodes[2]), "two fingers: press 0x2 dispatched, release returned");
    EXPECT_EQ(t.counts.taps, 2u);
    EXPECT_EQ(t.counts.twoFingerTaps, 1u);
    EXPECT_EQ(t.counts.clicks, 0u);  // the tap's release is not a click
    EXPECT_EQ(t.counts.dispatched, 2u);
}

TEST(Timeline, SettingsTakeTheTimeOfTheNextFrame) {
    TimelineBuilder b;
    b.addOtherRecord(0);
    b.addSetting(1, "TapToClickEnabled", PropertyValue(true), true);
    frame(b, 2, 0, nullptr);
    frame(b, 3, 8, nullptr);
    b.addSetting(4, "TwoFingersSecondaryClickEnabled", PropertyValue(1), false);
    frame(b, 5, 400, nullptr);
    const Timeline t = b.finish();
    ASSERT_EQ(t.episodes.size(), 2u);
    EXPECT_EQ(t.episodes[0].kind, EpisodeKind::Setting);
    EXPECT_TRUE(t.episodes[0].start.hasTime);
    EXPECT_DOUBLE_EQ(t.episodes[0].start.ms, 0.0);
    EXPECT_DOUBLE_EQ(t.episodes[1].start.ms, 400.0);
    EXPECT_EQ(describeEpisode(t.episodes[0]), "TapToClickEnabled = true (accepted)");
    EXPECT_EQ(describeEpisode(t.episodes[1]), "TwoFingersSecondaryClickEnabled = 1 (refused)");
    EXPECT_EQ(t.counts.inputs, 6u);
    EXPECT_EQ(t.counts.settings, 2u);
    EXPECT_EQ(t.counts.frames, 3u);  // inputs 2, 3 and 5
}

TEST(Timeline, TimesGoThroughTheTimebase) {
    // 125/3 ns a tick: 24,000 ticks are 1 ms.
    TimelineBuilder b(TimebaseInfo{125, 3});
    b.addFrame(0, 1'000'000);
    b.addFrame(1, 1'000'000 + 24'000 * 10);
    b.addReturned(1, pointer({hand()}, 0.635, 0.0).get());
    const Timeline t = b.finish();
    ASSERT_EQ(t.episodes.size(), 1u);
    EXPECT_DOUBLE_EQ(t.episodes[0].start.ms, 10.0);
}

TEST(Timeline, TheTextLinesEveryColumnUp) {
    TimelineBuilder b(TimebaseInfo{1, 1}, "s.gestures");
    b.addSetting(0, "TapToClickEnabled", PropertyValue(true), true);
    frame(b, 1, 0, pointer({hand(), scroll(0x80)}));
    for (int i = 2; i <= 10; ++i) frame(b, i, 8.0 * (i - 1), pointer({hand(), scroll(i == 2 ? 1 : 2, 0.0, -1.27)}));
    frame(b, 11, 1200, pointer({hand(0), scroll(4)}));
    b.addFrame(12, at(1500));
    b.addDispatched(12, *pointer({hand(0), button(1)}));
    b.addReturned(12, pointer({hand(0), button(0)}).get());
    const Timeline t = b.finish();
    EXPECT_EQ(text(t),
              "Timeline of s.gestures (ms from the first frame, #N = input record N)\n"
              "  time             inputs     gesture  what\n"
              "     0.0           #0         setting  TapToClickEnabled = true (accepted)\n"
              "     0.0 - 1200.0  #1  - #11  scroll   may-begin, began, 8 changed, ended | x +0.00 y -11.43\n"
              "  1500.0           #12        tap      one finger: press 0x1 dispatched, release returned\n"
              "Counts: 1 scroll, 1 tap, 1 setting\n");
}

TEST(Timeline, PhaseNames) {
    EXPECT_EQ(phaseName(0), "none");
    EXPECT_EQ(phaseName(1), "began");
    EXPECT_EQ(phaseName(2), "changed");
    EXPECT_EQ(phaseName(4), "ended");
    EXPECT_EQ(phaseName(8), "cancelled");
    EXPECT_EQ(phaseName(0x80), "may-begin");
    EXPECT_EQ(phaseName(0x30), "0x30");
}

}  // namespace
}  // namespace orvane::analysis
