// Damaged JPEG 2000 data: refused with vexo::Exception and OpenJPEG's reason, or read as far as it goes with
// warnings, never a crash; the source stays usable; no allocation the data cannot justify; no read outside
// the image segment.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "HostError.h"
#include "J2kStreams.h"
#include "NitfImageSourceJpeg2000.h"
#include "NitfTestFile.h"
#include "TreBytes.h"
#include "WholeSamples.h"

namespace {

j2ktest::Coding tiledGrey() {
    j2ktest::Coding coding;
    coding.width = coding.height = 128;
    coding.tileWidth = coding.tileHeight = 64;
    coding.levels = 3;
    return coding;
}

nitfsample::Image c8Image(const std::string& data, int cols, int rows, int blockWidth, int blockHeight) {
    nitfsample::Image image;
    image.ic = "C8";
    image.comrat = "N001";
    image.cols = cols;
    image.rows = rows;
    image.nppbh = blockWidth;
    image.nppbv = blockHeight;
    image.blockData = {data};
    return image;
}

// Where tile-part `tile`'s start-of-tile marker lies (SOT, Lsot 10, Isot).
size_t tileStart(const std::string& codestream, int tile) {
    const std::string sot = std::string("\xFF\x90\x00\x0A", 4) + char(tile >> 8) + char(tile & 0xFF);
    return codestream.find(sot);
}

} // namespace

TEST(Jpeg2000Damage, ADamagedTileRaisesAndTheOthersStillRead) {
    const j2ktest::Coding coding = tiledGrey();
    const auto samples = j2ktest::pattern(coding);
    std::string codestream = j2ktest::encode(coding, samples);
    const size_t tile = tileStart(codestream, 3);
    ASSERT_NE(tile, std::string::npos);
    codestream[tile + 5] = 40; // Isot: a tile the image does not have

    CapturedWarnings warnings;
    OpenedSample sample(c8Image(codestream, 128, 128, 64, 64));
    auto& source = sample.source<CNitfImageSourceJpeg2000>();
    std::vector<unsigned char> block(64 * 64);
    char* buffer = reinterpret_cast<char*>(block.data());
    for (int attempt = 0; attempt < 2; ++attempt) {
        const std::string refusal =
            refusalOf([&] { source.readTileInterleaved(&sample.reader(), buffer, 64, 1, 1); });
        EXPECT_NE(refusal.find("JPEG 2000 decoding failed"), std::string::npos) << refusal;
        EXPECT_NE(refusal.find("ile"), std::string::npos) << "OpenJPEG's reason";
        ASSERT_TRUE(source.readTileInterleaved(&sample.reader(), buffer, 64, 1, 0));
        for (int y = 0; y < 64; ++y)
            for (int x = 0; x < 64; ++x)
                ASSERT_EQ(block[size_t(y) * 64 + x], samples(0, 64 + x, y));
    }
    // The block reader callers use turns the failure into a zero-filled block.
    std::fill(block.begin(), block.end(), 0xAA);
    EXPECT_FALSE(source.readTileNonInterleaved(&sample.reader(), buffer, 0, 1, 1));
    EXPECT_EQ(block[0], 0);
}

TEST(Jpeg2000Damage, ACutCodestreamReadsWhatItHolds) {
    const j2ktest::Coding coding = tiledGrey();
    const auto samples = j2ktest::pattern(coding);
    const std::string whole = j2ktest::encode(coding, samples);
    const size_t cut = tileStart(whole, 2) + 200; // tiles 0 and 1 whole, 2 begun, 3 missing
    // The rest of the codestream follows in the file, in a text segment: the reader must not take it.
    nitfsample::File file = fileOf(c8Image(whole.substr(0, cut), 128, 128, 64, 64));
    nitfsample::Text rest;
    rest.data = whole.substr(cut);
    file.texts = {rest};

    CapturedWarnings warnings;
    OpenedSample sample(file);
    auto& source = sample.source<CNitfImageSourceJpeg2000>();
    std::vector<unsigned char> block(64 * 64);
    char* buffer = reinterpret_cast<char*>(block.data());
    ASSERT_TRUE(source.readTileInterleaved(&sample.reader(), buffer, 64, 0, 0));
    EXPECT_EQ(block[64 * 10 + 10], samples(0, 10, 10));
    for (int y = 0; y < 2; ++y)
        for (int x = 0; x < 2; ++x) {
            try {
                source.readTileInterleaved(&sample.reader(), buffer, 64, x, y);
            } catch (const vexo::Exception& e) {
                EXPECT_NE(std::string(e.getMessage()).find("JPEG 2000"), std::string::npos);
            }
        }
    EXPECT_LE(source.getBytesRead(), static_cast<long long>(cut) * 4 * 2)
        << "headers are read again per tile";
    // Nothing of the text segment was read: the missing tile cannot have come out whole.
    bool lastTileWhole = false;
    try {
        lastTileWhole = source.readTileInterleaved(&sample.reader(), buffer, 64, 1, 1) &&
                        block[64 * 63 + 63] == samples(0, 127, 127) && block[0] == samples(0, 64, 64);
    } catch (const vexo::Exception&) {
    }
    EXPECT_FALSE(lastTileWhole);
}

