// The record engine on layouts made here: what it writes reads back to the same fields, its measured length
// is the bytes written, binary records go through the serializer family, and values show as people read
// them.
#include <gtest/gtest.h>

#include <string>

#include "HostError.h"
#include "HostFile.h"
#include "KeyStore.h"
#include "NitfField.h"
#include "RecordLayout.h"
#include "SerializerFileRaw.h"
#include "SerializerQuery.h"
#include "TestFiles.h"

using namespace record;

namespace {

// clang-format off
// Text, a count of band fields with a fallback, a condition, typed bytes and binary numbers, a hole.
const Entry kBands[] = {
    Text("NAME", 6),
    Text("NBANDS", 1),
    IfText("NBANDS", "0"),
        Text("XBANDS", 3),
    End(),
    RepeatBands("NBANDS", "XBANDS"),
        Text("CODE", 2),
        Text("NLUT", 1),
        IfNotZero("NLUT"),
            PlaceSizedByProduct("TABLE", "NLUT", "NLUT"),
        End(),
    End(),
    Bytes("COLOUR", 3, kTyped),
    Unsigned("COUNT", 2, kTyped),
    Text("CORNER", 4, kHole),
    Text("TAIL", 2)
};
// A binary record as the RPF sections are: numbers of every width, a double, a float and raw bytes.
const Entry kBinary[] = {
    Unsigned("ONE", 1),
    Unsigned("TWO", 2),
    Unsigned("FOUR", 4),
    Unsigned("EIGHT", 8),
    Double("REAL"),
    Float("SINGLE"),
    Bytes("RAW", 3),
    Repeat("ONE"),
        Signed("ITEM", 2),
    End()
};
// clang-format on

struct Values {
    PropertyMap map;
    CKeyStore keys;
    ~Values() { DestroyPropertyMap(map); }
    std::string text(const char* key) {
        CNitfProperty* value = FindProperty(map, key);
        return value ? std::string(value->getBytes() ? value->getBytes() : "", value->getStoredLength())
                     : "(absent)";
    }
};

} // namespace

TEST(RecordLayout, WhatIsWrittenReadsBackAndMeasuresAsWritten) {
    static const CRecordLayout layout(kBands);
    // Twelve bands: the count goes to XBANDS and the keys are padded to two digits.
    std::string bytes = "ABCDEF0012";
    for (int band = 1; band <= 12; ++band)
        bytes += band == 3 ? std::string("LU2") + "wxyz" : "M 0";
    bytes += std::string("\xFF\x80\x00", 3) + std::string("\x01\x02", 2) + "N45E" + "ZZ";
    ByteStream in(bytes);
    Values read;
    std::vector<NitfField_t> fields;
    std::vector<Placed> places;
    Report report;
    report.fields = &fields;
    report.places = &places;
    EXPECT_EQ(layout.read(in, read.map, read.keys, report), static_cast<long long>(bytes.size()));
    EXPECT_EQ(read.text("XBANDS"), "012");
    EXPECT_EQ(read.text("CODE03"), "LU");
    EXPECT_EQ(read.text("CODE12"), "M ");
    EXPECT_EQ(FindProperty(read.map, "COLOUR")->getDataType(), CNitfProperty::eChars);
    EXPECT_EQ(FindProperty(read.map, "COUNT")->getAsInt(), 0x0102);
    ASSERT_EQ(places.size(), 2u); // the table not kept, and the hole
    EXPECT_EQ(places[0].index, 3);
    EXPECT_EQ(places[0].width, 4);
    EXPECT_STREQ(places[1].entry->name, "CORNER");
    EXPECT_STREQ(fields.front().name, "NAME");
    EXPECT_STREQ(fields.back().name, "TAIL");
    EXPECT_EQ(fields.back().offset, static_cast<long long>(bytes.size()) - 2);

    // Written back, the hole left for the table stays as the stream had it; everything else is the same.
    ByteStream out("");
    long long written = layout.write(out, read.map);
    EXPECT_EQ(written, layout.length(read.map));
    EXPECT_EQ(written, static_cast<long long>(bytes.size()));
    std::string copy = out.contents();
    size_t table = bytes.find("wxyz");
    EXPECT_EQ(copy.substr(0, table), bytes.substr(0, table));
    EXPECT_EQ(copy.substr(table + 4), bytes.substr(table + 4));
}

