// Image segments as GeoTIFFs: the georeferencing report, the RPC tag with a chip folded in, synthetic NITF
// images of every kind and the corpus's decodable images read back by GDAL, and nitf extract -f tiff.
#include <gtest/gtest.h>

#include <cstring>
#include <memory>
#include <string>
#include <vector>

#include "GdalOracle.h"
#include "GeorefReport.h"
#include "HostError.h"
#include "Canonical.h"
#include "NitfRegionReader.h"
#include "Manifest.h"
#include "NitfFileReader.h"
#include "NitfGeoTiff.h"
#include "NitfImageSource.h"
#include "NitfImageSubheader.h"
#include "NitfSampleWriter.h"
#include "NitfTestFile.h"
#include "Sha256.h"
#include "TestFiles.h"
#include "TreBytes.h"

using namespace nitfpicture;

namespace {

const std::string kRectangleG = "200000N0200000W200000N0200000E200000S0200000E200000S0200000W";

nitfsample::Image imageWith(char icords, const std::string& igeolo, int rows, int cols,
                            std::vector<nitfsample::Tre> tres = {}) {
    nitfsample::Image image;
    image.rows = rows;
    image.cols = cols;
    image.icords = icords;
    image.igeolo = igeolo;
    image.udid = std::move(tres);
    return image;
}

nitfgeoref::Summary summaryOf(OpenedSample& sample, int index = 0) {
    std::unique_ptr<CNitfImageSource> image(sample.reader().getNewImageSource(index));
    return nitfgeoref::summarize(sample.reader().getInputStream(), image->getImageSubheader());
}

// The model of a file's image 0 (RPC00B, with the TREs given).
CRpcSource modelOf(std::vector<nitfsample::Tre> tres) {
    nitfsample::File file;
    file.images.push_back(imageWith(0, "", 100, 100, std::move(tres)));
    OpenedSample sample(file);
    std::unique_ptr<CNitfImageSource> image(sample.reader().getNewImageSource(0));
    CNitfImageSubheader* subheader = image->getImageSubheader();
    std::unique_ptr<CRpcSource> model(
        subheader->getGeorefSource().getNewSensorModel(sample.reader().getInputStream(), subheader));
    EXPECT_TRUE(model);
    return model ? *model : CRpcSource();
}

std::string asLines(const std::vector<std::string>& lines) {
    std::string text;
    for (const std::string& line : lines)
        text += line + "\n";
    return text;
}

} // namespace

TEST(GeorefReport, TextAndJsonOfEachKindOfImage) {
    nitfsample::File file;
    file.images.push_back(
        imageWith('G', kRectangleG, 101, 201, {{"ICHIPB", sampleIchipb()}, {"RPC00B", sampleRpc00b()}}));
    file.images.push_back(
        imageWith('N', "172330853807070172349753807070172349753805180172330853805180", 50, 60));
    file.images.push_back(
        imageWith('D', "+10.000+020.000+10.000+021.000+09.000+021.500+09.000+020.000", 10, 10));
    file.images.push_back(imageWith(0, "", 10, 10));
    OpenedSample sample(file);

    const nitfgeoref::Summary g = summaryOf(sample, 0);
    EXPECT_TRUE(g.axisAligned);
    const double gt[6] = {-20.1, 0.2, 0, 20.2, 0, -0.4};
    for (int i = 0; i < 6; ++i)
        EXPECT_NEAR(g.geotransform[i], gt[i], 1e-12) << i;
    const nlohmann::json json = nitfgeoref::reportJson(g);
    EXPECT_EQ(json["corner_source"], "IGEOLO");
    EXPECT_EQ(json["corners"][1]["column"], 200);
    EXPECT_EQ(json["corners"][1]["latitude"], 20.0);
    EXPECT_EQ(json["sensor_model"], nlohmann::json({{"type", "RPC00B"}, {"valid", true}, {"chip", true}}));
    const nitfgeoref::Summary n = summaryOf(sample, 1);
    EXPECT_EQ(nitfgeoref::reportJson(n)["projection"]["zone"], 17);
    const nitfgeoref::Summary skew = summaryOf(sample, 2);
    EXPECT_FALSE(skew.axisAligned);
    EXPECT_EQ(nitfgeoref::reportJson(skew)["projection"]["tie_points"], true);
    const nitfgeoref::Summary none = summaryOf(sample, 3);
    EXPECT_EQ(nitfgeoref::reportJson(none), nlohmann::json({{"icords", " "}, {"coordinate_type", "none"}}));

    // The text says the same for people.
    const std::string text = asLines(nitfgeoref::reportLines(g)) + asLines(nitfgeoref::reportLines(n)) +
                             asLines(nitfgeoref::reportLines(skew)) + asLines(nitfgeoref::reportLines(none));
    for (const char* line :
         {"Coordinates: ICORDS \"G\" (geographic), corners from IGEOLO\n",
          "corner 3 (last row, last column, row 100, column 200): -20.00000000, +20.00000000\n",
          "geotransform: origin -20.1, 20.2; pixel 0.2 x -0.4; rotation 0, 0\n",
          "Sensor model: RPC00B, through ICHIPB\n", "(E 233085.000, N 3807070.000)",
          "Projection: UTM 17N on WGS 84", "tie points: the four corners", "Coordinates: none"})
        EXPECT_NE(text.find(line), std::string::npos) << line << "\n" << text;
}

