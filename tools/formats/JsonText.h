#pragma once
// The low-level pieces every JSON writer of the tools shares: numbers and strings
// written the same way everywhere, so that streams compare line by line.

#include <cstdint>
#include <string>
#include <string_view>

namespace orvane::formats {

// A double as a JSON token: the fewest digits that read back to the same double, always
// with a '.' or an exponent ("0.0", "0.1", "1e+300"); non-finite values are the strings
// "NaN", "Infinity" and "-Infinity" (with their quotes).
std::string formatJsonDouble(double value);
void appendJsonDouble(std::string& out, double value);

void appendJsonInteger(std::string& out, int64_t value);
void appendJsonUnsigned(std::string& out, uint64_t value);

// A JSON string with its quotes. Control characters are escaped; bytes that are not
// valid UTF-8 become U+FFFD, so the output is always valid JSON.
void appendJsonString(std::string& out, std::string_view text);
std::string jsonString(std::string_view text);

// Bytes as lowercase hex, two digits per byte, in memory order.
void appendHex(std::string& out, const uint8_t* bytes, size_t length);

}  // namespace orvane::formats
