// The HTML page of a replay: what it is made of, and what a person sees when it is opened
// in a real browser (headless Chromium): the finger paths, the timeline entries, a page
// script that ran without an error and nothing printed to the console. The pages and their
// screenshots are kept under the build folder (test-artefacts/) to be looked at.

#include <gtest/gtest.h>

#include <sstream>
#include <string>
#include <vector>

#include "ToolTestSupport.h"
#include "tools/analysis/Timeline.h"
#include "tools/html/ReplayPage.h"

namespace orvane::tooltest {
namespace {

const std::string kRecordings = ORVANE_TEST_EVEMU_RECORDINGS;
const std::string kArtefacts = ORVANE_TEST_ARTEFACTS;

size_t count(const std::string& text, const std::string& what) {
    size_t n = 0;
    for (size_t at = text.find(what); at != std::string::npos; at = text.find(what, at + what.size())) ++n;
    return n;
}

HIDEventRef frame(uint64_t ms, std::vector<std::tuple<int, double, double, int>> contacts, int click = 0) {
    HIDEventRef f = HIDEvent::create(kHIDEventTypeDigitizer, ms * 1000000);
    f->setIntegerValue(click, kHIDEventFieldDigitizerButtonMask);
    for (const auto& [index, x, y, touch] : contacts) {
        HIDEventRef c = HIDEvent::create(kHIDEventTypeDigitizer, ms * 1000000);
        c->setDoubleValue(x, kHIDEventFieldDigitizerX);
        c->setDoubleValue(y, kHIDEventFieldDigitizerY);
        c->setIntegerValue(index, kHIDEventFieldDigitizerIndex);
        c->setIntegerValue(touch, kHIDEventFieldDigitizerTouch);
        c->setIntegerValue(1, kHIDEventFieldDigitizerType);
        f->appendEvent(c);
    }
    return f;
}

PropertyDictionary surface(int64_t width, int64_t height) {
    PropertyDictionary size;
    size["Width"] = PropertyValue(width);
    size["Height"] = PropertyValue(height);
    PropertyDictionary properties;
    properties["SurfaceDimensions"] = PropertyValue(size);
    properties["Product"] = PropertyValue("Pad <&> \"one\"");
    return properties;
}

std::string pageOf(html::ReplayPage& page, const analysis::TimelineBuilder& timeline) {
    std::ostringstream out;
    page.write(out, timeline.finish());
    return out.str();
}

TEST(HtmlReplayPage, EscapesTextForHtml) {
    EXPECT_EQ(html::escapeHtml("a<b>&\"c'"), "a&lt;b&gt;&amp;&quot;c&#39;");
    EXPECT_EQ(html::escapeHtml(""), "");
}

TEST(HtmlReplayPage, DrawsOnePathPerTouchInTheFiltersOrientation) {
    // 100 x 50 mm (10 and 5 cm in 16.16 fixed point).
    html::ReplayPage page("dir/pad <1>.evemu", surface(655360, 327680), TimebaseInfo{1, 1});
    analysis::TimelineBuilder timeline;
    // Contact 0 touches, lifts, and touches again: two touches. Contact 1 touches once and
    // is simply no longer reported.
    const std::vector<HIDEventRef> frames = {
        frame(1000, {{0, 0.25, 0.8, 1}}),                    // y 0.8 flips to 1 - 0.8 = 0.2 of 50 mm
        frame(1010, {{0, 0.5, 0.8, 1}, {1, 0.75, 0.2, 1}}),  // contact 1 at y 0.8 of the height
        frame(1020, {{0, 0.5, 0.8, 0}, {1, 0.75, 0.2, 1}}),  // contact 0 lifts
        frame(1030, {{1, 0.75, 0.1, 1}}),
        frame(1040, {{0, 0.1, 0.5, 1}}),                     // contact 0 again
    };
    for (size_t i = 0; i < frames.size(); ++i) {
        timeline.addFrame(int64_t(i), frames[i]->timestamp());
        page.addFrame(int64_t(i), *frames[i]);
    }
    const std::string html = pageOf(page, timeline);
    EXPECT_EQ(count(html, "class=\"finger-path\""), 3u);
    EXPECT_EQ(count(html, "class=\"touch-down\""), 3u);
    EXPECT_EQ(count(html, "class=\"lift\""), 1u);  // only contact 0's first touch reported a lift
    EXPECT_EQ(count(html, "class=\"mark\""), 7u);  // every touching or lifting point
    // The surface is drawn 640 px wide, so 6.4 px a millimetre: (0.25 * 100, 0.2 * 50) mm
    // is (160, 64) px and the second point (320, 64).
    EXPECT_NE(html.find("points=\"160.0,64.0 320.0,64.0 320.0,64.0\""), std::string::npos);
    // Contact 1: (0.75 * 100, 0.8 * 50) = (480, 256), then y 0.9 * 50 * 6.4 = 288 px.
    EXPECT_NE(html.find("points=\"480.0,256.0 480.0,256.0 480.0,288.0\""), std::string::npos);
    // The zones: thumb rest from 0.45 * 320 = 144 px down, click half from 160 px.
    EXPECT_NE(html.find("class=\"zone-thumb\" x=\"0\" y=\"144.0\" width=\"640.0\" height=\"176.0\""),
              std::string::npos);
    EXPECT_NE(html.find("class=\"zone-click\" x=\"0\" y=\"160.0\" width=\"640.0\" height=\"160.0\""),
              std::string::npos);
    // Names are escaped; the title uses the file name, the size is shown in millimetres.
    EXPECT_NE(html.find("<title>Orvane replay of pad &lt;1&gt;.evemu</title>"), std::string::npos);
    EXPECT_NE(html.find("Pad &lt;&amp;&gt; &quot;one&quot;"), std::string::npos);
    EXPECT_NE(html.find("100.0 &times; 50.0 mm"), std::string::npos);
    EXPECT_EQ(html.find("<1>"), std::string::npos);
    // A mark carries its frame's details: frame #1 at 10 ms, both contacts in mm.
    EXPECT_NE(html.find("frame #1 at 10.0 ms\n  contact 0 at (50.0, 10.0) mm\n  contact 1 at (75.0, 40.0) mm\n"
                        "left the filter: no gesture"),
              std::string::npos);
}

TEST(HtmlReplayPage, IsSelfContained) {
    html::ReplayPage page("pad", {}, TimebaseInfo{1, 1});
    analysis::TimelineBuilder timeline;
    const std::string html = pageOf(page, timeline);
    EXPECT_NE(html.find("surface size unknown"), std::string::npos);
    for (const char* outside : {"http:", "https:", "src=", "<link", "@import", "url(http", "//cdn"})
        EXPECT_EQ(html.find(outside), std::string::npos) << outside;
    EXPECT_EQ(html.rfind("<!DOCTYPE html>", 0), 0u);
    EXPECT_NE(html.find("</html>\n"), std::string::npos);
}

TEST(HtmlReplayPage, LongRecordingsMarkEveryNthPoint) {
    html::ReplayPage page("long", surface(655360, 327680), TimebaseInfo{1, 1});
    analysis::TimelineBuilder timeline;
    // 10000 touching points: more than the 4000 marks kept, so every 3rd is marked
    // (ceil(10000 / 4000) = 3): points 0, 3, ..., 9999, that is 3334 marks.
    for (int i = 0; i < 10000; ++i) {
        const HIDEventRef f = frame(uint64_t(i), {{0, 0.5, 0.5, 1}});
        timeline.addFrame(i, f->timestamp());
        page.addFrame(i, *f);
    }
    const std::string html = pageOf(page, timeline);
    EXPECT_EQ(count(html, "class=\"mark\""), 3334u);
    EXPECT_EQ(count(html, "class=\"finger-path\""), 1u);
}

// Chromium, run as the tests need it: headless, nothing fetched, a new empty profile.
struct Browser {
    CommandResult run(const std::vector<std::string>& extra, const std::string& page) {
        ScratchFolder profile;
        std::vector<std::string> args = {"--headless",
                                         "--no-sandbox",
                                         "--disable-gpu",
                                         "--disable-quic",
                                         "--no-first-run",
                                         "--disable-background-networking",
                                         "--disable-component-update",
                                         "--disable-sync",
                                         "--user-data-dir=" + profile.path(),
                                         "--enable-logging=stderr",
                                         "--v=0"};
        args.insert(args.end(), extra.begin(), extra.end());
        args.push_back("file://" + page);
        std::string command = "timeout 120 chromium";
        for (const auto& a : args) command += " " + shellQuote(a);
        ScratchFolder out;
        command += " >" + shellQuote(out.file("stdout")) + " 2>" + shellQuote(out.file("stderr"));
        const int status = std::system(command.c_str());
        CommandResult r;
        if (status != -1 && WIFEXITED(status)) r.exitCode = WEXITSTATUS(status);
        r.out = readFile(out.file("stdout"));
        r.err = readFile(out.file("stderr"));
        return r;
    }
};

// The page's console messages, as Chromium logs them to standard error.
std::vector<std::string> consoleLines(const std::string& log) {
    std::vector<std::string> out;
    for (const std::string& line : lines(log))
        if (line.find(":CONSOLE") != std::string::npos) out.push_back(line);
    return out;
}

std::string replayToPage(const std::string& name, const std::vector<std::string>& options) {
    EXPECT_EQ(std::system(("mkdir -p " + shellQuote(kArtefacts)).c_str()), 0);
    const std::string page = kArtefacts + "/" + name + ".html";
    std::vector<std::string> args = {"replay", kRecordings + "/" + name, "--keyboard-cover", "--html", page};
    args.insert(args.end(), options.begin(), options.end());
    const CommandResult r = runOrvane(args);
    EXPECT_EQ(r.exitCode, 0) << r.err;
    EXPECT_TRUE(fileExists(page));
    return page;
}

TEST(HtmlReplayPageInBrowser, TwoFingerScrollShowsBothPathsAndTheScrollPhases) {
    const std::string page =
        replayToPage("synaptics.two-finger-scroll-vertical.events", {"--size", "100x76"});
    Browser browser;
    const CommandResult dom = browser.run({"--dump-dom"}, page);
    ASSERT_EQ(dom.exitCode, 0) << dom.err;
    EXPECT_EQ(consoleLines(dom.err), std::vector<std::string>{});
    // The page's own script ran to its end, and no error reached the page.
    EXPECT_NE(dom.out.find("id=\"page-status\" data-ready=\"1\""), std::string::npos) << dom.out.substr(0, 400);
    EXPECT_EQ(dom.out.find("data-errors=\""), std::string::npos);
    // Two fingers scroll together: two paths, one scroll episode in the timeline and in the
    // table, with one may-begin, one began and one ended mark (its changed marks between).
    EXPECT_NE(dom.out.find("ready: 2 finger paths, 1 timeline entries"), std::string::npos);
    EXPECT_EQ(count(dom.out, "class=\"finger-path\""), 2u);
    EXPECT_EQ(count(dom.out, "class=\"episode k-scroll\""), 1u);
    EXPECT_EQ(count(dom.out, "class=\"phase p-may-begin\""), 1u);
    EXPECT_EQ(count(dom.out, "class=\"phase p-began\""), 1u);
    EXPECT_EQ(count(dom.out, "class=\"phase p-ended\""), 1u);
    EXPECT_GE(count(dom.out, "class=\"phase p-changed\""), 1u);
    EXPECT_NE(dom.out.find("<td>scroll</td>"), std::string::npos);
    EXPECT_NE(dom.out.find("may-begin, began, "), std::string::npos);

    // A screenshot to look at, kept with the page.
    const std::string png = kArtefacts + "/synaptics.two-finger-scroll-vertical.png";
    std::remove(png.c_str());
    const CommandResult shot = browser.run({"--window-size=1200,1500", "--screenshot=" + png}, page);
    ASSERT_EQ(shot.exitCode, 0) << shot.err;
    EXPECT_EQ(consoleLines(shot.err), std::vector<std::string>{});
    const std::string image = readFile(png);
    ASSERT_GT(image.size(), 10000u) << png;
    EXPECT_EQ(image.substr(0, 8), std::string("\x89PNG\r\n\x1a\n", 8));
}

TEST(HtmlReplayPageInBrowser, TwoFingerTapShowsTheTapAndTheWithdrawnScroll) {
    const std::string page = replayToPage("cypress.two-finger-tap.evemu", {"--tap-to-click", "--secondary-click"});
    Browser browser;
    const CommandResult dom = browser.run({"--dump-dom"}, page);
    ASSERT_EQ(dom.exitCode, 0) << dom.err;
    EXPECT_EQ(consoleLines(dom.err), std::vector<std::string>{});
    EXPECT_NE(dom.out.find("id=\"page-status\" data-ready=\"1\""), std::string::npos);
    // Two settings, the may-begin scroll withdrawn, and the two-finger tap: its press sent
    // at once and its release returned, both drawn on the tap row.
    EXPECT_NE(dom.out.find("ready: 2 finger paths, 4 timeline entries"), std::string::npos);
    EXPECT_EQ(count(dom.out, "class=\"episode k-tap\""), 1u);
    EXPECT_EQ(count(dom.out, "class=\"episode k-setting\""), 2u);
    EXPECT_EQ(count(dom.out, "class=\"phase p-cancelled\""), 1u);
    EXPECT_NE(dom.out.find("tap: press of button mask 2 sent at once"), std::string::npos);
    EXPECT_NE(dom.out.find("tap: release returned"), std::string::npos);
    EXPECT_NE(dom.out.find("<td>tap</td>"), std::string::npos);

    const std::string png = kArtefacts + "/cypress.two-finger-tap.png";
    std::remove(png.c_str());
    const CommandResult shot = browser.run({"--window-size=1200,1300", "--screenshot=" + png}, page);
    ASSERT_EQ(shot.exitCode, 0) << shot.err;
    EXPECT_GT(readFile(png).size(), 10000u);
}

TEST(HtmlReplayPageInBrowser, PageGoesToStandardOutputForADash) {
    const CommandResult r = runOrvane({"replay", kRecordings + "/cypress.two-finger-tap.evemu", "--keyboard-cover",
                                       "--html", "-"});
    EXPECT_EQ(r.exitCode, 0) << r.err;
    EXPECT_EQ(r.out.rfind("<!DOCTYPE html>", 0), 0u);
    EXPECT_NE(r.err.find("Replayed "), std::string::npos);  // the summary moves to standard error
}

TEST(HtmlReplayPageInBrowser, PageNeedsAnOutputOfItsOwn) {
    const CommandResult r = runOrvane({"replay", kRecordings + "/cypress.two-finger-tap.evemu", "--keyboard-cover",
                                       "--html", "-", "--events-out", "-"});
    EXPECT_EQ(r.exitCode, 2);
    EXPECT_EQ(r.err, "orvane: --events-out - (standard output) and --html - (standard output) are the same output; "
                     "give each one of its own\n");
}

}  // namespace
}  // namespace orvane::tooltest
