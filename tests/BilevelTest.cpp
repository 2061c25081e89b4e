// Bi-level ("C1", "M1") images: the decoder on streams coded here from the coding rules (and checked against
// an independent decoder when one is installed), the image source against the uncompressed one-bit path. (The
// corpus's bi-level images are checked with the other exactly decoded images.)
#include <gtest/gtest.h>

#include <cstdio>
#include <cstdlib>
#include <string>
#include <vector>

#include "BiLevelHuffman.h"
#include "BilevelStreams.h"
#include "HostError.h"
#include "NitfImageSourceBilevel.h"
#include "NitfTestFile.h"

using bileveltest::BitWriter;
using bileveltest::Coding;
using bileveltest::Page;

namespace {

struct Decoded {
    BiLevelHuffman::Result result;
    std::string pixels; // canonical, one byte per pixel
};

// Decodes into rows `lineBits` apart from bit `firstBit` of a buffer of 1 bits; the bits around the rows
// must stay 1.
Decoded decode(const std::string& coded, int width, int rows, bool twoDimensional, uint64_t firstBit = 0,
               uint64_t lineBits = 0) {
    lineBits = lineBits ? lineBits : width;
    std::vector<unsigned char> out((firstBit + rows * lineBits + 7) / 8 + 1, 0xFF);
    BiLevelHuffman decoder(width, twoDimensional);
    Decoded decoded{decoder.decode(reinterpret_cast<const unsigned char*>(coded.data()), coded.size(), rows,
                                   out.data(), firstBit, lineBits),
                    bileveltest::canonicalBits(out.data(), firstBit, width, rows, lineBits)};
    for (uint64_t bit = 0; bit < out.size() * 8; ++bit) {
        const bool inRow = bit >= firstBit && (bit - firstBit) % lineBits < static_cast<uint64_t>(width) &&
                           (bit - firstBit) / lineBits < static_cast<uint64_t>(rows);
        if (!inRow && !((out[bit / 8] >> (7 - bit % 8)) & 1))
            ADD_FAILURE() << "bit " << bit << " outside the rows was written";
    }
    return decoded;
}

// Row r: a white run of 7r, a black run of 7r, white to the end. The residues of 7r cover 0 to 63, so every
// terminating and make-up code of both colours is used.
Page everyRunLength() {
    Page runs{5600, 400, std::vector<uint8_t>(5600 * 400, 0)};
    for (int r = 0; r < runs.height; ++r)
        for (int c = 7 * r; c < 14 * r; ++c)
            runs.at(r, c) = 1;
    return runs;
}

} // namespace

TEST(BiLevelHuffman, DecodesEveryCodingOfEveryPage) {
    // Wide runs take several make-up codes; 37 columns keep rows off whole bytes.
    Page wide{6000, 6, std::vector<uint8_t>(36000, 0)};
    for (int c = 100; c < 5900; ++c)
        wide.at(2, c) = wide.at(3, c - 50) = 1;
    const Page pages[] = {bileveltest::documentPage(1728, 120, 1), bileveltest::noisePage(37, 40, 30, 2),
                          bileveltest::noisePage(64, 16, 3, 3), wide, everyRunLength()};
    for (const Page& page : pages)
        for (int k : {1, 2, 4, 1000})
            for (int fill : {0, 13}) {
                SCOPED_TRACE(std::to_string(page.width) + " wide, K " + std::to_string(k) + ", fill " +
                             std::to_string(fill));
                const std::string coded = bileveltest::encode(page, Coding{k, fill, 6});
                const Decoded plain = decode(coded, page.width, page.height, k > 1);
                EXPECT_EQ(plain.result.damage, BiLevelHuffman::eDamageNone);
                EXPECT_EQ(plain.result.rows, page.height);
                EXPECT_EQ(plain.result.codedBytes, coded.size());
                EXPECT_TRUE(plain.pixels == bileveltest::canonical(page));
                // Inside a wider bitmap, from an odd bit on.
                EXPECT_TRUE(decode(coded, page.width, page.height, k > 1, 5, page.width + 19).pixels ==
                            bileveltest::canonical(page));
            }
}

