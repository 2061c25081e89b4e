// The sample writer is checked with arithmetic of its own on the bytes it produces, and against real files.
#include "NitfSampleWriter.h"

#include <gtest/gtest.h>

#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <sstream>
#include <stdexcept>

using namespace nitfsample;

namespace {

uint64_t decimal(const std::string& bytes, std::size_t offset, std::size_t width) {
    return std::stoull(bytes.substr(offset, width));
}

uint64_t bigEndian(const std::string& bytes, std::size_t offset, std::size_t width) {
    uint64_t value = 0;
    for (std::size_t i = 0; i < width; ++i)
        value = (value << 8) | static_cast<unsigned char>(bytes.at(offset + i));
    return value;
}

struct SegmentPlace {
    std::string tag;
    uint64_t subheaderOffset, subheaderLength, dataOffset, dataLength;
};

// Walks the length tables of a header whose FL field is at `flOffset`; the segments follow HL in table order.
std::vector<SegmentPlace> walk(const std::string& bytes, std::size_t flOffset, bool v20) {
    std::size_t p = flOffset + 18;
    uint64_t next = decimal(bytes, flOffset + 12, 6);
    std::vector<SegmentPlace> places;
    struct Table {
        const char* tag;
        int headerWidth, dataWidth;
    };
    std::vector<Table> tables = {{"IM", 6, 10}, {"SY", 4, 6}, {"LA", 4, 3},
                                 {"TE", 4, 5},  {"DE", 4, 9}, {"RE", 4, 7}};
    for (const Table& t : tables) {
        uint64_t count = decimal(bytes, p, 3);
        p += 3;
        if (!v20 && std::string(t.tag) == "LA")
            continue; // NUMX
        for (uint64_t i = 0; i < count; ++i) {
            uint64_t header = decimal(bytes, p, t.headerWidth),
                     data = decimal(bytes, p + t.headerWidth, t.dataWidth);
            p += t.headerWidth + t.dataWidth;
            places.push_back({t.tag, next, header, next + header, data});
            next += header + data;
        }
    }
    for (int area = 0; area < 2; ++area) // UDHD, XHD
        p += 5 + decimal(bytes, p, 5);
    EXPECT_EQ(p, decimal(bytes, flOffset + 12, 6)) << "HL";
    EXPECT_EQ(next, bytes.size()) << "the segments end at the end of the file";
    for (const SegmentPlace& place : places)
        EXPECT_EQ(bytes.substr(place.subheaderOffset, 2), place.tag);
    return places;
}

File everySegmentFile(const std::string& version) {
    File file;
    file.version = version;
    file.udhd = {{"JITCID", "hello"}};
    file.xhd = {{"TESTIN", "0123456789"}, {"AB", ""}};
    Image plain;
    file.images.push_back(plain);
    Image rich;
    rich.bands = 12 - (version == "NITF02.00" ? 3 : 0);
    rich.icords = 'G';
    rich.igeolo = std::string(60, '1');
    rich.comments = {"first", "second"};
    rich.ic = "C3";
    rich.blockData = {"not really a JPEG stream"};
    rich.udid = {{"ABCDEF", "xyz"}};
    file.images.push_back(rich);
    file.graphics.push_back(Graphic{});
    if (version == "NITF02.00")
        file.labels.push_back(Label{});
    file.texts.push_back(Text{});
    file.des.push_back(treOverflow("UDID", 2, {{"ABCDEF", "12345"}}, version));
    file.res.push_back(Res{});
    file.res.back().resshf = "abc";
    return file;
}

} // namespace

