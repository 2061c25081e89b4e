#include "NitfImageSourceJpeg.h"

#include <algorithm>
#include <cstring>
#include <string>
#include <strings.h>

#include "BlockResampler.h"
#include "HostError.h"
#include "HostFile.h"
#include "JpegAmplitudeMap.h"
#include "JpegStreamDecoder.h"
#include "NitfExtension.h"
#include "NitfFile.h"
#include "Raise.h"

static const char kSourceFile[] = "nitf/lib/NitfImageSourceJpeg";

namespace {

const size_t kScanChunk = 65536;
// A stream may be coded smaller or larger than its block; one this much larger than the block is damage.
const long long kLargestStreamToBlock = 16;

const char kDecodeSignature[] =
    "bool __cdecl CNitfImageSourceJpeg::decodeBlock(" NITF_FILE_SIG ",int,unsigned char *,int,int,bool)";

bool startsWithNoCase(const std::string& text, const char* prefix) {
    return strncasecmp(text.c_str(), prefix, std::strlen(prefix)) == 0;
}

} // namespace

CNitfImageSourceJpeg::CNitfImageSourceJpeg(CNitfImageSubheader* subheader, char* fileName)
    : CNitfImageSource(subheader, fileName), m_cachedX(-1), m_cachedY(-1), m_dataEnd(0),
      m_colour(eColourAsStored), m_amplitudeOffset(0), m_mappedOffset(0), m_hasNitfApp6(false),
      m_method3Warned(false), m_decodeCount(0) {}

CNitfImageSourceJpeg::~CNitfImageSourceJpeg() = default;

// ---- locating the streams
// ----------------------------------------------------------------------------------

std::vector<unsigned long long> CNitfImageSourceJpeg::findStreamStarts(FILE* fp, long long offset,
                                                                       long long length, size_t limit) {
    std::vector<unsigned long long> starts;
    if (!fp || offset < 0 || length <= 0 || limit == 0 || DKFSeek64(fp, offset, SEEK_SET) != 0)
        return starts;
    // After 0xFF the next byte decides: 0xD8 starts a stream, 0xFE a comment (two length bytes, then the
    // comment's bytes, passed over unseen), 0xFF keeps waiting, anything else is some other marker.
    enum { eSearching, eAfterFF, eLengthHigh, eLengthLow, eInComment } state = eSearching;
    unsigned commentLength = 0;
    unsigned long long commentLeft = 0;
    std::vector<unsigned char> chunk(kScanChunk);
    for (long long consumed = 0; consumed < length;) {
        const size_t wanted = static_cast<size_t>(std::min<long long>(length - consumed, kScanChunk));
        const size_t got = DKFRead(chunk.data(), 1, wanted, fp);
        if (got == 0)
            break;
        const unsigned char* bytes = chunk.data();
        for (size_t i = 0; i < got; ++i) {
            const unsigned char byte = bytes[i];
            switch (state) {
            case eSearching: {
                const void* marker = std::memchr(bytes + i, 0xFF, got - i);
                if (!marker) {
                    i = got;
                    break;
                }
                i = static_cast<size_t>(static_cast<const unsigned char*>(marker) - bytes);
                state = eAfterFF;
                break;
            }
            case eAfterFF:
                if (byte == 0xD8) {
                    starts.push_back(static_cast<unsigned long long>(offset + consumed) + i - 1);
                    if (starts.size() == limit)
                        return starts;
                    state = eSearching;
                } else if (byte == 0xFE) {
                    state = eLengthHigh;
                } else if (byte != 0xFF) {
                    state = eSearching;
                }
                break;
            case eLengthHigh:
                commentLength = static_cast<unsigned>(byte) << 8;
                state = eLengthLow;
                break;
            case eLengthLow:
                commentLength |= byte;
                commentLeft = commentLength > 2 ? commentLength - 2 : 0;
                state = commentLeft ? eInComment : eSearching;
                break;
            case eInComment: {
                const size_t passed = static_cast<size_t>(std::min<unsigned long long>(commentLeft, got - i));
                i += passed - 1;
                commentLeft -= passed;
                if (commentLeft == 0)
                    state = eSearching;
                break;
            }
            }
        }
        consumed += static_cast<long long>(got);
    }
    return starts;
}

