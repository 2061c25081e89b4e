// Damaged input, by cause: each case either reads what is there and says so (a warning, blocks counted as not
// read) or is refused with a clear message; none passes silently.
#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <vector>

#include "HostError.h"
#include "JpegStreams.h"
#include "NitfRegionReader.h"
#include "NitfTestFile.h"
#include "Canonical.h"
#include "NitfFileReader.h"
#include "NitfImageSubheader.h"
#include "TestFiles.h"

namespace {

std::string bytesOf(const nitfsample::Image& image) {
    return nitfsample::build(fileOf(image));
}

// Image 0 read whole through the region reader; the message of its refusal, when it is refused.
struct WholeRead {
    std::string refusal;
    CNitfRegionReader::Result result;
};

WholeRead readWhole(const std::string& bytes) {
    WholeRead read;
    try {
        OpenedSample file(bytes);
        CNitfRegionReader region(&file.reader(), &file.source());
        std::vector<unsigned char> out(
            region.getBufferSize(region.getWidth(), region.getHeight(), region.getBandCount()));
        read.result = region.read(0, 0, region.getWidth(), region.getHeight(), {}, out.data());
    } catch (const vexo::Exception& e) {
        read.refusal = e.what();
    }
    return read;
}

nitfsample::Image jpegImage(int blocks, const std::string& irep = "MONO", int components = 1) {
    nitfsample::Image image;
    image.ic = "C3";
    image.comrat = "00.0";
    image.cols = 16 * blocks;
    image.rows = 16;
    image.nppbh = image.nppbv = 16;
    image.bands = components;
    image.imode = components > 1 ? 'P' : 'B';
    image.irep = irep;
    jpegtest::Coding coding;
    for (int i = 0; i < blocks; ++i)
        image.blockData.push_back(jpegtest::encode(jpegtest::pattern(16, 16, components, 8, i), coding));
    return image;
}

} // namespace

TEST(DamagedImageData, ShortUncompressedDataWarnsOnceAndCountsItsBlocks) {
    nitfsample::Image image;
    image.cols = image.rows = 32;
    image.nppbh = image.nppbv = 16;
    image.bands = 2;
    const std::string bytes = bytesOf(image);
    CapturedWarnings warnings;
    // Cut inside the last band of the last block.
    const WholeRead read = readWhole(bytes.substr(0, bytes.size() - 100));
    EXPECT_EQ(read.refusal, "");
    EXPECT_EQ(read.result.failedBlocks, 1);
    EXPECT_NE(read.result.firstError.find("past the end of the file"), std::string::npos);
    EXPECT_EQ(warnings.count("of the 2048 bytes its blocks need"), 1) << "once per image, not per block";

    // Far less data than the blocks need: refused rather than extracted as zeros.
    nitfsample::Image huge = image;
    huge.fields = {{"NROWS", "00005120"}, {"NCOLS", "00005120"}, {"NBPR", "0010"},
                   {"NBPC", "0010"},      {"NPPBH", "0512"},     {"NPPBV", "0512"}};
    const std::string refusal = readWhole(bytesOf(huge)).refusal;
    EXPECT_NE(refusal.find("the file holds only 2048"), std::string::npos) << refusal;
}

