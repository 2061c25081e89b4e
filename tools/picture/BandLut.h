// The look-up table a band of an image carries, as pictures and GeoTIFF colour maps use it.
#pragma once

#include <vector>

class CNitfFile;
class CNitfImageSource;

namespace nitfpicture {

struct BandLut {
    int components = 0;                 // 0: the band has no table
    std::vector<unsigned char> entries; // entry-interleaved, `components` bytes each
};

// The first table of band `band` (0-based) with entries.
BandLut readBandLut(CNitfFile& file, CNitfImageSource& source, int band);

} // namespace nitfpicture
