// Georeferencing: the IGEOLO corner forms against the published worked examples, the precise corners of
// BLOCKA, GEOLOB and RPF coverage, reading into and writing from the host projection record (with the
// read-actual, write-padded sizes), the RPC sensor model with its chip, and every corpus image with IGEOLO.
#include <gtest/gtest.h>

#include <cmath>
#include <cstdio>
#include <memory>
#include <string>
#include <vector>

#include "GeorefText.h"
#include "HostError.h"
#include "HostFile.h"
#include "Manifest.h"
#include "NitfFileReader.h"
#include "NitfGeorefInfo.h"
#include "NitfImageSource.h"
#include "NitfImageSubheader.h"
#include "NitfSampleWriter.h"
#include "NitfTestFile.h"
#include "RpcSource.h"
#include "TestFiles.h"
#include "TreBytes.h"

using nitf_georef::CornerPoint;
using Form = CNitfGeorefInfo::eCoordinateType_t;

namespace {

// Latitude and longitude of a parsed corner.
void geocoded(const CornerPoint& point, double* latitude, double* longitude) {
    ProjInfo_t record;
    InitProjInfo(&record);
    record.system = point.system;
    record.zone = point.zone;
    record.southern = point.southern;
    ASSERT_EQ(ProjToGeocoded(&record, point.x, point.y, latitude, longitude), 0);
}

// Latitude and longitude of corner `i` of a record.
void cornerDegrees(const ProjInfo_t& record, int i, double* latitude, double* longitude) {
    ASSERT_EQ(ProjToGeocoded(&record, record.cornerX[i], record.cornerY[i], latitude, longitude), 0);
}

struct WorkedExample {
    Form form;
    const char* text;
    double latitude, longitude;
};

// The worked examples of the published corner forms (values to 1e-6 degree).
const WorkedExample kWorkedExamples[] = {
    {CNitfGeorefInfo::eCoordinatesGeographic, "440344N1230429W", 44.062222, -123.074722},
    {CNitfGeorefInfo::eCoordinatesGeographic, "163958S0114500E", -16.666111, 11.750000},
    {CNitfGeorefInfo::eCoordinatesGeographic, "200000S0125924E", -20.000000, 12.990000},
    {CNitfGeorefInfo::eCoordinatesDecimal, "+39.804-084.146", 39.804, -84.146},
    {CNitfGeorefInfo::eCoordinatesUtmNorth, "172330853807070", 34.370624, -83.902537},
    {CNitfGeorefInfo::eCoordinatesUtmNorth, "172349753805180", 34.354086, -83.881424},
    {CNitfGeorefInfo::eCoordinatesUtmSouth, "327933278155361", -16.666110, 11.750000},
    {CNitfGeorefInfo::eCoordinatesMgrs, "17SKU3308507070", 34.370624, -83.902537},
    {CNitfGeorefInfo::eCoordinatesMgrs, "32KQG9332755361", -16.666110, 11.750000},
    {CNitfGeorefInfo::eCoordinatesGeocentric, "325900N0850000E", 33.159316, 85.000000}};

} // namespace

// ---- the corner forms -------------------------------------------------------------------------------------

TEST(GeorefCornerText, WorkedExamplesDecodeAndWriteBack) {
    for (const WorkedExample& example : kWorkedExamples) {
        SCOPED_TRACE(example.text);
        CornerPoint point;
        ASSERT_TRUE(nitf_georef::parseIgeoloCorner(example.form, example.text, &point));
        double latitude, longitude;
        geocoded(point, &latitude, &longitude);
        EXPECT_NEAR(latitude, example.latitude, 1.5e-6);
        EXPECT_NEAR(longitude, example.longitude, 1.5e-6);
        char text[16];
        ASSERT_TRUE(nitf_georef::formatIgeoloCorner(example.form, point, text));
        EXPECT_STREQ(text, example.text);
    }
    // MGRS corners become UTM in the zone and hemisphere they name, to the metre.
    CornerPoint point;
    ASSERT_TRUE(nitf_georef::parseIgeoloCorner(CNitfGeorefInfo::eCoordinatesMgrs, "32KQG9332755361", &point));
    EXPECT_EQ(point.zone * 10 + point.southern, 321);
    EXPECT_NEAR(point.x, 793327, 1e-6);
    EXPECT_NEAR(point.y, 8155361, 1e-6);
}

