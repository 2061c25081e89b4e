// The JPEG 2000 images of the conformance corpus that are not decoded exactly (those are checked with the
// other exactly decoded images) decode through the JPEG 2000 source, block by block: where the reference
// keeps negative samples on a second route, bit for bit; elsewhere (lossy codestreams, where decoders may
// round differently) their statistics match within a tolerance.
#include <gtest/gtest.h>

#include <cmath>
#include <cstdlib>
#include <iostream>
#include <map>
#include <memory>
#include <string>

#include "HostError.h"
#include "Manifest.h"
#include "NitfFileReader.h"
#include "NitfImageSourceJpeg2000.h"
#include "Sha256.h"
#include "TestFiles.h"
#include "WholeSamples.h"

namespace {

using wholesamples::Stats;

// Lossy decoders differ by a few counts in a few samples: the statistics of a band move by far less than a
// count. The allowance grows with the samples' range (12-bit and 16-bit images).
void expectClose(const Stats& ours, const nlohmann::json& reference, const std::string& what) {
    const double range = std::max(1.0, reference.at("max").get<double>() - reference.at("min").get<double>());
    const double allowance = 0.5 + 0.005 * range;
    EXPECT_NEAR(ours.mean, reference.at("mean").get<double>(), allowance) << what;
    EXPECT_NEAR(ours.stddev, reference.at("stddev").get<double>(), allowance) << what;
    EXPECT_NEAR(ours.min, reference.at("min").get<double>(), 4 * allowance) << what;
    EXPECT_NEAR(ours.max, reference.at("max").get<double>(), 4 * allowance) << what;
}

// The samples the reference gives for a YCbCr image it converted to RGB (the JP2 colour box says sYCC): the
// same conversion applied to the Y, Cb, Cr bands the library delivers, for comparison with the reference.
std::vector<std::vector<int32_t>> ycbcrToRgb(const wholesamples::Image& image) {
    std::vector<std::vector<int32_t>> rgb(3, std::vector<int32_t>(image.bands[0].size()));
    auto clamp = [](double v) {
        return static_cast<int32_t>(std::lround(std::min(255.0, std::max(0.0, v))));
    };
    for (size_t i = 0; i < image.bands[0].size(); ++i) {
        const double y = image.bands[0][i], cb = image.bands[1][i] - 128.0, cr = image.bands[2][i] - 128.0;
        rgb[0][i] = clamp(y + 1.402 * cr);
        rgb[1][i] = clamp(y - 0.344136 * cb - 0.714136 * cr);
        rgb[2][i] = clamp(y + 1.772 * cb);
    }
    return rgb;
}

} // namespace

TEST(Jpeg2000Corpus, EveryJpeg2000ImageDecodes) {
    SKIP_WITHOUT_CORPUS();
    const Manifest& manifest = Manifest::get();
    std::map<std::string, int> verdicts;
    for (const CorpusFile& corpusFile : manifest.files()) {
        for (const nlohmann::json& image : corpusFile.entry->value("images", nlohmann::json::array())) {
            const std::string ic = image.value("IC", "");
            if ((ic != "C8" && ic != "M8") || image.at("oracle").value("exact", false))
                continue;
            const int index = image.at("index").get<int>();
            SCOPED_TRACE(corpusFile.relative + " image " + std::to_string(index));
            CNitfFileReader reader;
            ASSERT_TRUE(reader.open(corpusFile.path.c_str()));
            std::unique_ptr<CNitfImageSource> source;
            ASSERT_NO_THROW(source.reset(reader.getNewImageSource(index)));
            ASSERT_NE(dynamic_cast<CNitfImageSourceJpeg2000*>(source.get()), nullptr);
            wholesamples::Image decoded;
            ASSERT_NO_THROW(decoded = wholesamples::readBlocks(reader, *source));

            const nlohmann::json& oracle = image.at("oracle");
            const int bytes = (image.at("NBPP").get<int>() + 7) / 8;
            const int bands = static_cast<int>(decoded.bands.size());
            if (oracle.value("decoded", false) != true) {
                // No reference pixels: the reference decoder cannot open these (sub-sampled components, image
                // and tile offsets). They must still decode to a picture.
                for (int band = 0; band < bands; ++band)
                    EXPECT_GT(wholesamples::statsOf(decoded.bands[size_t(band)]).stddev, 1.0)
                        << "band " << band;
                ++verdicts["without reference pixels"];
            } else if (oracle.contains("alt")) {
                // The reference clamps negative samples; its second route keeps them, as the library does.
                for (int band = 0; band < bands; ++band)
                    EXPECT_EQ(Sha256::of(wholesamples::canonical(decoded, band, bytes)),
                              oracle.at("alt").at(0).at("sha256").at(band))
                        << "band " << band;
                ++verdicts["exact"];
            } else if (oracle.contains("conversion") &&
                       oracle.value("conversion", "").rfind("none", 0) != 0) {
                const auto rgb = ycbcrToRgb(decoded);
                for (int band = 0; band < 3; ++band)
                    expectClose(wholesamples::statsOf(rgb[size_t(band)]), oracle.at("bands").at(band),
                                "band " + std::to_string(band) + " as RGB");
                ++verdicts["within tolerance as RGB"];
            } else {
                for (int band = 0; band < bands; ++band)
                    expectClose(wholesamples::statsOf(decoded.bands[size_t(band)]),
                                oracle.at("bands").at(band), "band " + std::to_string(band));
                ++verdicts["within tolerance"];
            }
        }
    }
    int images = 0;
    for (const auto& [verdict, count] : verdicts) {
        std::cout << count << " " << verdict << "\n";
        images += count;
    }
    EXPECT_GE(images, 20);
}

