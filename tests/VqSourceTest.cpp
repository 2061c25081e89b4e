// The VQ codec and source on data laid out here: header with and without the code grid, 12-bit and other code
// lengths, kernels of other sizes, IMODE S and B with two bands, the storage lengths; and damaged headers,
// codebooks and block tables, which are refused or read as zeros, never followed. (Masks and absent blocks
// are checked on the corpus frames.)
#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <string>
#include <vector>

#include "HostError.h"
#include "NitfFileReader.h"
#include "NitfImageSourceVQ.h"
#include "NitfTestFile.h"
#include "VqDecoder.h"
#include "VqStreams.h"
#include "WalkFile.h"

using vqtest::Layout;

namespace {

// The codes of block entry `entry`, varied from block to block.
std::vector<int> codesOf(const Layout& layout, int entry) {
    std::vector<int> codes(static_cast<size_t>(layout.codesPerRow) * layout.codeRows);
    uint32_t state = 2463534242u + 977u * entry;
    for (int& code : codes) {
        state ^= state << 13;
        state ^= state >> 17;
        state ^= state << 5;
        code = static_cast<int>(state % (1u << layout.bits));
    }
    return codes;
}

// The pixels a block of these codes decodes to, rows of block width.
std::vector<unsigned char> expectedBlock(const Layout& layout, int entry) {
    const std::vector<int> codes = codesOf(layout, entry);
    std::vector<unsigned char> pixels(static_cast<size_t>(layout.blockWidth()) * layout.blockHeight());
    for (int y = 0; y < layout.blockHeight(); ++y)
        for (int x = 0; x < layout.blockWidth(); ++x) {
            const int code = codes[static_cast<size_t>(y / layout.kernelHeight) * layout.codesPerRow +
                                   x / layout.kernelWidth];
            pixels[static_cast<size_t>(y) * layout.blockWidth() + x] =
                vqtest::kernelPixel(code, y % layout.kernelHeight, x % layout.kernelWidth);
        }
    return pixels;
}

// A VQ image of blocksX x blocksY blocks: header, codebook and every entry's indexes in the one data part.
nitfsample::Image vqImage(const Layout& layout, int blocksX, int blocksY, int bands = 1, char imode = 'B') {
    nitfsample::Image image;
    image.ic = "C4";
    image.comrat = "0.75";
    image.irep = "MONO";
    image.bands = bands;
    image.imode = imode;
    image.nppbh = layout.blockWidth();
    image.nppbv = layout.blockHeight();
    image.cols = blocksX * image.nppbh;
    image.rows = blocksY * image.nppbv;
    std::string data = vqtest::headerAndCodebook(layout);
    for (int entry = 0; entry < blocksX * blocksY * bands; ++entry)
        data += vqtest::packed(layout, codesOf(layout, entry));
    image.blockData = {data};
    return image;
}

// Block (x, y) of a band, as many bytes as the source asks for, 0xEE beyond what it writes.
std::vector<unsigned char> blockOf(OpenedSample& image, int x, int y, int band = 0, bool* present = nullptr) {
    const CNitfImagePropertiesIF& p = image.source().getImageProperties();
    std::vector<unsigned char> pixels(static_cast<size_t>(p.getTileBandReadBufferSize()), 0xEE);
    const bool read = image.source().readTileNonInterleaved(
        &image.reader(), reinterpret_cast<char*>(pixels.data()), p.getTileWidth(), x, y, band);
    if (present)
        *present = read;
    return pixels;
}

// Image 0 read as a careful application reads it: the message of its refusal, or "".
std::string readEverything(const nitfsample::Image& vq) {
    OpenedSample file(vq);
    return readImage(file.reader(), 0);
}

} // namespace

