#include "J2kDecoder.h"

#include <algorithm>
#include <climits>
#include <cstdint>
#include <cstring>

#include <openjpeg.h>

#include "HostError.h"
#include "HostFile.h"
#include "J2kSegmentStream.h"
#include "Jp2BoxReader.h"
#include "Raise.h"

static const char kSourceFile[] = "nitf/lib/J2kDecoder";

namespace {

const char kOpenSignature[] = "void __cdecl CJ2kDecoder::open(" NITF_FILE_SIG ",__int64,__int64)";
const char kDecodeSignature[] = "void __cdecl CJ2kDecoder::decode(int,int,int,int,int,int,int,const struct "
                                "CJ2kDecoder::Output &)";
const char kDebugModule[] = "segrix";

// OpenJPEG keeps a block of coding parameters for every tile and component from the main header on; each
// takes about a kilobyte. A codestream pays for its tile-components with its bytes (every tile-part has a
// header, every tile-component packets), so more of them than this is damage, refused before OpenJPEG sees
// it.
long long tileComponentLimit(long long codestreamBytes) {
    return 4096 + codestreamBytes / 8;
}

// A decode holds every sample of what it decodes (a tile, or the area of a single-tile image) as 32-bit
// integers. Even the lowest quality layers of a real image spend a bit per few hundred samples, so a
// codestream claiming more than this many samples per byte is damage (or would decode to nothing).
const long long kSamplesPerCodedByte = 1024;
const long long kSmallDecodeSamples = 1LL << 24;

long long ceilDiv(long long a, long long b) {
    return (a + b - 1) / b;
}

long long ceilDivPow2(long long a, int power) {
    return (a + (1LL << power) - 1) >> power;
}

std::string trimmed(const char* message) {
    std::string text(message ? message : "");
    while (!text.empty() && (text.back() == '\n' || text.back() == ' '))
        text.pop_back();
    return text;
}

void onInfo(const char* message, void*) {
    vexo::nspio::Debugger::Debug(kDebugModule, trimmed(message).c_str(), kSourceFile, __LINE__);
}

void onWarning(const char* message, void*) {
    vexo::nspio::Warning::Warn(("JPEG 2000: " + trimmed(message)).c_str(), kSourceFile, __LINE__);
}

void onError(const char* message, void* client) {
    std::string& errors = *static_cast<std::string*>(client);
    if (!errors.empty())
        errors += "; ";
    errors += trimmed(message);
}

int bytesFor(int bits) {
    return bits <= 8 ? 1 : bits <= 16 ? 2 : bits <= 32 ? 4 : 8;
}

} // namespace

// ---- one OpenJPEG codec over the codestream ---------------------------------------------------------------

// A codec that has read the main header, with its stream and header image. A single-tile codestream can be
// decoded area after area on one session; tiles can be fetched one after another. Any failure ends it.
class CJ2kDecoder::Session {
public:
    Session(CJ2kSegmentStream& range, int level, std::string& errors) : level(level) {
        stream = range.newOpenJpegStream();
        codec = opj_create_decompress(OPJ_CODEC_J2K);
        if (!stream || !codec)
            return;
        opj_set_error_handler(codec, onError, &errors);
        opj_set_warning_handler(codec, onWarning, nullptr);
        if (DebugOver(0))
            opj_set_info_handler(codec, onInfo, nullptr);
        opj_dparameters_t parameters;
        opj_set_default_decoder_parameters(&parameters);
        // The library runs on its caller's thread only. Strict decoding refuses a cut tile rather than
        // decoding what it holds: this OpenJPEG's lenient mode crashes on some damaged codestreams.
        ok = opj_setup_decoder(codec, &parameters) && opj_codec_set_threads(codec, 0) &&
             opj_decoder_set_strict_mode(codec, OPJ_TRUE) && opj_read_header(stream, codec, &image) &&
             (level == 0 || opj_set_decoded_resolution_factor(codec, static_cast<OPJ_UINT32>(level)));
    }
    ~Session() {
        if (image)
            opj_image_destroy(image);
        if (codec)
            opj_destroy_codec(codec);
        if (stream)
            opj_stream_destroy(stream);
    }
    Session(const Session&) = delete;
    Session& operator=(const Session&) = delete;

