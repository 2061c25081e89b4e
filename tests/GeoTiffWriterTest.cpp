// The GeoTIFF writer on synthetic rasters, read back by GDAL: every sample type in both row layouts, the
// Cloud-Optimized layout with its averaged (or source-made) overviews, georeferencing, RPC, colour map and
// no-data; the rows it asks for; and failures.
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <cstring>
#include <fstream>
#include <functional>
#include <memory>
#include <optional>
#include <sstream>
#include <string>
#include <vector>

#include "GdalOracle.h"
#include "GeoTiffWriter.h"
#include "Sha256.h"
#include "TestFiles.h"

using namespace nitfpicture;

namespace {

// GDAL's names of the types, in the order of SampleType.
const char* gdalTypeName(SampleType type) {
    static const char* const names[] = {"Byte",   "Byte",  "UInt16",  "Int16",   "UInt32",   "Int32",
                                        "UInt64", "Int64", "Float32", "Float64", "CFloat32", "CFloat64"};
    return names[static_cast<int>(type)];
}

template <typename T> void put(unsigned char* out, T value) {
    std::memcpy(out, &value, sizeof value);
}

// One sample of `type`, native, from full-range bits for (band, row, col): integers take their low bytes,
// reals a scaled value, complex numbers two of them.
void sampleAt(SampleType type, int band, int row, int col, unsigned char* out) {
    const uint64_t bits = (static_cast<uint64_t>(band) * 1000003 + static_cast<uint64_t>(row) * 7919 +
                           static_cast<uint64_t>(col) * 104729 + 1) *
                          0x9E3779B97F4A7C15ULL;
    const double a = static_cast<int32_t>(bits >> 16) / 1024.0, b = static_cast<int32_t>(bits >> 36) / 1024.0;
    switch (type) {
    case SampleType::Float32:
        return put(out, static_cast<float>(a));
    case SampleType::Float64:
        return put(out, a / 3);
    case SampleType::ComplexFloat32:
        put(out, static_cast<float>(a));
        return put(out + 4, static_cast<float>(b));
    case SampleType::ComplexFloat64:
        put(out, a / 3);
        return put(out + 8, b / 7);
    default:
        std::memcpy(out, &bits, sampleBytes(type)); // little-endian: the low bytes
    }
}

using Content = std::function<void(int level, int band, int row, int col, unsigned char* out)>;

// A raster computed on the fly, which checks how it is read: rows top to bottom, each once, never more than
// `maxRows` at a time.
class SyntheticRaster : public RowSource {
public:
    SyntheticRaster(RasterFormat format, Content content, int reduced = 0, int maxRows = 1 << 30)
        : m_format(format), m_content(std::move(content)), m_reduced(reduced), m_maxRows(maxRows),
          m_nextRow(reduced + 1, 0) {}

    RasterFormat format() const override { return m_format; }
    int reducedLevels() const override { return m_reduced; }

    void readRows(int level, int first, int count, void* buffer) override {
        EXPECT_LE(level, m_reduced);
        EXPECT_EQ(first, m_nextRow.at(level)) << "rows are asked for in order, each once";
        EXPECT_LE(count, m_maxRows);
        if (m_failAtRow >= 0 && first + count > m_failAtRow)
            throw std::runtime_error("the source failed");
        m_nextRow[level] = first + count;
        const int width = levelSize(m_format.width, level);
        const size_t bytes = sampleBytes(m_format.type);
        unsigned char* out = static_cast<unsigned char*>(buffer);
        for (int r = 0; r < count; ++r)
            for (int c = 0; c < width; ++c)
                for (int b = 0; b < m_format.bands; ++b) {
                    const size_t index = m_format.bandSequential
                                             ? (static_cast<size_t>(b) * count + r) * width + c
                                             : (static_cast<size_t>(r) * width + c) * m_format.bands + b;
                    m_content(level, b, first + r, c, out + index * bytes);
                }
    }

