// `nitf info --json` reproduces what the manifest recorded about every corpus file, and prints header fields
// and TRE fields in file order.
#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <vector>

#include "Manifest.h"
#include "NitfExtension.h"
#include "NitfFileReader.h"
#include "NitfImageSubheader.h"
#include "NitfTestFile.h"
#include "TestFiles.h"

namespace {

using nlohmann::json;
using ordered = nlohmann::ordered_json;

// The tool's JSON report of a file.
std::string infoOf(const std::string& path) {
    std::string output;
    EXPECT_EQ(runTool("info --json '" + path + "'", &output), 0) << path;
    return output;
}

void checkTres(const json& expected, const json& actual, bool fileHeaderOnly, const std::string& what) {
    std::vector<const json*> listed;
    for (const json& tre : actual)
        if (!fileHeaderOnly || tre["source"] == 1)
            listed.push_back(&tre);
    ASSERT_EQ(listed.size(), expected.size()) << what;
    for (size_t i = 0; i < expected.size(); ++i) {
        const bool bare = expected[i].is_string();
        EXPECT_EQ((*listed[i])["tag"],
                  trimmed(bare ? expected[i].get<std::string>() : expected[i]["tag"].get<std::string>()))
            << what << " " << i;
        if (!bare) {
            EXPECT_EQ((*listed[i])["length"], expected[i]["length"]) << what << " " << i;
        }
    }
}

} // namespace

TEST(InfoCommand, JsonMatchesTheManifestForEveryCorpusFile) {
    SKIP_WITHOUT_CORPUS();
    const Manifest& manifest = Manifest::get();
    static const json none = json::array();
    int files = 0, summaries = 0, orderedTres = 0;
    for (const CorpusFile& file : manifest.wellFormed()) {
        const json& entry = *file.entry;
        if (!entry.contains("file") || !entry["file"].contains("FHDR"))
            continue;
        SCOPED_TRACE(file.relative);
        ++files;
        const std::string text = infoOf(file.path);
        const json info = json::parse(text);
        const ordered inOrder = ordered::parse(text);
        EXPECT_EQ(info["version"], entry["file"]["FHDR"]);
        const json& segments = entry["file"]["segments"];
        for (const char* kind : {"image", "graphic", "label", "text", "des", "res"})
            EXPECT_EQ(info["segments"][kind], segments.contains(kind) ? segments[kind].size() : 0) << kind;
        checkTres(entry["file"]["tres"], info["tres"], true, "file");
        const std::pair<const char*, const char*> ids[] = {
            {"graphics", "SID"}, {"labels", "LID"}, {"texts", "TEXTID"}};
        for (const auto& [kind, id] : ids) {
            const json& expected = entry.value(kind, none);
            for (size_t i = 0; i < expected.size(); ++i)
                EXPECT_EQ(info[kind][i]["subheader"][id], expected[i][id]) << kind << " " << i;
        }
        const json& des = entry.value("des", none);
        for (size_t i = 0; i < des.size(); ++i) {
            const json& subheader = info["des"][i]["subheader"];
            EXPECT_EQ(subheader.contains("DESID") ? subheader["DESID"] : subheader["DESTAG"],
                      des[i]["DESID"]);
            // Label overflow is deliberately not read.
            if (des[i].contains("tres") && des[i].value("DESOFLW", "") != "LXSHD")
                checkTres(des[i]["tres"], info["des"][i]["tres"], false, "DES " + std::to_string(i));
        }

        const json& images = entry.value("images", none);
        ASSERT_EQ(info["images"].size(), images.size());
        CNitfFileReader reader;
        ASSERT_TRUE(reader.open(file.path.c_str()));
        for (size_t i = 0; i < images.size(); ++i) {
            const json& expected = images[i];
            const json& summary = info["images"][i]["summary"];
            for (const char* name : {"NROWS", "NCOLS", "NBPP", "ABPP", "NBPR", "NBPC", "NPPBH", "NPPBV"}) {
                EXPECT_TRUE(summary[name].is_number_integer()) << name;
                EXPECT_EQ(summary[name].get<long long>(), expected[name].get<long long>()) << name;
            }
            for (const char* name : {"IC", "IMODE", "PVTYPE", "IREP", "COMRAT"})
                EXPECT_EQ(summary[name].dump(), expected[name].dump()) << name;
            EXPECT_EQ(summary["bands"],
                      expected["XBANDS"].is_null() ? expected["NBANDS"] : expected["XBANDS"]);
            EXPECT_EQ(summary["dataOffset"], expected["data_offset"]);
            EXPECT_EQ(summary["dataLength"], expected["data_length"]);
            ++summaries;

            // The library's parsers report their fields in the order read; the tool keeps it.
            std::unique_ptr<CNitfImageSubheader> subheader(
                reader.getFileHeader()->getNewImageSubheader(reader.getInputStream(), static_cast<int>(i)));
            size_t t = 0;
            for (CNitfTag* tag : subheader->getTaggedRecords()) {
                const ordered& tre = inOrder["images"][i]["tres"][t++];
                std::unique_ptr<CNitfExtension> extension(CNitfExtension::Build(tag));
                if (!extension || !tre.contains("fields"))
                    continue;
                extension->readNewInfo(reader.getInputStream(), false);
                std::vector<std::string> keys, expectedKeys;
                for (auto& item : tre["fields"].items())
                    keys.push_back(item.key());
                for (const NitfField_t& field : extension->getFields())
                    expectedKeys.push_back(field.name);
                EXPECT_EQ(keys, expectedKeys) << tag->getIdentifier();
                ++orderedTres;
            }
        }
    }
    EXPECT_GT(files, 100);
    EXPECT_GT(summaries, 100);
    EXPECT_GT(orderedTres, 10);
}

