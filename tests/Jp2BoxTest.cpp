// The JP2 box layer: what the writer writes the reader reads back, box lengths in all their forms, and
// damage. (The corpus's JP2-wrapped images, palettes among them, decode to the manifest's pixels.)
#include <gtest/gtest.h>

#include <string>

#include "HostError.h"
#include "J2kSegmentStream.h"
#include "Jp2BoxReader.h"
#include "Jp2BoxWriter.h"
#include "TestFiles.h"

namespace {

jp2::Metadata everyBox() {
    jp2::Metadata m;
    m.fileType.brand = jp2::boxType("jpx ");
    m.fileType.minorVersion = 2;
    m.fileType.compatible = {jp2::kBrandJp2, jp2::boxType("jpx ")};
    m.imageHeader = {480, 640, 3, 0xFF, 7, 1, 0};
    m.bitsPerComponent = {{8, false}, {12, true}, {1, false}};
    jp2::Colour enumerated;
    enumerated.enumerated = 18;
    jp2::Colour icc;
    icc.method = 2;
    icc.precedence = -1;
    icc.approximation = 1;
    icc.iccProfile = std::string("\0\x01profile", 9);
    m.colours = {enumerated, icc};
    m.hasPalette = true;
    m.palette.columns = {{8, false}, {16, true}};
    m.palette.entries = {{0, -300}, {255, 32767}, {17, -1}};
    m.componentMapping = {{0, 1, 0}, {0, 1, 1}, {2, 0, 0}};
    m.channels = {{0, 0, 3}, {1, 0, 2}, {2, 65535, 65535}};
    m.hasCaptureResolution = m.hasDisplayResolution = true;
    m.captureResolution = {300, 1, 600, 2, 2, -3};
    m.displayResolution = {72, 1, 72, 1, 0, 0};
    m.uuids = {{std::string(16, '\x42'), "payload"}};
    m.xml = {"<a/>", "<b>text</b>"};
    return m;
}

struct ReadBack {
    CJp2BoxReader reader;
    std::string codestream;
};

ReadBack readBack(const std::string& bytes) {
    ByteStream stream(bytes);
    CJ2kSegmentStream range(stream, 0, static_cast<long long>(bytes.size()));
    ReadBack result;
    EXPECT_EQ(CJp2BoxReader::identify(range), CJp2BoxReader::eJp2File);
    result.reader.read(range);
    result.codestream =
        bytes.substr(size_t(result.reader.codestreamOffset()), size_t(result.reader.codestreamLength()));
    return result;
}

} // namespace

TEST(Jp2Boxes, WhatTheWriterWritesTheReaderReads) {
    const jp2::Metadata m = everyBox();
    const std::string codestream = "\xFF\x4F\xFF\x51 pretend codestream \xFF\xD9";
    const ReadBack back = readBack(CJp2BoxWriter::file(m, codestream));
    const jp2::Metadata& r = back.reader.metadata();
    EXPECT_EQ(back.codestream, codestream);
    EXPECT_EQ(r.fileType.brand, m.fileType.brand);
    EXPECT_EQ(r.fileType.compatible, m.fileType.compatible);
    EXPECT_EQ(r.imageHeader.height * 1000 + r.imageHeader.width, 480u * 1000 + 640);
    EXPECT_EQ(r.imageHeader.bitsPerComponent, 0xFF);
    ASSERT_EQ(r.bitsPerComponent.size(), 3u);
    EXPECT_TRUE(r.bitsPerComponent[1].bits == 12 && r.bitsPerComponent[1].isSigned);
    ASSERT_EQ(r.colours.size(), 2u);
    EXPECT_EQ(r.colours[0].enumerated, 18u);
    EXPECT_EQ(r.colours[1].precedence, -1);
    EXPECT_EQ(r.colours[1].iccProfile, m.colours[1].iccProfile);
    ASSERT_TRUE(r.hasPalette);
    EXPECT_EQ(r.palette.entries, m.palette.entries) << "16-bit signed entries sign-extended";
    ASSERT_EQ(r.componentMapping.size(), 3u);
    EXPECT_EQ(r.componentMapping[2].component * 10 + r.componentMapping[2].type, 20);
    ASSERT_EQ(r.channels.size(), 3u);
    EXPECT_EQ(r.channels[2].type, 65535);
    ASSERT_TRUE(r.hasCaptureResolution && r.hasDisplayResolution);
    EXPECT_EQ(r.captureResolution.horizontalExponent, -3);
    EXPECT_EQ(r.displayResolution.verticalNumerator, 72);
    ASSERT_EQ(r.uuids.size(), 1u);
    EXPECT_EQ(r.uuids[0].id + r.uuids[0].data, std::string(16, '\x42') + "payload");
    EXPECT_EQ(r.xml, m.xml);
}

TEST(Jp2Boxes, LengthFormsAndDamage) {
    jp2::Metadata m;
    m.imageHeader = {1, 1, 1, 7, 7, 0, 0};
    const std::string head =
        CJp2BoxWriter::signature() + CJp2BoxWriter::fileType(m.fileType) + CJp2BoxWriter::header(m);
    const std::string codestream(100, '\x11');

    // A last box of length 0 runs to the end; a box of length 1 carries a 64-bit length.
    std::string toEnd = head + std::string("\0\0\0\0jp2c", 8) + codestream;
    EXPECT_EQ(readBack(toEnd).codestream, codestream);
    std::string extended =
        head + std::string("\0\0\0\1jp2c", 8) + std::string("\0\0\0\0\0\0\0\x74", 8) + codestream;
    EXPECT_EQ(readBack(extended).codestream, codestream);
    // Unknown boxes, and anything after the first codestream, are passed over.
    EXPECT_EQ(readBack(head + CJp2BoxWriter::box(jp2::boxType("zzzz"), "?") +
                       CJp2BoxWriter::codestream(codestream) + CJp2BoxWriter::codestream("second"))
                  .codestream,
              codestream);

    auto refused = [](const std::string& bytes, const char* why) {
        ByteStream stream(bytes);
        CJ2kSegmentStream range(stream, 0, static_cast<long long>(bytes.size()));
        CJp2BoxReader reader;
        EXPECT_THROW(reader.read(range), vexo::Exception) << why;
    };
    refused(head, "no codestream box");
    refused(head + std::string("\0\0\x10\0jp2c", 8) + codestream, "a length past the end");
    refused(head + std::string("\0\0\0\4jp2c", 8) + codestream, "a length shorter than the header");
    refused(head + std::string("\0\0\0\1jp2c\0\0", 10), "a cut extended length");

    // A damaged box inside the header is skipped with a warning; the codestream is still found.
    CapturedWarnings warnings;
    const std::string shortPalette = CJp2BoxWriter::box(
        jp2::kHeader, CJp2BoxWriter::imageHeader(m.imageHeader) + CJp2BoxWriter::box(jp2::kPalette, "\0"));
    const ReadBack back =
        readBack(CJp2BoxWriter::signature() + shortPalette + CJp2BoxWriter::codestream(codestream));
    EXPECT_EQ(back.codestream, codestream);
    EXPECT_FALSE(back.reader.metadata().hasPalette);
    EXPECT_EQ(warnings.count("pclr"), 1);
}
