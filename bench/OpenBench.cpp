// Opening a file and reading every sub-header of a file with 999 image segments and 999 data extensions: the
// "segments" rate gives the time per segment (the aim is 4 us or less), beside gdalinfo on the same file.
#include <benchmark/benchmark.h>

#include <cstdlib>
#include <memory>
#include <string>

#include "NitfDataExtensionSource.h"
#include "NitfFileReader.h"
#include "NitfImageSubheader.h"
#include "NitfSampleWriter.h"
#include "TestFiles.h"

namespace {

const TempFile& manySegmentsFile() {
    static const TempFile file = [] {
        nitfsample::File sample;
        for (int i = 0; i < 999; ++i) {
            nitfsample::Image image;
            image.rows = image.cols = 2;
            image.udid = {{"TESTAA", "0123456789"}};
            sample.images.push_back(image);
            nitfsample::Des des;
            des.desid = "TEST_DES";
            des.data = "x";
            sample.des.push_back(des);
        }
        return TempFile(nitfsample::build(sample));
    }();
    return file;
}

void OpenAndReadEverySubheader(benchmark::State& state) {
    const std::string& path = manySegmentsFile().path();
    for (auto _ : state) {
        CNitfFileReader reader;
        reader.open(path.c_str());
        CNitfFileHeader* header = reader.getFileHeader();
        for (int i = 0; i < reader.getImageCount(); ++i) {
            std::unique_ptr<CNitfImageSubheader> image(
                header->getNewImageSubheader(reader.getInputStream(), i));
            benchmark::DoNotOptimize(image.get());
        }
        for (int i = 0; i < reader.getDataExtensionCount(); ++i) {
            std::unique_ptr<CNitfDataExtensionSource> des(reader.getNewDataExtensionSource(i));
            benchmark::DoNotOptimize(des.get());
        }
    }
    state.counters["segments"] =
        benchmark::Counter(1998.0 * static_cast<double>(state.iterations()), benchmark::Counter::kIsRate);
    // Seconds per segment, shown with an SI prefix ("4u" is the aim).
    state.counters["per_segment"] = benchmark::Counter(1998.0, benchmark::Counter::kIsIterationInvariantRate |
                                                                   benchmark::Counter::kInvert);
}
BENCHMARK(OpenAndReadEverySubheader)->Unit(benchmark::kMillisecond);

// The reference on the same file: gdalinfo as a whole process (start-up included), when it is installed.
void GdalinfoSameFile(benchmark::State& state) {
    if (std::system("command -v gdalinfo >/dev/null 2>&1") != 0) {
        state.SkipWithError("gdalinfo is not installed");
        return;
    }
    const std::string command = "gdalinfo '" + manySegmentsFile().path() + "' >/dev/null 2>&1";
    for (auto _ : state) {
        if (std::system(command.c_str()) != 0) {
            state.SkipWithError("gdalinfo failed");
            return;
        }
    }
    state.counters["segments"] =
        benchmark::Counter(1998.0 * static_cast<double>(state.iterations()), benchmark::Counter::kIsRate);
}
BENCHMARK(GdalinfoSameFile)->Unit(benchmark::kMillisecond)->UseRealTime();

} // namespace
