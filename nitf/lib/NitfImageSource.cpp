#include "NitfImageSource.h"

#include <algorithm>
#include <climits>
#include <cstdint>
#include <cstring>
#include <string>

#if defined(__x86_64__) || defined(__i386__)
#include <immintrin.h>
#endif

#include "DataStreamRead.h"
#include "HostFile.h"
#include "HostMemory.h"
#include "NitfFile.h"
#include "PackedBits.h"
#include "Raise.h"

static const char kSourceFile[] = "nitf/lib/NitfImageSource";

CNitfImageSource::CNitfImageSource(CNitfImageSubheader* subheader, char*)
    : m_tileOffsets(nullptr), m_tileOffsetCount(0), m_blockMask(nullptr), m_blockMaskCount(0),
      m_subheader(subheader), m_workBuffer(nullptr), m_workBufferSize(0), m_workBufferUsed(0),
      m_padPixelValue(0), m_hasPadPixel(false), m_dataOffset(0), m_dataLength(0), m_availableData(0),
      m_channelType(0), m_channelIndex(-1), m_imageIndex(0), m_cachedX(-1), m_cachedY(-1), m_decodeCount(0) {
    if (m_subheader)
        m_properties.setProperties(m_subheader->getProperties());
}

CNitfImageSource::~CNitfImageSource() {
    free(m_tileOffsets);
    free(m_blockMask);
    free(m_workBuffer);
    m_workBuffer = nullptr;
    m_workBufferSize = 0;
    m_workBufferUsed = 0;
    delete m_subheader;
}

__int64 CNitfImageSource::computeStorageLength() {
    return 0;
}

bool CNitfImageSource::validateParameters(FILE*) {
    return false;
}

// ---- block tables -----------------------------------------------------------------------------------------

int CNitfImageSource::blockEntryCount() const {
    const long long blocksX = m_properties.getTileCountX();
    const long long blocksY = m_properties.getTileCountY();
    const long long bands = m_properties.getBandCount();
    if (blocksX <= 0 || blocksY <= 0 || bands <= 0)
        return 0;
    long long count = blocksX * blocksY; // both are ints: no overflow
    switch (m_properties.getInterleavingType()) {
    case CNitfImagePropertiesIF::eBandSequential:
        if (count <= INT_MAX)
            count *= bands;
        break;
    case CNitfImagePropertiesIF::eBandInterleavedByBlock:
    case CNitfImagePropertiesIF::eBandInterleavedByPixel:
    case CNitfImagePropertiesIF::eBandInterleavedByRow:
        break;
    default:
        return 0;
    }
    if (count > INT_MAX)
        NITF_RAISE_FORMAT("int __cdecl CNitfImageSource::blockEntryCount(void)",
                          "The image has too many blocks (%lld x %lld, %lld bands)", blocksX, blocksY, bands);
    return static_cast<int>(count);
}

// The block readers hand out one band of one block in a buffer, and take row sizes, whose sizes the interface
// gives as ints; geometry beyond that is damage (the largest legitimate block, 8192 x 8192 samples of 64
// bits, is 512 MiB). Every product is checked in 64 bits before it is formed.
void CNitfImageSource::checkGeometry() const {
    static const char signature[] = "void __cdecl CNitfImageSource::checkGeometry(void)";
    const long long width = m_properties.getTileWidth();
    const long long height = m_properties.getTileHeight();
    const long long bits = m_properties.getBpp();
    const long long bands = m_properties.getBandCount();
    const long long blocksX = m_properties.getTileCountX();
    const long long blocksY = m_properties.getTileCountY();
    if (width <= 0 || height <= 0 || blocksX <= 0 || blocksY <= 0 || bands <= 0 || bits <= 0 || bits > 64)
        NITF_RAISE_FORMAT(signature,
                          "Invalid image geometry (NPPBH %lld, NPPBV %lld, NBPR %lld, NBPC %lld, NBPP %lld, "
                          "%lld bands)",
                          width, height, blocksX, blocksY, bits, bands);
    if (blocksX * blocksY > INT_MAX || blocksX * blocksY * bands > INT_MAX)
        NITF_RAISE_FORMAT(signature, "The image has too many blocks (%lld x %lld, %lld bands)", blocksX,
                          blocksY, bands);
    if (width * height > 8LL * INT_MAX / bits)
        NITF_RAISE_FORMAT(signature, "Image blocks of %lld x %lld samples of %lld bits are too large", width,
                          height, bits);
    if ((width * bits + 7) / 8 * bands > INT_MAX)
        NITF_RAISE_FORMAT(signature, "Image block rows of %lld samples in %lld bands are too long", width,
                          bands);
}

