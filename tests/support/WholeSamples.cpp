#include "WholeSamples.h"

#include <algorithm>
#include <cmath>
#include <cstring>
#include <stdexcept>

#include "NitfFile.h"
#include "NitfImageSource.h"

namespace wholesamples {

namespace {

int32_t nativeValue(const char* at, int bytes, bool isSigned) {
    switch (bytes) {
    case 1: {
        uint8_t v;
        std::memcpy(&v, at, 1);
        return isSigned ? int8_t(v) : v;
    }
    case 2: {
        uint16_t v;
        std::memcpy(&v, at, 2);
        return isSigned ? int16_t(v) : v;
    }
    default: {
        int32_t v;
        std::memcpy(&v, at, 4);
        return v;
    }
    }
}

} // namespace

Image readBlocks(CNitfFile& file, CNitfImageSource& source) {
    const CNitfImagePropertiesIF& p = source.getImageProperties();
    const bool isSigned = source.getPvtype() == CNitfImagePropertiesIF::ePVTypeSignedInteger;
    const int bytes = p.getSampleContainerBytes();
    if (bytes > 4)
        throw std::runtime_error("samples wider than 32 bits are not handled here");
    const int bands = p.getBandCount(), width = p.getTileWidth(), height = p.getTileHeight();
    Image image;
    image.rows = p.getImageActualHeight();
    image.cols = p.getImageActualWidth();
    image.bands.assign(static_cast<size_t>(bands), std::vector<int32_t>(size_t(image.rows) * image.cols));
    const int rowBytes = width * bands * bytes;
    std::vector<char> block(static_cast<size_t>(rowBytes) * height);
    for (int by = 0; by < p.getTileCountY(); ++by)
        for (int bx = 0; bx < p.getTileCountX(); ++bx) {
            if (!source.readTileInterleaved(&file, block.data(), rowBytes, bx, by))
                std::fill(block.begin(), block.end(), 0);
            for (int r = 0; r < height && by * height + r < image.rows; ++r)
                for (int c = 0; c < width && bx * width + c < image.cols; ++c)
                    for (int b = 0; b < bands; ++b)
                        image.bands[size_t(b)][size_t(by * height + r) * image.cols + bx * width + c] =
                            nativeValue(&block[size_t(r) * rowBytes + (size_t(c) * bands + b) * bytes], bytes,
                                        isSigned);
        }
    return image;
}

std::string canonical(const Image& image, int band, int bytes) {
    std::string out;
    out.reserve(image.bands[size_t(band)].size() * bytes);
    for (int32_t value : image.bands[size_t(band)])
        for (int shift = 8 * (bytes - 1); shift >= 0; shift -= 8)
            out += static_cast<char>((static_cast<uint32_t>(value) >> shift) & 0xFF);
    return out;
}

Stats statsOf(const std::vector<int32_t>& values) {
    Stats s;
    if (values.empty())
        return s;
    s.min = *std::min_element(values.begin(), values.end());
    s.max = *std::max_element(values.begin(), values.end());
    double sum = 0, squares = 0;
    for (int32_t v : values) {
        sum += v;
        squares += double(v) * v;
    }
    s.mean = sum / values.size();
    s.stddev = std::sqrt(std::max(0.0, squares / values.size() - s.mean * s.mean));
    return s;
}

} // namespace wholesamples
