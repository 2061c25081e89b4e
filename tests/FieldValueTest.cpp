#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <string>

#include "HostError.h"
#include "HostFile.h"
#include "NitfProperty.h"
#include "TestFiles.h"

namespace {

// The exception a call raises, for checking its message, signature text and source file.
template <typename Call> vexo::Exception raisedBy(Call call) {
    try {
        call();
    } catch (const vexo::Exception& e) {
        return e;
    }
    ADD_FAILURE() << "no vexo::Exception was raised";
    return vexo::Exception("", "", "", 0);
}

std::string written(CNitfProperty& property, int width) {
    ByteStream stream("");
    property.writeString(stream, width);
    long long end = DKFTell(stream);
    DKFSeek64(stream, 0, SEEK_SET);
    std::string bytes(static_cast<size_t>(end), '\0');
    DKFRead(&bytes[0], 1, bytes.size(), stream);
    return bytes;
}

} // namespace

TEST(FieldValue, ReadersKeepTextAsReadAndSwapBinaryValues) {
    std::string bytes = std::string("AB  ") + std::string("\x01\x02", 2) +
                        std::string("\xFF\xFE\xFD\xFC", 4) + std::string("\x3F\xC0\x00\x00", 4) +
                        std::string("\x40\x09\x21\xFB\x54\x44\x2D\x18", 8) + "\x80";
    ByteStream in(bytes);

    CNitfProperty* text = CNitfProperty::getNewFromString(in, 4);
    EXPECT_EQ(text->getDataType(), CNitfProperty::eString);
    EXPECT_STREQ(text->getAsString(), "AB  ");
    EXPECT_EQ(text->getLength(), 4u);
    CNitfProperty* empty = CNitfProperty::getNewFromString(in, 0);
    EXPECT_STREQ(empty->getAsString(), "");

    CNitfProperty* u2 = CNitfProperty::getNewFromUint2(in);
    EXPECT_EQ(u2->getAsInt(), 0x0102);
    CNitfProperty* u4 = CNitfProperty::getNewFromUint4(in);
    EXPECT_EQ(u4->getDataType(), CNitfProperty::eInt4);
    EXPECT_EQ(u4->getAsInt(), static_cast<int>(0xFFFEFDFC));
    CNitfProperty* f = CNitfProperty::getNewFromFloat(in);
    EXPECT_FLOAT_EQ(f->getFloat(), 1.5f);
    CNitfProperty* d = CNitfProperty::getNewFromDouble(in);
    EXPECT_DOUBLE_EQ(d->getDouble(), M_PI);
    CNitfProperty* u1 = CNitfProperty::getNewFromUint1(in);
    EXPECT_EQ(u1->getAsInt(), 128);

    // Past the end of the file a text field is still terminated and holds no stale bytes.
    CNitfProperty* past = CNitfProperty::getNewFromString(in, 3);
    EXPECT_EQ(past->getLength(), 0u);
    CNitfProperty* chars = CNitfProperty::getNewFromChars(in, 0);
    EXPECT_EQ(chars->getDataType(), CNitfProperty::eChars);
    EXPECT_EQ(chars->getLength(), 0u);

    for (CNitfProperty* p : {text, empty, u2, u4, f, d, u1, past, chars})
        delete p;
}

TEST(FieldValue, ConversionsFollowAtoiAndHexRules) {
    CNitfProperty padded("  12");
    EXPECT_EQ(padded.getAsInt(), 12);
    EXPECT_EQ(padded.getAsInt64(), 12);
    EXPECT_DOUBLE_EQ(padded.getAsDouble(), 12.0);
    CNitfProperty letters("ABC");
    EXPECT_EQ(letters.getAsInt(), 0);
    EXPECT_DOUBLE_EQ(letters.getAsDouble(), 0.0);
    CNitfProperty huge("99999999999999999999");
    EXPECT_EQ(huge.getAsInt(), 2147483647) << "overflow saturates instead of wrapping";

    ByteStream in(std::string("\x00\xFF\x10", 3));
    CNitfProperty* bytes = CNitfProperty::getNewFromChars(in, 3);
    const char* hex = bytes->getAsString();
    EXPECT_STREQ(hex, "00FF10");
    free(const_cast<char*>(hex));
    delete bytes;

    CNitfProperty negative(-5);
    EXPECT_EQ(negative.toText(), "-5");
    EXPECT_EQ(negative.getAsInt64(), -5);
}

