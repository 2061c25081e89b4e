#include "NitfImageSourceUncompressed.h"

#include <algorithm>
#include <climits>
#include <cstdint>
#include <cstring>

#include "DataStream.h"
#include "HostFile.h"
#include "HostMemory.h"
#include "NitfFile.h"
#include "PackedBits.h"
#include "Raise.h"

static const char kSourceFile[] = "nitf/lib/NitfImageSourceUncompressed";

using packedbits::copyBits;

namespace {

// Internal buffers hold data of the file. One larger than the image data the file holds comes from a damaged
// header; the slack lets a truncated file still be read, with zeros in place of what is missing.
const long long kAllocationSlack = 1 << 20;

// Reads `size` bytes at `offset`; whatever the file does not hold reads as zeros.
void readAt(FILE* fp, unsigned long long offset, char* buffer, size_t size) {
    __int64 position =
        offset <= static_cast<unsigned long long>(LLONG_MAX) ? static_cast<__int64>(offset) : -1;
    CDataStream::readZeroFilledAt(fp, position, buffer, size);
}

unsigned char* bytes(char* data) {
    return reinterpret_cast<unsigned char*>(data);
}
const unsigned char* bytes(const char* data) {
    return reinterpret_cast<const unsigned char*>(data);
}

} // namespace

CNitfImageSourceUncompressed::CNitfImageSourceUncompressed(CNitfImageSubheader* subheader, char* fileName)
    : CNitfImageSource(subheader, fileName), m_tileBandBytes(0), m_tileBytes(0), m_blockBuffer(nullptr),
      m_cacheX(-1), m_cacheY(-1), m_bitmapRowBits(0), m_bitmapRows(0) {}

CNitfImageSourceUncompressed::~CNitfImageSourceUncompressed() {
    free(m_blockBuffer);
}

__int64 CNitfImageSourceUncompressed::computeStorageLength() {
    return m_properties.getImageBufferSize() + computeBlockMaskStorageLength();
}

// A pixel-interleaved image of two or more bands cannot be written band by band.
bool CNitfImageSourceUncompressed::isWriteable() {
    const CNitfImagePropertiesIF::eInterleavingType_t mode = m_properties.getInterleavingType();
    return mode == CNitfImagePropertiesIF::eBandInterleavedByBlock ||
           mode == CNitfImagePropertiesIF::eBandSequential ||
           mode == CNitfImagePropertiesIF::eBandInterleavedByRow || m_properties.getBandCount() < 2;
}

bool CNitfImageSourceUncompressed::isPixelOrRowInterleaved() const {
    const CNitfImagePropertiesIF::eInterleavingType_t mode = m_properties.getInterleavingType();
    return mode == CNitfImagePropertiesIF::eBandInterleavedByPixel ||
           mode == CNitfImagePropertiesIF::eBandInterleavedByRow;
}

bool CNitfImageSourceUncompressed::isValidBlock(int x, int y) const {
    return x >= 0 && y >= 0 && x < m_properties.getTileCountX() && y < m_properties.getTileCountY();
}

// ---- block offsets ----------------------------------------------------------------------------------------

void CNitfImageSourceUncompressed::prepareTileOffsets(FILE*, long long dataOffset, long long,
                                                      unsigned int* blockMask, int count) {
    if (!m_tileOffsets)
        return;
    const int entries = m_tileOffsetCount;
    if (blockMask) {
        for (int i = 0; i < entries; ++i) {
            const unsigned int offset = i < count ? blockMask[i] : 0xFFFFFFFFu;
            m_tileOffsets[i] = offset == 0xFFFFFFFFu ? kAbsentBlock : dataOffset + offset;
        }
        return;
    }
    // Stored one after the other: band-blocks for IMODE S (the blocks of each band follow the previous
    // band's), whole blocks otherwise. checkGeometry keeps these products within 2^62.
    const long long entryBytes = m_properties.getInterleavingType() == CNitfImagePropertiesIF::eBandSequential
                                     ? m_tileBandBytes
                                     : m_tileBytes;
    for (int i = 0; i < entries; ++i)
        m_tileOffsets[i] = dataOffset + i * entryBytes;
}

unsigned long long CNitfImageSourceUncompressed::getTileOffset(int x, int y, int band) const {
    if (!m_tileOffsets || !isValidBlock(x, y) || band < 0 || band >= m_properties.getBandCount())
        return kAbsentBlock;
    switch (m_properties.getInterleavingType()) {
    case CNitfImagePropertiesIF::eBandSequential:
        return CNitfImageSource::getTileOffset(m_properties.getTileIndex(x, y, band));
    case CNitfImagePropertiesIF::eBandInterleavedByBlock: {
        const unsigned long long offset = CNitfImageSource::getTileOffset(m_properties.getTileIndex(x, y));
        return offset == kAbsentBlock ? offset : offset + band * m_tileBandBytes;
    }
    default:
        return CNitfImageSource::getTileOffset(m_properties.getTileIndex(x, y));
    }
}

