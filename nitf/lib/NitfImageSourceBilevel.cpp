#include "NitfImageSourceBilevel.h"

#include <algorithm>
#include <climits>
#include <cstring>
#include <string>
#include <strings.h>

#include "BiLevelHuffman.h"
#include "DataStream.h"
#include "HostError.h"
#include "HostMemory.h"
#include "NitfFile.h"
#include "PackedBits.h"
#include "Raise.h"

static const char kSourceFile[] = "nitf/lib/NitfImageSourceBilevel";

namespace {

// Every coded line takes at least 13 bits (an EOL and one code word): the most lines the image data can hold,
// and so the largest bitmap they can fill. A little slack lets a truncated file still be read.
const long long kLeastLineBits = 13;
const long long kBitmapSlack = 1 << 20;

} // namespace

CNitfImageSourceBilevel::CNitfImageSourceBilevel(CNitfImageSubheader* subheader, char* fileName)
    : CNitfImageSource(subheader, fileName), m_dataEnd(0), m_bitmapRowBits(0), m_bitmapRows(0),
      m_damagedBlocks(0) {}

CNitfImageSourceBilevel::~CNitfImageSourceBilevel() = default;

// ---- starting ---------------------------------------------------------------------------------------------

void CNitfImageSourceBilevel::readStart(FILE* fp, long long dataOffset, long long dataLength) {
    static const char signature[] =
        "void __cdecl CNitfImageSourceBilevel::readStart(" NITF_FILE_SIG ",__int64,__int64)";
    const CNitfImagePropertiesIF::eInterleavingType_t mode = m_properties.getInterleavingType();
    if (m_properties.getBpp() != 1)
        NITF_RAISE_FORMAT(signature, "A bi-level image has one bit per pixel (ISH.NBPP == %d)",
                          m_properties.getBpp());
    if (mode == CNitfImagePropertiesIF::eInterleavingUnknown) {
        CNitfProperty* field = FindProperty(m_subheader->getProperties(), "IMODE");
        NITF_RAISE_FORMAT(signature, "Unknown interleaving mode (ISH.IMODE == '%s')",
                          field ? nitf_detail::printable(field->toText()).c_str() : "");
    }
    // Each coded block holds one band: several bands only make sense one after the other.
    if (m_properties.getBandCount() > 1 && mode != CNitfImagePropertiesIF::eBandSequential)
        NITF_RAISE_FORMAT(signature,
                          "A bi-level image of %d bands must be band-sequential (ISH.IMODE == 'S')",
                          m_properties.getBandCount());
    checkGeometry();
    CNitfImageSource::readStart(fp, dataOffset, dataLength);
    m_dataEnd = static_cast<unsigned long long>(dataOffset) +
                static_cast<unsigned long long>(std::min(std::max(dataLength, 0LL), availableData()));

    // COMRAT "2DS " and "2DH " put a tag bit after every EOL; "1D  " (and anything else) does not.
    CNitfProperty* comrat = FindProperty(m_subheader->getProperties(), "COMRAT");
    const std::string rate = comrat ? comrat->toText() : std::string();
    m_decoder = std::make_unique<BiLevelHuffman>(m_properties.getTileWidth(),
                                                 strncasecmp(rate.c_str(), "2D", 2) == 0);

    prepareTileOffsets(fp, dataOffset, dataLength, m_blockMask, m_blockMaskCount);
    m_sortedOffsets.clear();
    for (int i = 0; i < m_tileOffsetCount; ++i)
        if (m_tileOffsets[i] != kAbsentBlock)
            m_sortedOffsets.push_back(m_tileOffsets[i]);
    std::sort(m_sortedOffsets.begin(), m_sortedOffsets.end());
    m_sortedOffsets.erase(std::unique(m_sortedOffsets.begin(), m_sortedOffsets.end()), m_sortedOffsets.end());
    m_damageNoted.assign(static_cast<size_t>(m_tileOffsetCount), false);
    m_damagedBlocks = 0;
    buildBitmap(fp);
}

void CNitfImageSourceBilevel::prepareTileOffsets(FILE* fp, long long dataOffset, long long,
                                                 unsigned int* blockMask, int count) {
    if (tileOffsetsFromMask(static_cast<unsigned long long>(dataOffset), blockMask, count))
        return;
    const int entries = m_tileOffsetCount;
    // Without a mask the blocks follow one another, each ending with its RTC and padding to a whole byte:
    // only walking each block's coding finds where the next one begins. Blocks after a damaged one, or past
    // the end of the data, are absent.
    std::fill(m_tileOffsets, m_tileOffsets + entries, kAbsentBlock);
    const unsigned long long begin = static_cast<unsigned long long>(dataOffset);
    const size_t size = m_dataEnd > begin ? static_cast<size_t>(m_dataEnd - begin) : 0;
    if (entries == 1) {
        m_tileOffsets[0] = begin;
        return;
    }
    std::vector<unsigned char> data(size);
    const size_t stored = CDataStream::readZeroFilledAt(fp, dataOffset, data.data(), size);
    size_t start = 0;
    for (int i = 0; i < entries && start < stored; ++i) {
        m_tileOffsets[i] = begin + start;
        const BiLevelHuffman::Result walked = m_decoder->decode(data.data() + start, stored - start,
                                                                m_properties.getTileHeight(), nullptr, 0, 0);
        if (walked.damage != BiLevelHuffman::eDamageNone)
            break;
        start += walked.codedBytes;
    }
}

unsigned long long CNitfImageSourceBilevel::codedLength(unsigned long long offset) const {
    auto next = std::upper_bound(m_sortedOffsets.begin(), m_sortedOffsets.end(), offset);
    const unsigned long long end = next != m_sortedOffsets.end() ? *next : m_dataEnd;
    return end > offset ? end - offset : 0;
}