TEST(RecordLayout, ComputedValuesHolesAndNumbersThatDoNotFit) {
    static const CRecordLayout layout(kBands);
    Values values;
    SetProperty(values.map, "NAME", new CNitfProperty("X"));
    SetProperty(values.map, "NBANDS", new CNitfProperty(2));
    SetProperty(values.map, "COLOUR", new CNitfProperty("FF8000")); // typed bytes as text: hexadecimal
    PropertyMap overrides;
    SetProperty(overrides, "CODE2", new CNitfProperty("RG"));

    ByteStream out("");
    long long written = layout.write(out, values.map, &overrides);
    EXPECT_EQ(written, layout.length(values.map, &overrides));
    // A field without a value is blank; one marked as a hole is passed over, so the stream ends before it
    // unless something follows.
    std::string bytes = out.contents();
    std::string expected = std::string("X     2") + "   " + "RG " + std::string("\xFF\x80\x00", 3) +
                           std::string(2, '\0') + std::string(4, '\0') + "  ";
    EXPECT_EQ(bytes, expected);

    SetProperty(values.map, "NBANDS", new CNitfProperty(10)); // ten does not fit one digit
    ByteStream again("");
    EXPECT_THROW(layout.write(again, values.map), vexo::Exception);
    DestroyPropertyMap(overrides);
}

TEST(RecordLayout, BinaryRecordsGoThroughTheSerializers) {
    static const CRecordLayout layout(kBinary);
    std::string bytes = std::string("\x02", 1) + std::string("\x01\x02", 2) +
                        std::string("\x01\x02\x03\x04", 4) +
                        std::string("\x00\x00\x00\x01\x00\x00\x00\x00", 8) +
                        std::string("\x40\x09\x21\xFB\x54\x44\x2D\x18", 8) +
                        std::string("\x3F\xC0\x00\x00", 4) + "abc" + std::string("\xFF\xFE\x00\x05", 4);
    // Read through a swapping raw serializer (the host is little-endian, the record big-endian).
    ByteStream in(bytes);
    nitf::CSerializerFileRaw reader(in, true);
    Values values;
    layout.deserialize(reader, values.map, values.keys);

    std::vector<NitfField_t> fields = {{"EIGHT", eFieldUnsigned, 8, 0},
                                       {"REAL", eFieldDouble, 8, 0},
                                       {"SINGLE", eFieldFloat, 4, 0},
                                       {"RAW", eFieldBytes, 3, 0},
                                       {"ITEM_1", eFieldSigned, 2, 0}};
    EXPECT_EQ(nitfFieldDisplayText(fields[0], FindProperty(values.map, "EIGHT")), "4294967296");
    EXPECT_EQ(nitfFieldDisplayText(fields[1], FindProperty(values.map, "REAL")), "3.14159265");
    EXPECT_EQ(nitfFieldDisplayText(fields[2], FindProperty(values.map, "SINGLE")), "1.5");
    EXPECT_EQ(nitfFieldDisplayText(fields[3], FindProperty(values.map, "RAW")), "616263");
    EXPECT_EQ(nitfFieldDisplayText(fields[4], FindProperty(values.map, "ITEM_1")), "-2");
    EXPECT_EQ(values.text("ITEM_2"), std::string("\x00\x05", 2));

    // Written the same way, the bytes are the record's; a query measures what the layout measures.
    ByteStream out("");
    nitf::CSerializerFileRaw writer(out, true);
    layout.serialize(writer, values.map);
    EXPECT_EQ(out.contents(), bytes);
    nitf::CSerializerQuery query;
    layout.serialize(query, values.map);
    EXPECT_EQ(query.tell(), layout.length(values.map));
    EXPECT_EQ(query.tell(), static_cast<long long>(bytes.size()));
}
