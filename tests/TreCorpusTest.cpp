// Every TRE of the conformance corpus that the library parses consumes exactly its length; a few are checked
// field for field through their metadata.
#include <gtest/gtest.h>

#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <map>
#include <memory>
#include <set>
#include <sstream>
#include <string>
#include <sys/stat.h>
#include <vector>

#include "HostConfig.h"
#include "MiniJson.h"
#include "NitfExtension.h"
#include "NitfTag.h"

namespace {

std::string corpusRoot() {
    struct stat info;
    const char* fromEnvironment = std::getenv("NITF_TEST_DATA");
    std::string root = fromEnvironment ? fromEnvironment : NITF_SOURCE_DIR "/../shared/testdata";
    return stat((root + "/MANIFEST.json").c_str(), &info) == 0 ? root : std::string();
}

std::string readFile(const std::string& path) {
    std::ifstream in(path, std::ios::binary);
    std::ostringstream out;
    out << in.rdbuf();
    return out.str();
}

std::string trimmed(const std::string& text) {
    return text.substr(0, text.find_last_not_of(' ') + 1);
}

// One TRE found in a corpus file: its identifier as written, and where its data lies.
struct Occurrence {
    std::string file;
    std::string tag;
    long long offset;
    long long length;
};

// Finds the TREs `tres` lists (objects with tag and length, or bare tags) in file order within bytes
// [begin, end) of the file, each by its 11-byte header.
void locate(const std::string& file, const std::string& bytes, const JsonValue& tres, long long begin,
            long long end, std::vector<Occurrence>& found) {
    long long cursor = begin;
    for (const JsonValue& tre : tres.items()) {
        std::string tag = tre.isString() ? tre.string() : tre["tag"].string();
        std::string header = tag + std::string(6 - tag.size(), ' ');
        long long length = -1;
        if (!tre.isString()) {
            length = tre["length"].integer();
            char digits[8];
            std::snprintf(digits, sizeof digits, "%05lld", length);
            header += digits;
        }
        size_t at = bytes.find(header, static_cast<size_t>(cursor));
        ASSERT_NE(at, std::string::npos) << file << ": " << tag;
        if (length < 0)
            length = std::atoll(bytes.substr(at + 6, 5).c_str());
        ASSERT_LE(static_cast<long long>(at) + 11 + length, end) << file << ": " << tag;
        found.push_back({file, tag, static_cast<long long>(at) + 11, length});
        cursor = static_cast<long long>(at) + 11 + length;
    }
}

std::vector<Occurrence> corpusTres(const std::string& root, const JsonValue& manifest) {
    std::vector<Occurrence> found;
    for (const auto& entry : manifest["files"].members()) {
        const std::string& file = entry.first;
        const JsonValue& facts = entry.second;
        const JsonValue& header = facts["file"];
        if (facts["malformed"].boolean() || !header.isObject())
            continue;
        std::string bytes = readFile(root + "/" + file);
        long long size = static_cast<long long>(bytes.size());
        locate(file, bytes, header["tres"], 0, header["HL"].integer(), found);
        for (const JsonValue& image : facts["images"].items())
            locate(file, bytes, image["tres"], image["subheader_offset"].integer(),
                   image["subheader_offset"].integer() + image["subheader_length"].integer(), found);
        // Graphic, text and DES facts come in the order of the header's segment table.
        const std::pair<const char*, const char*> kinds[] = {{"graphics", "graphic"}, {"texts", "text"}};
        for (const auto& kind : kinds) {
            const auto& segments = facts[kind.first].items();
            for (size_t i = 0; i < segments.size(); ++i) {
                const JsonValue& place = header["segments"][kind.second].items().at(i);
                locate(file, bytes, segments[i]["tres"], place["subheader_offset"].integer(),
                       place["subheader_offset"].integer() + place["subheader_length"].integer(), found);
            }
        }
        const auto& des = facts["des"].items();
        for (size_t i = 0; i < des.size(); ++i) {
            const JsonValue& place = header["segments"]["des"].items().at(i);
            locate(file, bytes, des[i]["tres"], place["data_offset"].integer(), size, found);
        }
    }
    return found;
}

struct Stream {
    FILE* fp;
    explicit Stream(const std::string& path) : fp(std::fopen(path.c_str(), "rb")) {}
    ~Stream() {
        if (fp)
            std::fclose(fp);
    }
};

std::unique_ptr<CNitfExtension> parse(const std::string& root, const Occurrence& tre) {
    CNitfTag tag;
    // As trimmed names, the four- and five-letter identifiers are built too.
    tag.setIdentifier(trimmed(tre.tag).c_str());
    tag.setDataOffset(tre.offset);
    tag.setDataLength(tre.length);
    std::unique_ptr<CNitfExtension> extension(CNitfExtension::Build(&tag));
    if (extension) {
        Stream stream(root + "/" + tre.file);
        extension->readNewInfo(stream.fp, false);
    }
    return extension;
}

class TreCorpus : public ::testing::Test {
protected:
    void SetUp() override {
        m_root = corpusRoot();
        if (m_root.empty())
            GTEST_SKIP() << "no test corpus (set NITF_TEST_DATA)";
        JsonValue manifest = JsonValue::parse(readFile(m_root + "/MANIFEST.json"));
        m_tres = corpusTres(m_root, manifest);
    }

