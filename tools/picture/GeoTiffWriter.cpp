#include "GeoTiffWriter.h"

#include <algorithm>
#include <cerrno>
#include <cmath>
#include <cstdarg>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <memory>
#include <condition_variable>
#include <deque>
#include <mutex>
#include <stdexcept>
#include <thread>

#include <fcntl.h>
#include <unistd.h>

#include <geotiff.h>
#include <geovalues.h>
#include <tiffio.h>
#include <xtiffio.h>

#include "ScratchFile.h"

namespace nitfpicture {

int sampleBytes(SampleType type) {
    switch (type) {
    case SampleType::UInt8:
    case SampleType::Int8:
        return 1;
    case SampleType::UInt16:
    case SampleType::Int16:
        return 2;
    case SampleType::UInt32:
    case SampleType::Int32:
    case SampleType::Float32:
        return 4;
    case SampleType::UInt64:
    case SampleType::Int64:
    case SampleType::Float64:
    case SampleType::ComplexFloat32:
        return 8;
    case SampleType::ComplexFloat64:
        return 16;
    }
    return 0;
}

namespace {

// ---- libtiff set-up ---------------------------------------------------------------------------------------

// Two private tags that readers of GeoTIFF understand: the RPC model, and the no-data value as text.
constexpr uint32_t kTagRpcCoefficients = 50844;
constexpr uint32_t kTagNoData = 42113;

TIFFExtendProc g_parentExtender = nullptr;

void extendTags(TIFF* tif) {
    static const TIFFFieldInfo fields[] = {
        {kTagRpcCoefficients, TIFF_VARIABLE2, TIFF_VARIABLE2, TIFF_DOUBLE, FIELD_CUSTOM, 1, 1,
         const_cast<char*>("RPCCoefficientTag")},
        {kTagNoData, -1, -1, TIFF_ASCII, FIELD_CUSTOM, 1, 0, const_cast<char*>("GDALNoDataValue")},
    };
    TIFFMergeFieldInfo(tif, fields, sizeof fields / sizeof fields[0]);
    if (g_parentExtender)
        g_parentExtender(tif);
}

void registerTags() {
    static std::once_flag once;
    std::call_once(once, [] {
        XTIFFInitialize(); // the GeoTIFF tags
        g_parentExtender = TIFFSetTagExtender(extendTags);
    });
}

// libtiff reports through process-wide handlers: while a file is written, errors are kept for the exception
// and warnings are dropped.
thread_local std::string t_lastError;

void keepError(const char* module, const char* format, va_list args) {
    char text[512];
    std::vsnprintf(text, sizeof text, format, args);
    t_lastError = std::string(module ? module : "libtiff") + ": " + text;
}

void dropWarning(const char*, const char*, va_list) {}

class TiffReporting {
public:
    TiffReporting()
        : m_error(TIFFSetErrorHandler(keepError)), m_warning(TIFFSetWarningHandler(dropWarning)) {}
    ~TiffReporting() {
        TIFFSetErrorHandler(m_error);
        TIFFSetWarningHandler(m_warning);
    }
    TiffReporting(const TiffReporting&) = delete;
    TiffReporting& operator=(const TiffReporting&) = delete;

private:
    TIFFErrorHandler m_error, m_warning;
};

[[noreturn]] void fail(const std::string& what) {
    throw std::runtime_error(what + (t_lastError.empty() ? "" : " (" + t_lastError + ")"));
}

void check(int result, const char* what) {
    if (!result)
        fail(what);
}

struct TiffCloser {
    void operator()(TIFF* tif) const { TIFFClose(tif); }
};
using TiffFile = std::unique_ptr<TIFF, TiffCloser>;

// ---- what is written --------------------------------------------------------------------------------------

struct Layout {
    uint16_t format, bits;
};

Layout layoutOf(SampleType type) {
    switch (type) {
    case SampleType::UInt8:
        return {SAMPLEFORMAT_UINT, 8};
    case SampleType::Int8:
        return {SAMPLEFORMAT_INT, 8};
    case SampleType::UInt16:
        return {SAMPLEFORMAT_UINT, 16};
    case SampleType::Int16:
        return {SAMPLEFORMAT_INT, 16};
    case SampleType::UInt32:
        return {SAMPLEFORMAT_UINT, 32};
    case SampleType::Int32:
        return {SAMPLEFORMAT_INT, 32};
    case SampleType::UInt64:
        return {SAMPLEFORMAT_UINT, 64};
    case SampleType::Int64:
        return {SAMPLEFORMAT_INT, 64};
    case SampleType::Float32:
        return {SAMPLEFORMAT_IEEEFP, 32};
    case SampleType::Float64:
        return {SAMPLEFORMAT_IEEEFP, 64};
    case SampleType::ComplexFloat32:
        return {SAMPLEFORMAT_COMPLEXIEEEFP, 64};
    case SampleType::ComplexFloat64:
        return {SAMPLEFORMAT_COMPLEXIEEEFP, 128};
    }
    return {SAMPLEFORMAT_UINT, 8};
}

bool isComplex(SampleType type) {
    return type == SampleType::ComplexFloat32 || type == SampleType::ComplexFloat64;
}

bool isReal(SampleType type) {
    return type == SampleType::Float32 || type == SampleType::Float64;
}

struct LevelSize {
    int width, height;
};

// Everything the writer decided once: sizes, tiles, codec.
struct Plan {
    RasterFormat format;
    int tile = 0;
    uint16_t compression = COMPRESSION_NONE;
    int codecLevel = -1;
    uint16_t predictor = PREDICTOR_NONE;
    bool paletted = false;
    int bytes = 0;      // per sample
    int pixelBytes = 0; // bands x bytes
    std::vector<LevelSize> levels;
};

Plan makePlan(const RasterFormat& format, const TiffOptions& options) {
    Plan plan;
    plan.format = format;
    if (format.width <= 0 || format.height <= 0 || format.bands <= 0 || format.bands > 65535)
        throw std::runtime_error("a GeoTIFF needs at least one pixel and one band (and at most 65535 bands)");
    plan.tile = options.tileSize > 0 ? options.tileSize : (options.cog ? 512 : 256);
    if (plan.tile % 16 != 0 || plan.tile > 8192)
        throw std::runtime_error("tile size " + std::to_string(plan.tile) +
                                 " is not a multiple of 16 up to 8192");
    Compression compression = options.compression;
    if (compression == Compression::Default)
        compression = options.cog ? Compression::Deflate : Compression::None;
    plan.compression = compression == Compression::Deflate ? COMPRESSION_ADOBE_DEFLATE
                       : compression == Compression::Zstd  ? COMPRESSION_ZSTD
                                                           : COMPRESSION_NONE;
    plan.codecLevel = options.level;
    if (options.predictor && plan.compression != COMPRESSION_NONE && !isComplex(format.type))
        plan.predictor = isReal(format.type) ? PREDICTOR_FLOATINGPOINT : PREDICTOR_HORIZONTAL;
    plan.bytes = sampleBytes(format.type);
    plan.pixelBytes = plan.bytes * format.bands;
    const bool paletteType = format.type == SampleType::UInt8 || format.type == SampleType::UInt16;
    if (!options.palette.empty()) {
        if (format.bands != 1 || !paletteType || options.palette.size() % 3 != 0)
            throw std::runtime_error("a colour map needs one band of unsigned 8- or 16-bit samples");
        plan.paletted = true;
    }
    // Overviews halve (rounding up) until the image fits one tile.
    LevelSize size{format.width, format.height};
    plan.levels.push_back(size);
    while (options.cog && (size.width > plan.tile || size.height > plan.tile)) {
        size = {(size.width + 1) / 2, (size.height + 1) / 2};
        plan.levels.push_back(size);
    }
    return plan;
}

// Whether a level's data may pass 4 GiB, which needs BigTIFF. Compressed data can grow slightly, the file
// holds directories too: a generous margin.
bool needsBigTiff(const Plan& plan, bool allLevels) {
    double bytes = 0;
    for (size_t k = 0; k < (allLevels ? plan.levels.size() : 1); ++k) {
        const LevelSize& size = plan.levels[k];
        const double tilesAcross = std::ceil(size.width / double(plan.tile));
        const double tilesDown = std::ceil(size.height / double(plan.tile));
        bytes += tilesAcross * tilesDown * plan.tile * plan.tile * plan.bytes * plan.format.bands;
    }
    return bytes * 1.01 + (64 << 20) > 4294967295.0;
}

std::string noDataText(double value, SampleType type) {
    char text[64];
    if (std::isnan(value))
        return "nan";
    if (isReal(type) || isComplex(type))
        std::snprintf(text, sizeof text, "%.17g", value);
    else
        std::snprintf(text, sizeof text, "%.0f", value);
    return text;
}

void setImageTags(TIFF* tif, const Plan& plan, const LevelSize& size, const TiffOptions& options,
                  bool overview) {
    const RasterFormat& f = plan.format;
    const Layout layout = layoutOf(f.type);
    uint16_t photometric = PHOTOMETRIC_MINISBLACK;
    if (plan.paletted)
        photometric = PHOTOMETRIC_PALETTE;
    else if (f.bands == 3 && (f.type == SampleType::UInt8 || f.type == SampleType::UInt16))
        photometric = PHOTOMETRIC_RGB;
    bool ok = TIFFSetField(tif, TIFFTAG_IMAGEWIDTH, static_cast<uint32_t>(size.width)) &&
              TIFFSetField(tif, TIFFTAG_IMAGELENGTH, static_cast<uint32_t>(size.height)) &&
              TIFFSetField(tif, TIFFTAG_SAMPLESPERPIXEL, static_cast<uint16_t>(f.bands)) &&
              TIFFSetField(tif, TIFFTAG_BITSPERSAMPLE, layout.bits) &&
              TIFFSetField(tif, TIFFTAG_SAMPLEFORMAT, layout.format) &&
              TIFFSetField(tif, TIFFTAG_PLANARCONFIG, PLANARCONFIG_CONTIG) &&
              TIFFSetField(tif, TIFFTAG_PHOTOMETRIC, photometric) &&
              TIFFSetField(tif, TIFFTAG_TILEWIDTH, static_cast<uint32_t>(plan.tile)) &&
              TIFFSetField(tif, TIFFTAG_TILELENGTH, static_cast<uint32_t>(plan.tile)) &&
              TIFFSetField(tif, TIFFTAG_COMPRESSION, plan.compression);
    check(ok, "cannot describe the image");
    if (photometric == PHOTOMETRIC_MINISBLACK && f.bands > 1) {
        std::vector<uint16_t> extra(f.bands - 1, EXTRASAMPLE_UNSPECIFIED);
        check(TIFFSetField(tif, TIFFTAG_EXTRASAMPLES, static_cast<uint16_t>(extra.size()), extra.data()),
              "cannot describe the bands");
    }
    if (plan.predictor != PREDICTOR_NONE)
        check(TIFFSetField(tif, TIFFTAG_PREDICTOR, plan.predictor), "cannot set the predictor");
    if (plan.codecLevel >= 0 && plan.compression == COMPRESSION_ADOBE_DEFLATE)
        check(TIFFSetField(tif, TIFFTAG_ZIPQUALITY, plan.codecLevel), "cannot set the deflate level");
    if (plan.codecLevel >= 0 && plan.compression == COMPRESSION_ZSTD)
        check(TIFFSetField(tif, TIFFTAG_ZSTD_LEVEL, plan.codecLevel), "cannot set the zstd level");
    if (overview)
        check(TIFFSetField(tif, TIFFTAG_SUBFILETYPE, FILETYPE_REDUCEDIMAGE), "cannot mark the overview");
    if (plan.paletted) {
        // Every value the samples can take has an entry; those past the given colours are black.
        const size_t entries = size_t(1) << layout.bits;
        std::vector<uint16_t> red(entries), green(entries), blue(entries);
        const size_t given = std::min(entries, options.palette.size() / 3);
        for (size_t i = 0; i < given; ++i) {
            red[i] = static_cast<uint16_t>(options.palette[3 * i] * 257);
            green[i] = static_cast<uint16_t>(options.palette[3 * i + 1] * 257);
            blue[i] = static_cast<uint16_t>(options.palette[3 * i + 2] * 257);
        }
        check(TIFFSetField(tif, TIFFTAG_COLORMAP, red.data(), green.data(), blue.data()),
              "cannot write the colour map");
    }
    if (options.hasNoData)
        check(TIFFSetField(tif, kTagNoData, noDataText(options.noData, f.type).c_str()),
              "cannot write the no-data value");
}

void setGeoTags(TIFF* tif, const GeoReference& geo) {
    const bool placed =
        geo.system != GeoReference::System::None && (geo.hasGeotransform || !geo.tiePoints.empty());
    if (placed) {
        if (geo.hasGeotransform) {
            const double* gt = geo.geotransform;
            double scale[3] = {gt[1], -gt[5], 0};
            double tie[6] = {0, 0, 0, gt[0], gt[3], 0};
            check(TIFFSetField(tif, TIFFTAG_GEOPIXELSCALE, 3, scale) &&
                      TIFFSetField(tif, TIFFTAG_GEOTIEPOINTS, 6, tie),
                  "cannot write the geotransform");
        } else {
            std::vector<double> ties;
            for (const GeoReference::TiePoint& p : geo.tiePoints)
                ties.insert(ties.end(), {p.col, p.row, 0, p.x, p.y, 0});
            check(TIFFSetField(tif, TIFFTAG_GEOTIEPOINTS, static_cast<uint32_t>(ties.size()), ties.data()),
                  "cannot write the tie points");
        }
        GTIF* keys = GTIFNew(tif);
        if (!keys)
            fail("cannot start the GeoTIFF keys");
        GTIFKeySet(keys, GTRasterTypeGeoKey, TYPE_SHORT, 1, RasterPixelIsArea);
        if (geo.system == GeoReference::System::Geographic) {
            GTIFKeySet(keys, GTModelTypeGeoKey, TYPE_SHORT, 1, ModelTypeGeographic);
            GTIFKeySet(keys, GeographicTypeGeoKey, TYPE_SHORT, 1, GCS_WGS_84);
            GTIFKeySet(keys, GeogAngularUnitsGeoKey, TYPE_SHORT, 1, Angular_Degree);
        } else {
            // The EPSG codes of WGS 84 / UTM: 326zz north, 327zz south.
            GTIFKeySet(keys, GTModelTypeGeoKey, TYPE_SHORT, 1, ModelTypeProjected);
            GTIFKeySet(keys, ProjectedCSTypeGeoKey, TYPE_SHORT, 1, (geo.southern ? 32700 : 32600) + geo.zone);
            GTIFKeySet(keys, ProjLinearUnitsGeoKey, TYPE_SHORT, 1, Linear_Meter);
        }
        const int written = GTIFWriteKeys(keys);
        GTIFFree(keys);
        check(written, "cannot write the GeoTIFF keys");
    }
    if (geo.rpc.size() == 92)
        check(TIFFSetField(tif, kTagRpcCoefficients, 92, geo.rpc.data()), "cannot write the RPC model");
    else if (!geo.rpc.empty())
        throw std::runtime_error("an RPC model has 92 values, not " + std::to_string(geo.rpc.size()));
}

// ---- halving a strip --------------------------------------------------------------------------------------

template <typename T> struct Sum { using type = int64_t; };
template <> struct Sum<uint64_t> { using type = __int128; };
template <> struct Sum<int64_t> { using type = __int128; };
template <> struct Sum<float> { using type = double; };
template <> struct Sum<double> { using type = double; };

// The mean of `n` values summing to `sum`, rounded half up for integers.
template <typename T> T mean(typename Sum<T>::type sum, int n) {
    if constexpr (std::is_floating_point<T>::value) {
        return static_cast<T>(sum / n);
    } else {
        using S = typename Sum<T>::type;
        const S numerator = 2 * sum + n, denominator = 2 * static_cast<S>(n);
        S quotient = numerator / denominator;
        if ((numerator % denominator != 0) && (numerator < 0))
            --quotient; // floor, not truncation
        return static_cast<T>(quotient);
    }
}

struct Halving {
    bool nearest = false; // colour-mapped samples are indexes: they are picked, not averaged
    bool hasNoData = false;
    double noData = 0;
};

template <typename T> bool isNoData(T value, const Halving& how) {
    if constexpr (std::is_floating_point<T>::value) {
        if (std::isnan(how.noData))
            return std::isnan(value);
    }
    return static_cast<double>(value) == how.noData;
}

// Halves `rows` rows of `width` pixels of `elements` values each (rows `inStride` values apart) into
// ceil(rows / 2) rows of ceil(width / 2) pixels (`outStride` apart). At an odd edge the last row or column
// stands in for its missing neighbour, which leaves the mean of what is there unchanged.
template <typename T>
void halve(const T* in, size_t inStride, int width, int rows, int elements, T* out, size_t outStride,
           const Halving& how) {
    using S = typename Sum<T>::type;
    const int outWidth = (width + 1) / 2, outRows = (rows + 1) / 2;
    for (int r = 0; r < outRows; ++r) {
        const T* a = in + 2 * r * inStride;
        const T* b = 2 * r + 1 < rows ? a + inStride : a;
        T* o = out + r * outStride;
        for (int c = 0; c < outWidth; ++c) {
            const size_t left = static_cast<size_t>(2 * c) * elements;
            const size_t right = static_cast<size_t>(std::min(2 * c + 1, width - 1)) * elements;
            for (int e = 0; e < elements; ++e) {
                const T v[4] = {a[left + e], a[right + e], b[left + e], b[right + e]};
                T& result = o[static_cast<size_t>(c) * elements + e];
                if (how.nearest) {
                    result = v[0];
                } else if (!how.hasNoData) {
                    result = mean<T>(S(v[0]) + S(v[1]) + S(v[2]) + S(v[3]), 4);
                } else {
                    S sum = 0;
                    int n = 0;
                    for (T value : v) {
                        if (!isNoData(value, how)) {
                            sum += S(value);
                            ++n;
                        }
                    }
                    result = n ? mean<T>(sum, n) : static_cast<T>(how.noData);
                }
            }
        }
    }
}

// The same on raw bytes of a sample type: complex samples are two values each.
void halveBytes(SampleType type, const unsigned char* in, size_t inRowBytes, int width, int rows, int samples,
                unsigned char* out, size_t outRowBytes, const Halving& how) {
    auto run = [&](auto element, int elements) {
        using T = decltype(element);
        halve(reinterpret_cast<const T*>(in), inRowBytes / sizeof(T), width, rows, elements,
              reinterpret_cast<T*>(out), outRowBytes / sizeof(T), how);
    };
    switch (type) {
    case SampleType::UInt8:
        return run(uint8_t(), samples);
    case SampleType::Int8:
        return run(int8_t(), samples);
    case SampleType::UInt16:
        return run(uint16_t(), samples);
    case SampleType::Int16:
        return run(int16_t(), samples);
    case SampleType::UInt32:
        return run(uint32_t(), samples);
    case SampleType::Int32:
        return run(int32_t(), samples);
    case SampleType::UInt64:
        return run(uint64_t(), samples);
    case SampleType::Int64:
        return run(int64_t(), samples);
    case SampleType::Float32:
        return run(float(), samples);
    case SampleType::Float64:
        return run(double(), samples);
    case SampleType::ComplexFloat32:
        return run(float(), 2 * samples);
    case SampleType::ComplexFloat64:
        return run(double(), 2 * samples);
    }
}

// ---- levels -----------------------------------------------------------------------------------------------

// Band-sequential rows (`bands` planes of `rows` x `width` samples of `bytes`) into pixel-interleaved ones.
template <size_t Bytes>
void interleaveSized(const unsigned char* planes, int bands, int rows, int width, unsigned char* out) {
    const size_t plane = static_cast<size_t>(rows) * width;
    for (size_t i = 0; i < plane; ++i)
        for (int b = 0; b < bands; ++b)
            std::memcpy(out + (i * bands + b) * Bytes, planes + (b * plane + i) * Bytes, Bytes);
}

void interleave(const unsigned char* planes, int bands, int rows, int width, int bytes, unsigned char* out) {
    switch (bytes) {
    case 1:
        return interleaveSized<1>(planes, bands, rows, width, out);
    case 2:
        return interleaveSized<2>(planes, bands, rows, width, out);
    case 4:
        return interleaveSized<4>(planes, bands, rows, width, out);
    case 8:
        return interleaveSized<8>(planes, bands, rows, width, out);
    default:
        return interleaveSized<16>(planes, bands, rows, width, out);
    }
}

// Encodes tiles into TIFF files, `files[level][worker]`. With one worker it does so on the calling thread;
// with more, each worker thread writes into files of its own, so that libtiff's codecs run side by side
// (a file's tile table then holds the tiles that its worker encoded).
class TileEncoder {
public:
    TileEncoder(std::vector<std::vector<TIFF*>> files, size_t tileBytes)
        : m_files(std::move(files)), m_tileBytes(tileBytes) {
        const size_t workers = m_files.empty() ? 1 : m_files[0].size();
        for (size_t w = 0; workers > 1 && w < workers; ++w)
            m_workers.emplace_back(&TileEncoder::work, this, w);
    }
    ~TileEncoder() { stop(); }
    TileEncoder(const TileEncoder&) = delete;
    TileEncoder& operator=(const TileEncoder&) = delete;

