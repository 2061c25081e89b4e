#include "PictureView.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <cstring>
#include <functional>
#include <limits>
#include <memory>
#include <stdexcept>
#include <string>

#include "BandLut.h"
#include "NitfFileReader.h"
#include "NitfImageSource.h"
#include "NitfImageSubheader.h"
#include "NitfRegionReader.h"
#include "PictureWriter.h"

namespace {

// How the samples of the chosen bands become picture samples.
struct View {
    std::vector<int> bands; // one (grey or through a LUT) or three (RGB)
    enum Kind { Bilevel, Scaled, Stretched, LookUp } kind = Scaled;
    int significantBits = 8;          // Scaled: the samples' range is 0 .. 2^significantBits - 1
    double low = 0, high = 0;         // Stretched: the range found in the data
    std::vector<unsigned char> table; // LookUp: entries interleaved, `tableComponents` bytes each
    int tableComponents = 0;
    bool paletted = false;
    int transparent = -1; // LookUp: the sample value that stands for no data (the pad pixel), shown clear
};

std::string fieldText(CNitfImageSubheader* subheader, const char* name) {
    CNitfProperty* field = FindProperty(subheader->getProperties(), name);
    return field ? field->toText() : std::string();
}

std::string bandField(CNitfImageSubheader* subheader, const char* name, int band, int bands) {
    char* fieldName = CNitfImageSubheader::bandFieldName(name, band + 1, bands);
    std::string text = fieldText(subheader, fieldName);
    free(fieldName);
    return text;
}

// The value of one canonical sample as a number.
double sampleValue(const unsigned char* p, int bytes, CNitfImagePropertiesIF::ePVType_t type) {
    uint64_t raw = 0;
    for (int i = 0; i < bytes; ++i)
        raw = (raw << 8) | p[i];
    switch (type) {
    case CNitfImagePropertiesIF::ePVTypeSignedInteger: {
        const int shift = 64 - 8 * bytes;
        return static_cast<double>(static_cast<int64_t>(raw << shift) >> shift);
    }
    case CNitfImagePropertiesIF::ePVTypeReal:
        if (bytes == 4) {
            float f;
            uint32_t bits = static_cast<uint32_t>(raw);
            std::memcpy(&f, &bits, sizeof f);
            return f;
        }
        if (bytes == 8) {
            double d;
            std::memcpy(&d, &raw, sizeof d);
            return d;
        }
        return static_cast<double>(raw);
    case CNitfImagePropertiesIF::ePVTypeComplex:
        if (bytes == 8) {
            float re, im;
            uint32_t bits = static_cast<uint32_t>(raw >> 32);
            std::memcpy(&re, &bits, sizeof re);
            bits = static_cast<uint32_t>(raw);
            std::memcpy(&im, &bits, sizeof im);
            return std::hypot(re, im);
        }
        return static_cast<double>(raw);
    default:
        return static_cast<double>(raw);
    }
}

// The look-up table of band `band`, entry-interleaved.
bool readLut(CNitfFileReader& reader, CNitfImageSource& source, int band, View& view) {
    nitfpicture::BandLut lut = nitfpicture::readBandLut(reader, source, band);
    view.tableComponents = lut.components;
    view.table = std::move(lut.entries);
    return view.tableComponents > 0;
}

View chooseView(CNitfFileReader& reader, CNitfImageSource& source, const std::vector<int>& chosen) {
    CNitfImageSubheader* subheader = source.getImageSubheader();
    View view;
    const int bandCount = source.getImageProperties().getBandCount();
    if (chosen.size() == 1 || chosen.size() == 3) {
        view.bands = chosen;
    } else if (!chosen.empty()) {
        throw std::runtime_error("a picture shows one band or three (RGB), not " +
                                 std::to_string(chosen.size()));
    } else if (bandCount == 3) {
        // Colour in the order the bands say (IREPBAND R, G, B), else as stored.
        view.bands = {0, 1, 2};
        std::vector<int> order;
        for (const char* colour : {"R", "G", "B"})
            for (int b = 0; b < 3; ++b)
                if (bandField(subheader, "IREPBAND", b, 3) == colour)
                    order.push_back(b);
        if (order.size() == 3)
            view.bands = order;
    } else {
        view.bands = {0};
        if (bandCount > 1)
            std::fprintf(stderr, "nitf extract: showing band 0 of %d (choose another with -b)\n", bandCount);
    }

    const CNitfImagePropertiesIF::ePVType_t type = source.getPvtype();
    const int bits = source.getImageProperties().getBpp();
    const bool unsignedInts =
        type == CNitfImagePropertiesIF::ePVTypeInteger || type == CNitfImagePropertiesIF::ePVTypeBilevel;
    if (view.bands.size() == 1 && unsignedInts && bits <= 16 &&
        readLut(reader, source, view.bands[0], view)) {
        view.kind = View::LookUp;
        if (source.hasPadPixel() && source.getPadPixelValue() >= 0 && source.getPadPixelValue() < 256)
            view.transparent = static_cast<int>(source.getPadPixelValue());
    } else if (bits == 1) {
        view.kind = View::Bilevel;
    } else if (unsignedInts && bits <= 16) {
        view.kind = View::Scaled;
        const int abpp = source.getImageProperties().getActualBpp();
        const bool leftJustified = fieldText(subheader, "PJUST") == "L";
        view.significantBits = abpp > 0 && abpp <= bits && !leftJustified ? abpp : bits;
    } else {
        view.kind = View::Stretched;
    }
    return view;
}

// Converts one strip row of each chosen band into a picture row.
class RowConverter {
public:
    RowConverter(const View& view, const PictureFormat& format, int sampleBytes,
                 CNitfImagePropertiesIF::ePVType_t type)
        : m_view(view), m_format(format), m_sampleBytes(sampleBytes), m_type(type) {}

