// The evemu reader: what it takes from each kind of line, and every line it refuses, with
// the file and line it names.

#include <gtest/gtest.h>

#include <string>

#include "tools/evemu/EvdevCodes.h"
#include "tools/evemu/EvemuParser.h"

namespace orvane::evemu {
namespace {

EvemuFile parsed(const std::string& text) {
    EvemuFile file;
    std::string error;
    EXPECT_TRUE(parseEvemu(text, "pad.evemu", &file, &error)) << error;
    return file;
}

std::string refused(const std::string& text) {
    EvemuFile file;
    std::string error;
    EXPECT_FALSE(parseEvemu(text, "pad.evemu", &file, &error)) << text;
    return error;
}

TEST(EvemuParser, ReadsEveryDescriptionLine) {
    const EvemuFile f = parsed(
        "# EVEMU 1.3\n"
        "N: SynPS/2 Synaptics TouchPad  \n"
        "I: 0011 0002 0007 01b1\n"
        "P: 05 00 00 00 00 00 00 00\n"
        "B: 01 00 00 00 00 00 00 00 00\n"
        "B: 01 00 00 00 00 00 00 00 00\n"
        "B: 01 00 00 00 00 00 00 00 00\n"
        "B: 01 00 00 00 00 00 00 00 00\n"
        "B: 01 00 00 01 00 00 00 00 00\n"
        "A: 35 1472 5472 8 0 42\n"
        "A: 36 -100 4448 8 0\n"
        "L: 00 1\n"
        "S: 00 0\n");
    EXPECT_EQ(f.firstDescriptionLine, 2u);
    EXPECT_EQ(f.nameLine, 2u);
    EXPECT_EQ(f.identityLine, 3u);
    EXPECT_EQ(f.device.name, "SynPS/2 Synaptics TouchPad");  // blanks at the end dropped
    EXPECT_EQ(f.device.bus, 0x11);
    EXPECT_EQ(f.device.vendor, 0x2);
    EXPECT_EQ(f.device.product, 0x7);
    EXPECT_EQ(f.device.version, 0x1b1);
    // P: 05 is bits 0 and 2: INPUT_PROP_POINTER and INPUT_PROP_BUTTONPAD.
    EXPECT_TRUE(f.device.hasProperty(0));
    EXPECT_FALSE(f.device.hasProperty(1));
    EXPECT_TRUE(f.device.hasProperty(kInputPropButtonpad));
    EXPECT_FALSE(f.device.hasProperty(kInputPropSemiMt));
    // The five B: 01 lines add up to 40 bytes; byte 34 bit 0 is code 34 * 8 = 0x110.
    EXPECT_TRUE(f.device.hasCode(kEvKey, kBtnLeft));
    EXPECT_FALSE(f.device.hasCode(kEvKey, kBtnRight));
    EXPECT_FALSE(f.device.hasCode(kEvAbs, 0));
    ASSERT_NE(f.device.axis(kAbsMtPositionX), nullptr);
    EXPECT_EQ(f.device.axis(kAbsMtPositionX)->minimum, 1472);
    EXPECT_EQ(f.device.axis(kAbsMtPositionX)->maximum, 5472);
    EXPECT_EQ(f.device.axis(kAbsMtPositionX)->fuzz, 8);
    EXPECT_EQ(f.device.axis(kAbsMtPositionX)->resolution, 42);
    ASSERT_NE(f.device.axis(kAbsMtPositionY), nullptr);
    EXPECT_EQ(f.device.axis(kAbsMtPositionY)->minimum, -100);
    EXPECT_EQ(f.device.axis(kAbsMtPositionY)->resolution, 0);  // not given
    EXPECT_EQ(f.axisLines.at(kAbsMtPositionY), 11u);
    EXPECT_TRUE(f.events.empty());
}

TEST(EvemuParser, ReadsEventsWithTheirTimesLinesAndComments) {
    const EvemuFile f = parsed(
        "E: 0.000000 0003 0039 0007\t# EV_ABS / ABS_MT_TRACKING_ID   7\n"
        "\n"
        "# a comment between events\n"
        "E: 1329461875.832049 0001 014a 1\n"
        "E: 1329461875.832049 3 39 -001\n"
        "  E: 1329461875.900000 0004 0005 -2147483648\r\n");
    ASSERT_EQ(f.events.size(), 4u);
    EXPECT_FALSE(f.hasDescription());
    EXPECT_EQ(f.events[0].time_ns, 0u);
    EXPECT_EQ(f.events[0].type, kEvAbs);
    EXPECT_EQ(f.events[0].code, kAbsMtTrackingId);
    EXPECT_EQ(f.events[0].value, 7);  // values are decimal
    // 1329461875 s and 832049 us: 1329461875 * 10^9 + 832049 * 10^3 ns.
    EXPECT_EQ(f.events[1].time_ns, 1329461875832049000u);
    EXPECT_EQ(f.events[1].code, 0x14a);
    EXPECT_EQ(f.events[1].value, 1);
    EXPECT_EQ(f.events[2].code, 0x39);  // hex codes may be written short
    EXPECT_EQ(f.events[2].value, -1);
    EXPECT_EQ(f.events[3].time_ns, 1329461875900000000u);
    EXPECT_EQ(f.events[3].value, -2147483647 - 1);
    EXPECT_EQ(f.eventLines, (std::vector<size_t>{1, 4, 5, 6}));
}

TEST(EvemuParser, TakesTheLargestTimeThatFitsInNanoseconds) {
    // 18446744072 s + 999999 us = 18446744072999999000 ns, below 2^64 = 18446744073709551616.
    const EvemuFile f = parsed("E: 18446744072.999999 0000 0000 0000\n");
    EXPECT_EQ(f.events.at(0).time_ns, 18446744072999999000u);
    EXPECT_EQ(refused("E: 18446744073.000000 0000 0000 0000\n"),
              "pad.evemu:1: the time of E: must be seconds and six digits of microseconds (1.000250), not "
              "\"18446744073.000000\"");
}

struct Refusal {
    const char* text;
    const char* error;
};

class EvemuParserRefuses : public ::testing::TestWithParam<Refusal> {};

TEST_P(EvemuParserRefuses, NamingTheFileTheLineAndWhatIsWrong) {
    EXPECT_EQ(refused(GetParam().text), GetParam().error);
}

INSTANTIATE_TEST_SUITE_P(
    EvemuEveryMalformedLine, EvemuParserRefuses,
    ::testing::Values(
        Refusal{"N: pad\nhello\n",
                "pad.evemu:2: not an evemu line: \"hello\" (expected N:, I:, P:, B:, A:, L:, S:, E: or a # comment)"},
        Refusal{"X: 1\n", "pad.evemu:1: not an evemu line: \"X: 1\" (expected N:, I:, P:, B:, A:, L:, S:, E: or a # "
                          "comment)"},
        Refusal{"E:0.000000 0000 0000 0000\n",
                "pad.evemu:1: not an evemu line: \"E:0.000000 0000 0000 0000\" (expected N:, I:, P:, B:, A:, L:, S:, "
                "E: or a # comment)"},
        Refusal{"N: a\nN: b\n", "pad.evemu:2: a second N: line (the first is line 1)"},
        Refusal{"I: 0011 0002 0007 01b1\nI: 0011 0002 0007 01b1\n",
                "pad.evemu:2: a second I: line (the first is line 1)"},
        Refusal{"I: 0011 0002 0007\n", "pad.evemu:1: I: needs four hex numbers: bus, vendor, product and version"},
        Refusal{"I: 0011 00g2 0007 0000\n",
                "pad.evemu:1: the vendor of I: must be a hex number of up to four digits, not \"00g2\""},
        Refusal{"I: 10011 0002 0007 0000\n",
                "pad.evemu:1: the bus of I: must be a hex number of up to four digits, not \"10011\""},
        Refusal{"P: 5 00\n", "pad.evemu:1: the bytes of P: are two hex digits each, not \"5\""},
        Refusal{"P:\n", "pad.evemu:1: P: needs at least one byte (two hex digits)"},
        Refusal{"P: 00 00 00 00 00 00 00 00\nP: 00 00 00 00 00 00 00 00\nP: 00 00 00 00 00 00 00 00\n"
                "P: 00 00 00 00 00 00 00 00\nP: 00 00 00 00 00 00 00 00\nP: 00 00 00 00 00 00 00 00\n"
                "P: 00 00 00 00 00 00 00 00\nP: 00 00 00 00 00 00 00 00\nP: 00\n",
                "pad.evemu:9: P: has more than 64 bytes"},
        Refusal{"B: 20 00\n", "pad.evemu:1: B: starts with the event type, two hex digits from 00 to 1f, not \"20\""},
        Refusal{"B:\n", "pad.evemu:1: B: starts with the event type, two hex digits from 00 to 1f, not nothing"},
        Refusal{"B: 03\n", "pad.evemu:1: B: needs at least one byte (two hex digits)"},
        Refusal{"B: 03 0x\n", "pad.evemu:1: the bytes of B: are two hex digits each, not \"0x\""},
        Refusal{"A: 35 0 1000 0\n",
                "pad.evemu:1: A: needs the axis code and its minimum, maximum, fuzz, flat and, where known, "
                "resolution"},
        Refusal{"A: 40 0 1000 0 0\n", "pad.evemu:1: the axis code of A: must be a hex number from 00 to 3f, not \"40\""},
        Refusal{"A: 35 0 1e3 0 0\n",
                "pad.evemu:1: the maximum of A: ABS_MT_POSITION_X must be a decimal number, not \"1e3\""},
        Refusal{"A: 35 0 2147483648 0 0\n",
                "pad.evemu:1: the maximum of A: ABS_MT_POSITION_X must be a decimal number, not \"2147483648\""},
        Refusal{"A: 36 10 9 0 0\n", "pad.evemu:1: A: ABS_MT_POSITION_Y has its minimum 10 above its maximum 9"},
        Refusal{"A: 36 0 9 0 0 -1\n", "pad.evemu:1: A: ABS_MT_POSITION_Y has a negative resolution -1"},
        Refusal{"A: 2f 0 1 0 0\n# again\nA: 2f 0 3 0 0\n",
                "pad.evemu:3: a second A: line for ABS_MT_SLOT (the first is line 1)"},
        Refusal{"L: 00\n", "pad.evemu:1: L: needs a hex code and a decimal value"},
        Refusal{"S: 00 x\n", "pad.evemu:1: S: needs a hex code and a decimal value"},
        Refusal{"E: 0.000000 0000 0000\n",
                "pad.evemu:1: E: needs the time (seconds.microseconds), type, code and value"},
        Refusal{"E: 0.000000 0000 0000 0000 0000\n",
                "pad.evemu:1: E: needs the time (seconds.microseconds), type, code and value"},
        Refusal{"E: 1.25 0000 0000 0000\n",
                "pad.evemu:1: the time of E: must be seconds and six digits of microseconds (1.000250), not \"1.25\""},
        Refusal{"E: .000000 0000 0000 0000\n",
                "pad.evemu:1: the time of E: must be seconds and six digits of microseconds (1.000250), not "
                "\".000000\""},
        Refusal{"E: -1.000000 0000 0000 0000\n",
                "pad.evemu:1: the time of E: must be seconds and six digits of microseconds (1.000250), not "
                "\"-1.000000\""},
        Refusal{"E: 1.00000a 0000 0000 0000\n",
                "pad.evemu:1: the time of E: must be seconds and six digits of microseconds (1.000250), not "
                "\"1.00000a\""},
        Refusal{"E: 1.000000 0020 0000 0000\n",
                "pad.evemu:1: the type of E: must be a hex number from 0000 to 001f, not \"0020\""},
        Refusal{"E: 1.000000 0003 0300 0000\n",
                "pad.evemu:1: the code of E: must be a hex number from 0000 to 02ff, not \"0300\""},
        Refusal{"E: 1.000000 0003 00035 0000\n",
                "pad.evemu:1: the code of E: must be a hex number from 0000 to 02ff, not \"00035\""},
        Refusal{"E: 1.000000 0003 0035 0x10\n",
                "pad.evemu:1: the value of E: must be a decimal 32-bit number, not \"0x10\""},
        Refusal{"E: 1.000000 0003 0035 2147483648\n",
                "pad.evemu:1: the value of E: must be a decimal 32-bit number, not \"2147483648\""},
        Refusal{"E: 1.000000 0003 0035 -\n", "pad.evemu:1: the value of E: must be a decimal 32-bit number, not \"-\""},
        Refusal{"E: 1.000000 0003 0035 +5\n",
                "pad.evemu:1: the value of E: must be a decimal 32-bit number, not \"+5\""},
        Refusal{"E: 2.000000 0000 0000 0000\nE: 1.999999 0000 0000 0000\n",
                "pad.evemu:2: the time 1.999999 goes back before the previous event's (line 1)"},
        Refusal{"E: 1.000000 0000 0000 0000\nA: 35 0 1000 0 0\n",
                "pad.evemu:2: a description line (A:) after the events; the description comes first"}));

TEST(EvemuParser, ControlCharactersInAQuotedLineAreShownAsQuestionMarks) {
    EXPECT_EQ(refused(std::string("Z:\x01\x7f\n")),
              "pad.evemu:1: not an evemu line: \"Z:??\" (expected N:, I:, P:, B:, A:, L:, S:, E: or a # comment)");
}

}  // namespace
}  // namespace orvane::evemu