    std::string m_root;
    std::vector<Occurrence> m_tres;
};

struct Metadata {
    char** list = nullptr;
    ~Metadata() { DestroyStringList(list); }
    std::string operator()(const std::string& key) const {
        const char* value = FetchAuxEntry(list, key.c_str());
        return value ? value : "<absent>";
    }
};

} // namespace

TEST_F(TreCorpus, EveryParsedTreConsumesItsLength) {
    // Corpus TREs whose length matches no valid layout of their parser: none so far.
    const std::set<std::string> expectedMismatches = {};
    std::map<std::string, int> parsed;
    for (const Occurrence& tre : m_tres) {
        std::unique_ptr<CNitfExtension> extension = parse(m_root, tre);
        if (!extension)
            continue; // not a TRE the library parses
        ++parsed[trimmed(tre.tag)];
        if (expectedMismatches.count(tre.file + ":" + tre.tag))
            continue;
        EXPECT_EQ(extension->getReadLength(), tre.length)
            << tre.file << ": " << tre.tag << " at " << tre.offset;
        EXPECT_FALSE(extension->getProperties().empty()) << tre.file << ": " << tre.tag;
    }
    int total = 0;
    std::set<std::string> names;
    for (const auto& count : parsed) {
        std::printf("  %s x %d\n", count.first.c_str(), count.second);
        total += count.second;
        names.insert(count.first);
    }
    EXPECT_EQ(total, 40);
    EXPECT_EQ(names, (std::set<std::string>{"ACFTB", "AIMIDB", "ENGRDA", "GEOPSB", "HISTOA", "IMUDTG",
                                            "IMXDTG", "J2KLRA", "MHUDTG", "MHXDTG", "PIAIMB", "PIAPEA",
                                            "PIAPRC", "RPFHDR", "RPFIMG"}));
}

TEST_F(TreCorpus, MetadataMatchesTheBytes) {
    static const std::pair<const char*, int> kAimidb[] = {
        {"ACQUISITION_DATE", 14}, {"MISSION_NO", 4},     {"MISSION_IDENTIFICATION", 10},
        {"FLIGHT_NO", 2},         {"OP_NUM", 3},         {"CURRENT_SEGMENT", 2},
        {"REPRO_NUM", 2},         {"REPLAY", 3},         {"RESERVED_1", 1},
        {"START_TILE_COLUMN", 3}, {"START_TILE_ROW", 5}, {"END_SEGMENT", 2},
        {"END_TILE_COLUMN", 3},   {"END_TILE_ROW", 5},   {"COUNTRY", 2},
        {"RESERVED_2", 4},        {"LOCATION", 11},      {"RESERVED_3", 13}};
    int checked = 0;
    for (const Occurrence& tre : m_tres) {
        std::string name = trimmed(tre.tag);
        if (name != "AIMIDB" && name != "J2KLRA" && name != "MHUDTG")
            continue;
        std::string data = readFile(m_root + "/" + tre.file).substr(tre.offset, tre.length);
        Metadata metadata;
        parse(m_root, tre)->asMetadata(metadata.list, "IMAGE", "_1");
        std::string prefix = "IMAGE." + name + "_1.";
        if (name == "AIMIDB") {
            size_t at = 0;
            for (const auto& field : kAimidb) {
                EXPECT_EQ(metadata(prefix + field.first), data.substr(at, field.second)) << tre.file;
                at += field.second;
            }
            EXPECT_EQ(at, data.size());
        } else if (name == "J2KLRA") {
            int layers = std::atoi(data.substr(8, 3).c_str());
            EXPECT_EQ(metadata(prefix + "NBANDS_O"), data.substr(3, 5));
            for (int n = 1; n <= layers; ++n) {
                std::string index = std::to_string(n);
                EXPECT_EQ(metadata(prefix + "LAYER_ID_" + index), data.substr(11 + 12 * (n - 1), 3));
                EXPECT_EQ(metadata(prefix + "BITRATE_" + index), data.substr(14 + 12 * (n - 1), 9));
            }
            EXPECT_EQ(metadata(prefix + "LAYER_ID_" + std::to_string(layers + 1)), "<absent>");
        } else {
            EXPECT_EQ(metadata(prefix + "MHUDTG_DATA"), data);
        }
        ++checked;
    }
    EXPECT_GE(checked, 9);
}