// ---- starting ---------------------------------------------------------------------------------------------

char* CNitfImageSourceUncompressed::allocateJustified(long long size, const char* what) {
    if (size > availableData() + kAllocationSlack)
        NITF_RAISE_FORMAT(
            "char *__cdecl CNitfImageSourceUncompressed::allocateJustified(__int64,const char *)",
            "The image's %s (%lld bytes) is larger than the image data in the file (%lld bytes)", what, size,
            availableData());
    return static_cast<char*>(HCalloc(static_cast<size_t>(size > 0 ? size : 1), 1));
}

// Checks made before anything is allocated (each raises vexo::Exception):
// - an IMODE other than S, B, P, R: the layout of the samples is unknown;
// - block sizes, block rows and block counts that do not fit the interface's ints (checkGeometry);
// - without block offsets, more blocks than the file holds bytes of image data (the base's readStart);
// - block offsets that run past the end of the file (readBlockMask);
// - internal buffers (the block cache of IMODE P and R, the bitmap of a bi-level image) larger than the image
//   data the file holds, give or take a little (allocateJustified).
// Offsets that point past the end of the file are not errors: those blocks read as zeros.
void CNitfImageSourceUncompressed::readStart(FILE* fp, long long dataOffset, long long dataLength) {
    static const char signature[] =
        "void __cdecl CNitfImageSourceUncompressed::readStart(" NITF_FILE_SIG ",__int64,__int64)";
    if (m_properties.getInterleavingType() == CNitfImagePropertiesIF::eInterleavingUnknown) {
        CNitfProperty* mode = m_subheader ? FindProperty(m_subheader->getProperties(), "IMODE") : nullptr;
        NITF_RAISE_FORMAT(signature, "Unknown interleaving mode (ISH.IMODE == '%s')",
                          mode ? mode->toText().c_str() : "");
    }
    checkGeometry();
    m_tileBandBytes = m_properties.getTileBandBufferSize();
    m_tileBytes = m_properties.getBandCount() * m_tileBandBytes;

    CNitfImageSource::readStart(fp, dataOffset, dataLength);
    prepareTileOffsets(fp, dataOffset, dataLength, m_blockMask, m_blockMaskCount);

    free(m_blockBuffer);
    m_blockBuffer = nullptr;
    m_cacheX = m_cacheY = -1;
    if (isPixelOrRowInterleaved() && m_properties.getBandCount() >= 2)
        m_blockBuffer = allocateJustified(m_tileBytes, "block");
    if (m_properties.getBpp() == 1)
        buildBitmap(fp);
}

void CNitfImageSourceUncompressed::writeStart(FILE* fp, long long dataOffset, long long dataLength) {
    checkGeometry();
    m_tileBandBytes = m_properties.getTileBandBufferSize();
    m_tileBytes = m_properties.getBandCount() * m_tileBandBytes;
    CNitfImageSource::writeStart(fp, dataOffset, dataLength);
    prepareTileOffsets(fp, dataOffset, dataLength, m_blockMask, m_blockMaskCount);
}

// ---- bi-level images --------------------------------------------------------------------------------------

void CNitfImageSourceUncompressed::buildBitmap(FILE* fp) {
    const int width = m_properties.getTileWidth(), height = m_properties.getTileHeight();
    const int tilesX = m_properties.getTileCountX(), tilesY = m_properties.getTileCountY();
    const long long rowBits = static_cast<long long>(tilesX) * width;
    const long long rows = static_cast<long long>(tilesY) * height;

    // The data the blocks occupy (they may run past the recorded length), as far as the file holds it.
    long long span = std::max(m_dataLength, 0LL);
    for (int y = 0; y < tilesY; ++y) {
        for (int x = 0; x < tilesX; ++x) {
            const unsigned long long offset = getTileOffset(x, y, 0);
            if (offset != kAbsentBlock && offset >= static_cast<unsigned long long>(m_dataOffset))
                span = std::max(span, static_cast<long long>(offset - m_dataOffset) + m_tileBandBytes);
        }
    }
    span = std::min(span, availableData());

    char* data = static_cast<char*>(HMalloc(static_cast<size_t>(span > 0 ? span : 1)));
    readAt(fp, m_dataOffset, data, static_cast<size_t>(span));
    char* bitmap = nullptr;
    try {
        bitmap = ReassemblingBitmap(data, span, m_dataOffset, width, height, tilesX, tilesY, rowBits, rows);
    } catch (...) {
        free(data);
        throw;
    }
    free(data);
    free(m_workBuffer);
    m_workBuffer = bitmap;
    m_bitmapRowBits = rowBits;
    m_bitmapRows = rows;
}