TEST(SampleWriter, LengthsAndTablesOfEveryVersion) {
    // 2.1: FL at 342; image sub-headers 439 bytes + IGEOLO, comments, COMRAT, XBANDS, bands and TREs.
    std::string v21 = build(everySegmentFile("NITF02.10"));
    EXPECT_EQ(decimal(v21, 342, 12), v21.size());
    EXPECT_EQ(v21.substr(297, 3), std::string(3, '\0')); // FBKGC
    auto places = walk(v21, 342, false);
    ASSERT_EQ(places.size(), 6u);
    EXPECT_EQ(places[0].subheaderLength, 439u);
    EXPECT_EQ(places[0].dataLength, 64u * 64u);
    EXPECT_EQ(places[1].subheaderLength, 439u + 60 + 160 + 4 + 5 + 11 * 13 + 3 + 14);
    EXPECT_EQ(places[1].dataLength, 24u);
    EXPECT_EQ(places[2].subheaderLength, 258u);
    EXPECT_EQ(places[3].subheaderLength, 282u);
    EXPECT_EQ(places[4].subheaderLength, 209u);
    EXPECT_EQ(v21.substr(places[4].subheaderOffset + 2, 25), "TRE_OVERFLOW             ");
    EXPECT_EQ(v21.substr(places[4].subheaderOffset + 196, 9), "UDID  002");
    EXPECT_EQ(v21.substr(places[4].dataOffset, places[4].dataLength), "ABCDEF0000512345");
    EXPECT_EQ(places[5].subheaderLength, 203u);
    EXPECT_EQ(decimal(v21, 354, 6), 388u + 2 * 16 + 10 + 9 + 13 + 11 + 3 + 16 + 3 + 21 + 11);

    // OSDE: OID, IINFO, ISCSEC and DESSEC take exactly the room of the fields they replace.
    File osdeFile = everySegmentFile("OSDE01.00");
    osdeFile.oid = "originator";
    osdeFile.images[0].iinfo = "info";
    std::string osde = build(osdeFile);
    EXPECT_EQ(osde.size(), v21.size());
    places = walk(osde, 342, false);
    ASSERT_EQ(places.size(), 6u);
    EXPECT_EQ(osde.substr(297, 11), "originator ");
    EXPECT_EQ(osde.substr(places[0].subheaderOffset + 26, 5), "info ");
    EXPECT_EQ(osde.substr(places[0].subheaderOffset + 123, 2), "U ");

    // 2.0: six count fields, labels, nine bands at most, COMRAT for any IC but NC/NM; FSDEVT moves FL by 40.
    File file20 = everySegmentFile("NITF02.00");
    std::string v20 = build(file20);
    places = walk(v20, 342, true);
    ASSERT_EQ(places.size(), 7u);
    EXPECT_EQ(places[1].subheaderLength, 439u + 60 + 160 + 4 + 8 * 13 + 3 + 14);
    EXPECT_EQ(places[3].tag, "LA");
    EXPECT_EQ(places[3].subheaderLength, 212u);
    EXPECT_EQ(v20.substr(places[5].subheaderOffset + 2, 25), "Registered Extensions    ");
    file20.security.dwng = "999998";
    file20.texts[0].security.dwng = "999998";
    file20.images[0].ic = "C0";
    file20.images[0].blockData = {"x"};
    std::string downgraded = build(file20);
    places = walk(downgraded, 382, true);
    EXPECT_EQ(places[0].subheaderLength, 443u);
    EXPECT_EQ(places[4].subheaderLength, 322u);
    EXPECT_EQ(decimal(downgraded, 394, 6), decimal(v20, 354, 6) + 40);

    file20.images[0].bands = 10;
    EXPECT_THROW(build(file20), std::invalid_argument);
    File labelIn21;
    labelIn21.labels.push_back(Label{});
    EXPECT_THROW(build(labelIn21), std::invalid_argument);
}

TEST(SampleWriter, PacksSamplesMostSignificantBitFirst) {
    auto packed = [](int nbpp, std::vector<uint64_t> values, int bands = 1) {
        File file;
        Image image;
        image.rows = 1;
        image.cols = static_cast<int>(values.size()) / bands;
        image.bands = bands;
        image.nbpp = nbpp;
        image.sample = [values, bands](int band, int, int col) { return values[col * bands + band]; };
        file.images.push_back(image);
        std::string bytes = build(file);
        auto places = walk(bytes, 342, false);
        return bytes.substr(places[0].dataOffset);
    };
    EXPECT_EQ(packed(12, {0xABC, 0x123, 0x456}), "\xAB\xC1\x23\x45\x60");
    EXPECT_EQ(packed(1, {1, 0, 1, 1, 0, 0, 1, 1, 1, 0}), "\xB3\x80");
    EXPECT_EQ(packed(4, {0x1F, 0x2, 0x3}), "\xF2\x30"); // masked to 4 bits
    EXPECT_EQ(packed(16, {0x1234, 0xFFFF}), "\x12\x34\xFF\xFF");
    EXPECT_EQ(packed(64, {0x0102030405060708}), "\x01\x02\x03\x04\x05\x06\x07\x08");
    // IMODE B: each band of the block ends on a whole byte.
    EXPECT_EQ(packed(12, {0xABC, 0x123}, 2), std::string("\xAB\xC0\x12\x30", 4));
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
        File file;
        file.images.push_back(image);
        std::string bytes = build(file);
        auto place = walk(bytes, 342, false).at(0);
        EXPECT_EQ(place.dataLength, 6u * 8u);
        EXPECT_EQ(bytes.substr(place.subheaderOffset + 404, 16), "0003000200020002");
        for (int band = 0; band < 2; ++band) {
            std::string canonical = canonicalBand(image, band);
            ASSERT_EQ(canonical.size(), 15u);
            for (int row = 0; row < 4; ++row)
                for (int col = 0; col < 6; ++col) {
                    int block = (row / 2) * 3 + col / 2, y = row % 2, x = col % 2;
                    uint64_t offset = imode == 'S'   ? (6 * band + block) * 4 + y * 2 + x
                                      : imode == 'B' ? block * 8 + band * 4 + y * 2 + x
                                      : imode == 'P' ? block * 8 + (y * 2 + x) * 2 + band
                                                     : block * 8 + y * 4 + band * 2 + x;
                    int stored = static_cast<unsigned char>(bytes.at(place.dataOffset + offset));
                    bool inside = row < 3 && col < 5;
                    EXPECT_EQ(stored, inside ? band * 100 + row * 10 + col : 0xEE) << row << "," << col;
                    if (inside) {
                        EXPECT_EQ(static_cast<unsigned char>(canonical[row * 5 + col]), stored);
                    }
                }
        }
    }
}