void CNitfImageSource::allocateTileOffsets() {
    const int entries = blockEntryCount();
    free(m_tileOffsets);
    m_tileOffsets = nullptr;
    m_tileOffsetCount = 0;
    if (entries == 0)
        return;
    m_tileOffsets = static_cast<unsigned long long*>(HCalloc(entries, sizeof(unsigned long long)));
    m_tileOffsetCount = entries;
}

unsigned long long CNitfImageSource::getTileOffset(int index) const {
    if (!m_tileOffsets || index < 0 || index >= m_tileOffsetCount)
        return 0;
    return m_tileOffsets[index];
}

// ---- reading and writing ----------------------------------------------------------------------------------

// Bytes of the file from `offset` to its end.
static long long bytesFrom(FILE* fp, long long offset) {
    const long long size = DKSize(fp);
    return size > offset && offset >= 0 ? size - offset : 0;
}

void CNitfImageSource::readStart(FILE* fp, long long dataOffset, long long dataLength) {
    m_dataOffset = dataOffset;
    m_dataLength = dataLength;
    m_availableData = bytesFrom(fp, dataOffset);
    const int entries = blockEntryCount();
    // Without block offsets every block is stored, and each takes at least one byte: more blocks than the
    // file holds bytes comes from a damaged header, and would only make a table larger than the file.
    if (!m_blockMask && entries > m_availableData)
        NITF_RAISE_FORMAT("void __cdecl CNitfImageSource::readStart(" NITF_FILE_SIG ",__int64,__int64)",
                          "The image data (%lld bytes in the file) cannot hold its %d blocks",
                          m_availableData, entries);
    allocateTileOffsets();
}

void CNitfImageSource::writeStart(FILE*, long long, long long) {
    allocateTileOffsets();
}

// The georeferencing bridge: corners are read for the actual image (NCOLS x NROWS) and written for the
// block-padded one (NBPR x NPPBH, NBPC x NPPBV). The asymmetry is deliberate and kept.
void CNitfImageSource::readProjection(FILE* fp, ProjInfo_t* info, bool precise) {
    if (m_subheader)
        m_subheader->getGeorefSource().read(fp, m_subheader, info, m_properties.getImageActualWidth(),
                                            m_properties.getImageActualHeight(), precise);
}

void CNitfImageSource::writeProjection(FILE* fp, ProjInfo_t* info) {
    if (m_subheader)
        m_subheader->getGeorefSource().write(fp, info, m_properties.getImageWidth(),
                                             m_properties.getImageHeight());
}

bool CNitfImageSource::readBitmap(char*, int, int, int, int, int, int) {
    return false;
}

void CNitfImageSource::readFinish() {}

bool CNitfImageSource::isWriteable() {
    return false;
}

bool CNitfImageSource::writeTileNonInterleaved(CNitfFile*, char*, int, int, int) {
    return false;
}

void CNitfImageSource::writeFinish(FILE*) {}

bool CNitfImageSource::readTileInterleaved(CNitfFile* file, char* buffer, int x, int y) {
    return readTileInterleaved(file, buffer, m_properties.getTileWidthBufferSize(), x, y);
}

bool CNitfImageSource::readTileNonInterleaved(CNitfFile* file, char* buffer, int band, int x, int y) {
    const int rowBytes = m_properties.getTileBandWidthBufferSize();
    bool ok = false;
    try {
        ok = readTileNonInterleaved(file, buffer, rowBytes, x, y, band);
    } catch (...) {
        ok = false;
    }
    if (!ok && buffer) {
        const long long size = m_properties.getTileBandReadBufferSize();
        if (size > 0)
            std::memset(buffer, 0, static_cast<size_t>(size));
    }
    return ok;
}

// ---- block mechanics --------------------------------------------------------------------------------------

bool CNitfImageSource::isValidBlock(int x, int y, int band) const {
    return x >= 0 && y >= 0 && band >= 0 && x < m_properties.getTileCountX() &&
           y < m_properties.getTileCountY() && band < m_properties.getBandCount();
}

bool CNitfImageSource::isPacked() const {
    return !m_properties.deliversWholeSamples() && m_properties.getBpp() % 8 != 0;
}

int CNitfImageSource::blockEntry(int x, int y, int band) const {
    return m_properties.getInterleavingType() == CNitfImagePropertiesIF::eBandSequential
               ? m_properties.getTileIndex(x, y, band)
               : m_properties.getTileIndex(x, y);
}

int CNitfImageSource::bandInEntry(int band) const {
    return m_properties.getInterleavingType() == CNitfImagePropertiesIF::eBandSequential ? 0 : band;
}

unsigned long long CNitfImageSource::entryOffset(int entry) const {
    if (!m_tileOffsets || entry < 0 || entry >= m_tileOffsetCount)
        return kAbsentBlock;
    return m_tileOffsets[entry];
}

