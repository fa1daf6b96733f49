// Finding touchpads and lid switches from what sysfs says of each input device, and the
// one-line explanations of a device that cannot be opened.

#include <grp.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <filesystem>
#include <fstream>

#include "LiveTestSupport.h"
#include "tools/live/DeviceAccess.h"
#include "tools/live/DeviceDiscovery.h"

namespace orvane::live {
namespace {

namespace fs = std::filesystem;

// The ABS bitmap of a multitouch touchpad: ABS_X (bit 0), ABS_Y (1), ABS_MT_SLOT (0x2f = 47),
// ABS_MT_POSITION_X (0x35 = 53), ABS_MT_POSITION_Y (0x36 = 54), ABS_MT_TRACKING_ID
// (0x39 = 57): 2^57 + 2^54 + 2^53 + 2^47 + 3 = 0x260800000000003.
constexpr const char* kTouchpadAxes = "260800000000003";

// A sysfs folder and a device folder the test fills.
class FakeSystem {
public:
    FakeSystem() {
        fs::create_directories(sysfs());
        fs::create_directories(devices());
    }
    std::string sysfs() const { return folder.file("sys/class/input"); }
    std::string devices() const { return folder.file("dev/input"); }

    // One event device; `node` makes a readable node for it.
    void add(int number, const std::string& name, const std::string& abs, const std::string& properties,
             const std::string& sw = "0", bool node = true, const std::string& bus = "0018") {
        const fs::path d = fs::path(sysfs()) / ("event" + std::to_string(number)) / "device";
        fs::create_directories(d / "id");
        fs::create_directories(d / "capabilities");
        std::ofstream(d / "name") << name << "\n";
        std::ofstream(d / "id" / "bustype") << bus << "\n";
        std::ofstream(d / "id" / "vendor") << "04f3\n";
        std::ofstream(d / "id" / "product") << "3" << number << "\n";
        std::ofstream(d / "properties") << properties << "\n";
        std::ofstream(d / "capabilities" / "abs") << abs << "\n";
        std::ofstream(d / "capabilities" / "sw") << sw << "\n";
        if (node) std::ofstream(devices() + "/event" + std::to_string(number)) << "";
    }

