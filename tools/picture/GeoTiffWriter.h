// GeoTIFF and Cloud-Optimized GeoTIFF files from rows of pixels that the writer pulls through a RowSource:
// every sample type of the image readers, georeferencing as a geotransform or as tie points, the RPC tag, a
// colour map and a no-data value. Memory stays at a strip of tiles per resolution level, whatever the image's
// size. This part knows nothing of NITF: NitfGeoTiff.h connects it to images.
#pragma once

#include <functional>
#include <string>
#include <vector>

namespace nitfpicture {

// Native-endian samples; the complex types are (real, imaginary) pairs.
enum class SampleType {
    UInt8,
    Int8,
    UInt16,
    Int16,
    UInt32,
    Int32,
    UInt64,
    Int64,
    Float32,
    Float64,
    ComplexFloat32,
    ComplexFloat64
};
int sampleBytes(SampleType type);

struct RasterFormat {
    int width = 0, height = 0, bands = 0;
    SampleType type = SampleType::UInt8;
    // How readRows lays out `count` rows: pixel-interleaved, each row holding every band of a pixel in turn
    // (false), or band-sequential, `count` rows of the first band, then of the second, ... (true). The file
    // interleaves pixels either way: correlated bands compress far better so, and readers expect it.
    bool bandSequential = false;
};

// Where the pixels come from.
class RowSource {
public:
    virtual ~RowSource() = default;
    virtual RasterFormat format() const = 0;
    // Reduced resolutions the source decodes itself (a JPEG 2000 codestream's levels): level k, 1 to this
    // number, is ceil(width / 2^k) x ceil(height / 2^k). Levels beyond are made by averaging.
    virtual int reducedLevels() const { return 0; }
    // Decodes rows [first, first + count) of `level` (0: full resolution) into `buffer`, in the format's
    // layout, rows packed. Rows are asked for top to bottom, each once. Throws on failure.
    virtual void readRows(int level, int first, int count, void* buffer) = 0;
};

// Where the pixels lie: a coordinate system on WGS 84 and either a geotransform (for images whose corners
// form a rectangle along the system's axes) or tie points; and a rational polynomial sensor model.
struct GeoReference {
    enum class System { None, Geographic, Utm };
    System system = System::None;
    int zone = 0; // UTM
    bool southern = false;
    // x = gt0 + gt1 col + gt2 row, y = gt3 + gt4 col + gt5 row, with (col, row) = (0, 0) the outer corner of
    // the first pixel. Written only without rotation (gt2 = gt4 = 0).
    bool hasGeotransform = false;
    double geotransform[6] = {};
    // Raster positions (0.5, 0.5 is the centre of the first pixel) and their map coordinates.
    struct TiePoint {
        double col, row, x, y;
    };
    std::vector<TiePoint> tiePoints;
    // Empty, or the 92 values of the GeoTIFF RPC tag: bias and random error, line, sample, latitude,
    // longitude and height offsets, the same five scales, then the line numerator, line denominator, sample
    // numerator and sample denominator coefficients (20 each, RPC00B term order).
    std::vector<double> rpc;
};

enum class Compression { Default, None, Deflate, Zstd };

struct TiffOptions {
    // Cloud-Optimized layout: tiled, compressed, with internal overviews down to one tile, every IFD at the
    // start of the file and the smallest overview's tiles first.
    bool cog = false;
    Compression compression = Compression::Default; // none for a plain GeoTIFF, deflate for a COG
    int level = -1;                                 // the codec's level; -1 its default
    bool predictor = false;                         // horizontal differencing (floating point for reals)
    int tileSize = 0;                               // a multiple of 16; 0: 256, or 512 for a COG
    // RGB triplets of a colour map, for one band of unsigned 8- or 16-bit samples (padded with black to
    // every value the samples can take).
    std::vector<unsigned char> palette;
    bool hasNoData = false;
    double noData = 0;
    // Threads that compress a COG's tiles side by side, at most 16; 0: one per processor. A plain GeoTIFF is
    // written on the calling thread.
    int threads = 0;
    // Told the fraction done, 0 to 1.
    std::function<void(double)> progress;
};

// Writes the file at `path` (removed again on failure, which throws std::runtime_error).
void writeGeoTiff(const std::string& path, RowSource& source, const GeoReference& geo,
                  const TiffOptions& options);

} // namespace nitfpicture