TEST(BiLevelHuffman, FirstLineCodedTwoDimensionallyRefersToWhite) {
    // EOL, tag 0, horizontal: white 3 (1000), black 2 (11); V0 on b1 = the end of the line. Black 1088 is
    // make-up 0000001110101 and terminating 0 0000110111 as published.
    BitWriter out;
    out.put(joined({"000000000001", "0", "001", "1000", "11", "1"}));
    out.put(joined({"000000000001", "1", "00110101", "0000001110101", "0000110111", "0111"}));
    Page expected{1090, 2, std::vector<uint8_t>(2180, 0)};
    expected.at(0, 3) = expected.at(0, 4) = 1;
    for (int c = 0; c < 1088; ++c)
        expected.at(1, c) = 1;
    const Decoded decoded = decode(out.bytes(), 1090, 2, true);
    EXPECT_EQ(decoded.result.damage, BiLevelHuffman::eDamageNone);
    EXPECT_TRUE(decoded.pixels == bileveltest::canonical(expected));
}

TEST(BiLevelHuffman, DamageEndsTheBlockWithWhatWasDecoded) {
    // Lines of 8 pixels. The first is white 4 (1011), black 4 (011) wherever it is complete; the rows after
    // the damage, and runs whose end was not decoded, are white.
    const std::string eol = "000000000001", firstLine = joined({"1011", "011"}), white8 = "10011";
    struct Case {
        const char* what;
        bool twoDimensional;
        std::string bits;
        BiLevelHuffman::eDamage_t damage;
        int rows;
    } cases[] = {
        {"8 zeros then 1: no code", false, eol + firstLine + eol + "000000001111",
         BiLevelHuffman::eDamageBadCode, 1},
        {"white 20 in a line of 8", false, eol + "0001000", BiLevelHuffman::eDamageRunPastLine, 0},
        {"white 4, then EOL", false, eol + "1011" + eol + white8, BiLevelHuffman::eDamageShortLine, 0},
        {"second line without EOL", false, eol + firstLine + white8, BiLevelHuffman::eDamageMissingEol, 1},
        {"data end inside a line", false, eol + firstLine + eol + "1", BiLevelHuffman::eDamageTruncated, 1},
        {"no data", false, "", BiLevelHuffman::eDamageTruncated, 0},
        {"VR1, then VR3 past the end", true, eol + "1" + firstLine + eol + "0" + "011" + "0000011",
         BiLevelHuffman::eDamageRunPastLine, 1},
        {"VL3 before the start", true, eol + "1" + joined({"0111", "0010"}) + eol + "0" + "0000010",
         BiLevelHuffman::eDamageBadCode, 1},
        {"extension code", true, eol + "1" + firstLine + eol + "0" + "0000001111",
         BiLevelHuffman::eDamageBadCode, 1}};
    for (const Case& c : cases) {
        SCOPED_TRACE(c.what);
        BitWriter out;
        out.put(c.bits);
        const Decoded decoded = decode(out.bytes(), 8, 3, c.twoDimensional);
        EXPECT_EQ(decoded.result.damage, c.damage) << BiLevelHuffman::describe(decoded.result.damage);
        EXPECT_EQ(decoded.result.rows, c.rows);
        EXPECT_EQ(decoded.result.damagedRow, c.rows);
        const char* row0 = c.bits.find(joined({"0111", "0010"})) != std::string::npos ? "\0\0\1\1\1\1\1\1"
                                                                                      : "\0\0\0\0\1\1\1\1";
        EXPECT_TRUE(decoded.pixels ==
                    (c.rows == 1 ? std::string(row0, 8) + std::string(16, '\0') : std::string(24, '\0')));
    }
}

