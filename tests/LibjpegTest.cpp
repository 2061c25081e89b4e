// The libjpeg the build links must code 12-bit samples and the lossless process, as NITF JPEG images use
// both.
#include <gtest/gtest.h>

#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <stdexcept>
#include <vector>

#include <jpeglib.h>

namespace {

// libjpeg reports errors by calling error_exit, which must not return; a test can simply throw.
[[noreturn]] void throwJpegError(j_common_ptr cinfo) {
    char message[JMSG_LENGTH_MAX];
    (*cinfo->err->format_message)(cinfo, message);
    throw std::runtime_error(message);
}

JDIMENSION writeRows(j_compress_ptr c, JSAMPLE** rows, JDIMENSION n) {
    return jpeg_write_scanlines(c, rows, n);
}
JDIMENSION writeRows(j_compress_ptr c, J12SAMPLE** rows, JDIMENSION n) {
    return jpeg12_write_scanlines(c, rows, n);
}
JDIMENSION readRows(j_decompress_ptr c, JSAMPLE** rows, JDIMENSION n) {
    return jpeg_read_scanlines(c, rows, n);
}
JDIMENSION readRows(j_decompress_ptr c, J12SAMPLE** rows, JDIMENSION n) {
    return jpeg12_read_scanlines(c, rows, n);
}

// Pixel-interleaved samples of an image.
template <typename Sample> struct Image {
    int width, height, components;
    std::vector<Sample> samples;
    Sample* row(int y) { return samples.data() + size_t(y) * width * components; }
};

struct Coding {
    int precision;
    int predictor; // 1..7 for the lossless process, 0 for DCT
    int quality;   // DCT only
};

template <typename Sample> std::vector<unsigned char> encode(Image<Sample> image, const Coding& coding) {
    jpeg_compress_struct cinfo;
    jpeg_error_mgr errors;
    cinfo.err = jpeg_std_error(&errors);
    errors.error_exit = throwJpegError;
    jpeg_create_compress(&cinfo);
    unsigned char* buffer = nullptr;
    unsigned long size = 0;
    try {
        jpeg_mem_dest(&cinfo, &buffer, &size);
        cinfo.image_width = image.width;
        cinfo.image_height = image.height;
        cinfo.input_components = image.components;
        cinfo.in_color_space = image.components == 3 ? JCS_RGB : JCS_GRAYSCALE;
        jpeg_set_defaults(&cinfo);
        cinfo.data_precision = coding.precision;
        if (coding.predictor > 0) {
            jpeg_set_colorspace(&cinfo, cinfo.in_color_space); // a colour transform would not be lossless
            jpeg_enable_lossless(&cinfo, coding.predictor, 0);
        } else {
            jpeg_set_quality(&cinfo, coding.quality, FALSE);
        }
        jpeg_start_compress(&cinfo, TRUE);
        while (cinfo.next_scanline < cinfo.image_height) {
            Sample* row = image.row(int(cinfo.next_scanline));
            writeRows(&cinfo, &row, 1);
        }
        jpeg_finish_compress(&cinfo);
    } catch (...) {
        jpeg_destroy_compress(&cinfo);
        std::free(buffer);
        throw;
    }
    jpeg_destroy_compress(&cinfo);
    std::vector<unsigned char> bytes(buffer, buffer + size);
    std::free(buffer);
    return bytes;
}

template <typename Sample> Image<Sample> decode(const std::vector<unsigned char>& bytes, int precision) {
    jpeg_decompress_struct cinfo;
    jpeg_error_mgr errors;
    cinfo.err = jpeg_std_error(&errors);
    errors.error_exit = throwJpegError;
    jpeg_create_decompress(&cinfo);
    Image<Sample> image{0, 0, 0, {}};
    try {
        jpeg_mem_src(&cinfo, bytes.data(), bytes.size());
        jpeg_read_header(&cinfo, TRUE);
        if (cinfo.data_precision != precision)
            throw std::runtime_error("unexpected sample precision " + std::to_string(cinfo.data_precision));
        jpeg_start_decompress(&cinfo);
        image = {int(cinfo.output_width), int(cinfo.output_height), cinfo.output_components, {}};
        image.samples.resize(size_t(image.width) * image.height * image.components);
        while (cinfo.output_scanline < cinfo.output_height) {
            Sample* row = image.row(int(cinfo.output_scanline));
            if (readRows(&cinfo, &row, 1) != 1)
                throw std::runtime_error("truncated scan");
        }
        jpeg_finish_decompress(&cinfo);
    } catch (...) {
        jpeg_destroy_decompress(&cinfo);
        throw;
    }
    jpeg_destroy_decompress(&cinfo);
    return image;
}

// An odd-sized image whose samples jump about, with both extremes present, so that every predictor is busy.
template <typename Sample> Image<Sample> busyImage(int components, int maxValue) {
    Image<Sample> image{37, 23, components, {}};
    for (int y = 0; y < image.height; ++y)
        for (int x = 0; x < image.width; ++x)
            for (int c = 0; c < components; ++c)
                image.samples.push_back(
                    Sample((x * 97 + y * 131 + (x ^ y) * 13 + c * 1000) % (maxValue + 1)));
    image.samples.front() = 0;
    image.samples.back() = Sample(maxValue);
    return image;
}

int maxDifference(const std::vector<J12SAMPLE>& a, const std::vector<J12SAMPLE>& b) {
    int worst = 0;
    for (size_t i = 0; i < a.size(); ++i)
        worst = std::max(worst, std::abs(a[i] - b[i]));
    return worst;
}

} // namespace

TEST(Libjpeg, TwelveBitLosslessIsBitExact) {
    const Image<J12SAMPLE> original = busyImage<J12SAMPLE>(1, 4095);
    for (int predictor = 1; predictor <= 7; ++predictor) {
        Image<J12SAMPLE> decoded = decode<J12SAMPLE>(encode(original, {12, predictor, 0}), 12);
        ASSERT_EQ(decoded.width, original.width);
        ASSERT_EQ(decoded.height, original.height);
        EXPECT_EQ(decoded.samples, original.samples) << "predictor " << predictor;
    }
}

TEST(Libjpeg, EightBitLosslessIsBitExact) {
    for (int components : {1, 3}) {
        const Image<JSAMPLE> original = busyImage<JSAMPLE>(components, 255);
        Image<JSAMPLE> decoded = decode<JSAMPLE>(encode(original, {8, 1, 0}), 8);
        ASSERT_EQ(decoded.components, components);
        EXPECT_EQ(decoded.samples, original.samples) << components << " components";
    }
}

TEST(Libjpeg, TwelveBitDctStaysClose) {
    Image<J12SAMPLE> original{37, 23, 1, {}};
    for (int y = 0; y < original.height; ++y)
        for (int x = 0; x < original.width; ++x)
            original.samples.push_back(J12SAMPLE(2048 + 1500 * std::sin(x / 6.0) * std::cos(y / 5.0)));
    Image<J12SAMPLE> decoded = decode<J12SAMPLE>(encode(original, {12, 0, 90}), 12);
    ASSERT_EQ(decoded.samples.size(), original.samples.size());
    EXPECT_LE(maxDifference(decoded.samples, original.samples), 32) << "beyond what quality 90 allows";
}