TEST(DamagedImageData, MissingAndImpossibleJpegStreams) {
    // Four blocks, the last stream lost: three read, one fails, one warning.
    nitfsample::Image image = jpegImage(4);
    image.blockData.pop_back();
    {
        CapturedWarnings warnings;
        const WholeRead read = readWhole(bytesOf(image));
        EXPECT_EQ(read.refusal, "");
        EXPECT_EQ(read.result.failedBlocks, 1);
        EXPECT_EQ(read.result.absentBlocks, 0) << "a lost stream is damage, not an absent block";
        EXPECT_EQ(warnings.count("3 of the 4 JPEG streams"), 1);
    }
    // Most streams lost: the geometry cannot be right.
    image.blockData.resize(1);
    EXPECT_NE(readWhole(bytesOf(image)).refusal.find("Only 1 of the image's 4 JPEG streams"),
              std::string::npos);

    // A stream whose header claims far more pixels than its bytes can code fails as a block.
    nitfsample::Image claim = jpegImage(1);
    std::string& stream = claim.blockData[0];
    const size_t frame = stream.find(std::string("\xFF\xC0", 2));
    ASSERT_NE(frame, std::string::npos);
    stream[frame + 5] = '\x7F'; // height 0x7F10
    stream[frame + 7] = '\x7F'; // width 0x7F10
    const WholeRead read = readWhole(bytesOf(claim));
    EXPECT_EQ(read.result.failedBlocks, 1);
    EXPECT_NE(read.result.firstError.find("cannot code"), std::string::npos) << read.result.firstError;
}

TEST(DamagedImageData, YCbCrMarkedStreamsUnderRgbWarnOnce) {
    // libjpeg writes a JFIF marker on YCbCr streams: IREP RGB says otherwise.
    CapturedWarnings warnings;
    const WholeRead read = readWhole(bytesOf(jpegImage(2, "RGB", 3)));
    EXPECT_EQ(read.result.failedBlocks, 0);
    EXPECT_EQ(warnings.count("marked YCbCr"), 1);
}

TEST(DamagedMessages, FieldValuesInMessagesAreEscaped) {
    nitfsample::Image image;
    image.ic = "NC";
    image.fields = {{"IC", "\x0b\x0b"}};
    const std::string bytes = bytesOf(image);
    CNitfFileReader reader;
    ASSERT_TRUE(reader.openMemory(bytes.data(), bytes.size()));
    EXPECT_EQ(refusalOf([&] { delete reader.getNewImageSource(0); }),
              "Compression not supported (ISH.IC == \\x0b\\x0b)");
}

TEST(DamagedExtract, ExitsNonZeroOnUnreadBlocksUnlessPartialIsAllowed) {
    nitfsample::Image image;
    image.cols = image.rows = 32;
    const std::string bytes = bytesOf(image);
    TempFile input(bytes.substr(0, bytes.size() - 10));
    TempFile output("", ".raw");
    auto run = [&](const std::string& options) {
        return runTool("extract " + input.path() + " -f raw -o " + output.path() + " " + options + " 2>" +
                       output.path() + ".err");
    };
    EXPECT_EQ(run(""), 1);
    const std::string errors = readWholeFile(output.path() + ".err");
    EXPECT_NE(errors.find(input.path() + ": warning: Image 0: the file holds 1014 of the 1024 bytes"),
              std::string::npos)
        << errors;
    EXPECT_EQ(output.read().size(), 1024u) << "what could be read is kept";
    EXPECT_EQ(run("--allow-partial"), 0);
    std::remove((output.path() + ".err").c_str());
}

namespace {

nitfsample::File twoImages() {
    nitfsample::Image image;
    image.cols = image.rows = 16;
    nitfsample::File file;
    file.images = {image, image};
    file.images[1].iid1 = "SECOND";
    return file;
}

} // namespace

