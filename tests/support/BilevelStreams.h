// Bi-level coded blocks for tests and benchmarks: pages of black and white pixels, and an encoder of the
// facsimile coding NITF "C1" images use (one-dimensional lines, and two-dimensional lines with tag bits and a
// K factor), written from the coding rules alone; only the code word tables are the library's.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

namespace bileveltest {

// Pixels row by row, 0 white and 1 black.
struct Page {
    int width = 0;
    int height = 0;
    std::vector<uint8_t> pixels;

    const uint8_t* row(int r) const { return pixels.data() + static_cast<size_t>(r) * width; }
    uint8_t& at(int r, int c) { return pixels[static_cast<size_t>(r) * width + c]; }
};

// A typed page: lines of glyph-like black marks on white, a frame, and a dithered patch.
Page documentPage(int width, int height, unsigned seed);
// Every pixel black with a chance of `percent` in 100.
Page noisePage(int width, int height, int percent, unsigned seed);

// Bits in the order they are sent; bytes() pads the last byte with 0 bits.
class BitWriter {
public:
    void put(const std::string& code);
    void zeros(int count) { m_bits.insert(m_bits.end(), count, false); }
    size_t size() const { return m_bits.size(); }
    std::string bytes() const;

private:
    std::vector<bool> m_bits;
};

struct Coding {
    int k = 1; // 1: one-dimensional lines without tag bits ("1D"); 2, 4, ...: tag bits, every k-th line 1-D
    int fill = 0;    // 0 bits before every EOL
    int rtcEols = 6; // EOLs after the last line
};

void putRun(BitWriter& out, int run, bool black);
void putEol(BitWriter& out, const Coding& coding, bool oneDimensionalNext);
void putLine1D(BitWriter& out, const uint8_t* line, int width);
// `reference` null: an all-white reference line.
void putLine2D(BitWriter& out, const uint8_t* reference, const uint8_t* line, int width);
// The page as one coded block: EOL before every line, the RTC, padding to a whole byte.
std::string encode(const Page& page, const Coding& coding);

// One byte (0 or 1) per pixel, row by row: the corpus manifest's canonical form of a one-bit band.
std::string canonical(const Page& page);
// The same for `rows` rows of `width` pixels out of a bit stream, row r from bit firstBit + r x lineBits.
std::string canonicalBits(const unsigned char* bits, uint64_t firstBit, int width, int rows,
                          uint64_t lineBits);

} // namespace bileveltest
