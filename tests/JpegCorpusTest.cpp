// Every JPEG-compressed image of the conformance corpus decodes, to the manifest's pixel hashes where it has
// them: the reference decoder uses the same libjpeg-turbo IDCT, and the library's rules (default tables as
// listed, absent blocks as zeros, YCbCr delivered as RGB) agree with it on every such image.
#include <gtest/gtest.h>

#include <cmath>
#include <iostream>
#include <memory>
#include <set>
#include <string>

#include "HostError.h"
#include "Canonical.h"
#include "Manifest.h"
#include "NitfFileReader.h"
#include "NitfImageSource.h"
#include "Sha256.h"

namespace {

double standardDeviation(const std::string& samples) {
    double sum = 0, squares = 0;
    for (unsigned char sample : samples) {
        sum += sample;
        squares += double(sample) * sample;
    }
    const double mean = sum / samples.size();
    return std::sqrt(squares / samples.size() - mean * mean);
}

} // namespace

TEST(JpegCorpus, EveryJpegImageDecodes) {
    SKIP_WITHOUT_CORPUS();
    const Manifest& manifest = Manifest::get();
    const std::set<std::string> codes = {"C3", "M3", "C5", "M5", "I1"};
    int images = 0, exact = 0;
    for (const CorpusFile& corpusFile : manifest.wellFormed()) {
        for (const nlohmann::json& image : corpusFile.entry->value("images", nlohmann::json::array())) {
            if (!codes.count(image.value("IC", "")))
                continue;
            const int index = image.at("index").get<int>();
            const std::string name = corpusFile.relative + " image " + std::to_string(index);
            SCOPED_TRACE(name);
            CNitfFileReader reader;
            ASSERT_TRUE(reader.open(corpusFile.path.c_str()));
            std::unique_ptr<CNitfImageSource> source;
            try {
                source.reset(reader.getNewImageSource(index));
            } catch (const vexo::Exception& e) {
                EXPECT_EQ(image.at("data_length").get<long long>(), 0)
                    << "only an image without data is refused";
                continue;
            }
            ++images;
            const CanonicalImage bands = canonicalImage(corpusFile.path, index);
            const nlohmann::json& oracle = image.at("oracle");
            bool allExact = true;
            for (size_t band = 0; band < bands.bands.size(); ++band) {
                const std::string& samples = bands.bands[band];
                if (oracle.value("decoded", false)) {
                    EXPECT_EQ(Sha256::of(samples), oracle.at("bands").at(band).at("sha256"))
                        << "band " << band;
                    allExact = allExact && Sha256::of(samples) == oracle["bands"][band]["sha256"];
                } else {
                    // No reference pixels (i_3113g: I1, which the reference decoder cannot read): the
                    // enlarged picture must still be a picture.
                    EXPECT_GT(standardDeviation(samples), 20.0);
                    allExact = false;
                }
            }
            EXPECT_EQ(bands.failedBlocks, 0) << bands.firstError;
            EXPECT_EQ(bands.absentBlocks,
                      (image.contains("mask") ? image["mask"].value("absent_blocks", 0) : 0) *
                          static_cast<int>(bands.bands.size()));
            exact += allExact ? 1 : 0;
            std::cout << (allExact ? "  exact      " : "  no oracle  ") << name << "\n";
        }
    }
    EXPECT_GE(images, 14);
    std::cout << exact << " of " << images << " JPEG images match the manifest exactly\n";
}