TEST(GeorefCornerText, MalformedCornersAreRefused) {
    const std::pair<Form, const char*> bad[] = {
        {CNitfGeorefInfo::eCoordinatesGeographic, "446044N1230429W"}, // 60 minutes
        {CNitfGeorefInfo::eCoordinatesGeographic, "910000N1230429W"}, // latitude beyond 90
        {CNitfGeorefInfo::eCoordinatesGeographic, "440344X1230429W"}, // hemisphere letter
        {CNitfGeorefInfo::eCoordinatesGeographic, "44 344N1230429W"}, // blank in a number
        {CNitfGeorefInfo::eCoordinatesDecimal, " 39.804-084.146"},    // no sign
        {CNitfGeorefInfo::eCoordinatesDecimal, "+39,804-084.146"},
        {CNitfGeorefInfo::eCoordinatesUtmNorth, "612330853807070"}, // zone 61
        {CNitfGeorefInfo::eCoordinatesUtmSouth, "32793327815536 "},
        {CNitfGeorefInfo::eCoordinatesMgrs, "17IKU3308507070"}, // band I does not exist
        {CNitfGeorefInfo::eCoordinatesMgrs, "17SKI3308507070"}, // nor does row letter I
        {CNitfGeorefInfo::eCoordinatesMgrs, "ZAH330850707070"}, // polar: not this form
        {CNitfGeorefInfo::eCoordinatesUps, "P12345671234567"},
        {CNitfGeorefInfo::eCoordinatesOther, "440344N1230429W"}};
    for (const auto& [form, text] : bad) {
        CornerPoint point;
        EXPECT_FALSE(nitf_georef::parseIgeoloCorner(form, text, &point)) << text;
    }
}

TEST(GeorefCornerText, WritingRoundsAndRefusesAsTheFormsSay) {
    char text[16];
    CornerPoint geographic;
    geographic.system = PROJ_GEOGRAPHIC;
    // 59.6" rounds into the next minute and 59' 60" into the next degree.
    geographic.y = 10 + 59 / 60.0 + 59.6 / 3600;
    geographic.x = -(20 + 29.4 / 3600);
    ASSERT_TRUE(nitf_georef::formatIgeoloCorner(CNitfGeorefInfo::eCoordinatesGeographic, geographic, text));
    EXPECT_STREQ(text, "110000N0200029W");
    geographic.y = -5.25;
    geographic.x = 11.75;
    ASSERT_TRUE(nitf_georef::formatIgeoloCorner(CNitfGeorefInfo::eCoordinatesDecimal, geographic, text));
    EXPECT_STREQ(text, "-05.250+011.750");
    // A longitude past the antimeridian comes back into -180 .. 180.
    geographic.x = 190.5;
    ASSERT_TRUE(nitf_georef::formatIgeoloCorner(CNitfGeorefInfo::eCoordinatesDecimal, geographic, text));
    EXPECT_STREQ(text, "-05.250-169.500");

    CornerPoint utm;
    utm.system = PROJ_UTM;
    utm.zone = 4;
    utm.x = 500000.4;
    utm.y = 2300000.6;
    ASSERT_TRUE(nitf_georef::formatIgeoloCorner(CNitfGeorefInfo::eCoordinatesUtmNorth, utm, text));
    EXPECT_STREQ(text, "045000002300001");
    // MGRS keeps two zone digits, and truncates to the metre: a point a hair below a whole metre that came
    // through a latitude/longitude round trip keeps its metre.
    utm.x = 500000 - 1e-9;
    utm.y = 2300000;
    ASSERT_TRUE(nitf_georef::formatIgeoloCorner(CNitfGeorefInfo::eCoordinatesMgrs, utm, text));
    EXPECT_EQ(std::string(text).substr(0, 2), "04");
    CornerPoint back;
    ASSERT_TRUE(nitf_georef::parseIgeoloCorner(CNitfGeorefInfo::eCoordinatesMgrs, text, &back));
    EXPECT_NEAR(back.x, 500000, 1e-6) << text;
    EXPECT_NEAR(back.y, 2300000, 1e-6) << text;

    // North of the form's hemisphere, out of range, or in the wrong system: refused.
    EXPECT_FALSE(nitf_georef::formatIgeoloCorner(CNitfGeorefInfo::eCoordinatesUtmSouth, utm, text));
    utm.y = -10;
    EXPECT_FALSE(nitf_georef::formatIgeoloCorner(CNitfGeorefInfo::eCoordinatesUtmNorth, utm, text));
    EXPECT_FALSE(nitf_georef::formatIgeoloCorner(CNitfGeorefInfo::eCoordinatesGeographic, utm, text));
}

