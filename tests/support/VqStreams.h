// VQ image data laid out by hand, for the VQ tests and fuzz target: the header (with or without the code
// grid), the lookup records and a codebook of known kernels, and block indexes packed as the format says.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "TreBytes.h"

namespace vqtest {

// The code grid of a block and how the image data describe it.
struct Layout {
    int codesPerRow = 8;
    int codeRows = 8;
    int bits = 12;
    int kernelWidth = 4;
    int kernelHeight = 4;
    bool withGrid = true; // the header starts with the code grid (the image display parameters)
    int blockWidth() const { return codesPerRow * kernelWidth; }
    int blockHeight() const { return codeRows * kernelHeight; }
    size_t indexBytes() const { return static_cast<size_t>(codesPerRow) * codeRows * bits / 8; }
};

// The pixels of kernel `code` of the codebook.
inline unsigned char kernelPixel(int code, int row, int col) {
    return static_cast<unsigned char>(code * 13 + (code >> 8) + row * 5 + col * 3);
}

// The header and the codebook: kernel-height tables of 2^bits records of kernel-width bytes.
inline std::string headerAndCodebook(const Layout& layout) {
    std::string out;
    if (layout.withGrid) {
        out += bigEndian(layout.codeRows, 4);
        out += bigEndian(layout.codesPerRow, 4);
        out += bigEndian(layout.bits, 1);
    }
    out += bigEndian(1, 2); // vector quantisation
    out += bigEndian(4, 2); // lookup records
    out += bigEndian(0, 2);
    out += bigEndian(6, 4);
    out += bigEndian(14, 2);
    for (int id = 1; id <= 4; ++id) {
        out += bigEndian(id, 2);
        out += bigEndian(1u << layout.bits, 4);
        out += bigEndian(layout.kernelWidth, 2);
        out += bigEndian(8, 2);
        out += bigEndian(0, 4); // never followed
    }
    for (int row = 0; row < layout.kernelHeight; ++row)
        for (int code = 0; code < (1 << layout.bits); ++code)
            for (int col = 0; col < layout.kernelWidth; ++col)
                out += static_cast<char>(kernelPixel(code, row, col));
    return out;
}

// The codes packed most significant bit first, cut to the block's whole index bytes.
inline std::string packed(const Layout& layout, const std::vector<int>& codes) {
    std::string bytes((codes.size() * layout.bits + 7) / 8, '\0');
    size_t bit = 0;
    for (int code : codes)
        for (int i = layout.bits - 1; i >= 0; --i, ++bit)
            if ((code >> i) & 1)
                bytes[bit / 8] = static_cast<char>(bytes[bit / 8] | (0x80 >> (bit % 8)));
    bytes.resize(layout.indexBytes());
    return bytes;
}

} // namespace vqtest