TEST(SampleWriter, MaskedImagesStartWithTheBlockMaskRecord) {
    Image image;
    image.ic = "NM";
    image.rows = image.cols = 4;
    image.nppbh = image.nppbv = 2;
    image.bands = 2;
    image.imode = 'S';
    image.absentBlocks = {1, 6};
    image.padMaskRecords = true;
    image.padBlocks = {0, 1, 7};
    image.padCodeBits = 8;
    image.padValue = 0x7F;
    ASSERT_EQ(blockEntryCount(image), 8);
    File file;
    file.images.push_back(image);
    std::string bytes = build(file);
    auto place = walk(bytes, 342, false).at(0);
    const uint64_t d = place.dataOffset, recordLength = 10 + 1 + 32 + 32;
    EXPECT_EQ(bigEndian(bytes, d, 4), recordLength);        // IMDATOFF
    EXPECT_EQ(bigEndian(bytes, d + 4, 6), 0x000400040008u); // BMRLNTH, TMRLNTH, TPXCDLNTH
    EXPECT_EQ(bigEndian(bytes, d + 10, 1), 0x7Fu);          // TPXCD
    std::vector<uint64_t> bmr = {0, 0xFFFFFFFF, 4, 8, 12, 16, 0xFFFFFFFF, 20};
    std::vector<uint64_t> tmr = {0,          0xFFFFFFFF, 0xFFFFFFFF, 0xFFFFFFFF,
                                 0xFFFFFFFF, 0xFFFFFFFF, 0xFFFFFFFF, 20};
    for (int e = 0; e < 8; ++e) {
        EXPECT_EQ(bigEndian(bytes, d + 11 + 4 * e, 4), bmr[e]) << e;
        EXPECT_EQ(bigEndian(bytes, d + 43 + 4 * e, 4), tmr[e]) << e;
    }
    EXPECT_EQ(place.dataLength, recordLength + 6 * 4);
    // Entry 7 is band 1's block (1, 1): pixel (3, 3) is its last byte.
    EXPECT_EQ(bigEndian(bytes, d + recordLength + 20 + 3, 1), sampleAt(image, 1, 3, 3));
    std::string band0 = canonicalBand(image, 0);
    EXPECT_EQ(band0[2], '\0'); // block 1 is absent
    EXPECT_EQ(static_cast<unsigned char>(band0[0]), sampleAt(image, 0, 0, 0));

    // Pre-built blocks of their own sizes (as JPEG streams would be), offsets follow the sizes.
    Image jpeg;
    jpeg.ic = "M3";
    jpeg.comrat = "00.0";
    jpeg.rows = jpeg.cols = 4;
    jpeg.nppbh = jpeg.nppbv = 2;
    jpeg.blockData = {"aaa", "", "bbbbb", "c"};
    jpeg.absentBlocks = {1};
    file.images = {jpeg};
    bytes = build(file);
    place = walk(bytes, 342, false).at(0);
    EXPECT_EQ(bytes.substr(place.subheaderOffset + 373, 6), "M300.0");
    EXPECT_EQ(bigEndian(bytes, place.dataOffset + 10, 8), 0xFFFFFFFFu);
    EXPECT_EQ(bigEndian(bytes, place.dataOffset + 18, 8), (uint64_t(3) << 32) | 8u);
    EXPECT_EQ(bytes.substr(place.dataOffset + 26), "aaabbbbbc");

    jpeg.blockData.pop_back();
    file.images = {jpeg};
    EXPECT_THROW(build(file), std::invalid_argument);
}