    opj_stream_t* stream = nullptr;
    opj_codec_t* codec = nullptr;
    opj_image_t* image = nullptr;
    int level;
    bool ok = false;
    bool holdsWholeImage = false;
};

// ---- areas ------------------------------------------------------------------------------------------------

// An area of the image grid at one level, in absolute coordinates of that level's grid (the image's first
// column is at its origin, not at 0), and the same area on the full-resolution reference grid.
struct CJ2kDecoder::Area {
    int level;
    long long x, y, width, height;
    long long refX0, refY0, refX1, refY1;
};

CJ2kDecoder::CJ2kDecoder() = default;
CJ2kDecoder::~CJ2kDecoder() = default;

long long CJ2kDecoder::bytesRead() const {
    return m_range ? m_range->bytesRead() : 0;
}

int CJ2kDecoder::width(int level) const {
    const long long x0 = ceilDivPow2(ceilDiv(m_header.x0, m_gridDx), level);
    const long long x1 = ceilDivPow2(ceilDiv(m_header.x1, m_gridDx), level);
    return static_cast<int>(x1 - x0);
}

int CJ2kDecoder::height(int level) const {
    const long long y0 = ceilDivPow2(ceilDiv(m_header.y0, m_gridDy), level);
    const long long y1 = ceilDivPow2(ceilDiv(m_header.y1, m_gridDy), level);
    return static_cast<int>(y1 - y0);
}

// ---- opening ----------------------------------------------------------------------------------------------

void CJ2kDecoder::open(FILE* fp, long long offset, long long length) {
    m_session.reset();
    m_range.reset();
    auto range = std::make_unique<CJ2kSegmentStream>(fp, offset, length);
    m_isJp2 = false;
    m_jp2 = jp2::Metadata();
    switch (CJp2BoxReader::identify(*range)) {
    case CJp2BoxReader::eCodestream:
        break;
    case CJp2BoxReader::eJp2File: {
        CJp2BoxReader boxes;
        boxes.read(*range);
        range->narrow(boxes.codestreamOffset(), boxes.codestreamLength());
        m_jp2 = boxes.metadata();
        m_isJp2 = true;
        break;
    }
    case CJp2BoxReader::eUnknown:
        NITF_RAISE(std::string("The image data is neither a JPEG 2000 codestream nor a JP2 file"),
                   kOpenSignature);
    }
    m_header.read(*range);

    const long long tileComponents =
        m_header.tileCount() * static_cast<long long>(m_header.components.size());
    if (m_header.tileCount() > 65535 || tileComponents > tileComponentLimit(range->length()))
        NITF_RAISE_FORMAT(
            kOpenSignature, "A JPEG 2000 codestream of %lld bytes cannot hold %lld tiles of %d components",
            range->length(), m_header.tileCount(), static_cast<int>(m_header.components.size()));
    m_gridDx = m_gridDy = INT_MAX;
    for (const CJ2kCodestreamHeader::Component& c : m_header.components) {
        m_gridDx = std::min(m_gridDx, c.dx);
        m_gridDy = std::min(m_gridDy, c.dy);
    }
    m_range = std::move(range);
    m_bands.clear();

    // The main header gives the resolution levels of every component.
    try {
        startSession(0);
    } catch (...) {
        m_range.reset();
        throw;
    }
    m_resolutionLevels = INT_MAX;
    opj_codestream_info_v2_t* info = opj_get_cstr_info(m_session->codec);
    for (OPJ_UINT32 c = 0; info && info->m_default_tile_info.tccp_info && c < info->nbcomps; ++c)
        m_resolutionLevels = std::min(
            m_resolutionLevels, static_cast<int>(info->m_default_tile_info.tccp_info[c].numresolutions));
    if (m_resolutionLevels == INT_MAX || m_resolutionLevels < 1)
        m_resolutionLevels = 1;
    opj_destroy_cstr_info(&info);
}

void CJ2kDecoder::startSession(int level) {
    m_session.reset();
    m_codecError.clear();
    auto session = std::make_unique<Session>(*m_range, level, m_codecError);
    if (!session->ok)
        raiseCodecError("reading the codestream header");
    m_session = std::move(session);
}