void CNitfImageSourceJpeg::prepareTileOffsets(FILE* fp, long long dataOffset, long long dataLength,
                                              unsigned int* blockMask, int count) {
    const int entries = m_tileOffsetCount;
    if (!m_tileOffsets || entries == 0)
        return;
    if (blockMask) {
        for (int i = 0; i < entries; ++i) {
            const unsigned long long entry = i < count ? blockMask[i] : kAbsentBlock;
            m_tileOffsets[i] =
                entry == kAbsentBlock ? kAbsentBlock : entry + static_cast<unsigned long long>(dataOffset);
        }
        return;
    }
    // Streams follow each other in block order (band after band for IMODE S). A block whose stream is not
    // found reads as absent.
    const std::vector<unsigned long long> starts =
        findStreamStarts(fp, dataOffset, dataLength, static_cast<size_t>(entries));
    for (int i = 0; i < entries; ++i)
        m_tileOffsets[i] = static_cast<size_t>(i) < starts.size() ? starts[i] : kAbsentBlock;
}

unsigned long long CNitfImageSourceJpeg::streamLength(unsigned long long offset) const {
    auto next = std::upper_bound(m_sortedOffsets.begin(), m_sortedOffsets.end(), offset);
    const unsigned long long end = next != m_sortedOffsets.end() ? *next : m_dataEnd;
    return end > offset ? end - offset : 0;
}

// ---- set-up
// ------------------------------------------------------------------------------------------------

void CNitfImageSourceJpeg::readStart(FILE* fp, long long dataOffset, long long dataLength) {
    checkGeometry();
    CNitfImageSource::readStart(fp, dataOffset, dataLength);
    m_dataEnd = static_cast<unsigned long long>(dataOffset) +
                static_cast<unsigned long long>(std::max(dataLength, 0LL));
    prepareTileOffsets(fp, dataOffset, dataLength, m_blockMask, m_blockMaskCount);

    m_sortedOffsets.clear();
    for (int i = 0; m_tileOffsets && i < m_tileOffsetCount; ++i)
        if (m_tileOffsets[i] != kAbsentBlock)
            m_sortedOffsets.push_back(m_tileOffsets[i]);
    std::sort(m_sortedOffsets.begin(), m_sortedOffsets.end());
    m_sortedOffsets.erase(std::unique(m_sortedOffsets.begin(), m_sortedOffsets.end()), m_sortedOffsets.end());

    PropertyMap& fields = m_subheader->getProperties();
    CNitfProperty* irep = FindProperty(fields, "IREP");
    const std::string representation = irep ? irep->toText() : std::string();
    if (startsWithNoCase(representation, "RGB"))
        m_colour = eColourRgb;
    else if (startsWithNoCase(representation, "MULTI"))
        m_colour = eColourMulti;
    else if (startsWithNoCase(representation, "YCbCr"))
        m_colour = eColourYCbCr;
    else
        m_colour = eColourAsStored;

    // COMRAT "XX.Y": Y chooses the default quantisation table (0: the streams carry their own).
    CNitfProperty* comrat = FindProperty(fields, "COMRAT");
    const std::string rate = comrat ? comrat->toText() : std::string();
    const int quality = rate.size() > 3 ? nitf_detail::parseInt(rate.c_str() + 3) : 0;

    m_decoder = std::make_unique<CJpegStreamDecoder>();
    m_decoder->setDefaultQuality(quality);
}

// ---- reading blocks
// ----------------------------------------------------------------------------------------

bool CNitfImageSourceJpeg::isBandSequential() const {
    return m_properties.getInterleavingType() == CNitfImagePropertiesIF::eBandSequential;
}

int CNitfImageSourceJpeg::sampleBytes() const {
    return m_properties.getBpp() <= 8 ? 1 : 2;
}

bool CNitfImageSourceJpeg::isValidBlock(int x, int y, int band) const {
    return m_decoder && m_tileOffsets && x >= 0 && y >= 0 && band >= 0 && x < m_properties.getTileCountX() &&
           y < m_properties.getTileCountY() && band < m_properties.getBandCount() &&
           m_properties.getTileWidth() > 0 && m_properties.getTileHeight() > 0;
}