bool CNitfImageSource::isBlockAbsent(int x, int y, int band) const {
    if (!isValidBlock(x, y, band))
        return true;
    const int entry = blockEntry(x, y, band);
    const bool missing = entry >= 0 && static_cast<size_t>(entry) < m_missing.size() && m_missing[entry];
    return !missing && entryOffset(entry) == kAbsentBlock;
}

void CNitfImageSource::markMissing(int entry) {
    if (entry < 0 || entry >= m_tileOffsetCount)
        return;
    if (m_missing.empty())
        m_missing.assign(static_cast<size_t>(m_tileOffsetCount), false);
    m_missing[entry] = true;
}

void CNitfImageSource::warnOnce(const char* cause, const std::string& message) {
    if (!m_warned.insert(cause).second)
        return;
    const std::string text = "Image " + std::to_string(m_imageIndex) + ": " + message;
    vexo::nspio::Warning::Warn(text.c_str(), kSourceFile, __LINE__);
}

bool CNitfImageSource::tileOffsetsFromMask(unsigned long long start, const unsigned int* blockMask,
                                           int count) {
    if (!m_tileOffsets || m_tileOffsetCount == 0)
        return true;
    if (!blockMask)
        return false;
    for (int i = 0; i < m_tileOffsetCount; ++i) {
        const unsigned int offset = i < count ? blockMask[i] : 0xFFFFFFFFu;
        m_tileOffsets[i] = offset == 0xFFFFFFFFu ? kAbsentBlock : start + offset;
    }
    return true;
}

CNitfImageSource::eBlockLayout_t CNitfImageSource::getBlockLayout() const {
    if (m_properties.getBandCount() < 2)
        return eBlockBands;
    switch (m_properties.getInterleavingType()) {
    case CNitfImagePropertiesIF::eBandInterleavedByPixel:
        return eBlockPixels;
    case CNitfImagePropertiesIF::eBandInterleavedByRow:
        return eBlockRows;
    default:
        return eBlockBands;
    }
}

void CNitfImageSource::finishBand(CNitfFile*, unsigned char*, int) {}

bool CNitfImageSource::decodeBlockRows(FILE*, int, int, int, int, unsigned char*, int) {
    return false;
}

int CNitfImageSource::getResolutionLevels() const {
    return 1;
}

int CNitfImageSource::getLevelWidth(int level) const {
    return level == 0 ? m_properties.getImageActualWidth() : 0;
}

int CNitfImageSource::getLevelHeight(int level) const {
    return level == 0 ? m_properties.getImageActualHeight() : 0;
}

void CNitfImageSource::readRegion(CNitfFile*, int level, int, int, int, int, int, int, char*, int) {
    NITF_RAISE_FORMAT(
        "void __cdecl CNitfImageSource::readRegion(class CNitfFile *,int,int,int,int,int,int,int,"
        "char *,int)",
        "This image cannot be read at reduced resolution level %d", level);
}

bool CNitfImageSource::canDecodeBlockRows() const {
    return false;
}

bool CNitfImageSource::readBandRows(CNitfFile* file, unsigned char* buffer, int rowBytes, int x, int y,
                                    int band, int firstRow, int rows) {
    if (!canDecodeBlockRows() || firstRow < 0 || rows <= 0 || firstRow + rows > m_properties.getTileHeight())
        return false;
    checkRowBytes(
        rowBytes, bandRowBytes(),
        "bool __cdecl CNitfImageSource::readBandRows(class CNitfFile *,unsigned char *,int,int,int,int,"
        "int,int)");
    if (!decodeBlockRows(file->getInputStream(), blockEntry(x, y, band), bandInEntry(band), firstRow, rows,
                         buffer, rowBytes))
        return false;
    ++m_decodeCount;
    return true;
}

void CNitfImageSource::checkRowBytes(int rowBytes, int wanted, const char* signature) const {
    if (!isPacked() && rowBytes < wanted)
        NITF_RAISE_FORMAT(signature, "Rows of %d bytes cannot hold a block row of %d bytes", rowBytes,
                          wanted);
}

bool CNitfImageSource::decodeCounted(FILE* fp, int entry, int band, unsigned char* buffer, int rowBytes,
                                     bool interleaved) {
    if (entry >= 0 && static_cast<size_t>(entry) < m_missing.size() && m_missing[entry]) {
        ++m_incompleteBlocks;
        NITF_RAISE_FORMAT("bool __cdecl CNitfImageSource::decodeBlock(" NITF_FILE_SIG
                          ",int,int,unsigned char *,int,bool)",
                          "Block entry %d of the image is not in the file", entry);
    }
    ++m_decodeCount;
    return decodeBlock(fp, entry, band, buffer, rowBytes, interleaved);
}

