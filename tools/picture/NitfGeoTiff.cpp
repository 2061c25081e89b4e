#include "NitfGeoTiff.h"

#include <cmath>
#include <cstdint>
#include <algorithm>
#include <cstring>
#include <memory>
#include <stdexcept>

#include "NitfRegionReader.h"
#include "NitfFile.h"
#include "NitfImageSource.h"
#include "BandLut.h"
#include "RpcSource.h"

namespace nitfpicture {

namespace {

// The writer's sample types are the region reader's, in the same order: one is cast to the other.
static_assert(static_cast<int>(SampleType::UInt8) == CNitfRegionReader::eUInt8 &&
                  static_cast<int>(SampleType::Int64) == CNitfRegionReader::eInt64 &&
                  static_cast<int>(SampleType::ComplexFloat64) == CNitfRegionReader::eComplexFloat64,
              "sample types out of step");

// What a strip of rows may hold: a block row, unless that is larger and the source can read parts of blocks.
const size_t kStripBudget = 64u << 20;

// Rows of the image through the region reader, pixel-interleaved as the file holds them. Rows are read a
// strip at a time (a block row, so that a block is decoded once however the writer asks for its rows, or less
// where blocks are large and can be read in part) and kept until the writer has taken them; reduced levels
// come from the source where it has them.
class RegionRows : public RowSource {
public:
    RegionRows(CNitfFile& file, CNitfImageSource& source, std::vector<int> bands)
        : m_file(file), m_source(source), m_bands(std::move(bands)), m_region(&file, &source) {
        m_stripHeight =
            m_region.getRowsPerRead(m_region.getWidth(), static_cast<int>(m_bands.size()), kStripBudget);
    }

    RasterFormat format() const override {
        RasterFormat f;
        f.width = m_region.getWidth();
        f.height = m_region.getHeight();
        f.bands = static_cast<int>(m_bands.size());
        f.type = static_cast<SampleType>(m_region.getSampleType());
        f.bandSequential = false;
        return f;
    }

    int reducedLevels() const override { return m_region.getResolutionLevels() - 1; }

    void readRows(int level, int first, int count, void* buffer) override {
        unsigned char* out = static_cast<unsigned char*>(buffer);
        if (level > 0) {
            if (!m_reduced || m_reduced->getLevel() != level) {
                m_reduced.reset(new CNitfRegionReader(&m_file, &m_source));
                m_reduced->setLevel(level);
            }
            check(m_reduced->read(0, first, m_reduced->getWidth(), count, m_bands, out,
                                  CNitfRegionReader::ePixelInterleaved));
            return;
        }
        const size_t row = m_region.getBufferSize(m_region.getWidth(), 1, static_cast<int>(m_bands.size()));
        for (int r = first; r < first + count;) {
            if (r < m_stripTop || r >= m_stripTop + m_stripRows)
                loadStrip(r / m_stripHeight * m_stripHeight);
            const int rows = std::min(first + count, m_stripTop + m_stripRows) - r;
            std::memcpy(out + static_cast<size_t>(r - first) * row,
                        m_strip.data() + static_cast<size_t>(r - m_stripTop) * row, rows * row);
            r += rows;
        }
    }

private:
    void loadStrip(int top) {
        m_stripTop = top;
        m_stripRows = std::min(m_stripHeight, m_region.getHeight() - top);
        m_strip.resize(
            m_region.getBufferSize(m_region.getWidth(), m_stripRows, static_cast<int>(m_bands.size())));
        check(m_region.read(0, top, m_region.getWidth(), m_stripRows, m_bands, m_strip.data(),
                            CNitfRegionReader::ePixelInterleaved));
    }
    void check(const CNitfRegionReader::Result& result) {
        if (result.failedBlocks > 0)
            throw std::runtime_error(std::to_string(result.failedBlocks) +
                                     " block(s) could not be read: " + result.firstError);
    }

