// The JPEG image source on files made here: streams coded by libjpeg directly, wrapped as NITF images by the
// independent sample writer, read back through the file reader.
#include <gtest/gtest.h>

#include <cstring>
#include <string>
#include <vector>

#include "BlockResampler.h"
#include "HostError.h"
#include "JpegStreamDecoder.h"
#include "JpegStreams.h"
#include "NitfImageSourceJpeg.h"
#include "NitfTestFile.h"

using jpegtest::Coding;
using jpegtest::Raster;

namespace {

// Samples of a read buffer: one byte each, or two in host order.
std::vector<uint16_t> samplesOf(const std::vector<char>& buffer, int bytes) {
    std::vector<uint16_t> out(buffer.size() / bytes);
    for (size_t i = 0; i < out.size(); ++i) {
        if (bytes == 1)
            out[i] = static_cast<unsigned char>(buffer[i]);
        else
            std::memcpy(&out[i], buffer.data() + 2 * i, 2);
    }
    return out;
}

CNitfImageSourceJpeg& jpegOf(OpenedSample& file) {
    return file.source<CNitfImageSourceJpeg>();
}

// One band of block (x, y) as samples, through the row-size-taking read (rows packed); empty when absent.
std::vector<uint16_t> bandOf(OpenedSample& file, int x, int y, int band) {
    const CNitfImagePropertiesIF& p = jpegOf(file).getImageProperties();
    const int bytes = p.getBpp() <= 8 ? 1 : 2;
    std::vector<char> buffer(static_cast<size_t>(p.getTileWidth()) * p.getTileHeight() * bytes);
    if (!jpegOf(file).readTileNonInterleaved(&file.reader(), buffer.data(), p.getTileWidth() * bytes, x, y,
                                             band))
        return {};
    return samplesOf(buffer, bytes);
}

// All bands of block (x, y), pixel-interleaved; empty when absent.
std::vector<uint16_t> blockOf(OpenedSample& file, int x, int y) {
    const CNitfImagePropertiesIF& p = jpegOf(file).getImageProperties();
    const int bytes = p.getBpp() <= 8 ? 1 : 2;
    const int row = p.getTileWidth() * p.getBandCount() * bytes;
    std::vector<char> buffer(static_cast<size_t>(row) * p.getTileHeight());
    if (!jpegOf(file).readTileInterleaved(&file.reader(), buffer.data(), row, x, y))
        return {};
    return samplesOf(buffer, bytes);
}

// `cols` x `rows` pixels in blocks of `blockWidth` x `blockHeight` (0: one block).
nitfsample::Image jpegImage(const std::string& ic, int cols, int rows, int blockWidth, int blockHeight,
                            int bands, int nbpp, char imode, std::vector<std::string> streams) {
    nitfsample::Image image;
    image.ic = ic;
    image.comrat = "00.0";
    image.cols = cols;
    image.rows = rows;
    image.nppbh = blockWidth;
    image.nppbv = blockHeight;
    image.bands = bands;
    image.nbpp = nbpp;
    image.imode = imode;
    image.irep = bands == 3 ? "RGB" : bands == 1 ? "MONO" : "MULTI";
    image.blockData = std::move(streams);
    return image;
}

// The samples of a block of `size` taken from component `component` of a raster (all components when -1).
std::vector<uint16_t> cut(const Raster& raster, int component = -1) {
    if (component < 0)
        return raster.samples;
    std::vector<uint16_t> out;
    for (int y = 0; y < raster.height; ++y)
        for (int x = 0; x < raster.width; ++x)
            out.push_back(raster.at(x, y, component));
    return out;
}

int maxDifference(const std::vector<uint16_t>& a, const std::vector<uint16_t>& b) {
    if (a.size() != b.size())
        return 1 << 20;
    int worst = 0;
    for (size_t i = 0; i < a.size(); ++i)
        worst = std::max(worst, std::abs(int(a[i]) - int(b[i])));
    return worst;
}

Coding lossless(int precision) {
    Coding coding;
    coding.precision = precision;
    coding.predictor = 1;
    return coding;
}

} // namespace