    void convert(const std::vector<const unsigned char*>& bandRows, unsigned char* out) const {
        const int channels = m_format.channels;
        for (int c = 0; c < m_format.width; ++c) {
            if (m_view.kind == View::LookUp) {
                lookUp(bandRows[0] + static_cast<size_t>(c) * m_sampleBytes,
                       out + static_cast<size_t>(c) * channels);
                continue;
            }
            for (size_t k = 0; k < bandRows.size(); ++k) {
                const double value =
                    sampleValue(bandRows[k] + static_cast<size_t>(c) * m_sampleBytes, m_sampleBytes, m_type);
                put(out, static_cast<size_t>(c) * channels + k, level(value));
            }
        }
    }

private:
    // The picture level (0 .. 2^depth - 1) of a sample value.
    unsigned level(double value) const {
        const double top = m_format.depth == 16 ? 65535.0 : (m_format.depth == 8 ? 255.0 : 1.0);
        double fraction = 0;
        switch (m_view.kind) {
        case View::Bilevel:
            // Bi-level images are delivered with a background of 0: paper white, marks black.
            return value != 0 ? 0 : static_cast<unsigned>(top);
        case View::Scaled:
            fraction = value / (std::ldexp(1.0, m_view.significantBits) - 1);
            break;
        default:
            fraction = m_view.high > m_view.low ? (value - m_view.low) / (m_view.high - m_view.low) : 0;
            break;
        }
        if (!(fraction > 0))
            return 0;
        return fraction >= 1 ? static_cast<unsigned>(top) : static_cast<unsigned>(fraction * top + 0.5);
    }

    void put(unsigned char* out, size_t index, unsigned value) const {
        if (m_format.depth == 16) {
            out[2 * index] = static_cast<unsigned char>(value >> 8);
            out[2 * index + 1] = static_cast<unsigned char>(value);
        } else {
            out[index] = static_cast<unsigned char>(value);
        }
    }

    void lookUp(const unsigned char* sample, unsigned char* out) const {
        const size_t index = static_cast<size_t>(sampleValue(sample, m_sampleBytes, m_type));
        if (m_view.paletted) {
            out[0] = static_cast<unsigned char>(index);
            return;
        }
        const size_t components = static_cast<size_t>(m_view.tableComponents);
        const bool known = (index + 1) * components <= m_view.table.size();
        for (int k = 0; k < m_format.channels; ++k)
            out[k] = known ? m_view.table[index * components + std::min<size_t>(k, components - 1)] : 0;
    }

