// nitf extract: writes an image segment's pixels as raw canonical samples, as a PNG or PGM/PPM picture for
// looking at, or as a (Cloud-Optimized) GeoTIFF.
#include <algorithm>
#include <chrono>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <limits>
#include <memory>
#include <stdexcept>
#include <string>
#include <vector>

#include <png.h>
#include <unistd.h>

#include "Commands.h"
#include "HostError.h"
#include "ImageExtract.h"
#include "NitfFileReader.h"
#include "NitfImageSource.h"
#include "NitfImageSubheader.h"
#include "NitfLutSource.h"
#include "NitfGeoTiff.h"

namespace {

using nitfextract::BandReader;

struct Options {
    std::string file;
    std::string output;
    std::string format;
    int image = 0;
    int band = -1;
    bool cog = false;
    std::string compression;
    int threads = 0;
};

class UsageError : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

int parseIndex(const char* text, const char* what) {
    char* end = nullptr;
    long value = std::strtol(text, &end, 10);
    if (!*text || *end || value < 0 || value > std::numeric_limits<int>::max())
        throw UsageError(std::string("invalid ") + what + " '" + text + "'");
    return static_cast<int>(value);
}

Options parseOptions(int argc, char** argv) {
    Options options;
    for (int i = 0; i < argc; ++i) {
        std::string arg = argv[i];
        auto value = [&]() -> const char* {
            if (i + 1 >= argc)
                throw UsageError("option " + arg + " needs a value");
            return argv[++i];
        };
        if (arg == "-i")
            options.image = parseIndex(value(), "image index");
        else if (arg == "-b")
            options.band = parseIndex(value(), "band");
        else if (arg == "-f")
            options.format = value();
        else if (arg == "-o")
            options.output = value();
        else if (arg == "--cog")
            options.cog = true;
        else if (arg == "--compress")
            options.compression = value();
        else if (arg == "--threads")
            options.threads = parseIndex(value(), "thread count");
        else if (!arg.empty() && arg[0] == '-')
            throw UsageError("unknown option " + arg);
        else if (options.file.empty())
            options.file = arg;
        else
            throw UsageError("more than one input file");
    }
    if (options.file.empty() || options.output.empty() || options.format.empty())
        throw UsageError("FILE, -f and -o are required");
    if (options.format != "raw" && options.format != "png" && options.format != "pgm" &&
        options.format != "tiff")
        throw UsageError("unknown format '" + options.format + "' (raw, png, pgm or tiff)");
    if ((options.cog || !options.compression.empty() || options.threads > 0) && options.format != "tiff")
        throw UsageError("--cog, --compress and --threads go with -f tiff");
    if (!options.compression.empty() && options.compression != "deflate" && options.compression != "zstd" &&
        options.compression != "none")
        throw UsageError("unknown compression '" + options.compression + "' (deflate, zstd or none)");
    if (options.format == "tiff" && options.output == "-")
        throw UsageError("a GeoTIFF is written to a file, not to standard output");
    return options;
}

// A progress bar on stderr, shown only on a terminal and only once the work has taken more than a moment.
class ProgressBar {
public:
    ProgressBar() : m_enabled(isatty(STDERR_FILENO) != 0), m_start(std::chrono::steady_clock::now()) {}
    ~ProgressBar() {
        if (m_shown)
            std::fprintf(stderr, "\r%*s\r", kWidth + 16, "");
    }
    ProgressBar(const ProgressBar&) = delete;
    ProgressBar& operator=(const ProgressBar&) = delete;

    void update(long long done, long long total) {
        if (!m_enabled || total <= 0)
            return;
        const auto elapsed = std::chrono::steady_clock::now() - m_start;
        if (!m_shown && elapsed < std::chrono::milliseconds(500))
            return;
        const int percent = static_cast<int>(100 * done / total);
        if (m_shown && percent == m_percent)
            return;
        m_shown = true;
        m_percent = percent;
        const int filled = static_cast<int>(static_cast<long long>(kWidth) * done / total);
        std::fprintf(stderr, "\rextracting [%s%s] %3d%%", std::string(filled, '#').c_str(),
                     std::string(kWidth - filled, ' ').c_str(), percent);
        std::fflush(stderr);
    }

private:
    static constexpr int kWidth = 40;
    bool m_enabled;
    bool m_shown = false;
    int m_percent = -1;
    std::chrono::steady_clock::time_point m_start;
};

// The output file; removed again unless the extraction completes.
class OutputFile {
public:
    explicit OutputFile(const std::string& path) : m_path(path) {
        m_fp = path == "-" ? stdout : std::fopen(path.c_str(), "wb");
        if (!m_fp)
            throw std::runtime_error("cannot create " + path);
    }
    ~OutputFile() {
        if (m_fp == stdout)
            return;
        std::fclose(m_fp);
        if (!m_committed)
            std::remove(m_path.c_str());
    }
    OutputFile(const OutputFile&) = delete;
    OutputFile& operator=(const OutputFile&) = delete;

