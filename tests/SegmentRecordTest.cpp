#include <gtest/gtest.h>

#include <cstring>
#include <string>
#include <vector>

#include "DataPointer.h"
#include "DataStreamRead.h"
#include "DataStreamWrite.h"
#include "HostError.h"
#include "HostFile.h"
#include "TestFiles.h"

namespace {} // namespace

TEST(SegmentRecords, ReadDataAppendsNewlineAndNul) {
    ByteStream in("0123456789");
    char buffer[8];
    std::memset(buffer, 'x', sizeof buffer);
    CDataPointer(3, 4).readData(in, buffer);
    EXPECT_EQ(std::string(buffer, 6), std::string("3456\n\0", 6));

    CDataPointer(5, 0).readData(in, buffer);
    EXPECT_EQ(std::string(buffer, 2), std::string("\n\0", 2));

    // A pointer running past the end of the file gives zeros, not stale bytes.
    std::memset(buffer, 'x', sizeof buffer);
    CDataPointer(8, 4).readData(in, buffer);
    EXPECT_EQ(std::string(buffer, 6), std::string("89\0\0\n\0", 6));
}

TEST(SegmentRecords, DecimalFieldsAndTheirLimits) {
    ByteStream in(" 42  7x" + std::string(40, '9'));
    CDataStreamRead reader(in);
    EXPECT_EQ(reader.readDecimal(3), 42);
    EXPECT_EQ(reader.readDecimal(4), 7) << "conversion stops at the first non-digit";
    long long before = DKFTell(in);
    EXPECT_EQ(reader.readDecimal(32), 0);
    EXPECT_EQ(reader.readDecimal64(40), 0);
    EXPECT_EQ(DKFTell(in), before) << "a width of 32 or more reads nothing";
    EXPECT_EQ(reader.readDecimal64(12), 999999999999LL);

    ByteStream out("");
    CDataStreamWrite writer(out);
    writer.writeDecimal(42, 6, true);
    writer.writeDecimal(42, 6, false);
    writer.writeDecimal(-5, 4, true);
    writer.writeDecimal64(12000000000LL, 12, true);
    writer.writeText("ABCDEFGH", 5);
    writer.writeText("AB", 4);
    EXPECT_EQ(out.contents(), "000042    4200-5012000000000ABCDEAB  ");
}

TEST(SegmentRecords, LargeFieldsMustFitInTheFile) {
    ByteStream in(std::string(100, 'A'));
    CDataStreamRead reader(in);
    EXPECT_THROW(free(reader.readBytes(50 * 1000 * 1000)), vexo::Exception);
    EXPECT_THROW(free(reader.readText(1 << 20)), vexo::Exception);
    char* small = reader.readText(200); // small fields past the end are zero-filled, not refused
    EXPECT_EQ(std::strlen(small), 100u);
    free(small);
}