TEST(InfoCommand, HeaderFieldsInFileOrderBinaryFieldsAsNumbersAndErrorsOnStderr) {
    nitfsample::File file = nitfsample::defaultSample();
    file.fbkgc = std::string("\x12\xAB\x00", 3);
    nitfsample::Image image;
    image.udid = {{"ACFTB ", "MISSON" + std::string(201, ' ')}};
    file.images.push_back(image);
    file.udhd = {{"RPFHDR", std::string("\x00\x00\x30", 3) + "A.TOC       " + std::string("\x00", 1) +
                                "MIL-C-89038    19940304U    " + std::string("\x00\x00\x06\x6C", 4)}};
    TempFile sample(nitfsample::build(file));
    const ordered info = ordered::parse(infoOf(sample.path()));
    EXPECT_EQ(info["versionCode"], 2);
    std::vector<std::string> order;
    for (auto& item : info["header"].items())
        order.push_back(item.key());
    ASSERT_GE(order.size(), 8u);
    EXPECT_EQ(order[0], "FHDR");
    EXPECT_EQ(order[1], "CLEVEL");
    EXPECT_EQ(info["header"]["FBKGC"], "12AB00");
    EXPECT_EQ(info["header"]["LISH001"].get<std::string>().size(), 6u);
    const ordered& rpf = info["tres"][0]["fields"];
    EXPECT_EQ(rpf.begin().key(), "LITTLE_BIG_ENDIAN_INDICATOR");
    EXPECT_EQ(rpf["HEADER_SECTION_LENGTH"], 48);
    EXPECT_EQ(rpf["LOCATION_SECTION_LOCATION"], 1644);
    EXPECT_EQ(rpf["FILE_NAME"], "A.TOC");
    // A five-letter identifier stands blank-padded in the file and is not parsed; the text output shows no
    // control bytes either way.
    std::string text;
    EXPECT_EQ(runTool("info '" + sample.path() + "'", &text), 0);
    for (char c : text)
        EXPECT_TRUE(c == '\n' || (c >= 0x20 && c < 0x7F)) << static_cast<int>(c);

    TempFile garbage("NOT A NITF FILE AT ALL");
    EXPECT_NE(runTool("info --json '" + garbage.path() + "'", &text), 0);
    EXPECT_TRUE(text.empty()) << "errors never reach standard output";
}

// Where images lie: corners in decimal degrees and the projection record beside the raw IGEOLO, and an RPF
// frame's own description.
TEST(InfoCommand, ImagesCarryTheirGeoreferencingAndFramesTheirRpfDescription) {
    SKIP_WITHOUT_CORPUS();
    const std::string root = corpusRoot();
    const json frame = json::parse(infoOf(root + "/rpf/0000M033.GN3"))["images"][0];
    const json& place = frame["georeferencing"];
    EXPECT_EQ(place["corner_source"], "RPF coverage") << place.dump();
    ASSERT_EQ(place["corners"].size(), 4u);
    EXPECT_NEAR(place["corners"][0]["latitude"].get<double>(), 51.923077, 1e-6);
    EXPECT_NEAR(place["corners"][1]["longitude"].get<double>(), -168.75, 1e-9);
    ASSERT_TRUE(place["projection"].contains("geotransform")) << place.dump();
    EXPECT_GT(place["projection"]["geotransform"][1].get<double>(), 0) << "east across the antimeridian";
    EXPECT_NE(frame["rpf"].dump().find("ZJKM35"), std::string::npos) << frame["rpf"].dump();
}
