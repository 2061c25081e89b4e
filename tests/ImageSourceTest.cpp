// Uncompressed image sources: files laid out by the independent sample writer, read back block by block.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "HostError.h"
#include "Canonical.h"
#include "NitfFileReader.h"
#include "NitfImagePropertiesIF.h"
#include "NitfImageSource.h"
#include "NitfImageSourceUncompressed.h"
#include "NitfTestFile.h"

namespace {

using nitfsample::Image;

// One band of a sample's image 0 in canonical form.
std::string bandOf(OpenedSample& open, int band) {
    return canonicalBand(open.reader(), open.source(), band);
}

// 37 x 29 pixels in 16 x 8 blocks: partial blocks at the right and the bottom.
Image blockedImage(char imode, int nbpp, int bands) {
    Image image;
    image.cols = 37;
    image.rows = 29;
    image.nppbh = 16;
    image.nppbv = 8;
    image.imode = imode;
    image.nbpp = nbpp;
    image.bands = bands;
    image.pvtype = nbpp == 1 ? "B" : "INT";
    image.padValue = 0xA5A5A5A5A5A5A5A5ULL;
    return image;
}

} // namespace

// (Every interleaving and depth read through the region reader is checked with the region reader.)
TEST(ImageSourceRoundTrip, InterleavedBlocksAndWiderRowsHoldTheSameSamples) {
    for (char imode : {'B', 'S', 'P'}) {
        SCOPED_TRACE(std::string("IMODE ") + imode);
        Image image = blockedImage(imode, 16, 3);
        OpenedSample open(image);
        CNitfImagePropertiesIF& p = open.source().getImageProperties();
        // Block (1, 2) pixel-interleaved: sample (r, c, k) at ((r * 16 + c) * 3 + k) * 2, big-endian.
        std::vector<unsigned char> block(static_cast<size_t>(p.getTileBufferSize()));
        ASSERT_TRUE(
            open.source().readTileInterleaved(&open.reader(), reinterpret_cast<char*>(block.data()), 1, 2));
        for (int r : {0, 7})
            for (int c : {0, 4})
                for (int k = 0; k < 3; ++k) {
                    size_t at = ((r * 16 + c) * 3 + k) * 2;
                    EXPECT_EQ(block[at] << 8 | block[at + 1], nitfsample::sampleAt(image, k, 16 + r, 16 + c));
                }
        // One band into rows wider than stored: the gaps are left alone.
        std::vector<unsigned char> wide(8 * 40, 0xEE);
        ASSERT_TRUE(open.source().readTileNonInterleaved(&open.reader(), reinterpret_cast<char*>(wide.data()),
                                                         40, 1, 0, 2));
        EXPECT_EQ(wide[40 * 3 + 2 * 5] << 8 | wide[40 * 3 + 2 * 5 + 1],
                  nitfsample::sampleAt(image, 2, 3, 16 + 5));
        EXPECT_EQ(wide[39], 0xEE);
        EXPECT_THROW(open.source().readTileNonInterleaved(&open.reader(),
                                                          reinterpret_cast<char*>(wide.data()), 31, 1, 0, 2),
                     vexo::Exception)
            << "rows narrower than a block row";
    }
}

TEST(ImageSourceLayout, BlockOffsetsFollowTheInterleaving) {
    // Band-sequential 2 x 2 blocks of 3 bands: block (1, 0) of band 2 is entry 9, nine band-blocks in.
    Image image;
    image.cols = image.rows = 8;
    image.nppbh = image.nppbv = 4;
    image.bands = 3;
    image.imode = 'S';
    OpenedSample s(image);
    auto& source = s.source<CNitfImageSourceUncompressed>();
    const unsigned long long start = source.getTileOffset(0);
    EXPECT_EQ(source.getTileOffset(1, 0, 2), start + 9 * 16);
    EXPECT_EQ(source.getTileOffset(2, 0, 0), CNitfImageSource::kAbsentBlock) << "no such block";
    EXPECT_EQ(source.getTileOffset(0, 0, 3), CNitfImageSource::kAbsentBlock) << "no such band";
    EXPECT_EQ(source.getTileOffset(12), 0u) << "outside the table";

    // 3 x 3 blocks of 4 bits hold 4.5 bytes: each block takes 5.
    Image odd;
    odd.cols = odd.rows = 6;
    odd.nppbh = odd.nppbv = 3;
    odd.nbpp = 4;
    OpenedSample o(odd);
    auto& packed = o.source<CNitfImageSourceUncompressed>();
    EXPECT_EQ(packed.getTileOffset(1, 0, 0) - packed.getTileOffset(0, 0, 0), 5u);
    EXPECT_EQ(bandOf(o, 0), nitfsample::canonicalBand(odd, 0));
}

