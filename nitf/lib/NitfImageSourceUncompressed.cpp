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
// Returns the bytes the file held.
size_t readAt(FILE* fp, unsigned long long offset, char* buffer, size_t size) {
    __int64 position =
        offset <= static_cast<unsigned long long>(LLONG_MAX) ? static_cast<__int64>(offset) : -1;
    return CDataStream::readZeroFilledAt(fp, position, buffer, size);
}

using packedbits::bytes;
using packedbits::copyBits;
using packedbits::invertBits;
using packedbits::setBits;

} // namespace

CNitfImageSourceUncompressed::CNitfImageSourceUncompressed(CNitfImageSubheader* subheader, char* fileName)
    : CNitfImageSource(subheader, fileName), m_tileBandBytes(0), m_tileBytes(0), m_bitmapRowBits(0),
      m_bitmapRows(0) {}

CNitfImageSourceUncompressed::~CNitfImageSourceUncompressed() = default;

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

// ---- block offsets ----------------------------------------------------------------------------------------

void CNitfImageSourceUncompressed::prepareTileOffsets(FILE*, long long dataOffset, long long,
                                                      unsigned int* blockMask, int count) {
    if (tileOffsetsFromMask(static_cast<unsigned long long>(dataOffset), blockMask, count))
        return;
    // Stored one after the other. checkGeometry keeps these products within 2^62.
    const long long bytes = entryBytes();
    for (int i = 0; i < m_tileOffsetCount; ++i)
        m_tileOffsets[i] = dataOffset + i * bytes;
}

// The stored size of a block entry: band-blocks for IMODE S (the blocks of each band follow the previous
// band's), whole blocks otherwise.
long long CNitfImageSourceUncompressed::entryBytes() const {
    return m_properties.getInterleavingType() == CNitfImagePropertiesIF::eBandSequential ? m_tileBandBytes
                                                                                         : m_tileBytes;
}

unsigned long long CNitfImageSourceUncompressed::getTileOffset(int x, int y, int band) const {
    if (!isValidBlock(x, y, band))
        return kAbsentBlock;
    const unsigned long long offset = entryOffset(blockEntry(x, y, band));
    if (offset == kAbsentBlock ||
        m_properties.getInterleavingType() != CNitfImagePropertiesIF::eBandInterleavedByBlock)
        return offset;
    return offset + band * m_tileBandBytes;
}

// ---- starting ---------------------------------------------------------------------------------------------

void CNitfImageSourceUncompressed::checkJustified(long long size, const char* what) const {
    if (size > availableData() + kAllocationSlack)
        NITF_RAISE_FORMAT(
            "void __cdecl CNitfImageSourceUncompressed::checkJustified(__int64,const char *)",
            "The image's %s (%lld bytes) is larger than the image data in the file (%lld bytes)", what, size,
            availableData());
}

void CNitfImageSourceUncompressed::computeSizes() {
    checkGeometry();
    m_tileBandBytes = m_properties.getTileBandBufferSize();
    m_tileBytes = m_properties.getBandCount() * m_tileBandBytes;
}

// Checks made before anything is allocated (each raises vexo::Exception):
// - block sizes, block rows and block counts that do not fit the interface's ints (checkGeometry);
// - without block offsets, more blocks than the file holds bytes of image data (the base's readStart);
// - block offsets that run past the end of the file (readBlockMask);
// - blocks decoded whole (IMODE P and R) and the bitmap of a bi-level image larger than the image data the
//   file holds, give or take a little.
// Offsets that point past the end of the file are not errors: those blocks read as zeros. An unknown IMODE
// leaves the blocks unlocated: they read as absent.
void CNitfImageSourceUncompressed::readStart(FILE* fp, long long dataOffset, long long dataLength) {
    computeSizes();
    CNitfImageSource::readStart(fp, dataOffset, dataLength);
    prepareTileOffsets(fp, dataOffset, dataLength, m_blockMask, m_blockMaskCount);
    dropCachedBlock();
    // Blocks decoded whole must fit the data; band-blocks are decoded one at a time.
    checkJustified(getBlockLayout() != eBlockBands ? m_tileBytes : m_tileBandBytes, "block");
    checkDataPresent();
    if (m_properties.getBpp() == 1)
        buildBitmap(fp);
}