// (Well-formed BLOCKA and GEOLOB data are read into precise corners below and on the corpus.)
TEST(GeorefCornerText, MalformedBlockaAndGeolobAreRefused) {
    double latitude, longitude;
    for (const char* bad : {"                     ", "+39.241191 118.292969", "N396028.29W1181734.69"})
        EXPECT_FALSE(nitf_georef::parseBlockaLocation(bad, &latitude, &longitude)) << bad;
    nitf_georef::GeolobGrid grid;
    for (const char* bad : {"000000000030590149-123.0749837910+044.0622542218",
                            "022060370030590149-123.07498379X0+044.0622542218"})
        EXPECT_FALSE(nitf_georef::parseGeolob(bad, &grid)) << bad;
}

// ---- reading and writing through the image source ---------------------------------------------------------

namespace {

std::string blocka(int rows, const std::string& frfc, const std::string& frlc, const std::string& lrlc,
                   const std::string& lrfc) {
    char lines[8];
    std::snprintf(lines, sizeof lines, "%05d", rows);
    return std::string("01") + "     " + lines + "   " + "   " + std::string(16, ' ') + frlc + lrlc + lrfc +
           frfc + "010.0";
}

// One image of `rows` x `cols` with the given corners and TREs, in a file of `version`; blocks of `block`
// pixels (0: one block).
nitfsample::File georeferencedFile(char icords, const std::string& igeolo, int rows = 100, int cols = 100,
                                   std::vector<nitfsample::Tre> tres = {},
                                   const std::string& version = "NITF02.10", int block = 0) {
    nitfsample::File file;
    file.version = version;
    nitfsample::Image image;
    image.rows = rows;
    image.cols = cols;
    image.icords = icords;
    image.igeolo = igeolo;
    image.udid = std::move(tres);
    image.nppbh = image.nppbv = block;
    file.images.push_back(image);
    return file;
}

struct ReadResult {
    ProjInfo_t record;
    CNitfGeorefInfo::eCornerSource_t source;
};

ReadResult readRecord(const nitfsample::File& file, bool precise) {
    OpenedSample sample(file);
    CNitfImageSource& image = sample.source();
    ReadResult result;
    FILE* fp = sample.reader().getInputStream();
    DKFSeek64(fp, 7, SEEK_SET);
    image.readProjection(fp, &result.record, precise);
    EXPECT_EQ(DKFTell(fp), 7) << "the stream's position is kept";
    result.source = image.getImageSubheader()->getGeorefSource().getCornerSource();
    return result;
}

// Reads the record of image 0 of a file on disk, blanks IGEOLO, writes it back from the record (through the
// image source, so at the padded size), and returns what was written.
std::string rewriteIgeolo(const std::string& path, bool throughImageSource = true) {
    CNitfFileReader reader;
    EXPECT_TRUE(reader.open(path.c_str(), "r+b"));
    std::unique_ptr<CNitfImageSource> image(reader.getNewImageSource(0));
    FILE* fp = reader.getInputStream();
    ProjInfo_t record;
    image->readProjection(fp, &record, false);
    CNitfGeorefInfo& georef = image->getImageSubheader()->getGeorefSource();
    DKFSeek64(fp, georef.getIgeoloOffset(), SEEK_SET);
    DKFWrite(std::string(60, ' ').data(), 1, 60, fp);
    if (throughImageSource) {
        image->writeProjection(fp, &record);
    } else {
        const CNitfImagePropertiesIF& p = image->getImageProperties();
        georef.write(fp, &record, p.getImageActualWidth(), p.getImageActualHeight());
    }
    std::fflush(fp);
    char text[60];
    DKFSeek64(fp, georef.getIgeoloOffset(), SEEK_SET);
    EXPECT_EQ(DKFRead(text, 1, 60, fp), 60u);
    return std::string(text, 60);
}

const std::string kRectangleG = "200000N0200000W200000N0200000E200000S0200000E200000S0200000W";

} // namespace

