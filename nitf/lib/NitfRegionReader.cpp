#include "NitfRegionReader.h"

#include <algorithm>
#include <cstdint>
#include <cstring>

#include "HostError.h"
#include "NitfFile.h"
#include "NitfImageSource.h"
#include "PackedBits.h"
#include "Raise.h"

static const char kSourceFile[] = "nitf/lib/NitfRegionReader";

namespace {

constexpr bool kHostBigEndian = __BYTE_ORDER__ == __ORDER_BIG_ENDIAN__;

int containerBytes(int bits) {
    if (bits <= 8)
        return 1;
    if (bits <= 16)
        return 2;
    return bits <= 32 ? 4 : 8;
}

CNitfRegionReader::eSampleType_t sampleType(CNitfImagePropertiesIF::ePVType_t pvtype, int bits) {
    using R = CNitfRegionReader;
    const int bytes = containerBytes(bits);
    switch (pvtype) {
    case CNitfImagePropertiesIF::ePVTypeReal:
        if (bits == 32)
            return R::eFloat32;
        if (bits == 64)
            return R::eFloat64;
        break;
    case CNitfImagePropertiesIF::ePVTypeComplex:
        if (bits == 64)
            return R::eComplexFloat32;
        break;
    case CNitfImagePropertiesIF::ePVTypeSignedInteger:
        return bytes == 1 ? R::eInt8 : bytes == 2 ? R::eInt16 : bytes == 4 ? R::eInt32 : R::eInt64;
    default:
        break;
    }
    return bytes == 1 ? R::eUInt8 : bytes == 2 ? R::eUInt16 : bytes == 4 ? R::eUInt32 : R::eUInt64;
}

// Writes the low `bytes` bytes of `value` in the chosen order.
inline void storeValue(unsigned char* out, uint64_t value, int bytes, bool bigEndian) {
    if (bigEndian) {
        for (int i = bytes - 1; i >= 0; --i, value >>= 8)
            out[i] = static_cast<unsigned char>(value);
    } else {
        for (int i = 0; i < bytes; ++i, value >>= 8)
            out[i] = static_cast<unsigned char>(value);
    }
}

// Copies `count` samples of `bytes` bytes, `stride` apart in the output, reversing each element of
// `elementBytes` bytes when `swap` is set.
void copySamples(unsigned char* out, size_t stride, const unsigned char* in, size_t count, int bytes,
                 int elementBytes, bool swap) {
    if (!swap && stride == static_cast<size_t>(bytes)) {
        std::memcpy(out, in, count * bytes);
        return;
    }
    if (!swap) {
        for (size_t i = 0; i < count; ++i, out += stride, in += bytes)
            std::memcpy(out, in, bytes);
        return;
    }
    switch (elementBytes) {
    case 2:
        for (size_t i = 0; i < count; ++i, out += stride, in += bytes) {
            for (int e = 0; e < bytes; e += 2) {
                uint16_t v;
                std::memcpy(&v, in + e, 2);
                v = __builtin_bswap16(v);
                std::memcpy(out + e, &v, 2);
            }
        }
        return;
    case 4:
        for (size_t i = 0; i < count; ++i, out += stride, in += bytes) {
            for (int e = 0; e < bytes; e += 4) {
                uint32_t v;
                std::memcpy(&v, in + e, 4);
                v = __builtin_bswap32(v);
                std::memcpy(out + e, &v, 4);
            }
        }
        return;
    case 8:
        for (size_t i = 0; i < count; ++i, out += stride, in += bytes) {
            for (int e = 0; e < bytes; e += 8) {
                uint64_t v;
                std::memcpy(&v, in + e, 8);
                v = __builtin_bswap64(v);
                std::memcpy(out + e, &v, 8);
            }
        }
        return;
    default:
        for (size_t i = 0; i < count; ++i, out += stride, in += bytes)
            std::memcpy(out, in, bytes);
        return;
    }
}

} // namespace

