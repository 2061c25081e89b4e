#include "NitfImageSourceJpeg2000.h"

#include <algorithm>
#include <cstring>
#include <string>

#include "HostError.h"
#include "HostFile.h"
#include "J2kDecoder.h"
#include "NitfFile.h"
#include "Raise.h"

static const char kSourceFile[] = "nitf/lib/NitfImageSourceJpeg2000";

namespace {

const char kStartSignature[] =
    "void __cdecl CNitfImageSourceJpeg2000::readStart(" NITF_FILE_SIG ",__int64,__int64)";
const char kBlockSignature[] =
    "bool __cdecl CNitfImageSourceJpeg2000::decodeBlock(" NITF_FILE_SIG ",int,int,unsigned char *,int,bool)";
const char kRegionSignature[] = "void __cdecl CNitfImageSourceJpeg2000::readRegion(class CNitfFile *,int,int,"
                                "int,int,int,int,int,char *,int)";

// Pixel-interleaved bands of `sampleBytes` each, rows `rowBytes` apart.
CJ2kDecoder::Output outputFor(char* buffer, int rowBytes, int bands, int sampleBytes) {
    CJ2kDecoder::Output out;
    out.buffer = buffer;
    out.rowBytes = rowBytes;
    out.sampleBytes = sampleBytes;
    out.pixelBytes = bands * sampleBytes;
    return out;
}

} // namespace

CNitfImageSourceJpeg2000::CNitfImageSourceJpeg2000(CNitfImageSubheader* subheader, char* fileName)
    : CNitfImageSource(subheader, fileName), m_fp(nullptr) {}

CNitfImageSourceJpeg2000::~CNitfImageSourceJpeg2000() = default;

// Every block lies in the one codestream that starts at the data offset; the block mask of an "M8" image
// only tells which blocks are absent.
void CNitfImageSourceJpeg2000::prepareTileOffsets(FILE*, long long dataOffset, long long,
                                                  unsigned int* blockMask, int count) {
    for (int i = 0; m_tileOffsets && i < m_tileOffsetCount; ++i) {
        const bool absent = blockMask && (i >= count || blockMask[i] == kAbsentBlock);
        m_tileOffsets[i] = absent ? kAbsentBlock : static_cast<unsigned long long>(dataOffset);
    }
}

void CNitfImageSourceJpeg2000::readStart(FILE* fp, long long dataOffset, long long dataLength) {
    checkGeometry();
    CNitfImageSource::readStart(fp, dataOffset, dataLength);
    prepareTileOffsets(fp, dataOffset, dataLength, m_blockMask, m_blockMaskCount);

    auto decoder = std::make_unique<CJ2kDecoder>();
    decoder->open(fp, dataOffset, dataLength);
    decoder->mapBands(m_properties.getBandCount());
    const int container = m_properties.getSampleContainerBytes();
    for (int band = 0; band < decoder->bandCount(); ++band)
        if (decoder->bandPrecision(band) > 8 * container)
            NITF_RAISE_FORMAT(kStartSignature, "JPEG 2000 samples of %d bits do not fit an image of %d bits",
                              decoder->bandPrecision(band), m_properties.getBpp());
    if (decoder->width() != m_properties.getImageActualWidth() ||
        decoder->height() != m_properties.getImageActualHeight())
        vexo::nspio::Warning::Warn(("The JPEG 2000 image is " + std::to_string(decoder->width()) + " x " +
                                    std::to_string(decoder->height()) + " where the sub-header says " +
                                    std::to_string(m_properties.getImageActualWidth()) + " x " +
                                    std::to_string(m_properties.getImageActualHeight()))
                                       .c_str(),
                                   kSourceFile, __LINE__);
    m_decoder = std::move(decoder);
    m_fp = fp;
}

CJ2kDecoder& CNitfImageSourceJpeg2000::decoderFor(FILE* fp) {
    if (!m_decoder || !fp)
        NITF_RAISE(std::string("The JPEG 2000 image has not been started for reading"), kBlockSignature);
    if (fp != m_fp) {
        m_decoder->open(fp, m_dataOffset, m_dataLength);
        m_decoder->mapBands(m_properties.getBandCount());
        m_fp = fp;
    }
    return *m_decoder;
}