// ---- locating streams
// ---------------------------------------------------------------------------------------

TEST(JpegMarkerScan, FindsStreamStartsButNotThoseInsideComments) {
    const std::string soi("\xFF\xD8", 2);
    // A comment whose payload holds the start pattern, a stray FF FF D8 (fill bytes before a real marker),
    // and a comment that straddles the 64 KiB read chunk with the pattern right after the boundary: the
    // comment is skipped only to the chunk's end, so that pattern counts.
    std::string bytes = "xx" + soi + "\xFF\xFE" + std::string("\x00\x08", 2) + "ab" + soi + "cd";
    const size_t second = bytes.size() + 1;
    bytes += "\xFF" + soi;
    const size_t commentAt = 65536 - 10;
    bytes.resize(commentAt, 'z');
    bytes += "\xFF\xFE" + std::string("\x01\x00", 2); // 254 payload bytes, 8 before the boundary
    std::string payload(254, 'c');
    payload.replace(12, 2, soi);
    const size_t afterBoundary = bytes.size() + 12;
    bytes += payload;
    const size_t third = bytes.size();
    bytes += soi + "yy"; // and a start pattern split by the chunk after this one
    bytes.resize(2 * 65536 - 1, 'q');
    bytes += soi;
    ByteStream stream(bytes);

    auto starts =
        CNitfImageSourceJpeg::findStreamStarts(stream, 0, static_cast<long long>(bytes.size()), 100);
    EXPECT_EQ(starts, (std::vector<unsigned long long>{2, second, afterBoundary, third, 2 * 65536 - 1}));
    // The limit stops early; an offset shifts the positions; a shorter range misses the split pattern.
    EXPECT_EQ(CNitfImageSourceJpeg::findStreamStarts(stream, 0, 100000, 2).size(), 2u);
    EXPECT_EQ(CNitfImageSourceJpeg::findStreamStarts(stream, 3, 100000, 100).front(), second);
    EXPECT_EQ(CNitfImageSourceJpeg::findStreamStarts(stream, 0, 2 * 65536, 100).size(), 4u);
}

// ---- defaults
// ---------------------------------------------------------------------------------------------

TEST(JpegDefaults, TablesFillStreamsThatLackThem) {
    const Raster raster = jpegtest::pattern(64, 48, 1, 8, 3);
    for (int quality = 1; quality <= 5; ++quality) {
        // Coded with default table `quality` (its values taken as natural order, as the decoder installs
        // them), then stripped of every table: the defaults must reproduce libjpeg's own decoding.
        const unsigned short* listed = CJpegStreamDecoder::defaultQuantTable(quality);
        ASSERT_NE(listed, nullptr);
        unsigned table[64];
        for (int i = 0; i < 64; ++i)
            table[i] = listed[i];
        Coding coding;
        coding.quantTable = table;
        const std::string full = jpegtest::encode(raster, coding);
        const Raster expected = jpegtest::decode(full);
        const std::string bare = jpegtest::removeSegments(jpegtest::removeSegments(full, 0xDB), 0xC4);
        ASSERT_LT(bare.size(), full.size());

        nitfsample::Image image = jpegImage("C3", 64, 48, 0, 0, 1, 8, 'B', {bare});
        image.comrat = "00." + std::to_string(quality);
        OpenedSample file(image);
        EXPECT_EQ(bandOf(file, 0, 0, 0), expected.samples) << "COMRAT " << image.comrat;
    }
    // Spot checks against the published lists: 1 and 2 keep their diagonal layout, 5 starts at 4.
    EXPECT_EQ(CJpegStreamDecoder::defaultQuantTable(1)[10], 78);
    EXPECT_EQ(CJpegStreamDecoder::defaultQuantTable(2)[63], 255);
    EXPECT_EQ(CJpegStreamDecoder::defaultQuantTable(3)[63], 91);
    EXPECT_EQ(CJpegStreamDecoder::defaultQuantTable(5)[0], 4);
    EXPECT_EQ(CJpegStreamDecoder::defaultQuantTable(0), nullptr);
    EXPECT_EQ(CJpegStreamDecoder::defaultQuantTable(6), nullptr);
}