void CJ2kDecoder::raiseCodecError(const char* what) {
    m_session.reset(); // a failed codec is not used again: the next read starts afresh
    const std::string message = m_codecError.empty() ? std::string("no reason given") : m_codecError;
    m_codecError.clear();
    NITF_RAISE_FORMAT(kDecodeSignature, "JPEG 2000 decoding failed while %s: %s", what, message.c_str());
}

// ---- bands ------------------------------------------------------------------------------------------------

void CJ2kDecoder::mapBands(int bands) {
    static const char signature[] = "void __cdecl CJ2kDecoder::mapBands(int)";
    const int components = componentCount();
    m_bands.clear();
    const std::vector<jp2::ComponentMapping>& mapping = m_jp2.componentMapping;
    if (bands != components && m_jp2.hasPalette && static_cast<int>(mapping.size()) == bands) {
        // The palette makes the bands out of index components.
        for (const jp2::ComponentMapping& entry : mapping) {
            const bool throughPalette = entry.type == 1;
            if (entry.component >= components ||
                (throughPalette && entry.column >= m_jp2.palette.columns.size()))
                NITF_RAISE_FORMAT(signature, "The JP2 component mapping names component %d or column %d",
                                  entry.component, entry.column);
            m_bands.push_back(Band{entry.component, throughPalette ? entry.column : -1});
        }
        return;
    }
    if (bands < 1 || bands > components)
        NITF_RAISE_FORMAT(signature, "A JPEG 2000 codestream of %d components cannot give %d bands",
                          components, bands);
    if (bands < components)
        vexo::nspio::Warning::Warn(("The JPEG 2000 codestream has " + std::to_string(components) +
                                    " components for " + std::to_string(bands) +
                                    " bands; the others are not read")
                                       .c_str(),
                                   kSourceFile, __LINE__);
    for (int b = 0; b < bands; ++b)
        m_bands.push_back(Band{b, -1});
}

int CJ2kDecoder::bandPrecision(int band) const {
    const Band& b = m_bands.at(static_cast<size_t>(band));
    return b.paletteColumn >= 0 ? m_jp2.palette.columns[static_cast<size_t>(b.paletteColumn)].bits
                                : m_header.components[static_cast<size_t>(b.component)].precision;
}

bool CJ2kDecoder::bandIsSigned(int band) const {
    const Band& b = m_bands.at(static_cast<size_t>(band));
    return b.paletteColumn >= 0 ? m_jp2.palette.columns[static_cast<size_t>(b.paletteColumn)].isSigned
                                : m_header.components[static_cast<size_t>(b.component)].isSigned;
}

// ---- decoding ---------------------------------------------------------------------------------------------

void CJ2kDecoder::decode(int level, int x, int y, int width, int height, int firstBand, int bands,
                         const Output& out) {
    if (!m_range)
        NITF_RAISE(std::string("The JPEG 2000 data is not open"), kDecodeSignature);
    m_range->forgetFilePosition();
    if (m_bands.empty())
        mapBands(componentCount());
    if (level < 0 || level >= m_resolutionLevels)
        NITF_RAISE_FORMAT(kDecodeSignature, "Resolution level %d is not in the codestream (it has %d)", level,
                          m_resolutionLevels);
    if (width <= 0 || height <= 0 || x < 0 || y < 0 || x > this->width(level) - width ||
        y > this->height(level) - height)
        NITF_RAISE_FORMAT(kDecodeSignature, "The area %d x %d at (%d, %d) is not inside the %d x %d image",
                          width, height, x, y, this->width(level), this->height(level));
    if (firstBand < 0 || bands < 1 || firstBand > bandCount() - bands || !out.buffer)
        NITF_RAISE_FORMAT(kDecodeSignature, "Bands %d to %d are not in the image", firstBand,
                          firstBand + bands - 1);
    for (int b = firstBand; b < firstBand + bands; ++b)
        if (bytesFor(bandPrecision(b)) > out.sampleBytes)
            NITF_RAISE_FORMAT(kDecodeSignature, "Samples of %d bits do not fit in %d bytes", bandPrecision(b),
                              out.sampleBytes);

    Area area;
    area.level = level;
    area.x = x + ceilDivPow2(ceilDiv(m_header.x0, m_gridDx), level);
    area.y = y + ceilDivPow2(ceilDiv(m_header.y0, m_gridDy), level);
    area.width = width;
    area.height = height;
    // The reference grid area, widened so that the samples of coarser components left of and above the area
    // are decoded too.
    int widestDx = 1, widestDy = 1;
    for (const Band& b : m_bands) {
        widestDx = std::max(widestDx, m_header.components[static_cast<size_t>(b.component)].dx);
        widestDy = std::max(widestDy, m_header.components[static_cast<size_t>(b.component)].dy);
    }
    const long long scaleX = static_cast<long long>(m_gridDx) << level;
    const long long scaleY = static_cast<long long>(m_gridDy) << level;
    area.refX0 =
        std::max<long long>(m_header.x0, area.x * scaleX - (widestDx > m_gridDx ? widestDx << level : 0));
    area.refY0 =
        std::max<long long>(m_header.y0, area.y * scaleY - (widestDy > m_gridDy ? widestDy << level : 0));
    area.refX1 = std::min<long long>(m_header.x1, (area.x + width) * scaleX);
    area.refY1 = std::min<long long>(m_header.y1, (area.y + height) * scaleY);

    if (m_header.tileCount() > 1 && m_header.hasPackedPacketHeaders)
        decodeWhole(area, firstBand, bands, out);
    else if (m_header.tileCount() > 1)
        decodeTiled(area, firstBand, bands, out);
    else
        decodeUntiled(area, firstBand, bands, out);
}