CNitfRegionReader::CNitfRegionReader(CNitfFile* file, CNitfImageSource* source)
    : m_file(file), m_source(source) {
    static const char signature[] =
        "__cdecl CNitfRegionReader::CNitfRegionReader(class CNitfFile *,class CNitfImageSource *)";
    if (!file || !source || !file->getInputStream())
        NITF_RAISE("A region reader needs an open file and its image source", signature);
    const CNitfImagePropertiesIF& p = source->getImageProperties();
    m_width = p.getImageActualWidth();
    m_height = p.getImageActualHeight();
    m_bands = p.getBandCount();
    m_bits = p.getBpp();
    m_blockWidth = p.getTileWidth();
    m_blockHeight = p.getTileHeight();
    if (m_width <= 0 || m_height <= 0 || m_bands <= 0 || m_bits <= 0 || m_bits > 64 || m_blockWidth <= 0 ||
        m_blockHeight <= 0)
        NITF_RAISE_FORMAT(signature, "The image has no samples to read (%d x %d pixels, %d bands, NBPP %d)",
                          m_width, m_height, m_bands, m_bits);
    m_type = sampleType(source->getPvtype(), m_bits);
    m_sampleBytes = containerBytes(m_bits);
    const bool complex = m_type == eComplexFloat32 || m_type == eComplexFloat64;
    m_elementBytes = complex ? m_sampleBytes / 2 : m_sampleBytes;
    m_signed = source->getPvtype() == CNitfImagePropertiesIF::ePVTypeSignedInteger;
    m_packed = source->isPacked();
    m_bigEndianIn = !p.deliversWholeSamples();
    m_blockRowBytes = p.getTileBandWidthBufferSize();
    m_deliveredBytes = m_packed ? 0 : m_blockRowBytes / m_blockWidth;
}

const char* CNitfRegionReader::getSampleTypeName(eSampleType_t type) {
    static const char* const names[] = {"uint8",  "int8",  "uint16",  "int16",   "uint32",    "int32",
                                        "uint64", "int64", "float32", "float64", "complex64", "complex128"};
    return type >= eUInt8 && type <= eComplexFloat64 ? names[type] : "unknown";
}

int CNitfRegionReader::getResolutionLevels() const {
    return m_source->getResolutionLevels();
}

void CNitfRegionReader::setLevel(int level) {
    if (level < 0 || level >= m_source->getResolutionLevels())
        NITF_RAISE_FORMAT("void __cdecl CNitfRegionReader::setLevel(int)",
                          "The image has %d resolution level(s); there is no level %d",
                          m_source->getResolutionLevels(), level);
    // Level 0 is the image as the sub-header describes it, whatever size its data code.
    const CNitfImagePropertiesIF& p = m_source->getImageProperties();
    m_level = level;
    m_width = level == 0 ? p.getImageActualWidth() : m_source->getLevelWidth(level);
    m_height = level == 0 ? p.getImageActualHeight() : m_source->getLevelHeight(level);
}

size_t CNitfRegionReader::getBufferSize(int width, int height, int bands) const {
    if (width <= 0 || height <= 0 || bands <= 0)
        return 0;
    return static_cast<size_t>(width) * static_cast<size_t>(height) * static_cast<size_t>(bands) *
           static_cast<size_t>(m_sampleBytes);
}

int CNitfRegionReader::getRowsPerRead(int width, int bands, size_t budget) const {
    const size_t row = getBufferSize(width, 1, bands);
    if (row == 0 || row * m_blockHeight <= budget || !m_source->canDecodeBlockRows())
        return m_blockHeight;
    return static_cast<int>(std::max<size_t>(1, budget / row));
}

int CNitfRegionReader::getColumnsPerRead(int bands, size_t budget) const {
    const size_t blockRow = getBufferSize(m_blockWidth, m_blockHeight, bands);
    const size_t blocks = blockRow ? std::max<size_t>(1, budget / blockRow) : 1;
    return static_cast<int>(std::min<size_t>(blocks * m_blockWidth, static_cast<size_t>(m_width)));
}

