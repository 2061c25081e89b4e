// Decimal and text fields as the segment records read and write them, and fields too large for the file.
#include <gtest/gtest.h>

#include <cstring>
#include <string>
#include <vector>

#include "DataStreamRead.h"
#include "DataStreamWrite.h"
#include "HostError.h"
#include "HostFile.h"
#include "TestFiles.h"

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
