// Whole-image extraction: the corpus's uncompressed images against the manifest's pixel hashes, and the nitf
// tool's extract command end to end.
#include <gtest/gtest.h>

#include <fstream>
#include <iostream>
#include <map>
#include <set>
#include <string>

#include "Canonical.h"
#include "Manifest.h"
#include "NitfTestFile.h"
#include "Sha256.h"
#include "TestFiles.h"

// Every corpus image whose pixels any correct decoder reproduces exactly (uncompressed, bi-level, VQ and
// numerically lossless JPEG 2000) decodes through the tool's raw writer to the manifest's hashes: the
// independent decoder's, or its documented alternative where the library's rules differ from that decoder's
// (absent uncompressed blocks read as zeros; 12-bit samples unpacked most significant bit first).
TEST(ImageCorpus, ExactImagesMatchTheManifest) {
    SKIP_WITHOUT_CORPUS();
    static const std::set<std::string> exactCodes = {"NC", "NM", "C1", "M1", "C4", "M4", "C8", "M8"};
    int images = 0;
    std::map<std::string, int> verdicts;
    for (const CorpusFile& file : Manifest::get().files()) {
        for (const nlohmann::json& image : file.entry->value("images", nlohmann::json::array())) {
            const nlohmann::json& oracle = image.at("oracle");
            // U_4004B: the reference decoder fails on it; a second decoder's result is given instead.
            if (!exactCodes.count(image.value("IC", "")) || !oracle.value("exact", false) ||
                (oracle.value("decoded", nlohmann::json(false)) == false && !oracle.contains("alt")))
                continue;
            const int index = image.at("index").get<int>();
            SCOPED_TRACE(file.relative + " image " + std::to_string(index));
            ++images;
            CanonicalImage bands;
            ASSERT_NO_THROW(bands = canonicalImage(file.path, index));
            for (size_t band = 0; band < bands.bands.size(); ++band) {
                const std::string digest = Sha256::of(bands.bands[band]);
                const nlohmann::json& expected = oracle.at("bands").at(band);
                std::string verdict = expected.value("sha256", "") == digest ? "match" : "FAIL";
                for (const nlohmann::json& alt : oracle.value("alt", nlohmann::json::array()))
                    if (verdict == "FAIL" && alt.at("sha256").at(band) == digest)
                        verdict = "alt";
                // The independent decoder failed on this band, and no other result is given.
                if (verdict == "FAIL" && !oracle.contains("alt") && !expected.value("decoded", true))
                    verdict = "no oracle";
                EXPECT_NE(verdict, "FAIL") << "band " << band << " decodes to " << digest;
                ++verdicts[verdict];
            }
            // Only an image whose data run past the end of the file has blocks that cannot be read whole.
            const bool cutShort =
                image.at("data_offset").get<long long>() + image.at("data_length").get<long long>() >
                file.entry->at("size").get<long long>();
            EXPECT_EQ(bands.failedBlocks > 0, cutShort) << bands.firstError;
        }
    }
    EXPECT_GT(images, 60);
    std::cout << images << " images; bands: " << verdicts["match"] << " match the oracle, " << verdicts["alt"]
              << " its documented alternative, " << verdicts["no oracle"] << " have no oracle\n";
}