char* CNitfImageSourceUncompressed::ReassemblingBitmap(const char* data, long long dataSize,
                                                       long long dataOffset, int tileWidth, int tileHeight,
                                                       int tilesX, int tilesY, long long rowBits,
                                                       long long rows) {
    long long bits = 0;
    if (__builtin_mul_overflow(rowBits, rows, &bits) || bits / 8 + 1 > INT_MAX)
        NITF_RAISE_FORMAT("char *__cdecl CNitfImageSourceUncompressed::ReassemblingBitmap(void)",
                          "A bi-level image of %lld x %lld pixels is too large", rowBits, rows);
    const long long size = bits / 8 + 1;
    // Zero-filled: bits of absent blocks, and of blocks the file does not hold, stay cleared.
    unsigned char* bitmap = bytes(allocateJustified(size, "bitmap"));
    m_workBufferSize = static_cast<int>(size);
    m_workBufferUsed = static_cast<int>(size);
    for (int y = 0; y < tilesY; ++y) {
        for (int x = 0; x < tilesX; ++x) {
            const unsigned long long offset = getTileOffset(x, y, 0);
            if (offset == kAbsentBlock || offset < static_cast<unsigned long long>(dataOffset) ||
                offset - dataOffset >= static_cast<unsigned long long>(dataSize))
                continue;
            const long long start = static_cast<long long>(offset - dataOffset);
            const long long storedBits = (dataSize - start) * 8;
            // The block's rows run on without padding, tileWidth x tileHeight bits in all.
            for (long long r = 0; r < tileHeight && r * tileWidth < storedBits; ++r) {
                const long long count = std::min<long long>(tileWidth, storedBits - r * tileWidth);
                copyBits(bitmap,
                         (y * static_cast<long long>(tileHeight) + r) * rowBits +
                             x * static_cast<long long>(tileWidth),
                         bytes(data + start), r * tileWidth, count);
            }
        }
    }
    return reinterpret_cast<char*>(bitmap);
}

bool CNitfImageSourceUncompressed::readBitmap(char* buffer, int x0, int y0, int width, int srcRows,
                                              int outWidthBits, int outRows) {
    // A file whose background is 1 is delivered with background 0.
    return packedbits::cutBitmap(bytes(m_workBuffer), m_bitmapRowBits, m_bitmapRows, bytes(buffer), x0, y0,
                                 width, srcRows, outWidthBits, outRows, m_padPixelValue == 1);
}

// ---- block reading ----------------------------------------------------------------------------------------

bool CNitfImageSourceUncompressed::readStored(FILE* fp, unsigned long long offset, char* buffer,
                                              long long size, int storedRow, int rowBytes) {
    const size_t total = static_cast<size_t>(size);
    if (isPacked() || rowBytes == storedRow) {
        // One band (or block) in one piece: straight into the caller's buffer.
        if (offset == kAbsentBlock)
            std::memset(buffer, 0, total);
        else
            readAt(fp, offset, buffer, total);
        return true;
    }
    if (rowBytes < storedRow || storedRow <= 0)
        return false;
    const size_t row = static_cast<size_t>(storedRow);
    const size_t rows = total / row;
    if (offset == kAbsentBlock) {
        for (size_t r = 0; r < rows; ++r)
            std::memset(buffer + r * rowBytes, 0, row);
        return true;
    }
    // Rows wider apart than stored: the rows follow one another in the file, so one seek serves them all.
    const bool seeked = DKFSeek64(fp, static_cast<__int64>(offset), SEEK_SET) == 0;
    for (size_t r = 0; r < rows; ++r) {
        char* out = buffer + r * rowBytes;
        if (seeked)
            CDataStream::readZeroFilled(fp, out, row);
        else
            std::memset(out, 0, row);
    }
    return true;
}

bool CNitfImageSourceUncompressed::readTileNonInterleaved(CNitfFile* file, char* buffer, int rowBytes, int x,
                                                          int y, int band) {
    FILE* fp = file ? file->getInputStream() : nullptr;
    if (!fp || !buffer || !m_tileOffsets || !isValidBlock(x, y) || band < 0 ||
        band >= m_properties.getBandCount())
        return false;
    if (isPixelOrRowInterleaved() && m_properties.getBandCount() >= 2) {
        if (!isPacked() && rowBytes < m_properties.getTileBandWidthBufferSize())
            return false;
        if (!loadBlockCache(file, x, y))
            return false;
        extractBand(buffer, rowBytes, band);
        return true;
    }
    return readStored(fp, getTileOffset(x, y, band), buffer, m_tileBandBytes,
                      m_properties.getTileBandWidthBufferSize(), rowBytes);
}

