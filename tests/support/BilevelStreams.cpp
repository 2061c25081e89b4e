#include "BilevelStreams.h"

#include <algorithm>
#include <cstdlib>

#include "BiLevelHuffman.h"

namespace bileveltest {

namespace {

unsigned nextRandom(unsigned& state) {
    state = state * 1103515245u + 12345u;
    return state >> 16;
}

// The positions where a line changes colour (an imaginary white pixel precedes it).
std::vector<int> changes(const uint8_t* line, int width) {
    std::vector<int> positions;
    uint8_t previous = 0;
    for (int c = 0; line && c < width; previous = line[c++])
        if (line[c] != previous)
            positions.push_back(c);
    return positions;
}

} // namespace

Page documentPage(int width, int height, unsigned seed) {
    Page page{width, height, std::vector<uint8_t>(static_cast<size_t>(width) * height, 0)};
    for (int r = 0; r < height; ++r)
        for (int c = 0; c < width; ++c)
            if (r < 3 || c < 3 || r >= height - 3 || c >= width - 3)
                page.at(r, c) = 1;
    // Text lines of marks 2 to 17 pixels wide, 3 to 11 apart.
    for (int top = 12; top + 14 < height; top += 24)
        for (int c = 10; c < width - 30;) {
            const int w = 2 + nextRandom(seed) % 16, h = 6 + nextRandom(seed) % 9;
            for (int r = top + 14 - h; r < top + 14; ++r)
                for (int x = c; x < c + w; ++x)
                    page.at(r, x) = 1;
            c += w + 3 + nextRandom(seed) % 9;
        }
    // A dithered patch in the lower right quarter.
    for (int r = height / 2; r < height - 10; ++r)
        for (int c = width / 2; c < width - 10; ++c)
            page.at(r, c) = ((r * 7 + c * 3) % 11 < (c - width / 2) % 11) ? 1 : 0;
    return page;
}

Page noisePage(int width, int height, int percent, unsigned seed) {
    Page page{width, height, std::vector<uint8_t>(static_cast<size_t>(width) * height)};
    for (uint8_t& pixel : page.pixels)
        pixel = static_cast<int>(nextRandom(seed) % 100) < percent ? 1 : 0;
    return page;
}

void BitWriter::put(const std::string& code) {
    for (char bit : code)
        m_bits.push_back(bit == '1');
}

std::string BitWriter::bytes() const {
    std::string out((m_bits.size() + 7) / 8, '\0');
    for (size_t i = 0; i < m_bits.size(); ++i)
        if (m_bits[i])
            out[i / 8] = static_cast<char>(out[i / 8] | (0x80 >> (i % 8)));
    return out;
}

// Make-up codes (the extended ones beyond 1728, 2560 as often as needed), then one terminating code.
void putRun(BitWriter& out, int run, bool black) {
    for (; run >= 2624; run -= 2560)
        out.put(BiLevelHuffman::kExtendedMakeUp[12]);
    if (run >= 64) {
        const int units = run / 64;
        out.put(units <= 27 ? (black ? BiLevelHuffman::kBlackMakeUp : BiLevelHuffman::kWhiteMakeUp)[units - 1]
                            : BiLevelHuffman::kExtendedMakeUp[units - 28]);
        run -= 64 * units;
    }
    out.put((black ? BiLevelHuffman::kBlackTerminating : BiLevelHuffman::kWhiteTerminating)[run]);
}

void putEol(BitWriter& out, const Coding& coding, bool oneDimensionalNext) {
    out.zeros(coding.fill);
    out.put(BiLevelHuffman::kEol);
    if (coding.k > 1)
        out.put(oneDimensionalNext ? "1" : "0");
}

void putLine1D(BitWriter& out, const uint8_t* line, int width) {
    bool black = false;
    for (int c = 0; c < width; black = !black) {
        int end = c;
        while (end < width && line[end] == (black ? 1 : 0))
            ++end;
        putRun(out, end - c, black);
        c = end;
    }
}

// a0, a1, a2 on the coding line and b1, b2 on the reference line, as the coding rules define them.
void putLine2D(BitWriter& out, const uint8_t* reference, const uint8_t* line, int width) {
    const std::vector<int> coding = changes(line, width), above = changes(reference, width);
    auto at = [width](const std::vector<int>& positions, size_t i) {
        return i < positions.size() ? positions[i] : width;
    };
    int a0 = -1;
    uint8_t colour = 0;
    while (a0 < width) {
        const size_t i = std::upper_bound(coding.begin(), coding.end(), a0) - coding.begin();
        size_t j = std::upper_bound(above.begin(), above.end(), a0) - above.begin();
        if (j < above.size() && reference[above[j]] == colour)
            ++j; // b1 is a change to the colour opposite a0's
        const int a1 = at(coding, i), a2 = at(coding, i + 1), b1 = at(above, j), b2 = at(above, j + 1);
        if (b2 < a1) {
            out.put(BiLevelHuffman::kPass);
            a0 = b2;
        } else if (std::abs(a1 - b1) <= 3) {
            out.put(BiLevelHuffman::kVertical[a1 - b1 + 3]);
            a0 = a1;
            colour ^= 1;
        } else {
            out.put(BiLevelHuffman::kHorizontal);
            putRun(out, a1 - std::max(a0, 0), colour != 0);
            putRun(out, a2 - a1, colour == 0);
            a0 = a2;
        }
    }
}

std::string encode(const Page& page, const Coding& coding) {
    BitWriter out;
    for (int r = 0; r < page.height; ++r) {
        const bool oneDimensional = coding.k == 1 || r % coding.k == 0;
        putEol(out, coding, oneDimensional);
        if (oneDimensional)
            putLine1D(out, page.row(r), page.width);
        else
            putLine2D(out, page.row(r - 1), page.row(r), page.width);
    }
    for (int i = 0; i < coding.rtcEols; ++i)
        putEol(out, coding, true);
    return out.bytes();
}

std::string canonical(const Page& page) {
    return std::string(page.pixels.begin(), page.pixels.end());
}

std::string canonicalBits(const unsigned char* bits, uint64_t firstBit, int width, int rows,
                          uint64_t lineBits) {
    std::string out;
    out.reserve(static_cast<size_t>(width) * rows);
    for (int r = 0; r < rows; ++r)
        for (int c = 0; c < width; ++c) {
            const uint64_t bit = firstBit + r * lineBits + c;
            out += static_cast<char>((bits[bit >> 3] >> (7 - (bit & 7))) & 1);
        }
    return out;
}

} // namespace bileveltest
