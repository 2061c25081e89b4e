// Every corpus file header and image sub-header written back through `write`: the bytes written equal
// computeStorageLength, the written bytes read back to the same fields, and they equal the original where the
// writing rules reproduce it.
//
// The writers' rules decide which originals come back byte for byte. A file header is written with its image
// table only (no other segments, no TREs), so only files of image segments without file-level TREs, whose FL
// counts just the header and the images, qualify. An image sub-header is written in the layout of its class
// with IREP computed from the bands and look-up tables, no comments, IFCn "N", IMFLTn blank, a single band's
// IREPBAND "M"/"LU" and look-up table, no look-up tables for several bands, every TRE in the user-defined
// area and IXSHDL "00000"; sub-headers that already have that form qualify.
#include <gtest/gtest.h>

#include <cstdio>
#include <memory>
#include <set>
#include <string>

#include "HostError.h"
#include "HostFile.h"
#include "Manifest.h"
#include "NitfFileHeader.h"
#include "NitfFileHeaderV20.h"
#include "NitfFileHeaderV21.h"
#include "NitfFileReader.h"
#include "NitfImageSubheader.h"
#include "NitfImageSubheaderV20.h"
#include "NitfImageSubheaderV21.h"
#include "TestFiles.h"

namespace {

// A value's bytes as held, NULs included.
std::string textOf(PropertyMap& map, const std::string& key) {
    CNitfProperty* value = FindProperty(map, key.c_str());
    if (!value)
        return "(absent)";
    if (value->getDataType() == CNitfProperty::eString || value->getDataType() == CNitfProperty::eChars)
        return std::string(value->getBytes(), value->getStoredLength());
    return value->toText();
}

std::string bandKey(const char* name, int band, int count) {
    char* key = CNitfImageSubheader::bandFieldName(name, band, count);
    std::string text(key);
    free(key);
    return text;
}

// The fields whose written values the writer computes instead of copying.
std::set<std::string> computedImageFields(CNitfImageSubheader& subheader) {
    std::set<std::string> fields = {"IREP", "NICOM", "UDIDL", "IXSHDL"};
    int bands = subheader.getBandCount();
    for (int band = 1; band <= bands; ++band) {
        for (const char* name : {"IFC", "IMFLT", "NLUTS", "NELUT"})
            fields.insert(bandKey(name, band, bands));
        if (bands == 1)
            fields.insert(bandKey("IREPBAND", band, bands));
    }
    return fields;
}

struct Counts {
    int written = 0;
    int identical = 0;
};

void checkImage(const CorpusFile& file, CNitfFileHeader& header, FILE* in, int index, Counts& counts) {
    SCOPED_TRACE(file.relative + " image " + std::to_string(index));
    std::unique_ptr<CNitfImageSubheader> original(header.getNewImageSubheader(in, index));
    ASSERT_TRUE(original);
    const std::string whole = readWholeFile(file.path);
    const CNitfHeaderDataPair* pair = header.getImageHeaderDataPair(index);
    const std::string originalBytes = whole.substr(pair->getHeaderOffset(), pair->getHeaderLength());

    // The TRE data and look-up tables go where the writer left room for them: keep where they were.
    std::vector<std::pair<long long, long long>> treData;
    for (CNitfTag* tag : original->getTaggedRecords())
        treData.emplace_back(tag->getDataOffset(), tag->getDataLength());
    CNitfLutSource* lut = original->getLutSource(0);
    const long long lutOffset = lut ? lut->getEntryOffset() : 0;

    __int64 expectedLength = original->computeStorageLength();
    CNitfProperty* extended = FindProperty(original->getProperties(), "IXSHDL");
    if (extended && extended->getAsInt() > 0)
        expectedLength -= extended->getAsInt(); // the documented over-count of a sub-header read from a file

    ByteStream out("");
    original->write(out);
    EXPECT_EQ(DKFTell(out), expectedLength) << "bytes written against computeStorageLength";
    ++counts.written;

    auto put = [&](long long at, long long from, long long length) {
        DKFSeek64(out, at, SEEK_SET);
        const std::string data = whole.substr(from, length);
        DKFWrite(data.data(), 1, data.size(), out);
    };
    size_t t = 0;
    for (CNitfTag* tag : original->getTaggedRecords()) {
        put(tag->getDataOffset(), treData[t].first, treData[t].second);
        ++t;
    }
    if (lut && original->getBandCount() == 1)
        put(lut->getEntryOffset(), lutOffset, lut->getSize());

    // Read back: the same fields, but those the writer computes; the same TREs in the same order.
    DKFSeek64(out, 0, SEEK_SET);
    std::unique_ptr<CNitfImageSubheader> reread(
        header.getVersion() == eNitfVersion20 ? static_cast<CNitfImageSubheader*>(new CNitfImageSubheaderV20)
                                              : new CNitfImageSubheaderV21);
    eNitfVersion_t written = header.getVersion() == eOsdeVersion01 ? eNitfVersion21 : header.getVersion();
    reread->read(out, written);
    std::set<std::string> computed = computedImageFields(*original);
    if (header.getVersion() != eOsdeVersion01) {
        for (auto& entry : original->getProperties()) {
            if (!computed.count(entry.first)) {
                EXPECT_EQ(textOf(reread->getProperties(), entry.first),
                          textOf(original->getProperties(), entry.first))
                    << entry.first;
            }
        }
    }
    ASSERT_EQ(reread->getTaggedRecords().size(), original->getTaggedRecords().size());
    auto a = original->getTaggedRecords().begin();
    for (CNitfTag* tag : reread->getTaggedRecords()) {
        EXPECT_STREQ(tag->getIdentifier(), (*a)->getIdentifier());
        EXPECT_EQ(tag->getDataLength(), (*a)->getDataLength());
        ++a;
    }

    counts.identical += out.contents().substr(0, expectedLength) == originalBytes;
}

} // namespace

