#include "ImageExtract.h"

#include <algorithm>
#include <cstring>
#include <stdexcept>
#include <string>

#include "NitfFile.h"
#include "NitfImageSource.h"

namespace nitfextract {

namespace {

// A block, or a strip (one block row across the whole image), beyond this is more than a viewer or a hash can
// use: it comes from a damaged header.
const long long kLargestBuffer = 1LL << 30;

int ceilDiv(int a, int b) {
    return static_cast<int>((static_cast<long long>(a) + b - 1) / b);
}

} // namespace

uint64_t unpackSample(const unsigned char* data, uint64_t bit, int bits) {
    const uint64_t first = bit >> 3, last = (bit + bits - 1) >> 3;
    unsigned __int128 window = 0;
    for (uint64_t i = first; i <= last; ++i)
        window = (window << 8) | data[i];
    const unsigned shift = static_cast<unsigned>((last + 1) * 8 - (bit + bits));
    const uint64_t mask = bits >= 64 ? ~uint64_t(0) : (uint64_t(1) << bits) - 1;
    return static_cast<uint64_t>(window >> shift) & mask;
}

BandReader::BandReader(CNitfFile& file, CNitfImageSource& source) : m_file(file), m_source(source) {
    const CNitfImagePropertiesIF& p = source.getImageProperties();
    m_rows = p.getImageActualHeight();
    m_cols = p.getImageActualWidth();
    m_bands = p.getBandCount();
    m_bits = p.getBpp();
    m_blockWidth = p.getTileWidth();
    m_blockHeight = p.getTileHeight();
    if (m_rows <= 0 || m_cols <= 0 || m_bands <= 0 || m_bits <= 0 || m_bits > 64 || m_blockWidth <= 0 ||
        m_blockHeight <= 0)
        throw std::runtime_error("the image has no samples to extract");
    m_sampleBytes = (m_bits + 7) / 8;
    m_signed = source.getPvtype() == CNitfImagePropertiesIF::ePVTypeSignedInteger;
    m_blocksX = ceilDiv(m_cols, m_blockWidth);
    m_strips = ceilDiv(m_rows, m_blockHeight);
    if (m_blocksX > p.getTileCountX() || m_strips > p.getTileCountY())
        throw std::runtime_error("the image's blocks do not cover its " + std::to_string(m_cols) + " x " +
                                 std::to_string(m_rows) + " pixels");
    m_rowStride = p.getTileBandWidthBufferSize();
    m_nativeWords = m_bits % 8 != 0 && m_bits <= 16 && m_rowStride == 2 * m_blockWidth;
    // The reader fills whole rows of the stride, and packed depths fill the band's whole bit stream.
    const long long rowsSize = static_cast<long long>(m_rowStride) * m_blockHeight;
    const long long size = std::max(rowsSize, static_cast<long long>(p.getTileBandBufferSize()));
    if (size > kLargestBuffer)
        throw std::runtime_error("image blocks of " + std::to_string(size) +
                                 " bytes are too large to extract");
    m_block.assign(static_cast<size_t>(size), 0);
}

int BandReader::stripRows(int strip) const {
    const long long first = static_cast<long long>(strip) * m_blockHeight;
    return static_cast<int>(std::max(0LL, std::min<long long>(m_blockHeight, m_rows - first)));
}

void BandReader::readStrip(int band, int strip, std::vector<unsigned char>& out) {
    const int rows = stripRows(strip);
    const size_t size = static_cast<size_t>(rows) * static_cast<size_t>(m_cols) * m_sampleBytes;
    if (static_cast<long long>(size) > kLargestBuffer)
        throw std::runtime_error("a block row of " + std::to_string(size) + " bytes is too large to extract");
    out.resize(size);
    char* block = reinterpret_cast<char*>(m_block.data());
    for (int x = 0; x < m_blocksX; ++x) {
        if (!m_source.readTileNonInterleaved(&m_file, block, band, x, strip))
            ++m_failedBlocks;
        copyBlock(m_block.data(), x, rows, out.data());
    }
}

void BandReader::copyBlock(const unsigned char* block, int blockX, int rows, unsigned char* strip) const {
    const int firstCol = blockX * m_blockWidth;
    const int cols = std::min(m_blockWidth, m_cols - firstCol);
    const size_t outRow = static_cast<size_t>(m_cols) * m_sampleBytes;
    for (int r = 0; r < rows; ++r) {
        unsigned char* out = strip + r * outRow + static_cast<size_t>(firstCol) * m_sampleBytes;
        if (m_bits % 8 == 0) {
            // Whole-byte samples arrive big-endian, as stored: the canonical form already.
            std::memcpy(out, block + static_cast<size_t>(r) * m_rowStride,
                        static_cast<size_t>(cols) * m_sampleBytes);
            continue;
        }
        if (m_nativeWords) {
            for (int c = 0; c < cols; ++c) {
                uint16_t value;
                std::memcpy(&value, block + static_cast<size_t>(r) * m_rowStride + 2 * c, 2);
                out[2 * c] = static_cast<unsigned char>(value >> 8);
                out[2 * c + 1] = static_cast<unsigned char>(value & 0xFF);
            }
            continue;
        }
        // Packed depths arrive as the band's bit stream, rows running on without padding.
        const uint64_t rowBit = static_cast<uint64_t>(r) * m_blockWidth * m_bits;
        for (int c = 0; c < cols; ++c) {
            uint64_t value = unpackSample(block, rowBit + static_cast<uint64_t>(c) * m_bits, m_bits);
            if (m_signed && (value >> (m_bits - 1)) != 0)
                value |= ~uint64_t(0) << m_bits;
            for (int b = m_sampleBytes - 1; b >= 0; --b, value >>= 8)
                out[c * m_sampleBytes + b] = static_cast<unsigned char>(value);
        }
    }
}

void writeCanonical(BandReader& reader, int band, const Sink& sink, const Progress& progress) {
    const int firstBand = band < 0 ? 0 : band;
    const int lastBand = band < 0 ? reader.bands() - 1 : band;
    if (firstBand < 0 || lastBand >= reader.bands())
        throw std::runtime_error("the image has no band " + std::to_string(band));
    const long long total = static_cast<long long>(lastBand - firstBand + 1) * reader.strips();
    long long done = 0;
    std::vector<unsigned char> strip;
    for (int b = firstBand; b <= lastBand; ++b) {
        for (int s = 0; s < reader.strips(); ++s) {
            reader.readStrip(b, s, strip);
            sink(strip.data(), strip.size());
            if (progress)
                progress(++done, total);
        }
    }
}

} // namespace nitfextract
