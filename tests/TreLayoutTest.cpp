// The TRE layouts with conditions, nested groups and computed widths, against bytes built by hand; and the
// engine's behaviour on malformed data.
#include <gtest/gtest.h>

#include <chrono>
#include <string>

#include "HostError.h"
#include "NitfTag.h"
#include "TestFiles.h"
#include "TreBytes.h"
#include "RecordLayout.h"

namespace {

long long size(const std::string& bytes) {
    return static_cast<long long>(bytes.size());
}

// The BANDSB fields before the existence mask: COUNT bands of reflectance.
std::string bandsHead(long long count) {
    return padNumber(count, 5) + padText("REFLECTANCE", 24) + "F" + bigEndian(0x3F800000, 4) +
           bigEndian(0, 4) + "0000.50M0000.50M0000001M0000001M" + std::string(48, '\0');
}

} // namespace

TEST(TreLayouts, BandsFollowTheExistenceMask) {
    // Bits 31 (adjustment surface), 28 (band ID), 24 (centre wavelength), 13 (GSD uncertainties without the
    // GSDs of bit 14) and 0 (auxiliary parameters).
    std::string data =
        bandsHead(2) + bigEndian(0x91002001, 4) + padText("DETECTOR", 24) + bigEndian(0, 4) + "U";
    data += padText("BAND ONE", 50) + "0.45000" + "0000.01" + "0000.02";
    data += padText("BAND TWO", 50) + "0.55000" + "0000.03" + "0000.04";
    data += joined({"01", "01"});
    data += "I" + padText("COUNTS", 7) + padNumber(10, 10) + padNumber(20, 10);
    data += "A" + padText("NONE", 7) + padText("CUBE NOTE", 20);
    auto bands = parseTre("BANDSB", data);

    EXPECT_EQ(bands->getReadLength(), size(data));
    EXPECT_EQ(field(*bands, "RADIOMETRIC_ADJUSTMENT_SURFACE"), padText("DETECTOR", 24));
    EXPECT_EQ(field(*bands, "WAVE_LENGTH_UNIT"), "U");
    EXPECT_EQ(field(*bands, "BANDID_2"), padText("BAND TWO", 50));
    EXPECT_EQ(field(*bands, "CWAVE_1"), "0.45000");
    EXPECT_EQ(field(*bands, "ROW_GSD_UNC_2"), "0000.03");
    EXPECT_EQ(field(*bands, "COL_GSD_UNC_1"), "0000.02");
    EXPECT_EQ(field(*bands, "APN_1_1"), padNumber(10, 10));
    EXPECT_EQ(field(*bands, "APN_1_2"), padNumber(20, 10));
    EXPECT_EQ(field(*bands, "APA_1"), padText("CUBE NOTE", 20));
    EXPECT_EQ(field(*bands, "SCALE_FACTOR", 4), bigEndian(0x3F800000, 4));
    EXPECT_EQ(field(*bands, "ROW_GSD"), "0000.50");
    for (const char* absent : {"DIAMETER", "DATA_FLD_2", "NIIRS_1", "FWHM_1", "ROW_GSD_1", "ROW_GSD_UNIT_1",
                               "SCALE_FACTOR_1", "APR_1_1", "APN_1", "BANDID_3"})
        EXPECT_FALSE(hasField(*bands, absent)) << absent;

    // The wavelength unit comes with any of the wavelength fields, not only the centre wavelength.
    std::string nominal = bandsHead(1) + bigEndian(0x00100000, 4) + "M" + "0000.10";
    auto unit = parseTre("BANDSB", nominal);
    EXPECT_EQ(field(*unit, "WAVE_LENGTH_UNIT"), "M");
    EXPECT_EQ(field(*unit, "NOM_WAVE_UNC_1"), "0000.10");
    EXPECT_EQ(unit->getReadLength(), size(nominal));
}

TEST(TreLayouts, HistoryEventsWithCommentsAndFlags) {
    std::string data = padText("SYS", 20) + padText("NC", 12) + "NONE" + "0" + "00" + "02";
    // Event 1: two comments, a rotation.
    data += "20200101120000" + padText("SITE", 10) + padText("APP", 10) + "2" + padText("FIRST", 80) +
            padText("SECOND", 80) + "08" + "INT" + padText("NC", 10) + "0" + "1" + "00090.00" + "0" + "0" +
            "0" + "0" + "0" + "0" + "0" + "08" + "INT" + padText("NC", 10);
    // Event 2: no comment, every other operation.
    data += "20200102120000" + padText("SITE", 10) + padText("APP", 10) + "0" + "11" + "INT" +
            padText("NC", 10) + "1" + "0" + "1" + "0002.00" + "0003.00" + "0" + "1" + "01" + "02" + "1" +
            "0001.50" + "1" + "0001.00" + "00010" + "1" + "03" + "04" + "0" + "08" + "INT" +
            padText("C3", 10);
    auto history = parseTre("HISTOA", data);

    EXPECT_EQ(history->getReadLength(), size(data));
    EXPECT_EQ(field(*history, "IPCOM_1_2"), padText("SECOND", 80));
    EXPECT_EQ(field(*history, "ROT_ANGLE_1"), "00090.00");
    EXPECT_EQ(field(*history, "ZOOMCOL_2"), "0003.00");
    EXPECT_EQ(field(*history, "SHARPMEM_2"), "02");
    EXPECT_EQ(field(*history, "DRA_SUB_2"), "00010");
    EXPECT_EQ(field(*history, "TTCMEM_2"), "04");
    EXPECT_EQ(field(*history, "OUTBWC_2"), padText("C3", 10));
    for (const char* absent :
         {"IPCOM_2_1", "IPCOM_1_3", "ROT_ANGLE_2", "ZOOMROW_1", "MAG_LEVEL_1", "PDATE_3"})
        EXPECT_FALSE(hasField(*history, absent)) << absent;
}

