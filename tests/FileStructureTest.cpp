#include <gtest/gtest.h>

#include <memory>
#include <string>

#include "HostError.h"
#include "HostFile.h"
#include "NitfDataExtensionSource.h"
#include "NitfFileHeaderV21.h"
#include "NitfImageSubheader.h"
#include "NitfSymbolSource.h"
#include "NitfTestFile.h"
#include "NitfTextSource.h"

using nitfsample::Des;
using nitfsample::File;
using nitfsample::Tre;

namespace {

File oneImageFile(const std::string& version = "NITF02.10") {
    File file;
    file.version = version;
    file.images.emplace_back();
    file.images.back().rows = 8;
    file.images.back().cols = 8;
    return file;
}

} // namespace

TEST(FileStructure, VersionsAreDetectedFromTheFirstNineBytes) {
    const struct {
        const char* text;
        eNitfVersion_t version;
    } cases[] = {{"NITF01.10", eNitfVersion11},     {"NITF02.00", eNitfVersion20},
                 {"NITF02.10xyz", eNitfVersion21},  {"NSIF01.00", eNsifVersion10},
                 {"NSIF01.01", eNsifVersion10},     {"OSDE01.00", eOsdeVersion01},
                 {"NITF02.1", eNitfVersionUnknown}, {"nitf02.10", eNitfVersionUnknown}};
    for (const auto& c : cases) {
        ByteStream in(c.text);
        EXPECT_EQ(CNitfFileHeader::readVersion(in), c.version) << c.text;
    }
    TempFile unknown("GARBAGE-FILE-CONTENTS");
    CNitfFileReader reader;
    EXPECT_EQ(refusalOf([&] { reader.open(unknown.path().c_str()); }), "Unknown NITF file version");
    EXPECT_EQ(reader.open("/nonexistent/file.ntf"), nullptr);

    // An NSIF01.01 file is read with the 2.1 header; NITF 1.1 is recognised and shows nothing.
    std::string nsif = nitfsample::build(oneImageFile("NSIF01.00"));
    nsif.replace(0, 9, "NSIF01.01");
    OpenedSample sample(nsif);
    EXPECT_NE(dynamic_cast<CNitfFileHeaderV21*>(sample.header()), nullptr);
    EXPECT_EQ(sample.reader().getImageCount(), 1);
    OpenedSample old(std::string("NITF01.10") + std::string(500, ' '));
    EXPECT_EQ(old.reader().getImageCount(), 0);
    EXPECT_TRUE(old.header()->getFields().empty());
}

// (Segment tables are read against the manifest's offsets and lengths, and written back, on the corpus.)
TEST(FileStructure, SegmentLengthsThatDoNotFitAreWrittenAsNines) {
    ByteStream out("");
    CNitfHeaderDataPair huge(0, 499, 12000000000LL);
    std::vector<CNitfHeaderDataPair*> one{&huge};
    CNitfFileHeader::writePairs(out, 3, 6, 10, &one);
    EXPECT_EQ(out.contents(), "0010004999999999999");
}