    test::ScratchFolder folder;
};

TEST(DeviceDiscovery, ATouchpadHasSlotsPositionsTrackingIdsAndMovesAPointer) {
    FakeSystem sys;
    sys.add(2, "AT Translated Set 2 keyboard", "0", "0");
    sys.add(5, "ELAN0501:00 04F3:3060 Touchpad", kTouchpadAxes, "5");  // INPUT_PROP_POINTER | BUTTONPAD
    sys.add(7, "Goodix Capacitive TouchScreen", kTouchpadAxes, "2");   // INPUT_PROP_DIRECT: a screen
    sys.add(11, "Wacom tablet", "3", "1");                              // no multitouch slots
    const InputDeviceScan scan = scanInputDevices(sys.sysfs(), sys.devices());
    ASSERT_EQ(scan.devices.size(), 4u);
    const auto pads = scan.touchpads();
    ASSERT_EQ(pads.size(), 1u);
    EXPECT_EQ(pads[0]->node, sys.devices() + "/event5");
    EXPECT_EQ(pads[0]->name, "ELAN0501:00 04F3:3060 Touchpad");
    EXPECT_TRUE(pads[0]->readable);
    EXPECT_EQ(pads[0]->describe(), "\"ELAN0501:00 04F3:3060 Touchpad\" (I2C, 04f3:0035)");
}

TEST(DeviceDiscovery, BitmapsOfSeveralWordsCountFromTheLastWord) {
    FakeSystem sys;
    // The low word is the last; a set bit 64 in the first word does not hide the axes.
    sys.add(3, "Synaptics TM3276-022", std::string("1 ") + kTouchpadAxes, "1", "0", true, "0011");
    // The same bits one word up are codes 64 and above: no touchpad.
    sys.add(4, "Not a touchpad", std::string(kTouchpadAxes) + " 0", "1");
    const InputDeviceScan scan = scanInputDevices(sys.sysfs(), sys.devices());
    const auto pads = scan.touchpads();
    ASSERT_EQ(pads.size(), 1u);
    EXPECT_EQ(pads[0]->number, 3);
}

TEST(DeviceDiscovery, DevicesComeInNodeOrderAndLidSwitchesAreFound) {
    FakeSystem sys;
    sys.add(10, "Second touchpad", kTouchpadAxes, "1");
    sys.add(9, "First touchpad", kTouchpadAxes, "1");
    sys.add(0, "Lid Switch", "0", "0", "1");  // SW_LID is bit 0
    sys.add(1, "Power Button", "0", "0", "0");
    const InputDeviceScan scan = scanInputDevices(sys.sysfs(), sys.devices());
    const auto pads = scan.touchpads();
    ASSERT_EQ(pads.size(), 2u);
    EXPECT_EQ(pads[0]->name, "First touchpad");  // event9 before event10
    const auto lids = scan.lidSwitches();
    ASSERT_EQ(lids.size(), 1u);
    EXPECT_EQ(lids[0]->name, "Lid Switch");
}

TEST(DeviceDiscovery, TheChoiceTakesTheFirstReadableTouchpadOrTheOneAskedFor) {
    FakeSystem sys;
    sys.add(4, "Unreadable pad", kTouchpadAxes, "1", "0", false);  // no node to open
    sys.add(6, "SYNA2393:00 06CB:7A13 Touchpad", kTouchpadAxes, "1");
    sys.add(8, "Apple Magic Trackpad", kTouchpadAxes, "1");
    sys.add(9, "USB keyboard", "0", "0");
    const InputDeviceScan scan = scanInputDevices(sys.sysfs(), sys.devices());
    ASSERT_EQ(scan.touchpads().size(), 3u);
    EXPECT_FALSE(scan.touchpads()[0]->readable);
    EXPECT_EQ(scan.touchpads()[0]->problem, sys.devices() + "/event4: no such device");

    ASSERT_NE(chooseTouchpad(scan, ""), nullptr);
    EXPECT_EQ(chooseTouchpad(scan, "")->number, 6);
    // Part of a name, in any case.
    ASSERT_NE(chooseTouchpad(scan, "magic trackpad"), nullptr);
    EXPECT_EQ(chooseTouchpad(scan, "magic trackpad")->number, 8);
    EXPECT_EQ(chooseTouchpad(scan, "keyboard"), nullptr);  // not a touchpad
    // A node, whatever the device is (the caller says when it is no touchpad).
    ASSERT_NE(chooseTouchpad(scan, sys.devices() + "/event9"), nullptr);
    EXPECT_FALSE(chooseTouchpad(scan, sys.devices() + "/event9")->touchpad);
    EXPECT_EQ(chooseTouchpad(scan, sys.devices() + "/event99"), nullptr);
}

TEST(DeviceDiscovery, NoTouchpadAtAllChoosesNothing) {
    FakeSystem sys;
    sys.add(1, "Power Button", "0", "0");
    const InputDeviceScan scan = scanInputDevices(sys.sysfs(), sys.devices());
    EXPECT_EQ(chooseTouchpad(scan, ""), nullptr);
    EXPECT_TRUE(scanInputDevices(sys.folder.file("nothing-here"), sys.devices()).devices.empty());
}

TEST(DeviceAccess, APermissionProblemNamesTheGroupToJoin) {
    test::ScratchFolder folder;
    const std::string node = folder.file("event5");
    std::ofstream(node) << "";
    const group* g = ::getgrnam("daemon");
    ASSERT_NE(g, nullptr);
    ASSERT_EQ(::chown(node.c_str(), 0, g->gr_gid), 0);
    ASSERT_EQ(::chmod(node.c_str(), 0640), 0);
    EXPECT_EQ(describeOpenFailure(node, EACCES),
              node + ": permission denied: the device belongs to the group daemon; join it (sudo usermod -aG "
                     "daemon $USER, then log in again) or install the udev rule data/70-orvane.rules");
    // A node no group may read: the rule is what is missing.
    ASSERT_EQ(::chmod(node.c_str(), 0600), 0);
    EXPECT_EQ(describeOpenFailure(node, EACCES),
              node + ": permission denied: install the udev rule data/70-orvane.rules (it lets the user at the "
                     "seat read touchpads and lid switches) or run as root");
}

TEST(DeviceAccess, TheVirtualPointerNamesTheRuleOrTheModule) {
    EXPECT_EQ(describeOpenFailure("/dev/uinput", EACCES),
              "/dev/uinput: permission denied: install the udev rule data/70-orvane.rules (it lets the user at the "
              "seat and the group input make virtual devices) or run as root");
    EXPECT_EQ(describeOpenFailure("/dev/uinput", ENOENT), "/dev/uinput: not there: load the uinput module (sudo "
                                                          "modprobe uinput)");
    EXPECT_EQ(describeOpenFailure("/dev/input/event5", ENODEV), "/dev/input/event5: no such device");
}

}  // namespace
}  // namespace orvane::live