    static int levelSize(int size, int level) {
        return static_cast<int>((size + (1LL << level) - 1) >> level);
    }
    int rowsRead(int level) const { return m_nextRow.at(level); }
    void failAtRow(int row) { m_failAtRow = row; }

private:
    RasterFormat m_format;
    Content m_content;
    int m_reduced, m_maxRows;
    std::vector<int> m_nextRow;
    int m_failAtRow = -1;
};

Content patternContent(SampleType type) {
    return
        [type](int, int band, int row, int col, unsigned char* out) { sampleAt(type, band, row, col, out); };
}

// Band `band` of a level as bytes, `width` x `height` samples of `bytes` each.
using Plane = std::vector<unsigned char>;

Plane planeOf(const Content& content, int level, int band, int width, int height, int bytes) {
    Plane plane(static_cast<size_t>(width) * height * bytes);
    for (int r = 0; r < height; ++r)
        for (int c = 0; c < width; ++c)
            content(level, band, r, c, &plane[(static_cast<size_t>(r) * width + c) * bytes]);
    return plane;
}

// The overview of a plane as its definition says: each output sample the mean of the (up to four) input
// samples it covers that are not no-data, rounded half up for integers.
template <typename T>
Plane halvedReference(const Plane& in, int width, int height, const double* noData = nullptr) {
    const int outWidth = (width + 1) / 2, outHeight = (height + 1) / 2;
    Plane out(static_cast<size_t>(outWidth) * outHeight * sizeof(T));
    const T* src = reinterpret_cast<const T*>(in.data());
    T* dst = reinterpret_cast<T*>(out.data());
    for (int r = 0; r < outHeight; ++r)
        for (int c = 0; c < outWidth; ++c) {
            long double sum = 0;
            int n = 0;
            for (int dr = 0; dr < 2; ++dr)
                for (int dc = 0; dc < 2; ++dc) {
                    const int y = 2 * r + dr, x = 2 * c + dc;
                    if (y >= height || x >= width)
                        continue;
                    const T v = src[static_cast<size_t>(y) * width + x];
                    if (noData && static_cast<double>(v) == *noData)
                        continue;
                    sum += v;
                    ++n;
                }
            T& result = dst[static_cast<size_t>(r) * outWidth + c];
            if (n == 0)
                result = static_cast<T>(*noData);
            else if (std::is_floating_point<T>::value)
                result = static_cast<T>(sum / n);
            else
                result = static_cast<T>(std::floor(sum / n + 0.5L));
        }
    return out;
}

std::string sha(const Plane& plane) {
    return Sha256::of(std::string(plane.begin(), plane.end()));
}

TiffOptions cogOf(int tileSize) {
    TiffOptions options;
    options.cog = true;
    options.tileSize = tileSize;
    return options;
}

GeoReference geographic() {
    GeoReference geo;
    geo.system = GeoReference::System::Geographic;
    geo.hasGeotransform = true;
    const double gt[6] = {10.0, 0.001, 0, 45.0, 0, -0.002};
    std::copy(gt, gt + 6, geo.geotransform);
    return geo;
}

} // namespace

TEST(GeoTiffWriter, EverySampleTypeInBothLayoutsReadsBackThroughGdal) {
    std::vector<std::unique_ptr<TempFile>> files;
    std::vector<std::string> paths;
    struct Written {
        SampleType type;
        RasterFormat format;
        std::vector<std::string> shas;
    };
    std::vector<Written> written;
    for (int t = 0; t <= static_cast<int>(SampleType::ComplexFloat64); ++t) {
        const SampleType type = static_cast<SampleType>(t);
        for (bool bandSequential : {false, true}) {
            for (bool compressed : {false, true}) {
                // Odd sizes over 16-pixel tiles: partial tiles at the right and bottom.
                RasterFormat format{37, 23, bandSequential ? 2 : 3, type, bandSequential};
                SyntheticRaster raster(format, patternContent(type), 0, 16);
                TiffOptions options;
                options.tileSize = 16;
                options.compression = compressed ? Compression::Zstd : Compression::None;
                options.predictor = compressed;
                files.push_back(std::make_unique<TempFile>("", ".tif"));
                ASSERT_NO_THROW(writeGeoTiff(files.back()->path(), raster, geographic(), options));
                EXPECT_EQ(raster.rowsRead(0), 23);
                paths.push_back(files.back()->path());
                Written w{type, format, {}};
                for (int b = 0; b < format.bands; ++b)
                    w.shas.push_back(sha(planeOf(patternContent(type), 0, b, 37, 23, sampleBytes(type))));
                written.push_back(w);
            }
        }
    }
    GDAL_VIEW(view, paths);
    for (size_t i = 0; i < written.size(); ++i) {
        const nlohmann::json& file = (*view)[i];
        const Written& w = written[i];
        SCOPED_TRACE(std::string(gdalTypeName(w.type)) +
                     (w.format.bandSequential ? " band-sequential " : " pixel ") + paths[i]);
        EXPECT_EQ(file["width"], 37);
        EXPECT_EQ(file["height"], 23);
        ASSERT_EQ(file["bands"].size(), w.shas.size());
        for (size_t b = 0; b < w.shas.size(); ++b) {
            EXPECT_EQ(file["bands"][b]["type"], gdalTypeName(w.type));
            EXPECT_EQ(file["bands"][b]["sha256"], w.shas[b]) << "band " << b;
        }
        if (w.type == SampleType::Int8) {
            EXPECT_EQ(file["bands"][0]["pixeltype"], "SIGNEDBYTE");
        }
        EXPECT_EQ(file["epsg"], 4326);
        ASSERT_TRUE(file["geotransform"].is_array());
        EXPECT_DOUBLE_EQ(file["geotransform"][0].get<double>(), 10.0);
        EXPECT_DOUBLE_EQ(file["geotransform"][5].get<double>(), -0.002);
    }
}