// What a decode holds in memory must be paid for by the codestream's bytes (see kSamplesPerCodedByte).
void CJ2kDecoder::checkDecodeSize(long long width, long long height, int level) const {
    const long long samples =
        ceilDivPow2(width, level) * ceilDivPow2(height, level) * static_cast<long long>(componentCount());
    if (samples > kSmallDecodeSamples && samples / kSamplesPerCodedByte > m_range->length())
        NITF_RAISE_FORMAT(
            kDecodeSignature,
            "A JPEG 2000 codestream of %lld bytes cannot code %lld x %lld samples in %d components",
            m_range->length(), width, height, componentCount());
}

void CJ2kDecoder::decodeUntiled(const Area& area, int firstBand, int bands, const Output& out) {
    // OpenJPEG decodes just the area, but sets up its code-blocks for the whole tile.
    checkDecodeSize(m_header.x1 - m_header.x0, m_header.y1 - m_header.y0, area.level);
    // A codec that has decoded once cannot always decode another area (OpenJPEG then asks for the main
    // header again): every area starts on a codec of its own, as tiles do.
    startSession(area.level);
    m_codecError.clear();
    if (!opj_set_decode_area(m_session->codec, m_session->image, static_cast<OPJ_INT32>(area.refX0),
                             static_cast<OPJ_INT32>(area.refY0), static_cast<OPJ_INT32>(area.refX1),
                             static_cast<OPJ_INT32>(area.refY1)))
        raiseCodecError("setting the decode area");
    ++m_tileDecodes;
    if (!opj_decode(m_session->codec, m_session->stream, m_session->image))
        raiseCodecError("decoding");
    copyBands(m_session->image, area, firstBand, bands, out);
}

// Tiles whose packet headers all sit in the main header can only be decoded in order, from the first: the
// whole image is decoded once per level and kept, and areas are copied out of it.
void CJ2kDecoder::decodeWhole(const Area& area, int firstBand, int bands, const Output& out) {
    if (!m_session || m_session->level != area.level || !m_session->holdsWholeImage) {
        checkDecodeSize(m_header.x1 - m_header.x0, m_header.y1 - m_header.y0, area.level);
        startSession(area.level);
        m_tileDecodes += m_header.tileCount();
        if (!opj_decode(m_session->codec, m_session->stream, m_session->image))
            raiseCodecError("decoding");
        m_session->holdsWholeImage = true;
    }
    copyBands(m_session->image, area, firstBand, bands, out);
}

