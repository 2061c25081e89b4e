#include "NitfGeoTiff.h"

#include <cmath>
#include <cstdint>
#include <cstring>
#include <stdexcept>

#include "ImageExtract.h"
#include "NitfFile.h"
#include "NitfImageSource.h"
#include "NitfLutSource.h"
#include "RpcSource.h"

namespace nitfpicture {

namespace {

bool isSigned(SampleType type) {
    return type == SampleType::Int8 || type == SampleType::Int16 || type == SampleType::Int32 ||
           type == SampleType::Int64;
}

// Canonical samples (big-endian, `inBytes` each) to native ones (`outBytes` each, wider for odd sizes,
// sign-extended when signed). Complex samples swap each half on its own.
void canonicalToNative(const unsigned char* in, int inBytes, unsigned char* out, SampleType type,
                       size_t count) {
    const int outBytes = sampleBytes(type);
    if (inBytes == 1 && outBytes == 1) {
        std::memcpy(out, in, count);
        return;
    }
    const bool complex = type == SampleType::ComplexFloat32 || type == SampleType::ComplexFloat64;
    const int word = complex ? inBytes / 2 : inBytes;
    if (word == outBytes / (complex ? 2 : 1)) {
        // Same size: a byte swap per word.
        const size_t words = count * (complex ? 2 : 1);
        for (size_t i = 0; i < words; ++i) {
            const unsigned char* s = in + i * word;
            unsigned char* d = out + i * word;
            switch (word) {
            case 2: {
                uint16_t v;
                std::memcpy(&v, s, 2);
                v = __builtin_bswap16(v);
                std::memcpy(d, &v, 2);
                break;
            }
            case 4: {
                uint32_t v;
                std::memcpy(&v, s, 4);
                v = __builtin_bswap32(v);
                std::memcpy(d, &v, 4);
                break;
            }
            case 8: {
                uint64_t v;
                std::memcpy(&v, s, 8);
                v = __builtin_bswap64(v);
                std::memcpy(d, &v, 8);
                break;
            }
            default:
                for (int b = 0; b < word; ++b)
                    d[b] = s[word - 1 - b];
                break;
            }
        }
        return;
    }
    // Widening (3 bytes to 4, 5 to 7 to 8).
    const bool extend = isSigned(type);
    for (size_t i = 0; i < count; ++i) {
        uint64_t value = 0;
        for (int b = 0; b < inBytes; ++b)
            value = (value << 8) | in[i * inBytes + b];
        if (extend && (value >> (8 * inBytes - 1)) != 0)
            value |= ~uint64_t(0) << (8 * inBytes);
        if (outBytes == 4) {
            const uint32_t narrow = static_cast<uint32_t>(value);
            std::memcpy(out + i * 4, &narrow, 4);
        } else {
            std::memcpy(out + i * 8, &value, 8);
        }
    }
}

// The image's bands, band-sequential and native, from the block reader's canonical strips (one strip per
// band kept at a time).
class BandRows : public RowSource {
public:
    BandRows(nitfextract::BandReader& reader, std::vector<int> bands, SampleType type)
        : m_reader(reader), m_bands(std::move(bands)), m_type(type), m_strips(m_bands.size()),
          m_loaded(m_bands.size(), -1) {}

    RasterFormat format() const override {
        RasterFormat f;
        f.width = m_reader.cols();
        f.height = m_reader.rows();
        f.bands = static_cast<int>(m_bands.size());
        f.type = m_type;
        f.bandSequential = true;
        return f;
    }

    void readRows(int level, int first, int count, void* buffer) override {
        if (level != 0)
            throw std::logic_error("the block reader has no reduced resolutions");
        const size_t cols = static_cast<size_t>(m_reader.cols());
        const size_t inRow = cols * m_reader.sampleBytes(), outRow = cols * sampleBytes(m_type);
        const int stripHeight = m_reader.stripRows(0);
        unsigned char* out = static_cast<unsigned char*>(buffer);
        for (size_t b = 0; b < m_bands.size(); ++b) {
            for (int r = first; r < first + count; ++r) {
                const int strip = r / stripHeight;
                if (m_loaded[b] != strip) {
                    m_reader.readStrip(m_bands[b], strip, m_strips[b]);
                    m_loaded[b] = strip;
                }
                const size_t rowInStrip = static_cast<size_t>(r - strip * stripHeight);
                canonicalToNative(m_strips[b].data() + rowInStrip * inRow, m_reader.sampleBytes(),
                                  out + (b * count + (r - first)) * outRow, m_type, cols);
            }
        }
    }

private:
    nitfextract::BandReader& m_reader;
    std::vector<int> m_bands;
    SampleType m_type;
    std::vector<std::vector<unsigned char>> m_strips;
    std::vector<int> m_loaded;
};

// The colour map of band `band` (RGB triplets; a one-table grey LUT repeated into three), or empty.
std::vector<unsigned char> paletteOf(CNitfFile& file, CNitfImageSource& source, int band) {
    for (int i = 0; i < source.getLutCount(); ++i) {
        CNitfLutSource* lut = source.getLutSource(i);
        if (!lut || lut->getBand() != band + 1 || lut->getSize() <= 0)
            continue;
        const int components = lut->getEntrySize();
        if (components != 1 && components != 3)
            return {};
        std::vector<unsigned char> entries(static_cast<size_t>(lut->getSize()));
        lut->readInterleaved(&file, reinterpret_cast<char*>(entries.data()), lut->getSize());
        if (components == 3)
            return entries;
        std::vector<unsigned char> grey;
        for (unsigned char level : entries)
            grey.insert(grey.end(), {level, level, level});
        return grey;
    }
    return {};
}

} // namespace

SampleType sampleTypeOf(CNitfImageSource& source, int canonicalBytes) {
    const int bytes = canonicalBytes <= 1 ? 1 : canonicalBytes <= 2 ? 2 : canonicalBytes <= 4 ? 4 : 8;
    switch (source.getPvtype()) {
    case CNitfImagePropertiesIF::ePVTypeSignedInteger:
        return bytes == 1   ? SampleType::Int8
               : bytes == 2 ? SampleType::Int16
               : bytes == 4 ? SampleType::Int32
                            : SampleType::Int64;
    case CNitfImagePropertiesIF::ePVTypeReal:
        if (canonicalBytes == 4)
            return SampleType::Float32;
        if (canonicalBytes == 8)
            return SampleType::Float64;
        throw std::runtime_error("real samples of " + std::to_string(8 * canonicalBytes) +
                                 " bits have no TIFF form");
    case CNitfImagePropertiesIF::ePVTypeComplex:
        if (canonicalBytes == 8)
            return SampleType::ComplexFloat32;
        if (canonicalBytes == 16)
            return SampleType::ComplexFloat64;
        throw std::runtime_error("complex samples of " + std::to_string(8 * canonicalBytes) +
                                 " bits have no TIFF form");
    default:
        return bytes == 1   ? SampleType::UInt8
               : bytes == 2 ? SampleType::UInt16
               : bytes == 4 ? SampleType::UInt32
                            : SampleType::UInt64;
    }
}

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
                                           nitfextract::BandReader& bands, int band, const std::string& path,
                                           const TiffOptions& options) {
    std::vector<std::string> notes;
    std::vector<int> chosen;
    if (band >= 0) {
        chosen.push_back(band);
    } else {
        for (int b = 0; b < bands.bands(); ++b)
            chosen.push_back(b);
    }
    const SampleType type = sampleTypeOf(source, bands.sampleBytes());
    BandRows rows(bands, chosen, type);

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