    // A buffer for one tile (its earlier contents left in it), to be filled and handed to encode().
    std::vector<unsigned char> buffer() {
        std::lock_guard<std::mutex> lock(m_mutex);
        if (m_spare.empty())
            return std::vector<unsigned char>(m_tileBytes);
        std::vector<unsigned char> tile = std::move(m_spare.back());
        m_spare.pop_back();
        return tile;
    }

    void encode(int level, uint32_t index, std::vector<unsigned char> tile) {
        if (m_workers.empty()) {
            write(m_files[level][0], index, tile);
            m_spare.push_back(std::move(tile));
            return;
        }
        std::unique_lock<std::mutex> lock(m_mutex);
        // A few tiles per worker in waiting keep the workers busy and the memory small.
        m_space.wait(lock, [&] { return m_jobs.size() < 2 * m_workers.size() || !m_failure.empty(); });
        if (!m_failure.empty())
            fail(m_failure);
        m_jobs.push_back({level, index, std::move(tile)});
        m_ready.notify_one();
    }

    // Waits for every tile; throws when one could not be written.
    void finish() {
        stop();
        if (!m_failure.empty())
            fail(m_failure);
    }

private:
    struct Job {
        int level;
        uint32_t index;
        std::vector<unsigned char> tile;
    };

    static void write(TIFF* tif, uint32_t index, std::vector<unsigned char>& tile) {
        if (TIFFWriteEncodedTile(tif, index, tile.data(), static_cast<tmsize_t>(tile.size())) < 0)
            fail("cannot write a tile");
    }