bool CNitfImageSource::readTileNonInterleaved(CNitfFile* file, char* buffer, int rowBytes, int x, int y,
                                              int band) {
    FILE* fp = file ? file->getInputStream() : nullptr;
    if (!fp || !buffer || !m_tileOffsets || !isValidBlock(x, y, band))
        return false;
    return readBand(file, packedbits::bytes(buffer), rowBytes, x, y, band, true);
}

bool CNitfImageSource::readBand(CNitfFile* file, unsigned char* buffer, int rowBytes, int x, int y, int band,
                                bool packRows) {
    checkRowBytes(
        rowBytes, bandRowBytes(),
        "bool __cdecl CNitfImageSource::readTileNonInterleaved(class CNitfFile *,char *,int,int,int,"
        "int)");
    FILE* fp = file->getInputStream();
    if (getBlockLayout() == eBlockBands) {
        if (!decodeCounted(fp, blockEntry(x, y, band), bandInEntry(band), buffer, rowBytes, false))
            return false;
    } else {
        // Every band of the block comes out of one decode: keep it for the bands that follow.
        if (!loadCachedBlock(fp, x, y))
            return false;
        extractCachedBand(buffer, rowBytes, band, packRows);
    }
    finishBand(file, buffer, rowBytes);
    return true;
}

bool CNitfImageSource::readTileInterleaved(CNitfFile* file, char* buffer, int rowBytes, int x, int y) {
    FILE* fp = file ? file->getInputStream() : nullptr;
    if (!fp || !buffer || !m_tileOffsets || !isValidBlock(x, y, 0))
        return false;
    checkRowBytes(rowBytes, m_properties.getTileWidthBufferSize(),
                  "bool __cdecl CNitfImageSource::readTileInterleaved(class CNitfFile *,char *,int,int,int)");
    unsigned char* out = packedbits::bytes(buffer);
    const int bands = m_properties.getBandCount();
    const eBlockLayout_t layout = getBlockLayout();
    if (bands == 1 || layout == eBlockPixels || layout == eBlockRows)
        return decodeCounted(fp, blockEntry(x, y, 0), layout == eBlockBands ? 0 : -1, out, rowBytes, true);

    // Band after band: each band as a band read would give it, then interleaved.
    const long long plane = bandPlaneBytes();
    const unsigned char* planes = nullptr;
    if (layout == eBlockBands) {
        m_planes.resize(static_cast<size_t>(plane * bands));
        for (int band = 0; band < bands; ++band)
            if (!readBand(file, m_planes.data() + band * plane, bandRowBytes(), x, y, band, true))
                return false;
        planes = m_planes.data();
    } else {
        if (!loadCachedBlock(fp, x, y))
            return false;
        planes = m_cachedBlock.data();
    }
    interleavePlanes(planes, out, rowBytes);
    return true;
}

bool CNitfImageSource::loadCachedBlock(FILE* fp, int x, int y) {
    if (x == m_cachedX && y == m_cachedY)
        return true;
    m_cachedX = m_cachedY = -1;
    const bool planes = getBlockLayout() == eBlockPlanes;
    const long long size =
        planes ? bandPlaneBytes() * m_properties.getBandCount() : m_properties.getTileReadBufferSize();
    if (m_cachedBlock.size() < static_cast<size_t>(size))
        m_cachedBlock.resize(static_cast<size_t>(size));
    const int rowBytes = planes ? bandRowBytes() : m_properties.getTileWidthBufferSize();
    if (!decodeCounted(fp, blockEntry(x, y, 0), -1, m_cachedBlock.data(), rowBytes, true))
        return false;
    m_cachedX = x;
    m_cachedY = y;
    return true;
}