// (The fields, TREs and segments of real files are checked against the corpus manifest.)
TEST(FileStructure, HeaderFieldsTresAndSegmentsOfA21File) {
    File file = oneImageFile();
    file.ftitle = "A TITLE";
    file.fbkgc = std::string("\xFF\x80\0", 3);
    file.udhd = {{"AAAAAA", "123"}, {"BBBBBB", ""}};
    file.xhd = {{"AAAAAA", "45"}};
    file.texts.emplace_back();
    file.texts.back().data = "Hello\r\nWorld";
    OpenedSample sample(file);
    char title[81];
    sample.header()->getTitle(title);
    EXPECT_STREQ(title, "A TITLE");
    EXPECT_EQ(fieldText(sample.header()->getProperties(), "FBKGC"), "FF8000")
        << "the colour bytes read as hex text";

    // User-defined area first, then extended; numbering spans both areas.
    std::list<CNitfTag*>& tags = sample.header()->getTaggedRecords();
    ASSERT_EQ(tags.size(), 3u);
    EXPECT_STREQ(tags.front()->getIdentifier(), "AAAAAA");
    EXPECT_EQ(tags.front()->getSource(), CNitfTag::eTagSourceFileHeader);
    EXPECT_EQ(tags.back()->getOccurrence(), 2);
    EXPECT_EQ(tags.back()->getTotal(), 2);

    std::unique_ptr<CNitfTextSource> text(sample.reader().getNewTextSource(0));
    std::string buffer(text->getDataLength() + 2, 'x');
    text->readText(&sample.reader(), &buffer[0]);
    EXPECT_EQ(buffer, std::string("Hello\r\nWorld\n\0", 14));

    // Out-of-range indexes raise instead of crashing.
    EXPECT_THROW(sample.reader().getNewSymbolSource(0), vexo::Exception);
    EXPECT_THROW(sample.reader().getNewTextSource(-1), vexo::Exception);
    EXPECT_THROW(sample.reader().getNewLabelSource(0), vexo::Exception);
    EXPECT_THROW(sample.reader().getNewDataExtensionSource(0), vexo::Exception);
    EXPECT_THROW(sample.reader().getNewImageSource(1), vexo::Exception);
}

TEST(FileStructure, NonZeroReservedCountStopsTheHeader) {
    File file = oneImageFile();
    file.fields["NUMX"] = "001";
    file.udhd = {{"AAAAAA", "1"}};
    file.texts.emplace_back();
    for (const char* name : {"i_3125d.ntf", "other.ntf"}) {
        OpenedSample sample(file, name);
        EXPECT_EQ(sample.reader().getImageCount(), 1) << name;
        EXPECT_EQ(sample.reader().getTextCount(), 0) << name;
        EXPECT_TRUE(sample.header()->getTaggedRecords().empty()) << name;
    }
}

TEST(FileStructure, OsdeAndNitf20Layouts) {
    File osde = oneImageFile("OSDE01.00");
    osde.oid = "ORIGINATOR";
    OpenedSample sample(osde);
    PropertyMap& map = sample.header()->getProperties();
    EXPECT_EQ(fieldText(map, "OID").substr(0, 10), "ORIGINATOR");
    EXPECT_EQ(fieldText(map, "FBKGC"), "<absent>");
    std::unique_ptr<CNitfImageSubheader> image(
        sample.header()->getNewImageSubheader(sample.reader().getInputStream(), 0));
    EXPECT_NE(fieldText(image->getProperties(), "IINFO"), "<absent>");
    EXPECT_NE(fieldText(image->getProperties(), "ISCSEC"), "<absent>");
    EXPECT_EQ(fieldText(image->getProperties(), "ISCLAS"), "<absent>");
    EXPECT_EQ(fieldText(image->getProperties(), "TGTID"), "<absent>");

    File old = oneImageFile("NITF02.00");
    old.security.dwng = "999998";
    old.security.devt = "ON EVENT";
    old.des.push_back(nitfsample::treOverflow("UDID", 1, {{"IMTRE1", "abc"}}, "NITF02.00"));
    old.des.back().security.ctlh = "HANDLING";
    OpenedSample sample20(old);
    EXPECT_EQ(fieldText(sample20.header()->getProperties(), "FSDEVT").substr(0, 8), "ON EVENT");
    std::unique_ptr<CNitfDataExtensionSource> des(sample20.reader().getNewDataExtensionSource(0));
    EXPECT_TRUE(des->isOverflow());
    EXPECT_EQ(des->getField("DECTLH"), "HANDLING") << "2.0 keeps its own key for control and handling";
    EXPECT_EQ(des->getField("DESCTLH"), "");
}