    void work(size_t worker) {
        for (;;) {
            Job job;
            {
                std::unique_lock<std::mutex> lock(m_mutex);
                m_ready.wait(lock, [&] { return !m_jobs.empty() || m_closing; });
                if (m_jobs.empty())
                    return;
                job = std::move(m_jobs.front());
                m_jobs.pop_front();
                m_space.notify_one();
            }
            try {
                write(m_files[job.level][worker], job.index, job.tile);
            } catch (const std::exception& e) {
                std::lock_guard<std::mutex> lock(m_mutex);
                if (m_failure.empty())
                    m_failure = e.what();
                m_space.notify_all();
            }
            std::lock_guard<std::mutex> lock(m_mutex);
            m_spare.push_back(std::move(job.tile));
        }
    }

    void stop() {
        {
            std::lock_guard<std::mutex> lock(m_mutex);
            m_closing = true;
        }
        m_ready.notify_all();
        for (std::thread& worker : m_workers)
            worker.join();
        m_workers.clear();
    }

    std::vector<std::vector<TIFF*>> m_files;
    size_t m_tileBytes;
    std::vector<std::thread> m_workers;
    std::mutex m_mutex;
    std::condition_variable m_ready, m_space;
    std::deque<Job> m_jobs;
    std::vector<std::vector<unsigned char>> m_spare;
    bool m_closing = false;
    std::string m_failure;
};

// One resolution level: a strip of one tile row of pixel-interleaved samples, filled from the source or from
// the level above, and handed tile by tile to the encoder.
class Level {
public:
    Level(const Plan& plan, const LevelSize& size, TileEncoder& encoder, int index, bool fromSource)
        : m_plan(plan), m_size(size), m_encoder(encoder), m_index(index), m_fromSource(fromSource),
          m_rowBytes(static_cast<size_t>(size.width) * plan.pixelBytes), m_strip(m_rowBytes * plan.tile) {}