TEST(GeorefInfo, EveryFormFillsTheRecord) {
    // (A geographic rectangle's transform is checked with the georeferencing report.)

    // UTM north keeps easting and northing exactly; the 2.1 worked example's whole IGEOLO.
    ReadResult n = readRecord(
        georeferencedFile('N', "172330853807070172349753807070172349753805180172330853805180"), false);
    EXPECT_EQ(n.record.system * 100 + n.record.zone * 10 + n.record.southern, PROJ_UTM * 100 + 170);
    EXPECT_EQ(n.record.cornerX[1], 234975);
    EXPECT_EQ(n.record.cornerY[2], 3805180);

    // NITF 2.0: C is geocentric, made geodetic in a geographic record; N means no coordinates.
    ReadResult c =
        readRecord(georeferencedFile(
                       'C', std::string("325900N0850000E325900N0850001E") + "325859N0850001E325859N0850000E",
                       100, 100, {}, "NITF02.00"),
                   false);
    EXPECT_EQ(c.record.system, PROJ_GEOGRAPHIC);
    EXPECT_NEAR(c.record.cornerY[0], 33.159316, 1.5e-6);
    ReadResult none20 = readRecord(georeferencedFile('N', "", 100, 100, {}, "NITF02.00"), false);
    EXPECT_EQ(none20.record.system, PROJ_NONE);
    EXPECT_EQ(none20.source, CNitfGeorefInfo::eCornerSourceNone);
    ReadResult none21 = readRecord(georeferencedFile(0, ""), true);
    EXPECT_EQ(none21.record.system, PROJ_NONE);
    EXPECT_EQ(none21.record.hasCorners, 0);
}

TEST(GeorefInfo, CornersAcrossZonesKeepTheFirstCornersZone) {
    // (Corners that are not a parallelogram stand alone: see the georeferencing report.)
    // A corner in the next zone east is carried into the first corner's zone.
    double latitude = 34.37, longitude = -77.0, x, y;
    ProjInfo_t zone18;
    InitProjInfo(&zone18);
    DecodeGeosys(&zone18, "UTM 18N");
    ASSERT_EQ(GeocodedToProj(&zone18, latitude, longitude, &x, &y), 0);
    char corner[16];
    std::snprintf(corner, sizeof corner, "18%06.0f%07.0f", x, y);
    ReadResult zones = readRecord(
        georeferencedFile('N', std::string("172330853807070") + corner + "172349753805180172330853805180"),
        false);
    ASSERT_EQ(zones.record.zone, 17);
    double lat1, lon1;
    cornerDegrees(zones.record, 1, &lat1, &lon1);
    EXPECT_NEAR(lat1, latitude, 2e-5);
    EXPECT_NEAR(lon1, longitude, 2e-5);
    EXPECT_GT(zones.record.cornerX[1], 800000) << "east of zone 17's usual eastings";
}

TEST(GeorefInfo, DamagedOrUndecodedCornersAreWarnedNotGuessed) {
    CapturedWarnings warnings;
    ReadResult bad = readRecord(
        georeferencedFile('G', "200000N0200000W200000N02000X0E200000S0200000E200000S0200000W"), true);
    EXPECT_EQ(bad.record.system, PROJ_NONE);
    EXPECT_EQ(bad.record.hasCorners, 0);
    EXPECT_TRUE(warnings.count("IGEOLO corner 2"))
        << (warnings.messages().empty() ? "" : warnings.messages()[0]);
    ReadResult ups = readRecord(georeferencedFile('P', std::string(60, '1')), false);
    EXPECT_EQ(ups.record.hasCorners, 0);
    EXPECT_TRUE(warnings.count("\"P\" are not decoded"));
    // A letter ICORDS does not define still has its 60 bytes, and no corners.
    ReadResult other = readRecord(georeferencedFile('X', kRectangleG), false);
    EXPECT_EQ(other.record.hasCorners, 0);
}

