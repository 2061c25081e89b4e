// The JPEG 2000 source on codestreams made for the purpose: blocks and regions against the samples coded,
// tiles decoded only under what is read, reduced resolutions, sample containers, sub-sampling, palettes,
// several images in one file, and damaged codestreams.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "HostError.h"
#include "J2kStreams.h"
#include "Jp2BoxWriter.h"
#include "NitfImageSourceJpeg2000.h"
#include "NitfRegionReader.h"
#include "NitfTestFile.h"
#include "WholeSamples.h"

namespace {

// A C8 image segment of `data` (a codestream or a JP2 file) described as `coding` says; NITF blocks are the
// codestream's tiles.
nitfsample::Image c8Image(const j2ktest::Coding& coding, const std::string& data, int nbpp = 0) {
    nitfsample::Image image;
    image.ic = "C8";
    image.comrat = coding.lossless ? "N001" : "0100";
    const auto [cols, rows] = j2ktest::componentSize(coding, 0);
    image.cols = cols;
    image.rows = rows;
    image.bands = coding.components;
    image.nbpp = nbpp ? nbpp : coding.precision <= 8 ? 8 : 16;
    image.abpp = coding.precision;
    image.pvtype = coding.isSigned ? "SI" : "INT";
    image.irep = coding.components == 3 ? "RGB" : coding.components == 1 ? "MONO" : "MULTI";
    image.imode = 'B';
    if (coding.tileWidth > 0) {
        image.nppbh = coding.tileWidth;
        image.nppbv = coding.tileHeight;
    }
    image.blockData = {data};
    return image;
}

// Every pixel of every band equals the coded sample (components on the image grid, no offsets).
void expectSamples(const wholesamples::Image& image, const j2ktest::Samples& samples) {
    int mismatches = 0;
    for (size_t band = 0; band < image.bands.size(); ++band)
        for (int y = 0; y < image.rows; ++y)
            for (int x = 0; x < image.cols; ++x)
                mismatches += image.bands[band][size_t(y) * image.cols + x] != samples(int(band), x, y);
    EXPECT_EQ(mismatches, 0);
}

j2ktest::Coding tiledRgb() {
    j2ktest::Coding coding;
    coding.width = 120; // 4 x 3 tiles of 32 x 32, the last column and row partial
    coding.height = 90;
    coding.components = 3;
    coding.tileWidth = coding.tileHeight = 32;
    coding.levels = 3;
    return coding;
}

} // namespace

TEST(Jpeg2000Source, BlocksOfATiledImageAreItsTiles) {
    const j2ktest::Coding coding = tiledRgb();
    const auto samples = j2ktest::pattern(coding);
    OpenedSample sample(c8Image(coding, j2ktest::encode(coding, samples)));
    auto& source = sample.source<CNitfImageSourceJpeg2000>();
    const CNitfImagePropertiesIF& p = source.getImageProperties();
    EXPECT_EQ(p.getTileCountX(), 4);
    EXPECT_EQ(p.getTileCountY(), 3);
    expectSamples(wholesamples::readBlocks(sample.reader(), source), samples);

    // One band of a partial corner block: the image's part, zeros in the padding.
    std::vector<unsigned char> block(32 * 32, 0xAA);
    ASSERT_TRUE(
        source.readTileNonInterleaved(&sample.reader(), reinterpret_cast<char*>(block.data()), 2, 3, 2));
    for (int y = 0; y < 32; ++y)
        for (int x = 0; x < 32; ++x) {
            const bool inside = 96 + x < 120 && 64 + y < 90;
            ASSERT_EQ(block[size_t(y) * 32 + x], inside ? samples(2, 96 + x, 64 + y) : 0) << x << ", " << y;
        }
}

