// JPEG streams for tests and benchmarks, made and decoded with libjpeg directly (not through libnitf): sample
// rasters, an encoder for every process NITF uses (8- and 12-bit DCT, lossless up to 16 bits), a plain
// reference decoder, and surgery on marker segments.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

namespace jpegtest {

// Pixel-interleaved samples (any precision up to 16 bits in 16-bit storage).
struct Raster {
    int width = 0;
    int height = 0;
    int components = 1;
    std::vector<uint16_t> samples;

    uint16_t at(int x, int y, int component = 0) const {
        return samples[(static_cast<size_t>(y) * width + x) * components + component];
    }
};

// A smooth but busy picture whose samples span 0 to 2^precision - 1, different in every component.
Raster pattern(int width, int height, int components, int precision, int seed = 0);

struct Coding {
    int precision = 8;
    int quality = 90;                     // DCT only
    int predictor = 0;                    // 1 to 7: the lossless process
    bool rgb = false;                     // three components coded as R, G, B (no colour transform)
    int restartRows = 0;                  // a restart marker every this many MCU rows (0: none)
    bool progressive = false;             // DCT only: libjpeg's standard progressive scan script
    const unsigned* quantTable = nullptr; // 64 values in natural order for table 0 (all components)
    std::vector<std::string> app6;        // APP6 payloads, written right after SOI
    std::vector<std::string> comments;    // COM payloads, written after the APP6 markers
};

// Throws std::runtime_error when libjpeg refuses.
std::string encode(const Raster& raster, const Coding& coding);
// Decodes with libjpeg's defaults (three components to RGB); throws std::runtime_error.
Raster decode(const std::string& stream);

// The stream without its marker segments of code `marker` (0xDB: quantisation tables, 0xC4: Huffman tables).
std::string removeSegments(const std::string& stream, unsigned char marker);
// Payload of a "NITF0001.A" APP6 marker carrying `amplitudeOffset`.
std::string amplitudeMarker(unsigned short amplitudeOffset);

// One band (0-based) of a raster in the corpus manifest's canonical form: 1 byte per sample up to 8 bits,
// else 2 bytes big-endian.
std::string canonical(const Raster& raster, int component, int precision);

} // namespace jpegtest