namespace {

// One component as the OpenJPEG command-line decoder writes it (PGX: a text header, then big-endian samples).
struct Pgx {
    int width = 0, height = 0;
    std::vector<int32_t> samples;
};

bool readPgx(const std::string& path, Pgx& pgx) {
    const std::string bytes = readWholeFile(path);
    const size_t end = bytes.find('\n');
    char order[3] = {}, sign = '+';
    int depth = 0;
    if (end == std::string::npos ||
        std::sscanf(bytes.c_str(), "PG %2s %c %d %d %d", order, &sign, &depth, &pgx.width, &pgx.height) != 5)
        return false;
    const int bytesPerSample = depth <= 8 ? 1 : 2;
    const unsigned char* data = reinterpret_cast<const unsigned char*>(bytes.data()) + end + 1;
    if (bytes.size() - end - 1 < size_t(pgx.width) * pgx.height * bytesPerSample)
        return false;
    for (int i = 0; i < pgx.width * pgx.height; ++i) {
        uint32_t v = bytesPerSample == 1 ? data[i] : (data[2 * i] << 8) | data[2 * i + 1];
        pgx.samples.push_back(sign == '-' ? (bytesPerSample == 1 ? int8_t(v) : int16_t(v)) : int32_t(v));
    }
    return true;
}

} // namespace

// The images the manifest has no pixels for (sub-sampled components, image and tile offsets, packed packet
// headers) against OpenJPEG's own command-line decoder, component by component: a band on the image grid is
// its component exactly; a sub-sampled component is replicated over the pixels its samples cover.
TEST(Jpeg2000Corpus, ImagesWithoutReferencePixelsMatchTheOpenJpegTool) {
    SKIP_WITHOUT_CORPUS();
    const Manifest& manifest = Manifest::get();
    if (!haveCommand("opj_decompress"))
        GTEST_SKIP() << "opj_decompress is not installed";
    int checked = 0;
    for (const CorpusFile& corpusFile : manifest.files()) {
        for (const nlohmann::json& image : corpusFile.entry->value("images", nlohmann::json::array())) {
            if (image.value("IC", "") != "C8" || image.at("oracle").value("decoded", false) == true)
                continue;
            SCOPED_TRACE(corpusFile.relative);
            const std::string file = readWholeFile(corpusFile.path);
            TempFile codestream(
                file.substr(image.at("data_offset").get<size_t>(), image.at("data_length").get<size_t>()),
                ".j2k");
            TempFile output("", ".pgx");
            const std::string command =
                "opj_decompress -i " + codestream.path() + " -o " + output.path() + " > /dev/null 2>&1";
            ASSERT_EQ(std::system(command.c_str()), 0) << command;

            CNitfFileReader reader;
            ASSERT_TRUE(reader.open(corpusFile.path.c_str()));
            std::unique_ptr<CNitfImageSourceJpeg2000> source(dynamic_cast<CNitfImageSourceJpeg2000*>(
                reader.getNewImageSource(image.at("index").get<int>())));
            ASSERT_TRUE(source);
            const int width = source->getLevelWidth(0), height = source->getLevelHeight(0);
            const nlohmann::json& j2k = image.at("j2k");
            const int bands = source->getImageProperties().getBandCount();
            std::vector<char> pixels(size_t(width) * height * bands);
            source->readRegion(&reader, 0, 0, 0, width, height, 0, bands, pixels.data(), width * bands);

            const std::string stem = output.path().substr(0, output.path().size() - 4);
            int gridDx = 255, gridDy = 255;
            for (const auto& s : j2k.at("component_subsampling")) {
                gridDx = std::min(gridDx, s.at(0).get<int>());
                gridDy = std::min(gridDy, s.at(1).get<int>());
            }
            const int originX = (j2k.at("image_offset").at(0).get<int>() + gridDx - 1) / gridDx;
            const int originY = (j2k.at("image_offset").at(1).get<int>() + gridDy - 1) / gridDy;
            for (int band = 0; band < bands; ++band) {
                Pgx component;
                const std::string path = stem + "_" + std::to_string(band) + ".pgx";
                ASSERT_TRUE(readPgx(path, component)) << path;
                std::remove(path.c_str());
                const int dx = j2k.at("component_subsampling").at(band).at(0).get<int>();
                const int dy = j2k.at("component_subsampling").at(band).at(1).get<int>();
                const int componentX = (j2k.at("image_offset").at(0).get<int>() + dx - 1) / dx;
                const int componentY = (j2k.at("image_offset").at(1).get<int>() + dy - 1) / dy;
                int mismatches = 0;
                for (int r = 0; r < height; ++r)
                    for (int c = 0; c < width; ++c) {
                        const int x = (originX + c) * gridDx / dx - componentX;
                        const int y = (originY + r) * gridDy / dy - componentY;
                        const int expected =
                            static_cast<uint8_t>(component.samples.at(size_t(y) * component.width + x));
                        mismatches +=
                            static_cast<uint8_t>(pixels[(size_t(r) * width + c) * bands + band]) != expected;
                    }
                EXPECT_EQ(mismatches, 0) << "band " << band;
            }
            ++checked;
        }
    }
    EXPECT_EQ(checked, 6);
}
