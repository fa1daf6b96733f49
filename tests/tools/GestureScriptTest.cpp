// Gesture scripts: telling them from other inputs, reading them, the errors, and the frames
// they turn into.

#include <gtest/gtest.h>

#include <cstring>
#include <sstream>
#include <string>
#include <vector>

#include "ToolTestSupport.h"
#include "tools/formats/FrameRecording.h"
#include "tools/script/GestureScript.h"
#include "tools/script/GestureScriptFrames.h"

namespace orvane::script {
namespace {

using formats::FrameRecording;
using formats::InputRecord;

const std::string kMark = "# orvane gesture script\n";
const std::string kSurface = "surface 100 x 64 mm usb\n";

GestureScript parse(const std::string& text) {
    GestureScript script;
    std::string error;
    EXPECT_TRUE(parseGestureScript(text, "s.gestures", &script, &error)) << error;
    return script;
}

FrameRecording frames(const std::string& text) {
    FrameRecording recording;
    std::string error;
    EXPECT_TRUE(readGestureScript(text, "s.gestures", &recording, &error)) << error;
    return recording;
}

std::string error(const std::string& text) {
    FrameRecording recording;
    std::string message;
    EXPECT_FALSE(readGestureScript(text, "s.gestures", &recording, &message)) << "no error for:\n" << text;
    return message;
}

// The event records only.
std::vector<HIDEventRef> eventsOf(const FrameRecording& recording) {
    std::vector<HIDEventRef> out;
    for (const InputRecord& r : recording.records)
        if (r.kind == InputRecord::Kind::Event) out.push_back(r.event);
    return out;
}

int64_t field(const HIDEventRef& event, uint32_t selector) { return event->integerValueForField(selector); }
double real(const HIDEventRef& event, uint32_t selector) { return event->doubleValueForField(selector); }

// ---------------------------------------------------------------------------------------
// Telling a script from its content

TEST(GestureScriptKind, TheMarkOnTheFirstLineMakesAScript) {
    EXPECT_TRUE(isGestureScript(kMark + kSurface));
    EXPECT_TRUE(isGestureScript("\n  # Orvane Gesture Script, version 1\nrate 90 Hz\n"));
}

TEST(GestureScriptKind, ASurfaceStatementFirstMakesAScript) {
    EXPECT_TRUE(isGestureScript("# a session\n\nsurface 80 x 50 mm\n"));
    EXPECT_TRUE(isGestureScript("surface 80x50\n"));
}

TEST(GestureScriptKind, RecordingsAndOtherTextAreNotScripts) {
    EXPECT_FALSE(isGestureScript("{\"format\": \"orvane-frames\", \"version\": 1}\n"));
    EXPECT_FALSE(isGestureScript("# EVEMU 1.3\nN: Touchpad\n"));
    EXPECT_FALSE(isGestureScript("# orvane\nsurfaces 1 x 2\n"));
    EXPECT_FALSE(isGestureScript("# a comment\n# orvane gesture script\nhello\n"));  // the mark must come first
    EXPECT_FALSE(isGestureScript(""));
}

// ---------------------------------------------------------------------------------------
// Reading

TEST(GestureScriptParse, SetUpDefaultsToWiredAt125HzWithTheClockAtOneSecond) {
    const GestureScript s = parse("surface 100 x 64\n");
    EXPECT_EQ(s.surface.width_mm, 100.0);
    EXPECT_EQ(s.surface.height_mm, 64.0);
    EXPECT_EQ(s.surface.transport, Transport::Wired);
    EXPECT_EQ(s.surfaceLine, 1u);
    EXPECT_EQ(s.rate_Hz, 125.0);
    EXPECT_EQ(s.clock_ms, 1000.0);
    EXPECT_TRUE(s.statements.empty());
}

TEST(GestureScriptParse, SetUpStatementsTakeTheirUnitsOrNone) {
    const GestureScript s = parse(kMark + "surface 120.5mm x 70 mm bluetooth\nrate 90\nclock 0 ms\n");
    EXPECT_EQ(s.surface.width_mm, 120.5);
    EXPECT_EQ(s.surface.height_mm, 70.0);
    EXPECT_EQ(s.surface.transport, Transport::Bluetooth);
    EXPECT_EQ(s.surfaceLine, 2u);
    EXPECT_EQ(s.rate_Hz, 90.0);
    EXPECT_EQ(s.clock_ms, 0.0);
}

TEST(GestureScriptParse, TimedLinesReadAbsoluteAndRelativeTimes) {
    const GestureScript s = parse(kSurface +
                                  "10 finger a down at 30 40\n"
                                  "+5ms finger a move to 50, 40 over 100 ms   # comment\n"
                                  "200 ms thumb t2 down at 1.5 2.25mm\n"
                                  "+0 palm p.1 down at 0 64\n"
                                  "+50 finger a move by -10 -5 over 0\n"
                                  "+0 click down\n"
                                  "+0 click up\n"
                                  "400 end\n");
    ASSERT_EQ(s.statements.size(), 8u);
    const Statement& down = s.statements[0];
    EXPECT_EQ(down.kind, Statement::Kind::Down);
    EXPECT_TRUE(down.timed);
    EXPECT_EQ(down.time_ms, 10.0);
    EXPECT_EQ(down.line, 2u);
    EXPECT_EQ(down.contactKind, ContactKind::Finger);
    EXPECT_EQ(down.contact, "a");
    EXPECT_EQ(down.x_mm, 30.0);
    EXPECT_EQ(down.y_mm, 40.0);
    const Statement& move = s.statements[1];
    EXPECT_EQ(move.kind, Statement::Kind::MoveTo);
    EXPECT_EQ(move.time_ms, 15.0);  // 10 + 5
    EXPECT_EQ(move.x_mm, 50.0);
    EXPECT_EQ(move.duration_ms, 100.0);
    EXPECT_EQ(s.statements[2].contactKind, ContactKind::Thumb);
    EXPECT_EQ(s.statements[2].contact, "t2");
    EXPECT_EQ(s.statements[2].time_ms, 200.0);
    EXPECT_EQ(s.statements[2].y_mm, 2.25);
    EXPECT_EQ(s.statements[3].contactKind, ContactKind::Palm);
    EXPECT_EQ(s.statements[3].contact, "p.1");
    EXPECT_EQ(s.statements[3].time_ms, 200.0);
    const Statement& by = s.statements[4];
    EXPECT_EQ(by.kind, Statement::Kind::MoveBy);
    EXPECT_EQ(by.time_ms, 250.0);
    EXPECT_EQ(by.x_mm, -10.0);
    EXPECT_EQ(by.y_mm, -5.0);
    EXPECT_EQ(by.duration_ms, 0.0);
    EXPECT_EQ(s.statements[5].kind, Statement::Kind::ClickDown);
    EXPECT_EQ(s.statements[6].kind, Statement::Kind::ClickUp);
    EXPECT_EQ(s.statements[7].kind, Statement::Kind::End);
    EXPECT_EQ(s.statements[7].time_ms, 400.0);
}

TEST(GestureScriptParse, SettingsTakeWordsNumbersAndJson) {
    const GestureScript s = parse(kSurface +
                                  "set TapToClickEnabled on\n"
                                  "set A off\nset B yes\nset C false\nset D 3\nset E 2.5\nset F \"text # not a comment\"\n"
                                  "0 set HostStateNotification {\"ScreenOn\": 1, \"DigitizerSurfaceCovered\": 0}\n");
    ASSERT_EQ(s.statements.size(), 8u);
    EXPECT_FALSE(s.statements[0].timed);
    EXPECT_EQ(s.statements[0].key, "TapToClickEnabled");
    EXPECT_EQ(s.statements[0].value, PropertyValue(true));
    EXPECT_EQ(s.statements[1].value, PropertyValue(false));
    EXPECT_EQ(s.statements[2].value, PropertyValue(true));
    EXPECT_EQ(s.statements[3].value, PropertyValue(false));
    EXPECT_EQ(s.statements[4].value, PropertyValue(3));
    EXPECT_EQ(s.statements[5].value, PropertyValue(2.5));
    EXPECT_EQ(s.statements[6].value, PropertyValue("text # not a comment"));
    EXPECT_TRUE(s.statements[7].timed);
    PropertyDictionary host;
    host["ScreenOn"] = PropertyValue(1);
    host["DigitizerSurfaceCovered"] = PropertyValue(0);
    EXPECT_EQ(s.statements[7].value, PropertyValue(host));
}

struct BadScript {
    const char* name;
    std::string text;
    std::string expected;  // after "s.gestures:"
};

void PrintTo(const BadScript& b, std::ostream* os) { *os << b.name; }

class GestureScriptError : public ::testing::TestWithParam<BadScript> {};

TEST_P(GestureScriptError, NamesTheFileTheLineAndWhatIsWrong) {
    EXPECT_EQ(error(GetParam().text), "s.gestures:" + GetParam().expected);
}

INSTANTIATE_TEST_SUITE_P(
    , GestureScriptError,
    ::testing::Values(
        BadScript{"NoSurface", kMark + "rate 90 Hz\n",
                  "2: no surface: a script starts with \"surface WIDTH x HEIGHT mm\" (and usb or bluetooth)"},
        BadScript{"TimedLineBeforeTheSurface", kMark + "0 finger a down at 1 1\n",
                  "2: the surface must be given before the first timed line (surface WIDTH x HEIGHT mm)"},
        BadScript{"SurfaceTwice", kSurface + "surface 1 x 1\n", "2: surface is given twice (first on line 1)"},
        BadScript{"SurfaceWithoutX", "surface 100 64\n",
                  "1: expected \"x\" between the width and the height: surface WIDTH x HEIGHT mm, then usb or "
                  "bluetooth (for example \"surface 100 x 64 mm usb\")"},
        BadScript{"SurfaceOfNothing", "surface 0 x 64\n",
                  "1: a surface side must be more than 0 and at most 2000 mm, not 0"},
        BadScript{"UnknownConnection", "surface 100 x 64 mm serial\n",
                  "1: unknown connection \"serial\"; expected usb (or wired) or bluetooth"},
        BadScript{"RateOfZero", kSurface + "rate 0 Hz\n",
                  "2: the frame rate must be more than 0 and at most 1000 Hz, not 0"},
        BadScript{"SetUpAfterTimedLines", kSurface + "0 finger a down at 1 1\nrate 90\n",
                  "3: rate must come before the first timed line (line 2)"},
        BadScript{"UnknownStatement", kSurface + "wait 10\n",
                  "2: unknown statement \"wait\"; a line is surface, rate, clock, set, or a time in ms followed by "
                  "what happens"},
        BadScript{"ActionWithoutTime", kSurface + "finger a down at 1 1\n",
                  "2: \"finger\" needs a time first (milliseconds, or +N after the previous line)"},
        BadScript{"UnknownAction", kSurface + "0 hand a down\n",
                  "2: unknown action \"hand\"; expected finger, thumb, palm, click, set or end"},
        BadScript{"TimeAlone", kSurface + "10 ms\n", "2: expected what happens after the time"},
        BadScript{"NegativeTime", kSurface + "-5 finger a down at 1 1\n", "2: a time cannot be negative (-5 ms)"},
        BadScript{"TimeGoingBack", kSurface + "100 click down\n50 click up\n",
                  "3: time 50 ms comes before the previous line's 100 ms; lines go forward in time"},
        BadScript{"SecondsAreNotMilliseconds", kSurface + "0 finger a down at 1 1\n+1 s finger a up\n",
                  "3: unknown action \"s\"; expected finger, thumb, palm, click, set or end"},
        BadScript{"DownWithoutAt", kSurface + "0 finger a down 1 1\n", "2: expected \"at X Y\" after \"down\""},
        BadScript{"DownWithOneNumber", kSurface + "0 finger a down at 1\n",
                  "2: expected the position: two numbers in mm, x then y"},
        BadScript{"OffTheSurface", kSurface + "0 finger a down at 120 30\n",
                  "2: position (120, 30) mm is off the 100 x 64 mm surface"},
        BadScript{"MoveWithoutOver", kSurface + "0 finger a down at 1 1\n0 finger a move to 2 2\n",
                  "3: expected \"over DURATION ms\" after the position"},
        BadScript{"MoveNeitherToNorBy", kSurface + "0 finger a move 2 2 over 3\n",
                  "2: expected \"move to X Y\" or \"move by DX DY\""},
        BadScript{"FingerWithoutName", kSurface + "0 finger\n",
                  "2: expected the finger's name (for example \"finger a down at 30 40\")"},
        BadScript{"FingerWithoutAction", kSurface + "0 finger a sideways\n",
                  "2: expected down, move or up after finger a, not \"sideways\""},
        BadScript{"ClickSideways", kSurface + "0 click twice\n",
                  "2: expected \"click down\" or \"click up\", not \"click twice\""},
        BadScript{"TrailingWords", kSurface + "0 finger a up now\n", "2: unexpected \"now\" at the end of the line"},
        BadScript{"SetWithoutValue", kSurface + "set TapToClickEnabled\n",
                  "2: expected a value after set TapToClickEnabled"},
        BadScript{"SetWithBadJson", kSurface + "set TapToClickEnabled maybe\n",
                  "2: the value of TapToClickEnabled must be on, off, a number or a JSON value: invalid JSON at "
                  "column 1: syntax error while parsing value - invalid literal; last read: 'm'"},
        // Errors found while the frames are made.
        BadScript{"NoSuchFinger", kSurface + "0 finger a down at 1 1\n+8 finger b up\n",
                  "3: there is no finger b on the surface at 8 ms"},
        BadScript{"DownTwice", kSurface + "0 finger a down at 1 1\n+8 finger a down at 2 2\n",
                  "3: finger a is already down (line 2)"},
        BadScript{"KindChanges", kSurface + "0 thumb t down at 1 1\n+8 finger t up\n",
                  "3: t went down as a thumb (line 2), not a finger"},
        BadScript{"MoveWhileMoving", kSurface + "0 finger a down at 1 1\n0 finger a move by 5 0 over 100\n"
                                                "50 finger a move by 5 0 over 10\n",
                  "4: a is still moving until 100 ms (line 3)"},
        BadScript{"MoveOffTheSurface", kSurface + "0 finger a down at 90 1\n0 finger a move by 20 0 over 100\n",
                  "3: position (110, 1) mm is off the 100 x 64 mm surface"},
        BadScript{"UpBeforeAnyFrame", kSurface + "1 finger a down at 1 1\n+2 finger a up\n",
                  "3: a goes up before any frame has reported it down (line 2); frames are 8 ms apart"},
        BadScript{"ClickDownTwice", kSurface + "0 click down\n+8 click down\n",
                  "3: the click is already down (line 2)"},
        BadScript{"ClickUpFirst", kSurface + "0 click up\n", "2: the click is already up"},
        // 1000 Hz for a day, a finger down all the time.
        BadScript{"TooManyFrames", kSurface + "rate 1000 Hz\n0 finger a down at 1 1\n86400000 end\n",
                  "3: the session would have more than 200000 frames; is a contact left down?"}),
    [](const ::testing::TestParamInfo<BadScript>& info) { return std::string(info.param.name); });

// ---------------------------------------------------------------------------------------
// The recording's header and its settings

TEST(GestureScriptFrames, TheHeaderDescribesAKeyboardCoverTrackpad) {
    const FrameRecording r = frames(kMark + "surface 100 x 64 mm usb\n");
    EXPECT_EQ(r.name, "s.gestures");
    EXPECT_EQ(r.headerLine, 2u);
    const std::vector<HIDUsagePair> pairs{{13, 5}, {13, 34}, {1, 6}};
    EXPECT_EQ(r.header.service.usagePairs, pairs);
    // Centimetres in 16.16 fixed point: 10 cm = 655360; 6.4 cm = 419430.4, rounded to 419430.
    PropertyDictionary dimensions;
    dimensions["Width"] = PropertyValue(655360);
    dimensions["Height"] = PropertyValue(419430);
    EXPECT_EQ(r.header.service.properties.at("SurfaceDimensions"), PropertyValue(dimensions));
    EXPECT_EQ(r.header.service.properties.at("Transport"), PropertyValue("USB"));
    EXPECT_EQ(r.header.timebase.numer, 1u);
    EXPECT_EQ(r.header.timebase.denom, 1u);
    EXPECT_FALSE(r.header.bundle.has_value());
    EXPECT_TRUE(r.records.empty());
}

TEST(GestureScriptFrames, ABluetoothSurfaceSaysSo) {
    const FrameRecording r = frames("surface 100 x 64 mm bluetooth\n");
    EXPECT_EQ(r.header.service.properties.at("Transport"), PropertyValue("Bluetooth"));
}

TEST(GestureScriptFrames, SettingsComeFromAClientAndGoBeforeTheFrameAtTheirTime) {
    const FrameRecording r = frames(kSurface +
                                    "set TapToClickEnabled on\n"     // line 2
                                    "0 finger a down at 50 32\n"     // frame at 0
                                    "+16 set TapToClickEnabled off\n"  // before the frame at 16
                                    "+4 finger a up\n");             // the lift goes to the frame at 24
    ASSERT_EQ(r.records.size(), 7u);
    EXPECT_EQ(r.records[0].kind, InputRecord::Kind::Client);
    EXPECT_EQ(r.records[0].clientID, 1u);
    EXPECT_TRUE(r.records[0].clientAdded);
    EXPECT_EQ(r.records[0].line, 2u);
    EXPECT_EQ(r.records[1].kind, InputRecord::Kind::SetProperty);
    EXPECT_EQ(r.records[1].propertyKey, "TapToClickEnabled");
    EXPECT_EQ(r.records[1].propertyValue, PropertyValue(true));
    EXPECT_EQ(r.records[1].line, 2u);
    EXPECT_EQ(r.records[2].kind, InputRecord::Kind::Event);  // 0 ms
    EXPECT_EQ(r.records[3].kind, InputRecord::Kind::Event);  // 8 ms
    EXPECT_EQ(r.records[4].kind, InputRecord::Kind::SetProperty);
    EXPECT_EQ(r.records[4].propertyValue, PropertyValue(false));
    EXPECT_EQ(r.records[4].line, 4u);
    EXPECT_EQ(r.records[5].kind, InputRecord::Kind::Event);  // 16 ms
    EXPECT_EQ(r.records[6].kind, InputRecord::Kind::Event);  // 24 ms: the lift
    EXPECT_EQ(r.records[6].event->timestamp(), 1'024'000'000u);
    EXPECT_EQ(r.records[6].line, 5u);
}

// ---------------------------------------------------------------------------------------
// The frames, one by one

TEST(GestureScriptFrames, AFingerTouchesMovesRestsAndLifts) {
    // 128 x 64 mm, so that the positions below are exact binary fractions of the surface.
    const FrameRecording r = frames(
        "surface 128 x 64 mm\n"
        "0 finger a down at 32 16\n"
        "+0 finger a move by 16 8 over 16 ms\n"  // 8 mm and 4 mm a frame, until 16 ms
        "+32 finger a up\n");                    // at 32 ms
    const std::vector<HIDEventRef> e = eventsOf(r);
    ASSERT_EQ(e.size(), 5u);  // 0, 8, 16, 24 and the lift at 32 ms
    const uint64_t t0 = 1'000'000'000;  // the clock at 0 is 1000 ms, in nanoseconds
    const double x[] = {0.25, 0.3125, 0.375, 0.375, 0.375};     // 32, 40, 48, 48, 48 mm of 128
    const double y[] = {0.75, 0.6875, 0.625, 0.625, 0.625};     // 1 - 16/64, 1 - 20/64, 1 - 24/64
    const int64_t mask[] = {7, 4, 4, 0, 3};  // touch-down, moved, moved, still, lifted
    const int64_t touch[] = {1, 1, 1, 1, 0};
    for (size_t k = 0; k < e.size(); ++k) {
        SCOPED_TRACE("frame " + std::to_string(k));
        const HIDEventRef& f = e[k];
        EXPECT_EQ(f->type(), kHIDEventTypeDigitizer);
        EXPECT_EQ(f->timestamp(), t0 + 8'000'000u * k);
        EXPECT_EQ(field(f, kHIDEventFieldDigitizerButtonMask), 0);
        EXPECT_EQ(field(f, kHIDEventFieldDigitizerEventMask), mask[k]);
        EXPECT_EQ(field(f, kHIDEventFieldDigitizerTouch), touch[k]);
        EXPECT_EQ(field(f, kHIDEventFieldDigitizerRange), touch[k]);
        EXPECT_FALSE(f->hasField(kHIDEventFieldDigitizerX));
        ASSERT_EQ(f->children().size(), 1u);
        const HIDEventRef& c = f->children()[0];
        EXPECT_EQ(c->type(), kHIDEventTypeDigitizer);
        EXPECT_EQ(c->timestamp(), f->timestamp());
        EXPECT_EQ(real(c, kHIDEventFieldDigitizerX), x[k]);
        EXPECT_EQ(real(c, kHIDEventFieldDigitizerY), y[k]);
        EXPECT_EQ(field(c, kHIDEventFieldDigitizerType), 1);
        EXPECT_EQ(field(c, kHIDEventFieldDigitizerIndex), 0);
        EXPECT_EQ(field(c, kHIDEventFieldDigitizerEventMask), mask[k]);
        EXPECT_EQ(field(c, kHIDEventFieldDigitizerTouch), touch[k]);
        EXPECT_EQ(field(c, kHIDEventFieldDigitizerRange), touch[k]);
        // Exactly these seven fields.
        EXPECT_EQ(c->fields().size(), 7u);
    }
}

TEST(GestureScriptFrames, NothingIsReportedWhileNothingTouches) {
    const FrameRecording r = frames(kSurface +
                                    "0 finger a down at 50 32\n+8 finger a up\n"
                                    "1000 finger a down at 50 32\n+8 finger a up\n");
    const std::vector<HIDEventRef> e = eventsOf(r);
    ASSERT_EQ(e.size(), 4u);
    EXPECT_EQ(e[0]->timestamp(), 1'000'000'000u);
    EXPECT_EQ(e[1]->timestamp(), 1'008'000'000u);
    EXPECT_EQ(e[2]->timestamp(), 2'000'000'000u);
    EXPECT_EQ(e[3]->timestamp(), 2'008'000'000u);
}

TEST(GestureScriptFrames, StatementsTakeEffectInTheFirstFrameAtOrAfterTheirTime) {
    // At 100 Hz frames fall on 0, 10, 20 ms; a touch at 3 ms shows at 10, its lift at 11 at 20.
    const FrameRecording r = frames(kSurface + "rate 100 Hz\nclock 0 ms\n3 finger a down at 50 32\n11 finger a up\n");
    const std::vector<HIDEventRef> e = eventsOf(r);
    ASSERT_EQ(e.size(), 2u);
    EXPECT_EQ(e[0]->timestamp(), 10'000'000u);
    EXPECT_EQ(e[1]->timestamp(), 20'000'000u);
    EXPECT_EQ(field(e[1]->children()[0], kHIDEventFieldDigitizerTouch), 0);
}

TEST(GestureScriptFrames, ContactsTakeTheLowestFreeIndexAndAreReportedInIndexOrder) {
    const FrameRecording r = frames(kSurface +
                                    "0 finger a down at 10 10\n"
                                    "+0 finger b down at 20 20\n"
                                    "+8 finger a up\n"               // 8 ms: a lifts, index 0 still held
                                    "+0 finger c down at 30 30\n"    // so c takes index 2
                                    "+8 finger d down at 40 40\n");  // 16 ms: index 0 is free again
    const std::vector<HIDEventRef> e = eventsOf(r);
    ASSERT_EQ(e.size(), 3u);
    auto indexes = [](const HIDEventRef& f) {
        std::vector<int64_t> out;
        for (const HIDEventRef& c : f->children()) out.push_back(c->integerValueForField(kHIDEventFieldDigitizerIndex));
        return out;
    };
    EXPECT_EQ(indexes(e[0]), (std::vector<int64_t>{0, 1}));
    EXPECT_EQ(indexes(e[1]), (std::vector<int64_t>{0, 1, 2}));
    EXPECT_EQ(indexes(e[2]), (std::vector<int64_t>{0, 1, 2}));
    EXPECT_EQ(field(e[1]->children()[0], kHIDEventFieldDigitizerTouch), 0);  // a, lifted
    EXPECT_EQ(field(e[1]->children()[2], kHIDEventFieldDigitizerEventMask), 7);  // c, new
    EXPECT_EQ(real(e[2]->children()[0], kHIDEventFieldDigitizerX), 0.4);  // d at 40 of 100 mm
    // The parent ORs its children's masks: a lifted (3), b still (0), c new (7).
    EXPECT_EQ(field(e[1], kHIDEventFieldDigitizerEventMask), 7);
    EXPECT_EQ(field(e[1], kHIDEventFieldDigitizerTouch), 1);
}

TEST(GestureScriptFrames, APalmIsTransducerTypeThreeAndAThumbAFinger) {
    const FrameRecording r = frames(kSurface + "0 palm p down at 10 10\n+0 thumb t down at 50 60\n");
    const std::vector<HIDEventRef> e = eventsOf(r);
    ASSERT_EQ(e.size(), 1u);
    EXPECT_EQ(field(e[0]->children()[0], kHIDEventFieldDigitizerType), 3);
    EXPECT_EQ(field(e[0]->children()[1], kHIDEventFieldDigitizerType), 1);
}

TEST(GestureScriptFrames, TheClickIsBitZeroOfTheParentsButtonMask) {
    const FrameRecording r = frames(kSurface +
                                    "0 finger a down at 50 60\n"
                                    "+8 click down\n"
                                    "+16 click up\n"
                                    "+8 finger a up\n");
    const std::vector<HIDEventRef> e = eventsOf(r);
    ASSERT_EQ(e.size(), 5u);
    const int64_t buttons[] = {0, 1, 1, 0, 0};
    for (size_t k = 0; k < e.size(); ++k)
        EXPECT_EQ(field(e[k], kHIDEventFieldDigitizerButtonMask), buttons[k]) << "frame " << k;
}

TEST(GestureScriptFrames, AClickWithNothingTouchingIsReportedWhileHeldAndOnceReleased) {
    const FrameRecording r = frames(kSurface + "0 click down\n+16 click up\n");
    const std::vector<HIDEventRef> e = eventsOf(r);
    ASSERT_EQ(e.size(), 3u);  // 0 and 8 ms held, 16 ms released
    EXPECT_EQ(field(e[0], kHIDEventFieldDigitizerButtonMask), 1);
    EXPECT_EQ(field(e[2], kHIDEventFieldDigitizerButtonMask), 0);
    EXPECT_TRUE(e[2]->children().empty());
    EXPECT_EQ(field(e[2], kHIDEventFieldDigitizerTouch), 0);
}

TEST(GestureScriptFrames, AMoveThatOutlastsTheLastLineLengthensTheSession) {
    const FrameRecording r = frames(kSurface + "0 finger a down at 10 10\n+0 finger a move by 10 0 over 40 ms\n");
    EXPECT_EQ(eventsOf(r).size(), 6u);  // 0 to 40 ms; the finger stays down
}

TEST(GestureScriptFrames, EndKeepsReportingAStillFinger) {
    const FrameRecording r = frames(kSurface + "0 finger a down at 10 10\n100 end\n");
    const std::vector<HIDEventRef> e = eventsOf(r);
    ASSERT_EQ(e.size(), 14u);  // 0, 8, ..., 104: the first frame at or after 100 ms is the 13th after 0
    EXPECT_EQ(field(e.back(), kHIDEventFieldDigitizerEventMask), 0);
}

TEST(GestureScriptFrames, AContactLiftedWhileMovingIsReportedWhereItLifted) {
    // Down at 0 at x = 10, moving 1 mm a millisecond; it lifts at 4 ms (x = 14), which the
    // frame at 8 ms reports, having moved since the frame at 0: mask 3 | 4.
    const FrameRecording r = frames(kSurface + "0 finger a down at 10 10\n+0 finger a move by 20 0 over 20\n+4 finger a up\n");
    const std::vector<HIDEventRef> e = eventsOf(r);
    ASSERT_EQ(e.size(), 2u);
    EXPECT_EQ(real(e[1]->children()[0], kHIDEventFieldDigitizerX), 0.14);
    EXPECT_EQ(field(e[1]->children()[0], kHIDEventFieldDigitizerEventMask), 7);
}

TEST(GestureScriptFrames, BluetoothFramesCarryTheScanTimeLast) {
    // The clock at 6553.6 ms + 0.8 ms: 6554.4 ms = 65544 units of 100 µs, 8 past 65536.
    const FrameRecording r = frames("surface 100 x 64 mm bluetooth\nclock 6554.4 ms\n0 finger a down at 50 32\n+8 finger a up\n");
    const std::vector<HIDEventRef> e = eventsOf(r);
    ASSERT_EQ(e.size(), 2u);
    const uint16_t expected[] = {8, 88};  // 65544 mod 65536, then 80 units (8 ms) later
    for (size_t k = 0; k < 2; ++k) {
        ASSERT_EQ(e[k]->children().size(), 2u);
        const HIDEventRef& scan = e[k]->children()[1];
        EXPECT_EQ(scan->type(), kHIDEventTypeVendorDefined);
        EXPECT_EQ(field(scan, kHIDEventFieldVendorDefinedUsagePage), 13);
        EXPECT_EQ(field(scan, kHIDEventFieldVendorDefinedUsage), 86);
        EXPECT_EQ(field(scan, kHIDEventFieldVendorDefinedDataLength), 2);
        const std::vector<uint8_t>& bytes = scan->dataValueForField(kHIDEventFieldVendorDefinedData);
        ASSERT_EQ(bytes.size(), 2u);
        uint16_t count = 0;
        std::memcpy(&count, bytes.data(), 2);  // the host's byte order
        EXPECT_EQ(count, expected[k]);
    }
    EXPECT_EQ(e[0]->timestamp(), 6'554'400'000u);
}

// ---------------------------------------------------------------------------------------
// The bundled demonstration

TEST(GestureScriptDemo, TheBundledFramesAreTheScriptsConversion) {
    const std::string script = tooltest::readFile(ORVANE_TEST_DEMO_SCRIPT);
    ASSERT_TRUE(isGestureScript(script));
    FrameRecording recording;
    std::string message;
    ASSERT_TRUE(readGestureScript(script, "demo.gestures", &recording, &message)) << message;
    std::ostringstream converted;
    formats::writeFrameRecording(converted, recording);
    std::string committed;
    for (const std::string& line : tooltest::lines(tooltest::readFile(tooltest::kDemoRecording)))
        if (!line.empty() && line[0] != '#') committed += line + "\n";
    EXPECT_TRUE(converted.str() == committed)
        << "data/demo.frames.jsonl is not the conversion of data/demo.gestures; run tools/scripts/make_demo_frames.sh";
}

}  // namespace
}  // namespace orvane::script
