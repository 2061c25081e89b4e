// Bit streams, most significant bit first: how samples of depths that are not whole bytes (1, 4, 12, ...)
// are stored, and how bi-level images are delivered.
#pragma once

#include <cstdint>
#include <cstring>

namespace packedbits {

inline bool getBit(const unsigned char* data, uint64_t bit) {
    return (data[bit >> 3] >> (7 - (bit & 7))) & 1;
}

inline void putBit(unsigned char* data, uint64_t bit, bool value) {
    const unsigned char mask = static_cast<unsigned char>(0x80 >> (bit & 7));
    if (value)
        data[bit >> 3] |= mask;
    else
        data[bit >> 3] &= static_cast<unsigned char>(~mask);
}

// Copies `count` bits between arbitrary bit positions; whole destination bytes are assembled at once.
inline void copyBits(unsigned char* dst, uint64_t dstBit, const unsigned char* src, uint64_t srcBit,
                     uint64_t count) {
    for (; count > 0 && (dstBit & 7) != 0; --count)
        putBit(dst, dstBit++, getBit(src, srcBit++));
    unsigned char* out = dst + (dstBit >> 3);
    const unsigned char* in = src + (srcBit >> 3);
    const unsigned shift = srcBit & 7;
    const uint64_t bytes = count >> 3;
    if (shift == 0) {
        std::memcpy(out, in, bytes);
    } else {
        // The last byte assembled needs the first bits of in[bytes], which still belong to the copied range.
        for (uint64_t i = 0; i < bytes; ++i)
            out[i] = static_cast<unsigned char>((in[i] << shift) | (in[i + 1] >> (8 - shift)));
    }
    dstBit += bytes << 3;
    srcBit += bytes << 3;
    for (count &= 7; count > 0; --count)
        putBit(dst, dstBit++, getBit(src, srcBit++));
}

inline void setBits(unsigned char* data, uint64_t bit, uint64_t count, bool value) {
    for (; count > 0 && (bit & 7) != 0; --count)
        putBit(data, bit++, value);
    std::memset(data + (bit >> 3), value ? 0xFF : 0, count >> 3);
    bit += count & ~uint64_t(7);
    for (count &= 7; count > 0; --count)
        putBit(data, bit++, value);
}

inline void invertBits(unsigned char* data, uint64_t bit, uint64_t count) {
    for (; count > 0 && (bit & 7) != 0; --count, ++bit)
        putBit(data, bit, !getBit(data, bit));
    for (uint64_t i = 0; i < (count >> 3); ++i)
        data[(bit >> 3) + i] = static_cast<unsigned char>(~data[(bit >> 3) + i]);
    bit += count & ~uint64_t(7);
    for (count &= 7; count > 0; --count, ++bit)
        putBit(data, bit, !getBit(data, bit));
}

// The `bits`-bit value (1 to 64 bits) at bit position `bit`.
inline uint64_t readValue(const unsigned char* data, uint64_t bit, int bits) {
    const uint64_t first = bit >> 3, last = (bit + bits - 1) >> 3;
    unsigned __int128 window = 0;
    for (uint64_t i = first; i <= last; ++i)
        window = (window << 8) | data[i];
    const unsigned shift = static_cast<unsigned>((last + 1) * 8 - (bit + bits));
    const uint64_t mask = bits >= 64 ? ~uint64_t(0) : (uint64_t(1) << bits) - 1;
    return static_cast<uint64_t>(window >> shift) & mask;
}

inline unsigned char* bytes(char* data) {
    return reinterpret_cast<unsigned char*>(data);
}
inline const unsigned char* bytes(const char* data) {
    return reinterpret_cast<const unsigned char*>(data);
}

} // namespace packedbits