bool CNitfImageSourceJpeg::readTileInterleaved(CNitfFile* file, char* buffer, int rowBytes, int x, int y) {
    FILE* fp = file ? file->getInputStream() : nullptr;
    if (!fp || !buffer || !isValidBlock(x, y, 0))
        return false;
    const int bands = m_properties.getBandCount();
    unsigned char* out = reinterpret_cast<unsigned char*>(buffer);
    if (!isBandSequential())
        return decodeBlock(fp, m_properties.getTileIndex(x, y), out, rowBytes, bands, true);
    if (bands == 1)
        return decodeBlock(fp, m_properties.getTileIndex(x, y, 0), out, rowBytes, 1, true);

    // One stream per band: decode each into its plane, then interleave.
    const int width = m_properties.getTileWidth();
    const int height = m_properties.getTileHeight();
    const int bytes = sampleBytes();
    if (static_cast<long long>(width) * bands * bytes > rowBytes)
        NITF_RAISE_FORMAT(
            "bool __cdecl CNitfImageSourceJpeg::readTileInterleaved(class CNitfFile *,char *,int,"
            "int,int)",
            "Rows of %d bytes cannot hold %d pixels of %d bands", rowBytes, width, bands);
    const int planeRow = width * bytes;
    const size_t planeSize = static_cast<size_t>(planeRow) * height;
    m_bandSequentialBuffer.resize(planeSize * bands);
    char* planes = reinterpret_cast<char*>(m_bandSequentialBuffer.data());
    for (int band = 0; band < bands; ++band)
        if (!readTileNonInterleaved(file, planes + band * planeSize, planeRow, x, y, band))
            return false;
    deinterleaveBandToPixel(buffer, rowBytes, planes, height, width, bands, 8 * bytes);
    return true;
}

bool CNitfImageSourceJpeg::readTileNonInterleaved(CNitfFile* file, char* buffer, int rowBytes, int x, int y,
                                                  int band) {
    FILE* fp = file ? file->getInputStream() : nullptr;
    if (!fp || !buffer || !isValidBlock(x, y, band))
        return false;
    const int bands = m_properties.getBandCount();
    const int width = m_properties.getTileWidth();
    const int height = m_properties.getTileHeight();
    const int bytes = sampleBytes();
    unsigned char* out = reinterpret_cast<unsigned char*>(buffer);

    if (!isBandSequential() && bands >= 2) {
        // All bands share one stream: decode the block once and hand out its bands one by one.
        if (x != m_cachedX || y != m_cachedY) {
            const int blockRow = width * bands * bytes;
            m_cachedBlockBuffer.resize(static_cast<size_t>(blockRow) * height);
            m_cachedX = m_cachedY = -1;
            if (!readTileInterleaved(file, reinterpret_cast<char*>(m_cachedBlockBuffer.data()), blockRow, x,
                                     y))
                return false;
            m_cachedX = x;
            m_cachedY = y;
        }
        if (static_cast<long long>(width) * bytes > rowBytes)
            NITF_RAISE_FORMAT("bool __cdecl CNitfImageSourceJpeg::readTileNonInterleaved(class CNitfFile *,"
                              "char *,int,int,int,int)",
                              "Rows of %d bytes cannot hold %d samples", rowBytes, width);
        deinterleavePixelToBand(buffer, rowBytes, reinterpret_cast<char*>(m_cachedBlockBuffer.data()), height,
                                width, bands, 8 * bytes, band);
    } else {
        const int index =
            isBandSequential() ? m_properties.getTileIndex(x, y, band) : m_properties.getTileIndex(x, y);
        if (!decodeBlock(fp, index, out, rowBytes, 1, false))
            return false;
    }
    if (m_hasNitfApp6)
        applyAmplitudeMapping(out, rowBytes, file);
    return true;
}

// ---- decoding one stream
// -----------------------------------------------------------------------------------

bool CNitfImageSourceJpeg::decodeBlock(FILE* fp, int index, unsigned char* buffer, int rowBytes,
                                       int components, bool interleaved) {
    if (index < 0 || index >= m_tileOffsetCount)
        return false;
    const unsigned long long offset = m_tileOffsets[index];
    if (offset == kAbsentBlock)
        return false;
    m_decoder->readHeader(fp, offset, streamLength(offset));
    ++m_decodeCount;
    if (m_decoder->sawAmplitudeMarker()) {
        m_hasNitfApp6 = true;
        m_amplitudeOffset = m_decoder->amplitudeOffset();
    }
    setColourSpaces(interleaved);
    checkStream(rowBytes, components);
    m_decoder->start();
    if (m_decoder->outputComponents() != components)
        NITF_RAISE_FORMAT(kDecodeSignature,
                          "The JPEG stream of block %d has %d components where %d are expected", index,
                          m_decoder->outputComponents(), components);

    const int height = m_properties.getTileHeight();
    if (m_decoder->width() == m_properties.getTileWidth() && m_decoder->height() == height) {
        m_rowPointers.resize(height);
        for (int row = 0; row < height; ++row)
            m_rowPointers[row] = buffer + static_cast<size_t>(row) * rowBytes;
        m_decoder->readRows(m_rowPointers.data(), height);
    } else {
        readRowsResampled(buffer, rowBytes, components);
    }
    m_decoder->finish();
    return true;
}

