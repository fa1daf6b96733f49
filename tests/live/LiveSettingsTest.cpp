// The configuration file of `orvane run` and how flags and file combine; a bad file stops
// the command with one line.

#include <gtest/gtest.h>
#include <sys/wait.h>

#include <array>
#include <cstdio>
#include <fstream>

#include "LiveTestSupport.h"
#include "tools/live/LiveCommand.h"
#include "tools/live/LiveSettings.h"

namespace orvane::live {
namespace {

using test::ScratchFolder;

TEST(LiveSettings, ReadsEveryKey) {
    const std::string text =
        "# the laptop's touchpad\n"
        "device = /dev/input/event7\n"
        "tap-to-click = true\n"
        "secondary-click = no   # two fingers close together\n"
        "scroll-factor = -6.5\n"
        "keyboard-cover = yes\n"
        "\n"
        "size = 99.5x62.25\n"
        "gesture-socket = /run/user/1000/orvane/gestures.sock\n"
        "print = off\n"
        "wait = 1\n"
        "grab = false\n"
        "lid-switch = on\n";
    LiveSettings s;
    std::string error;
    ASSERT_TRUE(parseLiveSettings(text, "run.conf", &s, &error)) << error;
    EXPECT_EQ(s.device, "/dev/input/event7");
    EXPECT_EQ(s.tapToClick, true);
    EXPECT_EQ(s.twoFingerSecondaryClick, false);
    EXPECT_EQ(s.scrollFactor, -6.5);
    EXPECT_EQ(s.keyboardCover, true);
    ASSERT_TRUE(s.size);
    EXPECT_EQ(s.size->width_mm, 99.5);
    EXPECT_EQ(s.size->height_mm, 62.25);
    EXPECT_EQ(s.gestureSocket, "/run/user/1000/orvane/gestures.sock");
    EXPECT_EQ(s.print, false);
    EXPECT_EQ(s.wait, true);
    EXPECT_EQ(s.grab, false);
    EXPECT_EQ(s.lidSwitch, true);
}

TEST(LiveSettings, AnEmptyFileSetsNothing) {
    LiveSettings s;
    std::string error;
    ASSERT_TRUE(parseLiveSettings("# nothing yet\n\n", "run.conf", &s, &error));
    EXPECT_FALSE(s.device || s.tapToClick || s.twoFingerSecondaryClick || s.scrollFactor || s.keyboardCover ||
                 s.size || s.gestureSocket || s.print || s.wait || s.grab || s.lidSwitch);
}

struct BadLine {
    const char* name;
    const char* text;
    const char* error;
};

void PrintTo(const BadLine& b, std::ostream* os) { *os << b.name; }

class LiveSettingsErrors : public ::testing::TestWithParam<BadLine> {};

TEST_P(LiveSettingsErrors, NameTheFileTheLineAndTheProblem) {
    LiveSettings s;
    std::string error;
    EXPECT_FALSE(parseLiveSettings(GetParam().text, "run.conf", &s, &error));
    EXPECT_EQ(error, GetParam().error);
}

INSTANTIATE_TEST_SUITE_P(
    Lines, LiveSettingsErrors,
    ::testing::Values(
        BadLine{"UnknownKey", "tap-to-click = true\ntap-too-click = true\n", "run.conf:2: unknown key \"tap-too-click\""},
        BadLine{"NotATruth", "# a comment\n\ntap-to-click = maybe\n",
                "run.conf:3: \"tap-to-click\" must be true or false, not \"maybe\""},
        BadLine{"NotANumber", "scroll-factor = fast\n", "run.conf:1: \"scroll-factor\" must be a number, not \"fast\""},
        BadLine{"ZeroFactor", "scroll-factor = 0\n", "run.conf:1: \"scroll-factor\" must not be 0"},
        BadLine{"NotASize", "size = 100 by 60\n",
                "run.conf:1: \"size\" must be WIDTHxHEIGHT in millimetres, each above 0 and at most 10000 (for "
                "example 100x60), not \"100 by 60\""},
        BadLine{"GivenTwice", "wait = true\nwait = false\n", "run.conf:2: \"wait\" is given twice"},
        BadLine{"NoEquals", "print\n", "run.conf:1: expected key = value, found \"print\""},
        BadLine{"NoValue", "device =\n", "run.conf:1: \"device\" has no value"}));

TEST(LiveSettings, FlagsWinOverTheFile) {
    LiveSettings file, flags;
    file.tapToClick = true;
    file.scrollFactor = 6.0;
    file.device = "/dev/input/event3";
    flags.tapToClick = false;
    flags.wait = true;
    const LiveSettings s = flags.over(file);
    EXPECT_EQ(s.tapToClick, false);
    EXPECT_EQ(s.scrollFactor, 6.0);
    EXPECT_EQ(s.device, "/dev/input/event3");
    EXPECT_EQ(s.wait, true);
    EXPECT_FALSE(s.print);
}

TEST(LiveSettings, AFileThatCannotBeReadSaysSo) {
    RunOptions options;
    options.config = "/nonexistent/orvane/run.conf";
    LiveSettings s;
    std::string error;
    EXPECT_FALSE(settingsFor(options, &s, &error));
    EXPECT_EQ(error.rfind("/nonexistent/orvane/run.conf: cannot be read", 0), 0u) << error;
}

struct CommandResult {
    int status = -1;
    std::string out, err;
};

CommandResult runOrvane(const std::string& arguments, const ScratchFolder& folder) {
    CommandResult r;
    const std::string outPath = folder.file("stdout"), errPath = folder.file("stderr");
    const int raw = std::system((std::string(test::kOrvaneCommand) + " " + arguments + " >" + outPath + " 2>" +
                                 errPath + " </dev/null")
                                    .c_str());
    r.status = WIFEXITED(raw) ? WEXITSTATUS(raw) : -1;
    std::string error;
    formats::readFileContent(outPath, &r.out, &error);
    formats::readFileContent(errPath, &r.err, &error);
    return r;
}

TEST(OrvaneRunConfig, AnUnknownKeyStopsTheCommandWithOneLine) {
    ScratchFolder folder;
    const std::string config = folder.file("run.conf");
    std::ofstream(config) << "tap-to-click = on\nscroll-speed = 3\n";
    const CommandResult r = runOrvane("run --config " + config, folder);
    EXPECT_EQ(r.status, 1);
    EXPECT_EQ(r.err, config + ":2: unknown key \"scroll-speed\"\n");
    EXPECT_EQ(r.out, "");
}

TEST(OrvaneRunConfig, ABadValueStopsTheCommandWithOneLine) {
    ScratchFolder folder;
    const std::string config = folder.file("run.conf");
    std::ofstream(config) << "keyboard-cover = true\nsize = 100x0\n";
    const CommandResult r = runOrvane("run --keyboard-cover --config " + config, folder);
    EXPECT_EQ(r.status, 1);
    EXPECT_EQ(r.err, config +
                         ":2: \"size\" must be WIDTHxHEIGHT in millimetres, each above 0 and at most 10000 (for "
                         "example 100x60), not \"100x0\"\n");
}

TEST(OrvaneRunConfig, AScrollFactorOfZeroOnTheCommandLineIsRefused) {
    ScratchFolder folder;
    const CommandResult r = runOrvane("run --scroll-factor 0", folder);
    EXPECT_EQ(r.status, 2);
    EXPECT_NE(r.err.find("--scroll-factor"), std::string::npos) << r.err;
    EXPECT_EQ(std::count(r.err.begin(), r.err.end(), '\n'), 1) << r.err;
}

}  // namespace
}  // namespace orvane::live
