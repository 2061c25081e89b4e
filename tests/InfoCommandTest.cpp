// `nitf info --json` reproduces what the manifest recorded about every corpus file, and prints header fields
// in file order.
#include <gtest/gtest.h>

#include <cstdio>
#include <string>

#include <memory>
#include <vector>

#include "Manifest.h"
#include "NitfExtension.h"
#include "NitfFileHeader.h"
#include "NitfFileReader.h"
#include "NitfImageSubheader.h"
#include "NitfSampleWriter.h"
#include "TestFiles.h"

namespace {

using nlohmann::json;

// Runs the tool and returns its standard output; `status` receives the exit status.
std::string runTool(const std::string& arguments, int& status) {
    std::string command = std::string(NITF_TOOL_PATH) + " " + arguments + " 2>/dev/null";
    FILE* pipe = popen(command.c_str(), "r");
    std::string output;
    char buffer[65536];
    size_t got;
    while ((got = std::fread(buffer, 1, sizeof buffer, pipe)) > 0)
        output.append(buffer, got);
    status = pclose(pipe);
    return output;
}

json infoOf(const std::string& path) {
    int status = 0;
    std::string output = runTool("info --json '" + path + "'", status);
    EXPECT_EQ(status, 0) << path;
    return json::parse(output);
}

std::string trimmed(std::string text) {
    text.erase(text.find_last_not_of(' ') + 1);
    return text;
}

void checkTres(const json& expected, const json& actual, bool fileHeaderOnly, const std::string& what) {
    std::vector<const json*> listed;
    for (const json& tre : actual) {
        if (!fileHeaderOnly || tre["source"] == 1)
            listed.push_back(&tre);
    }
    ASSERT_EQ(listed.size(), expected.size()) << what;
    for (size_t i = 0; i < expected.size(); ++i) {
        std::string tag =
            expected[i].is_string() ? expected[i].get<std::string>() : expected[i]["tag"].get<std::string>();
        EXPECT_EQ((*listed[i])["tag"], trimmed(tag)) << what << " " << i;
        if (expected[i].is_object()) {
            EXPECT_EQ((*listed[i])["length"], expected[i]["length"]) << what << " " << i;
        }
    }
}

} // namespace

TEST(InfoCommand, JsonMatchesTheManifestForEveryCorpusFile) {
    const Manifest& manifest = Manifest::get();
    if (manifest.empty())
        GTEST_SKIP() << "no test corpus";
    static const json none = json::array();
    for (const CorpusFile& file : manifest.wellFormed()) {
        const json& entry = *file.entry;
        if (!entry.contains("file") || !entry["file"].contains("FHDR"))
            continue;
        SCOPED_TRACE(file.relative);
        json info = infoOf(file.path);
        EXPECT_EQ(info["version"], entry["file"]["FHDR"]);
        const json& segments = entry["file"]["segments"];
        for (const char* kind : {"image", "graphic", "label", "text", "des", "res"}) {
            size_t expected = segments.contains(kind) ? segments[kind].size() : 0;
            EXPECT_EQ(info["segments"][kind], expected) << kind;
        }
        checkTres(entry["file"]["tres"], info["tres"], true, "file");
        const json& graphics = entry.value("graphics", none);
        for (size_t i = 0; i < graphics.size(); ++i)
            EXPECT_EQ(info["graphics"][i]["subheader"]["SID"], graphics[i]["SID"]);
        const json& labels = entry.value("labels", none);
        for (size_t i = 0; i < labels.size(); ++i)
            EXPECT_EQ(info["labels"][i]["subheader"]["LID"], labels[i]["LID"]);
        const json& texts = entry.value("texts", none);
        for (size_t i = 0; i < texts.size(); ++i)
            EXPECT_EQ(info["texts"][i]["subheader"]["TEXTID"], texts[i]["TEXTID"]);
        const json& des = entry.value("des", none);
        for (size_t i = 0; i < des.size(); ++i) {
            const json& subheader = info["des"][i]["subheader"];
            EXPECT_EQ(subheader.contains("DESID") ? subheader["DESID"] : subheader["DESTAG"],
                      des[i]["DESID"]);
            // Label overflow is deliberately not read.
            if (des[i].contains("tres") && des[i].value("DESOFLW", "") != "LXSHD")
                checkTres(des[i]["tres"], info["des"][i]["tres"], false, "DES " + std::to_string(i));
        }
    }
}

