// The extension framework: which identifiers are built, and copies that share values until one re-reads.
// (Reading through a file, as the JPEG source reads IOMAPA, is checked with the amplitude mapping.)
#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <vector>

#include "NitfExtension.h"
#include "NitfTag.h"
#include "PIAEVAExtension.h"
#include "RPFIMGExtension.h"
#include "TestFiles.h"
#include "TreBytes.h"

namespace {

std::unique_ptr<CNitfExtension> build(const char* identifier) {
    CNitfTag tag;
    tag.setIdentifier(identifier);
    return std::unique_ptr<CNitfExtension>(CNitfExtension::Build(&tag));
}

const std::string kEvent = padText("HARVEST", 38) + padText("SEASON", 8);

} // namespace

TEST(ExtensionFramework, BuildChoosesTheParserByIdentifier) {
    const std::vector<const char*> names = CNitfExtension::getBuiltExtensionNames();
    EXPECT_GE(names.size(), 41u);
    for (const char* name : names) {
        auto extension = build(name);
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