TEST(SampleWriter, StreamingOverridesAndOutputs) {
    File file = defaultSample();
    file.streaming = true;
    file.images[0].fields["NROWS"] = "odd";
    std::string bytes = build(file);
    EXPECT_EQ(bytes.substr(342, 12), "999999999999");
    const uint64_t hl = decimal(bytes, 354, 6);
    EXPECT_EQ(bytes.substr(363 + 6, 10), "9999999999"); // LI1
    // The replacement header, found from the end of the file, has the real lengths.
    ASSERT_EQ(bytes.substr(bytes.size() - 11, 4), "\x0E\xCA\x14\xBF");
    EXPECT_EQ(decimal(bytes, bytes.size() - 7, 7), hl);
    std::string replacement = bytes.substr(bytes.size() - 11 - hl, hl);
    EXPECT_EQ(bytes.substr(bytes.size() - 22 - hl, 11), "0000" + std::to_string(hl) + "\x0A\x6E\x1D\x97");
    auto places = walk(replacement + bytes.substr(hl), 342, false);
    ASSERT_EQ(places.size(), 3u);
    EXPECT_EQ(bytes.substr(places[2].subheaderOffset + 2, 25), "STREAMING_FILE_HEADER    ");
    EXPECT_EQ(bytes.substr(places[0].subheaderOffset + 333, 8), "odd     ");

    // The demo: geographic corners, a comment, a file TRE; write() produces the same bytes as build().
    file = defaultSample();
    bytes = build(file);
    const uint64_t demoHl = 388 + 16 + 9 + 3 + 11 + 200; // one image, one text, JITCID
    EXPECT_EQ(decimal(bytes, 354, 6), demoHl);
    EXPECT_EQ(bytes.substr(363, 16), "0006050000196608");
    EXPECT_EQ(bytes.substr(demoHl + 371, 16), "G351200N1173000W");
    EXPECT_EQ(bytes.substr(demoHl + 432, 3), "1Re");
    std::string path = ::testing::TempDir() + "nitfsample-demo.ntf";
    write(file, path);
    std::ifstream in(path, std::ios::binary);
    std::stringstream written;
    written << in.rdbuf();
    EXPECT_EQ(written.str(), bytes);
    std::remove(path.c_str());
    EXPECT_THROW(write(file, ::testing::TempDir() + "no/such/dir/x.ntf"), std::runtime_error);
}

// Files that mirror the fields of real corpus files must reproduce them byte for byte.
class SampleWriterCorpus : public ::testing::Test {
protected:
    void SetUp() override {
        const char* env = std::getenv("NITF_TEST_DATA");
        root_ = env != nullptr ? env : NITF_SOURCE_DIR "/../shared/testdata";
        if (!std::ifstream(root_ + "/README.md"))
            GTEST_SKIP() << "no test corpus at " << root_;
    }
    std::string read(const std::string& name) const {
        std::ifstream in(root_ + "/" + name, std::ios::binary);
        std::stringstream bytes;
        bytes << in.rdbuf();
        return bytes.str();
    }
    static File jitc(const std::string& version, const std::string& ostaid, const std::string& title) {
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
    static Image bilevel(const std::string& bits) {
        Image image;
        image.iid1 = "Missing ID";
        image.idatim = "19961218121539";
        image.iid2 = "- BASE IMAGE -";
        image.isorce = "Unknown";
        image.rows = 18;
        image.cols = 35;
        image.nbpp = 1;
        image.pvtype = "B";
        image.nppbh = 35;
        image.nppbv = 18;
        image.iloc = "0010000100";
        image.imag = "1.0 ";
        image.sample = [bits](int, int row, int col) {
            int bit = row * 35 + col;
            return uint64_t((static_cast<unsigned char>(bits[bit / 8]) >> (7 - bit % 8)) & 1);
        };
        return image;
    }
    std::string root_;
};

TEST_F(SampleWriterCorpus, ReproducesBilevelImagesWithLutAndMask) {
    std::string real = read("nitf21/i_3034c.ntf");
    File file =
        jitc("NITF02.10", "I_3034C", "Check an RGB/LUT 1 bit image maps black to red and white to green.");
    file.fbkgc = "   ";
    Image image = bilevel(real.substr(854));
    image.irep = "RGB/LUT";
    image.bandInfo = {
        Band{"", "", {std::string("\xFF\x00", 2), std::string("\x00\xFF", 2), std::string(2, '\0')}}};
    file.images.push_back(image);
    EXPECT_EQ(build(file), real);

    real = read("nsif/ns3034d.nsf");
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
}

TEST_F(SampleWriterCorpus, ReproducesGraphicAndNitf20TextFiles) {
    std::string real = read("nitf21/i_3051e.ntf");
    File file = jitc("NITF02.10", "I_3051e", "Checks for CGM text in the proper location.");
    file.fdt = "19971219064511";
    file.fbkgc = std::string("\0\0\xFF", 3);
    file.oname = "JITC Fort Huachuca, AZ";
    Graphic graphic;
    graphic.sid = "0000000001";
    graphic.sname = "multi.cgm  SYMBOL.";
    graphic.sbnd1 = "0002500025";
    graphic.sbnd2 = "0007900430";
    graphic.data = real.substr(398 + 258);
    file.graphics.push_back(graphic);
    EXPECT_EQ(build(file), real);

    real = read("nitf20/U_0006A.NTF");
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
    file.texts.push_back(text);
    EXPECT_EQ(build(file), real);
}
