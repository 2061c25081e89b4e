// The extension framework: which identifiers are built, metadata export, copies and re-reading.
#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <memory>
#include <string>
#include <vector>

#include "HostConfig.h"
#include "NitfExtension.h"
#include "NitfFile.h"
#include "NitfTag.h"
#include "PIAEVAExtension.h"
#include "RPFIMGExtension.h"
#include "TestFiles.h"
#include "TreBytes.h"

namespace {

std::unique_ptr<CNitfExtension> build(const char* identifier, long long offset = 0, long long length = 0) {
    CNitfTag tag;
    tag.setIdentifier(identifier);
    tag.setDataOffset(offset);
    tag.setDataLength(length);
    return std::unique_ptr<CNitfExtension>(CNitfExtension::Build(&tag));
}

const std::string kEvent = padText("HARVEST", 38) + padText("SEASON", 8);

struct MetadataList {
    char** list = nullptr;
    ~MetadataList() { DestroyStringList(list); }
    std::vector<std::string> entries() const {
        std::vector<std::string> out;
        for (int i = 0; list && list[i]; ++i)
            out.push_back(list[i]);
        return out;
    }
};

} // namespace

TEST(ExtensionFramework, BuildChoosesTheParserByIdentifier) {
    const std::vector<const char*> names = CNitfExtension::getBuiltExtensionNames();
    EXPECT_GE(names.size(), 41u);
    for (const char* name : names) {
        auto extension = build(name, 1234, 56);
        ASSERT_TRUE(extension) << name;
        EXPECT_STREQ(extension->getName(), name);
        EXPECT_TRUE(CNitfExtension::isKnownExtension(name)) << name;
    }

    // Case is ignored.
    auto lower = build("rpfimg");
    ASSERT_TRUE(lower);
    EXPECT_TRUE(dynamic_cast<CRPFIMGExtension*>(lower.get()));

    // Blank-padded short identifiers, as they stand in a file, are known but not built.
    EXPECT_FALSE(build("ACFTB "));
    EXPECT_TRUE(CNitfExtension::isKnownExtension("ACFTB "));
    EXPECT_FALSE(build("PIAE A")); // a blank fifth character
    EXPECT_FALSE(build("ACFT  "));

    // RPC TREs belong to the rational polynomial source.
    EXPECT_FALSE(build("RPC00A"));
    EXPECT_TRUE(CNitfExtension::isKnownExtension("rpc00a"));

    // "TESTING" of the known list matches the six characters TESTIN.
    EXPECT_TRUE(CNitfExtension::isKnownExtension("TESTIN"));
    EXPECT_FALSE(CNitfExtension::isKnownExtension("XYZABC"));
    EXPECT_FALSE(build("XYZABC"));
    EXPECT_FALSE(build("BLOCKA"));
}

TEST(ExtensionFramework, MetadataKeysAndValues) {
    auto event = parseTre("PIAEVA", kEvent);
    const std::string name(38 - 7, ' ');

    MetadataList both, neither;
    event->asMetadata(both.list, "IMAGE", "_2");
    event->asMetadata(neither.list, nullptr, nullptr);
    // Values keep their blanks; entries come in key order.
    EXPECT_EQ(both.entries(), (std::vector<std::string>{"IMAGE.PIAEVA_2.EVENTNAME=HARVEST" + name,
                                                        "IMAGE.PIAEVA_2.EVENTTYPE=SEASON  "}));
    EXPECT_EQ(neither.entries()[1], "PIAEVA.EVENTTYPE=SEASON  ");

    // An empty value (a label of length 0) has a property but no entry; the order is strcmp order, not file
    // order.
    std::string engineering =
        padText("SOURCE", 20) + "001" + "00" + "0001" + "0001" + "A" + "1" + "NA" + padNumber(1, 8) + "X";
    auto records = parseTre("ENGRDA", engineering);
    EXPECT_TRUE(hasField(*records, "ENGLBL_1"));
    MetadataList list;
    records->asMetadata(list.list, nullptr, nullptr);
    std::vector<std::string> entries = list.entries();
    EXPECT_EQ(entries.size(), 10u);
    EXPECT_TRUE(std::is_sorted(entries.begin(), entries.end()));
    EXPECT_EQ(
        std::count_if(entries.begin(), entries.end(),
                      [](const std::string& entry) { return entry.find("ENGLBL") != std::string::npos; }),
        0);
}