TEST(GeoTiffWriter, CloudOptimizedLayoutWithAveragedOverviews) {
    struct Case {
        const char* name;
        RasterFormat format;
        Compression compression;
        bool noData;
    };
    // 1100 x 700 in 256-pixel tiles: overviews of 550 x 350, 275 x 175 and 138 x 88 (odd edges on the way).
    const Case cases[] = {
        {"RGB, deflate", {1100, 700, 3, SampleType::UInt8, false}, Compression::Default, false},
        {"two 16-bit planes, zstd", {1100, 700, 2, SampleType::UInt16, true}, Compression::Zstd, false},
        {"float with no-data", {1100, 700, 1, SampleType::Float32, false}, Compression::Deflate, true},
        {"signed 16-bit with no-data", {1100, 700, 1, SampleType::Int16, true}, Compression::Deflate, true}};
    const double noData = -7;
    // Smooth content (a ramp with every 11th sample no-data), so that averages mean something.
    auto contentOf = [noData](SampleType type, bool holes) -> Content {
        return [=](int, int band, int row, int col, unsigned char* out) {
            const double value = (row * 3 + col * 5 + band * 101) % 4000;
            const bool hole = holes && (row * 1100 + col) % 11 == 0;
            switch (type) {
            case SampleType::UInt8:
                return put(out, static_cast<uint8_t>(value / 16));
            case SampleType::UInt16:
                return put(out, static_cast<uint16_t>(value));
            case SampleType::Int16:
                return put(out, static_cast<int16_t>(hole ? noData : value - 2000));
            default:
                return put(out, static_cast<float>(hole ? noData : value / 8));
            }
        };
    };
    std::vector<std::unique_ptr<TempFile>> files;
    std::vector<std::string> paths;
    std::vector<std::vector<std::vector<std::string>>> expected; // case, band, level
    for (const Case& c : cases) {
        SyntheticRaster raster(c.format, contentOf(c.format.type, c.noData), 0, 256);
        TiffOptions options = cogOf(256);
        options.compression = c.compression;
        options.hasNoData = c.noData;
        options.noData = noData;
        std::vector<double> progress;
        options.progress = [&](double fraction) { progress.push_back(fraction); };
        files.push_back(std::make_unique<TempFile>("", ".tif"));
        ASSERT_NO_THROW(writeGeoTiff(files.back()->path(), raster, geographic(), options)) << c.name;
        paths.push_back(files.back()->path());
        EXPECT_TRUE(std::is_sorted(progress.begin(), progress.end())) << c.name;
        EXPECT_EQ(progress.back(), 1.0);

        expected.emplace_back();
        for (int b = 0; b < c.format.bands; ++b) {
            Plane plane =
                planeOf(contentOf(c.format.type, c.noData), 0, b, 1100, 700, sampleBytes(c.format.type));
            expected.back().push_back({sha(plane)});
            const double* hole = c.noData ? &noData : nullptr;
            for (int width = 1100, height = 700; width > 138;
                 width = (width + 1) / 2, height = (height + 1) / 2) {
                switch (c.format.type) {
                case SampleType::UInt8:
                    plane = halvedReference<uint8_t>(plane, width, height, hole);
                    break;
                case SampleType::UInt16:
                    plane = halvedReference<uint16_t>(plane, width, height, hole);
                    break;
                case SampleType::Int16:
                    plane = halvedReference<int16_t>(plane, width, height, hole);
                    break;
                default:
                    plane = halvedReference<float>(plane, width, height, hole);
                }
                expected.back().back().push_back(sha(plane));
            }
        }
    }
    GDAL_VIEW(view, paths);
    const int sizes[3][2] = {{550, 350}, {275, 175}, {138, 88}};
    for (size_t i = 0; i < expected.size(); ++i) {
        SCOPED_TRACE(cases[i].name);
        const nlohmann::json& file = (*view)[i];
        EXPECT_EQ(file["cog_errors"], nlohmann::json::array());
        for (size_t b = 0; b < expected[i].size(); ++b) {
            const nlohmann::json& band = file["bands"][b];
            EXPECT_EQ(band["sha256"], expected[i][b][0]);
            ASSERT_EQ(band["overviews"].size(), 3u);
            for (int level = 1; level <= 3; ++level)
                EXPECT_EQ(
                    band["overviews"][level - 1],
                    nlohmann::json::array({sizes[level - 1][0], sizes[level - 1][1], expected[i][b][level]}))
                    << "band " << b << " level " << level;
            if (cases[i].noData) {
                EXPECT_EQ(band["nodata"], noData);
            }
        }
    }
}

