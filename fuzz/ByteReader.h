#pragma once
// Takes values off the front of a fuzz input. Once the input is used up every read gives 0,
// so a decoder never fails: short inputs simply make short sessions.

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <vector>

namespace orvane::fuzz {

class ByteReader {
public:
    ByteReader(const uint8_t* data, size_t size) : data_(data), size_(size) {}

    bool empty() const { return pos_ >= size_; }
    size_t remaining() const { return empty() ? 0 : size_ - pos_; }

    uint8_t u8() { return empty() ? 0 : data_[pos_++]; }
    uint16_t u16() { return static_cast<uint16_t>(u8() | (u8() << 8)); }
    uint32_t u32() { return static_cast<uint32_t>(u16()) | static_cast<uint32_t>(u16()) << 16; }
    uint64_t u64() { return static_cast<uint64_t>(u32()) | static_cast<uint64_t>(u32()) << 32; }
    int32_t i32() { return static_cast<int32_t>(u32()); }
    int64_t i64() { return static_cast<int64_t>(u64()); }
    bool flag() { return (u8() & 1) != 0; }
    // A double from any eight bytes: every bit pattern, NaNs and infinities included.
    double rawDouble() {
        const uint64_t bits = u64();
        double d;
        std::memcpy(&d, &bits, sizeof d);
        return d;
    }
    std::vector<uint8_t> bytes(size_t n) {
        std::vector<uint8_t> out;
        out.reserve(n);
        for (size_t i = 0; i < n && !empty(); ++i) out.push_back(u8());
        return out;
    }

private:
    const uint8_t* data_;
    size_t size_;
    size_t pos_ = 0;
};

}  // namespace orvane::fuzz