TEST(JpegDefaults, CustomTablesRateInstallsNoQuantisationTable) {
    const Raster raster = jpegtest::pattern(32, 32, 1, 8, 4);
    const std::string full = jpegtest::encode(raster, Coding{});
    const std::string noQuant = jpegtest::removeSegments(full, 0xDB);
    OpenedSample file(jpegImage("C3", 32, 32, 32, 32, 1, 8, 'B', {noQuant}));
    EXPECT_THROW(
        {
            std::vector<char> buffer(32 * 32);
            jpegOf(file).readTileNonInterleaved(&file.reader(), buffer.data(), 32, 0, 0, 0);
        },
        vexo::Exception);
    // The Huffman defaults come whatever the rate.
    nitfsample::Image huffmanless =
        jpegImage("C3", 32, 32, 32, 32, 1, 8, 'B', {jpegtest::removeSegments(full, 0xC4)});
    OpenedSample second(huffmanless);
    EXPECT_EQ(bandOf(second, 0, 0, 0), jpegtest::decode(full).samples);
}

// ---- round trips
// ------------------------------------------------------------------------------------------

TEST(JpegSource, LosslessRoundTripsAreExactMaskedOrNot) {
    for (int precision : {8, 12}) {
        const int nbpp = precision;
        std::vector<Raster> blocks;
        std::vector<std::string> streams;
        for (int i = 0; i < 4; ++i) {
            blocks.push_back(jpegtest::pattern(24, 20, 1, precision, 10 * i + precision));
            streams.push_back(jpegtest::encode(blocks.back(), lossless(precision)));
        }
        nitfsample::Image image = jpegImage("C5", 48, 40, 24, 20, 1, nbpp, 'B', streams);
        OpenedSample plain(image);
        for (int i = 0; i < 4; ++i)
            EXPECT_EQ(bandOf(plain, i % 2, i / 2, 0), cut(blocks[i])) << precision << "-bit block " << i;

        image.ic = "M5";
        image.absentBlocks = {1};
        OpenedSample masked(image);
        EXPECT_TRUE(bandOf(masked, 1, 0, 0).empty()) << "an absent block reads as absent";
        for (int i : {0, 2, 3})
            EXPECT_EQ(bandOf(masked, i % 2, i / 2, 0), cut(blocks[i]))
                << precision << "-bit masked block " << i;

        // The row-size-free read uses the image's own row size: two bytes per 12-bit sample as well.
        std::vector<char> buffer(24 * 20 * (precision == 8 ? 1 : 2));
        EXPECT_TRUE(jpegOf(masked).readTileNonInterleaved(&masked.reader(), buffer.data(), 0, 0, 1));
        EXPECT_EQ(samplesOf(buffer, precision == 8 ? 1 : 2), cut(blocks[2]));
    }
}

TEST(JpegSource, DctStreamsMatchLibjpeg) {
    // 12-bit extended sequential, and 8-bit progressive with restart markers.
    for (int precision : {12, 8}) {
        Coding coding;
        coding.precision = precision;
        coding.quality = 85;
        coding.progressive = precision == 8;
        coding.restartRows = 1;
        const Raster raster = jpegtest::pattern(40, 40, 1, precision, 5);
        const std::string stream = jpegtest::encode(raster, coding);
        OpenedSample file(jpegImage("C3", 40, 40, 40, 40, 1, precision, 'B', {stream}));
        const std::vector<uint16_t> decoded = bandOf(file, 0, 0, 0);
        EXPECT_EQ(decoded, jpegtest::decode(stream).samples) << precision << "-bit";
        EXPECT_LE(maxDifference(decoded, raster.samples), precision == 8 ? 20 : 40) << precision << "-bit";
        EXPECT_FALSE(jpegOf(file).hasNitfApp6());
    }
}

