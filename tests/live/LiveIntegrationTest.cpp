// The real thing, where the machine allows it: a uinput virtual pointer that the kernel
// makes and that reads back what was written, and a real touchpad through the whole bridge.
// Where /dev/uinput cannot be written or no touchpad can be read, the test says it skipped
// and why.

#include <gtest/gtest.h>
#include <linux/input-event-codes.h>
#include <poll.h>
#include <unistd.h>

#include <chrono>
#include <sstream>
#include <thread>

#include "LiveTestSupport.h"
#include "tools/live/DeviceDiscovery.h"
#include "tools/live/GestureStream.h"
#include "tools/live/LibevdevSource.h"
#include "tools/live/LiveBridge.h"
#include "tools/live/LiveRunner.h"
#include "tools/live/PointerOutput.h"
#include "tools/live/SystemDevices.h"
#include "tools/live/UinputPointer.h"

namespace orvane::live {
namespace {

// Why the machine cannot make a virtual pointer, or empty when it can.
std::string uinputMissing() {
    if (::access("/dev/uinput", F_OK) != 0) return "/dev/uinput does not exist on this machine (no uinput module)";
    if (::access("/dev/uinput", W_OK) != 0) return "/dev/uinput exists but this user may not write it";
    return "";
}

TEST(LiveIntegration, TheVirtualPointerIsAnInputDeviceThatReadsBackWhatWasWritten) {
    const std::string missing = uinputMissing();
    if (!missing.empty()) GTEST_SKIP() << missing;
    std::string error;
    std::unique_ptr<UinputPointer> pointer = UinputPointer::create(&error);
    ASSERT_NE(pointer, nullptr) << error;
    const std::string node = pointer->deviceNode();
    ASSERT_FALSE(node.empty());
    std::unique_ptr<LibevdevSource> reader = LibevdevSource::open(node, false, &error);
    ASSERT_NE(reader, nullptr) << error;
    EXPECT_EQ(reader->device().name, UinputPointer::kDeviceName);

    PointerOutput output(*pointer);
    HIDEventRef move = HIDEvent::pointerEvent(1, 3.175, -1.905, 0.0, 0, 0);  // 5 and -3 quanta: 3 and -1 counts
    ASSERT_TRUE(output.deliver(*move, &error)) << error;
    std::vector<evemu::EvdevEvent> got;
    for (int tries = 0; tries < 100 && got.size() < 3; ++tries) {
        pollfd p{reader->pollDescriptor(), POLLIN, 0};
        ::poll(&p, 1, 20);
        evemu::EvdevEvent e;
        while (reader->next(&e, &error) == ReadStatus::Event) got.push_back(e);
    }
    ASSERT_EQ(got.size(), 3u);
    EXPECT_EQ(got[0].code, REL_X);
    EXPECT_EQ(got[0].value, 3);
    EXPECT_EQ(got[1].code, REL_Y);
    EXPECT_EQ(got[1].value, -1);
    EXPECT_EQ(got[2].type, EV_SYN);
}

TEST(LiveIntegration, ARealTouchpadRunsThroughTheBridge) {
    const std::string missing = uinputMissing();
    if (!missing.empty()) GTEST_SKIP() << missing;
    const InputDeviceScan scan = scanInputDevices();
    const InputDeviceInfo* pad = chooseTouchpad(scan, "");
    if (!pad) GTEST_SKIP() << "no touchpad on this machine";
    if (!pad->readable) GTEST_SKIP() << "the touchpad cannot be read: " << pad->problem;

    test::QuietLogs quiet;
    std::string error;
    std::unique_ptr<UinputPointer> pointer = UinputPointer::create(&error);
    ASSERT_NE(pointer, nullptr) << error;
    PointerOutput output(*pointer);
    GestureStream gestures;
    LiveBridge bridge(output, &gestures, nullptr);
    // Not grabbed: the person at the machine keeps their touchpad while the test runs.
    SystemDevices devices(pad->node, false, true);
    std::ostringstream messages;
    LiveRunner runner(devices, bridge, &gestures, messages);
    BridgeSettings settings;
    settings.plugInPath = test::kPlugInModule;
    settings.keyboardCover = true;
    {
        std::unique_ptr<LibevdevSource> probe = LibevdevSource::open(pad->node, false, &error);
        ASSERT_NE(probe, nullptr) << error;
        const evemu::EvdevAxis* x = probe->device().axis(evemu::kAbsMtPositionX);
        if (!x || x->resolution == 0) settings.size = evemu::SurfaceSize{100.0, 60.0};
    }
    int stop[2];
    ASSERT_EQ(::pipe(stop), 0);
    std::thread stopper([&] {
        std::this_thread::sleep_for(std::chrono::milliseconds(500));
        const char byte = 1;
        EXPECT_EQ(::write(stop[1], &byte, 1), 1);
    });
    const int status = runner.run(settings, false, stop[0]);
    stopper.join();
    ::close(stop[0]);
    ::close(stop[1]);
    EXPECT_EQ(status, 0) << messages.str();
    EXPECT_NE(messages.str().find("reading the touchpad " + pad->node), std::string::npos) << messages.str();
    EXPECT_FALSE(bridge.isRunning());
}

}  // namespace
}  // namespace orvane::live
