#include "JpegStreams.h"

#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <stdexcept>

#include <jpeglib.h>

namespace jpegtest {

namespace {

[[noreturn]] void throwJpegError(j_common_ptr cinfo) {
    char message[JMSG_LENGTH_MAX];
    (*cinfo->err->format_message)(cinfo, message);
    throw std::runtime_error(message);
}

void silence(j_common_ptr, int) {}

// One row of the raster converted to the sample type libjpeg takes at that precision.
template <typename Sample> std::vector<Sample> rowOf(const Raster& raster, int y) {
    const size_t count = static_cast<size_t>(raster.width) * raster.components;
    const uint16_t* first = raster.samples.data() + y * count;
    return std::vector<Sample>(first, first + count);
}

void writeRows(jpeg_compress_struct& cinfo, const Raster& raster) {
    while (cinfo.next_scanline < cinfo.image_height) {
        const int y = static_cast<int>(cinfo.next_scanline);
        if (cinfo.data_precision <= 8) {
            std::vector<JSAMPLE> row = rowOf<JSAMPLE>(raster, y);
            JSAMPROW pointer = row.data();
            jpeg_write_scanlines(&cinfo, &pointer, 1);
        } else if (cinfo.data_precision <= 12) {
            std::vector<J12SAMPLE> row = rowOf<J12SAMPLE>(raster, y);
            J12SAMPROW pointer = row.data();
            jpeg12_write_scanlines(&cinfo, &pointer, 1);
        } else {
            std::vector<J16SAMPLE> row = rowOf<J16SAMPLE>(raster, y);
            J16SAMPROW pointer = row.data();
            jpeg16_write_scanlines(&cinfo, &pointer, 1);
        }
    }
}

} // namespace

Raster pattern(int width, int height, int components, int precision, int seed) {
    Raster raster{width, height, components, {}};
    raster.samples.reserve(static_cast<size_t>(width) * height * components);
    const double top = std::ldexp(1.0, precision) - 1;
    for (int y = 0; y < height; ++y)
        for (int x = 0; x < width; ++x)
            for (int c = 0; c < components; ++c) {
                const double wave = std::sin((x + seed) / (7.0 + c)) * std::cos((y - seed) / (5.0 + 2 * c));
                const double ramp = (x + 2.0 * y + 31 * c) / (width + 2.0 * height + 31 * c);
                raster.samples.push_back(
                    static_cast<uint16_t>(std::lround(top * (0.3 * wave + 0.35 + 0.3 * ramp))));
            }
    raster.samples.front() = 0;
    raster.samples.back() = static_cast<uint16_t>(top);
    return raster;
}

std::string encode(const Raster& raster, const Coding& coding) {
    jpeg_compress_struct cinfo;
    jpeg_error_mgr errors;
    cinfo.err = jpeg_std_error(&errors);
    errors.error_exit = throwJpegError;
    errors.emit_message = silence;
    jpeg_create_compress(&cinfo);
    unsigned char* buffer = nullptr;
    unsigned long size = 0;
    try {
        jpeg_mem_dest(&cinfo, &buffer, &size);
        cinfo.image_width = raster.width;
        cinfo.image_height = raster.height;
        cinfo.input_components = raster.components;
        cinfo.in_color_space = raster.components == 3 ? JCS_RGB : JCS_GRAYSCALE;
        jpeg_set_defaults(&cinfo);
        cinfo.data_precision = coding.precision;
        if (coding.rgb || coding.predictor > 0)
            jpeg_set_colorspace(&cinfo, cinfo.in_color_space);
        if (coding.predictor > 0) {
            jpeg_enable_lossless(&cinfo, coding.predictor, 0);
        } else {
            jpeg_set_quality(&cinfo, coding.quality, FALSE);
            if (coding.progressive)
                jpeg_simple_progression(&cinfo);
            if (coding.quantTable) {
                jpeg_add_quant_table(&cinfo, 0, coding.quantTable, 100, FALSE);
                for (int c = 0; c < cinfo.num_components; ++c)
                    cinfo.comp_info[c].quant_tbl_no = 0;
            }
        }
        cinfo.restart_in_rows = coding.restartRows;
        jpeg_start_compress(&cinfo, TRUE);
        for (const std::string& payload : coding.app6)
            jpeg_write_marker(&cinfo, JPEG_APP0 + 6, reinterpret_cast<const JOCTET*>(payload.data()),
                              static_cast<unsigned>(payload.size()));
        for (const std::string& payload : coding.comments)
            jpeg_write_marker(&cinfo, JPEG_COM, reinterpret_cast<const JOCTET*>(payload.data()),
                              static_cast<unsigned>(payload.size()));
        writeRows(cinfo, raster);
        jpeg_finish_compress(&cinfo);
    } catch (...) {
        jpeg_destroy_compress(&cinfo);
        std::free(buffer);
        throw;
    }
    jpeg_destroy_compress(&cinfo);
    std::string bytes(reinterpret_cast<char*>(buffer), size);
    std::free(buffer);
    return bytes;
}

Raster decode(const std::string& stream) {
    jpeg_decompress_struct cinfo;
    jpeg_error_mgr errors;
    cinfo.err = jpeg_std_error(&errors);
    errors.error_exit = throwJpegError;
    errors.emit_message = silence;
    jpeg_create_decompress(&cinfo);
    Raster raster;
    try {
        jpeg_mem_src(&cinfo, reinterpret_cast<const unsigned char*>(stream.data()), stream.size());
        jpeg_read_header(&cinfo, TRUE);
        jpeg_start_decompress(&cinfo);
        raster = {static_cast<int>(cinfo.output_width),
                  static_cast<int>(cinfo.output_height),
                  cinfo.output_components,
                  {}};
        const size_t rowLength = static_cast<size_t>(raster.width) * raster.components;
        raster.samples.resize(rowLength * raster.height);
        std::vector<J16SAMPLE> wide(rowLength);
        std::vector<JSAMPLE> narrow(rowLength);
        while (cinfo.output_scanline < cinfo.output_height) {
            uint16_t* out = raster.samples.data() + cinfo.output_scanline * rowLength;
            if (cinfo.data_precision <= 8) {
                JSAMPROW row = narrow.data();
                jpeg_read_scanlines(&cinfo, &row, 1);
                std::copy(narrow.begin(), narrow.end(), out);
            } else if (cinfo.data_precision <= 12) {
                J12SAMPROW row = reinterpret_cast<J12SAMPROW>(wide.data());
                jpeg12_read_scanlines(&cinfo, &row, 1);
                std::copy(wide.begin(), wide.end(), out);
            } else {
                J16SAMPROW row = wide.data();
                jpeg16_read_scanlines(&cinfo, &row, 1);
                std::copy(wide.begin(), wide.end(), out);
            }
        }
        jpeg_finish_decompress(&cinfo);
    } catch (...) {
        jpeg_destroy_decompress(&cinfo);
        throw;
    }
    jpeg_destroy_decompress(&cinfo);
    return raster;
}

std::string removeSegments(const std::string& stream, unsigned char marker) {
    std::string out = stream.substr(0, 2); // SOI
    size_t at = 2;
    while (at + 4 <= stream.size() && static_cast<unsigned char>(stream[at]) == 0xFF) {
        const unsigned char code = static_cast<unsigned char>(stream[at + 1]);
        if (code == 0xDA) // SOS: the entropy-coded data follows; keep the rest as it is
            break;
        const size_t length =
            static_cast<unsigned char>(stream[at + 2]) << 8 | static_cast<unsigned char>(stream[at + 3]);
        if (code != marker)
            out += stream.substr(at, 2 + length);
        at += 2 + length;
    }
    return out + stream.substr(at);
}

std::string amplitudeMarker(unsigned short amplitudeOffset) {
    std::string payload("NITF0001.A", 11); // with its NUL
    payload += std::string(10, '\x07');    // two 32-bit and one 16-bit value nobody reads
    payload += static_cast<char>(amplitudeOffset >> 8);
    payload += static_cast<char>(amplitudeOffset & 0xFF);
    return payload;
}

std::string canonical(const Raster& raster, int component, int precision) {
    std::string bytes;
    for (int y = 0; y < raster.height; ++y)
        for (int x = 0; x < raster.width; ++x) {
            const uint16_t sample = raster.at(x, y, component);
            if (precision > 8)
                bytes += static_cast<char>(sample >> 8);
            bytes += static_cast<char>(sample & 0xFF);
        }
    return bytes;
}

} // namespace jpegtest
