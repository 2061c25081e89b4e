// Whole bands of an image segment in canonical form, decoded block by block through the library's block
// reader. The nitf tool's "extract" command and the conformance tests share this code, so that the tests
// check exactly what the tool writes.
#pragma once

#include <cstddef>
#include <cstdint>
#include <functional>
#include <vector>

class CNitfFile;
class CNitfImageSource;

namespace nitfextract {

// The canonical form of a band: NROWS rows of NCOLS samples, top row first, with the padding of partial
// blocks removed; each sample in ceil(NBPP / 8) bytes, big-endian, as stored (no LUT, no scaling, no ABPP
// shift), and one byte holding 0 or 1 for NBPP 1. Samples of packed depths (4, 12, ...) are unpacked most
// significant bit first, signed ones (PVTYPE SI) extended to two's complement of the whole bytes.
class BandReader {
public:
    // The source must have been started for reading (the file reader hands it out so).
    BandReader(CNitfFile& file, CNitfImageSource& source);

    int rows() const { return m_rows; }
    int cols() const { return m_cols; }
    int bands() const { return m_bands; }
    int bits() const { return m_bits; }
    int sampleBytes() const { return m_sampleBytes; }
    // Number of strips, one per block row that holds image rows.
    int strips() const { return m_strips; }
    // The image rows of strip `strip`: first row and count.
    int stripFirstRow(int strip) const { return strip * m_blockHeight; }
    int stripRows(int strip) const;

    // Decodes strip `strip` of band `band` into `out` (stripRows x cols samples in canonical form). Throws
    // std::runtime_error when a strip would be unreasonably large.
    void readStrip(int band, int strip, std::vector<unsigned char>& out);

    // Blocks the library could not read (they come out as zeros).
    int failedBlocks() const { return m_failedBlocks; }

private:
    void copyBlock(const unsigned char* block, int blockX, int rows, unsigned char* strip) const;

    CNitfFile& m_file;
    CNitfImageSource& m_source;
    int m_rows, m_cols, m_bands, m_bits, m_sampleBytes;
    bool m_signed;
    int m_blockWidth, m_blockHeight, m_blocksX, m_strips;
    int m_rowStride; // bytes between the rows of a block band (byte-multiple depths)
    // 12-bit JPEG: the library delivers each sample whole in two bytes of native order, not packed.
    bool m_nativeWords;
    std::vector<unsigned char> m_block;
    int m_failedBlocks = 0;
};

// Receives canonical bytes in order.
using Sink = std::function<void(const unsigned char* data, size_t size)>;
// Told how many of `total` strips are done.
using Progress = std::function<void(long long done, long long total)>;

// Streams band `band` (0-based), or every band one after the other when `band` is negative, in canonical
// form.
void writeCanonical(BandReader& reader, int band, const Sink& sink, const Progress& progress = Progress());

// The value of the `bits`-bit sample at bit position `bit` of a most-significant-bit-first stream.
uint64_t unpackSample(const unsigned char* data, uint64_t bit, int bits);

} // namespace nitfextract