    CNitfFile& m_file;
    CNitfImageSource& m_source;
    std::vector<int> m_bands;
    CNitfRegionReader m_region;
    std::unique_ptr<CNitfRegionReader> m_reduced; // of the reduced level last read
    int m_stripHeight = 1, m_stripTop = 0, m_stripRows = 0;
    std::vector<unsigned char> m_strip;
};

} // namespace

namespace {

// The colour map of band `band` (RGB triplets; a one-table grey LUT repeated into three), or empty.
std::vector<unsigned char> paletteOf(CNitfFile& file, CNitfImageSource& source, int band) {
    BandLut lut = readBandLut(file, source, band);
    if (lut.components == 3)
        return lut.entries;
    if (lut.components != 1)
        return {};
    std::vector<unsigned char> grey;
    for (unsigned char level : lut.entries)
        grey.insert(grey.end(), {level, level, level});
    return grey;
}

} // namespace

GeoReference geoReferenceOf(const nitfgeoref::Summary& summary, std::vector<std::string>& notes) {
    GeoReference geo;
    const ProjInfo_t& record = summary.record;
    if (!record.hasCorners)
        return geo;
    if (record.system == PROJ_GEOGRAPHIC) {
        geo.system = GeoReference::System::Geographic;
    } else if (record.system == PROJ_UTM) {
        geo.system = GeoReference::System::Utm;
        geo.zone = record.zone;
        geo.southern = record.southern != 0;
    } else {
        notes.push_back(
            "the corners' coordinate system has no GeoTIFF form here: the file is not georeferenced");
        return geo;
    }
    if (record.hasAffine && summary.axisAligned) {
        geo.hasGeotransform = true;
        std::copy(summary.geotransform, summary.geotransform + 6, geo.geotransform);
    } else {
        // The centres of the corner pixels.
        for (int i = 0; i < 4; ++i) {
            const double col = (i == 1 || i == 2 ? record.width - 1 : 0) + 0.5;
            const double row = (i >= 2 ? record.height - 1 : 0) + 0.5;
            geo.tiePoints.push_back({col, row, record.cornerX[i], record.cornerY[i]});
        }
    }
    return geo;
}

std::vector<double> rpcTagOf(const CRpcSource& model, std::vector<std::string>& notes) {
    if (!model.isValid()) {
        notes.push_back("the RPC model is not declared valid: it is left out");
        return {};
    }
    const CRpcSource::Model& m = model.getModel();
    double lineOffset = m.lineOffset, sampleOffset = m.sampleOffset;
    double lineScale = m.lineScale, sampleScale = m.sampleScale;
    if (model.hasChip()) {
        // chip = origin + d(chip)/d(full) x full, one axis at a time.
        double row0, col0, rowAlongRows, colAlongRows, rowAlongCols, colAlongCols;
        model.fullToChip(0, 0, &row0, &col0);
        model.fullToChip(1, 0, &rowAlongRows, &colAlongRows);
        model.fullToChip(0, 1, &rowAlongCols, &colAlongCols);
        const double rowStep = rowAlongRows - row0, colStep = colAlongCols - col0;
        const double shearRow = rowAlongCols - row0, shearCol = colAlongRows - col0;
        if (std::fabs(shearRow) > 1e-9 * std::fabs(rowStep) ||
            std::fabs(shearCol) > 1e-9 * std::fabs(colStep)) {
            notes.push_back("the ICHIPB chip is rotated against its full image: the RPC model is left out");
            return {};
        }
        lineOffset = row0 + rowStep * m.lineOffset;
        lineScale = rowStep * m.lineScale;
        sampleOffset = col0 + colStep * m.sampleOffset;
        sampleScale = colStep * m.sampleScale;
    }
    std::vector<double> tag = {m.biasError,      m.randomError,     lineOffset,       sampleOffset,
                               m.latitudeOffset, m.longitudeOffset, m.heightOffset,   lineScale,
                               sampleScale,      m.latitudeScale,   m.longitudeScale, m.heightScale};
    for (const double* polynomial :
         {m.lineNumerator, m.lineDenominator, m.sampleNumerator, m.sampleDenominator})
        tag.insert(tag.end(), polynomial, polynomial + 20);
    return tag;
}

std::vector<std::string> writeImageGeoTiff(CNitfFile& file, CNitfImageSource& source,
                                           const std::vector<int>& bands, const std::string& path,
                                           const TiffOptions& options) {
    std::vector<std::string> notes;
    std::vector<int> chosen = bands;
    if (chosen.empty())
        for (int b = 0; b < source.getImageProperties().getBandCount(); ++b)
            chosen.push_back(b);
    RegionRows rows(file, source, chosen);
    const SampleType type = rows.format().type;

    TiffOptions settings = options;
    if (chosen.size() == 1 && (type == SampleType::UInt8 || type == SampleType::UInt16))
        settings.palette = paletteOf(file, source, chosen[0]);
    if (source.hasPadPixel()) {
        settings.hasNoData = true;
        settings.noData = static_cast<double>(source.getPadPixelValue());
    }

    const nitfgeoref::Summary summary =
        nitfgeoref::summarize(file.getInputStream(), source.getImageSubheader());
    GeoReference geo = geoReferenceOf(summary, notes);
    if (summary.sensorModel)
        geo.rpc = rpcTagOf(*summary.sensorModel, notes);

    writeGeoTiff(path, rows, geo, settings);
    return notes;
}

} // namespace nitfpicture
