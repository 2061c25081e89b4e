// The libjpeg the build links must code 12-bit samples and the lossless process, as NITF JPEG images use
// both.
#include <gtest/gtest.h>

#include <algorithm>
#include <cstdlib>

#include "JpegStreams.h"

using jpegtest::Coding;
using jpegtest::Raster;

namespace {

// An odd-sized raster, so partial MCUs and every predictor's edge cases are exercised.
Raster busy(int components, int precision) {
    return jpegtest::pattern(37, 23, components, precision, 7);
}

Coding lossless(int precision, int predictor, bool rgb = false) {
    Coding coding;
    coding.precision = precision;
    coding.predictor = predictor;
    coding.rgb = rgb;
    return coding;
}

} // namespace

TEST(Libjpeg, TwelveBitLosslessIsBitExact) {
    const Raster original = busy(1, 12);
    for (int predictor = 1; predictor <= 7; ++predictor) {
        Raster decoded = jpegtest::decode(jpegtest::encode(original, lossless(12, predictor)));
        ASSERT_EQ(decoded.width, original.width);
        ASSERT_EQ(decoded.height, original.height);
        EXPECT_EQ(decoded.samples, original.samples) << "predictor " << predictor;
    }
}

TEST(Libjpeg, EightBitLosslessIsBitExact) {
    for (int components : {1, 3}) {
        const Raster original = busy(components, 8);
        Raster decoded = jpegtest::decode(jpegtest::encode(original, lossless(8, 1, components == 3)));
        ASSERT_EQ(decoded.components, components);
        EXPECT_EQ(decoded.samples, original.samples) << components << " components";
    }
}

TEST(Libjpeg, TwelveBitDctStaysClose) {
    const Raster original = busy(1, 12);
    Coding coding;
    coding.precision = 12;
    coding.quality = 95;
    Raster decoded = jpegtest::decode(jpegtest::encode(original, coding));
    ASSERT_EQ(decoded.samples.size(), original.samples.size());
    int worst = 0;
    for (size_t i = 0; i < original.samples.size(); ++i)
        worst = std::max(worst, std::abs(int(decoded.samples[i]) - int(original.samples[i])));
    EXPECT_GT(worst, 0) << "a DCT round trip is lossy: the 12-bit DCT path really ran";
    EXPECT_LE(worst, 32) << "beyond what quality 95 allows on 12-bit samples";
}