TEST(JpegSource, BandSequentialStreamsPerBand) {
    // IMODE S, 3 bands, 2 x 1 blocks: six 12-bit lossless streams, band after band, in an M5 image with one
    // absent entry.
    std::vector<Raster> planes;
    std::vector<std::string> streams;
    for (int i = 0; i < 6; ++i) {
        planes.push_back(jpegtest::pattern(16, 16, 1, 12, 7 * i));
        streams.push_back(jpegtest::encode(planes.back(), lossless(12)));
    }
    nitfsample::Image image = jpegImage("C5", 32, 16, 16, 16, 3, 12, 'S', streams);
    OpenedSample file(image);
    for (int band = 0; band < 3; ++band)
        EXPECT_EQ(bandOf(file, 1, 0, band), cut(planes[band * 2 + 1])) << "band " << band;

    const long long before = jpegOf(file).getDecodeCount();
    const std::vector<uint16_t> whole = blockOf(file, 0, 0);
    EXPECT_EQ(jpegOf(file).getDecodeCount() - before, 3) << "one stream per band";
    ASSERT_EQ(whole.size(), 16u * 16u * 3u);
    for (int band = 0; band < 3; ++band)
        for (int p = 0; p < 16 * 16; ++p)
            ASSERT_EQ(whole[p * 3 + band], planes[band * 2].samples[p]) << "band " << band << " pixel " << p;
}

// (Pixel-interleaved blocks decoded once for their bands are checked with the region reader; YCbCr streams
// delivered as RGB on the corpus.)

// ---- blocks of another size
// -------------------------------------------------------------------------------

TEST(JpegResampling, IndexMaps) {
    // Enlarging 96 to 128 by hand: the first entry covers one more than the ratio, then every source index
    // covers 4/3 destination entries.
    const std::vector<int> up = CBlockResampler::indexMap(128, 96);
    EXPECT_EQ(std::vector<int>(up.begin(), up.begin() + 10),
              (std::vector<int>{0, 0, 1, 2, 2, 3, 4, 5, 5, 6}));
    EXPECT_EQ(up.back(), 95);
    for (size_t i = 1; i < up.size(); ++i)
        ASSERT_LE(up[i] - up[i - 1], 1);
    // Enlarging 512 to 1023 never points past the source; reducing takes every other entry; equal sizes map
    // each entry to itself.
    const std::vector<int> i1 = CBlockResampler::indexMap(1023, 512);
    EXPECT_EQ(i1.back(), 511);
    EXPECT_EQ(CBlockResampler::indexMap(4, 8), (std::vector<int>{0, 2, 4, 6}));
    EXPECT_EQ(CBlockResampler::indexMap(3, 3), (std::vector<int>{0, 1, 2}));
}

