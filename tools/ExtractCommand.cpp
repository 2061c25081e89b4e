// nitf extract: writes an image segment's pixels as raw canonical samples, or as a PNG or PGM/PPM picture for
// looking at.
#include <algorithm>
#include <climits>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <memory>
#include <stdexcept>
#include <string>
#include <thread>
#include <vector>

#include "CommandLine.h"
#include "Commands.h"
#include "HostError.h"
#include "NitfFileReader.h"
#include "NitfImageSource.h"
#include "NitfGeoTiff.h"
#include "OutputFile.h"
#include "PictureView.h"
#include "ProgressBar.h"
#include "RawExtract.h"

namespace {

class UsageError : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

enum { kBands = 1000, kWindow, kLevel, kAllowPartial, kCog, kCompress };

struct Options {
    std::string file;
    std::string output;
    std::string format;
    int image = 0;
    std::vector<int> bands;
    nitfextract::Window window;
    int threads = 0;
    int level = 0;
    bool allowPartial = false;
    bool cog = false;
    std::string compression;
};

int parseNumber(const std::string& text, const char* what) {
    char* end = nullptr;
    const long value = std::strtol(text.c_str(), &end, 10);
    if (text.empty() || *end || value < 0 || value > INT_MAX)
        throw UsageError(std::string("invalid ") + what + " '" + text + "'");
    return static_cast<int>(value);
}

std::vector<int> parseList(const std::string& text, const char* what) {
    std::vector<int> values;
    size_t start = 0;
    while (true) {
        const size_t comma = text.find(',', start);
        values.push_back(parseNumber(text.substr(start, comma - start), what));
        if (comma == std::string::npos)
            return values;
        start = comma + 1;
    }
}

// One option into `options`; throws UsageError for a value it cannot take.
void takeOption(int code, const char* value, Options& options) {
    switch (code) {
    case 'i':
        options.image = parseNumber(value, "image index");
        break;
    case 'b':
        options.bands = {parseNumber(value, "band")};
        break;
    case kBands:
        options.bands = parseList(value, "band list");
        break;
    case kWindow: {
        const std::vector<int> w = parseList(value, "window");
        if (w.size() != 4)
            throw UsageError(std::string("a window is X,Y,WIDTH,HEIGHT, not '") + value + "'");
        options.window = {w[0], w[1], w[2], w[3]};
        if (options.window.width == 0 || options.window.height == 0)
            throw UsageError(std::string("an empty window '") + value + "'");
        break;
    }
    case kLevel:
        options.level = parseNumber(value, "level");
        break;
    case 'f':
        options.format = value;
        break;
    case 'o':
        options.output = value;
        break;
    case 'j':
        options.threads = parseNumber(value, "thread count");
        break;
    case kAllowPartial:
        options.allowPartial = true;
        break;
    case kCog:
        options.cog = true;
        break;
    case kCompress:
        options.compression = value;
        break;
    default:
        throw UsageError("unknown option");
    }
}

void checkOptions(Options& options) {
    if (options.file.empty() || options.output.empty() || options.format.empty())
        throw UsageError("FILE, -f and -o are required");
    if (options.format != "raw" && options.format != "png" && options.format != "pgm" &&
        options.format != "tiff")
        throw UsageError("unknown format '" + options.format + "' (raw, png, pgm or tiff)");
    if ((options.cog || !options.compression.empty()) && options.format != "tiff")
        throw UsageError("--cog and --compress go with -f tiff");
    if (!options.compression.empty() && options.compression != "deflate" && options.compression != "zstd" &&
        options.compression != "none")
        throw UsageError("unknown compression '" + options.compression + "' (deflate, zstd or none)");
    if (options.format == "tiff" && (options.output == "-" || options.window.width > 0 || options.level > 0))
        throw UsageError("a GeoTIFF is of the whole image, at full resolution, into a file");
    if (options.threads == 0)
        options.threads = static_cast<int>(std::max(1u, std::thread::hardware_concurrency()));
}

CNitfImageSource* openImage(CNitfFileReader& reader, int image) {
    if (image >= reader.getImageCount())
        throw std::runtime_error("the file has " + std::to_string(reader.getImageCount()) +
                                 " image segment(s); there is no image " + std::to_string(image));
    return reader.getNewImageSource(image);
}

// The GeoTIFF writer makes the file itself (it lays out a COG in a second pass).
int extractTiff(const Options& options) {
    CNitfFileReader reader;
    if (!reader.open(options.file.c_str()))
        throw std::runtime_error("cannot open the file");
    std::unique_ptr<CNitfImageSource> source(openImage(reader, options.image));
    nitfpicture::TiffOptions tiff;
    tiff.cog = options.cog;
    if (options.compression == "zstd")
        tiff.compression = nitfpicture::Compression::Zstd;
    else if (options.compression == "none")
        tiff.compression = nitfpicture::Compression::None;
    else if (options.compression == "deflate")
        tiff.compression = nitfpicture::Compression::Deflate;
    tiff.threads = options.threads;
    ProgressBar bar("writing");
    tiff.progress = [&](double fraction) { bar.update(static_cast<long long>(fraction * 1000), 1000); };
    for (const std::string& note :
         nitfpicture::writeImageGeoTiff(reader, *source, options.bands, options.output, tiff))
        std::fprintf(stderr, "nitf extract: %s: note: %s\n", options.file.c_str(), note.c_str());
    return 0;
}

int extract(const Options& options) {
    cli::WarningsOnStderr warnings("extract", options.file);
    if (options.format == "tiff")
        return extractTiff(options);
    OutputFile out(options.output);
    ProgressBar bar;
    const nitfextract::Progress progress = [&](long long done, long long total) { bar.update(done, total); };
    nitfextract::Outcome outcome;
    if (options.format == "raw") {
        nitfextract::Request request;
        request.path = options.file;
        request.image = options.image;
        request.window = options.window;
        request.bands = options.bands;
        request.threads = options.threads;
        request.level = options.level;
        std::fflush(out.get());
        outcome = nitfextract::writeRaw(request, out.descriptor(), progress);
    } else {
        CNitfFileReader reader;
        if (!reader.open(options.file.c_str()))
            throw std::runtime_error("cannot open the file");
        std::unique_ptr<CNitfImageSource> source(openImage(reader, options.image));
        outcome = writePicture(reader, *source, options.window, options.bands, options.level,
                               options.format == "png", out.get(), progress);
    }
    if (outcome.failedBlocks > 0) {
        std::fprintf(
            stderr,
            "nitf extract: %s: %d block(s) could not be read whole (zeros stand for what is missing): %s\n",
            options.file.c_str(), outcome.failedBlocks, outcome.firstError.c_str());
        if (!options.allowPartial) {
            std::fprintf(stderr, "nitf extract: %s: keeping %s anyway; --allow-partial accepts this\n",
                         options.file.c_str(), options.output.c_str());
            out.commit();
            return 1;
        }
    }
    out.commit();
    return 0;
}

} // namespace