TEST(GeoTiffWriter, ThreadsWriteTheSameFile) {
    RasterFormat format{700, 600, 3, SampleType::UInt16, true};
    std::string first;
    for (int threads : {1, 3}) {
        SyntheticRaster raster(format, patternContent(SampleType::UInt16));
        TiffOptions options;
        options.cog = true;
        options.tileSize = 128;
        options.threads = threads;
        TempFile file("", ".tif");
        ASSERT_NO_THROW(writeGeoTiff(file.path(), raster, geographic(), options));
        if (first.empty())
            first = file.read();
        else
            EXPECT_TRUE(file.read() == first) << "the tiles land in the same order";
    }
}

TEST(GeoTiffWriter, ReducedResolutionsComeFromTheSource) {
    // The source makes levels 1 and 2 itself (a different content, to tell them apart); level 3 is averaged
    // from its level 2.
    RasterFormat format{1000, 1000, 1, SampleType::UInt8, false};
    Content content = [](int level, int, int row, int col, unsigned char* out) {
        *out = static_cast<unsigned char>(level == 0 ? (row + col) % 256 : 40 * level + (row % 2) * 10);
    };
    SyntheticRaster raster(format, content, 2, 128);
    TempFile file("", ".tif");
    ASSERT_NO_THROW(writeGeoTiff(file.path(), raster, GeoReference(), cogOf(128)));
    EXPECT_EQ(raster.rowsRead(0), 1000);
    EXPECT_EQ(raster.rowsRead(1), 500);
    EXPECT_EQ(raster.rowsRead(2), 250);
    GDAL_VIEW(view, {file.path()});
    const nlohmann::json& overviews = (*view)[0]["bands"][0]["overviews"];
    ASSERT_EQ(overviews.size(), 3u); // 500, 250, 125
    EXPECT_EQ(overviews[0][2], sha(planeOf(content, 1, 0, 500, 500, 1)));
    const Plane level2 = planeOf(content, 2, 0, 250, 250, 1);
    EXPECT_EQ(overviews[1][2], sha(level2));
    EXPECT_EQ(overviews[2][2], sha(halvedReference<uint8_t>(level2, 250, 250)));
    EXPECT_EQ((*view)[0]["cog_errors"], nlohmann::json::array());
    EXPECT_TRUE((*view)[0]["geotransform"].is_null());
}