TEST(BiLevelHuffman, DataCutAnywhereDecodeWhatTheyHold) {
    const Page page = bileveltest::noisePage(61, 12, 25, 4);
    for (int k : {1, 4}) {
        const std::string coded = bileveltest::encode(page, Coding{k, 0, 6});
        const std::string whole = bileveltest::canonical(page);
        int lastRows = 0;
        for (size_t cut = 0; cut < coded.size(); ++cut) {
            const Decoded decoded = decode(coded.substr(0, cut), page.width, page.height, k > 1);
            const int rows = decoded.result.rows;
            EXPECT_TRUE(decoded.result.damage == BiLevelHuffman::eDamageTruncated || rows == page.height)
                << cut << " " << BiLevelHuffman::describe(decoded.result.damage) << " " << coded.size();
            EXPECT_GE(rows, lastRows);
            EXPECT_TRUE(decoded.pixels.compare(0, rows * page.width, whole, 0, rows * page.width) == 0);
            lastRows = rows;
        }
        EXPECT_EQ(lastRows, page.height);
    }
}

// (Where a block ends, behind a seventh EOL or fill, is found when the source walks unmasked blocks.)

namespace {

// The blocks of a page, each coded on its own, in row-major order.
std::vector<std::string> codeBlocks(const Page& page, int width, int height, const Coding& coding) {
    std::vector<std::string> blocks;
    for (int y = 0; y < page.height / height; ++y)
        for (int x = 0; x < page.width / width; ++x) {
            Page block{width, height, {}};
            for (int r = 0; r < height; ++r)
                block.pixels.insert(block.pixels.end(), page.row(y * height + r) + x * width,
                                    page.row(y * height + r) + (x + 1) * width);
            blocks.push_back(bileveltest::encode(block, coding));
        }
    return blocks;
}

// 70 x 50 pixels in 2 x 2 blocks of 40 x 30; the padding of the partial blocks is `pad`.
nitfsample::Image blockedPage(const Page& page, uint64_t pad) {
    nitfsample::Image image;
    image.cols = 70;
    image.rows = 50;
    image.nppbh = 40;
    image.nppbv = 30;
    image.nbpp = 1;
    image.pvtype = "B";
    image.padValue = pad;
    image.sample = [page](int, int r, int c) { return page.row(r)[c]; };
    return image;
}

// Every block of band 0 and the whole bitmap, as the source delivers them.
std::vector<std::string> everything(CNitfImageSource& source, CNitfFile& file) {
    const CNitfImagePropertiesIF& p = source.getImageProperties();
    std::vector<std::string> out;
    for (int y = 0; y < p.getTileCountY(); ++y)
        for (int x = 0; x < p.getTileCountX(); ++x) {
            std::string block(static_cast<size_t>(p.getTileBandReadBufferSize()), '\0');
            EXPECT_TRUE(source.readTileNonInterleaved(&file, &block[0], 0, x, y));
            out.push_back(block);
        }
    std::string bitmap(80 * 50 / 8, '\0');
    EXPECT_TRUE(source.readBitmap(&bitmap[0], 0, 0, 70, 50, 80, 50));
    out.push_back(bitmap);
    return out;
}

} // namespace

TEST(BilevelSource, DeliversWhatAnUncompressedOneBitImageDelivers) {
    for (bool masked : {false, true}) {
        SCOPED_TRACE(masked ? "M1 and NM" : "C1 and NC");
        // Masked: block 1 absent, pad pixel 1 (so readBitmap inverts). Unmasked: blocks found by walking.
        const uint64_t pad = masked ? 1 : 0;
        Page page = bileveltest::documentPage(80, 60, 6);
        for (int r = 0; r < 60; ++r)
            for (int c = 0; c < 80; ++c)
                if (r >= 50 || c >= 70)
                    page.at(r, c) = static_cast<uint8_t>(pad);
        nitfsample::Image stored = blockedPage(page, pad);
        stored.ic = masked ? "NM" : "NC";
        nitfsample::Image coded = blockedPage(page, pad);
        coded.ic = masked ? "M1" : "C1";
        coded.comrat = "2DH";
        coded.blockData = codeBlocks(page, 40, 30, Coding{4, 3, 7});
        for (nitfsample::Image* image : {&stored, &coded})
            if (masked) {
                image->absentBlocks = {1};
                image->padCodeBits = 1;
            }
        OpenedSample storedFile(stored), codedFile(coded);
        EXPECT_TRUE(everything(codedFile.source<CNitfImageSourceBilevel>(), codedFile.reader()) ==
                    everything(storedFile.source(), storedFile.reader()));
    }
}