    const LevelSize& size() const { return m_size; }
    bool fromSource() const { return m_fromSource; }
    bool complete() const { return m_nextRow >= m_size.height; }
    int stripCapacity() const { return std::min(m_plan.tile, m_size.height - m_nextRow); }
    int filled() const { return m_filled; }
    size_t rowBytes() const { return m_rowBytes; }
    unsigned char* row(int row) { return m_strip.data() + row * m_rowBytes; }

    // Reads the next strip from the source: decoded straight into the strip when the source interleaves
    // pixels, else into `planes` and interleaved from there.
    void readFrom(RowSource& source, int level, std::vector<unsigned char>& planes) {
        const int count = stripCapacity();
        const RasterFormat& f = m_plan.format;
        if (f.bandSequential && f.bands > 1) {
            planes.resize(m_rowBytes * count);
            source.readRows(level, m_nextRow, count, planes.data());
            interleave(planes.data(), f.bands, count, m_size.width, m_plan.bytes, m_strip.data());
        } else {
            source.readRows(level, m_nextRow, count, m_strip.data());
        }
        m_filled = count;
    }

    // Takes the rows halved from the strip of the level above.
    void addHalved(Level& above, const Halving& how) {
        halveBytes(m_plan.format.type, above.row(0), above.rowBytes(), above.size().width, above.filled(),
                   m_plan.format.bands, row(m_filled), m_rowBytes, how);
        m_filled += (above.filled() + 1) / 2;
    }