TEST(VqDecoder, EveryCodeLengthAndKernelSizeDecodesItsKernels) {
    // Codes per row and rows, code length, kernel width and height: 4 x 4 kernels with whole vectors of four
    // codes and a remainder; other code lengths and kernel sizes.
    const Layout layouts[] = {{8, 8, 12, 4, 4}, {6, 3, 12, 4, 4}, {8, 2, 5, 2, 3}, {7, 2, 8, 1, 1},
                              {4, 4, 16, 2, 2}, {8, 1, 1, 8, 8},  {4, 2, 3, 4, 4}};
    for (const Layout& layout : layouts) {
        SCOPED_TRACE(std::to_string(layout.bits) + "-bit codes, " + std::to_string(layout.codesPerRow) +
                     " x " + std::to_string(layout.codeRows) + " of " + std::to_string(layout.kernelWidth) +
                     " x " + std::to_string(layout.kernelHeight));
        CVqDecoder decoder(layout.codesPerRow, layout.codeRows, layout.bits, layout.kernelWidth,
                           layout.kernelHeight);
        ASSERT_EQ(decoder.indexBytes(), layout.indexBytes());
        std::string book = vqtest::headerAndCodebook(layout);
        book.erase(0, book.size() - decoder.codebookBytes());
        decoder.setCodebook(reinterpret_cast<const unsigned char*>(book.data()));
        std::string indexes =
            vqtest::packed(layout, codesOf(layout, 3)) + std::string(CVqDecoder::kIndexPadding, '\0');
        // Lines wider than the block: what lies right of it stays as it was.
        const int line = layout.blockWidth() + 5;
        std::vector<unsigned char> out(static_cast<size_t>(line) * layout.blockHeight(), 0xEE);
        decoder.decode(reinterpret_cast<const unsigned char*>(indexes.data()), out.data(), line);
        const std::vector<unsigned char> expected = expectedBlock(layout, 3);
        for (int y = 0; y < layout.blockHeight(); ++y) {
            const unsigned char* row = &out[static_cast<size_t>(y) * line];
            ASSERT_TRUE(std::equal(row, row + layout.blockWidth(), &expected[y * layout.blockWidth()]))
                << "row " << y;
            EXPECT_EQ(row[layout.blockWidth()], 0xEE);
        }
    }
}

TEST(VqSource, BlocksDecodeWithAndWithoutTheCodeGrid) {
    // Only the CADRG grid, 64 x 64 codes of 12 bits, can do without; another code length is read bit by bit.
    const Layout layouts[] = {{8, 8, 12, 4, 4, true}, {64, 64, 12, 4, 4, false}, {8, 8, 8, 2, 3, true}};
    for (const Layout& layout : layouts) {
        SCOPED_TRACE(std::to_string(layout.bits) + " bits, grid " + (layout.withGrid ? "given" : "implied"));
        OpenedSample image(vqImage(layout, 2, 2));
        auto* vq = &image.source<CNitfImageSourceVQ>();
        EXPECT_EQ(vq->getCodeBitLength(), layout.bits);
        EXPECT_EQ(vq->getCodesPerRow(), layout.codesPerRow);
        EXPECT_EQ(vq->getKernelWidth(), layout.kernelWidth);
        EXPECT_EQ(vq->getKernelHeight(), layout.kernelHeight);
        EXPECT_EQ(vq->getIndexBytesPerBlock(), static_cast<int>(layout.indexBytes()));
        for (int entry = 0; entry < 4; ++entry) {
            bool present = false;
            std::vector<unsigned char> pixels = blockOf(image, entry % 2, entry / 2, 0, &present);
            EXPECT_TRUE(present);
            pixels.resize(static_cast<size_t>(layout.blockWidth()) * layout.blockHeight());
            EXPECT_EQ(pixels, expectedBlock(layout, entry)) << "block " << entry;
        }
        // Outside the image: nothing read.
        bool present = true;
        blockOf(image, 2, 0, 0, &present);
        EXPECT_FALSE(present);
        blockOf(image, 0, 0, 1, &present);
        EXPECT_FALSE(present);
    }
}