TEST(TreLayouts, EngineeringRecordsSizeTheirOwnFields) {
    const std::string binary("\0\1\0\2\0\3", 6);
    std::string data = padText("SENSOR", 20) + "002";
    data += joined({"05LABEL", "0003", "0001", "I", "2", "NA"}) + padNumber(3, 8) + binary;
    data += joined({"04TEXT", "0001", "0001", "A", "1", "NA"}) + padNumber(5, 8) + "HELLO";
    auto records = parseTre("ENGRDA", data);

    EXPECT_EQ(records->getReadLength(), size(data));
    EXPECT_EQ(field(*records, "ENGLBL_1"), "LABEL");
    EXPECT_EQ(field(*records, "ENGDATA_1", 6), binary);
    EXPECT_EQ(field(*records, "ENGLBL_2"), "TEXT");
    EXPECT_EQ(field(*records, "ENGDATA_2"), "HELLO");
}

// (The shift, table and logarithmic forms are read by the JPEG amplitude mapping tests.)
TEST(TreLayouts, AmplitudeMappingPolynomialForms) {
    std::string coefficients(72, '\x3F');
    auto polynomial =
        parseTre("IOMAPA", joined({"0013", "01", "00", "00", "3", "1000", "2000"}) + coefficients);
    EXPECT_EQ(polynomial->getReadLength(), 91);
    EXPECT_EQ(field(*polynomial, "TABLE_ID"), "01");
    EXPECT_EQ(field(*polynomial, "OUT_B5_3"), "????");
    // The same form written with a one-byte TABLE_ID: 90 bytes.
    auto narrow = parseTre("IOMAPA", joined({"0013", "1", "00", "00", "3", "1000", "2000"}) + coefficients);
    EXPECT_EQ(narrow->getReadLength(), 90);
    EXPECT_EQ(field(*narrow, "TABLE_ID"), "1");
    EXPECT_EQ(field(*narrow, "XOB_2"), "2000");
}

TEST(TreLayouts, LayerInformationOfParsedStreams) {
    std::string layers = joined({"05", "00003", "002", "000", "00.500000", "001", "01.000000"});
    std::string parsed = joined({"04", "00003", "001"});
    auto withParsed = parseTre("J2KLRA", "1" + layers + parsed);
    EXPECT_EQ(withParsed->getReadLength(), 45);
    EXPECT_EQ(field(*withParsed, "BITRATE_2"), "01.000000");
    EXPECT_EQ(field(*withParsed, "NLAYERS_I"), "001");

    // A parsed origin without room for the parsed values, and an original origin with bytes to spare.
    auto noRoom = parseTre("J2KLRA", "1" + layers);
    EXPECT_EQ(noRoom->getReadLength(), 35);
    EXPECT_FALSE(hasField(*noRoom, "NLEVELS_I"));
    auto original = parseTre("J2KLRA", "0" + layers + parsed);
    EXPECT_EQ(original->getReadLength(), 35);
    EXPECT_FALSE(hasField(*original, "NBANDS_I"));
}

TEST(TreLayouts, FrameOffsets) {
    auto frames =
        parseTre("NBLOCA", bigEndian(0, 4) + bigEndian(3, 4) + bigEndian(1000, 4) + bigEndian(70000, 4));
    EXPECT_EQ(frames->getReadLength(), 16);
    EXPECT_EQ(field(*frames, "FRAME_2_OFFSET", 4), bigEndian(1000, 4));
    EXPECT_EQ(CNitfExtension::getBinaryValue(FindProperty(frames->getProperties(), "FRAME_3_OFFSET"), 4),
              70000u);
    EXPECT_FALSE(hasField(*frames, "FRAME_4_OFFSET"));
}