TEST(ImageSourceMasked, AbsentBlocksReadAsZerosAndTheMaskIsMeasured) {
    for (char imode : {'B', 'P', 'S'}) {
        SCOPED_TRACE(std::string("IMODE ") + imode);
        Image image = blockedImage(imode, 8, 3);
        image.ic = "NM";
        image.absentBlocks = {1, 5};
        image.padMaskRecords = true;
        image.padBlocks = {2};
        image.padCodeBits = 8;
        image.padValue = 0x7F;
        OpenedSample open(image);
        CNitfImageSourceUncompressed& source = open.source<CNitfImageSourceUncompressed>();
        for (int band = 0; band < 3; ++band)
            EXPECT_EQ(bandOf(open, band), nitfsample::canonicalBand(image, band)) << "band " << band;
        EXPECT_EQ(source.getTileOffset(1), CNitfImageSource::kAbsentBlock);
        EXPECT_TRUE(source.hasPadPixel());
        EXPECT_EQ(source.getPadPixelValue(), 0x7F);
        const int entries = nitfsample::blockEntryCount(image);
        EXPECT_EQ(source.computeBlockMaskStorageLength(), 10 + 4 * entries);
        // The blocks start after the whole record: both masks and the pad code.
        CNitfHeaderDataPair* pair = open.reader().getFileHeader()->getImageHeaderDataPair(0);
        EXPECT_EQ(source.getTileOffset(0),
                  static_cast<unsigned long long>(pair->getDataOffset() + 10 + 1 + 8 * entries));

        // An absent block fills exactly the rows asked for.
        std::vector<char> rows(8 * 20, 'x');
        if (imode != 'P') {
            ASSERT_TRUE(
                source.readTileNonInterleaved(&open.reader(), rows.data(), 20, 1, 0, imode == 'S' ? 0 : 1));
            EXPECT_EQ(rows[0], 0);
            EXPECT_EQ(rows[15], 0);
            EXPECT_EQ(rows[16], 'x');
        }
    }

    // Pad pixel mask only, no block offsets, no pad code: every block stored.
    Image plain = blockedImage('B', 8, 1);
    plain.ic = "NM";
    plain.blockMaskRecords = false;
    plain.padMaskRecords = true;
    OpenedSample open(plain);
    EXPECT_FALSE(open.source().hasPadPixel());
    EXPECT_EQ(open.source().computeBlockMaskStorageLength(), 0);
    EXPECT_EQ(bandOf(open, 0), nitfsample::canonicalBand(plain, 0));
}

TEST(ImageSourceMasked, PadPixelIsDecodedByPixelValueType) {
    struct Case {
        const char* pvtype;
        int nbpp, codeBits;
        uint64_t code;
        bool has;
        long long value;
    } cases[] = {{"INT", 8, 8, 0x7F, true, 127},
                 {"INT", 16, 16, 0xFFFE, true, 65534},
                 {"INT", 32, 32, 0xFFFFFFFF, true, 4294967295LL},
                 {"SI", 16, 16, 0xFFFE, true, -2},
                 {"SI", 8, 8, 0x80, true, -128},
                 {"SI", 32, 32, 0x80000000, true, -2147483648LL},
                 {"R", 32, 32, 0x3FC00000, true, 1},  // 1.5f, truncated
                 {"R", 64, 32, 0x3FC00000, false, 0}, // a float code does not describe 64-bit samples
                 {"B", 1, 8, 1, true, 1},
                 {"B", 1, 16, 1, false, 0},
                 {"INT", 32, 24, 0x123456, false, 0},
                 {"C", 64, 32, 1, false, 0},
                 {"INT", 8, 0, 0, false, 0}};
    for (const Case& c : cases) {
        SCOPED_TRACE(std::string(c.pvtype) + " NBPP " + std::to_string(c.nbpp) + " TPXCDLNTH " +
                     std::to_string(c.codeBits));
        Image image;
        image.cols = image.rows = 4;
        image.ic = "NM";
        image.pvtype = c.pvtype;
        image.nbpp = c.nbpp;
        image.padCodeBits = c.codeBits;
        image.padValue = c.code;
        OpenedSample open(image);
        EXPECT_EQ(open.source().hasPadPixel(), c.has);
        EXPECT_EQ(open.source().getPadPixelValue(), c.value);
    }
}

