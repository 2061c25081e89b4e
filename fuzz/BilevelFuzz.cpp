// libFuzzer target: the input bytes after two shape bytes are bi-level coded data. The decoder reads them as
// one block of a width, height and coding the shape bytes choose, into rows at an odd bit offset and spacing,
// and once more only walking; when the shape asks for it, the same bytes become the blocks of a small C1 or
// M1 image read as readSample reads it. Damage may be reported or refused with vexo::Exception; a crash, a
// sanitizer report, a hang, a write outside the rows or results that disagree are findings.
#include <cstdint>
#include <string>
#include <vector>

#include "BiLevelHuffman.h"
#include "NitfSampleWriter.h"
#include "WalkFile.h"

namespace {

const int kWidths[] = {1, 7, 8, 37, 64, 200, 1728, 2560};

void check(bool condition) {
    if (!condition)
        __builtin_trap();
}

void decodeBlock(const uint8_t* data, size_t size, int width, int rows, bool twoDimensional,
                 uint64_t firstBit, uint64_t lineBits) {
    // Guard bytes of 0xA5 around the rows: the decoder writes only the rows' bits.
    std::vector<unsigned char> out((firstBit + rows * lineBits + 7) / 8 + 8, 0xA5);
    BiLevelHuffman decoder(width, twoDimensional);
    const BiLevelHuffman::Result result = decoder.decode(data, size, rows, out.data(), firstBit, lineBits);
    check(result.rows <= rows && result.codedBytes <= size);
    check(result.damage == BiLevelHuffman::eDamageNone ? result.rows == rows
                                                       : result.damagedRow == result.rows);
    for (uint64_t bit = 0; bit < out.size() * 8; ++bit) {
        const bool inRow = bit >= firstBit && (bit - firstBit) % lineBits < static_cast<uint64_t>(width) &&
                           (bit - firstBit) / lineBits < static_cast<uint64_t>(rows);
        check(inRow || ((out[bit / 8] ^ 0xA5) & (0x80 >> (bit % 8))) == 0);
    }
    const BiLevelHuffman::Result walked = decoder.decode(data, size, rows, nullptr, 0, 0);
    check(walked.rows == result.rows && walked.damage == result.damage &&
          walked.codedBytes == result.codedBytes);
}

// Two blocks side by side: one coded run of both (found by walking) or, masked, the halves, the second
// perhaps absent.
nitfsample::Image imageOf(uint8_t shape, int width, int rows, const std::string& coded) {
    nitfsample::Image image;
    const bool masked = shape & 0x80;
    image.ic = masked ? "M1" : "C1";
    image.comrat = (shape & 1) ? "2DS" : "1D";
    image.nbpp = 1;
    image.pvtype = "B";
    image.nppbh = width;
    image.nppbv = rows;
    image.cols = 2 * width;
    image.rows = rows;
    if (masked) {
        image.blockData = {coded.substr(0, coded.size() / 2), coded.substr(coded.size() / 2)};
        if (shape & 0x20)
            image.absentBlocks = {1};
        image.padCodeBits = (shape & 0x10) ? 1 : 0;
        image.padValue = 1;
    } else {
        image.blockData = {coded};
    }
    return image;
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    if (size < 2)
        return 0;
    const uint8_t shape = data[0], geometry = data[1];
    const int width = kWidths[geometry & 7];
    const int rows = 1 + (geometry >> 3);
    const bool twoDimensional = shape & 1;
    const uint64_t firstBit = (shape >> 1) & 7;
    const uint64_t lineBits = width + ((shape >> 4) & 3) * 5;
    decodeBlock(data + 2, size - 2, width, rows, twoDimensional, firstBit, lineBits);
    if (shape & 0x40)
        readSample(
            imageOf(shape, width, rows, std::string(reinterpret_cast<const char*>(data) + 2, size - 2)));
    return 0;
}