void CNitfImageSourceBilevel::buildBitmap(FILE* fp) {
    static const char signature[] = "void __cdecl CNitfImageSourceBilevel::buildBitmap(" NITF_FILE_SIG ")";
    const int width = m_properties.getTileWidth(), height = m_properties.getTileHeight();
    const int tilesX = m_properties.getTileCountX(), tilesY = m_properties.getTileCountY();
    const long long rowBits = static_cast<long long>(tilesX) * width;
    const long long rows = static_cast<long long>(tilesY) * height;
    long long bits = 0;
    if (__builtin_mul_overflow(rowBits, rows, &bits) || bits / 8 + 1 > INT_MAX)
        NITF_RAISE_FORMAT(signature, "A bi-level image of %lld x %lld pixels is too large", rowBits, rows);
    const long long size = bits / 8 + 1;
    const long long codedLines = 8 * static_cast<long long>(m_dataEnd - m_dataOffset) / kLeastLineBits;
    long long fillable = 0;
    if (!__builtin_mul_overflow(codedLines, static_cast<long long>(width), &fillable) &&
        fillable / 8 + kBitmapSlack < size)
        NITF_RAISE_FORMAT(
            signature, "The image's bitmap (%lld bytes) is larger than its coded data (%lld bytes) can fill",
            size, static_cast<long long>(m_dataEnd - m_dataOffset));

    free(m_workBuffer);
    m_workBuffer = static_cast<char*>(HCalloc(static_cast<size_t>(size), 1));
    m_workBufferSize = m_workBufferUsed = static_cast<int>(size);
    m_bitmapRowBits = rowBits;
    m_bitmapRows = rows;
    // Each block is decoded straight into its place; in band-sequential images the bitmap is band 0's.
    for (int y = 0; y < tilesY; ++y)
        for (int x = 0; x < tilesX; ++x)
            decodeInto(fp, m_properties.getTileIndex(x, y), packedbits::bytes(m_workBuffer),
                       static_cast<uint64_t>(y) * height * rowBits + static_cast<uint64_t>(x) * width,
                       static_cast<uint64_t>(rowBits));
}

// ---- decoding ---------------------------------------------------------------------------------------------

bool CNitfImageSourceBilevel::decodeBlock(FILE* fp, int entry, int, unsigned char* buffer, int, bool) {
    const int width = m_properties.getTileWidth(), height = m_properties.getTileHeight();
    const int tilesX = m_properties.getTileCountX(), tilesY = m_properties.getTileCountY();
    bool read;
    if (m_workBuffer && entry >= 0 && entry < tilesX * tilesY) {
        // A block of band 0 is in the bitmap already, decoded when the source started.
        const uint64_t first = static_cast<uint64_t>(entry / tilesX) * height * m_bitmapRowBits +
                               static_cast<uint64_t>(entry % tilesX) * width;
        for (int row = 0; row < height; ++row)
            packedbits::copyBits(buffer, static_cast<uint64_t>(row) * width, packedbits::bytes(m_workBuffer),
                                 first + static_cast<uint64_t>(row) * m_bitmapRowBits, width);
        read = true;
    } else {
        read = decodeInto(fp, entry, buffer, 0, static_cast<uint64_t>(width));
    }
    if (read && m_damageNoted[entry])
        noteIncompleteBlock(); // a damaged block is not read whole
    return read;
}

bool CNitfImageSourceBilevel::decodeInto(FILE* fp, int index, unsigned char* out, uint64_t firstBit,
                                         uint64_t lineBits) {
    if (!m_decoder || index < 0 || index >= m_tileOffsetCount)
        return false;
    const int width = m_properties.getTileWidth(), height = m_properties.getTileHeight();
    const unsigned long long offset = m_tileOffsets[index];
    if (offset == kAbsentBlock) {
        for (int row = 0; row < height; ++row)
            packedbits::setBits(out, firstBit + row * lineBits, static_cast<uint64_t>(width), false);
        return true;
    }
    // No longer than the file holds from the image data on (codedLength stops at the data's end).
    m_coded.resize(static_cast<size_t>(codedLength(offset)));
    const size_t stored =
        CDataStream::readZeroFilledAt(fp, static_cast<__int64>(offset), m_coded.data(), m_coded.size());
    const BiLevelHuffman::Result result =
        m_decoder->decode(m_coded.data(), stored, height, out, firstBit, lineBits);
    if (result.damage != BiLevelHuffman::eDamageNone)
        noteDamage(index, result.damagedRow, BiLevelHuffman::describe(result.damage));
    return true;
}

void CNitfImageSourceBilevel::noteDamage(int index, int damagedRow, const char* what) {
    if (!m_damageNoted[index]) {
        m_damageNoted[index] = true;
        ++m_damagedBlocks;
    }
    char* message =
        MkName("damaged bi-level coding: %s in row %d of block %d; the rest of the block reads as white",
               what, damagedRow, index);
    const std::string text(message);
    free(message);
    warnOnce("damaged coding", text);
}

// ---- reading blocks ---------------------------------------------------------------------------------------

bool CNitfImageSourceBilevel::readBitmap(char* buffer, int x0, int y0, int width, int srcRows,
                                         int outWidthBits, int outRows) {
    // A file whose background is 1 is delivered with background 0.
    return packedbits::cutBitmap(packedbits::bytes(m_workBuffer), m_bitmapRowBits, m_bitmapRows,
                                 packedbits::bytes(buffer), x0, y0, width, srcRows, outWidthBits, outRows,
                                 m_padPixelValue == 1);
}
