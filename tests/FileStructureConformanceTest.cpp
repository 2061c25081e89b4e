// Every well-formed corpus file opens, and its structure matches what the manifest recorded.
#include <gtest/gtest.h>

#include <memory>
#include <string>

#include "Manifest.h"
#include "NitfDataExtensionSource.h"
#include "NitfFileReader.h"
#include "NitfImageSubheader.h"
#include "NitfLabelSource.h"
#include "NitfSymbolSource.h"
#include "NitfTextSource.h"

namespace {

using nlohmann::json;

std::string trimmed(std::string text) {
    text.erase(text.find_last_not_of(' ') + 1);
    return text;
}

std::string fieldOf(PropertyMap& map, const char* name) {
    CNitfProperty* value = FindProperty(map, name);
    return value ? trimmed(value->toText()) : std::string("<absent>");
}

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

void checkFile(const CorpusFile& file) {
    SCOPED_TRACE(file.relative);
    const json& entry = *file.entry;
    CNitfFileReader reader;
    ASSERT_NE(reader.open(file.path.c_str()), nullptr);
    CNitfFileHeader* header = reader.getFileHeader();
    const json& expected = entry["file"];

    EXPECT_EQ(fieldOf(header->getProperties(), "FHDR"), expected["FHDR"].get<std::string>());
    const json& segments = expected["segments"];
    auto count = [&](const char* name) { return segments.contains(name) ? segments[name].size() : 0u; };
    EXPECT_EQ(header->getImageCount(), static_cast<int>(count("image")));
    EXPECT_EQ(header->getSymbolCount(), static_cast<int>(count("graphic")));
    EXPECT_EQ(header->getLabelCount(), static_cast<int>(count("label")));
    EXPECT_EQ(header->getTextCount(), static_cast<int>(count("text")));
    EXPECT_EQ(header->getDataExtensionCount(), static_cast<int>(count("des")));
    EXPECT_EQ(header->getReservedExtensionCount(), static_cast<int>(count("res")));
    if (segments.contains("image"))
        checkSegments(segments["image"], &CNitfFileHeader::getImageHeaderDataPair, header, "image");
    if (segments.contains("des"))
        checkSegments(segments["des"], &CNitfFileHeader::getDataExtensionHeaderDataPair, header, "des");
    checkTres(expected["tres"], header->getTaggedRecords(), CNitfTag::eTagSourceFileHeader, "file");

    const json none = json::array();
    const json& graphics = entry.value("graphics", none);
    for (size_t i = 0; i < graphics.size(); ++i) {
        std::unique_ptr<CNitfSymbolSource> graphic(reader.getNewSymbolSource(static_cast<int>(i)));
        EXPECT_EQ(graphic->getField("SID"), graphics[i]["SID"].get<std::string>());
        if (graphics[i].contains("tres"))
            checkTres(graphics[i]["tres"], graphic->getTaggedRecords(), -1, "graphic");
    }
    const json& labels = entry.value("labels", none);
    for (size_t i = 0; i < labels.size(); ++i) {
        std::unique_ptr<CNitfLabelSource> label(reader.getNewLabelSource(static_cast<int>(i)));
        EXPECT_EQ(label->getField("LID"), labels[i]["LID"].get<std::string>());
    }
    const json& texts = entry.value("texts", none);
    for (size_t i = 0; i < texts.size(); ++i) {
        std::unique_ptr<CNitfTextSource> text(reader.getNewTextSource(static_cast<int>(i)));
        EXPECT_EQ(text->getField("TEXTID"), texts[i]["TEXTID"].get<std::string>());
        if (texts[i].contains("tres"))
            checkTres(texts[i]["tres"], text->getTaggedRecords(), -1, "text");
    }
    const json& des = entry.value("des", none);
    for (size_t i = 0; i < des.size(); ++i) {
        std::unique_ptr<CNitfDataExtensionSource> segment(
            reader.getNewDataExtensionSource(static_cast<int>(i)));
        std::string id = segment->getField(header->getVersion() == eNitfVersion20 ? "DESTAG" : "DESID");
        EXPECT_EQ(id, des[i]["DESID"].get<std::string>());
        if (des[i].contains("DESOFLW")) {
            EXPECT_EQ(segment->getField("DESOFLW"), des[i]["DESOFLW"].get<std::string>());
        }
        // Label overflow is deliberately not read, so its TREs are not listed.
        bool labelOverflow = des[i].value("DESOFLW", "") == "LXSHD";
        if (des[i].contains("tres") && !labelOverflow)
            checkTres(des[i]["tres"], segment->getOverflowTags(), -1, "DES " + std::to_string(i));
    }

    const json& images = entry.value("images", none);
    for (size_t i = 0; i < images.size(); ++i) {
        SCOPED_TRACE("image " + std::to_string(i));
        std::unique_ptr<CNitfImageSubheader> image(
            header->getNewImageSubheader(reader.getInputStream(), static_cast<int>(i)));
        ASSERT_NE(image, nullptr);
        PropertyMap& map = image->getProperties();
        for (const char* name : {"IC", "IMODE", "IREP", "PVTYPE", "ICAT"})
            EXPECT_EQ(fieldOf(map, name), images[i][name].get<std::string>()) << name;
        for (const char* name : {"NROWS", "NCOLS", "NBPP", "ABPP", "NBPR", "NBPC", "NPPBH", "NPPBV"})
            EXPECT_EQ(FindProperty(map, name)->getAsInt(), images[i][name].get<int>()) << name;
        EXPECT_EQ(image->getBandCount(), images[i]["XBANDS"].is_null() ? images[i]["NBANDS"].get<int>()
                                                                       : images[i]["XBANDS"].get<int>());
        EXPECT_EQ(image->getCommentCount(), images[i]["NICOM"].get<int>());
        if (images[i].contains("tres"))
            checkTres(images[i]["tres"], image->getTaggedRecords(), CNitfTag::eTagSourceImage, "image");
    }
}

} // namespace

TEST(FileStructureConformance, EveryCorpusFileMatchesItsManifest) {
    const Manifest& manifest = Manifest::get();
    if (manifest.empty())
        GTEST_SKIP() << "no test corpus";
    int checked = 0;
    for (const CorpusFile& file : manifest.wellFormed()) {
        if (!file.entry->contains("file") || !(*file.entry)["file"].contains("FHDR"))
            continue;
        checkFile(file);
        ++checked;
    }
    EXPECT_GT(checked, 100);
}
