// Every JPEG 2000 image of the conformance corpus decodes through the JPEG 2000 source, block by block. Where
// the manifest's reference pixels are exact (numerically lossless codestreams), the samples match them bit
// for bit; elsewhere (lossy codestreams, where decoders may round differently) their statistics match within
// a tolerance. Set NITF_J2K_PICTURES to a directory to get a picture of every image there.
#include <gtest/gtest.h>

#include <cmath>
#include <cstdlib>
#include <iostream>
#include <memory>
#include <set>
#include <string>

#include "HostError.h"
#include "Manifest.h"
#include "NitfFileReader.h"
#include "NitfImageSourceJpeg2000.h"
#include "Sha256.h"
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

std::string statsText(const Stats& s) {
    char text[160];
    std::snprintf(text, sizeof text, "min %g max %g mean %.3f stddev %.3f", s.min, s.max, s.mean, s.stddev);
    return text;
}

} // namespace

TEST(Jpeg2000Corpus, EveryJpeg2000ImageDecodes) {
    const Manifest& manifest = Manifest::get();
    if (manifest.empty())
        GTEST_SKIP() << "no test corpus";
    const char* pictures = std::getenv("NITF_J2K_PICTURES");
    int images = 0, exact = 0, close = 0, unreferenced = 0;
    for (const CorpusFile& corpusFile : manifest.files()) {
        for (const nlohmann::json& image : corpusFile.entry->value("images", nlohmann::json::array())) {
            const std::string ic = image.value("IC", "");
            if (ic != "C8" && ic != "M8")
                continue;
            const int index = image.at("index").get<int>();
            const std::string name = corpusFile.relative + " image " + std::to_string(index);
            SCOPED_TRACE(name);
            CNitfFileReader reader;
            ASSERT_TRUE(reader.open(corpusFile.path.c_str()));
            std::unique_ptr<CNitfImageSource> source;
            ASSERT_NO_THROW(source.reset(reader.getNewImageSource(index)));
            ASSERT_NE(dynamic_cast<CNitfImageSourceJpeg2000*>(source.get()), nullptr);
            ++images;
            wholesamples::Image decoded;
            ASSERT_NO_THROW(decoded = wholesamples::readBlocks(reader, *source));
            if (pictures) {
                std::string stem = corpusFile.relative.substr(corpusFile.relative.find('/') + 1);
                wholesamples::writePicture(decoded, std::string(pictures) + "/" + stem + ".pnm");
            }

            const nlohmann::json& oracle = image.at("oracle");
            const int bytes = (image.at("NBPP").get<int>() + 7) / 8;
            const int bands = static_cast<int>(decoded.bands.size());
            std::string verdict;
            if (oracle.value("decoded", false) != true) {
                // No reference pixels: the reference decoder cannot open these (sub-sampled components, image
                // and tile offsets). They must still decode to a picture.
                for (int band = 0; band < bands; ++band)
                    EXPECT_GT(wholesamples::statsOf(decoded.bands[size_t(band)]).stddev, 1.0)
                        << "band " << band;
                verdict = "no oracle ";
                ++unreferenced;
            } else if (oracle.contains("alt")) {
                // The reference clamps negative samples; its second route keeps them, as the library does.
                for (int band = 0; band < bands; ++band)
                    EXPECT_EQ(Sha256::of(wholesamples::canonical(decoded, band, bytes)),
                              oracle.at("alt").at(0).at("sha256").at(band))
                        << "band " << band;
                verdict = "exact (alt)";
                ++exact;
            } else if (oracle.contains("conversion") &&
                       oracle.value("conversion", "").rfind("none", 0) != 0) {
                const auto rgb = ycbcrToRgb(decoded);
                for (int band = 0; band < 3; ++band)
                    expectClose(wholesamples::statsOf(rgb[size_t(band)]), oracle.at("bands").at(band),
                                "band " + std::to_string(band) + " as RGB");
                verdict = "close (RGB)";
                ++close;
            } else if (oracle.value("exact", false)) {
                for (int band = 0; band < bands; ++band)
                    EXPECT_EQ(Sha256::of(wholesamples::canonical(decoded, band, bytes)),
                              oracle.at("bands").at(band).at("sha256"))
                        << "band " << band;
                verdict = "exact      ";
                ++exact;
            } else {
                for (int band = 0; band < bands; ++band)
                    expectClose(wholesamples::statsOf(decoded.bands[size_t(band)]),
                                oracle.at("bands").at(band), "band " + std::to_string(band));
                verdict = "close      ";
                ++close;
            }
            std::cout << "  " << verdict << " " << name << ": "
                      << statsText(wholesamples::statsOf(decoded.bands[0])) << "\n";
        }
    }
    EXPECT_GE(images, 36);
    std::cout << images << " JPEG 2000 images: " << exact << " exact, " << close << " within tolerance, "
              << unreferenced << " without reference pixels\n";
}