CNitfRegionReader::Result CNitfRegionReader::read(int x, int y, int width, int height,
                                                  const std::vector<int>& bandList, void* out,
                                                  eLayout_t layout) {
    static const char signature[] =
        "struct CNitfRegionReader::Result __cdecl CNitfRegionReader::read(int,int,int,int,const class "
        "std::vector<int> &,void *,enum CNitfRegionReader::eLayout_t)";
    if (x < 0 || y < 0 || width <= 0 || height <= 0 || static_cast<long long>(x) + width > m_width ||
        static_cast<long long>(y) + height > m_height)
        NITF_RAISE_FORMAT(signature, "The window %d,%d,%d,%d does not lie inside the image (%d x %d pixels)",
                          x, y, width, height, m_width, m_height);
    std::vector<int> bands = bandList;
    if (bands.empty())
        for (int b = 0; b < m_bands; ++b)
            bands.push_back(b);
    for (int band : bands)
        if (band < 0 || band >= m_bands)
            NITF_RAISE_FORMAT(signature, "The image has %d band(s); there is no band %d", m_bands, band);

    const size_t count = bands.size();
    const size_t pixelStride = layout == ePixelInterleaved ? count * m_sampleBytes : m_sampleBytes;
    const size_t rowStride = pixelStride * static_cast<size_t>(width);
    const size_t planeStride = layout == ePixelInterleaved ? m_sampleBytes : rowStride * height;
    unsigned char* output = static_cast<unsigned char*>(out);

    Result result;
    if (m_level > 0) {
        readReduced(x, y, width, height, bands, output, layout, result);
        return result;
    }
    const int firstBlockY = y / m_blockHeight, lastBlockY = (y + height - 1) / m_blockHeight;
    const int firstBlockX = x / m_blockWidth, lastBlockX = (x + width - 1) / m_blockWidth;
    for (int blockY = firstBlockY; blockY <= lastBlockY; ++blockY) {
        const int top = std::max(y, blockY * m_blockHeight);
        const int bottom = std::min(y + height, (blockY + 1) * m_blockHeight);
        for (int blockX = firstBlockX; blockX <= lastBlockX; ++blockX) {
            const int left = std::max(x, blockX * m_blockWidth);
            const int right = std::min(x + width, (blockX + 1) * m_blockWidth);
            const bool wholeBlock = right - left == m_blockWidth && bottom - top == m_blockHeight;
            // Every band of this block before the next block: a block decoded whole serves them all.
            for (size_t k = 0; k < count; ++k) {
                Target target;
                target.column = left - blockX * m_blockWidth;
                target.row = top - blockY * m_blockHeight;
                target.width = right - left;
                target.height = bottom - top;
                target.out = output + k * planeStride + static_cast<size_t>(top - y) * rowStride +
                             static_cast<size_t>(left - x) * pixelStride;
                target.pixelStride = pixelStride;
                target.rowStride = rowStride;
                readBlockBand(blockX, blockY, bands[k], target, wholeBlock, result);
            }
        }
    }
    return result;
}

// Reduced levels come from the source's region read: one decode of every band from the lowest asked for to
// the highest, pixel-interleaved, then each band put in its place.
void CNitfRegionReader::readReduced(int x, int y, int width, int height, const std::vector<int>& bands,
                                    unsigned char* out, eLayout_t layout, Result& result) {
    const int first = *std::min_element(bands.begin(), bands.end());
    const int last = *std::max_element(bands.begin(), bands.end());
    const int span = last - first + 1;
    const size_t row = static_cast<size_t>(width) * span * m_sampleBytes;
    const size_t pixelStride = layout == ePixelInterleaved ? bands.size() * m_sampleBytes : m_sampleBytes;
    const size_t rowStride = pixelStride * width;
    std::vector<unsigned char> decoded;
    try {
        if (row > static_cast<size_t>(INT32_MAX))
            NITF_RAISE("A reduced-resolution window row is too long",
                       "void __cdecl CNitfRegionReader::readReduced(void)");
        decoded.resize(row * height);
        m_source->readRegion(m_file, m_level, x, y, width, height, first, span,
                             reinterpret_cast<char*>(decoded.data()), static_cast<int>(row));
    } catch (const vexo::Exception& e) {
        if (result.failedBlocks++ == 0)
            result.firstError = e.what();
    }
    if (decoded.empty()) { // not even begun: zeros
        std::memset(out, 0, getBufferSize(width, height, static_cast<int>(bands.size())));
        return;
    }
    const bool swap = needsSwap();
    for (size_t k = 0; k < bands.size(); ++k) {
        unsigned char* plane =
            out + (layout == ePixelInterleaved ? k * m_sampleBytes : k * rowStride * height);
        for (int r = 0; r < height; ++r)
            for (int c = 0; c < width; ++c)
                copySamples(plane + r * rowStride + c * pixelStride, m_sampleBytes,
                            decoded.data() + r * row +
                                (static_cast<size_t>(c) * span + bands[k] - first) * m_sampleBytes,
                            1, m_sampleBytes, m_elementBytes, swap);
    }
}