void CNitfImageSource::extractCachedBand(unsigned char* buffer, int rowBytes, int band, bool packRows) const {
    const int width = m_properties.getTileWidth(), height = m_properties.getTileHeight();
    const int bands = m_properties.getBandCount();
    const unsigned char* block = m_cachedBlock.data();
    const eBlockLayout_t layout = getBlockLayout();
    char* out = reinterpret_cast<char*>(buffer);
    char* in = const_cast<char*>(reinterpret_cast<const char*>(block));
    if (!isPacked()) {
        const int sampleBits = 8 * (bandRowBytes() / std::max(width, 1));
        const size_t row = static_cast<size_t>(bandRowBytes());
        switch (layout) {
        case eBlockPixels:
            deinterleavePixelToBand(out, rowBytes, in, height, width, bands, sampleBits, band);
            return;
        case eBlockRows:
            if (packRows) {
                deinterleaveRowToBand(out, rowBytes, in, height, width, bands, sampleBits, band);
                return;
            }
            for (int r = 0; r < height; ++r)
                std::memcpy(buffer + static_cast<size_t>(r) * rowBytes, block + (r * bands + band) * row,
                            row);
            return;
        default: {
            const unsigned char* plane = block + band * bandPlaneBytes();
            for (int r = 0; r < height; ++r)
                std::memcpy(buffer + static_cast<size_t>(r) * rowBytes, plane + r * row, row);
            return;
        }
        }
    }
    // Packed depths come out as the band's bit stream, laid out as one band of an IMODE B block is stored.
    const int bits = m_properties.getBpp();
    const uint64_t rowBits = static_cast<uint64_t>(width) * bits;
    if (layout == eBlockPlanes || layout == eBlockBands) {
        std::memcpy(buffer, block + band * bandPlaneBytes(), static_cast<size_t>(bandPlaneBytes()));
        return;
    }
    std::memset(buffer, 0, static_cast<size_t>(m_properties.getTileBandBufferSize()));
    for (uint64_t r = 0; r < static_cast<uint64_t>(height); ++r) {
        if (layout == eBlockRows) {
            packedbits::copyBits(buffer, r * rowBits, block, (r * bands + band) * rowBits, rowBits);
            continue;
        }
        for (uint64_t c = 0; c < static_cast<uint64_t>(width); ++c) {
            const uint64_t sample = r * width + c;
            packedbits::copyBits(buffer, sample * bits, block, (sample * bands + band) * bits, bits);
        }
    }
}

void CNitfImageSource::interleavePlanes(const unsigned char* planes, unsigned char* buffer,
                                        int rowBytes) const {
    const int width = m_properties.getTileWidth(), height = m_properties.getTileHeight();
    const int bands = m_properties.getBandCount();
    const long long plane = bandPlaneBytes();
    if (!isPacked()) {
        const int sampleBits = 8 * (bandRowBytes() / std::max(width, 1));
        deinterleaveBandToPixel(reinterpret_cast<char*>(buffer), rowBytes,
                                const_cast<char*>(reinterpret_cast<const char*>(planes)), height, width,
                                bands, sampleBits);
        return;
    }
    const int bits = m_properties.getBpp();
    std::memset(buffer, 0, static_cast<size_t>(m_properties.getTileBufferSize()));
    const uint64_t samples = static_cast<uint64_t>(width) * height;
    for (int band = 0; band < bands; ++band)
        for (uint64_t i = 0; i < samples; ++i)
            packedbits::copyBits(buffer, (i * bands + band) * bits, planes + band * plane, i * bits, bits);
}

// ---- block mask record ------------------------------------------------------------------------------------

namespace {

// The pad pixel code, decoded by pixel value type; false when the width or the type has no pad pixel.
bool decodePadPixel(const unsigned char* code, int bytes, CNitfImagePropertiesIF::ePVType_t type, int bits,
                    __int64& value) {
    uint32_t raw = 0;
    for (int i = 0; i < bytes; ++i)
        raw = (raw << 8) | code[i];
    switch (type) {
    case CNitfImagePropertiesIF::ePVTypeInteger:
        if (bytes != 1 && bytes != 2 && bytes != 4)
            return false;
        value = raw;
        return true;
    case CNitfImagePropertiesIF::ePVTypeBilevel:
        if (bytes != 1)
            return false;
        value = raw;
        return true;
    case CNitfImagePropertiesIF::ePVTypeSignedInteger:
        if (bytes == 1)
            value = static_cast<int8_t>(raw);
        else if (bytes == 2)
            value = static_cast<int16_t>(raw);
        else if (bytes == 4)
            value = static_cast<int32_t>(raw);
        else
            return false;
        return true;
    case CNitfImagePropertiesIF::ePVTypeReal: {
        // A 32-bit float only describes 32-bit samples; it is kept truncated to an integer.
        if (bytes != 4 || bits != 32)
            return false;
        float real;
        std::memcpy(&real, &raw, sizeof real);
        value = nitf_detail::truncateTo<long long>(real, LLONG_MIN, LLONG_MAX);
        return true;
    }
    default:
        return false;
    }
}

} // namespace