TEST(JpegResampling, StreamsOfAnotherSizeFitTheirBlock) {
    const Raster small = jpegtest::pattern(96, 96, 1, 8, 13);
    OpenedSample enlarged(
        jpegImage("C5", 128, 128, 128, 128, 1, 8, 'B', {jpegtest::encode(small, lossless(8))}));
    const std::vector<uint16_t> up = bandOf(enlarged, 0, 0, 0);
    const std::vector<int> map = CBlockResampler::indexMap(128, 96);
    ASSERT_EQ(up.size(), 128u * 128u);
    for (int y = 0; y < 128; ++y)
        for (int x = 0; x < 128; ++x)
            ASSERT_EQ(up[y * 128 + x], small.at(map[x], map[y])) << x << ", " << y;

    const Raster large = jpegtest::pattern(64, 64, 1, 8, 14);
    OpenedSample reduced(jpegImage("C5", 32, 32, 32, 32, 1, 8, 'B', {jpegtest::encode(large, lossless(8))}));
    const std::vector<uint16_t> down = bandOf(reduced, 0, 0, 0);
    ASSERT_EQ(down.size(), 32u * 32u);
    for (int y = 0; y < 32; ++y)
        for (int x = 0; x < 32; ++x)
            ASSERT_EQ(down[y * 32 + x], large.at(2 * x, 2 * y)) << x << ", " << y;

    // Two-byte samples keep only their low byte, sign-extended, when columns are resampled: how these images
    // have always been delivered.
    const Raster deep = jpegtest::pattern(12, 16, 1, 12, 15);
    OpenedSample narrowed(
        jpegImage("C5", 16, 16, 16, 16, 1, 12, 'B', {jpegtest::encode(deep, lossless(12))}));
    const std::vector<uint16_t> wide = bandOf(narrowed, 0, 0, 0);
    const std::vector<int> columns = CBlockResampler::indexMap(16, 12);
    ASSERT_EQ(wide.size(), 256u);
    for (int y = 0; y < 16; ++y)
        for (int x = 0; x < 16; ++x)
            ASSERT_EQ(wide[y * 16 + x], uint16_t(int16_t(int8_t(deep.at(columns[x], y) & 0xFF))));

    // A whole interleaved block is delivered as coded: the stream's rows at the block's row spacing, the rest
    // of the buffer untouched.
    std::vector<unsigned char> coded(128 * 128, 0xEE);
    ASSERT_TRUE(enlarged.source().readTileInterleaved(&enlarged.reader(),
                                                      reinterpret_cast<char*>(coded.data()), 128, 0, 0));
    EXPECT_EQ(coded[95 * 128 + 95], small.at(95, 95));
    EXPECT_EQ(coded[96], 0xEE);
    EXPECT_EQ(coded[96 * 128], 0xEE);
}

// ---- amplitude mapping
// --------------------------------------------------------------------------------------------

namespace {

std::string bigEndian16(unsigned value) {
    return std::string{static_cast<char>(value >> 8), static_cast<char>(value & 0xFF)};
}

// A 1-band 12-bit image whose one lossless stream carries the amplitude marker, with an IOMAPA TRE.
nitfsample::Image mappedImage(const Raster& raster, unsigned short amplitudeOffset, const std::string& tre) {
    Coding coding = lossless(12);
    coding.app6 = {jpegtest::amplitudeMarker(amplitudeOffset)};
    nitfsample::Image image =
        jpegImage("C5", raster.width, raster.height, 0, 0, 1, 12, 'B', {jpegtest::encode(raster, coding)});
    image.ixshd = {{"IOMAPA", tre}};
    return image;
}

Raster ramp() {
    Raster raster{8, 4, 1, {0, 1, 100, 1000, 2048, 3000, 4094, 4095}};
    for (int row = 1; row < 4; ++row)
        for (int i = 0; i < 8; ++i)
            raster.samples.push_back(raster.samples[i]);
    return raster;
}

std::vector<uint16_t> firstRow(const std::vector<uint16_t>& band) {
    return std::vector<uint16_t>(band.begin(), band.begin() + 8);
}

} // namespace