void CNitfRegionReader::readBlockBand(int blockX, int blockY, int band, const Target& target, bool wholeBlock,
                                      Result& result) {
    // Outside the block grid (blocks that do not cover the image): nothing is stored there.
    if (!m_source->isValidBlock(blockX, blockY, band)) {
        zero(target, m_sampleBytes);
        ++result.absentBlocks;
        return;
    }
    // A block the file records as absent is still asked for: uncompressed sources deliver zeros for it, as
    // their block reads always have; the others say it is absent, and it reads as the pad pixel.
    if (m_source->isBlockAbsent(blockX, blockY, band))
        ++result.absentBlocks;
    // Samples that need no conversion but perhaps a byte swap are decoded straight into the output.
    const bool direct = wholeBlock && !m_packed && m_deliveredBytes == m_sampleBytes &&
                        target.pixelStride == static_cast<size_t>(m_sampleBytes) &&
                        target.rowStride <= static_cast<size_t>(INT32_MAX);
    const long long incomplete = m_source->getIncompleteBlockCount();
    try {
        if (target.height < m_blockHeight && readRows(blockX, blockY, band, target)) {
            countIncomplete(incomplete, blockX, blockY, band, result);
            return;
        }
        bool read;
        if (direct) {
            read = m_source->readBand(m_file, target.out, static_cast<int>(target.rowStride), blockX, blockY,
                                      band, false);
            if (read)
                swapInPlace(target);
        } else {
            const size_t size = static_cast<size_t>(m_source->bandPlaneBytes());
            if (m_block.size() < size)
                m_block.resize(size);
            read = m_source->readBand(m_file, m_block.data(), m_blockRowBytes, blockX, blockY, band, false);
            if (read)
                convert(m_block.data(), target);
        }
        if (!read)
            fillAbsent(target);
        countIncomplete(incomplete, blockX, blockY, band, result);
    } catch (const vexo::Exception& e) {
        zero(target, m_sampleBytes);
        if (result.failedBlocks++ == 0)
            result.firstError = e.what();
    }
}

void CNitfRegionReader::countIncomplete(long long before, int blockX, int blockY, int band,
                                        Result& result) const {
    if (m_source->getIncompleteBlockCount() == before)
        return;
    if (result.failedBlocks++ == 0)
        result.firstError = "block (" + std::to_string(blockX) + ", " + std::to_string(blockY) +
                            ") of band " + std::to_string(band) + " runs past the end of the file";
}

bool CNitfRegionReader::readRows(int blockX, int blockY, int band, const Target& target) {
    if (m_packed)
        return false;
    const bool fullWidth = target.width == m_blockWidth && m_deliveredBytes == m_sampleBytes &&
                           target.pixelStride == static_cast<size_t>(m_sampleBytes) &&
                           target.rowStride <= static_cast<size_t>(INT32_MAX);
    if (fullWidth) {
        if (!m_source->readBandRows(m_file, target.out, static_cast<int>(target.rowStride), blockX, blockY,
                                    band, target.row, target.height))
            return false;
        swapInPlace(target);
        return true;
    }
    const size_t size = static_cast<size_t>(target.height) * m_blockRowBytes;
    if (m_block.size() < size)
        m_block.resize(size);
    if (!m_source->readBandRows(m_file, m_block.data(), m_blockRowBytes, blockX, blockY, band, target.row,
                                target.height))
        return false;
    Target rows = target;
    rows.row = 0;
    convert(m_block.data(), rows);
    return true;
}

