// JPEG 2000 decoding through the library against the same codestream decoded by OpenJPEG alone (in process,
// the way its command-line decoder reads a file), by OpenJPEG's command-line decoder, and by GDAL; then a
// window of a tiled image against the whole image, and a reduced-resolution read against full resolution.
// The images (4096 x 4096 RGB, lossy at about 2.4 bits per pixel, five levels, one tiled in 1024 x 1024 tiles
// and one untiled) are made once and kept in the cache directory.
#include <benchmark/benchmark.h>

#include <cstdio>
#include <cstdlib>
#include <memory>
#include <stdexcept>
#include <string>
#include <sys/resource.h>
#include <sys/stat.h>
#include <vector>

#include <openjpeg.h>

#include "J2kStreams.h"
#include "NitfFileReader.h"
#include "NitfImageSourceJpeg2000.h"
#include "NitfSampleWriter.h"
#include "TestFiles.h"

namespace {

const int kSize = 4096;
const int kTile = 1024;

struct BenchFile {
    std::string nitf;       // the NITF file
    std::string codestream; // the same codestream on its own
};

std::string cacheDirectory() {
    const char* cache = std::getenv("NITF_CACHE_DIR");
    const char* home = std::getenv("HOME");
    std::string dir = cache && *cache ? cache : std::string(home ? home : "/tmp") + "/.cache/nitf";
    dir += "/bench-j2k";
    std::system(("mkdir -p " + dir).c_str());
    return dir;
}

bool exists(const std::string& path) {
    struct stat s;
    return stat(path.c_str(), &s) == 0 && s.st_size > 0;
}

BenchFile makeFile(bool tiled) {
    const std::string stem = cacheDirectory() + (tiled ? "/tiled-" : "/untiled-") + std::to_string(kSize);
    BenchFile file{stem + ".ntf", stem + ".j2k"};
    if (exists(file.nitf) && exists(file.codestream))
        return file;
    j2ktest::Coding coding;
    coding.width = coding.height = kSize;
    coding.components = 3;
    coding.lossless = false;
    coding.ratio = 10;
    coding.mct = true;
    if (tiled)
        coding.tileWidth = coding.tileHeight = kTile;
    const std::string codestream = j2ktest::encode(coding, j2ktest::pattern(coding));
    std::FILE* out = std::fopen(file.codestream.c_str(), "wb");
    std::fwrite(codestream.data(), 1, codestream.size(), out);
    std::fclose(out);
    nitfsample::Image image;
    image.ic = "C8";
    image.comrat = "0240";
    image.rows = image.cols = kSize;
    image.bands = 3;
    image.irep = "RGB";
    image.nppbh = image.nppbv = tiled ? kTile : 0;
    image.blockData = {codestream};
    nitfsample::File nitf;
    nitf.images = {image};
    nitfsample::write(nitf, file.nitf);
    return file;
}

const BenchFile& tiledFile() {
    static const BenchFile file = makeFile(true);
    return file;
}
const BenchFile& untiledFile() {
    static const BenchFile file = makeFile(false);
    return file;
}

void countPixels(benchmark::State& state, long long pixels) {
    state.SetItemsProcessed(static_cast<int64_t>(state.iterations()) * pixels);
    state.SetLabel("items = pixels");
}

struct OpenSource {
    explicit OpenSource(const std::string& path) {
        if (!reader.open(path.c_str()))
            throw std::runtime_error("cannot open " + path);
        source.reset(dynamic_cast<CNitfImageSourceJpeg2000*>(reader.getNewImageSource(0)));
    }
    CNitfFileReader reader;
    std::unique_ptr<CNitfImageSourceJpeg2000> source;
};

// Every block, all bands interleaved, into one block buffer.
void libraryWhole(benchmark::State& state, const BenchFile& file) {
    OpenSource open(file.nitf);
    const CNitfImagePropertiesIF& p = open.source->getImageProperties();
    std::vector<char> block(static_cast<size_t>(p.getTileReadBufferSize()));
    for (auto _ : state)
        for (int y = 0; y < p.getTileCountY(); ++y)
            for (int x = 0; x < p.getTileCountX(); ++x) {
                open.source->readTileInterleaved(&open.reader, block.data(), x, y);
                benchmark::DoNotOptimize(block.data());
            }
    countPixels(state, 1LL * kSize * kSize);
}

// OpenJPEG alone, the way its command-line decoder reads a file (without writing one).
void openJpegWhole(benchmark::State& state, const BenchFile& file) {
    for (auto _ : state) {
        opj_stream_t* stream = opj_stream_create_default_file_stream(file.codestream.c_str(), OPJ_TRUE);
        opj_codec_t* codec = opj_create_decompress(OPJ_CODEC_J2K);
        opj_dparameters_t parameters;
        opj_set_default_decoder_parameters(&parameters);
        opj_image_t* image = nullptr;
        if (!opj_setup_decoder(codec, &parameters) || !opj_read_header(stream, codec, &image) ||
            !opj_decode(codec, stream, image) || !opj_end_decompress(codec, stream))
            state.SkipWithError("OpenJPEG failed");
        benchmark::DoNotOptimize(image);
        opj_image_destroy(image);
        opj_destroy_codec(codec);
        opj_stream_destroy(stream);
    }
    countPixels(state, 1LL * kSize * kSize);
}

double childCpuMilliseconds() {
    rusage usage;
    getrusage(RUSAGE_CHILDREN, &usage);
    return (usage.ru_utime.tv_sec + usage.ru_stime.tv_sec) * 1e3 +
           (usage.ru_utime.tv_usec + usage.ru_stime.tv_usec) / 1e3;
}

// A command, timed whole (`environment` set before it, e.g. "NAME=value "); skipped when the tool is missing.
void command(benchmark::State& state, const std::string& tool, const std::string& arguments,
             const std::string& environment = std::string()) {
    if (std::system(("command -v " + tool + " > /dev/null 2>&1").c_str()) != 0) {
        state.SkipWithError((tool + " is not installed").c_str());
        return;
    }
    const std::string line = environment + tool + " " + arguments + " > /dev/null 2>&1";
    const double before = childCpuMilliseconds();
    for (auto _ : state)
        if (std::system(line.c_str()) != 0)
            state.SkipWithError(("failed: " + line).c_str());
    // The machine may be shared: the tool's own processor time compares with the CPU column of the others.
    state.counters["tool_cpu_ms"] =
        (childCpuMilliseconds() - before) / static_cast<double>(state.iterations());
    countPixels(state, 1LL * kSize * kSize);
}

// Outputs go to memory, so that writing them costs the tools little.
std::string scratch(const char* name) {
    return std::string(exists("/dev/shm") ? "/dev/shm" : "/tmp") + "/nitf-j2kbench-" + name;
}

void opjDecompress(benchmark::State& state, const BenchFile& file) {
    command(state, "opj_decompress", "-i " + file.codestream + " -o " + scratch("out.raw"));
    std::remove(scratch("out.raw").c_str());
}

void gdalTranslate(benchmark::State& state, const BenchFile& file) {
    // One thread, as the library and OpenJPEG's tool decode.
    command(state, "gdal_translate", "-q -of ENVI " + file.nitf + " " + scratch("out.envi"),
            "GDAL_NUM_THREADS=1 ");
    std::remove(scratch("out.envi").c_str());
    std::remove(scratch("out.hdr").c_str());
    std::remove((scratch("out.envi") + ".aux.xml").c_str());
}

// A region of every band at `level`.
void libraryRegion(benchmark::State& state, const BenchFile& file, int level, int x, int y, int width,
                   int height) {
    OpenSource open(file.nitf);
    if (width == 0) {
        width = open.source->getLevelWidth(level);
        height = open.source->getLevelHeight(level);
    }
    std::vector<char> pixels(static_cast<size_t>(width) * height * 3);
    const long long before = open.source->getTileDecodeCount();
    for (auto _ : state) {
        open.source->readRegion(&open.reader, level, x, y, width, height, 0, 3, pixels.data(), width * 3);
        benchmark::DoNotOptimize(pixels.data());
    }
    state.counters["tiles"] = static_cast<double>(open.source->getTileDecodeCount() - before) /
                              static_cast<double>(state.iterations());
    countPixels(state, 1LL * width * height);
}

void TiledWholeLibrary(benchmark::State& state) {
    libraryWhole(state, tiledFile());
}
void TiledWholeOpenJpeg(benchmark::State& state) {
    openJpegWhole(state, tiledFile());
}
void TiledWholeOpjDecompress(benchmark::State& state) {
    opjDecompress(state, tiledFile());
}
void TiledWholeGdal(benchmark::State& state) {
    gdalTranslate(state, tiledFile());
}
void UntiledWholeLibrary(benchmark::State& state) {
    libraryWhole(state, untiledFile());
}
void UntiledWholeOpenJpeg(benchmark::State& state) {
    openJpegWhole(state, untiledFile());
}
void UntiledWholeOpjDecompress(benchmark::State& state) {
    opjDecompress(state, untiledFile());
}
void UntiledWholeGdal(benchmark::State& state) {
    gdalTranslate(state, untiledFile());
}
// A 512 x 512 window inside one tile, and one across the corner of four.
void TiledWindowOneTile(benchmark::State& state) {
    libraryRegion(state, tiledFile(), 0, kTile + 256, kTile + 256, 512, 512);
}
void TiledWindowFourTiles(benchmark::State& state) {
    libraryRegion(state, tiledFile(), 0, 2 * kTile - 256, 2 * kTile - 256, 512, 512);
}
void TiledRegionWhole(benchmark::State& state) {
    libraryRegion(state, tiledFile(), 0, 0, 0, 0, 0);
}
void UntiledWindow(benchmark::State& state) {
    libraryRegion(state, untiledFile(), 0, kSize / 2 - 256, kSize / 2 - 256, 512, 512);
}
void UntiledRegionWhole(benchmark::State& state) {
    libraryRegion(state, untiledFile(), 0, 0, 0, 0, 0);
}
void UntiledLevel2Whole(benchmark::State& state) {
    libraryRegion(state, untiledFile(), 2, 0, 0, 0, 0);
}
void TiledLevel2Whole(benchmark::State& state) {
    libraryRegion(state, tiledFile(), 2, 0, 0, 0, 0);
}

BENCHMARK(TiledWholeLibrary)->Unit(benchmark::kMillisecond)->Iterations(3);
BENCHMARK(TiledWholeOpenJpeg)->Unit(benchmark::kMillisecond)->Iterations(3);
BENCHMARK(TiledWholeOpjDecompress)->Unit(benchmark::kMillisecond)->Iterations(3);
BENCHMARK(TiledWholeGdal)->Unit(benchmark::kMillisecond)->Iterations(3);
BENCHMARK(UntiledWholeLibrary)->Unit(benchmark::kMillisecond)->Iterations(3);
BENCHMARK(UntiledWholeOpenJpeg)->Unit(benchmark::kMillisecond)->Iterations(3);
BENCHMARK(UntiledWholeOpjDecompress)->Unit(benchmark::kMillisecond)->Iterations(3);
BENCHMARK(UntiledWholeGdal)->Unit(benchmark::kMillisecond)->Iterations(3);
BENCHMARK(TiledWindowOneTile)->Unit(benchmark::kMillisecond);
BENCHMARK(TiledWindowFourTiles)->Unit(benchmark::kMillisecond);
BENCHMARK(TiledRegionWhole)->Unit(benchmark::kMillisecond)->Iterations(3);
BENCHMARK(UntiledWindow)->Unit(benchmark::kMillisecond);
BENCHMARK(UntiledRegionWhole)->Unit(benchmark::kMillisecond)->Iterations(3);
BENCHMARK(UntiledLevel2Whole)->Unit(benchmark::kMillisecond);
BENCHMARK(TiledLevel2Whole)->Unit(benchmark::kMillisecond);

} // namespace