TEST(GeorefInfo, PreciseCornersReplaceIgeoloWhenTheyAgree) {
    const std::string igeolo = "391339N1181829W391428N1181735W391346N1181631W391257N1181725W";
    // The published cross-check: each IGEOLO corner is the BLOCKA corner rounded to the whole second.
    const nitfsample::Tre block{"BLOCKA", blocka(100, "N391338.95W1181828.74", "N391428.29W1181734.69",
                                                 "N391345.91W1181630.73", "N391256.57W1181724.79")};
    ReadResult precise = readRecord(georeferencedFile('G', igeolo, 100, 100, {block}), true);
    EXPECT_EQ(precise.source, CNitfGeorefInfo::eCornerSourceBlocka);
    EXPECT_EQ(precise.record.system, PROJ_GEOGRAPHIC);
    EXPECT_NEAR(precise.record.cornerY[0], 39 + 13 / 60.0 + 38.95 / 3600, 1e-12);
    EXPECT_NEAR(precise.record.cornerX[3], -(118 + 17 / 60.0 + 24.79 / 3600), 1e-12);
    EXPECT_EQ(readRecord(georeferencedFile('G', igeolo, 100, 100, {block}), false).source,
              CNitfGeorefInfo::eCornerSourceIgeolo);

    CapturedWarnings warnings;
    // BLOCKA of another block's rows, and BLOCKA whose corners go round the other way: IGEOLO stays.
    const nitfsample::Tre otherRows{"BLOCKA", blocka(8960, "N391338.95W1181828.74", "N391428.29W1181734.69",
                                                     "N391345.91W1181630.73", "N391256.57W1181724.79")};
    EXPECT_EQ(readRecord(georeferencedFile('G', igeolo, 100, 100, {otherRows}), true).source,
              CNitfGeorefInfo::eCornerSourceIgeolo);
    EXPECT_TRUE(warnings.count("BLOCKA describes 8960 rows"));
    const nitfsample::Tre rotated{"BLOCKA", blocka(100, "N391428.29W1181734.69", "N391345.91W1181630.73",
                                                   "N391256.57W1181724.79", "N391338.95W1181828.74")};
    EXPECT_EQ(readRecord(georeferencedFile('G', igeolo, 100, 100, {rotated}), true).source,
              CNitfGeorefInfo::eCornerSourceIgeolo);
    EXPECT_TRUE(warnings.count("BLOCKA corner 1 disagrees with IGEOLO"));
    // Without IGEOLO there is nothing to disagree with.
    EXPECT_EQ(readRecord(georeferencedFile(0, "", 100, 100, {rotated}), true).source,
              CNitfGeorefInfo::eCornerSourceBlocka);
    // GEOLOB beats BLOCKA: its grid is exact (its corners, the corner pixels' centres, are checked on the
    // corpus); RPF coverage corners, once given, come first.
    const nitfsample::Tre grid{"GEOLOB", "000360000000360000-118.3080000000+039.2280000000"};
    const std::string gridIgeolo = "391339N1181827W391339N1161831W381343N1161831W381343N1181827W";
    ReadResult geolob = readRecord(georeferencedFile('G', gridIgeolo, 1000, 2000, {block, grid}), true);
    EXPECT_EQ(geolob.source, CNitfGeorefInfo::eCornerSourceGeolob);
    EXPECT_NEAR(geolob.record.affine[1], 0.001, 1e-15);
    OpenedSample sample(georeferencedFile('G', kRectangleG, 100, 100, {grid}));
    CNitfGeorefInfo& georef = sample.source().getImageSubheader()->getGeorefSource();
    const double latitude[4] = {20.0001, 20.0001, -20.0001, -20.0001}, longitude[4] = {-20, 20, 20, -20};
    georef.setCoverageCorners(latitude, longitude);
    ProjInfo_t record;
    sample.source().readProjection(sample.reader().getInputStream(), &record, true);
    EXPECT_EQ(georef.getCornerSource(), CNitfGeorefInfo::eCornerSourceRpfCoverage);
}

