// The files that install `orvane run` (data/): the example settings read without error, the
// systemd unit asks only for flags the command has, and the udev rule names the virtual
// pointer the bridge makes.

#include <gtest/gtest.h>

#include <regex>
#include <set>

#include "LiveTestSupport.h"
#include "tools/live/DeviceAccess.h"
#include "tools/live/LiveSettings.h"
#include "tools/live/UinputPointer.h"

namespace orvane::live {
namespace {

const std::string kData = ORVANE_TEST_PROJECT_DATA;

std::string read(const std::string& path) {
    std::string text, error;
    EXPECT_TRUE(formats::readFileContent(path, &text, &error)) << error;
    return text;
}

TEST(LiveInstallFiles, TheExampleSettingsRead) {
    LiveSettings s;
    std::string error;
    ASSERT_TRUE(readLiveSettingsFile(kData + "/orvane-run.conf", &s, &error)) << error;
    // A laptop's touchpad is matched only as a keyboard cover's.
    EXPECT_EQ(s.keyboardCover, true);
}

TEST(LiveInstallFiles, TheUnitUsesOnlyFlagsTheCommandHas) {
    const std::string unit = read(kData + "/orvane.service");
    std::smatch exec;
    ASSERT_TRUE(std::regex_search(unit, exec, std::regex("ExecStart=(\\S+) run ([^\\n]*)")));
    EXPECT_EQ(exec[1].str(), "@ORVANE_CHECKOUT@/build/release/bin/orvane");
    test::ScratchFolder folder;
    const std::string help = folder.file("help");
    ASSERT_EQ(std::system((std::string(test::kOrvaneCommand) + " run --help >" + help).c_str()), 0);
    const std::string text = read(help);
    const std::string arguments = exec[2].str();
    std::set<std::string> flags;
    const std::regex flag("--[a-z-]+");
    for (std::sregex_iterator it(arguments.begin(), arguments.end(), flag), end; it != end; ++it)
        flags.insert(it->str());
    EXPECT_EQ(flags, (std::set<std::string>{"--wait", "--config", "--gesture-socket"}));
    for (const std::string& f : flags) EXPECT_NE(text.find(f), std::string::npos) << f;
}

TEST(LiveInstallFiles, TheRuleNamesTheVirtualPointerAndGivesAccessToUinput) {
    const std::string rule = read(kData + "/" + kUdevRuleName);
    EXPECT_NE(rule.find(std::string("ATTRS{name}==\"") + UinputPointer::kDeviceName + "\""), std::string::npos);
    EXPECT_NE(rule.find("KERNEL==\"uinput\""), std::string::npos);
    EXPECT_NE(rule.find("ENV{ID_INPUT_TOUCHPAD}==\"1\", TAG+=\"uaccess\""), std::string::npos);
    // One count per millimetre is 25.4 counts to the inch, given to libinput as a whole number.
    EXPECT_NE(rule.find("ENV{MOUSE_DPI}=\"25\""), std::string::npos);
}

}  // namespace
}  // namespace orvane::live
