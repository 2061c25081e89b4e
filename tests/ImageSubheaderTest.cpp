#include <gtest/gtest.h>

#include <cstring>
#include <memory>
#include <string>

#include "HostFile.h"
#include "NitfImageSubheaderV21.h"
#include "NitfTestFile.h"

using nitfsample::Image;

namespace {

// Builds a one-image file and reads the image's sub-header back.
struct ReadImage {
    explicit ReadImage(const Image& image)
        : sample(image),
          subheader(sample.header()->getNewImageSubheader(sample.reader().getInputStream(), 0)) {}
    std::string field(const char* name) { return fieldText(subheader->getProperties(), name); }
    OpenedSample sample;
    std::unique_ptr<CNitfImageSubheader> subheader;
};

Image small(int bands = 1) {
    Image image;
    image.rows = image.cols = 4;
    image.bands = bands;
    return image;
}

} // namespace

TEST(ImageSubheader, BandFieldNamesFollowTheBandCount) {
    auto name = [](int index, int count) {
        char* text = CNitfImageSubheader::bandFieldName("IREPBAND", index, count);
        std::string result(text);
        free(text);
        return result;
    };
    EXPECT_EQ(name(3, 9), "IREPBAND3");
    EXPECT_EQ(name(7, 12), "IREPBAND07");
    EXPECT_EQ(name(12, 12), "IREPBAND12");
    EXPECT_EQ(name(5, 100), "IREPBAND005");
    EXPECT_EQ(name(42, 999), "IREPBAND042");
    EXPECT_EQ(name(7, 1000), "IREPBAND7") << "no padding from 1000 bands on";

    Image image = small(12);
    image.irep = "MULTI";
    ReadImage read(image);
    EXPECT_EQ(read.field("XBANDS"), "00012");
    EXPECT_EQ(read.field("IREPBAND1"), "<absent>") << "two-digit names from 10 bands on";
}

TEST(ImageSubheader, CompressionRateIsReadOnlyForTheClosedList) {
    for (const char* ic : {"C6", "M0", "C2"}) {
        Image image = small();
        image.ic = ic;
        image.comrat = "9.99";
        ReadImage read(image);
        EXPECT_EQ(read.field("COMRAT"), "<absent>") << ic;
        EXPECT_EQ(read.field("IC"), ic);
    }
    Image j2k = small();
    j2k.ic = "C8";
    j2k.comrat = "N001";
    ReadImage read(j2k);
    EXPECT_EQ(read.field("COMRAT"), "N001");
    EXPECT_EQ(read.field("NBANDS"), "1") << "fields after COMRAT stay in place";
}

TEST(ImageSubheader, LookUpTablesByRepresentation) {
    Image mono = small();
    mono.irep = "MONO";
    mono.bandInfo.resize(1);
    mono.bandInfo[0].luts = {std::string(256, '\x07')};
    ReadImage monoRead(mono);
    ASSERT_EQ(monoRead.subheader->getLutCount(), 1);
    CNitfLutSource* lut = monoRead.subheader->getLutSource(0);
    EXPECT_EQ(lut->getEntryType(), CNitfLutSource::eEntryTypeMono);
    EXPECT_EQ(lut->getEntryCount(), 256);
    EXPECT_EQ(lut->getBand(), 1);
    char first;
    FILE* fp = monoRead.sample.reader().getInputStream();
    DKFSeek64(fp, lut->getEntryOffset(), SEEK_SET);
    DKFRead(&first, 1, 1, fp);
    EXPECT_EQ(first, '\x07') << "the entry offset is that of the table's first byte";

    // (A palette's entries come back interleaved: see the corpus frames' colour tables.)
    Image rgbBands = small(3);
    rgbBands.irep = "RGB";
    rgbBands.bandInfo.resize(3);
    rgbBands.bandInfo[0].luts = {std::string(4, 'a'), std::string(4, 'b'), std::string(4, 'c')};
    ReadImage rgbRead(rgbBands);
    EXPECT_EQ(rgbRead.subheader->getLutCount(), 0) << "an RGB image's tables record no look-up table";
    EXPECT_EQ(rgbRead.field("NELUT1"), "00004");
}

TEST(ImageSubheader, CommentsCornersTitleAndLevels) {
    Image image = small();
    image.comments = {"FIRST COMMENT", "SECOND"};
    image.icords = 'G';
    image.igeolo = std::string("325900N0850000E325900N0850001E325859N0850001E325859N0850000E");
    image.iid2 = "THE TITLE";
    image.security.clas = "S";
    image.idlvl = 2;
    image.ialvl = 1;
    ReadImage read(image);
    CNitfImageSubheader& subheader = *read.subheader;
    EXPECT_TRUE(subheader.hasComments());
    char comment[82];
    EXPECT_EQ(subheader.readComment(read.sample.reader().getInputStream(), 1, comment), 2);
    EXPECT_EQ(std::string(comment, 6), "SECOND");
    EXPECT_EQ(comment[80], '\n');
    std::memset(comment, 'x', sizeof comment);
    EXPECT_EQ(subheader.readComment(read.sample.reader().getInputStream(), 2, comment), 2);
    EXPECT_EQ(comment[0], 'x') << "an index beyond the comments reads nothing";

    EXPECT_EQ(subheader.getGeorefSource().getCoordinateType(), CNitfGeorefInfo::eCoordinatesGeographic);
    EXPECT_EQ(read.field("IGEOLO3"), "325859N0850001E");
    char title[81];
    subheader.getTitle(title);
    EXPECT_STREQ(title, "Secret: THE TITLE");
    EXPECT_EQ(subheader.getImageAttachment(), 0) << "the attachment level is looked up as LALVL";
}

// (Sub-headers read from the corpus are written back at their storage length in the record round trips.)
TEST(ImageSubheader, ExtendedAreaTresAreWrittenToTheUserArea) {
    // TREs read from the extended area are written into the user-defined area, and the old extended length is
    // still counted (the over-count is kept).
    Image tagged = small();
    tagged.ixshd = {{"ABCDEF", "12345"}};
    ReadImage withTres(tagged);
    CNitfImageSubheader& subheader = *withTres.subheader;
    ASSERT_EQ(subheader.getTaggedRecords().size(), 1u);
    EXPECT_EQ(subheader.getTaggedRecords().front()->getSource(), CNitfTag::eTagSourceImage);
    ByteStream written("");
    subheader.write(written);
    const std::string bytes = written.contents();
    EXPECT_EQ(subheader.computeStorageLength(), static_cast<long long>(bytes.size()) + 19)
        << "over-counted by the old IXSHDL";
    EXPECT_EQ(bytes.substr(bytes.size() - 29), "00019000ABCDEF00005" + std::string(5, '\0') + "00000")
        << "UDIDL, UDOFL, the TRE header and its skipped data, then IXSHDL 00000";

    CNitfImageSubheaderV21 copy(static_cast<CNitfImageSubheaderV21&>(subheader));
    EXPECT_EQ(copy.getTaggedRecords().size(), 1u);
    EXPECT_NE(copy.getTaggedRecords().front(), subheader.getTaggedRecords().front())
        << "copies own their entries";
}