bool CNitfImageSourceUncompressed::loadBlockCache(CNitfFile* file, int x, int y) {
    if (m_cacheX == x && m_cacheY == y)
        return true;
    m_cacheX = m_cacheY = -1;
    if (!m_blockBuffer ||
        !readTileInterleaved(file, m_blockBuffer, m_properties.getTileWidthBufferSize(), x, y))
        return false;
    m_cacheX = x;
    m_cacheY = y;
    return true;
}

// One band out of the cached block. Byte-multiple depths use the interleaving conversions (row-interleaved
// bands come out as packed rows, whatever `rowBytes` says); packed depths come out as the band's bit stream,
// laid out as an IMODE B block band would be stored.
void CNitfImageSourceUncompressed::extractBand(char* buffer, int rowBytes, int band) {
    const int width = m_properties.getTileWidth(), height = m_properties.getTileHeight();
    const int bands = m_properties.getBandCount(), bits = m_properties.getBpp();
    const bool byPixel =
        m_properties.getInterleavingType() == CNitfImagePropertiesIF::eBandInterleavedByPixel;
    if (!isPacked()) {
        if (byPixel)
            deinterleavePixelToBand(buffer, rowBytes, m_blockBuffer, height, width, bands, bits, band);
        else
            deinterleaveRowToBand(buffer, rowBytes, m_blockBuffer, height, width, bands, bits, band);
        return;
    }
    unsigned char* out = bytes(buffer);
    std::memset(out, 0, static_cast<size_t>(m_tileBandBytes));
    const unsigned char* block = bytes(m_blockBuffer);
    const uint64_t rowBits = static_cast<uint64_t>(width) * bits;
    for (uint64_t r = 0; r < static_cast<uint64_t>(height); ++r) {
        if (!byPixel) {
            copyBits(out, r * rowBits, block, (r * bands + band) * rowBits, rowBits);
            continue;
        }
        for (uint64_t c = 0; c < static_cast<uint64_t>(width); ++c) {
            const uint64_t sample = r * width + c;
            copyBits(out, sample * bits, block, (sample * bands + band) * bits, bits);
        }
    }
}

bool CNitfImageSourceUncompressed::readTileInterleaved(CNitfFile* file, char* buffer, int rowBytes, int x,
                                                       int y) {
    FILE* fp = file ? file->getInputStream() : nullptr;
    if (!fp || !buffer || !m_tileOffsets || !isValidBlock(x, y))
        return false;
    const int bands = m_properties.getBandCount();
    const int storedRow = m_properties.getTileWidthBufferSize();
    if (isPixelOrRowInterleaved() || bands == 1) {
        // Stored interleaved already, or a single band: the block in one piece. Absent blocks read as zeros.
        return readStored(fp, getTileOffset(x, y, 0), buffer, m_tileBytes, storedRow, rowBytes);
    }

    // Band-interleaved by block or band-sequential: the bands side by side in the block buffer, then
    // interleaved into the caller's buffer.
    if (!isPacked() && rowBytes < storedRow)
        return false;
    if (!m_blockBuffer)
        m_blockBuffer = allocateJustified(m_tileBytes, "block");
    const int bandRow = m_properties.getTileBandWidthBufferSize();
    for (int band = 0; band < bands; ++band)
        readStored(fp, getTileOffset(x, y, band), m_blockBuffer + band * m_tileBandBytes, m_tileBandBytes,
                   bandRow, bandRow);
    const int width = m_properties.getTileWidth(), height = m_properties.getTileHeight();
    const int bits = m_properties.getBpp();
    if (!isPacked()) {
        deinterleaveBandToPixel(buffer, rowBytes, m_blockBuffer, height, width, bands, bits);
        return true;
    }
    unsigned char* out = bytes(buffer);
    std::memset(out, 0, static_cast<size_t>(m_tileBytes));
    const uint64_t samples = static_cast<uint64_t>(width) * height;
    for (int band = 0; band < bands; ++band) {
        const unsigned char* plane = bytes(m_blockBuffer + band * m_tileBandBytes);
        for (uint64_t i = 0; i < samples; ++i)
            copyBits(out, (i * bands + band) * bits, plane, i * bits, bits);
    }
    return true;
}

// ---- writing ----------------------------------------------------------------------------------------------

bool CNitfImageSourceUncompressed::writeTileNonInterleaved(CNitfFile* file, char* buffer, int x, int y,
                                                           int band) {
    if (!isWriteable() || !file || !buffer)
        return false;
    const unsigned long long offset = getTileOffset(x, y, band);
    FILE* fp = file->getOutputStream();
    if (!fp || offset == kAbsentBlock || DKFSeek64(fp, static_cast<__int64>(offset), SEEK_SET) != 0)
        return false;
    return DKFWrite(buffer, static_cast<size_t>(m_tileBandBytes), 1, fp) == 1;
}