namespace {

// The start of a codestream: SOC and SIZ with `components` 8-bit components, then the end marker.
std::string mainHeader(uint32_t width, uint32_t height, uint32_t tileWidth, uint32_t tileHeight,
                       int components) {
    std::string out("\xFF\x4F\xFF\x51", 4);
    out.resize(42, '\0');
    out.replace(4, 2, bigEndian(38 + 3 * components, 2));
    for (auto [at, value] :
         {std::pair<size_t, uint32_t>{8, width}, {12, height}, {24, tileWidth}, {28, tileHeight}})
        out.replace(at, 4, bigEndian(value, 4));
    out.replace(40, 2, bigEndian(components, 2));
    for (int c = 0; c < components; ++c)
        out += std::string("\x07\x01\x01", 3);
    return out + std::string("\xFF\xD9", 2);
}

// A real codestream of a small image whose header claims another size.
std::string claimingSize(uint32_t width, uint32_t height, uint32_t tileWidth, uint32_t tileHeight) {
    j2ktest::Coding coding;
    coding.width = coding.height = 16;
    coding.levels = 2;
    std::string codestream = j2ktest::encode(coding, j2ktest::pattern(coding));
    for (auto [at, value] :
         {std::pair<size_t, uint32_t>{8, width}, {12, height}, {24, tileWidth}, {28, tileHeight}})
        codestream.replace(at, 4, bigEndian(value, 4));
    return codestream;
}

} // namespace

// Sizes the data cannot pay for are refused before OpenJPEG allocates anything for them.
TEST(Jpeg2000Damage, ClaimsLargerThanTheDataAreRefused) {
    {
        SCOPED_TRACE("255 x 255 tiles of 16384 components");
        OpenedSample sample(c8Image(mainHeader(255, 255, 1, 1, 16384), 255, 255, 1, 1));
        EXPECT_NE(refusalOf([&] { sample.source(); }).find("cannot hold"), std::string::npos);
    }
    {
        SCOPED_TRACE("25 tiles of 8000 x 8000 in a few bytes");
        OpenedSample sample(c8Image(claimingSize(40000, 40000, 8000, 8000), 40000, 40000, 8000, 8000));
        auto& source = sample.source<CNitfImageSourceJpeg2000>();
        std::vector<char> small(16 * 16);
        EXPECT_NE(refusalOf([&] {
                      source.readRegion(&sample.reader(), 0, 0, 0, 16, 16, 0, 1, small.data(), 16);
                  }).find("cannot code"),
                  std::string::npos);
    }
    {
        SCOPED_TRACE("one 40000 x 40000 tile, a small area of it asked for");
        OpenedSample sample(c8Image(claimingSize(40000, 40000, 40000, 40000), 40000, 40000, 8192, 8192));
        auto& source = sample.source<CNitfImageSourceJpeg2000>();
        std::vector<char> small(16 * 16);
        EXPECT_THROW(source.readRegion(&sample.reader(), 0, 100, 100, 16, 16, 0, 1, small.data(), 16),
                     vexo::Exception);
    }
}

TEST(Jpeg2000Damage, DataThatIsNotJpeg2000IsRefused) {
    const struct {
        std::string data;
        const char* message;
    } cases[] = {
        {std::string(64, 'x'), "neither a JPEG 2000 codestream nor a JP2 file"},
        {std::string("\0\0\0\x0CjP  \r\n\x87\n", 12) + std::string("\0\0\0\x10"
                                                                   "ftypjp2 \0\0\0\0",
                                                                   16),
         "no codestream box"},
        {std::string("\xFF\x4F\xFF\x51\x00\x29", 6) + std::string(40, '\0'), "declares 0 components"},
        {mainHeader(16, 16, 16, 16, 1).substr(0, 30), "does not start with a codestream header"},
        {mainHeader(16, 16, 16, 16, 1).substr(0, 44), "cut short"}};
    for (const auto& c : cases) {
        OpenedSample sample(c8Image(c.data, 16, 16, 16, 16));
        const std::string refusal = refusalOf([&] { sample.source(); });
        EXPECT_NE(refusal.find(c.message), std::string::npos) << refusal;
    }
}