void CNitfRegionReader::zero(const Target& target, size_t sampleBytes) {
    for (int r = 0; r < target.height; ++r) {
        unsigned char* out = target.out + r * target.rowStride;
        if (target.pixelStride == sampleBytes) {
            std::memset(out, 0, sampleBytes * target.width);
            continue;
        }
        for (int c = 0; c < target.width; ++c)
            std::memset(out + c * target.pixelStride, 0, sampleBytes);
    }
}

std::vector<unsigned char> CNitfRegionReader::padSample() const {
    std::vector<unsigned char> sample(static_cast<size_t>(m_sampleBytes), 0);
    if (!m_source->hasPadPixel())
        return sample;
    const long long pad = m_source->getPadPixelValue();
    uint64_t bits = static_cast<uint64_t>(pad);
    if (m_type == eFloat32) {
        const float value = static_cast<float>(pad);
        uint32_t word;
        std::memcpy(&word, &value, 4);
        bits = word;
    } else if (m_type == eFloat64) {
        const double value = static_cast<double>(pad);
        std::memcpy(&bits, &value, 8);
    } else if (m_type == eComplexFloat32 || m_type == eComplexFloat64) {
        return sample;
    }
    storeValue(sample.data(), bits, m_sampleBytes, m_bigEndianOut || kHostBigEndian);
    return sample;
}

void CNitfRegionReader::fillAbsent(const Target& target) const {
    const std::vector<unsigned char> pad = padSample();
    if (std::all_of(pad.begin(), pad.end(), [](unsigned char b) { return b == 0; })) {
        zero(target, m_sampleBytes);
        return;
    }
    for (int r = 0; r < target.height; ++r)
        for (int c = 0; c < target.width; ++c)
            std::memcpy(target.out + r * target.rowStride + c * target.pixelStride, pad.data(), pad.size());
}

void CNitfRegionReader::convert(const unsigned char* block, const Target& target) const {
    if (m_packed)
        convertPacked(block, target);
    else
        convertWhole(block, target);
}

void CNitfRegionReader::convertWhole(const unsigned char* block, const Target& target) const {
    const bool swap = needsSwap();
    for (int r = 0; r < target.height; ++r) {
        const unsigned char* in = block + static_cast<size_t>(target.row + r) * m_blockRowBytes +
                                  static_cast<size_t>(target.column) * m_deliveredBytes;
        copySamples(target.out + r * target.rowStride, target.pixelStride, in, target.width, m_sampleBytes,
                    m_elementBytes, swap);
    }
}

bool CNitfRegionReader::needsSwap() const {
    const bool inBig = m_bigEndianIn || kHostBigEndian;
    const bool outBig = m_bigEndianOut || kHostBigEndian;
    return m_elementBytes > 1 && inBig != outBig;
}

void CNitfRegionReader::swapInPlace(const Target& target) const {
    if (!needsSwap())
        return;
    for (int r = 0; r < target.height; ++r) {
        unsigned char* row = target.out + r * target.rowStride;
        copySamples(row, m_sampleBytes, row, target.width, m_sampleBytes, m_elementBytes, true);
    }
}

void CNitfRegionReader::convertPacked(const unsigned char* block, const Target& target) const {
    const bool bigEndian = m_bigEndianOut || kHostBigEndian;
    const uint64_t rowBits = static_cast<uint64_t>(m_blockWidth) * m_bits;
    const uint64_t signBit = uint64_t(1) << (m_bits - 1);
    for (int r = 0; r < target.height; ++r) {
        unsigned char* out = target.out + r * target.rowStride;
        uint64_t bit =
            static_cast<uint64_t>(target.row + r) * rowBits + static_cast<uint64_t>(target.column) * m_bits;
        if (m_bits == 1 && m_sampleBytes == 1) {
            for (int c = 0; c < target.width; ++c, ++bit, out += target.pixelStride)
                *out = packedbits::getBit(block, bit);
            continue;
        }
        for (int c = 0; c < target.width; ++c, bit += m_bits, out += target.pixelStride) {
            uint64_t value = packedbits::readValue(block, bit, m_bits);
            if (m_signed && (value & signBit))
                value |= ~uint64_t(0) << m_bits;
            storeValue(out, value, m_sampleBytes, bigEndian);
        }
    }
}
