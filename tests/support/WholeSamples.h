// Whole images read block by block through an image source that delivers whole samples (every compressed
// source but bi-level): values per band, their statistics, and the canonical form the corpus manifest hashes.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

class CNitfFile;
class CNitfImageSource;

namespace wholesamples {

struct Image {
    int rows = 0;
    int cols = 0;
    std::vector<std::vector<int32_t>> bands; // rows x cols values each
};

// Reads every block with readTileInterleaved and keeps the NROWS x NCOLS image area. Samples are read from
// their native containers, signed for PVTYPE "SI".
Image readBlocks(CNitfFile& file, CNitfImageSource& source);

// Band `band` in canonical form: `bytes` bytes per sample, big-endian two's complement.
std::string canonical(const Image& image, int band, int bytes);

struct Stats {
    double min = 0, max = 0, mean = 0, stddev = 0;
};
Stats statsOf(const std::vector<int32_t>& values);

} // namespace wholesamples
