#include <gtest/gtest.h>

#include <list>
#include <string>
#include <vector>

#include "HostFile.h"
#include "NitfTag.h"
#include "TestFiles.h"

namespace {

std::string tre(const std::string& tag, const std::string& data) {
    char cel[6];
    std::snprintf(cel, sizeof cel, "%05zu", data.size());
    return tag + cel + data;
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
    const std::vector<CNitfTag*> tags(list.begin(), list.end());
    EXPECT_EQ(tags[0]->getDataOffset(), 11);
    EXPECT_EQ(tags[0]->getDataLength(), 3);
    EXPECT_EQ(tags[1]->getDataOffset(), 25) << "a zero-length TRE is followed immediately by the next";
    EXPECT_FALSE(tags[1]->hasOccurrence());
    // Numbering ignores case; all three report the final total; find compares exactly.
    for (int i : {0, 2, 3}) {
        EXPECT_EQ(tags[i]->getOccurrence(), i == 0 ? 1 : i);
        EXPECT_EQ(tags[i]->getTotal(), 3);
    }
    EXPECT_EQ(CNitfTag::find("abcdef", list), tags[2]);
    EXPECT_EQ(CNitfTag::find("NOPE", list), nullptr);
    EXPECT_EQ(CNitfTag::computeListDataLengths(&list), 9);
    EXPECT_EQ(CNitfTag::computeListTotalLengths(&list), 9 + 44);
    CNitfTag::destroyList(list);
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
