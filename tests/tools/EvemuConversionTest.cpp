// Where the description of an evemu recording comes from, the service made from it, and
// every way a recording can fail to become a frame recording, each with the file and line.

#include <gtest/gtest.h>

#include <string>

#include "ToolTestSupport.h"
#include "tools/evemu/EvemuConversion.h"

namespace orvane::evemu {
namespace {

using tooltest::readFile;
using tooltest::ScratchFolder;

const std::string kData = ORVANE_TEST_TOOLS_DATA;

// A protocol-B description of 12 lines: two slots, 0..1000 x 0..500 at 10 units per mm, clickpad.
std::string description(const std::string& name, const std::string& bus = "0003") {
    return "N: " + name + "\nI: " + bus +
           " 0001 0002 0003\nP: 04\nB: 01 00 00 00 00 00 00 00 00\nB: 01 00 00 00 00 00 00 00 00\n"
           "B: 01 00 00 00 00 00 00 00 00\nB: 01 00 00 00 00 00 00 00 00\nB: 01 00 00 01\n"
           "A: 2f 0 1 0 0 0\nA: 35 0 1000 0 0 10\nA: 36 0 500 0 0 10\nA: 39 0 65535 0 0 0\n";
}
const std::string kEvents = "E: 1.000000 0003 0039 0001\nE: 1.000000 0000 0000 0000\n";

bool convert(const std::string& path, const EvemuOptions& options, formats::FrameRecording* recording,
             std::string* error) {
    return convertEvemuRecording(readFile(path), path, path, options, recording, error);
}

std::string refused(const std::string& path, const EvemuOptions& options = {}) {
    formats::FrameRecording recording;
    std::string error;
    EXPECT_FALSE(convert(path, options, &recording, &error)) << path;
    return error;
}

std::string product(const formats::FrameRecording& recording) {
    return recording.header.service.properties.at("Product").stringValue();
}

TEST(EvemuConversion, SiblingDescriptionsAreTriedFromTheLongestStem) {
    EXPECT_EQ(siblingDescriptionPaths("/d/alps.one-finger-tap.events"),
              (std::vector<std::string>{"/d/alps.one-finger-tap.desc", "/d/alps.desc"}));
    EXPECT_EQ(siblingDescriptionPaths("a.b.c.events"), (std::vector<std::string>{"a.b.c.desc", "a.b.desc", "a.desc"}));
    EXPECT_EQ(siblingDescriptionPaths("pad.events"), (std::vector<std::string>{"pad.desc"}));
    // No extension, or dots only in the folder's name: nothing to look for.
    EXPECT_TRUE(siblingDescriptionPaths("pad").empty());
    EXPECT_TRUE(siblingDescriptionPaths("/my.recordings/pad").empty());
    EXPECT_TRUE(siblingDescriptionPaths("/d/.events").empty());
}

TEST(EvemuConversion, TheLongerSiblingWinsAndAGivenDescriptionWinsOverBoth) {
    ScratchFolder scratch;
    const std::string events = scratch.write("pad.left.events", kEvents);
    scratch.write("pad.desc", description("short stem"));
    formats::FrameRecording recording;
    std::string error;
    ASSERT_TRUE(convert(events, {}, &recording, &error)) << error;
    EXPECT_EQ(product(recording), "short stem");

    scratch.write("pad.left.desc", description("long stem"));
    ASSERT_TRUE(convert(events, {}, &recording, &error)) << error;
    EXPECT_EQ(product(recording), "long stem");

    EvemuOptions given;
    given.descriptionPath = scratch.write("elsewhere.txt", description("given"));
    ASSERT_TRUE(convert(events, given, &recording, &error)) << error;
    EXPECT_EQ(product(recording), "given");
    EXPECT_EQ(recording.name, events);  // messages still name the recording
}

TEST(EvemuConversion, ARecordingsOwnDescriptionWinsOverASiblingOne) {
    ScratchFolder scratch;
    const std::string events = scratch.write("pad.events", description("its own") + kEvents);
    scratch.write("pad.desc", description("the sibling"));
    formats::FrameRecording recording;
    std::string error;
    ASSERT_TRUE(convert(events, {}, &recording, &error)) << error;
    EXPECT_EQ(product(recording), "its own");
}

TEST(EvemuConversion, TransportFollowsTheBus) {
    ScratchFolder scratch;
    const std::pair<const char*, const char*> buses[] = {{"0003", "USB"},       {"0005", "Bluetooth"},
                                                         {"0018", "I2C"},       {"0011", "PS/2"},
                                                         {"001c", "SPI"},       {"0006", "Virtual"},
                                                         {"0042", "bus 0x0042"}};
    for (const auto& [bus, transport] : buses) {
        const std::string path = scratch.write("pad.evemu", description("pad", bus) + kEvents);
        formats::FrameRecording recording;
        std::string error;
        ASSERT_TRUE(convert(path, {}, &recording, &error)) << error;
        EXPECT_EQ(recording.header.service.properties.at("Transport").stringValue(), transport) << bus;
    }
}

TEST(EvemuConversion, ANamelessDeviceHasNoProduct) {
    ScratchFolder scratch;
    std::string text = description("pad") + kEvents;
    text.replace(0, text.find('\n') + 1, "");  // without its N: line
    const std::string path = scratch.write("pad.evemu", text);
    formats::FrameRecording recording;
    std::string error;
    ASSERT_TRUE(convert(path, {}, &recording, &error)) << error;
    EXPECT_EQ(recording.header.service.properties.count("Product"), 0u);
}

TEST(EvemuConversion, SurfaceSizeIsParsedStrictly) {
    SurfaceSize size;
    std::string error;
    ASSERT_TRUE(parseSurfaceSize("100x60", &size, &error));
    EXPECT_EQ(size.width_mm, 100.0);
    EXPECT_EQ(size.height_mm, 60.0);
    ASSERT_TRUE(parseSurfaceSize("99.5x0.25", &size, &error));
    EXPECT_EQ(size.width_mm, 99.5);
    EXPECT_EQ(size.height_mm, 0.25);
    ASSERT_TRUE(parseSurfaceSize("10000x10000", &size, &error));
    for (const char* bad : {"", "100", "100x", "x60", "100x60x3", "100X60", "0x60", "100x0", "-1x60", "1e2x60",
                            "infx60", "10000.5x60", "100 x 60", "100x60 ", "."}) {
        EXPECT_FALSE(parseSurfaceSize(bad, &size, &error)) << bad;
        EXPECT_EQ(error, "--size must be WIDTHxHEIGHT in millimetres, each above 0 and at most 10000 (for example "
                         "100x60), not \"" +
                             std::string(bad) + "\"");
    }
}

TEST(EvemuConversion, FixedPointCentimetresRoundToTheNearestUnit) {
    EXPECT_EQ(fixedPointCentimetres(100.0), 655360);  // 10 cm
    EXPECT_EQ(fixedPointCentimetres(0.25), 1638);     // 0.025 cm * 65536 = 1638.4
    EXPECT_EQ(fixedPointCentimetres(0.5), 3277);      // 3276.8
    // 4000 units at 42 per mm: 95.238 mm; 4000 * 65536 / 420 = 624152.38 -> 624152.
    EXPECT_EQ(fixedPointCentimetres(EvdevAxis{1472, 5472, 0, 0, 42}), 624152);
    // 900 units at 15 per mm: exactly 6 cm.
    EXPECT_EQ(fixedPointCentimetres(EvdevAxis{0, 900, 0, 0, 15}), 6 * 65536);
    // 3 units at 2 per mm: 1.5 mm = 9830.4 -> 9830; 7 at 4: 1.75 mm = 11468.8 -> 11469.
    EXPECT_EQ(fixedPointCentimetres(EvdevAxis{0, 3, 0, 0, 2}), 9830);
    EXPECT_EQ(fixedPointCentimetres(EvdevAxis{-3, 4, 0, 0, 4}), 11469);
}

class EvemuConversionFails : public ::testing::Test {
protected:
    ScratchFolder scratch;
};

TEST_F(EvemuConversionFails, WithoutADescriptionSayingWhereItLooked) {
    const std::string events = scratch.write("pad.two.events", kEvents);
    EXPECT_EQ(refused(events), events +
                                   ": has no device description (N:, I:, P:, B:, A: lines): give it with --desc FILE "
                                   "or put it beside the recording (looked for " +
                                   scratch.file("pad.two.desc") + ", " + scratch.file("pad.desc") + ")");
    const std::string bare = scratch.write("pad", kEvents);
    EXPECT_EQ(refused(bare), bare + ": has no device description (N:, I:, P:, B:, A: lines): give it with --desc FILE");
}

TEST_F(EvemuConversionFails, FromStandardInputWithoutADescription) {
    // Standard input has nothing beside it, whatever files lie in the working folder.
    formats::FrameRecording recording;
    std::string error;
    EXPECT_FALSE(convertEvemuRecording(kEvents, "-", "<stdin>", {}, &recording, &error));
    EXPECT_EQ(error, "<stdin>: has no device description (N:, I:, P:, B:, A: lines): give it with --desc FILE");
}

TEST_F(EvemuConversionFails, WhenADescriptionIsGivenToARecordingThatHasOne) {
    const std::string path = scratch.write("pad.evemu", "# EVEMU 1.3\n" + description("pad") + kEvents);
    EvemuOptions options;
    options.descriptionPath = scratch.write("pad.desc", description("other"));
    EXPECT_EQ(refused(path, options),
              path + ":2: the recording has its own device description; --desc is for an events file without one");
}

TEST_F(EvemuConversionFails, WhenTheDescriptionFileIsMissingHasEventsOrIsEmpty) {
    const std::string events = scratch.write("pad.events", kEvents);
    EvemuOptions options;
    options.descriptionPath = scratch.file("missing.desc");
    EXPECT_EQ(refused(events, options), options.descriptionPath + ": cannot be read (No such file or directory)");

    options.descriptionPath = scratch.write("events.desc", description("pad") + "# then\n" + kEvents);
    EXPECT_EQ(refused(events, options),
              options.descriptionPath + ":14: a device description has no events (E: lines); give the recording as INPUT");

    options.descriptionPath = scratch.write("empty.desc", "# nothing but a comment\n");
    EXPECT_EQ(refused(events, options), options.descriptionPath + ": has no device description (N:, I:, P:, B:, A: lines)");

    options.descriptionPath = scratch.write("bad.desc", "N: pad\nI: 0003\n");
    EXPECT_EQ(refused(events, options),
              options.descriptionPath + ":2: I: needs four hex numbers: bus, vendor, product and version");
}

TEST_F(EvemuConversionFails, WithoutAnIdentityLine) {
    std::string text = description("pad");
    text.replace(text.find("I: "), text.find("P: ") - text.find("I: "), "");
    const std::string path = scratch.write("pad.evemu", "\n" + text + kEvents);
    EXPECT_EQ(refused(path), path +
                                 ":2: the device description has no I: line (bus, vendor, product, version), which "
                                 "tells the transport");
}

TEST_F(EvemuConversionFails, ForSingleTouchAndProtocolARecordingsNamingWhatIsMissing) {
    const std::string single = kData + "/single-touch.evemu";
    EXPECT_EQ(refused(single), single +
                                   ":3: a single-touch device: its description has no A: line for ABS_MT_POSITION_X, "
                                   "ABS_MT_POSITION_Y, ABS_MT_SLOT and ABS_MT_TRACKING_ID, and the conversion needs "
                                   "multitouch slots with tracking IDs (protocol B)");
    const std::string protocolA = kData + "/protocol-a.evemu";
    EXPECT_EQ(refused(protocolA), protocolA +
                                      ":4: a protocol-A multitouch device: its description has no A: line for "
                                      "ABS_MT_SLOT and ABS_MT_TRACKING_ID, and the conversion needs multitouch slots "
                                      "with tracking IDs (protocol B)");
}

TEST_F(EvemuConversionFails, WithoutAResolutionUnlessASizeIsGiven) {
    std::string text = description("pad");
    text.replace(text.find("A: 36 0 500 0 0 10"), 18, "A: 36 0 500 0 0");
    const std::string path = scratch.write("pad.evemu", text + kEvents);
    // The A: 36 line is line 11 of the description.
    EXPECT_EQ(refused(path), path +
                                 ":11: ABS_MT_POSITION_Y gives no resolution, so the surface size is unknown: give "
                                 "it with --size WIDTHxHEIGHT in millimetres (for example --size 100x60)");
    text.replace(text.find("A: 35 0 1000 0 0 10"), 19, "A: 35 0 1000 0 0 0");
    const std::string both = scratch.write("both.evemu", text + kEvents);
    EXPECT_EQ(refused(both), both +
                                 ":10: ABS_MT_POSITION_X gives no resolution, so the surface size is unknown: give "
                                 "it with --size WIDTHxHEIGHT in millimetres (for example --size 100x60)");
    EvemuOptions options;
    options.size = SurfaceSize{100.0, 50.0};
    formats::FrameRecording recording;
    std::string error;
    EXPECT_TRUE(convert(both, options, &recording, &error)) << error;
}

TEST_F(EvemuConversionFails, ForADeviceWithAnEmptyAxis) {
    std::string text = description("pad");
    text.replace(text.find("A: 35 0 1000"), 12, "A: 35 5 5");
    const std::string path = scratch.write("pad.evemu", "# flat\n" + text + kEvents);
    EXPECT_EQ(refused(path), path + ":2: ABS_MT_POSITION_X has an empty range (minimum and maximum 5)");
}

TEST_F(EvemuConversionFails, AtTheEventItCannotFollow) {
    const std::string head = description("pad");  // 12 lines
    const struct {
        std::string events;
        std::string error;
    } cases[] = {
        {"E: 1.000000 0003 0035 0010\nE: 1.000000 0000 0002 0000\n",
         ":14: SYN_MT_REPORT belongs to multitouch protocol A; the conversion needs slots with tracking IDs (protocol "
         "B)"},
        {"E: 1.000000 0000 0003 0000\n",
         ":13: SYN_DROPPED: events were lost here, so the touchpad's state after it is unknown"},
        {"E: 1.000000 0003 002f 0002\n", ":13: slot 2 is outside the device's slots 0 to 1"},
        {"E: 1.000000 0003 0000 0002\n", ":13: ABS_X is not an axis of this device (it has no A: line)"},
        {"E: 1.000000 0001 0111 0001\n", ":13: BTN_RIGHT is not a key of this device (its B: 01 lines)"},
        {"E: 1.000000 0001 0110 0005\n", ":13: BTN_LEFT has the value 5 (0 up, 1 down, 2 held)"},
        {"E: 1.000000 0003 0039 -002\n", ":13: tracking ID -2 is neither -1 (the contact ends) nor a contact"},
    };
    for (const auto& c : cases) {
        const std::string path = scratch.write("pad.evemu", head + c.events);
        EXPECT_EQ(refused(path), path + c.error);
    }
}

TEST_F(EvemuConversionFails, AtAMalformedLineOfTheRecording) {
    const std::string path = scratch.write("pad.evemu", description("pad") + "E: 1.0 0003 0035 0010\n");
    EXPECT_EQ(refused(path), path +
                                 ":13: the time of E: must be seconds and six digits of microseconds (1.000250), not "
                                 "\"1.0\"");
}

}  // namespace
}  // namespace orvane::evemu
