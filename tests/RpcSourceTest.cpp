// The rational polynomial model against values computed by hand, its inverse, RPC00A's term order and the
// ICHIPB chip mapping.
#include <gtest/gtest.h>

#include <cstdio>
#include <string>

#include "HostError.h"
#include "NitfTag.h"
#include "RpcSource.h"
#include "TestFiles.h"
#include "TreBytes.h"

namespace {

// Offsets and scales: line 1000 + 1000 r, sample 2000 + 2000 c, P = (lat - 45) / 0.1, L = (lon - 10) / 0.2,
// H = (h - 100) / 500.
const std::string kNormalisation =
    joined({"1", "0001.00", "0000.50", "001000", "02000", "+45.0000", "+010.0000", "+0100", "001000", "02000",
            "+00.1000", "+000.2000", "+0500"});

// 20 coefficients of 12 characters, all zero but the given 1-based terms.
std::string polynomial(std::initializer_list<std::pair<int, const char*>> terms) {
    std::string out;
    for (int i = 1; i <= 20; ++i) {
        const char* value = "+0.000000E+0";
        for (const auto& term : terms) {
            if (term.first == i)
                value = term.second;
        }
        out += value;
    }
    return out;
}

// Line = P + 0.5 P² over 1 - 0.2 H; sample = L + 0.1 × (the term at `sampleTerm`) over 1.
std::string model(int sampleTerm) {
    return kNormalisation + polynomial({{3, "+1.000000E+0"}, {9, "+5.000000E-1"}}) +
           polynomial({{1, "+1.000000E+0"}, {4, "-2.000000E-1"}}) +
           polynomial({{2, "+1.000000E+0"}, {sampleTerm, "+1.000000E-1"}}) +
           polynomial({{1, "+1.000000E+0"}});
}

CRpcSource read(const char* name, const std::string& data, long long length = 1041) {
    ByteStream stream("pad" + data);
    CNitfTag tag;
    tag.setIdentifier(name);
    tag.setDataOffset(3);
    tag.setDataLength(length);
    CRpcSource rpc(&tag);
    rpc.readNewInfo(stream.get());
    return rpc;
}

std::string number12(double value) {
    char text[16];
    std::snprintf(text, sizeof text, "%012.3f", value);
    return text;
}

} // namespace

TEST(RpcSource, GroundToImageByHand) {
    CRpcSource rpc = read("RPC00B", model(11));
    EXPECT_TRUE(rpc.isValid());
    EXPECT_EQ(rpc.computeStorageLength(), 1041);
    EXPECT_DOUBLE_EQ(rpc.getModel().randomError, 0.5);
    EXPECT_DOUBLE_EQ(rpc.getModel().longitudeScale, 0.2);

    // At P = L = H = 0.5: line = 1000 + 1000 × (0.5 + 0.125) / 0.9; sample = 2000 + 2000 × (0.5 + 0.1 ×
    // 0.125).
    double line, sample;
    ASSERT_TRUE(rpc.groundToImage(45.05, 10.1, 350, &line, &sample));
    EXPECT_NEAR(line, 1000 + 1000 * 0.625 / 0.9, 1e-9);
    EXPECT_NEAR(sample, 3025, 1e-9);

    // At the offsets everything normalises to 0.
    ASSERT_TRUE(rpc.groundToImage(45, 10, 100, &line, &sample));
    EXPECT_NEAR(line, 1000, 1e-12);
    EXPECT_NEAR(sample, 2000, 1e-12);
}

TEST(RpcSource, Rpc00AIsReorderedToRpc00B) {
    // RPC00A term 8 is P·L·H, RPC00B's term 11; read as RPC00B the same bytes mean L² (term 8).
    double line, sample;
    CRpcSource a = read("RPC00A", model(8));
    ASSERT_TRUE(a.groundToImage(45.05, 10.1, 350, &line, &sample));
    EXPECT_NEAR(sample, 3025, 1e-9);
    EXPECT_DOUBLE_EQ(a.getModel().sampleNumerator[10], 0.1);
    EXPECT_DOUBLE_EQ(a.getModel().lineNumerator[7], 0.5); // RPC00A's term 9 is L², RPC00B's term 8
    EXPECT_DOUBLE_EQ(a.getModel().lineNumerator[2], 1);   // terms 1 to 7 keep their place

    CRpcSource b = read("RPC00B", model(8));
    ASSERT_TRUE(b.groundToImage(45.05, 10.1, 350, &line, &sample));
    EXPECT_NEAR(sample, 2000 + 2000 * (0.5 + 0.1 * 0.25), 1e-9);
}

TEST(RpcSource, ImageToGroundInvertsTheModel) {
    CRpcSource rpc = read("RPC00B", model(11));
    for (double latitude : {44.93, 45.0, 45.08}) {
        for (double longitude : {9.85, 10.02, 10.17}) {
            double line, sample, lat, lon;
            ASSERT_TRUE(rpc.groundToImage(latitude, longitude, 250, &line, &sample));
            ASSERT_TRUE(rpc.imageToGround(line, sample, 250, &lat, &lon));
            EXPECT_NEAR(lat, latitude, 1e-9);
            EXPECT_NEAR(lon, longitude, 1e-9);
        }
    }
    // A model with zero scales has no inverse.
    CRpcSource empty;
    double lat, lon;
    EXPECT_FALSE(empty.isValid());
    EXPECT_FALSE(empty.imageToGround(1, 1, 0, &lat, &lon));
    EXPECT_FALSE(empty.groundToImage(1, 1, 0, &lat, &lon));
}

TEST(RpcSource, ChipCoordinatesThroughIchipb) {
    // The chip is the full image from row 500, column 1000 on, at half resolution: full = 2 × chip + offset.
    std::string grid;
    const double chip[4][2] = {{0.5, 0.5}, {0.5, 1000.5}, {1000.5, 0.5}, {1000.5, 1000.5}};
    for (const auto& point : chip)
        grid += number12(point[0]) + number12(point[1]);
    for (const auto& point : chip)
        grid += number12(2 * point[0] + 500) + number12(2 * point[1] + 1000);
    auto ichipb = parseTre("ICHIPB", joined({"00", "0000.50000", "00", "00"}) + grid +
                                         joined({"00003000", "00004000"}));

    CRpcSource rpc = read("RPC00B", model(11));
    ASSERT_TRUE(rpc.setChip(ichipb.get()));
    double line, sample;
    ASSERT_TRUE(rpc.groundToImage(45.05, 10.1, 350, &line, &sample));
    EXPECT_NEAR(line, (1000 + 1000 * 0.625 / 0.9 - 500) / 2, 1e-9);
    EXPECT_NEAR(sample, (3025 - 1000) / 2.0, 1e-9);
    double lat, lon;
    ASSERT_TRUE(rpc.imageToGround(line, sample, 350, &lat, &lon));
    EXPECT_NEAR(lat, 45.05, 1e-9);
    EXPECT_NEAR(lon, 10.1, 1e-9);

    // Grid points that collapse to a line define no mapping.
    auto flat = parseTre("ICHIPB", joined({"00", "0000.50000", "00", "00"}) + std::string(192, '0') +
                                       joined({"00003000", "00004000"}));
    CRpcSource other = read("RPC00B", model(11));
    EXPECT_FALSE(other.setChip(flat.get()));
    EXPECT_FALSE(other.hasChip());
}

TEST(RpcSource, ShortDataIsRefused) {
    EXPECT_THROW(read("RPC00B", model(11), 1000), vexo::Exception);
    EXPECT_THROW(read("RPC00B", model(11).substr(0, 500)), vexo::Exception);
}