TEST(DamagedStructure, FilesCutShortAreNeverValid) {
    const std::string bytes = nitfsample::build(twoImages());
    CNitfFileReader whole;
    ASSERT_TRUE(whole.openMemory(bytes.data(), bytes.size()));
    const __int64 headerLength = whole.getFileHeader()->getImageHeaderDataPair(0)->getHeaderOffset();

    // Nine bytes: no header at all.
    TempFile nine("NITF02.10");
    EXPECT_EQ(runTool("info " + nine.path()), 1);

    // Cut right after the header: both images are listed, neither can be read; said, and exit 1.
    TempFile cut(bytes.substr(0, static_cast<size_t>(headerLength)));
    {
        CapturedWarnings warnings;
        CNitfFileReader reader;
        ASSERT_TRUE(reader.open(cut.path().c_str()));
        EXPECT_EQ(warnings.count("2 image segment(s) lie wholly or partly beyond the end of the file"), 1);
        EXPECT_NE(
            refusalOf([&] { delete reader.getNewImageSource(0); }).find("lies beyond the end of the file"),
            std::string::npos);
    }
    std::string json;
    EXPECT_EQ(runTool("info --json " + cut.path(), &json), 1);
    EXPECT_NE(json.find("\"error\""), std::string::npos);

    // Cut inside the second image's sub-header: the first image reads whole.
    TempFile inside(bytes.substr(0, bytes.size() - 300));
    EXPECT_EQ(runTool("info " + inside.path()), 1);
    CNitfFileReader reader;
    ASSERT_TRUE(reader.open(inside.path().c_str()));
    EXPECT_NO_THROW(delete reader.getNewImageSource(0));
    EXPECT_THROW(delete reader.getNewImageSource(1), vexo::Exception);
}

TEST(DamagedStructure, AnImpossibleHeaderLengthGivesWayToTheFields) {
    const std::string good = nitfsample::build(twoImages());
    for (const char* hl : {"000000", "      ", "999999", "000100"}) {
        SCOPED_TRACE(std::string("HL \"") + hl + "\"");
        nitfsample::File file = twoImages();
        file.fields = {{"HL", hl}};
        const std::string bytes = nitfsample::build(file);
        CapturedWarnings warnings;
        CNitfFileReader reader;
        ASSERT_TRUE(reader.openMemory(bytes.data(), bytes.size()));
        EXPECT_EQ(warnings.count("cannot be right"), 1);
        std::unique_ptr<CNitfImageSubheader> second(
            reader.getFileHeader()->getNewImageSubheader(reader.getInputStream(), 1));
        ASSERT_TRUE(second);
        EXPECT_EQ(FindProperty(second->getProperties(), "IID1")->toText(), "SECOND    ");
        std::unique_ptr<CNitfImageSource> source(reader.getNewImageSource(1));
        EXPECT_EQ(canonicalBand(reader, *source, 0).size(), 256u);
    }
}

TEST(DamagedStructure, OneBadTreDoesNotBlockTheFile) {
    // An ACFTB TRE far too short for its fields, between two good ones.
    nitfsample::File file = twoImages();
    file.images[0].udid = {{"USE00A", std::string(107, '0')}, {"ACFTB", "short"}, {"BANDSB", "x"}};
    TempFile damaged(nitfsample::build(file));
    std::string text;
    EXPECT_EQ(runTool("info " + damaged.path(), &text), 0);
    EXPECT_NE(text.find("TRE USE00A"), std::string::npos);
    EXPECT_NE(text.find("TRE ACFTB"), std::string::npos);
    EXPECT_NE(text.find("Image 1:"), std::string::npos) << "the rest of the file is read";
}

TEST(DamagedStructure, RecordsPastTheEndOfTheFileAreCutWithAWarning) {
    // A TRE whose length runs far past the end of a file whose image data also run past it: the size of the
    // file stays what it is, the TRE is said to be cut, the image reads what is there.
    nitfsample::Image image;
    image.cols = image.rows = 16;
    image.udid = {{"USE00A", std::string(107, '0')}};
    std::string bytes = bytesOf(image);
    const size_t cel = bytes.find("USE00A") + 6;
    bytes.replace(cel, 5, "99999");
    CapturedWarnings warnings;
    CNitfFileReader reader;
    ASSERT_TRUE(reader.openMemory(bytes.data(), bytes.size()));
    std::unique_ptr<CNitfImageSubheader> subheader(
        reader.getFileHeader()->getNewImageSubheader(reader.getInputStream(), 0));
    EXPECT_EQ(warnings.count("TRE USE00A (99999 bytes) runs past the end of the file"), 1);
    EXPECT_EQ(DKSize(reader.getInputStream()), static_cast<__int64>(bytes.size()));
}
