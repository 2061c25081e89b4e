// Every TRE of the conformance corpus that the library parses consumes exactly its length. (Fields are
// checked against bytes built by hand in the layout tests; which TREs each segment holds, against the
// manifest with the file structure.)
#include <gtest/gtest.h>

#include <cstdio>
#include <list>
#include <map>
#include <memory>
#include <set>
#include <string>

#include "HostError.h"
#include "Manifest.h"
#include "NitfDataExtensionSource.h"
#include "NitfExtension.h"
#include "NitfFileReader.h"
#include "NitfImageSubheader.h"
#include "NitfSymbolSource.h"
#include "NitfTag.h"
#include "NitfTestFile.h"
#include "NitfTextSource.h"
#include "TestFiles.h"

namespace {

// Parses each TRE of the list that the library parses (as trimmed names, the four- and five-letter
// identifiers are built too), counting them by name.
void parseAll(const std::list<CNitfTag*>& tags, FILE* in, const std::string& where,
              std::map<std::string, int>& parsed) {
    for (const CNitfTag* tag : tags) {
        const std::string name = trimmed(tag->getIdentifier());
        CNitfTag trimmed;
        trimmed.setIdentifier(name.c_str());
        trimmed.setDataOffset(tag->getDataOffset());
        trimmed.setDataLength(tag->getDataLength());
        std::unique_ptr<CNitfExtension> extension(CNitfExtension::Build(&trimmed));
        if (!extension)
            continue;
        extension->readNewInfo(in, false);
        EXPECT_EQ(extension->getReadLength(), tag->getDataLength()) << where << ": " << name;
        EXPECT_FALSE(extension->getProperties().empty()) << where << ": " << name;
        ++parsed[name];
    }
}

} // namespace

TEST(TreCorpus, EveryParsedTreConsumesItsLength) {
    SKIP_WITHOUT_CORPUS();
    CapturedWarnings quiet;
    std::map<std::string, int> parsed;
    for (const CorpusFile& file : Manifest::get().wellFormed()) {
        CNitfFileReader reader;
        if (!openCorpusFile(reader, file))
            continue;
        CNitfFileHeader* header = reader.getFileHeader();
        FILE* in = reader.getInputStream();
        parseAll(header->getTaggedRecords(), in, file.relative, parsed);
        for (int i = 0; i < header->getImageCount(); ++i)
            parseAll(
                std::unique_ptr<CNitfImageSubheader>(header->getNewImageSubheader(in, i))->getTaggedRecords(),
                in, file.relative, parsed);
        for (int i = 0; i < header->getSymbolCount(); ++i)
            parseAll(std::unique_ptr<CNitfSymbolSource>(reader.getNewSymbolSource(i))->getTaggedRecords(), in,
                     file.relative, parsed);
        for (int i = 0; i < header->getTextCount(); ++i)
            parseAll(std::unique_ptr<CNitfTextSource>(reader.getNewTextSource(i))->getTaggedRecords(), in,
                     file.relative, parsed);
        for (int i = 0; i < header->getDataExtensionCount(); ++i)
            parseAll(std::unique_ptr<CNitfDataExtensionSource>(reader.getNewDataExtensionSource(i))
                         ->getOverflowTags(),
                     in, file.relative, parsed);
    }
    int total = 0;
    std::set<std::string> names;
    for (const auto& [name, count] : parsed) {
        std::printf("  %s x %d\n", name.c_str(), count);
        total += count;
        names.insert(name);
    }
    EXPECT_EQ(total, 40);
    EXPECT_EQ(names, (std::set<std::string>{"ACFTB", "AIMIDB", "ENGRDA", "GEOPSB", "HISTOA", "IMUDTG",
                                            "IMXDTG", "J2KLRA", "MHUDTG", "MHXDTG", "PIAIMB", "PIAPEA",
                                            "PIAPRC", "RPFHDR", "RPFIMG"}));
}