// The bytes the stored blocks reach, against what the file holds: a little missing is read as zeros with a
// warning; far more missing than present comes from damaged geometry, and would only extract zeros.
void CNitfImageSourceUncompressed::checkDataPresent() {
    const unsigned long long fileEnd = static_cast<unsigned long long>(m_dataOffset + availableData());
    const long long bytes = entryBytes();
    unsigned long long needed = 0, missing = 0;
    for (int i = 0; i < m_tileOffsetCount; ++i) {
        const unsigned long long offset = m_tileOffsets[i];
        if (offset == kAbsentBlock)
            continue;
        const unsigned long long end = offset + static_cast<unsigned long long>(bytes);
        needed += static_cast<unsigned long long>(bytes);
        if (end > fileEnd)
            missing += end - std::max(offset, fileEnd);
    }
    if (missing == 0)
        return;
    const unsigned long long present = needed - missing;
    if (missing > 2 * present + kAllocationSlack)
        NITF_RAISE_FORMAT("void __cdecl CNitfImageSourceUncompressed::checkDataPresent(void)",
                          "The image's blocks need %llu bytes of data but the file holds only %llu of them",
                          needed, present);
    warnOnce("short data", "the file holds " + std::to_string(present) + " of the " + std::to_string(needed) +
                               " bytes its blocks need; what is missing reads as zeros");
}

void CNitfImageSourceUncompressed::writeStart(FILE* fp, long long dataOffset, long long dataLength) {
    computeSizes();
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
    checkJustified(size, "bitmap");
    // Zero-filled: bits of absent blocks, and of blocks the file does not hold, stay cleared.
    unsigned char* bitmap = static_cast<unsigned char*>(HCalloc(static_cast<size_t>(size), 1));
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

void CNitfImageSourceUncompressed::readStored(FILE* fp, unsigned long long offset, unsigned char* buffer,
                                              long long size, int storedRow, int rowBytes) {
    const size_t total = static_cast<size_t>(size);
    if (isPacked() || rowBytes == storedRow) {
        // In one piece: straight into the caller's buffer.
        if (offset == kAbsentBlock)
            std::memset(buffer, 0, total);
        else if (readAt(fp, offset, reinterpret_cast<char*>(buffer), total) < total)
            noteIncompleteBlock();
        return;
    }
    const size_t row = static_cast<size_t>(storedRow);
    const size_t rows = total / row;
    if (offset == kAbsentBlock) {
        for (size_t r = 0; r < rows; ++r)
            std::memset(buffer + r * rowBytes, 0, row);
        return;
    }
    // Rows wider apart than stored: the rows follow one another in the file, so one seek serves them all.
    const bool seeked = DKFSeek64(fp, static_cast<__int64>(offset), SEEK_SET) == 0;
    size_t got = 0;
    for (size_t r = 0; r < rows; ++r) {
        unsigned char* out = buffer + r * rowBytes;
        if (seeked)
            got += CDataStream::readZeroFilled(fp, out, row);
        else
            std::memset(out, 0, row);
    }
    if (got < rows * row)
        noteIncompleteBlock();
}

bool CNitfImageSourceUncompressed::decodeBlock(FILE* fp, int entry, int band, unsigned char* buffer,
                                               int rowBytes, bool) {
    unsigned long long offset = entryOffset(entry);
    if (band < 0) {
        readStored(fp, offset, buffer, m_tileBytes, m_properties.getTileWidthBufferSize(), rowBytes);
        return true;
    }
    if (offset != kAbsentBlock)
        offset += band * m_tileBandBytes;
    readStored(fp, offset, buffer, m_tileBandBytes, bandRowBytes(), rowBytes);
    return true;
}

bool CNitfImageSourceUncompressed::canDecodeBlockRows() const {
    return getBlockLayout() == eBlockBands && !isPacked();
}

bool CNitfImageSourceUncompressed::decodeBlockRows(FILE* fp, int entry, int band, int firstRow, int rows,
                                                   unsigned char* buffer, int rowBytes) {
    unsigned long long offset = entryOffset(entry);
    const long long storedRow = bandRowBytes();
    if (offset != kAbsentBlock)
        offset += band * m_tileBandBytes + firstRow * storedRow;
    readStored(fp, offset, buffer, rows * storedRow, static_cast<int>(storedRow), rowBytes);
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
