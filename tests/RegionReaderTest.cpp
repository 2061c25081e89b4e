// The region reader: typed samples of windows and band subsets, checked against the samples the independent
// sample writer put into the file, against whole-image reads of the corpus, and by how often blocks decode.
#include <gtest/gtest.h>

#include <cstdint>
#include <memory>
#include <random>
#include <string>
#include <vector>

#include "Canonical.h"
#include "HostError.h"
#include "JpegStreams.h"
#include "Manifest.h"
#include "NitfImageSource.h"
#include "NitfRegionReader.h"
#include "NitfTestFile.h"

namespace {

using nitfsample::Image;

// A sample's image 0 with a region reader over it.
struct OpenRegion {
    explicit OpenRegion(const Image& image) : sample(image), region(&sample.reader(), &sample.source()) {}
    OpenedSample sample;
    CNitfRegionReader region;
};

// Sample `index` of a read buffer as a 64-bit pattern (native or big-endian).
uint64_t valueAt(const std::vector<unsigned char>& buffer, size_t index, int bytes, bool bigEndian) {
    uint64_t value = 0;
    const unsigned char* p = buffer.data() + index * bytes;
    for (int i = 0; i < bytes; ++i)
        value |= static_cast<uint64_t>(p[bigEndian ? bytes - 1 - i : i]) << (8 * i);
    return value;
}

// What the region reader must deliver for a stored sample: NBPP bits, sign-extended for SI, in the
// container.
uint64_t expected(const Image& image, int band, int row, int col, int bytes) {
    uint64_t value = nitfsample::sampleAt(image, band, row, col);
    if (image.pvtype == "SI" && image.nbpp < 64 && (value >> (image.nbpp - 1)) & 1)
        value |= ~uint64_t(0) << image.nbpp;
    return bytes == 8 ? value : value & ((uint64_t(1) << (8 * bytes)) - 1);
}

Image blocked(char imode, int nbpp, int bands, const char* pvtype) {
    Image image;
    image.cols = 45;
    image.rows = 31;
    image.nppbh = 16;
    image.nppbv = 8;
    image.imode = imode;
    image.nbpp = nbpp;
    image.bands = bands;
    image.pvtype = nbpp == 1 ? "B" : pvtype;
    return image;
}

} // namespace

TEST(RegionReader, WindowsOfEveryLayoutAndDepthHoldTheStoredSamples) {
    std::mt19937 random(7);
    const struct {
        int nbpp;
        const char* pvtype;
        CNitfRegionReader::eSampleType_t type;
    } depths[] = {{1, "B", CNitfRegionReader::eUInt8},          {4, "INT", CNitfRegionReader::eUInt8},
                  {8, "SI", CNitfRegionReader::eInt8},          {12, "SI", CNitfRegionReader::eInt16},
                  {16, "INT", CNitfRegionReader::eUInt16},      {32, "R", CNitfRegionReader::eFloat32},
                  {64, "C", CNitfRegionReader::eComplexFloat32}};
    for (char imode : {'B', 'P', 'R', 'S'}) {
        for (const auto& depth : depths) {
            SCOPED_TRACE(std::string("IMODE ") + imode + ", NBPP " + std::to_string(depth.nbpp) + " " +
                         depth.pvtype);
            const Image image = blocked(imode, depth.nbpp, 3, depth.pvtype);
            OpenRegion open(image);
            CNitfRegionReader& region = open.region;
            ASSERT_EQ(region.getSampleType(), depth.type);
            const int bytes = region.getSampleBytes();
            for (int trial = 0; trial < 6; ++trial) {
                const int x = random() % 45, y = random() % 31;
                const int w = 1 + random() % (45 - x), h = 1 + random() % (31 - y);
                const std::vector<int> bands = trial % 2 ? std::vector<int>{2, 0} : std::vector<int>{1};
                const bool interleaved = trial % 3 == 0, bigEndian = trial % 4 == 1;
                region.setBigEndian(bigEndian);
                std::vector<unsigned char> out(region.getBufferSize(w, h, static_cast<int>(bands.size())));
                const auto layout =
                    interleaved ? CNitfRegionReader::ePixelInterleaved : CNitfRegionReader::eBandSequential;
                const CNitfRegionReader::Result result = region.read(x, y, w, h, bands, out.data(), layout);
                EXPECT_EQ(result.failedBlocks + result.absentBlocks, 0);
                for (size_t k = 0; k < bands.size(); ++k)
                    for (int r = 0; r < h; ++r)
                        for (int c = 0; c < w; ++c) {
                            const size_t index =
                                interleaved ? (r * w + c) * bands.size() + k : (k * h + r) * w + c;
                            // A complex sample is two 32-bit numbers, each in the chosen order.
                            uint64_t got = valueAt(out, index, bytes, bigEndian);
                            if (depth.nbpp == 64 && !bigEndian)
                                got = got << 32 | got >> 32;
                            ASSERT_EQ(got, expected(image, bands[k], y + r, x + c, bytes))
                                << "window " << x << "," << y << "," << w << "," << h << " band " << bands[k]
                                << " at " << c << "," << r;
                        }
            }
        }
    }
}