int CNitfImageSource::readBlockMask(FILE* fp) {
    static const char signature[] = "int __cdecl CNitfImageSource::readBlockMask(" NITF_FILE_SIG ")";
    CDataStreamRead in(fp);
    in.readUint32(); // IMDATOFF: the blocks follow the record directly
    const bool hasBlockOffsets = in.readUint16() != 0;
    const bool hasPadMask = in.readUint16() != 0;
    const int codeBytes = (in.readUint16() + 7) / 8;

    m_hasPadPixel = false;
    m_padPixelValue = 0;
    if (codeBytes == 1 || codeBytes == 2 || codeBytes == 4) {
        unsigned char code[4];
        for (int i = 0; i < codeBytes; ++i)
            code[i] = in.readByte();
        m_hasPadPixel = decodePadPixel(code, codeBytes, getPvtype(), m_properties.getBpp(), m_padPixelValue);
        if (!m_hasPadPixel)
            m_padPixelValue = 0;
    } else {
        in.skip(codeBytes);
    }

    const long long count = blockEntryCount();
    free(m_blockMask);
    m_blockMask = nullptr;
    m_blockMaskCount = 0;
    if (hasBlockOffsets && count > 0) {
        // The offsets are kept, so they must be in the file: that bounds the array by the file's size.
        CDataStream::requireReadable(fp, 4 * count, "The block mask");
        m_blockMask = static_cast<unsigned int*>(HMalloc(static_cast<size_t>(4 * count)));
        m_blockMaskCount = static_cast<int>(count);
        CDataStream::readZeroFilled(fp, m_blockMask, static_cast<size_t>(4 * count));
        for (long long i = 0; i < count; ++i)
            CDataStream::reverse(&m_blockMask[i], 4);
    }
    // The pad pixel mask is skipped unread: where pad pixels lie does not change how blocks are read.
    if (hasPadMask && count > 0)
        in.skip(4 * count);

    const long long length =
        10 + codeBytes + (hasBlockOffsets ? 4 * count : 0) + (hasPadMask ? 4 * count : 0);
    if (length > INT_MAX)
        NITF_RAISE_FORMAT(signature, "The block mask record (%lld bytes) is too long", length);
    return static_cast<int>(length);
}

__int64 CNitfImageSource::computeBlockMaskStorageLength() const {
    // The pad pixel code and the pad pixel mask are not counted.
    return m_blockMask ? 10 + 4 * static_cast<__int64>(m_blockMaskCount) : 0;
}

// ---- fields of the sub-header -----------------------------------------------------------------------------

void CNitfImageSource::fillTileBlank(char* buffer, int rowStride) {
    const int rowBytes = m_properties.getTileWidthBufferSize();
    for (int row = 0; row < m_properties.getTileHeight(); ++row) {
        std::memset(buffer, 0, static_cast<size_t>(rowBytes));
        buffer += rowStride;
    }
}

// The integer of a sub-header field; an absent field is created empty and reads as 0.
static int subheaderInt(CNitfImageSubheader* subheader, const char* name) {
    if (!subheader)
        return 0;
    CNitfProperty*& value = subheader->getProperties()[const_cast<char*>(name)];
    if (!value)
        value = new CNitfProperty("");
    return value->getDataType() == CNitfProperty::eNone ? 0 : value->getAsInt();
}

int CNitfImageSource::getDisplayLevel() {
    return subheaderInt(m_subheader, "IDLVL");
}

// IDLVL, not IALVL: callers of this interface have always received the display level here.
int CNitfImageSource::getAttachmentLevel() {
    return subheaderInt(m_subheader, "IDLVL");
}

CNitfImagePropertiesIF::ePVType_t CNitfImageSource::getPvtype() {
    CNitfProperty* field = m_subheader ? FindProperty(m_subheader->getProperties(), "PVTYPE") : nullptr;
    const std::string text = field ? field->toText() : std::string();
    static const struct {
        const char* code;
        CNitfImagePropertiesIF::ePVType_t type;
    } codes[] = {{"INT", CNitfImagePropertiesIF::ePVTypeInteger},
                 {"B  ", CNitfImagePropertiesIF::ePVTypeBilevel},
                 {"SI ", CNitfImagePropertiesIF::ePVTypeSignedInteger},
                 {"R  ", CNitfImagePropertiesIF::ePVTypeReal},
                 {"C  ", CNitfImagePropertiesIF::ePVTypeComplex}};
    for (const auto& entry : codes) {
        if (_stricmp(text.c_str(), entry.code) == 0)
            return entry.type;
    }
    return CNitfImagePropertiesIF::ePVTypeUnknown;
}

char* CNitfImageSource::getErrorMessage(int) {
    return MkName("%s", "NITF Image error");
}

// ---- interleaving conversions -----------------------------------------------------------------------------

