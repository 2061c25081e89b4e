// Bit ranges of most-significant-bit-first bit streams: the packed samples of depths that are not whole
// bytes, and the image-wide bitmaps of bi-level images, which the uncompressed and the bi-level sources
// share.
#pragma once

#include <algorithm>
#include <cmath>
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

// Sets (or clears) `count` bits from `bit` on, leaving the bits around them alone: the partial bytes at the
// ends through masks, the whole bytes between them with one memset. Decoders call it for every run: forced
// inline, so the call does not go through the shared library's symbol table.
__attribute__((always_inline)) inline void setBits(unsigned char* data, uint64_t bit, uint64_t count,
                                                   bool value) {
    if (count == 0)
        return;
    const uint64_t first = bit >> 3, last = (bit + count - 1) >> 3;
    const unsigned char head = static_cast<unsigned char>(0xFF >> (bit & 7));
    const unsigned char tail = static_cast<unsigned char>(0xFF << (7 - ((bit + count - 1) & 7)));
    auto apply = [&](uint64_t index, unsigned char mask) {
        if (value)
            data[index] |= mask;
        else
            data[index] &= static_cast<unsigned char>(~mask);
    };
    if (first == last) {
        apply(first, head & tail);
        return;
    }
    apply(first, head);
    std::memset(data + first + 1, value ? 0xFF : 0, last - first - 1);
    apply(last, tail);
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

// Cuts a region out of an image-wide bitmap of `rowBits` x `rows` bits into `buffer`, output row i at bit
// i x outWidthBits: `width` bits from column x0 of source row floor(i x srcRows / outRows) + y0
// (nearest-lower row sampling; columns are not resampled), the rest of the output row cleared; with `invert`
// every output bit is inverted. False, with nothing written, when the region is not inside the bitmap.
inline bool cutBitmap(const unsigned char* bitmap, long long rowBits, long long rows, unsigned char* buffer,
                      int x0, int y0, int width, int srcRows, int outWidthBits, int outRows, bool invert) {
    if (!bitmap || !buffer || x0 < 0 || y0 < 0 || width < 0 || outWidthBits < width || outRows < 0 ||
        x0 + static_cast<long long>(width) > rowBits)
        return false;
    const double ratio = outRows > 0 ? static_cast<double>(srcRows) / outRows : 0.0;
    auto sourceRow = [&](int i) { return static_cast<long long>(std::floor(i * ratio)) + y0; };
    if (outRows > 0) {
        const long long firstRow = sourceRow(0), lastRow = sourceRow(outRows - 1);
        if (std::min(firstRow, lastRow) < 0 || std::max(firstRow, lastRow) >= rows)
            return false;
    }
    for (int i = 0; i < outRows; ++i) {
        const uint64_t dstBit = static_cast<uint64_t>(i) * outWidthBits;
        copyBits(buffer, dstBit, bitmap, sourceRow(i) * rowBits + x0, width);
        setBits(buffer, dstBit + width, outWidthBits - width, false);
        if (invert)
            invertBits(buffer, dstBit, outWidthBits);
    }
    return true;
}

} // namespace packedbits
