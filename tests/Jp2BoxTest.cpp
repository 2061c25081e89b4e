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
