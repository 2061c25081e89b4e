// The A.TOC model: tables built here from known rectangles and frames through the record classes, written as
// raw and NITF-wrapped A.TOC files, read back to the same descriptions; the layout of the written sections;
// and damaged tables (counts, offsets, record and path lengths, frames outside their grids), which are
// refused with a clear message before anything they claim is followed or allocated.
#include <gtest/gtest.h>

#include <cstdio>
#include <memory>
#include <string>
#include <vector>

#include "HostError.h"
#include "NitfFileReader.h"
#include "NitfSampleWriter.h"
#include "NitfTag.h"
#include "RpfSource.h"
#include "RpfTables.h"
#include "SerializerFileRaw.h"
#include "TestFiles.h"
#include "TreBytes.h"

namespace {

// readStart on the bytes of a raw A.TOC; the message of its exception, or "".
std::string readRaw(const std::string& bytes, CRpfSource* into = nullptr) {
    ByteStream stream(bytes);
    CRpfSource local;
    CRpfSource& toc = into ? *into : local;
    try {
        toc.readStartAt(stream, 0);
        CRpfSource::freeRpfBoundaries(toc.readRpfBoundaries(stream));
    } catch (const vexo::Exception& e) {
        return e.what();
    }
    return "";
}

// A description as text: corners as they were, intervals through the per-pixel form of the records.
std::string describe(const RPFBoundaryRectangle_t& r) {
    char text[512];
    std::snprintf(text, sizeof text,
                  "%s %s %s %c %s | %.17g %.17g %.17g %.17g %.17g %.17g %.17g %.17g | %.12g %.12g | %u x %u",
                  r.productDataType, r.compressionRatio, r.scale, r.zone, r.producer, r.upperLeftLatitude,
                  r.upperLeftLongitude, r.lowerLeftLatitude, r.lowerLeftLongitude, r.upperRightLatitude,
                  r.upperRightLongitude, r.lowerRightLatitude, r.lowerRightLongitude, r.verticalInterval,
                  r.horizontalInterval, r.verticalFrames, r.horizontalFrames);
    std::string out = text;
    for (int i = 0; i < r.frameCount; ++i)
        out += std::string(" ") + (r.frameFiles[i] ? r.frameFiles[i] : "-");
    return out;
}

void expectBoundaries(CRpfSource& toc, const RpfTestRectangles& rectangles) {
    RPFBoundaryRectangle_t** boundaries = toc.readRpfBoundaries(nullptr);
    size_t count = 0;
    while (boundaries[count])
        ++count;
    ASSERT_EQ(count, rectangles.size());
    for (size_t n = 0; n < count; ++n) {
        SCOPED_TRACE("rectangle " + std::to_string(n));
        EXPECT_EQ(describe(*boundaries[n]), describe(rectangles[n]->description));
    }
    CRpfSource::freeRpfBoundaries(boundaries);
}

} // namespace

TEST(RpfToc, OneFrameTableHasThePublishedLayout) {
    // One rectangle of one frame beside the A.TOC: 292 bytes, each component where the format puts it.
    RpfTestRectangles rectangles;
    rectangles.push_back(std::make_unique<RpfTestRectangle>("CADRG", "1:1M", '1', 1, 1, 33.93, 1.99994, 2.07,
                                                            std::vector<std::string>{"RPFTOC01.ON2"}));
    CRpfSource toc = builtRpfToc(rectangles, 0, 48);
    EXPECT_EQ(toc.computeTagLength(), 48);
    EXPECT_EQ(toc.computeComponentsLength(), 292 - 48);
    EXPECT_EQ(toc.computeTotalLength(), 292);
    const nitf::CRpfLocationSection& location = toc.getToc().location;
    ASSERT_EQ(location.components.size(), 4u);
    const unsigned ids[] = {148, 149, 150, 151}, at[] = {102, 110, 242, 255}, lengths[] = {8, 132, 13, 37};
    for (int i = 0; i < 4; ++i) {
        EXPECT_EQ(location.components[i].id, ids[i]);
        EXPECT_EQ(location.components[i].location, at[i]);
        EXPECT_EQ(location.components[i].length, lengths[i]);
    }
    EXPECT_EQ(location.aggregateLength, 190u);
    EXPECT_EQ(location.sectionLength, 54);

    const std::string bytes = rawRpfToc(rectangles);
    ASSERT_EQ(bytes.size(), 292u);
    EXPECT_EQ(bytes.substr(0, 15), std::string("\0\0\x30       A.TOC", 15));
    EXPECT_EQ(bytes.substr(44, 4), std::string("\0\0\0\x30", 4));
    EXPECT_EQ(bytes.substr(255 + 6, 4), std::string("\0\0\0\x21", 4)); // the pathname after the one record
    EXPECT_EQ(bytes.substr(255 + 10, 12), "RPFTOC01.ON2");
    EXPECT_EQ(bytes.substr(288), std::string("\0\x02./", 4));
    ByteStream stream(bytes);
    EXPECT_TRUE(CRpfSource::isRawToc(stream));
}