TEST(GeoTiffWriter, TiePointsRpcColourMapAndNoData) {
    // UTM tie points that no geotransform could hold, an RPC model, a colour map whose overviews pick samples
    // instead of averaging indexes.
    GeoReference geo;
    geo.system = GeoReference::System::Utm;
    geo.zone = 17;
    geo.tiePoints = {{0.5, 0.5, 233085, 3807070},
                     {599.5, 0.5, 234975, 3807170},
                     {599.5, 399.5, 234875, 3805180},
                     {0.5, 399.5, 233085, 3805280}};
    for (int i = 0; i < 92; ++i)
        geo.rpc.push_back(i < 12 ? 100 + i : (i - 12) * 0.5);
    RasterFormat format{600, 400, 1, SampleType::UInt8, false};
    Content content = [](int, int, int row, int col, unsigned char* out) { *out = (row / 3 + col / 5) % 4; };
    SyntheticRaster raster(format, content);
    TiffOptions options = cogOf(256);
    options.palette = {255, 0, 0, 0, 255, 0, 0, 0, 255, 250, 250, 250};
    options.hasNoData = true;
    options.noData = 3;
    TempFile file("", ".tif");
    ASSERT_NO_THROW(writeGeoTiff(file.path(), raster, geo, options));

    GDAL_VIEW(view, {file.path()});
    const nlohmann::json& tif = (*view)[0];
    ASSERT_EQ(tif["gcps"].size(), 4u);
    EXPECT_EQ(tif["gcp_epsg"], 32617);
    EXPECT_TRUE(tif["geotransform"].is_null());
    for (size_t i = 0; i < 4; ++i) {
        const GeoReference::TiePoint& p = geo.tiePoints[i];
        EXPECT_EQ(tif["gcps"][i], nlohmann::json::array({p.col, p.row, p.x, p.y}));
    }
    // Offsets and scales first, then the coefficients.
    EXPECT_EQ(std::stod(tif["rpc"]["LINE_OFF"].get<std::string>()), 102);
    std::istringstream lineNumerator(tif["rpc"]["LINE_NUM_COEFF"].get<std::string>());
    double first, second;
    lineNumerator >> first >> second;
    EXPECT_EQ(second, 0.5);
    const nlohmann::json& band = tif["bands"][0];
    ASSERT_EQ(band["colours"].size(), 256u);
    EXPECT_EQ(band["colours"][0], nlohmann::json::array({255, 0, 0}));
    EXPECT_EQ(band["colours"][3], nlohmann::json::array({250, 250, 250}));
    EXPECT_EQ(band["colours"][4], nlohmann::json::array({0, 0, 0}));
    EXPECT_EQ(band["nodata"], 3);
    // Nearest: the first overview takes each 2 x 2 square's top-left index.
    Plane full = planeOf(content, 0, 0, 600, 400, 1), picked(300 * 200);
    for (int r = 0; r < 200; ++r)
        for (int c = 0; c < 300; ++c)
            picked[r * 300 + c] = full[(2 * r) * 600 + 2 * c];
    EXPECT_EQ(band["overviews"][0][2], sha(picked));
    EXPECT_EQ(tif["cog_errors"], nlohmann::json::array());
}

TEST(GeoTiffWriter, FailuresThrowAndLeaveNoFile) {
    const std::string path = TempFile("", ".tif").path(); // removed again: a free name
    RasterFormat format{300, 300, 1, SampleType::UInt8, false};
    for (bool cog : {false, true}) {
        SyntheticRaster raster(format, patternContent(SampleType::UInt8), 0, 256);
        raster.failAtRow(200);
        TiffOptions options = cogOf(128);
        options.cog = cog;
        EXPECT_THROW(writeGeoTiff(path, raster, GeoReference(), options), std::runtime_error);
        EXPECT_EQ(readWholeFile(path), "") << "the output is removed";
        EXPECT_FALSE(std::ifstream(path).good());
    }
    SyntheticRaster rgb({10, 10, 3, SampleType::UInt8, false}, patternContent(SampleType::UInt8));
    TiffOptions paletted;
    paletted.palette = {1, 2, 3};
    EXPECT_THROW(writeGeoTiff(path, rgb, GeoReference(), paletted), std::runtime_error)
        << "a palette on 3 bands";
    TiffOptions oddTiles;
    oddTiles.tileSize = 100;
    EXPECT_THROW(writeGeoTiff(path, rgb, GeoReference(), oddTiles), std::runtime_error);
    GeoReference shortRpc;
    shortRpc.rpc = {1, 2, 3};
    EXPECT_THROW(writeGeoTiff(path, rgb, shortRpc, TiffOptions()), std::runtime_error);
    SyntheticRaster empty({0, 10, 1, SampleType::UInt8, false}, patternContent(SampleType::UInt8));
    EXPECT_THROW(writeGeoTiff(path, empty, GeoReference(), TiffOptions()), std::runtime_error);
    EXPECT_THROW(writeGeoTiff("/nonexistent-directory/x.tif", rgb, GeoReference(), TiffOptions()),
                 std::runtime_error);
}
