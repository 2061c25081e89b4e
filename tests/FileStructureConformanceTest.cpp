// Every well-formed corpus file opens, and its structure matches what the manifest recorded.
#include <gtest/gtest.h>

#include <memory>
#include <string>

#include "Manifest.h"
#include "NitfFileReader.h"
#include "NitfImageSubheader.h"
#include "NitfSymbolSource.h"
#include "NitfTestFile.h"
#include "NitfTextSource.h"

namespace {

using nlohmann::json;

// The pairs of one segment type against the manifest's offsets and lengths.
void checkSegments(const json& expected, CNitfHeaderDataPair* (CNitfFileHeader::*pairAt)(int),
                   CNitfFileHeader* header, const std::string& what) {
    for (size_t i = 0; i < expected.size(); ++i) {
        CNitfHeaderDataPair* pair = (header->*pairAt)(static_cast<int>(i));
        ASSERT_NE(pair, nullptr) << what << " " << i;
        EXPECT_EQ(pair->getHeaderOffset(), expected[i]["subheader_offset"].get<long long>())
            << what << " " << i;
        EXPECT_EQ(pair->getHeaderLength(), expected[i]["subheader_length"].get<long long>())
            << what << " " << i;
        EXPECT_EQ(pair->getDataLength(), expected[i]["data_length"].get<long long>()) << what << " " << i;
    }
    EXPECT_EQ((header->*pairAt)(static_cast<int>(expected.size())), nullptr) << what;
}

// TRE entries (tag and length) of a list against the manifest's, keeping only entries from `source`.
void checkTres(const json& expected, const std::list<CNitfTag*>& tags, int source, const std::string& what) {
    std::vector<std::pair<std::string, long long>> actual;
    for (const CNitfTag* tag : tags) {
        if (source < 0 || tag->getSource() == source)
            actual.emplace_back(trimmed(tag->getIdentifier()), tag->getDataLength());
    }
    ASSERT_EQ(actual.size(), expected.size()) << what;
    for (size_t i = 0; i < expected.size(); ++i) {
        const json& tre = expected[i];
        std::string tag = tre.is_string() ? tre.get<std::string>() : tre["tag"].get<std::string>();
        EXPECT_EQ(actual[i].first, trimmed(tag)) << what << " TRE " << i;
        if (tre.is_object()) {
            EXPECT_EQ(actual[i].second, tre["length"].get<long long>()) << what << " TRE " << i;
        }
    }
}

// (Segment counts, identifiers, the file's and DES TRE lists and the images' main fields are checked against
// the manifest through `nitf info`, which reads them with the library.)
void checkFile(const CorpusFile& file) {
    SCOPED_TRACE(file.relative);
    const json& entry = *file.entry;
    CNitfFileReader reader;
    ASSERT_NE(reader.open(file.path.c_str()), nullptr);
    CNitfFileHeader* header = reader.getFileHeader();
    const json& segments = entry["file"]["segments"];
    if (segments.contains("image"))
        checkSegments(segments["image"], &CNitfFileHeader::getImageHeaderDataPair, header, "image");
    if (segments.contains("des"))
        checkSegments(segments["des"], &CNitfFileHeader::getDataExtensionHeaderDataPair, header, "des");

    const json none = json::array();
    const json& graphics = entry.value("graphics", none);
    for (size_t i = 0; i < graphics.size(); ++i)
        if (graphics[i].contains("tres"))
            checkTres(graphics[i]["tres"],
                      std::unique_ptr<CNitfSymbolSource>(reader.getNewSymbolSource(static_cast<int>(i)))
                          ->getTaggedRecords(),
                      -1, "graphic");
    const json& texts = entry.value("texts", none);
    for (size_t i = 0; i < texts.size(); ++i)
        if (texts[i].contains("tres"))
            checkTres(texts[i]["tres"],
                      std::unique_ptr<CNitfTextSource>(reader.getNewTextSource(static_cast<int>(i)))
                          ->getTaggedRecords(),
                      -1, "text");
    const json& images = entry.value("images", none);
    for (size_t i = 0; i < images.size(); ++i) {
        SCOPED_TRACE("image " + std::to_string(i));
        std::unique_ptr<CNitfImageSubheader> image(
            header->getNewImageSubheader(reader.getInputStream(), static_cast<int>(i)));
        ASSERT_NE(image, nullptr);
        EXPECT_EQ(trimmed(fieldText(image->getProperties(), "ICAT")), images[i]["ICAT"].get<std::string>());
        EXPECT_EQ(image->getCommentCount(), images[i]["NICOM"].get<int>());
        if (images[i].contains("tres"))
            checkTres(images[i]["tres"], image->getTaggedRecords(), CNitfTag::eTagSourceImage, "image");
    }
}

} // namespace

TEST(FileStructureConformance, EveryCorpusFileMatchesItsManifest) {
    SKIP_WITHOUT_CORPUS();
    const Manifest& manifest = Manifest::get();
    int checked = 0;
    for (const CorpusFile& file : manifest.wellFormed()) {
        if (!file.entry->contains("file") || !(*file.entry)["file"].contains("FHDR"))
            continue;
        checkFile(file);
        ++checked;
    }
    EXPECT_GT(checked, 100);
}
