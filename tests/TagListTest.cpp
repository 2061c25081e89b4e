#include <gtest/gtest.h>

#include <list>
#include <string>

#include "HostFile.h"
#include "NitfTag.h"
#include "TestFiles.h"

namespace {

std::string tre(const std::string& tag, const std::string& data) {
    char cel[6];
    std::snprintf(cel, sizeof cel, "%05zu", data.size());
    return tag + cel + data;
}

CNitfTag* named(const char* identifier) {
    CNitfTag* tag = new CNitfTag;
    tag->setIdentifier(identifier);
    return tag;
}

} // namespace

TEST(TagList, ReadsAreaAndNumbersRepeatedIdentifiers) {
    std::string area = tre("ABCDEF", "xyz") + tre("OTHER1", "") + tre("abcdef", "12345") + tre("ABCDEF", "q");
    ByteStream in(area);
    std::list<CNitfTag*> list;
    EXPECT_EQ(
        CNitfTag::readArea(in, static_cast<long long>(area.size()), CNitfTag::eTagSourceImage, list, true),
        static_cast<long long>(area.size()));
    ASSERT_EQ(list.size(), 4u);

    auto it = list.begin();
    CNitfTag* first = *it++;
    CNitfTag* other = *it++;
    CNitfTag* lower = *it++;
    CNitfTag* third = *it++;
    EXPECT_EQ(first->getDataOffset(), 11);
    EXPECT_EQ(first->getDataLength(), 3);
    EXPECT_EQ(other->getDataLength(), 0);
    EXPECT_EQ(other->getDataOffset(), 25) << "a zero-length TRE is followed immediately by the next";
    EXPECT_FALSE(other->hasOccurrence());
    EXPECT_EQ(other->getTotal(), 0);

    // Numbering ignores case; all three report the final total.
    EXPECT_EQ(first->getOccurrence(), 1);
    EXPECT_EQ(lower->getOccurrence(), 2);
    EXPECT_EQ(third->getOccurrence(), 3);
    EXPECT_EQ(first->getTotal(), 3);
    EXPECT_EQ(lower->getTotal(), 3);
    EXPECT_EQ(third->getTotal(), 3);
    EXPECT_EQ(first->getSource(), CNitfTag::eTagSourceImage);

    // ... while find compares exactly.
    EXPECT_EQ(CNitfTag::find("ABCDEF", list), first);
    EXPECT_EQ(CNitfTag::find("abcdef", list), lower);
    EXPECT_EQ(CNitfTag::find("NOPE", list), nullptr);
    EXPECT_EQ(CNitfTag::computeListDataLengths(&list), 9);
    EXPECT_EQ(CNitfTag::computeListTotalLengths(&list), 9 + 44);
    CNitfTag::destroyList(list);

    std::list<CNitfTag*> empty;
    EXPECT_EQ(CNitfTag::computeListTotalLengths(&empty), 0);
    EXPECT_EQ(CNitfTag::find("ABCDEF", empty), nullptr);
}

TEST(TagList, DamagedAreasEndWithoutLooping) {
    // A negative CEL must not walk backwards; an area longer than the file ends at the end of the file.
    std::string area = std::string("BADTRE-0100") + tre("GOODIE", "ab");
    ByteStream in(area);
    std::list<CNitfTag*> list;
    CNitfTag::readArea(in, 99999, CNitfTag::eTagSourceFileHeader, list, true);
    ASSERT_EQ(list.size(), 2u);
    EXPECT_EQ(list.front()->getDataLength(), 0);
    EXPECT_STREQ(list.back()->getIdentifier(), "GOODIE");
    CNitfTag::destroyList(list);
}

TEST(TagList, IdentifiersSourcesAndWriting) {
    CNitfTag tag;
    tag.setIdentifier("ACFTB");
    EXPECT_EQ(std::string(tag.getIdentifier(), 7), std::string("ACFTB\0\0", 7)) << "strncpy fills with NUL";
    tag.setIdentifier("TOOLONGNAME");
    EXPECT_STREQ(tag.getIdentifier(), "TOOLON");

    for (int s = 0; s <= 8; ++s) {
        tag.setSource(static_cast<CNitfTag::eTagSource_t>(s));
        EXPECT_EQ(tag.fromDES(), s > 0 && s % 2 == 0) << "source " << s;
    }

    ByteStream out("");
    CNitfTag record;
    record.setIdentifier("WRITES");
    record.setDataLength(123);
    EXPECT_EQ(record.write(out), 134);
    EXPECT_EQ(DKFTell(out), 134);
    EXPECT_EQ(record.getDataOffset(), 11);
    DKFSeek64(out, 0, SEEK_SET);
    char header[12] = {0};
    ASSERT_EQ(DKFRead(header, 1, 11, out), 11u);
    EXPECT_STREQ(header, "WRITES00123");

    std::list<CNitfTag*> list{named("RPC00B"), named("TESTIN")};
    EXPECT_TRUE(list.front()->isKnownExtension());
    EXPECT_TRUE(list.back()->isKnownExtension()) << "TESTIN matches the six characters of TESTING";
    CNitfTag unknown;
    unknown.setIdentifier("XYZABC");
    EXPECT_FALSE(unknown.isKnownExtension());
    CNitfTag::destroyList(list);
}
