// Frame files of the corpus (CADRG, masked or not, polar, and a CIB frame whose RPF offsets went stale when
// it was re-wrapped): their header sections, coverage corners against the image's IGEOLO, intervals, colours
// against the manifest's colour tables, transparent codes and location codes.
#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <vector>

#include "HostError.h"
#include "Manifest.h"
#include "NitfFileReader.h"
#include "NitfImageSubheader.h"
#include "NitfLutSource.h"
#include "NitfSampleWriter.h"
#include "RpfFrame.h"
#include "Sha256.h"
#include "TestFiles.h"

namespace {

const char* const kFrames[] = {"rpf/001zc013.on1", "rpf/0000M033.GN3", "rpf/bug3337.ntf",
                               "rpf/NITF21_CGM_ANNO_Uncompressed_unmasked.ntf"};

const nlohmann::json* entryOf(const std::string& relative) {
    for (const CorpusFile& file : Manifest::get().files())
        if (file.relative == relative)
            return file.entry;
    return nullptr;
}

// A geographic IGEOLO corner, ddmmssXdddmmssY, in degrees.
std::pair<double, double> corner(const std::string& igeolo, int index) {
    const std::string text = igeolo.substr(15 * index, 15);
    auto dms = [](const std::string& d, const std::string& m, const std::string& s, char hemisphere) {
        const double value = std::stod(d) + std::stod(m) / 60 + std::stod(s) / 3600;
        return hemisphere == 'S' || hemisphere == 'W' ? -value : value;
    };
    return {dms(text.substr(0, 2), text.substr(2, 2), text.substr(4, 2), text[6]),
            dms(text.substr(7, 3), text.substr(10, 2), text.substr(12, 2), text[14])};
}

} // namespace

TEST(RpfFrame, CorpusFramesDescribeThemselves) {
    SKIP_WITHOUT_CORPUS();
    for (const char* relative : kFrames) {
        SCOPED_TRACE(relative);
        const nlohmann::json* entry = entryOf(relative);
        ASSERT_NE(entry, nullptr);
        const nlohmann::json& image = entry->at("images").at(0);
        CNitfFileReader reader;
        ASSERT_TRUE(reader.open((corpusRoot() + "/" + relative).c_str()));
        CRpfFrame frame(reader);
        EXPECT_EQ(frame.getFileName().size(), 12u);

        // The coverage corners are the image's corners (IGEOLO holds them to the second: UL, UR, LR, LL).
        ASSERT_TRUE(frame.hasCoverage());
        const RpfCoverage_t& c = frame.getCoverage();
        const std::string igeolo = image.at("IGEOLO");
        const double corners[4][2] = {{c.upperLeftLatitude, c.upperLeftLongitude},
                                      {c.upperRightLatitude, c.upperRightLongitude},
                                      {c.lowerRightLatitude, c.lowerRightLongitude},
                                      {c.lowerLeftLatitude, c.lowerLeftLongitude}};
        for (int i = 0; i < 4; ++i) {
            EXPECT_NEAR(corners[i][0], corner(igeolo, i).first, 1.0 / 3600) << "corner " << i;
            EXPECT_NEAR(corners[i][1], corner(igeolo, i).second, 1.0 / 3600) << "corner " << i;
        }
        // Degrees per pixel over the frame's 1536 rows (polar frames are squares of the polar grid instead).
        if (c.upperLeftLongitude == c.lowerLeftLongitude) {
            EXPECT_NEAR(c.verticalInterval, (c.upperLeftLatitude - c.lowerLeftLatitude) / 1536, 1e-12);
        }
        EXPECT_GT(c.horizontalInterval, 0);
        EXPECT_GT(c.verticalResolution, 1);

        // The look-up tables as stored are the manifest's.
        std::unique_ptr<CNitfImageSubheader> subheader(
            reader.getFileHeader()->getNewImageSubheader(reader.getInputStream(), 0));
        CNitfLutSource* lut = subheader->getLutSource(0);
        ASSERT_NE(lut, nullptr);
        std::string stored(static_cast<size_t>(lut->getSize()), '\0');
        lut->readNonInterleaved(&reader, &stored[0], lut->getSize());
        EXPECT_EQ(Sha256::of(stored), image.at("luts").at(0).at("sha256"));

        // Colours: the look-up table entries, opaque; with the reference's appended transparent entry they
        // are its colour table.
        const nlohmann::json& table = image.at("oracle").at("colour_table");
        ASSERT_EQ(frame.getColours().size(), 216u);
        EXPECT_EQ(frame.getTransparentCode(), 216);
        EXPECT_FALSE(frame.isTransparentCodeStored());
        std::string rgba;
        for (const RpfColour_t& colour : frame.getColours()) {
            EXPECT_EQ(colour.alpha, 255);
            rgba += std::string{static_cast<char>(colour.red), static_cast<char>(colour.green),
                                static_cast<char>(colour.blue), static_cast<char>(colour.alpha)};
        }
        rgba += std::string(4, '\0');
        EXPECT_EQ(Sha256::of(rgba), table.at("sha256_rgba"));
    }
}

TEST(RpfFrame, StoredTransparentCodesAndFilesWithoutRpf) {
    // A masked VQ-less image with a transparent pixel code of 8 bits and a three-table LUT.
    nitfsample::File file;
    file.version = "NITF02.00";
    file.udhd = {{"RPFHDR", std::string("\0\0\x30", 3) + "FRAME001.ON1" + std::string(1, '\0') +
                                "MIL-C-89038    19940304U    " + std::string("\0\0\0\0", 4)}};
    nitfsample::Image image;
    image.ic = "NM";
    image.irep = "RGB/LUT";
    image.padCodeBits = 8;
    image.padValue = 5;
    nitfsample::Band band;
    band.luts = {std::string(8, 'r'), std::string(8, 'g'), std::string(8, 'b')};
    image.bandInfo = {band};
    file.images = {image};
    TempFile stored(nitfsample::build(file));
    CNitfFileReader reader;
    ASSERT_TRUE(reader.open(stored.path().c_str()));
    CRpfFrame frame(reader);
    EXPECT_EQ(frame.getFileName(), "FRAME001.ON1");
    EXPECT_FALSE(frame.hasCoverage());
    EXPECT_EQ(frame.getLocationCode(), "");
    ASSERT_EQ(frame.getColours().size(), 8u);
    EXPECT_TRUE(frame.isTransparentCodeStored());
    EXPECT_EQ(frame.getTransparentCode(), 5);
    EXPECT_EQ(frame.getColours()[5].alpha, 0);
    EXPECT_EQ(frame.getColours()[4].alpha, 255);
    EXPECT_EQ(frame.getColours()[4].green, 'g');

    TempFile plain(nitfsample::build(nitfsample::File()));
    CNitfFileReader other;
    ASSERT_TRUE(other.open(plain.path().c_str()));
    EXPECT_THROW(CRpfFrame{other}, vexo::Exception);
}