// (Every form's corners are written back on their own with the worked examples, and whole IGEOLO fields with
// the corpus's images.)
TEST(GeorefInfo, WritingKeepsTheFourCornersOfOnePixel) {
    // One pixel with four different corners (as a JPEG 2000 test file has it) keeps them all.
    const std::string single = "172330853807070172349753807070172349753805180172330853805180";
    TempFile one(nitfsample::build(georeferencedFile('N', single, 1, 1)));
    EXPECT_EQ(rewriteIgeolo(one.path()), single);
}

TEST(GeorefInfo, WritingUsesThePaddedSize) {
    // 101 x 101 pixels in blocks of 64: the padded image is 128 x 128, and the corners move out with it.
    const std::string igeolo = "+10.100+020.000+10.100+020.100+10.000+020.100+10.000+020.000";
    TempFile file(nitfsample::build(georeferencedFile('D', igeolo, 101, 101, {}, "NITF02.10", 64)));
    EXPECT_EQ(rewriteIgeolo(file.path()), "+10.100+020.000+10.100+020.127+09.973+020.127+09.973+020.000");
    TempFile again(nitfsample::build(georeferencedFile('D', igeolo, 101, 101, {}, "NITF02.10", 64)));
    EXPECT_EQ(rewriteIgeolo(again.path(), false), igeolo) << "written at the actual size";
}

TEST(GeorefInfo, WritingRefusesWhatItCannotWrite) {
    CNitfGeorefInfo georef;
    georef.setCoordinateType('N', eNitfVersion21);
    ByteStream stream(std::string(100, ' '));
    ProjInfo_t record;
    InitProjInfo(&record);
    EXPECT_THROW(georef.write(stream, &record, 10, 10), vexo::Exception) << "no georeferencing";
    DecodeGeosys(&record, "GEO");
    const double x[4] = {10, 11, 11, 10}, south[4] = {1, 1, -1, -1};
    ASSERT_EQ(ProjSetGeoreferenceFromCorners(&record, x, south, 10, 10), 0);
    EXPECT_THROW(georef.write(stream, &record, 10, 10), vexo::Exception) << "UTM north below the equator";
    georef.setCoordinateType('P', eNitfVersion21);
    EXPECT_THROW(georef.write(stream, &record, 10, 10), vexo::Exception);

    EXPECT_EQ(CNitfGeorefInfo::chooseIcords(&record, eNitfVersion21), 'G');
    ProjInfo_t utm;
    InitProjInfo(&utm);
    DecodeGeosys(&utm, "UTM 32S");
    const double e[4] = {793327, 794327, 794327, 793327}, n[4] = {10000500, 10000500, 9999500, 9999500};
    ASSERT_EQ(ProjSetGeoreferenceFromCorners(&utm, e, n, 10, 10), 0);
    EXPECT_EQ(CNitfGeorefInfo::chooseIcords(&utm, eNitfVersion21), 'N') << "the northernmost corner decides";
    const double s[4] = {8155361, 8155361, 8154361, 8154361};
    ASSERT_EQ(ProjSetGeoreferenceFromCorners(&utm, e, s, 10, 10), 0);
    EXPECT_EQ(CNitfGeorefInfo::chooseIcords(&utm, eNitfVersion21), 'S');
    EXPECT_EQ(CNitfGeorefInfo::chooseIcords(nullptr, eNitfVersion20), 'N');
}

// (The model itself, with and without its chip, is checked with the GeoTIFF RPC tag.)
TEST(GeorefInfo, SensorModelOnlyFromWholeRpcData) {
    CapturedWarnings warnings;
    OpenedSample cut(georeferencedFile(0, "", 100, 100, {{"RPC00B", sampleRpc00b().substr(0, 500)}}));
    OpenedSample without(georeferencedFile(0, ""));
    for (OpenedSample* file : {&cut, &without}) {
        CNitfImageSubheader* subheader = file->source().getImageSubheader();
        EXPECT_EQ(subheader->getGeorefSource().getNewSensorModel(file->reader().getInputStream(), subheader),
                  nullptr);
    }
    EXPECT_EQ(warnings.count("the RPC model is not used"), 1);
}

