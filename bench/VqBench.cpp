// VQ decoding of a CADRG frame from the corpus (001zc013.on1, 1536 x 1536 pixels in 36 blocks of 256 x 256):
// - the codec alone, on the frame's codebook and indexes in memory, against copying the same number of pixels
//   with memcpy (the ceiling of any decoder that writes its output once);
// - block by block through the image source, reading the indexes from the file;
// - whole processes: `nitf extract -f raw` of the frame against `gdal_translate -of ENVI` (when installed).
// Pixel rates are in the "pixels" counter (pixels per second).
#include <benchmark/benchmark.h>

#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fcntl.h>
#include <memory>
#include <string>
#include <unistd.h>
#include <vector>

#include "BenchProcess.h"
#include "NitfFileReader.h"
#include "NitfImageSource.h"
#include "TestFiles.h"
#include "VqDecoder.h"

namespace {

const int kFrameSize = 1536;
const int kBlockSize = 256;
const int kBlocks = 36;
// The frame's image data: the 77-byte header, the codebook, then 6,144 index bytes per block.
const long kCodebookOffset = 77;
const long kIndexesOffset = 65613;
const int kIndexBytes = 6144;

std::string framePath() {
    const std::string root = corpusRoot();
    return root.empty() ? std::string() : root + "/rpf/001zc013.on1";
}

// The codec set up with the frame's codebook, and the frame's 36 blocks of indexes, each padded for it.
struct FrameCodes {
    std::unique_ptr<CVqDecoder> decoder;
    std::vector<std::vector<unsigned char>> blocks;
};

bool loadFrameCodes(FrameCodes& codes) {
    const std::string path = framePath();
    CNitfFileReader reader;
    if (path.empty() || !reader.open(path.c_str()))
        return false;
    const long long data = reader.getFileHeader()->getImageHeaderDataPair(0)->getDataOffset();
    const std::string file = readWholeFile(path);
    codes.decoder = std::make_unique<CVqDecoder>(64, 64, 12, 4, 4);
    codes.decoder->setCodebook(reinterpret_cast<const unsigned char*>(file.data() + data + kCodebookOffset));
    for (int block = 0; block < kBlocks; ++block) {
        const char* at = file.data() + data + kIndexesOffset + static_cast<long>(block) * kIndexBytes;
        codes.blocks.emplace_back(at, at + kIndexBytes);
        codes.blocks.back().resize(kIndexBytes + CVqDecoder::kIndexPadding, 0);
    }
    return true;
}

void countPixels(benchmark::State& state) {
    state.counters["pixels"] = benchmark::Counter(
        static_cast<double>(state.iterations()) * kFrameSize * kFrameSize, benchmark::Counter::kIsRate);
    state.SetBytesProcessed(static_cast<int64_t>(state.iterations()) * kFrameSize * kFrameSize);
}

// Each block decoded into its place in the whole frame, as a caller assembling the picture would.
void VqCodecFrame(benchmark::State& state) {
    FrameCodes codes;
    if (!loadFrameCodes(codes)) {
        state.SkipWithError("no test corpus");
        return;
    }
    std::vector<unsigned char> frame(static_cast<size_t>(kFrameSize) * kFrameSize);
    for (auto _ : state) {
        for (int block = 0; block < kBlocks; ++block) {
            unsigned char* at = frame.data() + static_cast<size_t>(block / 6) * kBlockSize * kFrameSize +
                                static_cast<size_t>(block % 6) * kBlockSize;
            codes.decoder->decode(codes.blocks[block].data(), at, kFrameSize);
        }
        benchmark::DoNotOptimize(frame.data());
    }
    countPixels(state);
}

void MemcpyFrame(benchmark::State& state) {
    std::vector<unsigned char> source(static_cast<size_t>(kBlockSize) * kBlockSize, 7);
    std::vector<unsigned char> frame(static_cast<size_t>(kFrameSize) * kFrameSize);
    for (auto _ : state) {
        for (int block = 0; block < kBlocks; ++block) {
            unsigned char* at = frame.data() + static_cast<size_t>(block / 6) * kBlockSize * kFrameSize +
                                static_cast<size_t>(block % 6) * kBlockSize;
            for (int row = 0; row < kBlockSize; ++row)
                std::memcpy(at + static_cast<size_t>(row) * kFrameSize,
                            &source[static_cast<size_t>(row) * kBlockSize], kBlockSize);
        }
        benchmark::DoNotOptimize(frame.data());
    }
    countPixels(state);
}

void VqSourceFrame(benchmark::State& state) {
    const std::string path = framePath();
    CNitfFileReader reader;
    if (path.empty() || !reader.open(path.c_str())) {
        state.SkipWithError("no test corpus");
        return;
    }
    std::unique_ptr<CNitfImageSource> source(reader.getNewImageSource(0));
    std::vector<char> block(static_cast<size_t>(kBlockSize) * kBlockSize);
    for (auto _ : state) {
        for (int y = 0; y < 6; ++y)
            for (int x = 0; x < 6; ++x)
                source->readTileNonInterleaved(&reader, block.data(), kBlockSize, x, y, 0);
        benchmark::DoNotOptimize(block.data());
    }
    countPixels(state);
}

void wholeProcess(benchmark::State& state, const std::vector<std::string>& command,
                  const std::string& output) {
    if (framePath().empty()) {
        state.SkipWithError("no test corpus");
        return;
    }
    if (runQuietly(command) != 0) {
        state.SkipWithError(("cannot run " + command[0]).c_str());
        return;
    }
    for (auto _ : state) {
        if (runQuietly(command) != 0)
            state.SkipWithError(("failed: " + command[0]).c_str());
    }
    std::remove(output.c_str());
    // GDAL's ENVI header replaces the extension.
    std::remove((output.substr(0, output.rfind('.')) + ".hdr").c_str());
    std::remove((output + ".aux.xml").c_str());
    countPixels(state);
}

std::string scratch(const char* name) {
    const char* dir = std::getenv("TMPDIR");
    return std::string(dir && *dir ? dir : "/tmp") + "/nitf-vqbench-" + std::to_string(getpid()) + name;
}

void ExtractProcess(benchmark::State& state) {
    const std::string out = scratch(".raw");
    // One thread, as GDAL decodes.
    wholeProcess(state, {NITF_TOOL_PATH, "extract", framePath(), "-f", "raw", "-j", "1", "-o", out}, out);
}

void GdalTranslateProcess(benchmark::State& state) {
    const std::string out = scratch(".envi");
    wholeProcess(state, {"gdal_translate", "-q", "-of", "ENVI", framePath(), out}, out);
}

BENCHMARK(VqCodecFrame)->Unit(benchmark::kMicrosecond);
BENCHMARK(MemcpyFrame)->Unit(benchmark::kMicrosecond);
BENCHMARK(VqSourceFrame)->Unit(benchmark::kMicrosecond);
BENCHMARK(ExtractProcess)->Unit(benchmark::kMillisecond)->UseRealTime();
BENCHMARK(GdalTranslateProcess)->Unit(benchmark::kMillisecond)->UseRealTime();

} // namespace