namespace {

// Each conversion copies samples of a fixed byte size; the common sizes get a loop the compiler can unroll.
template <size_t Bytes> inline void copySample(char* dst, const char* src) {
    std::memcpy(dst, src, Bytes);
}

template <size_t Bytes>
void bandToPixel(char* dst, size_t dstRowStride, const char* src, size_t rows, size_t cols, size_t bands) {
    const size_t plane = rows * cols * Bytes;
    for (size_t band = 0; band < bands; ++band) {
        const char* in = src + band * plane;
        for (size_t r = 0; r < rows; ++r) {
            char* out = dst + r * dstRowStride + band * Bytes;
            for (size_t c = 0; c < cols; ++c, in += Bytes, out += bands * Bytes)
                copySample<Bytes>(out, in);
        }
    }
}

template <size_t Bytes>
void pixelToBand(char* dst, size_t dstRowStride, const char* src, size_t rows, size_t cols, size_t bands,
                 size_t band) {
    const size_t pixelBytes = bands * Bytes;
    const char* in = src + band * Bytes;
    for (size_t r = 0; r < rows; ++r) {
        char* out = dst + r * dstRowStride;
        for (size_t c = 0; c < cols; ++c, in += pixelBytes, out += Bytes)
            copySample<Bytes>(out, in);
    }
}

// One byte of each of three interleaved bands, the most common pixel-interleaved layout (RGB): handing out
// its bands is on the path of every block read, so it gets a vector loop where the processor has byte
// shuffles.
void pixelToBandRgb8Scalar(unsigned char* out, const unsigned char* in, size_t cols) {
    for (size_t c = 0; c < cols; ++c)
        out[c] = in[3 * c];
}

#if defined(__x86_64__) || defined(__i386__)
// For each band, the shuffles that gather its 16 bytes out of 48 interleaved ones: byte j of the result is
// input byte 3j + band, found in vector (3j + band) / 16; positions holding 0x80 are zeroed by the shuffle.
struct RgbShuffles {
    alignas(16) unsigned char masks[3][3][16];
    RgbShuffles() {
        std::memset(masks, 0x80, sizeof masks);
        for (int band = 0; band < 3; ++band)
            for (int j = 0; j < 16; ++j)
                masks[band][(3 * j + band) / 16][j] = static_cast<unsigned char>((3 * j + band) % 16);
    }
};

__attribute__((target("ssse3"))) void pixelToBandRgb8Ssse3(unsigned char* out, const unsigned char* in,
                                                           size_t cols, int band) {
    static const RgbShuffles shuffles;
    const __m128i* masks = reinterpret_cast<const __m128i*>(shuffles.masks[band]);
    const __m128i m0 = _mm_load_si128(masks), m1 = _mm_load_si128(masks + 1), m2 = _mm_load_si128(masks + 2);
    const unsigned char* pixels = in - band; // the shuffles pick the band
    size_t c = 0;
    for (; c + 16 <= cols; c += 16) {
        const __m128i* block = reinterpret_cast<const __m128i*>(pixels + 3 * c);
        const __m128i gathered = _mm_or_si128(_mm_or_si128(_mm_shuffle_epi8(_mm_loadu_si128(block), m0),
                                                           _mm_shuffle_epi8(_mm_loadu_si128(block + 1), m1)),
                                              _mm_shuffle_epi8(_mm_loadu_si128(block + 2), m2));
        _mm_storeu_si128(reinterpret_cast<__m128i*>(out + c), gathered);
    }
    pixelToBandRgb8Scalar(out + c, in + 3 * c, cols - c);
}

// Two 16-byte loads 48 bytes apart, in the lower and the upper 128-bit lane.
__attribute__((target("avx2"))) inline __m256i loadLanes(const unsigned char* low) {
    return _mm256_inserti128_si256(
        _mm256_castsi128_si256(_mm_loadu_si128(reinterpret_cast<const __m128i*>(low))),
        _mm_loadu_si128(reinterpret_cast<const __m128i*>(low + 48)), 1);
}

// The same with 32 bytes at a time. Shuffles do not cross lanes, so each lane gathers from its own 48 input
// bytes: the lower lane from bytes 0-47, the upper from 48-95.
__attribute__((target("avx2"))) void pixelToBandRgb8Avx2(unsigned char* out, const unsigned char* in,
                                                         size_t cols, int band) {
    static const RgbShuffles shuffles;
    const __m128i* masks = reinterpret_cast<const __m128i*>(shuffles.masks[band]);
    const __m256i m0 = _mm256_broadcastsi128_si256(_mm_load_si128(masks));
    const __m256i m1 = _mm256_broadcastsi128_si256(_mm_load_si128(masks + 1));
    const __m256i m2 = _mm256_broadcastsi128_si256(_mm_load_si128(masks + 2));
    const unsigned char* pixels = in - band;
    size_t c = 0;
    for (; c + 32 <= cols; c += 32) {
        const unsigned char* block = pixels + 3 * c;
        const __m256i gathered =
            _mm256_or_si256(_mm256_or_si256(_mm256_shuffle_epi8(loadLanes(block), m0),
                                            _mm256_shuffle_epi8(loadLanes(block + 16), m1)),
                            _mm256_shuffle_epi8(loadLanes(block + 32), m2));
        _mm256_storeu_si256(reinterpret_cast<__m256i*>(out + c), gathered);
    }
    if (c < cols)
        pixelToBandRgb8Ssse3(out + c, in + 3 * c, cols - c, band);
}

enum class VectorUnit { None, Ssse3, Avx2 };

VectorUnit vectorUnit() {
    static const VectorUnit unit = __builtin_cpu_supports("avx2")    ? VectorUnit::Avx2
                                   : __builtin_cpu_supports("ssse3") ? VectorUnit::Ssse3
                                                                     : VectorUnit::None;
    return unit;
}
#endif

void pixelToBandRgb8(char* dst, size_t dstRowStride, const char* src, size_t rows, size_t cols, size_t band) {
    // Packed destination rows are one long row.
    if (dstRowStride == cols) {
        cols *= rows;
        rows = 1;
    }
    for (size_t r = 0; r < rows; ++r) {
        const unsigned char* in = reinterpret_cast<const unsigned char*>(src) + r * cols * 3 + band;
        unsigned char* out = reinterpret_cast<unsigned char*>(dst) + r * dstRowStride;
#if defined(__x86_64__) || defined(__i386__)
        if (vectorUnit() == VectorUnit::Avx2) {
            pixelToBandRgb8Avx2(out, in, cols, static_cast<int>(band));
            continue;
        }
        if (vectorUnit() == VectorUnit::Ssse3) {
            pixelToBandRgb8Ssse3(out, in, cols, static_cast<int>(band));
            continue;
        }
#endif
        pixelToBandRgb8Scalar(out, in, cols);
    }
}

void copySampleBytes(char* dst, const char* src, size_t bytes) {
    std::memcpy(dst, src, bytes);
}

} // namespace