TEST(NitfGeoTiff, RpcTagInTheImagesPixels) {
    std::vector<std::string> notes;
    // The chip (full = 100 + 2 chip in rows, 200 + 2 chip in columns) folds into offsets and scales: the tag
    // puts 45.1 N 10.1 E where the chipped model does, at line -50, sample 400.
    const CRpcSource chipped = modelOf({{"ICHIPB", sampleIchipb()}, {"RPC00B", sampleRpc00b()}});
    std::vector<double> tag = rpcTagOf(chipped, notes);
    ASSERT_EQ(tag.size(), 92u);
    EXPECT_EQ(tag[0], 1.0);
    EXPECT_EQ(tag[1], 0.5);
    EXPECT_NEAR(tag[2], 200, 1e-9);
    EXPECT_NEAR(tag[3], 150, 1e-9);
    EXPECT_NEAR(tag[7], 250, 1e-9);
    EXPECT_NEAR(tag[8], 250, 1e-9);
    EXPECT_EQ(tag[12 + 2], -1.0) << "line numerator, term P";
    EXPECT_EQ(tag[52 + 1], 1.0) << "sample numerator, term L";
    double line, sampleAt;
    ASSERT_TRUE(chipped.groundToImage(45.1, 10.1, 0, &line, &sampleAt));
    EXPECT_NEAR(tag[2] + tag[7] * -1.0, line, 1e-9);
    EXPECT_NEAR(tag[3] + tag[8] * 1.0, sampleAt, 1e-9);
    const CRpcSource plain = modelOf({{"RPC00B", sampleRpc00b()}});
    tag = rpcTagOf(plain, notes);
    ASSERT_EQ(tag.size(), 92u);
    EXPECT_EQ(tag[2], 500);
    EXPECT_TRUE(notes.empty());

    // A model its producer did not declare valid, and a chip turned against its image, are left out.
    std::string invalid = sampleRpc00b();
    invalid[0] = '0';
    EXPECT_TRUE(rpcTagOf(modelOf({{"RPC00B", invalid}}), notes).empty());
    std::string turned = sampleIchipb();
    // Swap the full-image row and column of grid point 12: the chip's columns run down the full image.
    turned.replace(16 + 8 * 12 + 2 * 12, 24,
                   turned.substr(16 + 8 * 12 + 2 * 12 + 12, 12) + turned.substr(16 + 8 * 12 + 2 * 12, 12));
    const CRpcSource rotated = modelOf({{"ICHIPB", turned}, {"RPC00B", sampleRpc00b()}});
    ASSERT_TRUE(rotated.hasChip());
    EXPECT_TRUE(rpcTagOf(rotated, notes).empty());
    ASSERT_EQ(notes.size(), 2u);
    EXPECT_NE(notes[1].find("rotated"), std::string::npos) << notes[1];
}

namespace {

uint64_t bitsOf(float value) {
    uint32_t bits;
    std::memcpy(&bits, &value, 4);
    return bits;
}

// One band of the sample writer's image in canonical form, hashed.
std::string canonicalSha(const nitfsample::Image& image, int band) {
    return Sha256::of(nitfsample::canonicalBand(image, band));
}

} // namespace