    FILE* get() const { return m_fp; }
    void write(const void* data, size_t size) {
        if (size > 0 && std::fwrite(data, 1, size, m_fp) != size)
            throw std::runtime_error("cannot write " + m_path);
    }
    void commit() {
        if (std::fflush(m_fp) != 0)
            throw std::runtime_error("cannot write " + m_path);
        m_committed = true;
    }

private:
    std::string m_path;
    FILE* m_fp;
    bool m_committed = false;
};

// ---- pictures ---------------------------------------------------------------------------------------------

// Rows of a picture: `channels` samples of `depth` bits per pixel (16-bit samples big-endian, 1-bit samples
// one byte 0/1 each), optionally a palette of RGB triplets.
struct PictureFormat {
    int width = 0, height = 0, channels = 1, depth = 8;
    std::vector<unsigned char> palette;
};

class PictureWriter {
public:
    virtual ~PictureWriter() {}
    virtual void row(const unsigned char* samples) = 0;
    virtual void finish() = 0;
};

class PngWriter : public PictureWriter {
public:
    PngWriter(OutputFile& out, const PictureFormat& format) {
        m_png = png_create_write_struct(PNG_LIBPNG_VER_STRING, nullptr, onError, nullptr);
        m_info = m_png ? png_create_info_struct(m_png) : nullptr;
        if (!m_info)
            throw std::runtime_error("cannot start a PNG file");
        const bool paletted = !format.palette.empty();
        const int type = paletted ? PNG_COLOR_TYPE_PALETTE
                                  : (format.channels == 3 ? PNG_COLOR_TYPE_RGB : PNG_COLOR_TYPE_GRAY);
        std::vector<png_color> colours(format.palette.size() / 3);
        for (size_t i = 0; i < colours.size(); ++i)
            colours[i] = {format.palette[3 * i], format.palette[3 * i + 1], format.palette[3 * i + 2]};
        guard([&] {
            png_init_io(m_png, out.get());
            png_set_IHDR(m_png, m_info, format.width, format.height, format.depth, type, PNG_INTERLACE_NONE,
                         PNG_COMPRESSION_TYPE_DEFAULT, PNG_FILTER_TYPE_DEFAULT);
            if (paletted)
                png_set_PLTE(m_png, m_info, colours.data(), static_cast<int>(colours.size()));
            png_write_info(m_png, m_info);
            if (format.depth < 8)
                png_set_packing(m_png);
        });
    }
    ~PngWriter() override { png_destroy_write_struct(&m_png, &m_info); }

    void row(const unsigned char* samples) override {
        guard([&] { png_write_row(m_png, const_cast<unsigned char*>(samples)); });
    }
    void finish() override {
        guard([&] { png_write_end(m_png, m_info); });
    }

private:
    // libpng reports errors by longjmp; they are turned into exceptions at this one place. The bodies hold no
    // objects that need destroying.
    template <typename Body> void guard(Body body) {
        if (setjmp(png_jmpbuf(m_png)))
            throw std::runtime_error("PNG: " + m_error);
        body();
    }
    static void onError(png_structp png, png_const_charp message) {
        m_error = message ? message : "error";
        png_longjmp(png, 1);
    }