// ---- blocks -----------------------------------------------------------------------------------------------

CNitfImageSource::eBlockLayout_t CNitfImageSourceJpeg2000::getBlockLayout() const {
    return m_properties.getBandCount() < 2 ? eBlockBands : eBlockPixels;
}

// A block is the area of the image under it. Blocks reaching past the image (the padding of the last block
// row and column) are zero-filled there.
bool CNitfImageSourceJpeg2000::decodeBlock(FILE* fp, int entry, int, unsigned char* out, int rowBytes, bool) {
    const CNitfImagePropertiesIF& p = m_properties;
    if (entryOffset(entry) == kAbsentBlock || p.getTileCountX() <= 0 || p.getTileCountY() <= 0)
        return false;
    // Band-sequential images number their entries band after band; every band lies in the one codestream.
    const int x = entry % p.getTileCountX(), y = entry / p.getTileCountX() % p.getTileCountY();
    const int firstBand = 0, bands = p.getBandCount();
    char* buffer = reinterpret_cast<char*>(out);
    CJ2kDecoder& decoder = decoderFor(fp);
    const int sampleBytes = p.getSampleContainerBytes();
    const long long blockWidth = p.getTileWidth(), blockHeight = p.getTileHeight();
    if (blockWidth * bands * sampleBytes > rowBytes)
        NITF_RAISE_FORMAT(kBlockSignature, "Rows of %d bytes cannot hold %lld pixels of %d bands", rowBytes,
                          blockWidth, bands);

    const long long left = x * blockWidth, top = y * blockHeight;
    const long long width = std::min<long long>(blockWidth, decoder.width() - left);
    const long long height = std::min<long long>(blockHeight, decoder.height() - top);
    if (width < blockWidth || height < blockHeight)
        for (long long row = 0; row < blockHeight; ++row)
            std::memset(buffer + row * rowBytes, 0, static_cast<size_t>(blockWidth * bands * sampleBytes));
    if (width <= 0 || height <= 0)
        return true; // a block wholly outside the codestream's image: padding only

    decoder.decode(0, static_cast<int>(left), static_cast<int>(top), static_cast<int>(width),
                   static_cast<int>(height), firstBand, bands,
                   outputFor(buffer, rowBytes, bands, sampleBytes));
    return true;
}

// ---- regions and levels -----------------------------------------------------------------------------------

int CNitfImageSourceJpeg2000::getResolutionLevels() const {
    return m_decoder ? m_decoder->resolutionLevels() : 0;
}

int CNitfImageSourceJpeg2000::getLevelWidth(int level) const {
    return m_decoder && level >= 0 && level < getResolutionLevels() ? m_decoder->width(level) : 0;
}

int CNitfImageSourceJpeg2000::getLevelHeight(int level) const {
    return m_decoder && level >= 0 && level < getResolutionLevels() ? m_decoder->height(level) : 0;
}

void CNitfImageSourceJpeg2000::readRegion(CNitfFile* file, int level, int x, int y, int width, int height,
                                          int firstBand, int bands, char* buffer, int rowBytes) {
    CJ2kDecoder& decoder = decoderFor(file ? file->getInputStream() : nullptr);
    const int sampleBytes = m_properties.getSampleContainerBytes();
    if (static_cast<long long>(width) * bands * sampleBytes > rowBytes)
        NITF_RAISE_FORMAT(kRegionSignature, "Rows of %d bytes cannot hold %d pixels of %d bands", rowBytes,
                          width, bands);
    decoder.decode(level, x, y, width, height, firstBand, bands,
                   outputFor(buffer, rowBytes, bands, sampleBytes));
}

long long CNitfImageSourceJpeg2000::getTileDecodeCount() const {
    return m_decoder ? m_decoder->tileDecodes() : 0;
}

long long CNitfImageSourceJpeg2000::getBytesRead() const {
    return m_decoder ? m_decoder->bytesRead() : 0;
}