TEST(NitfGeoTiff, SyntheticImagesOfEveryKindReadBackThroughGdal) {
    nitfsample::File file;
    // A colour-mapped band with corners and an RPC model on a chip.
    nitfsample::Image lut =
        imageWith('G', kRectangleG, 40, 50, {{"ICHIPB", sampleIchipb()}, {"RPC00B", sampleRpc00b()}});
    lut.irep = "RGB/LUT";
    lut.bandInfo.resize(1);
    lut.bandInfo[0].irepband = "LU";
    lut.bandInfo[0].luts = {std::string("\x10\x20\x30\x40", 4), std::string("\x11\x21\x31\x41", 4),
                            std::string("\x12\x22\x32\x42", 4)};
    lut.sample = [](int, int row, int col) { return static_cast<uint64_t>((row + col) % 4); };
    file.images.push_back(lut);
    // A masked image with a pad value and an absent block, on UTM corners that are not a rectangle.
    nitfsample::Image masked =
        imageWith('N', "172330853807070172349753807170172348753805180172330853805280", 64, 64);
    masked.ic = "NM";
    masked.nppbh = masked.nppbv = 32;
    masked.absentBlocks = {3};
    masked.padCodeBits = 8;
    masked.padValue = 7;
    file.images.push_back(masked);
    // 32-bit reals pixel-interleaved, complex. (Signed samples are written with every sample type.)
    nitfsample::Image reals = imageWith(0, "", 17, 19);
    reals.bands = 2;
    reals.nbpp = 32;
    reals.pvtype = "R";
    reals.imode = 'P';
    reals.irep = "MULTI";
    reals.sample = [](int band, int row, int col) { return bitsOf(band * 100.5f + row * 0.25f - col); };
    file.images.push_back(reals);
    nitfsample::Image complex = imageWith(0, "", 9, 13);
    complex.nbpp = 64;
    complex.pvtype = "C";
    complex.sample = [](int, int row, int col) { return bitsOf(row * 1.5f) << 32 | bitsOf(-col * 0.75f); };
    file.images.push_back(complex);
    OpenedSample sample(file);

    std::vector<std::unique_ptr<TempFile>> outputs;
    std::vector<std::string> paths;
    for (int i = 0; i < static_cast<int>(file.images.size()); ++i) {
        SCOPED_TRACE("image " + std::to_string(i));
        std::unique_ptr<CNitfImageSource> image(sample.reader().getNewImageSource(i));
        outputs.push_back(std::make_unique<TempFile>("", ".tif"));
        TiffOptions options;
        options.cog = i % 2 == 0;
        std::vector<std::string> notes;
        ASSERT_NO_THROW(notes =
                            writeImageGeoTiff(sample.reader(), *image, {}, outputs.back()->path(), options));
        EXPECT_TRUE(notes.empty()) << notes.front();
        paths.push_back(outputs.back()->path());
    }
    GDAL_VIEW(view, paths);
    const char* types[] = {"Byte", "Byte", "Float32", "CFloat32"};
    for (size_t i = 0; i < paths.size(); ++i) {
        SCOPED_TRACE("image " + std::to_string(i));
        const nlohmann::json& tif = (*view)[i];
        const nitfsample::Image& image = file.images[i];
        EXPECT_EQ(tif["width"], image.cols);
        EXPECT_EQ(tif["height"], image.rows);
        ASSERT_EQ(tif["bands"].size(), static_cast<size_t>(image.bands));
        for (int b = 0; b < image.bands; ++b) {
            EXPECT_EQ(tif["bands"][b]["type"], types[i]);
            EXPECT_EQ(tif["bands"][b]["sha256_be"], canonicalSha(image, b)) << "band " << b;
        }
        if (i % 2 == 0) {
            EXPECT_EQ(tif["cog_errors"], nlohmann::json::array());
        }
    }
    // Colour map, corners as a geotransform, the RPC model in the chip's pixels.
    const nlohmann::json& first = (*view)[0];
    EXPECT_EQ(first["bands"][0]["colours"][1], nlohmann::json::array({0x20, 0x21, 0x22}));
    EXPECT_EQ(first["bands"][0]["colours"][4], nlohmann::json::array({0, 0, 0}));
    EXPECT_EQ(first["epsg"], 4326);
    EXPECT_NEAR(first["geotransform"][0].get<double>(), -20 - 20.0 / 49, 1e-9);
    EXPECT_NEAR(std::stod(first["rpc"]["LINE_OFF"].get<std::string>()), 200, 1e-6);
    // Pad value as no-data, tie points in UTM 17N.
    const nlohmann::json& second = (*view)[1];
    EXPECT_EQ(second["bands"][0]["nodata"], 7);
    EXPECT_EQ(second["gcp_epsg"], 32617);
    ASSERT_EQ(second["gcps"].size(), 4u);
    EXPECT_EQ(second["gcps"][1], nlohmann::json::array({63.5, 0.5, 234975.0, 3807170.0}));
    EXPECT_TRUE((*view)[2]["geotransform"].is_null());
}

