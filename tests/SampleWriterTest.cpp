// The sample writer, which the reader's tests take as their independent source of files: files that mirror
// the fields of real corpus files reproduce them byte for byte, and samples are packed and blocks placed as
// the format says, checked with arithmetic of its own on the bytes written.
#include "NitfSampleWriter.h"

#include <gtest/gtest.h>

#include "TestFiles.h"

using namespace nitfsample;

namespace {

// The image data of a file of this one image (it ends the file): `length` bytes.
std::string imageData(const Image& image, size_t length) {
    File file;
    file.images = {image};
    const std::string bytes = build(file);
    return bytes.substr(bytes.size() - length);
}

File jitc(const std::string& version, const std::string& ostaid, const std::string& title) {
    File file;
    file.version = version;
    file.ostaid = ostaid;
    file.fdt = "19971218121539";
    file.ftitle = title;
    file.fscop = file.fscpys = 1;
    file.oname = "JITC";
    file.ophone = "(520) 538-5458";
    return file;
}

// The 35 x 18 one-bit image of two corpus files, its bits taken from the real file.
Image bilevel(const std::string& bits) {
    Image image;
    image.iid1 = "Missing ID";
    image.idatim = "19961218121539";
    image.iid2 = "- BASE IMAGE -";
    image.isorce = "Unknown";
    image.rows = image.nppbv = 18;
    image.cols = image.nppbh = 35;
    image.nbpp = 1;
    image.pvtype = "B";
    image.iloc = "0010000100";
    image.imag = "1.0 ";
    image.sample = [bits](int, int row, int col) {
        const int bit = row * 35 + col;
        return uint64_t((static_cast<unsigned char>(bits[bit / 8]) >> (7 - bit % 8)) & 1);
    };
    return image;
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

TEST(SampleWriter, ReproducesCorpusFilesByteForByte) {
    const std::string root = corpusRoot();
    if (root.empty())
        GTEST_SKIP() << "no test corpus";
    // A one-bit image with a colour look-up table.
    std::string real = readWholeFile(root + "/nitf21/i_3034c.ntf");
    File file =
        jitc("NITF02.10", "I_3034C", "Check an RGB/LUT 1 bit image maps black to red and white to green.");
    file.fbkgc = "   ";
    Image image = bilevel(real.substr(854));
    image.irep = "RGB/LUT";
    image.bandInfo = {
        Band{"", "", {std::string("\xFF\x00", 2), std::string("\x00\xFF", 2), std::string(2, '\0')}}};
    file.images = {image};
    EXPECT_EQ(build(file), real);

    // The same image behind a pad pixel mask.
    real = readWholeFile(root + "/nsif/ns3034d.nsf");
    file = jitc("NSIF01.00", "NS3034D",
                "Check a mask header with 0 or black (00) being the transparent pixels color.");
    file.fbkgc = std::string("\0\xFF\0", 3);
    image = bilevel(real.substr(404 + 439 + 15));
    image.ic = "NM";
    image.blockMaskRecords = false;
    image.padMaskRecords = true;
    image.padBlocks = {0};
    image.padCodeBits = 1;
    file.images = {image};
    EXPECT_EQ(build(file), real);

    // A graphic.
    real = readWholeFile(root + "/nitf21/i_3051e.ntf");
    file = jitc("NITF02.10", "I_3051e", "Checks for CGM text in the proper location.");
    file.fdt = "19971219064511";
    file.fbkgc = std::string("\0\0\xFF", 3);
    file.oname = "JITC Fort Huachuca, AZ";
    Graphic graphic;
    graphic.sid = "0000000001";
    graphic.sname = "multi.cgm  SYMBOL.";
    graphic.sbnd1 = "0002500025";
    graphic.sbnd2 = "0007900430";
    graphic.data = real.substr(398 + 258);
    file.graphics = {graphic};
    EXPECT_EQ(build(file), real);

    // A NITF 2.0 text with its downgrading fields.
    real = readWholeFile(root + "/nitf20/U_0006A.NTF");
    file = jitc("NITF02.00", "JR6_4", "This NITF message contains 1 text.");
    file.clevel = "01";
    file.fdt = "07171219ZAUG91";
    file.security.dwng = "999998";
    file.security.devt = "This message will not need a downgrade.";
    file.ophone = "(602) 538-5458";
    Text text;
    text.textid = "0000000001";
    text.txtdt = "27235536ZNOV89";
    text.txtitl = "This is the title of unclassified text file #1 in NITF message JR6_4.";
    text.security.dwng = "999998";
    text.security.devt = "This text will never need downgrading.";
    text.data = real.substr(437 + 322);
    file.texts = {text};
    EXPECT_EQ(build(file), real);
}