TEST(Jpeg2000Source, ReadingABlockDecodesOnlyTheTilesUnderIt) {
    j2ktest::Coding coding = tiledRgb(); // 3 x 3 tiles of 160 x 160
    coding.width = coding.height = 480;
    coding.tileWidth = coding.tileHeight = 160;
    const std::string codestream = j2ktest::encode(coding, j2ktest::pattern(coding));
    OpenedSample sample(c8Image(coding, codestream));
    auto& source = sample.source<CNitfImageSourceJpeg2000>();
    std::vector<char> block(size_t(source.getImageProperties().getTileReadBufferSize()));
    const long long afterHeaders = source.getBytesRead();

    ASSERT_TRUE(source.readTileInterleaved(&sample.reader(), block.data(), 1, 1));
    EXPECT_EQ(source.getTileDecodeCount(), 1);
    // The headers of the tiles before it are passed over by their lengths; the tiles themselves not read.
    EXPECT_LT(source.getBytesRead() - afterHeaders, static_cast<long long>(codestream.size()) / 3);

    // A region over the corners of four tiles decodes those four.
    std::vector<char> region(20 * 20 * 3);
    source.readRegion(&sample.reader(), 0, 150, 150, 20, 20, 0, 3, region.data(), 60);
    EXPECT_EQ(source.getTileDecodeCount(), 5);
    EXPECT_LE(source.getBytesRead(), 2 * static_cast<long long>(codestream.size())); // headers read twice
}

TEST(Jpeg2000Source, RegionsAtEveryLevelMatchAWholeDecode) {
    // Offsets of the image and the tiles, so that levels round their origins differently.
    j2ktest::Coding coding = tiledRgb();
    coding.x0 = 5;
    coding.y0 = 3;
    coding.tileX0 = 2;
    coding.tileY0 = 1;
    coding.width = 117;
    coding.height = 87;
    const std::string codestream = j2ktest::encode(coding, j2ktest::pattern(coding));
    OpenedSample sample(c8Image(coding, codestream));
    auto& source = sample.source<CNitfImageSourceJpeg2000>();
    ASSERT_EQ(source.getResolutionLevels(), coding.levels + 1);
    EXPECT_EQ(source.getLevelWidth(0), 117);
    EXPECT_EQ(source.getLevelWidth(2), (5 + 117 + 3) / 4 - (5 + 3) / 4);
    EXPECT_EQ(source.getLevelWidth(coding.levels + 1), 0);

    for (int level = 0; level <= coding.levels; ++level) {
        SCOPED_TRACE("level " + std::to_string(level));
        const j2ktest::Decoded whole = j2ktest::decodeWhole(codestream, level);
        const int width = source.getLevelWidth(level), height = source.getLevelHeight(level);
        // OpenJPEG's whole decode may count one column or row more than the level has (left unfilled).
        const int stride = whole.components[0].width;
        ASSERT_LE(width, stride);
        ASSERT_LE(height, whole.components[0].height);
        // The right half, one band at a time, then all bands interleaved.
        const int x = width / 2, w = width - x;
        std::vector<unsigned char> band(size_t(w) * height), all(size_t(w) * height * 3);
        source.readRegion(&sample.reader(), level, x, 0, w, height, 0, 3, reinterpret_cast<char*>(all.data()),
                          w * 3);
        for (int b = 0; b < 3; ++b) {
            source.readRegion(&sample.reader(), level, x, 0, w, height, b, 1,
                              reinterpret_cast<char*>(band.data()), w);
            int mismatches = 0;
            for (int r = 0; r < height; ++r)
                for (int c = 0; c < w; ++c) {
                    const int32_t expected = whole.components[size_t(b)].samples[size_t(r) * stride + x + c];
                    mismatches += band[size_t(r) * w + c] != expected;
                    mismatches += all[(size_t(r) * w + c) * 3 + b] != expected;
                }
            EXPECT_EQ(mismatches, 0) << "band " << b;
        }
    }
    // The region reader and the tool read a level the same way: bands in the order asked for.
    const int level = 2;
    const j2ktest::Decoded reduced = j2ktest::decodeWhole(codestream, level);
    CNitfRegionReader region(&sample.reader(), &source);
    region.setLevel(level);
    ASSERT_EQ(region.getWidth(), source.getLevelWidth(level));
    const int width = region.getWidth(), height = region.getHeight();
    std::vector<unsigned char> planes(region.getBufferSize(width, height, 2));
    region.read(0, 0, width, height, {2, 0}, planes.data());
    TempFile raw("", ".raw");
    ASSERT_EQ(runTool("extract " + sample.path() + " --level 2 --bands 2,0 -f raw -o " + raw.path()), 0);
    EXPECT_EQ(raw.read(), std::string(planes.begin(), planes.end()));
    int mismatches = 0;
    for (int k = 0; k < 2; ++k)
        for (int r = 0; r < height; ++r)
            for (int c = 0; c < width; ++c)
                mismatches +=
                    planes[(size_t(k) * height + r) * width + c] !=
                    reduced.components[k == 0 ? 2 : 0].samples[size_t(r) * reduced.components[0].width + c];
    EXPECT_EQ(mismatches, 0);
    EXPECT_THROW(region.setLevel(coding.levels + 1), vexo::Exception);

    EXPECT_THROW(source.readRegion(&sample.reader(), 1, 0, 0, 60, 1, 0, 1, nullptr, 60), vexo::Exception);
    std::vector<char> row(64);
    EXPECT_THROW(source.readRegion(&sample.reader(), 1, 1, 0, 60, 1, 0, 1, row.data(), 64), vexo::Exception)
        << "past the level's right edge";
    EXPECT_THROW(source.readRegion(&sample.reader(), 6, 0, 0, 1, 1, 0, 1, row.data(), 64), vexo::Exception)
        << "a level the codestream does not have";
}