void CJ2kDecoder::decodeTiled(const Area& area, int firstBand, int bands, const Output& out) {
    const CJ2kCodestreamHeader& h = m_header;
    checkDecodeSize(h.tileWidth, h.tileHeight, area.level);
    const long long firstColumn = (area.refX0 - h.tileX0) / h.tileWidth;
    const long long lastColumn = (area.refX1 - 1 - h.tileX0) / h.tileWidth;
    const long long firstRow = (area.refY0 - h.tileY0) / h.tileHeight;
    const long long lastRow = (area.refY1 - 1 - h.tileY0) / h.tileHeight;
    for (long long row = firstRow; row <= lastRow; ++row)
        for (long long column = firstColumn; column <= lastColumn; ++column) {
            // Each tile on a codec of its own: after one tile OpenJPEG cannot always find the parts of
            // another (tile-parts of several tiles interleaved in the codestream).
            startSession(area.level);
            ++m_tileDecodes;
            const OPJ_UINT32 tile = static_cast<OPJ_UINT32>(row * h.tilesAcross() + column);
            if (!opj_get_decoded_tile(m_session->codec, m_session->stream, m_session->image, tile))
                raiseCodecError("decoding a tile");
            copyBands(m_session->image, area, firstBand, bands, out);
        }
}

// ---- delivering samples -----------------------------------------------------------------------------------

void CJ2kDecoder::copyBands(const opj_image_t* image, const Area& area, int firstBand, int bands,
                            const Output& out) const {
    if (copyRgb8(image, area, firstBand, bands, out))
        return;
    for (int b = 0; b < bands; ++b) {
        const Band& band = m_bands[static_cast<size_t>(firstBand + b)];
        if (static_cast<OPJ_UINT32>(band.component) >= image->numcomps)
            continue;
        const opj_image_comp_t& comp = image->comps[band.component];
        if (!comp.data)
            continue;
        char* target = out.buffer + static_cast<long long>(b) * out.sampleBytes;
        switch (out.sampleBytes) {
        case 1:
            copyBand<int8_t>(comp, band, area, target, out.rowBytes, out.pixelBytes);
            break;
        case 2:
            copyBand<int16_t>(comp, band, area, target, out.rowBytes, out.pixelBytes);
            break;
        case 4:
            copyBand<int32_t>(comp, band, area, target, out.rowBytes, out.pixelBytes);
            break;
        default:
            copyBand<int64_t>(comp, band, area, target, out.rowBytes, out.pixelBytes);
            break;
        }
    }
}

// Three 8-bit bands of three components with the same window, pixel-interleaved (RGB): the most common
// whole-block read, done in one pass over the output instead of one per band.
bool CJ2kDecoder::copyRgb8(const opj_image_t* image, const Area& area, int firstBand, int bands,
                           const Output& out) const {
    if (bands != 3 || out.sampleBytes != 1 || out.pixelBytes != 3)
        return false;
    const opj_image_comp_t* comps[3];
    for (int b = 0; b < 3; ++b) {
        const Band& band = m_bands[static_cast<size_t>(firstBand + b)];
        const CJ2kCodestreamHeader::Component& c = m_header.components[static_cast<size_t>(band.component)];
        if (band.paletteColumn >= 0 || c.dx != m_gridDx || c.dy != m_gridDy ||
            static_cast<OPJ_UINT32>(band.component) >= image->numcomps)
            return false;
        comps[b] = &image->comps[band.component];
        if (!comps[b]->data || comps[b]->x0 != comps[0]->x0 || comps[b]->y0 != comps[0]->y0 ||
            comps[b]->w != comps[0]->w || comps[b]->h != comps[0]->h || comps[b]->factor != comps[0]->factor)
            return false;
    }
    const opj_image_comp_t& first = *comps[0];
    const long long windowX = ceilDivPow2(first.x0, static_cast<int>(first.factor));
    const long long windowY = ceilDivPow2(first.y0, static_cast<int>(first.factor));
    const long long firstColumn = std::clamp<long long>(windowX - area.x, 0, area.width);
    const long long endColumn = std::clamp<long long>(windowX + first.w - area.x, 0, area.width);
    const long long firstRow = std::clamp<long long>(windowY - area.y, 0, area.height);
    const long long endRow = std::clamp<long long>(windowY + first.h - area.y, 0, area.height);
    for (long long r = firstRow; r < endRow; ++r) {
        const size_t at =
            static_cast<size_t>((area.y + r - windowY) * first.w + (area.x + firstColumn - windowX));
        const int32_t* red = comps[0]->data + at;
        const int32_t* green = comps[1]->data + at;
        const int32_t* blue = comps[2]->data + at;
        unsigned char* pixel =
            reinterpret_cast<unsigned char*>(out.buffer + r * out.rowBytes) + 3 * firstColumn;
        for (long long c = 0; c < endColumn - firstColumn; ++c, pixel += 3) {
            pixel[0] = static_cast<unsigned char>(red[c]);
            pixel[1] = static_cast<unsigned char>(green[c]);
            pixel[2] = static_cast<unsigned char>(blue[c]);
        }
    }
    return true;
}

