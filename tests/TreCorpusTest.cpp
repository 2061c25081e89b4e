// Every TRE of the conformance corpus that the library parses consumes exactly its length. (Fields are
// checked against bytes built by hand in the layout tests.)
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

#include "Manifest.h"
#include "NitfExtension.h"
#include "NitfTag.h"
#include "TestFiles.h"

namespace {

using nlohmann::json;

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
void locate(const std::string& file, const std::string& bytes, const json& tres, long long begin,
            long long end, std::vector<Occurrence>& found) {
    long long cursor = begin;
    for (const json& tre : tres) {
        std::string tag = tre.is_string() ? tre.get<std::string>() : tre["tag"].get<std::string>();
        std::string header = tag + std::string(6 - tag.size(), ' ');
        long long length = -1;
        if (!tre.is_string()) {
            length = tre["length"].get<long long>();
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

std::vector<Occurrence> corpusTres() {
    static const json none = json::array();
    std::vector<Occurrence> found;
    for (const CorpusFile& corpusFile : Manifest::get().wellFormed()) {
        const std::string& file = corpusFile.relative;
        const json& facts = *corpusFile.entry;
        if (!facts.contains("file") || !facts["file"].contains("HL"))
            continue;
        const json& header = facts["file"];
        std::string bytes = readWholeFile(corpusFile.path);
        long long size = static_cast<long long>(bytes.size());
        auto span = [](const json& place) {
            long long start = place["subheader_offset"].get<long long>();
            return std::make_pair(start, start + place["subheader_length"].get<long long>());
        };
        locate(file, bytes, header["tres"], 0, header["HL"].get<long long>(), found);
        for (const json& image : facts.value("images", none))
            locate(file, bytes, image.value("tres", none), span(image).first, span(image).second, found);
        // Graphic, text and DES facts come in the order of the header's segment table.
        const std::pair<const char*, const char*> kinds[] = {{"graphics", "graphic"}, {"texts", "text"}};
        for (const auto& kind : kinds) {
            const json& segments = facts.value(kind.first, none);
            for (size_t i = 0; i < segments.size(); ++i) {
                auto place = span(header["segments"][kind.second].at(i));
                locate(file, bytes, segments[i].value("tres", none), place.first, place.second, found);
            }
        }
        const json& des = facts.value("des", none);
        for (size_t i = 0; i < des.size(); ++i) {
            long long start = header["segments"]["des"].at(i)["data_offset"].get<long long>();
            locate(file, bytes, des[i].value("tres", none), start, size, found);
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
        if (Manifest::get().empty())
            GTEST_SKIP() << "no test corpus (set NITF_TEST_DATA)";
        m_tres = corpusTres();
    }

    std::string m_root;
    std::vector<Occurrence> m_tres;
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
