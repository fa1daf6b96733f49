// The gesture stream on its Unix socket: a client that connects gets one line of event JSON
// per scale, rotation and scroll event the filter delivers, with its phase; a client that
// stops reading, or goes away, is dropped without ever holding up the input path.
//
// Frames come from the hand builder straight into the bridge. The surface is 1000 × 500
// units (SurfaceDimensions 100.0 × 50.0, 16.16 fixed-point centimetres), frames 8 ms apart; the fingers stay at
// y = 200, away from the edges, off the diving button and above the thumb zone. A first
// step of 10 moves a finger's steadied position by 9.95 (the hysteresis radius is 0.05),
// later steps by 10; both are 15 quanta of 0.635 = 9.525.

#include <fcntl.h>
#include <gtest/gtest.h>
#include <linux/input-event-codes.h>
#include <sys/socket.h>
#include <sys/un.h>
#include <unistd.h>

#include <algorithm>
#include <csignal>
#include <cstring>
#include <fstream>
#include <map>
#include <tuple>

#include "LiveTestSupport.h"
#include "tests/support/FrameBuilder.h"
#include "tools/formats/EventJson.h"
#include "tools/live/GestureStream.h"
#include "tools/live/LiveBridge.h"
#include "tools/live/PointerOutput.h"

namespace orvane::live {
namespace {

using orvane::test::Hand;
using orvane::test::TestClock;

formats::ServiceDescription keyboardCoverTrackpad() {
    formats::ServiceDescription s;
    s.usagePairs = {{13, 5}, {13, 34}, {1, 6}};
    PropertyDictionary size;
    size["Width"] = PropertyValue(int64_t{100 * 65536});
    size["Height"] = PropertyValue(int64_t{50 * 65536});
    s.properties["SurfaceDimensions"] = PropertyValue(std::move(size));
    s.properties["Transport"] = PropertyValue("USB");
    return s;
}

// A client of the socket.
class Client {
public:
    explicit Client(const std::string& path) : fd_(::socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0)) {
        sockaddr_un a{};
        a.sun_family = AF_UNIX;
        std::strncpy(a.sun_path, path.c_str(), sizeof(a.sun_path) - 1);
        connected_ = ::connect(fd_, reinterpret_cast<const sockaddr*>(&a), sizeof(a)) == 0;
    }
    ~Client() { close(); }
    bool connected() const { return connected_; }
    void close() {
        if (fd_ >= 0) ::close(fd_);
        fd_ = -1;
    }
    // Everything that is waiting, without blocking.
    std::string take() {
        std::string got;
        char buffer[8192];
        for (ssize_t n; fd_ >= 0 && (n = ::recv(fd_, buffer, sizeof buffer, MSG_DONTWAIT)) > 0;)
            got.append(buffer, static_cast<size_t>(n));
        return got;
    }

private:
    int fd_;
    bool connected_ = false;
};

struct Line {
    uint32_t type;
    uint16_t phase;
    double z;  // scale or rotation: z; scroll: y
};

std::vector<Line> parse(const std::string& text) {
    std::vector<Line> lines;
    size_t start = 0;
    for (size_t end; (end = text.find('\n', start)) != std::string::npos; start = end + 1) {
        std::string error;
        HIDEventRef e = formats::eventFromJson(text.substr(start, end - start), &error);
        EXPECT_NE(e, nullptr) << error;
        if (!e) continue;
        const double value = e->type() == kHIDEventTypeScroll ? e->doubleValueForField(kHIDEventFieldScrollY)
                                                              : e->doubleValueForField(hidFieldSelector(e->type(), 2));
        lines.push_back({e->type(), e->phase(), value});
    }
    EXPECT_EQ(start, text.size()) << "a line without its end";
    return lines;
}

std::vector<std::pair<uint32_t, uint16_t>> kinds(const std::vector<Line>& lines) {
    std::vector<std::pair<uint32_t, uint16_t>> k;
    for (const Line& l : lines) k.emplace_back(l.type, l.phase);
    return k;
}

class GestureSocketTest : public ::testing::Test {
protected:
    void SetUp() override {
        std::string error;
        ASSERT_TRUE(stream.listen(socketPath, &error)) << error;
        BridgeSettings settings;
        settings.plugInPath = test::kPlugInModule;
        ASSERT_TRUE(bridge.startWithService(keyboardCoverTrackpad(), settings, &error)) << error;
    }