TEST(RegionReader, EachBlockDecodesOncePerRead) {
    // Pixel-interleaved JPEG: the three bands of a block come out of one decode; band-sequential: one
    // stream per band; uncompressed band-interleaved blocks: each band read on its own, once.
    std::vector<std::string> pixelStreams, bandStreams;
    for (int i = 0; i < 4; ++i) {
        jpegtest::Coding coding;
        coding.predictor = 1;
        pixelStreams.push_back(jpegtest::encode(jpegtest::pattern(16, 16, 3, 8, i), coding));
        for (int b = 0; b < 3; ++b)
            bandStreams.push_back(jpegtest::encode(jpegtest::pattern(16, 16, 1, 8, 10 * i + b), coding));
    }
    const struct {
        char imode;
        std::vector<std::string> streams;
        long long decodes;
    } cases[] = {{'P', pixelStreams, 4}, {'S', bandStreams, 12}, {'B', {}, 12}};
    for (const auto& c : cases) {
        SCOPED_TRACE(std::string("IMODE ") + c.imode);
        Image image;
        image.cols = image.rows = 32;
        image.nppbh = image.nppbv = 16;
        image.bands = 3;
        image.imode = c.imode;
        if (!c.streams.empty()) {
            image.ic = "C5";
            image.comrat = "00.0";
            image.irep = "RGB";
            image.blockData = c.streams;
        }
        OpenRegion open(image);
        std::vector<unsigned char> out(open.region.getBufferSize(32, 32, 3));
        const long long before = open.sample.source().getDecodeCount();
        open.region.read(0, 0, 32, 32, {}, out.data(), CNitfRegionReader::ePixelInterleaved);
        EXPECT_EQ(open.sample.source().getDecodeCount() - before, c.decodes);
        // A window inside one block reads just that block.
        const long long again = open.sample.source().getDecodeCount();
        open.region.read(18, 2, 5, 5, {2, 1}, out.data());
        EXPECT_LE(open.sample.source().getDecodeCount() - again, c.imode == 'P' ? 1 : 2);
    }
}