// Copies the samples of one decoded component window (a tile, or the decoded area) that fall in the area.
// Casting to the signed container type sign-extends signed samples and keeps unsigned ones (which OpenJPEG
// has clamped to their precision) as they are.
template <typename Sample>
void CJ2kDecoder::copyBand(const opj_image_comp_t& comp, const Band& band, const Area& area, char* out,
                           long long rowBytes, int pixelBytes) const {
    // The window of the component, in its absolute coordinates at this level. OpenJPEG gives its origin at
    // full resolution, and a reduced width that may count one column (or row) more than the data has, which
    // no area inside the image reaches.
    const long long windowX = ceilDivPow2(comp.x0, static_cast<int>(comp.factor));
    const long long windowY = ceilDivPow2(comp.y0, static_cast<int>(comp.factor));
    const long long windowW = comp.w, windowH = comp.h;
    const int dx = m_header.components[static_cast<size_t>(band.component)].dx;
    const int dy = m_header.components[static_cast<size_t>(band.component)].dy;
    const bool sameGrid = dx == m_gridDx && dy == m_gridDy;

    // Output column -> window column, or -1 where the column's sample lies outside the window.
    std::vector<int> columns;
    long long firstColumn = 0, endColumn = area.width;
    if (sameGrid) {
        firstColumn = std::clamp<long long>(windowX - area.x, 0, area.width);
        endColumn = std::clamp<long long>(windowX + windowW - area.x, 0, area.width);
    } else {
        columns.resize(static_cast<size_t>(area.width));
        for (long long c = 0; c < area.width; ++c) {
            const long long sample = (area.x + c) * m_gridDx / dx - windowX;
            columns[static_cast<size_t>(c)] = sample >= 0 && sample < windowW ? static_cast<int>(sample) : -1;
        }
    }
    if (firstColumn >= endColumn)
        return;

    const std::vector<std::vector<int32_t>>* palette =
        band.paletteColumn >= 0 ? &m_jp2.palette.entries : nullptr;
    auto value = [&](int32_t v) -> Sample {
        if (!palette)
            return static_cast<Sample>(v);
        const size_t index = static_cast<size_t>(std::clamp<long long>(v, 0, palette->size() - 1));
        return static_cast<Sample>((*palette)[index][static_cast<size_t>(band.paletteColumn)]);
    };

    for (long long r = 0; r < area.height; ++r) {
        const long long sourceRow = sameGrid ? area.y + r - windowY : (area.y + r) * m_gridDy / dy - windowY;
        if (sourceRow < 0 || sourceRow >= windowH)
            continue;
        const int32_t* source = comp.data + sourceRow * windowW;
        char* target = out + r * rowBytes;
        if (sameGrid) {
            const int32_t* in = source + (area.x + firstColumn - windowX);
            const long long count = endColumn - firstColumn;
            char* to = target + firstColumn * pixelBytes;
            if (!palette && pixelBytes == static_cast<int>(sizeof(Sample))) {
                // Packed samples: a loop the compiler turns into vector narrowing (the buffer need not be
                // aligned, hence the copies).
                for (long long c = 0; c < count; ++c) {
                    const Sample sample = static_cast<Sample>(in[c]);
                    std::memcpy(to + c * static_cast<long long>(sizeof(Sample)), &sample, sizeof sample);
                }
            } else {
                for (long long c = 0; c < count; ++c) {
                    const Sample sample = value(in[c]);
                    std::memcpy(to + c * pixelBytes, &sample, sizeof sample);
                }
            }
        } else {
            for (long long c = 0; c < area.width; ++c) {
                const int column = columns[static_cast<size_t>(c)];
                if (column < 0)
                    continue;
                const Sample sample = value(source[column]);
                std::memcpy(target + c * pixelBytes, &sample, sizeof sample);
            }
        }
    }
}