    static std::string m_error;
    png_structp m_png = nullptr;
    png_infop m_info = nullptr;
};
std::string PngWriter::m_error;

// Netpbm: P5 (grey) or P6 (colour), 8 or 16 bits.
class PnmWriter : public PictureWriter {
public:
    PnmWriter(OutputFile& out, const PictureFormat& format) : m_out(out) {
        const int maxValue = format.depth == 16 ? 65535 : 255;
        std::string header = std::string(format.channels == 3 ? "P6" : "P5") + "\n" +
                             std::to_string(format.width) + " " + std::to_string(format.height) + "\n" +
                             std::to_string(maxValue) + "\n";
        m_out.write(header.data(), header.size());
        m_rowBytes = static_cast<size_t>(format.width) * format.channels * (format.depth == 16 ? 2 : 1);
    }
    void row(const unsigned char* samples) override { m_out.write(samples, m_rowBytes); }
    void finish() override {}

private:
    OutputFile& m_out;
    size_t m_rowBytes;
};

// ---- turning samples into picture values ------------------------------------------------------------------

// How the samples of the chosen bands become picture samples.
struct View {
    std::vector<int> bands; // one (grey or through a LUT) or three (RGB)
    enum Kind { Bilevel, Scaled, Stretched, LookUp } kind = Scaled;
    int significantBits = 8;          // Scaled: the samples' range is 0 .. 2^significantBits - 1
    double low = 0, high = 0;         // Stretched: the range found in the data
    std::vector<unsigned char> table; // LookUp: entries interleaved, `tableComponents` bytes each
    int tableComponents = 0;
    bool paletted = false;
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
    for (int i = 0; i < source.getLutCount(); ++i) {
        CNitfLutSource* lut = source.getLutSource(i);
        if (!lut || lut->getBand() != band + 1 || lut->getSize() <= 0)
            continue;
        view.tableComponents = lut->getEntrySize();
        view.table.assign(static_cast<size_t>(lut->getSize()), 0);
        lut->readInterleaved(&reader, reinterpret_cast<char*>(view.table.data()), lut->getSize());
        return true;
    }
    return false;
}

View chooseView(CNitfFileReader& reader, CNitfImageSource& source, const BandReader& bands, int band) {
    CNitfImageSubheader* subheader = source.getImageSubheader();
    View view;
    if (band >= 0) {
        view.bands = {band};
    } else if (bands.bands() == 3) {
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
        if (bands.bands() > 1)
            std::fprintf(stderr, "nitf extract: showing band 0 of %d (choose another with -b)\n",
                         bands.bands());
    }

    const CNitfImagePropertiesIF::ePVType_t type = source.getPvtype();
    const int bits = bands.bits();
    const bool unsignedInts =
        type == CNitfImagePropertiesIF::ePVTypeInteger || type == CNitfImagePropertiesIF::ePVTypeBilevel;
    if (view.bands.size() == 1 && unsignedInts && bits <= 16 &&
        readLut(reader, source, view.bands[0], view)) {
        view.kind = View::LookUp;
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
            return value != 0 ? 1 : 0;
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

PictureFormat pictureFormat(View& view, const BandReader& bands, bool png) {
    PictureFormat format;
    format.width = bands.cols();
    format.height = bands.rows();
    format.channels = static_cast<int>(view.bands.size());
    switch (view.kind) {
    case View::Bilevel:
        // Black and white: one bit in a PNG, 0 and 255 in a PGM.
        format.depth = png ? 1 : 8;
        if (!png) {
            view.kind = View::Scaled;
            view.significantBits = 1;
        }
        break;
    case View::Scaled:
        format.depth = bands.bits() <= 8 ? 8 : 16;
        break;
    case View::Stretched:
        format.depth = 16;
        break;
    case View::LookUp: {
        // A colour table of up to 256 entries on samples of up to 8 bits becomes a PNG palette, padded with
        // black so that every sample value names an entry.
        const size_t entries = view.table.size() / view.tableComponents;
        format.depth = 8;
        if (png && view.tableComponents == 3 && bands.bits() <= 8 && entries <= 256) {
            view.paletted = true;
            format.palette = view.table;
            format.palette.resize(3 * (size_t(1) << bands.bits()), 0);
        } else {
            format.channels = view.tableComponents == 3 ? 3 : 1;
        }
        break;
    }
    }
    return format;
}

// ---- the command ------------------------------------------------------------------------------------------

void extractTiff(CNitfFileReader& reader, CNitfImageSource& source, BandReader& bands,
                 const Options& options) {
    nitfpicture::TiffOptions tiff;
    tiff.cog = options.cog;
    if (options.compression == "deflate")
        tiff.compression = nitfpicture::Compression::Deflate;
    else if (options.compression == "zstd")
        tiff.compression = nitfpicture::Compression::Zstd;
    else if (options.compression == "none")
        tiff.compression = nitfpicture::Compression::None;
    tiff.threads = options.threads;
    ProgressBar bar;
    tiff.progress = [&](double fraction) { bar.update(static_cast<long long>(fraction * 1000), 1000); };
    for (const std::string& note :
         nitfpicture::writeImageGeoTiff(reader, source, bands, options.band, options.output, tiff))
        std::fprintf(stderr, "nitf extract: note: %s\n", note.c_str());
}

void extractRaw(BandReader& bands, const Options& options, OutputFile& out) {
    ProgressBar bar;
    nitfextract::writeCanonical(
        bands, options.band, [&](const unsigned char* data, size_t size) { out.write(data, size); },
        [&](long long done, long long total) { bar.update(done, total); });
}

void extractPicture(CNitfFileReader& reader, CNitfImageSource& source, BandReader& bands,
                    const Options& options, OutputFile& out) {
    View view = chooseView(reader, source, bands, options.band);
    const bool png = options.format == "png";
    const CNitfImagePropertiesIF::ePVType_t type = source.getPvtype();
    std::vector<std::vector<unsigned char>> strips(view.bands.size());
    ProgressBar bar;
    const long long passes = view.kind == View::Stretched ? 2 : 1;
    const long long total = passes * bands.strips() * static_cast<long long>(view.bands.size());
    long long done = 0;
    auto readStrips = [&](int strip) {
        for (size_t k = 0; k < view.bands.size(); ++k) {
            bands.readStrip(view.bands[k], strip, strips[k]);
            bar.update(++done, total);
        }
    };

    if (view.kind == View::Stretched) {
        // A first pass finds the range of the samples.
        view.low = std::numeric_limits<double>::infinity();
        view.high = -view.low;
        for (int s = 0; s < bands.strips(); ++s) {
            readStrips(s);
            for (const auto& strip : strips)
                for (size_t i = 0; i < strip.size(); i += bands.sampleBytes()) {
                    const double value = sampleValue(&strip[i], bands.sampleBytes(), type);
                    if (std::isfinite(value)) {
                        view.low = std::min(view.low, value);
                        view.high = std::max(view.high, value);
                    }
                }
        }
    }

    PictureFormat format = pictureFormat(view, bands, png);
    std::unique_ptr<PictureWriter> writer;
    if (png)
        writer.reset(new PngWriter(out, format));
    else
        writer.reset(new PnmWriter(out, format));
    RowConverter converter(view, format, bands.sampleBytes(), type);
    std::vector<unsigned char> row(static_cast<size_t>(format.width) * format.channels *
                                   (format.depth == 16 ? 2 : 1));
    std::vector<const unsigned char*> bandRows(view.bands.size());
    const size_t stripRow = static_cast<size_t>(bands.cols()) * bands.sampleBytes();
    for (int s = 0; s < bands.strips(); ++s) {
        readStrips(s);
        for (int r = 0; r < bands.stripRows(s); ++r) {
            for (size_t k = 0; k < strips.size(); ++k)
                bandRows[k] = strips[k].data() + r * stripRow;
            converter.convert(bandRows, row.data());
            writer->row(row.data());
        }
    }
    writer->finish();
}

void reportFailedBlocks(const BandReader& bands) {
    if (bands.failedBlocks() > 0)
        std::fprintf(stderr,
                     "nitf extract: warning: %d block(s) could not be read and are written as zeros\n",
                     bands.failedBlocks());
}

} // namespace

int runExtract(int argc, char** argv) {
    Options options;
    try {
        options = parseOptions(argc, argv);
    } catch (const UsageError& e) {
        std::fprintf(stderr,
                     "nitf extract: %s\n"
                     "usage: nitf extract FILE [-i IMAGE] [-b BAND] -f raw|png|pgm|tiff [--cog]\n"
                     "                    [--compress deflate|zstd|none] [--threads N] -o OUT\n",
                     e.what());
        return 2;
    }
    try {
        CNitfFileReader reader;
        if (!reader.open(options.file.c_str()))
            throw std::runtime_error("cannot open " + options.file);
        if (options.image >= reader.getImageCount())
            throw std::runtime_error("the file has " + std::to_string(reader.getImageCount()) +
                                     " image segment(s); there is no image " + std::to_string(options.image));
        std::unique_ptr<CNitfImageSource> source(reader.getNewImageSource(options.image));
        BandReader bands(reader, *source);
        if (options.band >= bands.bands())
            throw std::runtime_error("the image has " + std::to_string(bands.bands()) +
                                     " band(s); there is no band " + std::to_string(options.band));
        if (options.format == "tiff") {
            extractTiff(reader, *source, bands, options);
            reportFailedBlocks(bands);
            return 0;
        }
        OutputFile out(options.output);
        if (options.format == "raw")
            extractRaw(bands, options, out);
        else
            extractPicture(reader, *source, bands, options, out);
        out.commit();
        reportFailedBlocks(bands);
        return 0;
    } catch (const vexo::Exception& e) {
        std::fprintf(stderr, "nitf extract: %s\n", e.what());
    } catch (const std::exception& e) {
        std::fprintf(stderr, "nitf extract: %s\n", e.what());
    }
    return 1;
}