TEST(ExtractTool, WritesCanonicalSamplesAndPictures) {
    nitfsample::Image image;
    image.cols = 23;
    image.rows = 17;
    image.nppbh = image.nppbv = 8;
    image.nbpp = 12;
    image.bands = 3;
    image.imode = 'S';
    TempFile input(nitfsample::build(fileOf(image)));
    TempFile output("", ".out");
    auto extract = [&](const std::string& options) {
        return runTool("extract " + input.path() + " " + options + " -o " + output.path());
    };

    ASSERT_EQ(extract("-f raw"), 0);
    EXPECT_EQ(output.read(), nitfsample::canonicalBand(image, 0) + nitfsample::canonicalBand(image, 1) +
                                 nitfsample::canonicalBand(image, 2));
    ASSERT_EQ(extract("-i 0 -b 1 -f raw"), 0);
    EXPECT_EQ(output.read(), nitfsample::canonicalBand(image, 1));

    // A window of two bands in the order asked for; the same bytes streamed to a pipe.
    auto cut = [&](int band) {
        const std::string whole = nitfsample::canonicalBand(image, band);
        std::string part;
        for (int row = 2; row < 9; ++row)
            part += whole.substr((row * 23 + 3) * 2, 10 * 2);
        return part;
    };
    ASSERT_EQ(extract("--window 3,2,10,7 --bands 2,0 -j 2 -f raw"), 0);
    EXPECT_EQ(output.read(), cut(2) + cut(0));
    ASSERT_EQ(runTool("extract " + input.path() + " --window 3,2,10,7 --bands 2,0 -f raw -o - | cat > " +
                      output.path()),
              0);
    EXPECT_EQ(output.read(), cut(2) + cut(0));
    EXPECT_EQ(extract("--window 20,0,4,1 -f raw"), 1) << "a window past the edge";
    EXPECT_EQ(extract("--window 1,2,3 -f raw"), 2);
    EXPECT_EQ(runTool("extract --help"), 0);

    ASSERT_EQ(extract("-f png"), 0);
    EXPECT_EQ(output.read().substr(0, 8), "\x89PNG\r\n\x1a\n");
    ASSERT_EQ(extract("-f pgm"), 0);
    EXPECT_EQ(output.read().substr(0, 15), "P6\n23 17\n65535\n") << "RGB, 16 bits";
    EXPECT_EQ(output.read().size(), 15u + 23 * 17 * 3 * 2);
    ASSERT_EQ(extract("-b 2 -f pgm"), 0);
    EXPECT_EQ(output.read().substr(0, 3), "P5\n");

    EXPECT_EQ(extract("-f bmp"), 2);
    EXPECT_EQ(runTool("extract " + input.path()), 2);
    EXPECT_EQ(extract("-b 3 -f raw"), 1);
    EXPECT_EQ(extract("-i 1 -f raw"), 1);
    std::remove(output.path().c_str());
    EXPECT_EQ(runTool("extract " + input.path() + "-missing -f raw -o " + output.path()), 1);
    EXPECT_FALSE(std::ifstream(output.path()).good()) << "no output is left behind after a failure";
}

// Uncompressed images whose stored bytes already are the raw form (whole bytes per sample, one block column,
// each band's blocks in a row in the file) are copied rather than decoded: whole, as a full-width window of
// some bands (the last block's padding rows skipped) and through a pipe. A block-interleaved image of several
// block rows is not in that form and takes the decoding path to the same bytes.
TEST(ExtractTool, CopiesStoredBytesThatAreAlreadyTheRawForm) {
    for (char imode : {'S', 'B'}) {
        SCOPED_TRACE(std::string("IMODE ") + imode);
        nitfsample::Image image;
        image.cols = 23;
        image.rows = 17;
        image.nppbh = 23;
        image.nppbv = 8;
        image.nbpp = 16;
        image.bands = 3;
        image.imode = imode;
        TempFile input(nitfsample::build(fileOf(image)));
        TempFile output("", ".out");
        auto rows = [&](int band, int first, int count) {
            return nitfsample::canonicalBand(image, band).substr(first * 23 * 2, count * 23 * 2);
        };
        ASSERT_EQ(runTool("extract " + input.path() + " -f raw -o " + output.path()), 0);
        EXPECT_EQ(output.read(), rows(0, 0, 17) + rows(1, 0, 17) + rows(2, 0, 17));
        ASSERT_EQ(
            runTool("extract " + input.path() + " --window 0,2,23,15 --bands 2,0 -f raw -o " + output.path()),
            0);
        EXPECT_EQ(output.read(), rows(2, 2, 15) + rows(0, 2, 15));
        ASSERT_EQ(runTool("extract " + input.path() + " --window 0,9,23,8 --bands 1 -f raw -o - | cat > " +
                          output.path()),
                  0);
        EXPECT_EQ(output.read(), rows(1, 9, 8));
    }
}

// A CADRG frame as a picture: its colour table as the palette, absent subframes (the pad pixel, the first
// code past the 216 colours) transparent.
TEST(ExtractTool, CadrgFramesAreColouredWithNoDataClear) {
    SKIP_WITHOUT_CORPUS();
    const std::string root = corpusRoot();
    TempFile picture("", ".png");
    ASSERT_EQ(runTool("extract " + root + "/rpf/0000M033.GN3 -f png -o " + picture.path()), 0);
    const std::string png = picture.read();
    const size_t palette = png.find("PLTE"), transparency = png.find("tRNS");
    ASSERT_NE(palette, std::string::npos);
    ASSERT_NE(transparency, std::string::npos);
    auto length = [&](size_t type) {
        const unsigned char* p = reinterpret_cast<const unsigned char*>(png.data() + type - 4);
        return (size_t(p[0]) << 24) | (size_t(p[1]) << 16) | (size_t(p[2]) << 8) | p[3];
    };
    EXPECT_EQ(length(palette), 3u * 256) << "a palette entry for every code";
    ASSERT_EQ(length(transparency), 217u) << "opaque colours, then the transparent code 216";
    EXPECT_EQ(static_cast<unsigned char>(png[transparency + 4 + 215]), 255);
    EXPECT_EQ(static_cast<unsigned char>(png[transparency + 4 + 216]), 0);
}