    bool stripFull() const { return m_filled > 0 && m_filled == stripCapacity(); }

    // Encodes the strip's tiles (padded with zeros at the right and bottom edges) and starts the next strip.
    void encodeStrip() {
        const int tile = m_plan.tile, tileRow = m_nextRow / tile,
                  tilesAcross = (m_size.width + tile - 1) / tile;
        const size_t tileRowBytes = static_cast<size_t>(tile) * m_plan.pixelBytes;
        for (int x = 0; x < tilesAcross; ++x) {
            const int cols = std::min(tile, m_size.width - x * tile);
            const size_t copied = static_cast<size_t>(cols) * m_plan.pixelBytes;
            std::vector<unsigned char> buffer = m_encoder.buffer();
            if (cols < tile || m_filled < tile)
                std::fill(buffer.begin(), buffer.end(), 0);
            for (int r = 0; r < m_filled; ++r)
                std::memcpy(buffer.data() + r * tileRowBytes, row(r) + x * tileRowBytes, copied);
            m_encoder.encode(m_index, static_cast<uint32_t>(tileRow * tilesAcross + x), std::move(buffer));
        }
        m_nextRow += m_filled;
        m_filled = 0;
    }

private:
    const Plan& m_plan;
    LevelSize m_size;
    TileEncoder& m_encoder;
    int m_index;
    bool m_fromSource;
    size_t m_rowBytes;
    std::vector<unsigned char> m_strip;
    int m_nextRow = 0;
    int m_filled = 0;
};

// Reads every level that comes from the source, strip by strip, and feeds the levels averaged from it.
class Pyramid {
public:
    Pyramid(RowSource& source, const Plan& plan, const TiffOptions& options, std::vector<Level>& levels,
            double progressShare)
        : m_source(source), m_options(options), m_levels(levels), m_share(progressShare) {
        m_how.nearest = plan.paletted;
        m_how.hasNoData = options.hasNoData;
        m_how.noData = options.noData;
        for (const Level& level : levels)
            if (level.fromSource())
                m_total += static_cast<double>(level.size().width) * level.size().height;
    }

