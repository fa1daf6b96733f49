// The bundled demonstration (data/demo.gestures) through the loaded plug-in: each of its
// parts yields its gesture, in order.

#include <gtest/gtest.h>

#include <fstream>
#include <sstream>

#include "EndToEndSupport.h"

namespace orvane::e2e {
namespace {

using analysis::Episode;
using analysis::EpisodeKind;

std::string demoScript() {
    std::ifstream in(ORVANE_E2E_DEMO_SCRIPT);
    std::ostringstream text;
    text << in.rdbuf();
    return text.str();
}

std::string kinds(const std::vector<Episode>& episodes) {
    std::string out;
    for (const Episode& e : episodes) out += std::string(out.empty() ? "" : " ") + analysis::episodeKindName(e.kind);
    return out;
}

TEST(DemoEndToEnd, EachPartOfTheDemonstrationYieldsItsGesture) {
    const Replay r = replayScript(demoScript());
    ASSERT_TRUE(r.ok);
    const std::vector<Episode>& e = r.timeline.episodes;
    // The settings; then, part by part (two fingers touching together always first offer a
    // scroll that may begin, which the gesture that follows withdraws):
    //   1 pointer motion; 2 a one-finger tap; 3 the withdrawn scroll and a two-finger tap;
    //   4 a scroll; 5 the withdrawn scroll and a scale; 6 the withdrawn scroll and a
    //   rotation; 7 the secondary click turned off, then the thumb and the finger touching
    //   offer a scroll that the finger's pointer motion withdraws, and the click while it
    //   moves; 8 pointer motion beside a palm.
    ASSERT_EQ(kinds(e),
              "setting setting pointer tap scroll tap scroll scroll scale scroll rotation setting scroll pointer click "
              "pointer");

    EXPECT_TRUE(e[0].accepted);
    EXPECT_TRUE(e[1].accepted);

    // 1. The finger moves 1.125 mm right and 0.75 mm down a frame: one step of 0.635 on
    //    each axis in every frame the pointer moves.
    EXPECT_GT(e[2].x, 0.0);
    EXPECT_DOUBLE_EQ(e[2].x, e[2].y);
    EXPECT_EQ(e[2].start.input, e[2].inputs.front());

    // 2. and 3. The taps click: the first with the primary button, the two-finger tap with
    //    the secondary one, after withdrawing the scroll its two fingers offered.
    EXPECT_EQ(e[3].buttonMask, 1u);
    EXPECT_TRUE(e[3].finished);
    EXPECT_TRUE(e[4].cancelled);
    EXPECT_EQ(e[5].buttonMask, 2u);
    EXPECT_TRUE(e[5].finished);

    // 4. The fingers move 1 mm a frame for 24 frames. The first moving frame adds 0.95
    //    (the hysteresis centre trails by 0.05 mm) and each later one 1: more than 5 in the
    //    sixth, where the scroll begins; it changes in the other 18 and ends at the lift.
    //    Each of the 19 frames scrolls by trunc(1 / 0.635) x 0.635 x -2 = -1.27.
    const Episode& scroll = e[6];
    ASSERT_EQ(scroll.phases.size(), 4u);
    EXPECT_EQ(scroll.phases[0].phase, kMayBegin);
    EXPECT_EQ(scroll.phases[1].phase, kBegan);
    EXPECT_EQ(scroll.phases[2].phase, kChanged);
    EXPECT_EQ(scroll.phases[2].count, 18u);
    EXPECT_EQ(scroll.phases[3].phase, kEnded);
    EXPECT_NEAR(scroll.y, -19 * 1.27, 1e-4);
    EXPECT_EQ(scroll.x, 0.0);

    // 5. The pinch spreads the fingers: a positive scale, begun and ended.
    EXPECT_TRUE(e[7].cancelled);
    EXPECT_GT(e[8].z, 0.0);
    EXPECT_EQ(e[8].phases.front().phase, kBegan);
    EXPECT_EQ(e[8].phases.back().phase, kEnded);

    // 6. The rotation: the left finger moves toward the click, the right one away from it,
    //    a positive rotation term ((di.y - do.y) u.x with u.x > 0), begun and ended.
    EXPECT_TRUE(e[9].cancelled);
    EXPECT_GT(e[10].z, 0.0);
    EXPECT_EQ(e[10].phases.front().phase, kBegan);
    EXPECT_EQ(e[10].phases.back().phase, kEnded);

    // 7. The secondary click off; the finger moves the pointer to the right while the thumb
    //    rests, and the click is the primary one, pressed and released while it moves.
    EXPECT_FALSE(e[11].value.truth());
    EXPECT_TRUE(e[12].cancelled);
    const Episode& drag = e[13];
    const Episode& click = e[14];
    EXPECT_GT(drag.x, 0.0);
    EXPECT_EQ(click.buttonMask, 1u);
    EXPECT_TRUE(click.finished);
    EXPECT_GT(click.start.input, drag.start.input);
    EXPECT_LT(click.release.input, drag.end.input);

    // 8. The palm takes no part: the finger beside it moves the pointer to the right, and
    //    lifting the palm is no tap.
    EXPECT_GT(e[15].x, 0.0);
    EXPECT_EQ(r.timeline.counts.taps, 2u);
}

}  // namespace
}  // namespace orvane::e2e