int runExtract(int argc, char** argv) {
    cli::Options parser(*cli::findCommand("extract"),
                        {{"image", required_argument, nullptr, 'i'},
                         {"band", required_argument, nullptr, 'b'},
                         {"bands", required_argument, nullptr, kBands},
                         {"window", required_argument, nullptr, kWindow},
                         {"level", required_argument, nullptr, kLevel},
                         {"format", required_argument, nullptr, 'f'},
                         {"output", required_argument, nullptr, 'o'},
                         {"threads", required_argument, nullptr, 'j'},
                         {"allow-partial", no_argument, nullptr, kAllowPartial},
                         {"cog", no_argument, nullptr, kCog},
                         {"compress", required_argument, nullptr, kCompress}},
                        "i:b:f:o:j:");
    Options options;
    const int status = parser.parse(argc, argv, [&](int code, const char* value) {
        try {
            takeOption(code, value, options);
            return true;
        } catch (const UsageError& e) {
            std::fprintf(stderr, "nitf extract: %s\n", e.what());
            return false;
        }
    });
    if (status >= 0)
        return status;
    try {
        if (parser.operands().size() > 1)
            throw UsageError("more than one input file");
        if (!parser.operands().empty())
            options.file = parser.operands().front();
        checkOptions(options);
    } catch (const UsageError& e) {
        return parser.usageError(e.what());
    }
    try {
        return extract(options);
    } catch (const std::exception& e) {
        cli::reportError("extract", options.file, e.what());
    }
    return 1;
}