TEST(VqSource, TwoBandsBandSequentialAndByBlock) {
    Layout layout;
    const size_t blockPixels = static_cast<size_t>(layout.blockWidth()) * layout.blockHeight();
    for (char imode : {'S', 'B'}) {
        SCOPED_TRACE(std::string("IMODE ") + imode);
        OpenedSample image(vqImage(layout, 2, 1, 2, imode));
        // Entries in file order: S holds band 0's blocks then band 1's; B holds each block's bands together.
        auto entryOf = [&](int x, int band) { return imode == 'S' ? band * 2 + x : x * 2 + band; };
        for (int x = 0; x < 2; ++x)
            for (int band = 0; band < 2; ++band) {
                std::vector<unsigned char> pixels = blockOf(image, x, 0, band);
                pixels.resize(blockPixels);
                EXPECT_EQ(pixels, expectedBlock(layout, entryOf(x, band))) << x << "," << band;
            }
        // Both bands at once, pixel-interleaved.
        std::vector<char> both(2 * blockPixels);
        ASSERT_TRUE(
            image.source().readTileInterleaved(&image.reader(), both.data(), 2 * layout.blockWidth(), 1, 0));
        const std::vector<unsigned char> band0 = expectedBlock(layout, entryOf(1, 0));
        const std::vector<unsigned char> band1 = expectedBlock(layout, entryOf(1, 1));
        for (size_t i = 0; i < blockPixels; ++i) {
            ASSERT_EQ(static_cast<unsigned char>(both[2 * i]), band0[i]) << i;
            ASSERT_EQ(static_cast<unsigned char>(both[2 * i + 1]), band1[i]) << i;
        }
    }
}

TEST(VqSource, DamagedHeadersAreRefusedWithAClearMessage) {
    Layout layout;
    const nitfsample::Image good = vqImage(layout, 2, 2);
    const std::string data = good.blockData[0];
    struct Case {
        const char* what;
        size_t at;         // byte of the image data to overwrite
        std::string bytes; // with these
        const char* message;
    };
    const Case cases[] = {
        {"codes of 0 bits", 8, std::string(1, '\0'), "no usable code grid"},
        {"codes of 17 bits", 8, std::string(1, '\x11'), "no usable code grid"},
        {"more codes per row than pixels", 4, std::string("\0\0\x01\0", 4), "no usable code grid"},
        {"more code rows than lines", 0, std::string("\x7F\xFF\xFF\xFF", 4), "no usable code grid"},
        {"a lookup table offset far away", 15, std::string("\xFF\xFF\xFF\x00", 4), "The VQ codebook"},
        {"65535 lookup records", 11, std::string("\xFF\xFF", 2), "The VQ codebook"}};
    for (const Case& c : cases) {
        SCOPED_TRACE(c.what);
        nitfsample::Image image = good;
        image.blockData[0].replace(c.at, c.bytes.size(), c.bytes);
        EXPECT_NE(readEverything(image).find(c.message), std::string::npos) << readEverything(image);
    }
    // A codebook cut short, and the indexes of a block that cannot be in the file.
    nitfsample::Image cut = good;
    cut.blockData[0] = data.substr(0, 77 + 1000);
    EXPECT_NE(readEverything(cut).find("The VQ codebook"), std::string::npos);
    cut.blockData[0] = data.substr(0, 77 + 65536 + 10);
    EXPECT_NE(readEverything(cut).find("The indexes of a VQ block"), std::string::npos);
    // Several bands interleaved by pixel: each kernel holds one band's pixels.
    nitfsample::Image pixelInterleaved = vqImage(layout, 1, 1, 3, 'P');
    EXPECT_NE(readEverything(pixelInterleaved).find("must have one band"), std::string::npos);
    // Caller's rows too short for the block.
    OpenedSample image(good);
    std::vector<char> pixels(4096);
    EXPECT_THROW(image.source().readTileNonInterleaved(&image.reader(), pixels.data(),
                                                       layout.blockWidth() - 1, 0, 0, 0),
                 vexo::Exception);
}