    void place(int finger, float x, float y) {
        positions[finger] = {x, y};
        hand.finger(finger).at(x, y).down();
    }
    void step() {
        std::string error;
        ASSERT_TRUE(bridge.filter(hand.frame(), &error)) << error;
        clock.advance(8);
        stream.service();
    }
    void moveAll(const std::vector<std::tuple<int, float, float>>& moves) {
        for (const auto& [finger, dx, dy] : moves) {
            auto& p = positions[finger];
            p.first += dx;
            p.second += dy;
            hand.finger(finger).moveTo(p.first, p.second);
        }
        step();
    }
    // Both fingers lift, one after the other, and the surface is empty for two frames.
    void liftAll() {
        hand.finger(1).up();
        step();
        hand.finger(0).up();
        step();
        step();
        step();
    }

    test::QuietLogs quiet;
    test::ScratchFolder folder;
    std::string socketPath = folder.file("gestures.sock");
    CapturePointer capture;
    PointerOutput output{capture};
    GestureStream stream;
    LiveBridge bridge{output, &stream, nullptr};
    TestClock clock;
    Hand hand{1000.0f, 500.0f, clock};
    std::map<int, std::pair<float, float>> positions;
};

constexpr uint32_t kScroll = kHIDEventTypeScroll, kScale = kHIDEventTypeScale, kRotation = kHIDEventTypeRotation;
constexpr uint16_t kMayBegin = 0x80, kBegan = 1, kChanged = 2, kEnded = 4, kCancelled = 8;

TEST_F(GestureSocketTest, AClientGetsThePhasesOfAPinch) {
    Client client(socketPath);
    ASSERT_TRUE(client.connected());
    stream.service();
    EXPECT_EQ(stream.clientCount(), 1u);

    // Two fingers 200 apart; the scroll may begin. Then both move 10 outward three times:
    // the separation grows while the hand's mean stays, so the scale dominates; the
    // withdrawn scroll is cancelled in the frame the scale begins.
    place(0, 400, 200);
    place(1, 600, 200);
    step();
    for (int i = 0; i < 3; ++i) moveAll({{0, -10, 0}, {1, 10, 0}});
    liftAll();

    const std::vector<Line> lines = parse(client.take());
    EXPECT_EQ(kinds(lines), (std::vector<std::pair<uint32_t, uint16_t>>{{kScroll, kMayBegin},
                                                                        {kScroll, kCancelled},
                                                                        {kScale, kBegan},
                                                                        {kScale, kChanged},
                                                                        {kScale, kChanged},
                                                                        {kScale, kEnded}}));
    ASSERT_EQ(lines.size(), 6u);
    // Began: the separation grew by two first steps of 9.95, 19.9 × 0.005; then by 20.
    EXPECT_NEAR(lines[2].z, 19.9 * 0.005, 1e-5);
    EXPECT_NEAR(lines[3].z, 20 * 0.005, 1e-5);
    EXPECT_EQ(lines[5].z, 0.0);
    // Nothing of a pinch reaches the pointer.
    EXPECT_TRUE(capture.written.empty());
}

TEST_F(GestureSocketTest, AClientGetsThePhasesOfARotation) {
    Client client(socketPath);
    stream.service();
    // The fingers move in opposite directions across the line joining them.
    place(0, 400, 200);
    place(1, 600, 200);
    step();
    moveAll({{0, 0, 10}, {1, 0, -10}});
    moveAll({{0, 0, 10}, {1, 0, -10}});
    liftAll();

    const std::vector<Line> lines = parse(client.take());
    EXPECT_EQ(kinds(lines), (std::vector<std::pair<uint32_t, uint16_t>>{{kScroll, kMayBegin},
                                                                        {kScroll, kCancelled},
                                                                        {kRotation, kBegan},
                                                                        {kRotation, kChanged},
                                                                        {kRotation, kEnded}}));
    ASSERT_EQ(lines.size(), 5u);
    EXPECT_NE(lines[2].z, 0.0);
}

TEST_F(GestureSocketTest, AClientGetsEveryPhaseOfAScrollAndThePointerTheWheel) {
    Client client(socketPath);
    stream.service();
    place(0, 400, 200);
    place(1, 500, 200);
    step();
    // Both fingers move 10 down four times: 15 quanta of 0.635 each time, a scroll of
    // -2 × 9.525 = -19.05 (single precision: -19.0499992...).
    for (int i = 0; i < 4; ++i) moveAll({{0, 0, 10}, {1, 0, 10}});
    liftAll();

    const std::vector<Line> lines = parse(client.take());
    EXPECT_EQ(kinds(lines), (std::vector<std::pair<uint32_t, uint16_t>>{{kScroll, kMayBegin},
                                                                        {kScroll, kBegan},
                                                                        {kScroll, kChanged},
                                                                        {kScroll, kChanged},
                                                                        {kScroll, kChanged},
                                                                        {kScroll, kEnded}}));
    ASSERT_EQ(lines.size(), 6u);
    for (size_t i = 1; i <= 4; ++i) EXPECT_NEAR(lines[i].z, -19.05, 1e-5) << i;
    // The wheel: -19.05 × 12 = -228.6 a step; with the remainders carried -228, -229, -228,
    // -229 = -914 units, and -914 / 120 makes 7 detents down.
    int32_t units = 0, detents = 0;
    for (const auto& w : capture.written) {
        if (w.code == REL_WHEEL_HI_RES && w.type == EV_REL) units += w.value;
        if (w.code == REL_WHEEL && w.type == EV_REL) detents += w.value;
    }
    EXPECT_EQ(units, -914);
    EXPECT_EQ(detents, -7);
}

TEST_F(GestureSocketTest, EveryClientGetsTheSameLines) {
    Client first(socketPath), second(socketPath);
    stream.service();
    EXPECT_EQ(stream.clientCount(), 2u);
    place(0, 400, 200);
    place(1, 500, 200);
    step();
    moveAll({{0, 0, 10}, {1, 0, 10}});
    liftAll();
    const std::string a = first.take();
    EXPECT_FALSE(a.empty());
    EXPECT_EQ(second.take(), a);
}

// The input path is never held up: a write that blocked would stop the process here, and
// the alarm ends it as a failure.
class Watchdog {
public:
    explicit Watchdog(unsigned seconds) { ::alarm(seconds); }
    ~Watchdog() { ::alarm(0); }
};

TEST(GestureSocketClients, ASlowClientAndAVanishedClientAreDroppedWithoutHoldingUpTheInputPath) {
    test::QuietLogs quiet;
    test::ScratchFolder folder;
    const std::string path = folder.file("gestures.sock");
    CapturePointer capture;
    PointerOutput output(capture);
    // A small allowance: the slow client overflows it once the kernel's buffer is full.
    GestureStream stream(4096);
    std::string error;
    ASSERT_TRUE(stream.listen(path, &error)) << error;
    LiveBridge bridge(output, &stream, nullptr);
    BridgeSettings settings;
    settings.plugInPath = test::kPlugInModule;
    ASSERT_TRUE(bridge.startWithService(keyboardCoverTrackpad(), settings, &error)) << error;

    Client reader(path), slow(path), vanished(path);
    stream.service();
    ASSERT_EQ(stream.clientCount(), 3u);
    vanished.close();

    Watchdog watchdog(120);
    TestClock clock;
    Hand hand(1000.0f, 500.0f, clock);
    float y = 200;
    hand.finger(0).at(400, y).down();
    hand.finger(1).at(500, y).down();
    std::string received;
    // Two fingers scroll up and down the pad, 10 units a frame, 20 frames each way, until
    // the slow client has been dropped (and a while longer).
    int frames = 0, afterDrop = 0;
    for (; frames < 40000 && afterDrop < 100; ++frames) {
        const float dy = (frames / 20) % 2 == 0 ? 10.0f : -10.0f;
        y += dy;
        hand.finger(0).moveTo(400, y);
        hand.finger(1).moveTo(500, y);
        ASSERT_TRUE(bridge.filter(hand.frame(), &error)) << error;
        clock.advance(8);
        stream.service();
        received += reader.take();
        if (stream.clientsDropped() == 2) ++afterDrop;
    }
    EXPECT_EQ(stream.clientsDropped(), 2u) << "after " << frames << " frames";
    EXPECT_EQ(stream.clientCount(), 1u);
    // The client that keeps reading has every line, whole.
    const size_t lines = static_cast<size_t>(std::count(received.begin(), received.end(), '\n'));
    EXPECT_EQ(lines, stream.linesPublished());
    EXPECT_GT(lines, 100u);
    EXPECT_EQ(received.back(), '\n');
    // The pointer got its wheel all along.
    EXPECT_FALSE(capture.written.empty());
    // The slow client finds its connection closed after what it was sent.
    const std::string slowGot = slow.take();
    EXPECT_LT(slowGot.size(), received.size());
}

TEST(GestureSocketClients, PrintedLinesThatCannotBeWrittenAreLeftOutNotWaitedFor) {
    int pipe[2];
    ASSERT_EQ(::pipe2(pipe, O_CLOEXEC), 0);
    GestureStream stream;
    stream.printTo(pipe[1]);  // nobody reads the other end
    Watchdog watchdog(60);
    const std::string line(200, 'x');
    // A pipe holds 64 KiB: 2000 lines of 201 bytes do not fit.
    for (int i = 0; i < 2000; ++i) stream.publish(line);
    EXPECT_EQ(stream.linesPublished(), 2000u);
    EXPECT_GT(stream.printedLinesLeftOut(), 0u);
    // What went through is whole lines.
    std::string got;
    char buffer[4096];
    ::fcntl(pipe[0], F_SETFL, O_NONBLOCK);
    for (ssize_t n; (n = ::read(pipe[0], buffer, sizeof buffer)) > 0;) got.append(buffer, static_cast<size_t>(n));
    EXPECT_EQ(got.size() % 201, 0u);
    EXPECT_EQ(got.size() / 201 + stream.printedLinesLeftOut(), 2000u);
    ::close(pipe[0]);
    ::close(pipe[1]);
}

TEST(GestureSocketListening, ASocketLeftBehindIsReplacedButALiveOneIsNot) {
    test::ScratchFolder folder;
    const std::string path = folder.file("gestures.sock");
    std::string error;
    {
        GestureStream first;
        ASSERT_TRUE(first.listen(path, &error)) << error;
        GestureStream second;
        EXPECT_FALSE(second.listen(path, &error));
        EXPECT_EQ(error, path + ": another program is already serving this socket");
    }
    // The first removed its socket when it ended; one left behind by a killed process is
    // a socket file nobody answers on.
    const int s = ::socket(AF_UNIX, SOCK_STREAM, 0);
    sockaddr_un a{};
    a.sun_family = AF_UNIX;
    std::strncpy(a.sun_path, path.c_str(), sizeof(a.sun_path) - 1);
    ASSERT_EQ(::bind(s, reinterpret_cast<const sockaddr*>(&a), sizeof(a)), 0);
    ::close(s);
    GestureStream third;
    EXPECT_TRUE(third.listen(path, &error)) << error;
    // A file that is not a socket is not touched.
    const std::string plain = folder.file("plain");
    std::ofstream(plain) << "keep me\n";
    GestureStream fourth;
    EXPECT_FALSE(fourth.listen(plain, &error));
    EXPECT_EQ(error, plain + ": exists and is not a socket");
}

}  // namespace
}  // namespace orvane::live