// ---- the corpus -------------------------------------------------------------------------------------------

namespace {

struct CorpusImage {
    std::string relative, path;
    int index;
    std::string icords, igeolo;
    std::vector<std::string> tres;
};

std::vector<CorpusImage> corpusImagesWithIgeolo() {
    std::vector<CorpusImage> images;
    for (const CorpusFile& file : Manifest::get().wellFormed()) {
        const nlohmann::json& entry = *file.entry;
        if (!entry.contains("images") || !entry["images"].is_array())
            continue;
        for (const nlohmann::json& image : entry["images"]) {
            if (!image.contains("IGEOLO") || !image["IGEOLO"].is_string())
                continue;
            CorpusImage found{file.relative,
                              file.path,
                              image.at("index").get<int>(),
                              image.at("ICORDS").get<std::string>(),
                              image["IGEOLO"].get<std::string>(),
                              {}};
            if (image.contains("tres"))
                for (const nlohmann::json& tre : image["tres"])
                    found.tres.push_back(tre.at("tag").get<std::string>());
            images.push_back(found);
        }
    }
    return images;
}

// The sub-header of a corpus image (whatever its compression) and its georeferencing read into `record`.
std::unique_ptr<CNitfImageSubheader> readCorpusRecord(CNitfFileReader& reader, const CorpusImage& image,
                                                      bool precise, ProjInfo_t* record) {
    std::unique_ptr<CNitfImageSubheader> subheader(
        reader.getFileHeader()->getNewImageSubheader(reader.getInputStream(), image.index));
    PropertyMap& fields = subheader->getProperties();
    subheader->getGeorefSource().read(reader.getInputStream(), subheader.get(), record,
                                      FindProperty(fields, "NCOLS")->getAsInt(),
                                      FindProperty(fields, "NROWS")->getAsInt(), precise);
    return subheader;
}

} // namespace

TEST(GeorefCorpus, IgeoloCornersMatchTheWorkedExamplesAndWriteBack) {
    const std::vector<CorpusImage> images = corpusImagesWithIgeolo();
    if (images.empty())
        GTEST_SKIP() << "no test corpus";
    struct Fact {
        const char* file;
        int corner;
        double latitude, longitude;
    };
    const Fact facts[] = {{"nitf20/U_3050B.NTF", 0, -16.666111, 11.750000},
                          {"nitf20/U_3050B.NTF", 2, -20.000000, 12.990000},
                          {"jpeg2000/p0_13xa.ntf", 0, 34.370624, -83.902537},
                          {"jpeg2000/p0_13xa.ntf", 2, 34.354086, -83.881424},
                          {"misc/autzen-utm10.ntf", 0, 44.062222, -123.074722},
                          {"misc/20091021203850-01001116-VIS.ntf.r2", 0, 39.804, -84.146}};
    int checkedFacts = 0;
    for (const CorpusImage& image : images) {
        SCOPED_TRACE(image.relative + " image " + std::to_string(image.index));
        TempFile copy(readWholeFile(image.path));
        CNitfFileReader reader;
        ASSERT_TRUE(reader.open(copy.path().c_str(), "r+b"));
        ProjInfo_t record;
        auto subheader = readCorpusRecord(reader, image, false, &record);
        ASSERT_EQ(record.hasCorners, 1);
        EXPECT_EQ(subheader->getGeorefSource().getCornerSource(), CNitfGeorefInfo::eCornerSourceIgeolo);
        EXPECT_EQ(record.width, FindProperty(subheader->getProperties(), "NCOLS")->getAsInt());
        for (const Fact& fact : facts) {
            if (image.relative != fact.file)
                continue;
            double latitude, longitude;
            cornerDegrees(record, fact.corner, &latitude, &longitude);
            EXPECT_NEAR(latitude, fact.latitude, 1.5e-6) << "corner " << fact.corner + 1;
            EXPECT_NEAR(longitude, fact.longitude, 1.5e-6) << "corner " << fact.corner + 1;
            ++checkedFacts;
        }
        EXPECT_EQ(record.system, image.icords == "N" ? PROJ_UTM : PROJ_GEOGRAPHIC);

        // Written back at the actual size, the corners that were read reproduce IGEOLO.
        CNitfGeorefInfo& georef = subheader->getGeorefSource();
        FILE* fp = reader.getInputStream();
        DKFSeek64(fp, georef.getIgeoloOffset(), SEEK_SET);
        DKFWrite(std::string(60, ' ').data(), 1, 60, fp);
        georef.write(fp, &record, record.width, record.height);
        char text[60];
        DKFSeek64(fp, georef.getIgeoloOffset(), SEEK_SET);
        ASSERT_EQ(DKFRead(text, 1, 60, fp), 60u);
        EXPECT_EQ(std::string(text, 60), image.igeolo);
    }
    EXPECT_EQ(checkedFacts, 6);
}