TEST(RegionReader, AbsentBlocksAndBadRequests) {
    Image image = blocked('B', 8, 2, "INT");
    image.ic = "NM";
    image.absentBlocks = {1};
    OpenRegion open(image);
    std::vector<unsigned char> out(open.region.getBufferSize(45, 31, 2), 0x55);
    const CNitfRegionReader::Result result = open.region.read(0, 0, 45, 31, {}, out.data());
    EXPECT_EQ(result.absentBlocks, 2) << "block 1 of both bands";
    EXPECT_EQ(result.failedBlocks, 0);
    EXPECT_EQ(out[20], 0) << "block (1, 0) reads as zeros";
    EXPECT_EQ(out[0], nitfsample::sampleAt(image, 0, 0, 0));

    EXPECT_THROW(open.region.read(40, 0, 6, 1, {}, out.data()), vexo::Exception) << "past the right edge";
    EXPECT_THROW(open.region.read(0, 0, 0, 1, {}, out.data()), vexo::Exception) << "empty";
    EXPECT_THROW(open.region.read(0, 0, 1, 1, {2}, out.data()), vexo::Exception) << "no band 2";
}

TEST(RegionReader, TwelveAndSixteenBitJpegComeOutCanonical) {
    // A 12-bit DCT image written with NBPP 16 and a 16-bit lossless one: the raw form is big-endian.
    for (int precision : {12, 16}) {
        SCOPED_TRACE(std::to_string(precision) + "-bit");
        const jpegtest::Raster raster = jpegtest::pattern(24, 16, 1, precision, precision);
        jpegtest::Coding coding;
        coding.precision = precision;
        coding.predictor = precision == 16 ? 1 : 0;
        coding.quality = 100;
        Image image;
        image.cols = 24;
        image.rows = 16;
        image.nbpp = 16;
        image.abpp = precision;
        image.ic = precision == 16 ? "C5" : "C3";
        image.comrat = "00.0";
        image.blockData = {jpegtest::encode(raster, coding)};
        OpenedSample sample(image);
        const CanonicalImage canonical = canonicalImage(sample.path(), 0);
        ASSERT_EQ(canonical.bands.size(), 1u);
        const std::string expected = jpegtest::canonical(jpegtest::decode(image.blockData[0]), 0, precision);
        EXPECT_EQ(canonical.bands[0], expected);
    }
}

// For random windows and band subsets of the corpus's decodable images, the region reader gives exactly the
// matching part of the whole image.
TEST(RegionReaderCorpus, WindowsAreCutsOfTheWholeImage) {
    SKIP_WITHOUT_CORPUS();
    const Manifest& manifest = Manifest::get();
    std::mt19937 random(11);
    int images = 0;
    for (const CorpusFile& file : manifest.wellFormed()) {
        for (const nlohmann::json& entry : file.entry->value("images", nlohmann::json::array())) {
            const int index = entry.at("index").get<int>();
            CNitfFileReader reader;
            ASSERT_TRUE(reader.open(file.path.c_str()));
            std::unique_ptr<CNitfImageSource> source;
            try {
                source.reset(reader.getNewImageSource(index));
            } catch (const vexo::Exception&) {
                continue; // compressions not read by this build, and images without data
            }
            SCOPED_TRACE(file.relative + " image " + std::to_string(index));
            ++images;
            const CanonicalImage whole = canonicalImage(file.path, index, 1);
            CNitfRegionReader region(&reader, source.get());
            region.setBigEndian(true);
            const int width = region.getWidth(), height = region.getHeight(), bytes = region.getSampleBytes();
            for (int trial = 0; trial < 3; ++trial) {
                const int x = random() % width, y = random() % height;
                const int w = 1 + random() % std::min(width - x, 300),
                          h = 1 + random() % std::min(height - y, 300);
                const int band = random() % region.getBandCount();
                std::string out(region.getBufferSize(w, h, 1), '\0');
                region.read(x, y, w, h, {band}, &out[0]);
                for (int r = 0; r < h; ++r)
                    ASSERT_EQ(out.substr(static_cast<size_t>(r) * w * bytes, static_cast<size_t>(w) * bytes),
                              whole.bands[band].substr((static_cast<size_t>(y + r) * width + x) * bytes,
                                                       static_cast<size_t>(w) * bytes))
                        << "window " << x << "," << y << "," << w << "," << h << " band " << band << " row "
                        << r;
            }
        }
    }
    EXPECT_GT(images, 50);
}
