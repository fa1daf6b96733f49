#include "tools/formats/JsonText.h"

#include <gtest/gtest.h>

#include <cmath>
#include <cstdlib>
#include <cstring>
#include <limits>

namespace orvane::formats {
namespace {

TEST(JsonText, DoublesUseTheFewestDigitsThatReadBack) {
    EXPECT_EQ(formatJsonDouble(0.1), "0.1");
    EXPECT_EQ(formatJsonDouble(0.25), "0.25");
    EXPECT_EQ(formatJsonDouble(1.0 / 3.0), "0.3333333333333333");
    EXPECT_EQ(formatJsonDouble(0.1 + 0.2), "0.30000000000000004");
}

TEST(JsonText, WholeDoublesKeepAPoint) {
    EXPECT_EQ(formatJsonDouble(1.0), "1.0");
    EXPECT_EQ(formatJsonDouble(0.0), "0.0");
    EXPECT_EQ(formatJsonDouble(-0.0), "-0.0");
    EXPECT_EQ(formatJsonDouble(-42.0), "-42.0");
    EXPECT_EQ(formatJsonDouble(100000.0), "100000.0");
    EXPECT_EQ(formatJsonDouble(1e15), "1000000000000000.0");
    EXPECT_EQ(formatJsonDouble(123.456), "123.456");
    EXPECT_EQ(formatJsonDouble(0.0001), "0.0001");
}

TEST(JsonText, LargeAndSmallDoublesUseAnExponent) {
    EXPECT_EQ(formatJsonDouble(1e300), "1e+300");
    EXPECT_EQ(formatJsonDouble(1e-7), "1e-07");
    EXPECT_EQ(formatJsonDouble(1e16), "1e+16");
    EXPECT_EQ(formatJsonDouble(-1.5e-5), "-1.5e-05");
    EXPECT_EQ(formatJsonDouble(1.7976931348623157e308), "1.7976931348623157e+308");
    EXPECT_EQ(formatJsonDouble(std::numeric_limits<double>::denorm_min()), "5e-324");
    EXPECT_EQ(std::stod(formatJsonDouble(std::numeric_limits<double>::max())), std::numeric_limits<double>::max());
}

TEST(JsonText, EveryDoubleReadsBackExactly) {
    uint64_t bits = 0x0123456789abcdefull;
    for (int i = 0; i < 20000; ++i) {
        bits = bits * 6364136223846793005ull + 1442695040888963407ull;
        double v;
        std::memcpy(&v, &bits, sizeof v);
        if (!std::isfinite(v)) continue;
        const std::string text = formatJsonDouble(v);
        ASSERT_EQ(std::strtod(text.c_str(), nullptr), v) << text;
        ASSERT_NE(text.find_first_of(".e"), std::string::npos) << text;
    }
}

TEST(JsonText, NonFiniteDoublesAreStrings) {
    EXPECT_EQ(formatJsonDouble(std::numeric_limits<double>::quiet_NaN()), "\"NaN\"");
    EXPECT_EQ(formatJsonDouble(std::numeric_limits<double>::infinity()), "\"Infinity\"");
    EXPECT_EQ(formatJsonDouble(-std::numeric_limits<double>::infinity()), "\"-Infinity\"");
}

TEST(JsonText, StringsEscapeQuotesBackslashesAndControlCharacters) {
    EXPECT_EQ(jsonString("a\"b\\c"), "\"a\\\"b\\\\c\"");
    EXPECT_EQ(jsonString("line\nnext\ttab"), "\"line\\nnext\\ttab\"");
    EXPECT_EQ(jsonString(std::string("\x01", 1)), "\"\\u0001\"");
}

TEST(JsonText, StringsKeepUtf8AndReplaceInvalidBytes) {
    EXPECT_EQ(jsonString("caf\xc3\xa9"), "\"caf\xc3\xa9\"");
    EXPECT_EQ(jsonString("bad\xff"), "\"bad\xef\xbf\xbd\"");
    EXPECT_EQ(jsonString("\xc3"), "\"\xef\xbf\xbd\"");
}

TEST(JsonText, BytesAreLowercaseHexInMemoryOrder) {
    const uint8_t bytes[] = {0x00, 0xab, 0x10, 0xff};
    std::string s;
    appendHex(s, bytes, sizeof bytes);
    EXPECT_EQ(s, "00ab10ff");
}

}  // namespace
}  // namespace orvane::formats