TEST(NitfGeoTiff, ExtractCommandWritesCogFiles) {
    TempFile input(nitfsample::build(nitfsample::defaultSample()));
    TempFile output("", ".tif");
    ASSERT_EQ(
        runTool("extract '" + input.path() + "' -f tiff --cog --compress zstd -o '" + output.path() + "'"),
        0);
    EXPECT_EQ(output.read().substr(0, 4), std::string("II*\0", 4));
    for (const char* bad : {" -f png --cog -o x.png", " -f tiff --compress lzw -o x.tif", " -f tiff -o -"})
        EXPECT_EQ(runTool("extract '" + input.path() + "'" + bad), 2) << bad;
    GDAL_VIEW(view, {output.path()});
    EXPECT_EQ((*view)[0]["cog_errors"], nlohmann::json::array());
    EXPECT_EQ((*view)[0]["width"], 256);
    EXPECT_EQ((*view)[0]["epsg"], 4326);
}

TEST(GeoTiffCorpus, DecodedImagesOpenInGdalWithTheirPixelsAndCorners) {
    SKIP_WITHOUT_CORPUS();
    const Manifest& manifest = Manifest::get();
    struct Written {
        std::string name;
        std::vector<std::string> shas;
        nitfgeoref::Summary summary;
    };
    std::vector<Written> written;
    std::vector<std::unique_ptr<TempFile>> outputs;
    std::vector<std::string> paths;
    CapturedWarnings quiet;
    for (const CorpusFile& file : manifest.wellFormed()) {
        const nlohmann::json& entry = *file.entry;
        if (!entry.contains("images") || !entry["images"].is_array())
            continue;
        for (const nlohmann::json& info : entry["images"]) {
            // Images up to 4 Mpixels that the library decodes.
            if (info.value("NROWS", 0LL) * info.value("NCOLS", 0LL) > (4LL << 20))
                continue;
            const int index = info.at("index").get<int>();
            CNitfFileReader reader;
            if (!reader.open(file.path.c_str()))
                continue;
            std::unique_ptr<CNitfImageSource> image;
            try {
                image.reset(reader.getNewImageSource(index));
                CNitfRegionReader region(&reader, image.get());
                const CNitfRegionReader::eSampleType_t type = region.getSampleType();
                if (type == CNitfRegionReader::eComplexFloat64)
                    continue;
            } catch (const std::exception&) {
                continue;
            }
            const std::string name = file.relative + " image " + std::to_string(index);
            SCOPED_TRACE(name);
            Written w{name, {}, nitfgeoref::summarize(reader.getInputStream(), image->getImageSubheader())};
            outputs.push_back(std::make_unique<TempFile>("", ".tif"));
            TiffOptions options;
            options.cog = true;
            try {
                writeImageGeoTiff(reader, *image, {}, outputs.back()->path(), options);
            } catch (const std::exception& e) {
                outputs.pop_back(); // blocks that cannot be read (a file cut short)
                continue;
            }
            for (int b = 0; b < image->getImageProperties().getBandCount(); ++b)
                w.shas.push_back(Sha256::of(canonicalBand(reader, *image, b)));
            written.push_back(w);
            paths.push_back(outputs.back()->path());
        }
    }
    ASSERT_GT(written.size(), 40u);
    GDAL_VIEW(view, paths);
    int georeferenced = 0;
    for (size_t i = 0; i < written.size(); ++i) {
        SCOPED_TRACE(written[i].name);
        const nlohmann::json& tif = (*view)[i];
        EXPECT_EQ(tif["cog_errors"], nlohmann::json::array());
        ASSERT_EQ(tif["bands"].size(), written[i].shas.size());
        for (size_t b = 0; b < written[i].shas.size(); ++b)
            EXPECT_EQ(tif["bands"][b]["sha256_be"], written[i].shas[b]) << "band " << b;
        const nitfgeoref::Summary& summary = written[i].summary;
        if (!summary.hasCorners())
            continue;
        ++georeferenced;
        if (summary.axisAligned) {
            for (int k = 0; k < 6; ++k)
                EXPECT_NEAR(tif["geotransform"][k].get<double>(), summary.geotransform[k], 1e-9) << k;
        } else {
            ASSERT_EQ(tif["gcps"].size(), 4u);
            for (int k = 0; k < 4; ++k) {
                EXPECT_EQ(tif["gcps"][k][2].get<double>(), summary.record.cornerX[k]);
                EXPECT_EQ(tif["gcps"][k][3].get<double>(), summary.record.cornerY[k]);
            }
        }
    }
    EXPECT_GT(georeferenced, 5);
}