TEST(ExtensionFramework, CopiesShareUntilOneRereads) {
    std::string file = kEvent + padText("FLOOD", 38) + padText("DISASTER", 8);
    ByteStream stream(file);
    CNitfTag first, second;
    first.setIdentifier("PIAEVA");
    first.setDataLength(46);
    second.setIdentifier("PIAEVA");
    second.setDataOffset(46);
    second.setDataLength(46);

    auto original = std::make_unique<CPIAEVAExtension>();
    original->prepare(&first);
    original->readNewInfo(stream.get(), false);
    auto copy = std::make_unique<CPIAEVAExtension>(*original);
    EXPECT_EQ(FindProperty(copy->getProperties(), "EVENTNAME"),
              FindProperty(original->getProperties(), "EVENTNAME"));
    EXPECT_EQ(copy->getDataLength(), 46);

    // Re-reading the copy gives it its own values and leaves the original's alone.
    copy->prepare(&second);
    copy->readNewInfo(stream.get(), false);
    EXPECT_EQ(field(*copy, "EVENTTYPE"), "DISASTER");
    EXPECT_EQ(field(*original, "EVENTTYPE"), "SEASON  ");

    // The original outlives a copy that shares its values (no double release under the sanitizers).
    auto sharer = std::make_unique<CPIAEVAExtension>(*original);
    original.reset();
    EXPECT_EQ(field(*sharer, "EVENTNAME").substr(0, 7), "HARVEST");
}

TEST(ExtensionFramework, RereadingReplacesValuesAndKeepsKeys) {
    std::string one = padText("P", 80) + "AB" + "2" + padNumber(1, 15) + padNumber(2, 15) + padNumber(3, 15) +
                      padNumber(4, 15);
    std::string two = padText("Q", 80) + "AB" + "1" + padNumber(9, 15) + padNumber(5, 15) + padNumber(6, 15);
    ByteStream stream(one + two);
    CNitfTag tag;
    tag.setIdentifier("PRJPSB");
    tag.setDataLength(static_cast<long long>(one.size()));
    std::unique_ptr<CNitfExtension> projection(CNitfExtension::Build(&tag));
    projection->readNewInfo(stream.get(), false);
    EXPECT_EQ(projection->getReadLength(), static_cast<long long>(one.size()));
    const char* key = projection->getProperties().find(const_cast<char*>("PRJ_1"))->first;

    tag.setDataOffset(static_cast<long long>(one.size()));
    tag.setDataLength(static_cast<long long>(two.size()));
    projection->prepare(&tag);
    projection->readNewInfo(stream.get(), false);
    EXPECT_EQ(projection->getProperties().find(const_cast<char*>("PRJ_1"))->first, key);
    EXPECT_EQ(field(*projection, "PRJ_1"), padNumber(9, 15));
    EXPECT_EQ(field(*projection, "XOR"), padNumber(5, 15));
    // A name of the first read only stays as it was.
    EXPECT_EQ(field(*projection, "PRJ_2"), padNumber(2, 15));
}

// (Nothing is read for a length of 0: see the parsers' robustness tests.)
TEST(ExtensionFramework, ReadsThroughTheFile) {
    struct File : CNitfFile {
        FILE* fp;
        explicit File(FILE* stream) : fp(stream) {}
        FILE* getInputStream() override { return fp; }
        FILE* getOutputStream() override { return nullptr; }
        void close() override {}
        CNitfFileHeader* getFileHeader() override { return nullptr; }
    };
    ByteStream stream("xxxx" + kEvent);
    File file(stream.get());
    auto event = build("PIAEVA", 4, 46);
    event->readNewInfo(&file, true);
    EXPECT_EQ(field(*event, "EVENTTYPE"), "SEASON  ");
}