// IOMAPA data are given field by field: method, table ID, S1, S2, then the method's own fields.
TEST(JpegAmplitudeMapping, MethodsAgainstHandComputedValues) {
    const Raster input = ramp();
    OpenedSample shift(mappedImage(input, 0, std::string("0010") + "02"));
    EXPECT_EQ(firstRow(bandOf(shift, 0, 0, 0)), (std::vector<uint16_t>{0, 0, 25, 250, 512, 750, 1023, 1023}));
    EXPECT_TRUE(jpegOf(shift).hasNitfApp6());
    OpenedSample unchanged(mappedImage(input, 0, std::string("0010") + "00"));
    EXPECT_EQ(bandOf(unchanged, 0, 0, 0), input.samples) << "S2 = 0 leaves samples as decoded";

    // Table value 4095 - s, S1 = 0, S2 = 1, offset 100: round((4095 - s) / 2) + 50, at most 2047.
    std::string table = std::string("0011") + "07" + "00" + "01";
    for (int s = 0; s < 4096; ++s)
        table += bigEndian16(4095 - s);
    OpenedSample lookUp(mappedImage(input, 100, table));
    EXPECT_EQ(jpegOf(lookUp).getAmplitudeOffset(), 0) << "known only once a stream is read";
    EXPECT_EQ(firstRow(bandOf(lookUp, 0, 0, 0)),
              (std::vector<uint16_t>{2047, 2047, 2047, 1598, 1074, 598, 51, 50}));
    EXPECT_EQ(jpegOf(lookUp).getAmplitudeOffset(), 100);

    // r = 2, S1 = S2 = 0: (e^(s/c) - 1) * 2048 with c = 4095 / ln(4095 / 2048 + 1).
    OpenedSample logarithmic(mappedImage(input, 0, std::string("0012") + "07" + "00" + "00" + "002" + "000"));
    EXPECT_EQ(firstRow(bandOf(logarithmic, 0, 0, 0)),
              (std::vector<uint16_t>{0, 1, 56, 630, 1499, 2531, 4093, 4095}));
    // r = 1.5, S1 = S2 = 1, offset 100: 50 + the curve, at most 1023.
    OpenedSample scaled(mappedImage(input, 100, std::string("0012") + "07" + "01" + "01" + "001" + "128"));
    const std::vector<uint16_t> row = firstRow(bandOf(scaled, 0, 0, 0));
    EXPECT_EQ(row[0], 50);
    EXPECT_EQ(row[3], 239);
    EXPECT_EQ(row[7], 1023);
}

TEST(JpegAmplitudeMapping, MethodThreeWarnsOncePerSource) {
    CapturedWarnings warnings;
    const Raster input = ramp();
    OpenedSample file(mappedImage(
        input, 0, std::string("0013") + "07" + "00" + "00" + "1" + "0000" + "4095" + std::string(24, '\0')));
    EXPECT_EQ(bandOf(file, 0, 0, 0), input.samples);
    EXPECT_EQ(bandOf(file, 0, 0, 0), input.samples);
    EXPECT_EQ(warnings.messages(),
              std::vector<std::string>{"IOMAPA - Output Amplitude Mapping Method 3 is not supported."});
}

TEST(JpegAmplitudeMapping, OnlyTheNitfAmplitudeMarkerCounts) {
    // The "NITF" marker of every NITF stream, a foreign APP6 and a short one are passed over; the
    // amplitude marker is recognised without regard to case.
    const Raster input = ramp();
    Coding coding = lossless(12);
    std::string nitf("NITF\0\x02\x00"
                     "B"
                     "\x00\x01\x00\x01\x00\x0c\x00\x04\x00\x00\x0c\x01\x01\x00\x00",
                     23);
    std::string lower = jpegtest::amplitudeMarker(321);
    lower.replace(0, 4, "nitf");
    coding.app6 = {nitf, "FOREIGN", "NITF0001.A", lower};
    nitfsample::Image image = jpegImage("C5", 8, 4, 0, 0, 1, 12, 'B', {jpegtest::encode(input, coding)});
    OpenedSample file(image);
    EXPECT_EQ(bandOf(file, 0, 0, 0), input.samples) << "no IOMAPA: nothing to map";
    EXPECT_TRUE(jpegOf(file).hasNitfApp6());
    EXPECT_EQ(jpegOf(file).getAmplitudeOffset(), 321);

    coding.app6 = {nitf, "NITF0002.A"};
    image.blockData = {jpegtest::encode(input, coding)};
    OpenedSample plain(image);
    bandOf(plain, 0, 0, 0);
    EXPECT_FALSE(jpegOf(plain).hasNitfApp6());
}