TEST(RecordRoundTrip, EveryCorpusImageSubheaderWritesItsStorageLengthAndReadsBack) {
    SKIP_WITHOUT_CORPUS();
    const Manifest& manifest = Manifest::get();
    Counts counts;
    for (const CorpusFile& file : manifest.wellFormed()) {
        CNitfFileReader reader;
        if (!openCorpusFile(reader, file))
            continue;
        CNitfFileHeader* header = reader.getFileHeader();
        for (int i = 0; i < header->getImageCount(); ++i)
            checkImage(file, *header, reader.getInputStream(), i, counts);
    }
    // The sub-headers already of the written form (see above) come back byte for byte.
    EXPECT_EQ(counts.written, 103);
    EXPECT_EQ(counts.identical, 45);
}

TEST(RecordRoundTrip, EveryCorpusFileHeaderWritesItsStorageLengthAndReadsBack) {
    SKIP_WITHOUT_CORPUS();
    const Manifest& manifest = Manifest::get();
    int written = 0, identical = 0;
    for (const CorpusFile& file : manifest.wellFormed()) {
        SCOPED_TRACE(file.relative);
        CNitfFileReader reader;
        if (!openCorpusFile(reader, file))
            continue;
        CNitfFileHeader* header = reader.getFileHeader();
        if (header->getVersion() == eNitfVersion11)
            continue; // recognised, not interpreted: nothing to write
        ByteStream out("");
        header->write(out);
        ASSERT_EQ(DKFTell(out), header->computeStorageLength());
        ++written;

        DKFSeek64(out, 0, SEEK_SET);
        std::unique_ptr<CNitfFileHeader> reread(header->getVersion() == eNitfVersion20
                                                    ? static_cast<CNitfFileHeader*>(new CNitfFileHeaderV20)
                                                    : new CNitfFileHeaderV21(header->getVersion()));
        reread->read(out, nullptr);
        // The lengths are computed, and the other segments and TREs are deliberately not written.
        static const std::set<std::string> rewritten = {"FL",   "HL",     "NUMS",   "NUMX",  "NUML",
                                                        "NUMT", "NUMDES", "NUMRES", "UDHDL", "XHDL"};
        for (auto& entry : header->getProperties()) {
            if (!rewritten.count(entry.first)) {
                EXPECT_EQ(textOf(reread->getProperties(), entry.first),
                          textOf(header->getProperties(), entry.first))
                    << entry.first;
            }
        }
        ASSERT_EQ(reread->getImageCount(), header->getImageCount());
        for (int i = 0; i < header->getImageCount(); ++i) {
            EXPECT_EQ(reread->getImageHeaderDataPair(i)->getHeaderLength(),
                      header->getImageHeaderDataPair(i)->getHeaderLength());
            EXPECT_EQ(reread->getImageHeaderDataPair(i)->getDataLength(),
                      header->getImageHeaderDataPair(i)->getDataLength());
        }

        identical += out.contents() == readWholeFile(file.path).substr(0, out.contents().size());
    }
    // Files of image segments only, without file-level TREs (see above), come back byte for byte.
    EXPECT_EQ(written, 108);
    EXPECT_EQ(identical, 77);
}
