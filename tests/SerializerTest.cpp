#include <gtest/gtest.h>

#include <cstring>
#include <string>

#include "BitStream.h"
#include "HostFile.h"
#include "Serializable.h"
#include "SerializableArray.h"
#include "SerializerFileRaw.h"
#include "TestFiles.h"

namespace {

struct Record : nitf::CSerializable {
    int a = 0x01020304;
    short b = 0x0506;
    char name[3] = {'A', 'B', 'C'};
    void serialize(nitf::CSerializer& out) override { out << a << b << nitf::CSerializableArray(name, 3); }
    void deserialize(nitf::CSerializer& in) override {
        nitf::CSerializableArray array(name, 3);
        in >> a >> b >> array;
    }
};

} // namespace

// (Queries, and records of every number type, are checked with the record engine.)
TEST(Serializer, SwappingWritesBigEndianButNeverSwapsArrays) {
    ByteStream out("");
    nitf::CSerializerFileRaw raw(out, true);
    Record record;
    raw << record << 1.0;
    EXPECT_EQ(out.contents(), std::string("\x01\x02\x03\x04\x05\x06"
                                          "ABC"
                                          "\x3F\xF0\0\0\0\0\0\0",
                                          17));
    raw.seek(0);
    Record back;
    back.a = back.b = 0;
    back.name[0] = 0;
    raw >> back;
    EXPECT_EQ(back.a, 0x01020304);
    EXPECT_EQ(back.b, 0x0506);
    EXPECT_EQ(std::string(back.name, 3), "ABC");
    EXPECT_EQ(raw.tell(), 9);
}

TEST(Serializer, BitStreamReadsAndWritesMostSignificantFirst) {
    unsigned char bytes[] = {0xAB, 0xCD};
    CBitStream in(bytes);
    EXPECT_EQ(in.read16(0), 0);
    EXPECT_EQ(in.read16(12), 0xABC);
    EXPECT_EQ(in.getPosition(), bytes + 1);
    EXPECT_EQ(in.getMask(), 8);
    EXPECT_EQ(in.read16(4), 0xD);

    unsigned char out[3] = {0xFF, 0x00, 0x0F};
    CBitStream writer(out);
    writer.write16(0x0, 4);
    writer.write16(0xDEF, 12);
    EXPECT_EQ(out[0], 0x0D);
    EXPECT_EQ(out[1], 0xEF);
    EXPECT_EQ(out[2], 0x0F) << "bits beyond the written ones are left alone";
}
