#include <gtest/gtest.h>

#include <cstring>
#include <string>

#include "BitStream.h"
#include "HostFile.h"
#include "Serializable.h"
#include "SerializableArray.h"
#include "SerializerFileRaw.h"
#include "SerializerQuery.h"
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

struct Outer : nitf::CSerializable {
    Record first, second;
    void serialize(nitf::CSerializer& out) override { out << 'x' << first << second; }
    void deserialize(nitf::CSerializer& in) override {
        char c;
        in >> c >> first >> second;
    }
};

std::string contents(FILE* fp) {
    long long end = DKFTell(fp);
    DKFSeek64(fp, 0, SEEK_SET);
    std::string bytes(static_cast<size_t>(end), '\0');
    DKFRead(&bytes[0], 1, bytes.size(), fp);
    return bytes;
}

} // namespace

TEST(Serializer, SwappingWritesBigEndianButNeverSwapsArrays) {
    ByteStream out("");
    nitf::CSerializerFileRaw raw(out, true);
    Record record;
    raw << record << 1.0;
    std::string bytes = contents(out);
    EXPECT_EQ(bytes.substr(0, 9), std::string("\x01\x02\x03\x04\x05\x06"
                                              "ABC",
                                              9));
    EXPECT_EQ(bytes.substr(9), std::string("\x3F\xF0\0\0\0\0\0\0", 8));

    raw.seek(0);
    Record back;
    back.a = 0;
    back.b = 0;
    std::memset(back.name, 0, 3);
    raw >> back;
    EXPECT_EQ(back.a, 0x01020304);
    EXPECT_EQ(back.b, 0x0506);
    EXPECT_EQ(std::string(back.name, 3), "ABC");
    EXPECT_EQ(raw.tell(), 9);

    ByteStream host("");
    nitf::CSerializerFileRaw plain(host, false);
    plain << 0x01020304;
    EXPECT_EQ(contents(host), std::string("\x04\x03\x02\x01", 4));
}

TEST(Serializer, QueryMeasuresRegisteredObjects) {
    Outer outer;
    nitf::CSerializerQuery query;
    query.addQuery(&outer.second);
    query << outer;
    EXPECT_EQ(query.tell(), 1 + 9 + 9);
    nitf::SerializerQueryInfo_t* info = query.getQueryInfo(&outer.second);
    ASSERT_NE(info, nullptr);
    EXPECT_TRUE(info->found);
    EXPECT_EQ(info->offset, 10);
    EXPECT_EQ(info->length, 9);
    EXPECT_EQ(query.getQueryInfo(&outer.first), nullptr) << "never registered";

    nitf::CSerializerQuery unused;
    unused.addQuery(&outer);
    EXPECT_EQ(unused.getQueryInfo(&outer), nullptr) << "registered but never serialized";
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
