// Damaged image geometry and block tables: refused with vexo::Exception, or read with zeros, never a crash or
// an allocation the file cannot justify.
#include <gtest/gtest.h>

#include <sstream>
#include <string>
#include <vector>

#include "NitfTestFile.h"
#include "WalkFile.h"

namespace {

using nitfsample::Image;

std::string fileWith(const Image& image) {
    nitfsample::File file;
    file.images = {image};
    return nitfsample::build(file);
}

// Image 0 read as a careful application reads it: the message of its refusal, or "".
std::string readEverything(const std::string& bytes) {
    OpenedSample file(bytes);
    return readImage(file.reader(), 0);
}

Image smallImage() {
    Image image;
    image.cols = image.rows = 16;
    image.nppbh = image.nppbv = 8;
    return image;
}

} // namespace

TEST(ImageMalformed, GeometryBeyondTheFileIsRefused) {
    const struct {
        const char* what;
        const char* fields; // NAME=VALUE ...
        int bands;
        char imode;
        const char* message;
    } cases[] = {
        {"blocks the data cannot hold", "NBPR=9999 NBPC=9999", 1, 'B', "cannot hold"},
        {"band-sequential blocks beyond an int", "NBPR=9999 NBPC=9999", 22, 'S', "too many blocks"},
        {"a block beyond an int", "NCOLS=99999999 NROWS=99999999 NPPBH=0000 NPPBV=0000 NBPR=0001 NBPC=0001",
         1, 'B', "too large"},
        {"block rows beyond an int", "NCOLS=99999999 NPPBH=0000 NPPBV=0001 NBPP=64 NBPR=0001 NBPC=0016", 9,
         'B', "too long"},
        {"a pixel-interleaved block far larger than the file", "NPPBH=9999 NPPBV=9999 NBPR=0001 NBPC=0001", 3,
         'P', "larger than the image data"},
        {"a bi-level bitmap far larger than the file",
         "NPPBH=9999 NPPBV=9999 NBPR=0009 NBPC=0009 NBPP=01 PVTYPE=B", 1, 'B', "larger than the image data"},
        {"no blocks", "NBPR=0000", 1, 'B', "Invalid image geometry"},
        {"a negative block size", "NPPBV=-001", 1, 'B', "Invalid image geometry"}};
    for (const auto& c : cases) {
        SCOPED_TRACE(c.what);
        Image image = smallImage();
        image.bands = c.bands;
        image.imode = c.imode;
        std::istringstream fields(c.fields);
        for (std::string field; fields >> field;)
            image.fields[field.substr(0, field.find('='))] = field.substr(field.find('=') + 1);
        const std::string message = readEverything(fileWith(image));
        EXPECT_NE(message.find(c.message), std::string::npos) << message;
    }
}

TEST(ImageMalformed, DataThatTheFileDoesNotHoldReadsAsZeros) {
    // A block-interleaved image cut off in the second band of its second block: what is missing reads as
    // zeros, never as stale bytes.
    Image image = smallImage();
    image.bands = 2;
    std::string bytes = fileWith(image);
    OpenedSample cut(bytes.substr(0, bytes.size() - 2 * 128 - 10));
    CNitfImageSource& source = cut.source();
    std::vector<char> block(64, 'x');
    ASSERT_TRUE(source.readTileNonInterleaved(&cut.reader(), block.data(), 1, 1, 0));
    EXPECT_EQ(static_cast<unsigned char>(block[0]), nitfsample::sampleAt(image, 1, 0, 8));
    EXPECT_EQ(static_cast<unsigned char>(block[53]), nitfsample::sampleAt(image, 1, 6, 13));
    EXPECT_EQ(block[54], 0);
    EXPECT_EQ(block[63], 0);
    ASSERT_TRUE(source.readTileNonInterleaved(&cut.reader(), block.data(), 1, 1, 1));
    EXPECT_EQ(block, std::vector<char>(64, 0));

    // Block offsets pointing past the end of the file, and a table of them that is itself cut short.
    Image masked = smallImage();
    masked.ic = "NM";
    bytes = fileWith(masked);
    const size_t mask =
        static_cast<size_t>(OpenedSample(bytes).header()->getImageHeaderDataPair(0)->getDataOffset()) + 10;
    bytes.replace(mask + 4, 4, std::string("\x7F\xFF\xFF\x00", 4));
    EXPECT_EQ(readEverything(bytes), "");
    EXPECT_NE(readEverything(bytes.substr(0, mask + 6)).find("block mask"), std::string::npos);
}

TEST(ImageMalformed, AnUnknownInterleavingLeavesEveryBlockAbsent) {
    // An IMODE the library does not know: the source is handed out, but no block can be located.
    Image unknown = smallImage();
    unknown.bands = 3;
    unknown.fields = {{"IMODE", "X"}};
    OpenedSample file(unknown);
    EXPECT_EQ(file.source().getTileOffset(0), 0u);
    EXPECT_TRUE(file.source().isBlockAbsent(0, 0, 0));
    std::vector<char> block(64, 'x');
    EXPECT_FALSE(file.source().readTileNonInterleaved(&file.reader(), block.data(), 0, 0, 0));
    EXPECT_EQ(block, std::vector<char>(64, 0));

    // Look-up tables longer than the rest of the file: the fields after them read as blanks past the end,
    // so the image has no geometry to read it by.
    Image lut = smallImage();
    lut.irep = "RGB/LUT";
    lut.bandInfo = {{"LU", "", {"abcd", "efgh", "ijkl"}}};
    lut.fields = {{"NELUT1", "99999"}};
    EXPECT_NE(readEverything(fileWith(lut)).find("Invalid image geometry"), std::string::npos);
}