// ---- damage
// -----------------------------------------------------------------------------------------------

TEST(JpegDamage, CorruptStreamsRaiseAndLeaveTheSourceUsable) {
    const Raster good = jpegtest::pattern(16, 16, 1, 8, 21);
    const std::string stream = jpegtest::encode(good, Coding{});
    const std::string soi("\xFF\xD8", 2);
    struct Case {
        const char* what;
        std::string bytes;
        int nbpp;
    };
    const std::vector<Case> cases = {
        {"truncated", stream.substr(0, stream.size() / 2), 8},
        {"garbage after SOI", soi + std::string(200, '\x5A'), 8},
        {"huge dimensions", jpegtest::encode(jpegtest::pattern(1024, 1024, 1, 8), lossless(8)), 8},
        {"precision above NBPP", jpegtest::encode(jpegtest::pattern(16, 16, 1, 12), lossless(12)), 8},
        {"8-bit stream in a 12-bit image", stream, 12},
        {"three components in one band", jpegtest::encode(jpegtest::pattern(16, 16, 3, 8), Coding{}), 8},
        {"no tables, no default", jpegtest::removeSegments(stream, 0xDB), 8},
        {"header only", stream.substr(0, 20), 8}};
    for (const Case& c : cases) {
        // The damaged stream comes first, a good one second: both blocks must behave.
        nitfsample::Image image = jpegImage(
            "M3", 32, 16, 16, 16, 1, c.nbpp, 'B',
            {c.bytes,
             c.nbpp == 8 ? stream : jpegtest::encode(jpegtest::pattern(16, 16, 1, 12), lossless(12))});
        OpenedSample file(image);
        const int bytes = c.nbpp == 8 ? 1 : 2;
        std::vector<char> buffer(16 * 16 * bytes, 'x');
        EXPECT_THROW(jpegOf(file).readTileNonInterleaved(&file.reader(), buffer.data(), 16 * bytes, 0, 0, 0),
                     vexo::Exception)
            << c.what;
        // The base's read turns the failure into a zero-filled block.
        EXPECT_FALSE(jpegOf(file).readTileNonInterleaved(&file.reader(), buffer.data(), 0, 0, 0)) << c.what;
        EXPECT_EQ(buffer, std::vector<char>(buffer.size(), 0)) << c.what;
        EXPECT_EQ(bandOf(file, 1, 0, 0).size(), 256u) << c.what << ": the next block still decodes";
    }
}

TEST(JpegDamage, ReadsOutsideTheImageOrItsRowsAreRefused) {
    const Raster raster = jpegtest::pattern(16, 16, 1, 12, 22);
    OpenedSample file(jpegImage("C5", 16, 16, 16, 16, 1, 12, 'B', {jpegtest::encode(raster, lossless(12))}));
    std::vector<char> buffer(16 * 16 * 2);
    EXPECT_THROW(jpegOf(file).readTileNonInterleaved(&file.reader(), buffer.data(), 24, 0, 0, 0),
                 vexo::Exception)
        << "24-byte rows cannot take 16 two-byte samples";
    EXPECT_FALSE(jpegOf(file).readTileNonInterleaved(&file.reader(), buffer.data(), 32, 1, 0, 0));
    EXPECT_FALSE(jpegOf(file).readTileNonInterleaved(&file.reader(), buffer.data(), 32, 0, 0, 1));
    EXPECT_FALSE(jpegOf(file).readTileInterleaved(&file.reader(), buffer.data(), 32, -1, 0));
    EXPECT_FALSE(jpegOf(file).readTileInterleaved(nullptr, buffer.data(), 32, 0, 0));
    EXPECT_TRUE(jpegOf(file).readTileInterleaved(&file.reader(), buffer.data(), 32, 0, 0));
}