TEST(RpfToc, RawTableReadsBackToTheSameDescriptions) {
    const auto rectangles = knownRpfRectangles();
    const std::string bytes = rawRpfToc(rectangles);
    CRpfSource toc;
    ASSERT_EQ(readRaw(bytes, &toc), "");
    EXPECT_EQ(toc.getBoundaryRectangleCount(), 2);
    expectBoundaries(toc, rectangles);

    const nitf::CRpfToc& model = toc.getToc();
    EXPECT_EQ(nitf::textOf(model.header.fileName), "A.TOC");
    EXPECT_EQ(nitf::textOf(model.header.standardNumber), "MIL-STD-2411");
    // Frames sharing a directory share its pathname record.
    ASSERT_EQ(model.pathnames.size(), 3u);
    EXPECT_EQ(model.pathnames[0].text, "./RPF/ONC/");
    EXPECT_EQ(model.pathnames[1].text, "./RPF/TPC/");
    EXPECT_EQ(model.pathnames[2].text, "./");
    // Frames are listed from the top row down, rows counted from the bottom; the empty place has no record.
    ASSERT_EQ(model.frames.size(), 6u);
    const unsigned rows[] = {2, 2, 1, 0, 0, 0}, columns[] = {0, 1, 0, 0, 1, 0},
                   directory[] = {0, 0, 1, 0, 1, 2};
    for (int i = 0; i < 6; ++i) {
        EXPECT_EQ(model.frames[i].row, rows[i]) << i;
        EXPECT_EQ(model.frames[i].column, columns[i]) << i;
        EXPECT_EQ(model.frames[i].pathname, static_cast<int>(directory[i])) << i;
    }
    // The location code of each frame's south-west corner; the frame at (0, 0) is NGAA00.
    EXPECT_EQ(nitf::textOf(model.frames[5].geographicLocation), "NGAA00");
    EXPECT_EQ(nitf::textOf(model.frames[0].geographicLocation),
              CRpfSource::getGeographicLocation(28.0 + 2 * 2.0, -100.0));
    // Intervals are stored per pixel.
    EXPECT_DOUBLE_EQ(model.rectangles[0].verticalInterval, 2.0 / 1536);
}

TEST(RpfToc, LittleEndianTablesAreRead) {
    const auto rectangles = knownRpfRectangles();
    CRpfSource built = builtRpfToc(rectangles, 0, 48);
    built.getToc().header.byteOrder = 0xFF;
    TempFile file;
    FILE* fp = std::fopen(file.path().c_str(), "w+b");
    nitf::CSerializerFileRaw out(fp, false); // this host's own order is little-endian
    out << built.getToc();
    std::fclose(fp);
    CRpfSource toc;
    ASSERT_EQ(readRaw(file.read(), &toc), "");
    expectBoundaries(toc, rectangles);
}

TEST(RpfToc, NitfWrappedTableReadsThroughTheFileReader) {
    const auto rectangles = knownRpfRectangles();
    TempFile nitf(nitfWrappedRpfToc(rectangles));
    CNitfFileReader reader;
    ASSERT_TRUE(reader.open(nitf.path().c_str()));
    std::unique_ptr<CRpfSource> read(reader.getNewExtensionRpfSource());
    ASSERT_NE(read, nullptr);
    expectBoundaries(*read, rectangles);

    // A file without RPF sections has no table.
    TempFile plain(nitfsample::build(nitfsample::File()));
    CNitfFileReader other;
    ASSERT_TRUE(other.open(plain.path().c_str()));
    EXPECT_FALSE(other.hasExtensionRpf());
    EXPECT_EQ(other.getNewExtensionRpfSource(), nullptr);
}

TEST(RpfToc, DescriptionsTheRecordsCannotHoldAreRefused) {
    CRpfSource toc;
    toc.writeStart();
    RpfTestRectangle tooMany("CADRG", "1:1M", '1', 1, 2, 0, 0, 1, {"./A.ON1", "./B.ON1", "./C.ON1"});
    EXPECT_THROW(toc.writeAddBoundaryRectangle(tooMany.description), vexo::Exception);
    RpfTestRectangle longName("CADRG", "1:1M", '1', 1, 1, 0, 0, 1, {"./FRAMENAME.ONC1"});
    EXPECT_THROW(toc.writeAddBoundaryRectangle(longName.description), vexo::Exception);
    RpfTestRectangle longPath("CADRG", "1:1M", '1', 1, 1, 0, 0, 1, {"./" + std::string(300, 'D') + "/A.ON1"});
    EXPECT_THROW(toc.writeAddBoundaryRectangle(longPath.description), vexo::Exception);
    RpfTestRectangle noColumns("CADRG", "1:1M", '1', 1, 0, 0, 0, 1, {"./A.ON1"});
    EXPECT_THROW(toc.writeAddBoundaryRectangle(noColumns.description), vexo::Exception);
    EXPECT_EQ(toc.getBoundaryRectangleCount(), 0);
}