TEST(InfoCommand, HeaderFieldsComeInFileOrderAndErrorsGoToStderr) {
    nitfsample::File file = nitfsample::defaultSample();
    file.fbkgc = std::string("\x12\xAB\x00", 3);
    TempFile sample(nitfsample::build(file));
    json info = infoOf(sample.path());
    EXPECT_EQ(info["versionCode"], 2);
    std::vector<std::string> order; // the parser above sorts keys: read them again in document order
    int status = 0;
    nlohmann::ordered_json ordered =
        nlohmann::ordered_json::parse(runTool("info --json '" + sample.path() + "'", status));
    for (auto& item : ordered["header"].items())
        order.push_back(item.key());
    ASSERT_GE(order.size(), 8u);
    EXPECT_EQ(order[0], "FHDR");
    EXPECT_EQ(order[1], "CLEVEL");
    EXPECT_EQ(info["header"]["FBKGC"], "12AB00");
    EXPECT_EQ(info["header"]["LISH001"].get<std::string>().size(), 6u);
    ASSERT_EQ(info["tres"].size(), 1u);
    EXPECT_TRUE(info["tres"][0].contains("fields")) << "a TRE the library parses shows its fields";

    TempFile garbage("NOT A NITF FILE AT ALL");
    std::string output = runTool("info --json '" + garbage.path() + "'", status);
    EXPECT_NE(status, 0);
    EXPECT_TRUE(output.empty()) << "errors never reach standard output";
}

TEST(InfoCommand, ImageSummariesMatchTheManifestAndTreFieldsComeInFileOrder) {
    const Manifest& manifest = Manifest::get();
    if (manifest.empty())
        GTEST_SKIP() << "no test corpus";
    int summaries = 0, orderedTres = 0;
    for (const CorpusFile& file : manifest.wellFormed()) {
        const json& entry = *file.entry;
        if (!entry.contains("images") || entry["images"].empty())
            continue;
        SCOPED_TRACE(file.relative);
        int status = 0;
        nlohmann::ordered_json info =
            nlohmann::ordered_json::parse(runTool("info --json '" + file.path + "'", status));
        ASSERT_EQ(info["images"].size(), entry["images"].size());
        for (size_t i = 0; i < entry["images"].size(); ++i) {
            const json& expected = entry["images"][i];
            const nlohmann::ordered_json& summary = info["images"][i]["summary"];
            for (const char* name : {"NROWS", "NCOLS", "NBPP", "ABPP", "NBPR", "NBPC", "NPPBH", "NPPBV"}) {
                EXPECT_TRUE(summary[name].is_number_integer()) << name;
                EXPECT_EQ(summary[name].get<long long>(), expected[name].get<long long>()) << name;
            }
            for (const char* name : {"IC", "IMODE", "PVTYPE", "IREP", "COMRAT"})
                EXPECT_EQ(summary[name].dump(), expected[name].dump()) << name;
            long long bands = expected["XBANDS"].is_null() ? expected["NBANDS"].get<long long>()
                                                           : expected["XBANDS"].get<long long>();
            EXPECT_EQ(summary["bands"].get<long long>(), bands);
            EXPECT_EQ(summary["dataOffset"].get<long long>(), expected["data_offset"].get<long long>());
            EXPECT_EQ(summary["dataLength"].get<long long>(), expected["data_length"].get<long long>());
            ++summaries;
        }

        // The library's parsers report their fields in the order read; the tool keeps it.
        CNitfFileReader reader;
        reader.open(file.path.c_str());
        CNitfFileHeader* header = reader.getFileHeader();
        for (size_t i = 0; i < info["images"].size(); ++i) {
            std::unique_ptr<CNitfImageSubheader> subheader(
                header->getNewImageSubheader(reader.getInputStream(), static_cast<int>(i)));
            size_t t = 0;
            for (CNitfTag* tag : subheader->getTaggedRecords()) {
                const nlohmann::ordered_json& tre = info["images"][i]["tres"][t++];
                std::unique_ptr<CNitfExtension> extension(CNitfExtension::Build(tag));
                if (!extension || !tre.contains("fields"))
                    continue;
                extension->readNewInfo(reader.getInputStream(), false);
                std::vector<std::string> keys;
                for (auto& item : tre["fields"].items())
                    keys.push_back(item.key());
                std::vector<std::string> expectedKeys;
                for (const NitfField_t& field : extension->getFields())
                    expectedKeys.push_back(field.name);
                EXPECT_EQ(keys, expectedKeys) << tag->getIdentifier();
                ++orderedTres;
            }
        }
    }
    EXPECT_GT(summaries, 100);
    EXPECT_GT(orderedTres, 10);
}