// (Background colours, like every field of the corpus's headers, are written back byte for byte in the
// record round trips.)
TEST(FileStructure, OverflowSegmentsAttachTheirTres) {
    File file = oneImageFile();
    file.des.push_back(nitfsample::treOverflow("UDID", 1, {{"IMTRE1", "abc"}, {"IMTRE2", ""}}));
    file.des.push_back(nitfsample::treOverflow("LXSHD", 1, {{"LABTRE", "q"}}));
    file.des.push_back(nitfsample::treOverflow("XHD", 0, {{"FILTRE", "zz"}}));
    file.des.push_back(nitfsample::treOverflow("WEIRD", 0, {{"ODDTRE", "1"}}));
    OpenedSample sample(file);
    CNitfFileReader& reader = sample.reader();
    std::list<CNitfTag*>& tags = sample.header()->getTaggedRecords();

    std::unique_ptr<CNitfDataExtensionSource> image(reader.getNewDataExtensionSource(0));
    ASSERT_EQ(tags.size(), 2u) << "without an image source, image overflow joins the file header";
    EXPECT_EQ(tags.front()->getSource(), CNitfTag::eTagSourceImageDES);
    EXPECT_FALSE(tags.back()->hasOccurrence()) << "overflow TREs are not numbered";
    EXPECT_EQ(image->getOverflowTags().size(), 2u);

    std::unique_ptr<CNitfDataExtensionSource> label(reader.getNewDataExtensionSource(1));
    EXPECT_EQ(tags.size(), 2u) << "label overflow is not read";
    std::unique_ptr<CNitfDataExtensionSource> header(reader.getNewDataExtensionSource(2));
    EXPECT_EQ(tags.back()->getSource(), CNitfTag::eTagSourceFileHeaderDES);
    std::unique_ptr<CNitfDataExtensionSource> odd(reader.getNewDataExtensionSource(3));
    EXPECT_EQ(tags.back()->getSource(), CNitfTag::eTagSourceUnknown);
    EXPECT_STREQ(tags.back()->getIdentifier(), "ODDTRE");
}

TEST(FileStructure, DataExtensionKinds) {
    File file = oneImageFile();
    Des xml, shape, plain;
    xml.desid = "XML_DATA_CONTENT";
    xml.desshf = "abcde";
    shape.desid = "CSSHPA DES";
    plain.desid = "TEST_DES";
    file.des = {xml, shape, plain};
    OpenedSample sample(file);
    std::unique_ptr<CNitfDataExtensionSource> first(sample.reader().getNewDataExtensionSource(0));
    EXPECT_TRUE(first->isXMLDES());
    EXPECT_EQ(first->getField("DESSHF"), "abcde");
    EXPECT_TRUE(std::unique_ptr<CNitfDataExtensionSource>(sample.reader().getNewDataExtensionSource(1))
                    ->isCloudShape());
    std::unique_ptr<CNitfDataExtensionSource> third(sample.reader().getNewDataExtensionSource(2));
    EXPECT_FALSE(third->isXMLDES());
    EXPECT_EQ(FindProperty(third->getProperties(), "DESSHF"), nullptr) << "DESSHL 0000 has no DESSHF";
}

TEST(FileStructure, StreamingHeaderReplacesTheHeader) {
    File file = oneImageFile();
    file.streaming = true;
    OpenedSample sample(file);
    auto* header = dynamic_cast<CNitfFileHeaderV21*>(sample.header());
    ASSERT_NE(header, nullptr);
    EXPECT_TRUE(header->isStreamingReplacement());
    EXPECT_NE(fieldText(header->getProperties(), "FL"), "999999999999");
    EXPECT_LT(header->getImageHeaderDataPair(0)->getDataLength(), 9999999999LL);

    std::unique_ptr<CNitfDataExtensionSource> des(
        sample.reader().getNewDataExtensionSource(header->getDataExtensionCount() - 1));
    EXPECT_TRUE(des->isStreamingFileHeader());
    EXPECT_EQ(des->getStreamingHeaderLength(), FindProperty(header->getProperties(), "HL")->getAsInt());
    long long start = des->getDataOffset() + 11;
    EXPECT_EQ(DKFTell(sample.reader().getInputStream()), start)
        << "left at the replacement header's first byte";

    // A streaming segment that does not replace the whole header is refused.
    File partial = oneImageFile();
    partial.fields["FL"] = "999999999999";
    partial.des.push_back(nitfsample::streamingFileHeader(std::string(100, ' ')));
    EXPECT_EQ(refusalOf([&] { OpenedSample broken(partial); }),
              "Only a file header replacement is supported for a streaming file header.");
}
