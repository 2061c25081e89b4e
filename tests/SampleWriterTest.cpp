// The sample writer, which the reader's tests take as their independent source of files. What the writer lays
// out is read back by the reader, whose reading of every structure the corpus holds is checked against the
// manifest; what remains is what the corpus does not hold, where writer and reader could share a mistake:
// samples packed and blocks placed for every depth and interleaving, checked with arithmetic of its own.
#include "NitfSampleWriter.h"

#include <gtest/gtest.h>

using namespace nitfsample;

namespace {

// The image data of a file of this one image (it ends the file): `length` bytes.
std::string imageData(const Image& image, size_t length) {
    File file;
    file.images = {image};
    const std::string bytes = build(file);
    return bytes.substr(bytes.size() - length);
}

} // namespace

TEST(SampleWriter, PacksSamplesMostSignificantBitFirst) {
    auto packed = [](int nbpp, std::vector<uint64_t> values, size_t length, int bands = 1) {
        Image image;
        image.rows = 1;
        image.cols = static_cast<int>(values.size()) / bands;
        image.bands = bands;
        image.nbpp = nbpp;
        image.sample = [values, bands](int band, int, int col) { return values[col * bands + band]; };
        return imageData(image, length);
    };
    EXPECT_EQ(packed(12, {0xABC, 0x123, 0x456}, 5), "\xAB\xC1\x23\x45\x60");
    EXPECT_EQ(packed(1, {1, 0, 1, 1, 0, 0, 1, 1, 1, 0}, 2), "\xB3\x80");
    EXPECT_EQ(packed(4, {0x1F, 0x2, 0x3}, 2), "\xF2\x30"); // masked to 4 bits
    EXPECT_EQ(packed(64, {0x0102030405060708}, 8), "\x01\x02\x03\x04\x05\x06\x07\x08");
    // IMODE B: each band of the block ends on a whole byte.
    EXPECT_EQ(packed(12, {0xABC, 0x123}, 4, 2), std::string("\xAB\xC0\x12\x30", 4));
}

TEST(SampleWriter, PlacesBlocksAsEachImodeRequires) {
    // 3 rows x 5 columns in 2 x 2 blocks: 3 blocks per row, 2 per column, 4 bytes per block band.
    for (char imode : {'S', 'B', 'P', 'R'}) {
        SCOPED_TRACE(imode);
        Image image;
        image.rows = 3;
        image.cols = 5;
        image.bands = 2;
        image.nppbh = image.nppbv = 2;
        image.imode = imode;
        image.padValue = 0xEE;
        image.sample = [](int band, int row, int col) { return uint64_t(band * 100 + row * 10 + col); };
        const std::string data = imageData(image, 6 * 8);
        for (int band = 0; band < 2; ++band) {
            const std::string canonical = canonicalBand(image, band);
            for (int row = 0; row < 4; ++row)
                for (int col = 0; col < 6; ++col) {
                    const int block = (row / 2) * 3 + col / 2, y = row % 2, x = col % 2;
                    const int offset = imode == 'S'   ? (6 * band + block) * 4 + y * 2 + x
                                       : imode == 'B' ? block * 8 + band * 4 + y * 2 + x
                                       : imode == 'P' ? block * 8 + (y * 2 + x) * 2 + band
                                                      : block * 8 + y * 4 + band * 2 + x;
                    const int stored = static_cast<unsigned char>(data.at(offset));
                    const bool inside = row < 3 && col < 5;
                    EXPECT_EQ(stored, inside ? band * 100 + row * 10 + col : 0xEE) << row << "," << col;
                    if (inside) {
                        EXPECT_EQ(static_cast<unsigned char>(canonical.at(row * 5 + col)), stored);
                    }
                }
        }
    }
}
