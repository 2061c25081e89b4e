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
    : CNitfImageSource(subheader, fileName), m_dataEnd(0), m_colour(eColourAsStored), m_amplitudeOffset(0),
      m_mappedOffset(0), m_hasNitfApp6(false), m_method3Warned(false) {}

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
        // A comment is skipped only to the end of the chunk it starts in; the scan goes on afresh there.
        if (state == eInComment)
            state = eSearching;
        consumed += static_cast<long long>(got);
    }
    return starts;
}

void CNitfImageSourceJpeg::prepareTileOffsets(FILE* fp, long long dataOffset, long long dataLength,
                                              unsigned int* blockMask, int count) {
    if (tileOffsetsFromMask(static_cast<unsigned long long>(dataOffset), blockMask, count))
        return;
    const int entries = m_tileOffsetCount;
    // Streams follow each other in block order (band after band for IMODE S). A block whose stream is not
    // found reads as absent.
    const std::vector<unsigned long long> starts =
        findStreamStarts(fp, dataOffset, dataLength, static_cast<size_t>(entries));
    for (int i = 0; i < entries; ++i)
        m_tileOffsets[i] = static_cast<size_t>(i) < starts.size() ? starts[i] : kAbsentBlock;
    if (starts.size() == static_cast<size_t>(entries))
        return;
    // Fewer streams than blocks: the data are cut short or damaged. Far fewer comes from damaged geometry.
    if (2 * starts.size() < static_cast<size_t>(entries))
        NITF_RAISE_FORMAT("void __cdecl CNitfImageSourceJpeg::prepareTileOffsets(" NITF_FILE_SIG
                          ",__int64,__int64,unsigned int *,int)",
                          "Only %d of the image's %d JPEG streams are in its data",
                          static_cast<int>(starts.size()), entries);
    for (int i = static_cast<int>(starts.size()); i < entries; ++i)
        markMissing(i);
    warnOnce("missing streams",
             "only " + std::to_string(starts.size()) + " of the " + std::to_string(entries) +
                 " JPEG streams its blocks need are in the file; the other blocks cannot be read");
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

int CNitfImageSourceJpeg::sampleBytes() const {
    return m_properties.getBpp() <= 8 ? 1 : 2;
}

CNitfImageSource::eBlockLayout_t CNitfImageSourceJpeg::getBlockLayout() const {
    const bool bandSequential = m_properties.getInterleavingType() == CNitfImagePropertiesIF::eBandSequential;
    return bandSequential || m_properties.getBandCount() < 2 ? eBlockBands : eBlockPixels;
}

bool CNitfImageSourceJpeg::decodeBlock(FILE* fp, int entry, int, unsigned char* buffer, int rowBytes,
                                       bool interleaved) {
    const unsigned long long offset = entryOffset(entry);
    if (!m_decoder || offset == kAbsentBlock || m_properties.getTileWidth() <= 0 ||
        m_properties.getTileHeight() <= 0)
        return false;
    const int components = getBlockLayout() == eBlockPixels ? m_properties.getBandCount() : 1;
    m_streamLength = streamLength(offset);
    m_decoder->readHeader(fp, offset, m_streamLength);
    if (m_colour == eColourRgb && m_decoder->components() == 3 && m_decoder->markedYCbCr())
        warnOnce("colour", "IREP says RGB but its JPEG streams are marked YCbCr (JFIF or Adobe marker); the "
                           "samples are delivered as coded, by IREP, without colour conversion");
    if (m_decoder->sawAmplitudeMarker()) {
        m_hasNitfApp6 = true;
        m_amplitudeOffset = m_decoder->amplitudeOffset();
    }
    setColourSpaces(interleaved);
    checkStream(rowBytes, components);
    m_decoder->start();
    if (m_decoder->outputComponents() != components)
        NITF_RAISE_FORMAT(kDecodeSignature,
                          "The JPEG stream of block %d has %d components where %d are expected", entry,
                          m_decoder->outputComponents(), components);

    const int height = m_properties.getTileHeight();
    if (m_decoder->width() == m_properties.getTileWidth() && m_decoder->height() == height) {
        m_rowPointers.resize(height);
        for (int row = 0; row < height; ++row)
            m_rowPointers[row] = buffer + static_cast<size_t>(row) * rowBytes;
        m_decoder->readRows(m_rowPointers.data(), height);
    } else if (interleaved) {
        // Whole interleaved blocks are delivered as coded, without fitting.
        readRowsAsCoded(buffer, rowBytes, components);
    } else {
        readRowsResampled(buffer, rowBytes, components);
    }
    m_decoder->finish();
    return true;
}

void CNitfImageSourceJpeg::finishBand(CNitfFile* file, unsigned char* buffer, int rowBytes) {
    if (m_hasNitfApp6)
        applyAmplitudeMapping(buffer, rowBytes, file);
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
    // Every 8 x 8 unit of every component costs the entropy coder at least a few bits, so no stream decodes
    // to much more than 256 times its own size: more is a damaged header, not a picture.
    const unsigned long long decoded =
        static_cast<unsigned long long>(streamArea) * m_decoder->components() * m_decoder->sampleBytes();
    if (decoded > 256 * m_streamLength + (1u << 20))
        NITF_RAISE_FORMAT(kDecodeSignature,
                          "A JPEG stream of %llu bytes cannot code %d x %d pixels of %d components",
                          m_streamLength, m_decoder->width(), m_decoder->height(), m_decoder->components());
    if (streamArea > kLargestStreamToBlock * width * height)
        NITF_RAISE_FORMAT(kDecodeSignature,
                          "A JPEG stream of %d x %d pixels cannot belong to a block of %lld x %lld",
                          m_decoder->width(), m_decoder->height(), width, height);
    if (width * components * sampleBytes() > rowBytes)
        NITF_RAISE_FORMAT(kDecodeSignature, "Rows of %d bytes cannot hold %lld pixels of %d samples",
                          rowBytes, width, components);
}

void CNitfImageSourceJpeg::readRowsAsCoded(unsigned char* buffer, int rowBytes, int components) {
    const size_t pixelBytes = static_cast<size_t>(components) * sampleBytes();
    const int width = std::min(m_decoder->width(), m_properties.getTileWidth());
    const int rows = std::min(m_decoder->height(), m_properties.getTileHeight());
    m_rowBuffer.resize(static_cast<size_t>(m_decoder->width()) * pixelBytes);
    unsigned char* row = m_rowBuffer.data();
    for (int r = 0; r < rows; ++r) {
        m_decoder->readRows(&row, 1);
        std::memcpy(buffer + static_cast<size_t>(r) * rowBytes, row, width * pixelBytes);
    }
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
