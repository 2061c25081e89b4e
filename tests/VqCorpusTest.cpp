// Every VQ-compressed image of the conformance corpus (CADRG frames, masked or not) decodes to the manifest's
// pixel hash, each block decoded by the library straight into its place in the whole image. (Their colour
// tables are checked with the frames' descriptions.)
#include <gtest/gtest.h>

#include <memory>
#include <set>
#include <string>
#include <vector>

#include "Manifest.h"
#include "NitfFileReader.h"
#include "NitfImageSourceVQ.h"
#include "Sha256.h"

namespace {

std::vector<CorpusFile> vqImages(std::vector<int>& indexes) {
    std::vector<CorpusFile> files;
    for (const CorpusFile& file : Manifest::get().wellFormed())
        for (const nlohmann::json& image : file.entry->value("images", nlohmann::json::array()))
            if (image.value("IC", "") == "C4" || image.value("IC", "") == "M4") {
                files.push_back(file);
                indexes.push_back(image.at("index").get<int>());
            }
    return files;
}

const nlohmann::json& imageEntry(const CorpusFile& file, int index) {
    for (const nlohmann::json& image : file.entry->at("images"))
        if (image.at("index").get<int>() == index)
            return image;
    throw std::runtime_error("no such image");
}

} // namespace

TEST(VqCorpus, EveryVqImageDecodesToTheManifestHash) {
    if (Manifest::get().empty())
        GTEST_SKIP() << "no test corpus";
    std::vector<int> indexes;
    const std::vector<CorpusFile> files = vqImages(indexes);
    ASSERT_GE(files.size(), 3u);
    int masked = 0;
    for (size_t i = 0; i < files.size(); ++i) {
        SCOPED_TRACE(files[i].relative);
        const nlohmann::json& expected = imageEntry(files[i], indexes[i]);
        CNitfFileReader reader;
        ASSERT_TRUE(reader.open(files[i].path.c_str()));
        std::unique_ptr<CNitfImageSource> source(reader.getNewImageSource(indexes[i]));
        ASSERT_NE(dynamic_cast<CNitfImageSourceVQ*>(source.get()), nullptr);
        const CNitfImagePropertiesIF& p = source->getImageProperties();
        const int width = p.getImageWidth(), height = p.getImageHeight();
        // The reference fills subframes absent from the file with the value it reports as no data.
        const int absentFill = expected.at("oracle").value("nodata", 0.0);
        std::vector<unsigned char> picture(static_cast<size_t>(width) * height);
        int absent = 0;
        for (int y = 0; y < p.getTileCountY(); ++y)
            for (int x = 0; x < p.getTileCountX(); ++x) {
                unsigned char* at = &picture[(static_cast<size_t>(y) * p.getTileHeight()) * width +
                                             static_cast<size_t>(x) * p.getTileWidth()];
                if (!source->readTileNonInterleaved(&reader, reinterpret_cast<char*>(at), width, x, y, 0)) {
                    ++absent;
                    for (int row = 0; row < p.getTileHeight(); ++row)
                        std::fill_n(at + static_cast<size_t>(row) * width, p.getTileWidth(), absentFill);
                }
            }
        // The canonical form: the actual image, padding removed.
        std::string canonical;
        for (int row = 0; row < p.getImageActualHeight(); ++row)
            canonical.append(reinterpret_cast<const char*>(&picture[static_cast<size_t>(row) * width]),
                             p.getImageActualWidth());
        EXPECT_EQ(Sha256::of(canonical), expected.at("oracle").at("bands").at(0).at("sha256"));
        if (expected.at("IC") == "M4") {
            EXPECT_GT(absent, 0);
            ++masked;
        } else {
            EXPECT_EQ(absent, 0);
        }
    }
    EXPECT_GE(masked, 2);
}