    void run() {
        for (size_t k = 0; k < m_levels.size(); ++k) {
            if (!m_levels[k].fromSource())
                continue;
            Level& level = m_levels[k];
            while (!level.complete()) {
                const int rows = level.stripCapacity();
                level.readFrom(m_source, static_cast<int>(k), m_planes);
                finishStrip(k);
                m_done += static_cast<double>(level.size().width) * rows;
                if (m_options.progress)
                    m_options.progress(m_share * m_done / m_total);
            }
        }
    }

private:
    // Encodes level k's full strip and hands it down to the level below when that one is averaged.
    void finishStrip(size_t k) {
        Level& level = m_levels[k];
        if (k + 1 < m_levels.size() && !m_levels[k + 1].fromSource()) {
            Level& below = m_levels[k + 1];
            below.addHalved(level, m_how);
            level.encodeStrip();
            if (below.stripFull())
                finishStrip(k + 1);
        } else {
            level.encodeStrip();
        }
    }

    RowSource& m_source;
    const TiffOptions& m_options;
    std::vector<Level>& m_levels;
    double m_share;
    Halving m_how;
    std::vector<unsigned char> m_planes; // band-sequential rows on their way to the strip
    double m_total = 0, m_done = 0;
};

// ---- files ------------------------------------------------------------------------------------------------

// Removes the output unless the writing completes.
class OutputGuard {
public:
    explicit OutputGuard(const std::string& path) : m_path(path) {}
    ~OutputGuard() {
        if (!m_kept)
            std::remove(m_path.c_str());
    }
    OutputGuard(const OutputGuard&) = delete;
    OutputGuard& operator=(const OutputGuard&) = delete;
    void keep() { m_kept = true; }

private:
    std::string m_path;
    bool m_kept = false;
};

TiffFile openTiff(const std::string& path, const char* mode) {
    TiffFile tif(XTIFFOpen(path.c_str(), mode));
    if (!tif)
        fail("cannot open " + path);
    return tif;
}

// A scratch TIFF next to the output (so on the same disk), deleted from the directory at once: it
// disappears with its handle whatever happens.
TiffFile scratchTiff(const std::string& outputPath, bool big) {
    const size_t slash = outputPath.find_last_of('/');
    const int fd = nitfextract::openUnlinkedFile(
        slash == std::string::npos ? std::string(".") : outputPath.substr(0, slash), ".nitf-level-");
    if (fd < 0)
        throw std::runtime_error("cannot create a scratch file beside " + outputPath + ": " +
                                 std::strerror(errno));
    TiffFile tif(TIFFFdOpen(fd, "scratch level", big ? "w8" : "w"));
    if (!tif) {
        close(fd);
        fail("cannot start a scratch file");
    }
    return tif;
}

// The compressed tiles of a level, in index order, appended to the current directory of `to`: each from
// the worker file that encoded it.
void copyTiles(const std::vector<TiffFile>& from, TIFF* to) {
    std::vector<unsigned char> buffer;
    const uint32_t tiles = TIFFNumberOfTiles(from[0].get());
    for (uint32_t t = 0; t < tiles; ++t) {
        size_t w = 0;
        while (w + 1 < from.size() && TIFFGetStrileByteCount(from[w].get(), t) == 0)
            ++w;
        const uint64_t size = TIFFGetStrileByteCount(from[w].get(), t);
        const uint64_t offset = TIFFGetStrileOffset(from[w].get(), t);
        const int fd = TIFFFileno(from[w].get());
        buffer.resize(size);
        size_t got = 0;
        while (got < size) {
            const ssize_t n = pread(fd, buffer.data() + got, size - got, static_cast<off_t>(offset + got));
            if (n <= 0)
                throw std::runtime_error("cannot read back a scratch tile");
            got += static_cast<size_t>(n);
        }
        if (TIFFWriteRawTile(to, t, buffer.data(), static_cast<tmsize_t>(size)) < 0)
            fail("cannot write a tile");
    }
}

size_t tileBytes(const Plan& plan) {
    return static_cast<size_t>(plan.tile) * plan.tile * plan.pixelBytes;
}

void writePlain(const std::string& path, RowSource& source, const GeoReference& geo,
                const TiffOptions& options, const Plan& plan) {
    TiffFile tif = openTiff(path, needsBigTiff(plan, false) ? "w8" : "w");
    setImageTags(tif.get(), plan, plan.levels[0], options, false);
    setGeoTags(tif.get(), geo);
    TileEncoder encoder({{tif.get()}}, tileBytes(plan));
    std::vector<Level> levels;
    levels.emplace_back(plan, plan.levels[0], encoder, 0, true);
    Pyramid(source, plan, options, levels, 1.0).run();
    encoder.finish();
    check(TIFFWriteDirectory(tif.get()), "cannot write the image directory");
    tif.reset();
}

// Every level is encoded into scratch files first (one per level and worker); then the output gets every
// directory at its start, with the tile tables right after them, and the tiles copied as they are, smallest
// level first, the tables being rewritten in place.
void writeCloudOptimized(const std::string& path, RowSource& source, const GeoReference& geo,
                         const TiffOptions& options, const Plan& plan) {
    const bool big = needsBigTiff(plan, true);
    const int reduced = std::max(0, source.reducedLevels());
    // Each worker keeps a scratch file per level open: at most 16 workers stay well within the descriptor
    // limit on any machine.
    const unsigned threads = std::clamp(options.threads > 0 ? static_cast<unsigned>(options.threads)
                                                            : std::thread::hardware_concurrency(),
                                        1u, 16u);
    std::vector<std::vector<TiffFile>> scratch(plan.levels.size());
    std::vector<std::vector<TIFF*>> files(plan.levels.size());
    for (size_t k = 0; k < plan.levels.size(); ++k) {
        for (unsigned w = 0; w < threads; ++w) {
            scratch[k].push_back(scratchTiff(path, big));
            TIFF* tif = scratch[k].back().get();
            setImageTags(tif, plan, plan.levels[k], options, k > 0);
            check(TIFFWriteCheck(tif, 1, "scratch"), "cannot prepare a scratch file");
            files[k].push_back(tif);
        }
    }
    TileEncoder encoder(files, tileBytes(plan));
    std::vector<Level> levels;
    levels.reserve(plan.levels.size());
    for (size_t k = 0; k < plan.levels.size(); ++k)
        levels.emplace_back(plan, plan.levels[k], encoder, static_cast<int>(k),
                            k == 0 || static_cast<int>(k) <= reduced);
    const double encodingShare = 0.9;
    Pyramid(source, plan, options, levels, encodingShare).run();
    encoder.finish();

    {
        // Every directory first, each followed by its tile tables (all zero until the tiles are there).
        TiffFile out = openTiff(path, big ? "w8" : "w");
        for (size_t k = 0; k < plan.levels.size(); ++k) {
            setImageTags(out.get(), plan, plan.levels[k], options, k > 0);
            if (k == 0)
                setGeoTags(out.get(), geo);
            check(TIFFWriteCheck(out.get(), 1, "directory"), "cannot prepare an image directory");
            check(TIFFWriteDirectory(out.get()), "cannot write an image directory");
        }
    }
    TiffFile out = openTiff(path, "r+");
    long long copied = 0, total = 0;
    for (const std::vector<TiffFile>& level : scratch)
        total += TIFFNumberOfTiles(level[0].get());
    for (size_t k = plan.levels.size(); k-- > 0;) {
        check(TIFFSetDirectory(out.get(), static_cast<tdir_t>(k)), "cannot reopen an image directory");
        copyTiles(scratch[k], out.get());
        // The tables were written in place: same count and type, now with the offsets.
        check(TIFFForceStrileArrayWriting(out.get()), "cannot complete the tile tables");
        copied += TIFFNumberOfTiles(scratch[k][0].get());
        if (options.progress)
            options.progress(encodingShare + (1 - encodingShare) * copied / total);
    }
    out.reset();
}

} // namespace

void writeGeoTiff(const std::string& path, RowSource& source, const GeoReference& geo,
                  const TiffOptions& options) {
    registerTags();
    TiffReporting reporting;
    t_lastError.clear();
    const Plan plan = makePlan(source.format(), options);
    OutputGuard guard(path);
    if (options.cog)
        writeCloudOptimized(path, source, geo, options, plan);
    else
        writePlain(path, source, geo, options, plan);
    guard.keep();
    if (options.progress)
        options.progress(1.0);
}

} // namespace nitfpicture