    const View& m_view;
    const PictureFormat& m_format;
    int m_sampleBytes;
    CNitfImagePropertiesIF::ePVType_t m_type;
};

PictureFormat pictureFormat(View& view, int width, int height, int bits, bool png) {
    PictureFormat format;
    format.width = width;
    format.height = height;
    format.channels = static_cast<int>(view.bands.size());
    switch (view.kind) {
    case View::Bilevel:
        // Black and white: one bit in a PNG, 0 and 255 in a PGM.
        format.depth = png ? 1 : 8;
        break;
    case View::Scaled:
        format.depth = bits <= 8 ? 8 : 16;
        break;
    case View::Stretched:
        format.depth = 16;
        break;
    case View::LookUp: {
        // A colour table of up to 256 entries on samples of up to 8 bits becomes a PNG palette, padded with
        // black so that every sample value names an entry.
        const size_t entries = view.table.size() / view.tableComponents;
        format.depth = 8;
        if (png && view.tableComponents == 3 && bits <= 8 && entries <= 256) {
            view.paletted = true;
            format.palette = view.table;
            format.palette.resize(3 * (size_t(1) << bits), 0);
            // An RPF frame's transparent code (its pad pixel): clear in the picture.
            if (view.transparent >= 0 && view.transparent < (1 << bits))
                format.transparentIndex = view.transparent;
        } else {
            format.channels = view.tableComponents == 3 ? 3 : 1;
        }
        break;
    }
    }
    return format;
}

} // namespace

nitfextract::Outcome writePicture(CNitfFileReader& reader, CNitfImageSource& source,
                                  const nitfextract::Window& requested, const std::vector<int>& bands,
                                  int level, bool png, FILE* out, const nitfextract::Progress& progress) {
    CNitfRegionReader region(&reader, &source);
    region.setBigEndian(true); // the canonical bytes sampleValue reads
    region.setLevel(level);
    const nitfextract::Window window =
        nitfextract::resolveWindow(requested, region.getWidth(), region.getHeight());
    View view = chooseView(reader, source, bands);
    const CNitfImagePropertiesIF::ePVType_t type = source.getPvtype();
    const int bits = source.getImageProperties().getBpp();
    const int sampleBytes = region.getSampleBytes();
    // Strips of whole block rows at full resolution (each block decoded once per pass); reduced levels are
    // read by area.
    const int blockHeight = level > 0 ? 256 : source.getImageProperties().getTileHeight();
    const int channels = static_cast<int>(view.bands.size());

    // Strips of whole block rows: every block is decoded once per pass.
    std::vector<unsigned char> strip;
    nitfextract::Outcome outcome;
    const int passes = view.kind == View::Stretched ? 2 : 1;
    long long done = 0;
    const long long total = passes * static_cast<long long>((window.y + window.height - 1) / blockHeight -
                                                            window.y / blockHeight + 1);
    auto forEachStrip = [&](const std::function<void(int rows)>& use) {
        for (int top = window.y; top < window.y + window.height;) {
            const int rows = std::min(window.y + window.height, (top / blockHeight + 1) * blockHeight) - top;
            strip.resize(region.getBufferSize(window.width, rows, channels));
            const CNitfRegionReader::Result result =
                region.read(window.x, top, window.width, rows, view.bands, strip.data());
            if (result.failedBlocks > 0 && outcome.failedBlocks == 0)
                outcome.firstError = result.firstError;
            outcome.failedBlocks += result.failedBlocks;
            outcome.absentBlocks += result.absentBlocks;
            use(rows);
            if (progress)
                progress(++done, total);
            top += rows;
        }
    };

    if (view.kind == View::Stretched) {
        // A first pass finds the range of the samples.
        view.low = std::numeric_limits<double>::infinity();
        view.high = -view.low;
        forEachStrip([&](int) {
            for (size_t i = 0; i < strip.size(); i += sampleBytes) {
                const double value = sampleValue(&strip[i], sampleBytes, type);
                if (std::isfinite(value)) {
                    view.low = std::min(view.low, value);
                    view.high = std::max(view.high, value);
                }
            }
        });
        outcome = nitfextract::Outcome(); // the second pass meets the same blocks again
    }

    PictureFormat format = pictureFormat(view, window.width, window.height, bits, png);
    std::unique_ptr<PictureWriter> writer = png ? makePngWriter(out, format) : makePnmWriter(out, format);
    RowConverter converter(view, format, sampleBytes, type);
    std::vector<unsigned char> row(static_cast<size_t>(format.width) * format.channels *
                                   (format.depth == 16 ? 2 : 1));
    std::vector<const unsigned char*> bandRows(view.bands.size());
    const size_t stripRow = static_cast<size_t>(window.width) * sampleBytes;
    forEachStrip([&](int rows) {
        const size_t plane = stripRow * rows;
        for (int r = 0; r < rows; ++r) {
            for (size_t k = 0; k < bandRows.size(); ++k)
                bandRows[k] = strip.data() + k * plane + r * stripRow;
            converter.convert(bandRows, row.data());
            writer->row(row.data());
        }
    });
    writer->finish();
    return outcome;
}