// (Sub-sampled components, replicated to the image size, are checked against OpenJPEG's own tool on the
// corpus.)

namespace {

// A JP2 file around a one-component codestream of palette indices, with a three-column palette.
std::string paletteJp2(const std::string& codestream, int width, int height) {
    jp2::Metadata metadata;
    metadata.imageHeader.width = width;
    metadata.imageHeader.height = height;
    metadata.imageHeader.components = 1;
    jp2::Colour srgb;
    srgb.enumerated = 16;
    metadata.colours = {srgb};
    metadata.hasPalette = true;
    metadata.palette.columns = {jp2::Depth{8, false}, jp2::Depth{8, false}, jp2::Depth{8, false}};
    for (int i = 0; i < 256; ++i)
        metadata.palette.entries.push_back({i, 255 - i, (i * 7) % 256});
    metadata.componentMapping = {{0, 1, 0}, {0, 1, 1}, {0, 1, 2}};
    metadata.xml = {"<note>palette</note>"};
    return CJp2BoxWriter::file(metadata, codestream);
}

} // namespace

// The palette gives the bands when the image has as many bands as the component mapping has channels. (An
// image of one band gets the indices, its own look-up table mapping them: see the corpus.)
TEST(Jpeg2000Source, PaletteImages) {
    j2ktest::Coding coding;
    coding.width = 33;
    coding.height = 17;
    coding.levels = 2;
    const auto samples = j2ktest::pattern(coding);
    const std::string jp2File = paletteJp2(j2ktest::encode(coding, samples), 33, 17);

    nitfsample::Image colours = c8Image(coding, jp2File);
    colours.bands = 3;
    colours.irep = "RGB";
    OpenedSample sample(colours);
    const wholesamples::Image rgb =
        wholesamples::readBlocks(sample.reader(), sample.source<CNitfImageSourceJpeg2000>());
    int mismatches = 0;
    for (int y = 0; y < 17; ++y)
        for (int x = 0; x < 33; ++x) {
            const int index = samples(0, x, y);
            const size_t at = size_t(y) * 33 + x;
            mismatches += rgb.bands[0][at] != index;
            mismatches += rgb.bands[1][at] != 255 - index;
            mismatches += rgb.bands[2][at] != (index * 7) % 256;
        }
    EXPECT_EQ(mismatches, 0);
}

// (Several JPEG 2000 images in one file are read in the corpus.)

// "M8": the block mask record comes first; the codestream follows it, and a block marked absent is not read.
TEST(Jpeg2000Source, MaskedImagesSkipAbsentBlocks) {
    j2ktest::Coding coding;
    coding.width = coding.height = 64;
    coding.tileWidth = coding.tileHeight = 32;
    coding.levels = 2;
    const auto samples = j2ktest::pattern(coding);
    nitfsample::Image image = c8Image(coding, "");
    image.ic = "M8";
    image.blockData = {j2ktest::encode(coding, samples), "", "", ""};
    image.absentBlocks = {3};
    OpenedSample sample(image);
    auto& source = sample.source<CNitfImageSourceJpeg2000>();
    std::vector<unsigned char> block(32 * 32, 0xAA);
    char* buffer = reinterpret_cast<char*>(block.data());
    ASSERT_TRUE(source.readTileNonInterleaved(&sample.reader(), buffer, 0, 0, 1));
    EXPECT_EQ(block[5 * 32 + 7], samples(0, 7, 32 + 5));
    EXPECT_FALSE(source.readTileNonInterleaved(&sample.reader(), buffer, 0, 1, 1));
    EXPECT_EQ(block[5 * 32 + 7], 0);
    EXPECT_EQ(source.getTileDecodeCount(), 1);
}
