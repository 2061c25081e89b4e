// Writing a Cloud-Optimized GeoTIFF (deflate, 512 x 512 tiles, averaged overviews) of an 8192 x 8192 x 3
// 8-bit uncompressed NITF image in 1024 x 1024 blocks, a whole process each time: nitf extract -f tiff --cog
// against gdal_translate -of COG on the same file, in one run. The counters give the output's size.
#include <benchmark/benchmark.h>

#include <cstdint>
#include <cstdlib>
#include <memory>
#include <string>
#include <sys/stat.h>

#include "NitfSampleWriter.h"
#include "TestFiles.h"

namespace {

const int kSize = 8192;
const int kBands = 3;

// Imagery-like content: broad gradients, a texture of a few grey levels, and the bands correlated.
uint64_t sampleAt(int band, int row, int col) {
    const int broad = (row / 32 + col / 48) % 128;
    const int texture = ((row * 7 + col * 13) ^ (row * col)) % 9;
    return static_cast<uint64_t>(broad + 12 * texture + 20 * band);
}

const std::string& sourcePath() {
    static std::unique_ptr<TempFile> file;
    if (!file) {
        file.reset(new TempFile());
        nitfsample::File nitf;
        nitfsample::Image image;
        image.rows = image.cols = kSize;
        image.nppbh = image.nppbv = 1024;
        image.bands = kBands;
        image.imode = 'B';
        image.icords = 'G';
        image.igeolo = "351200N1173000W351200N1172900W351100N1172900W351100N1173000W";
        image.sample = sampleAt;
        nitf.images = {image};
        nitfsample::write(nitf, file->path());
    }
    return file->path();
}

void runCommand(benchmark::State& state, const std::string& command, const std::string& output) {
    for (auto _ : state) {
        if (std::system(command.c_str()) != 0) {
            state.SkipWithError(("failed: " + command).c_str());
            return;
        }
    }
    struct stat info;
    state.counters["output_MB"] = stat(output.c_str(), &info) == 0 ? info.st_size / 1e6 : 0;
    state.SetBytesProcessed(state.iterations() * static_cast<int64_t>(kSize) * kSize * kBands);
    std::remove(output.c_str());
}

// `threads` 0: the tool's default, one per processor.
void NitfExtractCog(benchmark::State& state, int threads) {
    const std::string output = sourcePath() + ".nitf.tif";
    runCommand(state,
               std::string(NITF_TOOL_PATH) + " extract '" + sourcePath() + "' -f tiff --cog" +
                   (threads ? " --threads " + std::to_string(threads) : std::string()) + " -o '" + output +
                   "'",
               output);
}

// GDAL's default is one thread; "ALL_CPUS" compresses on every processor.
void GdalTranslateCog(benchmark::State& state, const char* threads) {
    if (std::system("command -v gdal_translate >/dev/null 2>&1") != 0) {
        state.SkipWithError("gdal_translate is not installed");
        return;
    }
    const std::string output = sourcePath() + ".gdal.tif";
    runCommand(state,
               "gdal_translate -q -of COG -co COMPRESS=DEFLATE -co NUM_THREADS=" + std::string(threads) +
                   " '" + sourcePath() + "' '" + output + "'",
               output);
}

} // namespace

BENCHMARK_CAPTURE(NitfExtractCog, oneThread, 1)->Unit(benchmark::kMillisecond)->UseRealTime()->Iterations(3);
BENCHMARK_CAPTURE(GdalTranslateCog, oneThread, "1")
    ->Unit(benchmark::kMillisecond)
    ->UseRealTime()
    ->Iterations(3);
BENCHMARK_CAPTURE(NitfExtractCog, allProcessors, 0)
    ->Unit(benchmark::kMillisecond)
    ->UseRealTime()
    ->Iterations(3);
BENCHMARK_CAPTURE(GdalTranslateCog, allProcessors, "ALL_CPUS")
    ->Unit(benchmark::kMillisecond)
    ->UseRealTime()
    ->Iterations(3);