TEST(FieldValue, FailuresCarryFixedMessagesAndSignatures) {
    CNitfProperty none;
    vexo::Exception e = raisedBy([&] { none.getLength(); });
    EXPECT_STREQ(e.what(), "Unknown data, can't get length.");
    EXPECT_STREQ(e.getSignature(), "unsigned __int64 __cdecl CNitfProperty::getLength(void)");
    EXPECT_STREQ(e.getFile(), "nitf/lib/NitfProperty");
    EXPECT_GT(e.getLine(), 0);

    EXPECT_STREQ(raisedBy([&] { none.getAsString(); }).what(), "Unknown data, can't return as string");
    EXPECT_STREQ(raisedBy([&] { none.getAsInt(); }).getSignature(),
                 "int __cdecl CNitfProperty::getAsInt(void)");
    EXPECT_STREQ(raisedBy([&] { none.getAsDouble(); }).what(), "Unknown data, can't return as double");

    // A float converts to int and double but not to int64.
    ByteStream in(std::string("\xC0\x20\x00\x00", 4));
    CNitfProperty* f = CNitfProperty::getNewFromFloat(in);
    EXPECT_EQ(f->getAsInt(), -2);
    EXPECT_DOUBLE_EQ(f->getAsDouble(), -2.5);
    vexo::Exception e64 = raisedBy([&] { f->getAsInt64(); });
    EXPECT_STREQ(e64.what(), "Unknown data, can't return as int64");
    EXPECT_STREQ(e64.getSignature(), "__int64 __cdecl CNitfProperty::getAsInt64(void)");
    delete f;

    ByteStream chars(std::string("AB", 2));
    CNitfProperty* raw = CNitfProperty::getNewFromChars(chars, 2);
    EXPECT_THROW(raw->getAsInt(), vexo::Exception);
    EXPECT_THROW(raw->getAsDouble(), vexo::Exception);
    delete raw;
}

TEST(FieldValue, SecurityWordsAndCharacterTests) {
    const char* cases[][2] = {{"U", "Unclassified"},
                              {"R", "Restricted"},
                              {"C", "Confidential"},
                              {"S", "Secret"},
                              {"T", "Top Secret"},
                              {"XN", "NATO"},
                              {"X ", "Unknown Classification"},
                              {"", "Unknown Classification"},
                              {"Z", "Unknown Classification"}};
    for (auto& c : cases) {
        CNitfProperty code(c[0]);
        EXPECT_STREQ(code.getAsSecurityString(), c[1]) << "code '" << c[0] << "'";
    }

    EXPECT_TRUE(CNitfProperty::isBCSA(' '));
    EXPECT_TRUE(CNitfProperty::isBCSA('~'));
    EXPECT_FALSE(CNitfProperty::isBCSA('\x7F'));
    EXPECT_FALSE(CNitfProperty::isBCSA("AB\tC", 4));
    EXPECT_TRUE(CNitfProperty::isBCSA("\t", 0));
    EXPECT_FALSE(CNitfProperty::isBCSA("AB", 4)) << "an early NUL fails";

    CNitfProperty binaryColour;
    binaryColour.setCharsFromString("\x01\x02\x03");
    EXPECT_TRUE(binaryColour.isFBKGC());
    CNitfProperty sameText("AAA");
    EXPECT_TRUE(sameText.isFBKGC());
    CNitfProperty unequalText("ABC");
    EXPECT_FALSE(unequalText.isFBKGC());
}

TEST(FieldValue, WritersFillToWidth) {
    CNitfProperty abc("ABC");
    EXPECT_EQ(written(abc, 5), "ABC  ");
    CNitfProperty long_("ABCDEFG");
    EXPECT_EQ(written(long_, 5), "ABCDE");
    CNitfProperty seven(7);
    EXPECT_EQ(written(seven, 3), "007");
    CNitfProperty minusFive(-5);
    EXPECT_EQ(written(minusFive, 5), "000-5");
    CNitfProperty wide(123456);
    EXPECT_EQ(written(wide, 3), "123456") << "numbers are not cut";

    ByteStream in(std::string("\x3F\x80\x00\x00", 4));
    CNitfProperty* f = CNitfProperty::getNewFromFloat(in);
    EXPECT_EQ(written(*f, 4), "") << "floats are not written as text";
    delete f;

    ByteStream out("");
    CNitfProperty value(0x01020304);
    value.writeInt4(out);
    DKFSeek64(out, 0, SEEK_SET);
    unsigned char bytes[4];
    ASSERT_EQ(DKFRead(bytes, 1, 4, out), 4u);
    EXPECT_EQ(bytes[0], 0x04) << "writeInt4 writes host (little-endian) order";
}

TEST(FieldValue, SettersReleaseAndCopiesShareBuffers) {
    CNitfProperty p("first");
    p.setInt4(3);
    EXPECT_EQ(p.getDataType(), CNitfProperty::eInt4);
    p.setCharsFromString("xyz");
    EXPECT_EQ(p.getDataType(), CNitfProperty::eChars);
    EXPECT_EQ(p.getLength(), 3u);
    p.setString("ABCDEF", 3);
    EXPECT_STREQ(p.getAsString(), "ABC");

    CNitfProperty* original = new CNitfProperty("shared");
    CNitfProperty alias;
    alias = *original;
    EXPECT_EQ(alias.getAsString(), original->getAsString()) << "assignment shares the buffer";
    alias = CNitfProperty(); // drop the alias without releasing the shared buffer
    delete original;

    PropertyMap map;
    SetProperty(map, "NAME", new CNitfProperty("one"));
    SetProperty(map, "NAME", new CNitfProperty("two"));
    EXPECT_EQ(map.size(), 1u);
    EXPECT_STREQ(FindProperty(map, "NAME")->getAsString(), "two");
    EXPECT_EQ(FindProperty(map, "OTHER"), nullptr);
    EXPECT_EQ(map.size(), 1u) << "lookup inserts nothing";
    DestroyPropertyMap(map);
    EXPECT_TRUE(map.empty());
}