void CNitfImageSource::deinterleaveBandToPixel(char* dst, int dstRowStride, char* src, int rows, int cols,
                                               int bands, int bitsPerPixel) {
    const int bytes = bitsPerPixel / 8;
    if (rows <= 0 || cols <= 0 || bands <= 0 || bytes <= 0)
        return;
    const size_t stride = static_cast<size_t>(dstRowStride);
    switch (bytes) {
    case 1:
        return bandToPixel<1>(dst, stride, src, rows, cols, bands);
    case 2:
        return bandToPixel<2>(dst, stride, src, rows, cols, bands);
    case 4:
        return bandToPixel<4>(dst, stride, src, rows, cols, bands);
    case 8:
        return bandToPixel<8>(dst, stride, src, rows, cols, bands);
    default:
        break;
    }
    const size_t b = static_cast<size_t>(bytes), plane = static_cast<size_t>(rows) * cols * b;
    for (size_t k = 0; k < static_cast<size_t>(bands); ++k)
        for (size_t r = 0; r < static_cast<size_t>(rows); ++r)
            for (size_t c = 0; c < static_cast<size_t>(cols); ++c)
                copySampleBytes(dst + r * stride + (c * bands + k) * b, src + k * plane + (r * cols + c) * b,
                                b);
}

void CNitfImageSource::deinterleavePixelToBand(char* dst, int dstRowStride, char* src, int rows, int cols,
                                               int bands, int bitsPerPixel, int band) {
    const int bytes = bitsPerPixel / 8;
    if (rows <= 0 || cols <= 0 || bands <= 0 || bytes <= 0 || band < 0 || band >= bands)
        return;
    const size_t stride = static_cast<size_t>(dstRowStride);
    if (bytes == 1 && bands == 3)
        return pixelToBandRgb8(dst, stride, src, rows, cols, band);
    switch (bytes) {
    case 1:
        return pixelToBand<1>(dst, stride, src, rows, cols, bands, band);
    case 2:
        return pixelToBand<2>(dst, stride, src, rows, cols, bands, band);
    case 4:
        return pixelToBand<4>(dst, stride, src, rows, cols, bands, band);
    case 8:
        return pixelToBand<8>(dst, stride, src, rows, cols, bands, band);
    default:
        break;
    }
    const size_t b = static_cast<size_t>(bytes);
    for (size_t r = 0; r < static_cast<size_t>(rows); ++r)
        for (size_t c = 0; c < static_cast<size_t>(cols); ++c)
            copySampleBytes(dst + r * stride + c * b, src + ((r * cols + c) * bands + band) * b, b);
}

// The destination rows are packed: `dstRowStride` is not used (callers have always received packed rows
// here).
void CNitfImageSource::deinterleaveRowToBand(char* dst, int, char* src, int rows, int cols, int bands,
                                             int bitsPerPixel, int band) {
    const int bytes = bitsPerPixel / 8;
    if (rows <= 0 || cols <= 0 || bands <= 0 || bytes <= 0 || band < 0 || band >= bands)
        return;
    const size_t rowBytes = static_cast<size_t>(bytes) * cols;
    const size_t sourceRow = static_cast<size_t>(bands) * bitsPerPixel / 8 * cols;
    for (size_t r = 0; r < static_cast<size_t>(rows); ++r)
        std::memcpy(dst + r * rowBytes, src + r * sourceRow + band * rowBytes, rowBytes);
}