TEST(InfoCommand, FixedLayoutsInTheirOrderAndBinaryFieldsAsNumbers) {
    nitfsample::File file;
    nitfsample::Image image;
    std::string acftb = std::string(207, ' ');
    acftb.replace(0, 6, "MISSON");
    image.udid = {{"ACFTB ", acftb}};
    file.images.push_back(image);
    std::string rpfhdr = std::string("\x00\x00\x30", 3) + "A.TOC       " + std::string("\x00", 1) +
                         "MIL-C-89038    19940304U    " + std::string("\x00\x00\x06\x6C", 4);
    file.udhd = {{"RPFHDR", rpfhdr}};
    TempFile sample(nitfsample::build(file));
    int status = 0;
    nlohmann::ordered_json info =
        nlohmann::ordered_json::parse(runTool("info --json '" + sample.path() + "'", status));
    const nlohmann::ordered_json& header = info["tres"][0]["fields"];
    EXPECT_EQ(header.begin().key(), "LITTLE_BIG_ENDIAN_INDICATOR");
    EXPECT_EQ(header["HEADER_SECTION_LENGTH"], 48);
    EXPECT_EQ(header["LOCATION_SECTION_LOCATION"], 1644);
    EXPECT_EQ(header["FILE_NAME"], "A.TOC");
    // A five-letter identifier stands blank-padded in the file and is not parsed; the text output shows no
    // control bytes either way.
    std::string text = runTool("info '" + sample.path() + "'", status);
    for (char c : text)
        EXPECT_TRUE(c == '\n' || (c >= 0x20 && c < 0x7F)) << static_cast<int>(c);
}

// Where images lie: corners in decimal degrees and the projection record beside the raw IGEOLO, and an RPF
// frame's own description.
TEST(InfoCommand, ImagesCarryTheirGeoreferencingAndFramesTheirRpfDescription) {
    const std::string root = corpusRoot();
    if (root.empty())
        GTEST_SKIP() << "no test corpus";
    const json frame = infoOf(root + "/rpf/0000M033.GN3")["images"][0];
    const json& place = frame["georeferencing"];
    EXPECT_EQ(place["corner_source"], "RPF coverage") << place.dump();
    ASSERT_EQ(place["corners"].size(), 4u);
    EXPECT_NEAR(place["corners"][0]["latitude"].get<double>(), 51.923077, 1e-6);
    EXPECT_NEAR(place["corners"][1]["longitude"].get<double>(), -168.75, 1e-9);
    ASSERT_TRUE(place["projection"].contains("geotransform")) << place.dump();
    EXPECT_GT(place["projection"]["geotransform"][1].get<double>(), 0) << "east across the antimeridian";
    ASSERT_TRUE(frame.contains("rpf"));
    EXPECT_EQ(frame["rpf"].dump().find("ZJKM35") != std::string::npos, true) << frame["rpf"].dump();

    int status = 0;
    const std::string text = runTool("info '" + root + "/rpf/0000M033.GN3'", status);
    EXPECT_EQ(status, 0);
    EXPECT_NE(text.find("corners from RPF coverage"), std::string::npos);
    EXPECT_NE(text.find("location    ZJKM35"), std::string::npos);
}