TEST(RpfToc, DamagedTablesAreRefusedBeforeTheyAreFollowed) {
    const std::string good = rawRpfToc(knownRpfRectangles());
    ASSERT_EQ(readRaw(good), "");
    // Places in the written table: location section at 48 with four records; 148 at 102, 149 at 110 (two
    // records), 150 at 374, 151 at 387 (six records, then the pathnames at 387 + 198).
    const size_t frames = 387, pathnames = 387 + 6 * 33;
    struct Case {
        const char* what;
        size_t at;
        unsigned long long value;
        int width;
        const char* message;
    };
    const Case cases[] = {
        {"unknown byte order", 0, 0x42, 1, "byte order"},
        {"location section past the end", 44, 0x7FFFFF00, 4, "runs past the end of the file"},
        {"component table far away", 48 + 2, 0xFFFFFF00, 4, "run past the end of the file"},
        {"65535 component records", 48 + 6, 0xFFFF, 2, "run past the end of the file"},
        {"component records of 4 bytes", 48 + 8, 4, 2, "shorter than its fields"},
        {"a component beyond the file", 48 + 14 + 6, 0xFFFFFFF0, 4, "runs past the end of the file"},
        {"65535 rectangles", 102 + 4, 0xFFFF, 2, "run past the end of the file"},
        {"rectangle records of 100 bytes", 102 + 6, 100, 2, "shorter than its fields"},
        {"4 billion frames", 374 + 5, 0xFFFFFFFF, 4, "run past the end of the file"},
        {"65535 pathnames", 374 + 9, 0xFFFF, 2, "run past the end of the file"},
        {"frame records of 20 bytes", 374 + 11, 20, 2, "shorter than its fields"},
        {"a pathname of 0 bytes", pathnames, 0, 2, "a text of 0 bytes"},
        {"a pathname of 300 bytes", pathnames, 300, 2, "a text of 300 bytes"},
        {"a pathname past the end", pathnames + 2 + 10 + 2 + 10, 200, 2, "runs past the end of the file"},
        {"a frame of a rectangle that does not exist", frames, 7, 2, "refers to boundary rectangle 7"},
        {"a row outside the grid", frames + 2, 3, 2, "outside the 3 x 2 frames"},
        {"a column outside the grid", frames + 4, 2, 2, "outside the 3 x 2 frames"},
        {"a grid far larger than its frames", 110 + 124, 60000, 4, "far larger than their 6 frames"},
        {"a grid whose cells overflow 64 bits", 110 + 124, 0xFFFFFFF0, 4, "far larger than their 6 frames"}};
    for (const Case& c : cases) {
        SCOPED_TRACE(c.what);
        std::string bytes = good;
        bytes.replace(c.at, c.width, bigEndian(c.value, c.width));
        if (c.at == 110 + 124) // the grid cases: as many frames east-west as north-south
            bytes.replace(110 + 128, 4, bigEndian(c.value, 4));
        const std::string message = readRaw(bytes);
        EXPECT_NE(message.find(c.message), std::string::npos) << message;
    }
}

TEST(RpfToc, TruncatedTablesNeverCrash) {
    const std::string good = rawRpfToc(knownRpfRectangles());
    int refused = 0;
    int tried = 0;
    // Every cut inside the header and location sections, then every few bytes.
    for (size_t length = 0; length < good.size(); length += length < 110 ? 1 : 7, ++tried)
        refused += readRaw(good.substr(0, length)).empty() ? 0 : 1;
    EXPECT_EQ(refused, tried);
    // A pathname offset that matches no pathname record leaves that frame without a path.
    std::string bytes = good;
    bytes.replace(387 + 6, 4, bigEndian(5, 4));
    CRpfSource toc;
    ASSERT_EQ(readRaw(bytes, &toc), "");
    EXPECT_EQ(toc.getToc().frames[0].pathname, -1);
    RPFBoundaryRectangle_t** boundaries = toc.readRpfBoundaries(nullptr);
    EXPECT_EQ(boundaries[0]->frameFiles[0], nullptr);
    EXPECT_STREQ(boundaries[0]->frameFiles[1], "./RPF/ONC/001ZD013.ON1");
    CRpfSource::freeRpfBoundaries(boundaries);
}