TEST(GeorefCorpus, PreciseCornersAgreeWithIgeoloWithinItsPrecision) {
    const std::vector<CorpusImage> images = corpusImagesWithIgeolo();
    if (images.empty())
        GTEST_SKIP() << "no test corpus";
    CapturedWarnings warnings;
    int blocka = 0, geolob = 0, coverage = 0;
    for (const CorpusImage& image : images) {
        SCOPED_TRACE(image.relative);
        CNitfFileReader reader;
        ASSERT_TRUE(reader.open(image.path.c_str()));
        ProjInfo_t igeolo, precise;
        readCorpusRecord(reader, image, false, &igeolo);
        const CNitfGeorefInfo::eCornerSource_t used =
            readCorpusRecord(reader, image, true, &precise)->getGeorefSource().getCornerSource();
        auto has = [&](const char* tag) {
            for (const std::string& t : image.tres)
                if (t == tag)
                    return true;
            return false;
        };
        if (image.relative == "nsif/fake_nsif.ntf" || image.relative == "misc/TimeStep103498.ntf.r5") {
            // BLOCKA of 1000 rows on an image of 30; BLOCKA starting at another corner than IGEOLO.
            EXPECT_EQ(used, CNitfGeorefInfo::eCornerSourceIgeolo);
            continue;
        }
        if (has("RPFIMG")) {
            // The coverage section of an RPF frame.
            EXPECT_EQ(used, CNitfGeorefInfo::eCornerSourceRpfCoverage);
            ++coverage;
        } else if (has("GEOLOB")) {
            EXPECT_EQ(used, CNitfGeorefInfo::eCornerSourceGeolob);
            ++geolob;
        } else if (has("BLOCKA")) {
            EXPECT_EQ(used, CNitfGeorefInfo::eCornerSourceBlocka);
            ++blocka;
        } else {
            EXPECT_EQ(used, CNitfGeorefInfo::eCornerSourceIgeolo);
            continue;
        }
        // Within IGEOLO's last digit (a second, or a thousandth of a degree), and half a pixel for a GEOLOB
        // grid whose producer gave IGEOLO the outer edges of the corner pixels.
        const double unit = image.icords == "D" ? 0.001 : 1 / 3600.0;
        const double halfPixel =
            has("GEOLOB") ? std::fabs(precise.affine[1]) / 2 + std::fabs(precise.affine[5]) / 2 : 0;
        for (int i = 0; i < 4; ++i) {
            EXPECT_NEAR(precise.cornerY[i], igeolo.cornerY[i], unit + halfPixel) << "corner " << i + 1;
            EXPECT_NEAR(precise.cornerX[i], igeolo.cornerX[i], unit + halfPixel) << "corner " << i + 1;
        }
        if (image.relative == "misc/GHSarNITF21_good.ntf") {
            // FRFC of its BLOCKA.
            EXPECT_DOUBLE_EQ(precise.cornerY[0], 39.227486);
            EXPECT_DOUBLE_EQ(precise.cornerX[0], -118.307983);
        }
        if (image.relative == "misc/autzen-utm10.ntf") {
            EXPECT_NEAR(precise.cornerX[0], -123.0749837910 + 180.0 / 22060370, 1e-12);
            EXPECT_NEAR(precise.cornerY[0], 44.0622542218 - 180.0 / 30590149, 1e-12);
        }
    }
    EXPECT_EQ(blocka, 4);
    EXPECT_EQ(geolob, 5);
    EXPECT_EQ(coverage, 4);
}