// (Bitmaps of one-bit images, sampled rows and a pad of one inverting them, are compared between the
// uncompressed and the bi-level source with the bi-level tests.)

// (The interleaving conversions are checked by every interleaved and band read above and by the region
// reader's.)

TEST(ImageSourceBitmap, RowsAreSampledAndAPadOfOneInvertsThem) {
    Image image;
    image.cols = 20;
    image.rows = 10;
    image.nppbh = 8;
    image.nppbv = 4;
    image.nbpp = 1;
    image.pvtype = "B";
    image.sample = [](int, int row, int col) {
        return static_cast<uint64_t>((row * 3 + col * col) % 5 == 0);
    };
    auto bitAt = [](const std::vector<unsigned char>& bits, int index) {
        return (bits[index / 8] >> (7 - index % 8)) & 1;
    };
    for (bool inverted : {false, true}) {
        SCOPED_TRACE(inverted ? "pad pixel 1" : "no pad pixel");
        if (inverted) {
            image.ic = "NM";
            image.padCodeBits = 8;
            image.padValue = 1;
            image.absentBlocks = {4}; // block (1, 1): rows 4-7, columns 8-15
        }
        OpenedSample open(image);
        // Columns 3-15, 8 source rows onto 4 output rows (rows 1, 3, 5, 7), 16 bits per output row.
        std::vector<unsigned char> out(8, 0x5A);
        ASSERT_TRUE(open.source().readBitmap(reinterpret_cast<char*>(out.data()), 3, 1, 13, 8, 16, 4));
        for (int i = 0; i < 4; ++i) {
            const int row = 1 + 2 * i;
            for (int c = 0; c < 16; ++c) {
                int expected = 0;
                if (c < 13 && !(inverted && row >= 4 && 3 + c >= 8))
                    expected = static_cast<int>(nitfsample::sampleAt(image, 0, row, 3 + c));
                EXPECT_EQ(bitAt(out, i * 16 + c), inverted ? 1 - expected : expected)
                    << "row " << i << " bit " << c;
            }
        }
        EXPECT_FALSE(open.source().readBitmap(reinterpret_cast<char*>(out.data()), 20, 0, 8, 4, 8, 4))
            << "beyond the padded width";
        EXPECT_FALSE(open.source().readBitmap(reinterpret_cast<char*>(out.data()), 0, 9, 8, 8, 8, 4))
            << "rows beyond the image";
    }
}

TEST(ImageSource, WriteabilityAndLowerCaseValueTypes) {
    Image image;
    image.imode = 'P';
    image.bands = 3;
    EXPECT_FALSE(OpenedSample(image).source().isWriteable()) << "pixel-interleaved bands cannot be written";
    image.pvtype = "si";
    image.nbpp = 16;
    image.bands = 1;
    EXPECT_EQ(OpenedSample(image).source().getPvtype(), CNitfImagePropertiesIF::ePVTypeSignedInteger);
}
TEST(ImageProperties, BufferSizesFollowTheTwelveBitJpegRule) {
    Image image;
    image.cols = 100;
    image.rows = 30;
    image.nbpp = 12;
    OpenedSample twelve(image);
    CNitfImagePropertiesIF& p = twelve.source().getImageProperties();
    EXPECT_EQ(p.getTileBandWidthBufferSize(), 150);
    p.setCompressionType(CNitfImagePropertiesIF::eCompressionJpeg);
    EXPECT_EQ(p.getTileBandWidthBufferSize(), 200) << "12-bit JPEG samples take two bytes";
    EXPECT_EQ(p.getTileBandBufferSize(), 4500) << "the block size does not apply the rule";

    image.cols = 1000;
    image.nbpp = 1;
    image.pvtype = "B";
    OpenedSample bilevel(image);
    EXPECT_EQ(bilevel.source().getImageProperties().getTileBandWidthBufferSize(), 125);
    EXPECT_EQ(bilevel.source().getImageProperties().getTileBandBufferSize(), 3750);
}