TEST(BilevelSource, DamageWarnsOncePerImage) {
    const Page page = bileveltest::documentPage(80, 60, 7);
    nitfsample::Image image = blockedPage(page, 0);
    image.ic = "M1";
    image.comrat = "1D";
    image.blockData = codeBlocks(page, 40, 30, Coding{});
    image.blockData[0] = "\x7F\xFF garbage";
    image.blockData[3].resize(image.blockData[3].size() / 2);
    CapturedWarnings warnings;
    OpenedSample file(image);
    auto& source = file.source<CNitfImageSourceBilevel>();
    everything(source, file.reader());
    ASSERT_EQ(warnings.messages().size(), 1u);
    EXPECT_EQ(warnings.count("a line without its EOL in row 0 of block 0"), 1) << warnings.messages()[0];
    EXPECT_EQ(source.getDamagedBlockCount(), 2);
}

TEST(BilevelSource, RefusesWhatTheCodingCannotDescribe) {
    nitfsample::Image image;
    image.ic = "C1";
    image.comrat = "1D";
    image.nbpp = 8;
    image.blockData = {bileveltest::encode(bileveltest::noisePage(64, 64, 10, 8), Coding{})};
    EXPECT_THROW(OpenedSample(image).source(), vexo::Exception);
    // Ten coded lines cannot fill a page of 2560 x 99999 pixels: no 32 MB bitmap for them.
    image.nbpp = 1;
    image.cols = 2560;
    image.rows = 99999;
    image.blockData = {bileveltest::encode(bileveltest::noisePage(2560, 10, 10, 9), Coding{})};
    EXPECT_THROW(OpenedSample(image).source(), vexo::Exception);
}

// gdal_translate, where installed, is a decoder written without this code: agreeing with it on streams coded
// here checks the encoder, and so the code tables both share, beyond the code words the corpus uses.
TEST(BilevelOracle, AnIndependentDecoderReadsOurStreamsAsTheirPages) {
    if (!haveCommand("gdal_translate"))
        GTEST_SKIP() << "gdal_translate is not installed";
    const Page runs = everyRunLength();
    const struct {
        Page page;
        int k;
        const char* comrat;
    } cases[] = {{runs, 1, "1D"},
                 {runs, 4, "2DH"},
                 {bileveltest::documentPage(1728, 200, 10), 2, "2DS"},
                 {bileveltest::noisePage(64, 64, 20, 11), 4, "2DH"}};
    for (const auto& c : cases) {
        SCOPED_TRACE(std::string(c.comrat) + ", " + std::to_string(c.page.width) + " wide");
        nitfsample::Image image;
        image.ic = "C1";
        image.comrat = c.comrat;
        image.nbpp = 1;
        image.pvtype = "B";
        image.cols = c.page.width;
        image.rows = c.page.height;
        image.blockData = {bileveltest::encode(c.page, Coding{c.k, 0, 6})};
        OpenedSample file(image);
        TempFile output(std::string(), ".raw");
        const std::string command =
            "gdal_translate -q -of ENVI '" + file.path() + "' '" + output.path() + "' >/dev/null 2>&1";
        ASSERT_EQ(std::system(command.c_str()), 0);
        EXPECT_TRUE(output.read() == bileveltest::canonical(c.page));
        std::remove((output.path().substr(0, output.path().size() - 4) + ".hdr").c_str());
        std::remove((output.path() + ".aux.xml").c_str());
    }
}
