// A small reader over a fuzz input. Every read succeeds: past the end it yields zeros, so any
// byte string decodes to some sequence of calls. The encodings favour the values the server
// cares about (0, -1, small tags, known command ids) and keep a path to every 32-bit value.
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <string>

namespace velmora {
namespace fuzz {

class FuzzInput {
public:
    FuzzInput(const uint8_t* data, size_t size) : mData(data), mSize(size) {}

    bool empty() const { return mPos >= mSize; }

    uint8_t byte() { return mPos < mSize ? mData[mPos++] : 0; }

    uint16_t u16() {
        const uint16_t lo = byte();
        return static_cast<uint16_t>(lo | (byte() << 8));
    }

    int32_t raw32() {
        uint32_t v = 0;
        for (int i = 0; i < 4; ++i) {
            v |= static_cast<uint32_t>(byte()) << (8 * i);
        }
        int32_t out;
        memcpy(&out, &v, sizeof(out));
        return out;
    }

    // One byte: -127..127 as a signed value; 0x80 announces a raw 32-bit value.
    int32_t integer() {
        const uint8_t b = byte();
        if (b == 0x80) {
            return raw32();
        }
        return static_cast<int8_t>(b);
    }

    // Length byte then that many bytes (fewer at the end of the input).
    std::string shortString() { return bytes(byte()); }

    // Little-endian 16-bit length then that many bytes.
    std::string longString() { return bytes(u16()); }

    // A command id: even selectors pick from `known`, odd ones read a raw value.
    int32_t pick(const int32_t* known, size_t count) {
        const uint8_t sel = byte();
        if ((sel & 1) == 0) {
            return known[(sel >> 1) % count];
        }
        return raw32();
    }

private:
    std::string bytes(size_t n) {
        const size_t take = n < mSize - mPos ? n : mSize - mPos;
        std::string out(reinterpret_cast<const char*>(mData + mPos), take);
        mPos += take;
        return out;
    }

    const uint8_t* mData;
    size_t mSize;
    size_t mPos = 0;
};

}  // namespace fuzz
}  // namespace velmora