TEST(TreRobustness, DataCutByTheEndOfTheFile) {
    // ACFTB declares 207 bytes; the file ends after 50: the field across the end keeps its 4 bytes, no later
    // field is read.
    std::string data = padText("MISSION", 20) + padText("TAIL", 10) + "202001011200" + "EOIR" + "ABCD";
    auto aircraft = parseTre("ACFTB", data, 207);
    EXPECT_EQ(aircraft->getReadLength(), 50);
    EXPECT_EQ(field(*aircraft, "SENSOR_ID"), "ABCD");
    EXPECT_FALSE(hasField(*aircraft, "SCENE_SOURCE"));

    // A TRE shorter than its layout is read on past its end while the file lasts.
    auto longer = parseTre("ACFTB", std::string(300, '7'), 20);
    EXPECT_EQ(longer->getReadLength(), 207);
    EXPECT_EQ(field(*longer, "MTI_TOT"), "777");
}

TEST(TreRobustness, CountsFromTheFileAreBoundedByItsBytes) {
    auto start = std::chrono::steady_clock::now();

    std::string threeBands = bandsHead(99999) + bigEndian(0x10000000, 4) + std::string(150, 'B');
    auto bands = parseTre("BANDSB", threeBands);
    EXPECT_EQ(bands->getReadLength(), size(threeBands));
    EXPECT_TRUE(hasField(*bands, "BANDID_3"));
    EXPECT_FALSE(hasField(*bands, "BANDID_4"));

    // No per-band field selected: the band loop reads nothing and ends at once.
    auto empty = parseTre("BANDSB", bandsHead(99999) + bigEndian(0, 4));
    EXPECT_EQ(empty->getProperties().size(), 15u);

    auto frames =
        parseTre("NBLOCA", bigEndian(0, 4) + bigEndian(0xFFFFFFFF, 4) + bigEndian(1, 4) + bigEndian(2, 2));
    EXPECT_EQ(frames->getProperties().size(), 4u);
    EXPECT_EQ(frames->getReadLength(), 14);
    // The field cut by the end of the file keeps its width, the missing bytes as zeros.
    EXPECT_EQ(CNitfExtension::getBinaryValue(FindProperty(frames->getProperties(), "FRAME_3_OFFSET"), 4),
              0x20000u);

    // ENGDATC x ENGDTS far beyond the file: the field runs to the end of the file.
    std::string huge =
        padText("S", 20) + "001" + "00" + joined({"0001", "0001", "A", "9", "NA", "99999999"}) + "tail";
    auto records = parseTre("ENGRDA", huge);
    EXPECT_EQ(field(*records, "ENGDATA_1"), "tail");
    EXPECT_EQ(records->getReadLength(), size(huge));

    // A declared length far beyond the file reads what there is.
    auto unknown = parseTre("ESD001", "abc", 99999);
    EXPECT_EQ(field(*unknown, "ESD001_DATA"), "abc");

    EXPECT_LT(std::chrono::steady_clock::now() - start, std::chrono::seconds(2));
}

TEST(TreRobustness, CountsThatAreNotNumbersRepeatNothing) {
    std::string tail = padNumber(5, 15) + padNumber(6, 15);
    auto letters = parseTre("PRJPSB", padText("P", 80) + "AB" + "x" + tail);
    EXPECT_FALSE(hasField(*letters, "PRJ_1"));
    EXPECT_EQ(field(*letters, "XOR"), padNumber(5, 15));

    auto negative = parseTre("ENGRDA", padText("S", 20) + "-05" + "more");
    EXPECT_FALSE(hasField(*negative, "ENGLN_1"));
    EXPECT_EQ(negative->getReadLength(), 23);

    auto blank = parseTre("CSSFAA", " " + std::string(106, 'x'));
    EXPECT_EQ(blank->getProperties().size(), 1u);
}

TEST(TreRobustness, EveryParserOnEmptyShortAndGarbageData) {
    std::string garbage(3000, '\0');
    unsigned state = 12345;
    for (char& byte : garbage) {
        state = state * 1103515245u + 12345u;
        byte = static_cast<char>(state >> 16);
    }
    for (const char* name : CNitfExtension::getBuiltExtensionNames()) {
        auto none = parseTre(name, garbage, 0);
        EXPECT_TRUE(none->getProperties().empty()) << name;
        for (long long length : {5LL, 3000LL}) {
            auto parsed = parseTre(name, garbage.substr(0, 700), length);
            EXPECT_LE(parsed->getReadLength(), 700) << name;
        }
        auto digits = parseTre(name, std::string(900, '9'), 900);
        EXPECT_LE(digits->getReadLength(), 900) << name;
    }
}

TEST(TreRobustness, MalformedTablesAreRefused) {
    static const record::Entry unclosed[] = {record::Text("N", 1), record::Repeat("N"), record::Text("X", 1)};
    static const record::Entry unknown[] = {record::Repeat("COUNT"), record::Text("X", 1), record::End()};
    static const record::Entry later[] = {record::Repeat("N"), record::Text("N", 1), record::End()};
    EXPECT_THROW(CRecordLayout{unclosed}, vexo::Exception);
    EXPECT_THROW(CRecordLayout{unknown}, vexo::Exception);
    EXPECT_THROW(CRecordLayout{later}, vexo::Exception);
}
