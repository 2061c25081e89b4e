// Field values: read from the file as text or big-endian binary, converted, written back to a width, and
// shared between copies without being released twice.
#include <gtest/gtest.h>

#include <cmath>
#include <string>

#include "HostError.h"
#include "HostFile.h"
#include "NitfProperty.h"
#include "TestFiles.h"

namespace {

std::string written(CNitfProperty& property, int width) {
    ByteStream stream("");
    property.writeString(stream, width);
    return stream.contents();
}

} // namespace

TEST(FieldValue, ReadersKeepTextAsReadAndSwapBinaryValues) {
    ByteStream in(std::string("AB  ") + std::string("\x01\x02", 2) + std::string("\xFF\xFE\xFD\xFC", 4) +
                  std::string("\x3F\xC0\x00\x00", 4) + std::string("\x40\x09\x21\xFB\x54\x44\x2D\x18", 8) +
                  "\x80");
    std::unique_ptr<CNitfProperty> text(CNitfProperty::getNewFromString(in, 4));
    EXPECT_STREQ(text->getAsString(), "AB  ");
    EXPECT_EQ(std::unique_ptr<CNitfProperty>(CNitfProperty::getNewFromUint2(in))->getAsInt(), 0x0102);
    EXPECT_EQ(std::unique_ptr<CNitfProperty>(CNitfProperty::getNewFromUint4(in))->getAsInt(),
              static_cast<int>(0xFFFEFDFC));
    EXPECT_FLOAT_EQ(std::unique_ptr<CNitfProperty>(CNitfProperty::getNewFromFloat(in))->getFloat(), 1.5f);
    EXPECT_DOUBLE_EQ(std::unique_ptr<CNitfProperty>(CNitfProperty::getNewFromDouble(in))->getDouble(), M_PI);
    EXPECT_EQ(std::unique_ptr<CNitfProperty>(CNitfProperty::getNewFromUint1(in))->getAsInt(), 128);
    // Past the end of the file a text field is still terminated and holds no stale bytes.
    std::unique_ptr<CNitfProperty> past(CNitfProperty::getNewFromString(in, 3));
    EXPECT_EQ(past->getLength(), 0u);
    EXPECT_STREQ(past->getAsString(), "");
}

TEST(FieldValue, ConversionsFollowAtoiAndHexRules) {
    CNitfProperty padded("  12"), letters("ABC"), huge("99999999999999999999");
    EXPECT_EQ(padded.getAsInt64(), 12);
    EXPECT_DOUBLE_EQ(padded.getAsDouble(), 12.0);
    EXPECT_EQ(letters.getAsInt(), 0);
    EXPECT_EQ(huge.getAsInt(), 2147483647) << "overflow saturates instead of wrapping";

    ByteStream in(std::string("\x00\xFF\x10", 3) + std::string("\xC0\x20\x00\x00", 4));
    std::unique_ptr<CNitfProperty> bytes(CNitfProperty::getNewFromChars(in, 3));
    const char* hex = bytes->getAsString();
    EXPECT_STREQ(hex, "00FF10");
    free(const_cast<char*>(hex));
    EXPECT_THROW(bytes->getAsInt(), vexo::Exception);
    // A float converts to int and double but not to int64.
    std::unique_ptr<CNitfProperty> f(CNitfProperty::getNewFromFloat(in));
    EXPECT_EQ(f->getAsInt(), -2);
    EXPECT_DOUBLE_EQ(f->getAsDouble(), -2.5);
    EXPECT_THROW(f->getAsInt64(), vexo::Exception);
    EXPECT_THROW(CNitfProperty().getLength(), vexo::Exception) << "no data";

    CNitfProperty binaryColour, sameText("AAA"), unequalText("ABC");
    binaryColour.setCharsFromString("\x01\x02\x03");
    EXPECT_TRUE(binaryColour.isFBKGC());
    EXPECT_TRUE(sameText.isFBKGC());
    EXPECT_FALSE(unequalText.isFBKGC());
    EXPECT_FALSE(CNitfProperty::isBCSA("AB\tC", 4));
    EXPECT_FALSE(CNitfProperty::isBCSA("AB", 4)) << "an early NUL fails";
}

TEST(FieldValue, WritersFillToWidth) {
    CNitfProperty abc("ABC"), longer("ABCDEFG"), seven(7), minusFive(-5), wide(123456);
    EXPECT_EQ(written(abc, 5), "ABC  ");
    EXPECT_EQ(written(longer, 5), "ABCDE");
    EXPECT_EQ(written(seven, 3), "007");
    EXPECT_EQ(written(minusFive, 5), "000-5");
    EXPECT_EQ(written(wide, 3), "123456") << "numbers are not cut";
    ByteStream in(std::string("\x3F\x80\x00\x00", 4));
    std::unique_ptr<CNitfProperty> f(CNitfProperty::getNewFromFloat(in));
    EXPECT_EQ(written(*f, 4), "") << "floats are not written as text";
}

TEST(FieldValue, SettersReleaseAndCopiesShareBuffers) {
    CNitfProperty p("first");
    p.setInt4(3);
    p.setCharsFromString("xyz");
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
    EXPECT_STREQ(FindProperty(map, "NAME")->getAsString(), "two");
    EXPECT_EQ(FindProperty(map, "OTHER"), nullptr);
    EXPECT_EQ(map.size(), 1u) << "lookup inserts nothing";
    DestroyPropertyMap(map);
}