// Three-component streams take their colour spaces from IREP: RGB (and MULTI when read as a whole) as
// stored, YCbCr converted to RGB. Anything else keeps libjpeg's own reading of the stream.
void CNitfImageSourceJpeg::setColourSpaces(bool interleaved) {
    if (m_decoder->components() != 3)
        return;
    switch (m_colour) {
    case eColourRgb:
        m_decoder->setColorSpaces(JCS_RGB, JCS_RGB);
        break;
    case eColourMulti:
        if (interleaved)
            m_decoder->setColorSpaces(JCS_RGB, JCS_RGB);
        break;
    case eColourYCbCr:
        m_decoder->setColorSpaces(JCS_YCbCr, JCS_RGB);
        break;
    case eColourAsStored:
        break;
    }
}

// Refuses streams whose samples or size the block cannot take, before anything is allocated for them.
void CNitfImageSourceJpeg::checkStream(int rowBytes, int components) const {
    const int precision = m_decoder->precision();
    const int bpp = m_properties.getBpp();
    if (precision > bpp || bpp > 16 || m_decoder->sampleBytes() != sampleBytes())
        NITF_RAISE_FORMAT(kDecodeSignature,
                          "A JPEG stream of %d-bit precision does not fit an image of %d bits", precision,
                          bpp);
    const long long width = m_properties.getTileWidth();
    const long long height = m_properties.getTileHeight();
    const long long streamArea = static_cast<long long>(m_decoder->width()) * m_decoder->height();
    if (streamArea > kLargestStreamToBlock * width * height)
        NITF_RAISE_FORMAT(kDecodeSignature,
                          "A JPEG stream of %d x %d pixels cannot belong to a block of %lld x %lld",
                          m_decoder->width(), m_decoder->height(), width, height);
    if (width * components * sampleBytes() > rowBytes)
        NITF_RAISE_FORMAT(kDecodeSignature, "Rows of %d bytes cannot hold %lld pixels of %d samples",
                          rowBytes, width, components);
}

void CNitfImageSourceJpeg::readRowsResampled(unsigned char* buffer, int rowBytes, int components) {
    const int bytes = sampleBytes();
    const int sourceWidth = m_decoder->width();
    const int sourceHeight = m_decoder->height();
    CBlockResampler resampler(sourceWidth, sourceHeight, m_properties.getTileWidth(),
                              m_properties.getTileHeight(), components, bytes);
    m_rowBuffer.resize(static_cast<size_t>(sourceWidth) * components * bytes);
    unsigned char* row = m_rowBuffer.data();
    for (int sourceRow = 0; sourceRow < sourceHeight; ++sourceRow) {
        m_decoder->readRows(&row, 1);
        resampler.putSourceRow(sourceRow, row, buffer, rowBytes);
    }
}

// ---- amplitude mapping
// -------------------------------------------------------------------------------------

void CNitfImageSourceJpeg::applyAmplitudeMapping(unsigned char* buffer, int rowBytes, CNitfFile* file) {
    if (sampleBytes() != 2)
        return;
    if (!m_amplitudeMap || m_mappedOffset != m_amplitudeOffset) {
        CNitfTag* iomapa = nullptr;
        for (CNitfTag* tag : m_subheader->getTaggedRecords()) {
            if (strncasecmp(tag->getIdentifier(), "IOMAPA", 6) == 0) {
                iomapa = tag;
                break;
            }
        }
        std::unique_ptr<CNitfExtension> extension(iomapa ? CNitfExtension::Build(iomapa) : nullptr);
        if (!extension)
            return;
        extension->readNewInfo(file, false);
        m_amplitudeMap = std::make_unique<CJpegAmplitudeMap>(extension->getProperties(), m_amplitudeOffset);
        m_mappedOffset = m_amplitudeOffset;
        if (m_amplitudeMap->getMethod() == 3 && !m_method3Warned) {
            m_method3Warned = true;
            vexo::nspio::Warning::Warn("IOMAPA - Output Amplitude Mapping Method 3 is not supported.",
                                       kSourceFile, __LINE__);
        }
    }
    const int width = m_properties.getTileWidth();
    const int height = m_properties.getTileHeight();
    for (int row = 0; row < height; ++row)
        m_amplitudeMap->apply(buffer + static_cast<size_t>(row) * rowBytes, width);
}
