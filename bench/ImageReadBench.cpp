// Reading every block band of an 8192 x 8192 x 3 uncompressed 8-bit image (IMODE B, P and S, in 1024 x 1024
// and in 512 x 512 blocks) through readTileNonInterleaved, against plainly read()ing the same file, both from
// a warm page cache. The last lines give the library's throughput as a share of the plain read's.
#include <benchmark/benchmark.h>

#include <cstdio>
#include <fcntl.h>
#include <map>
#include <memory>
#include <stdexcept>
#include <string>
#include <unistd.h>
#include <vector>

#include "NitfFileReader.h"
#include "NitfImageSource.h"
#include "NitfSampleWriter.h"
#include "TestFiles.h"

namespace {

const int kSize = 8192;
const int kBands = 3;

// One generated image file at a time: asking for another layout replaces it.
class ImageFile {
public:
    static const std::string& path(char imode, int blockSize) {
        static ImageFile current;
        if (current.m_imode != imode || current.m_blockSize != blockSize) {
            current.m_file.reset(); // delete the previous file before writing the next
            current.m_file.reset(new TempFile());
            nitfsample::File file;
            nitfsample::Image image;
            image.rows = image.cols = kSize;
            image.nppbh = image.nppbv = blockSize;
            image.bands = kBands;
            image.imode = imode;
            image.sample = [](int band, int row, int col) {
                return static_cast<uint64_t>(row + 3 * col + 85 * band);
            };
            file.images = {image};
            nitfsample::write(file, current.m_file->path());
            current.m_imode = imode;
            current.m_blockSize = blockSize;
            warm(current.m_file->path());
        }
        return current.m_file->path();
    }

    // Reads the whole file with read(); returns the byte count.
    static long long readPlainly(const std::string& path, std::vector<char>& buffer) {
        int fd = open(path.c_str(), O_RDONLY);
        if (fd < 0)
            throw std::runtime_error("cannot open " + path);
        long long total = 0;
        for (ssize_t got; (got = read(fd, buffer.data(), buffer.size())) > 0;)
            total += got;
        close(fd);
        return total;
    }

private:
    static void warm(const std::string& path) {
        std::vector<char> buffer(1 << 20);
        readPlainly(path, buffer);
    }

    char m_imode = 0;
    int m_blockSize = 0;
    std::unique_ptr<TempFile> m_file;
};

void readBlocks(benchmark::State& state, char imode, int blockSize) {
    const std::string& path = ImageFile::path(imode, blockSize);
    CNitfFileReader reader;
    if (!reader.open(path.c_str()))
        throw std::runtime_error("cannot open " + path);
    std::unique_ptr<CNitfImageSource> source(reader.getNewImageSource(0));
    const CNitfImagePropertiesIF& p = source->getImageProperties();
    std::vector<char> buffer(static_cast<size_t>(p.getTileBandBufferSize()));
    for (auto _ : state) {
        for (int y = 0; y < p.getTileCountY(); ++y)
            for (int x = 0; x < p.getTileCountX(); ++x)
                for (int band = 0; band < p.getBandCount(); ++band)
                    source->readTileNonInterleaved(&reader, buffer.data(), band, x, y);
        benchmark::DoNotOptimize(buffer.data());
    }
    state.SetBytesProcessed(state.iterations() * p.getImageBufferSize());
}

void readPlainly(benchmark::State& state, char imode, int blockSize) {
    const std::string& path = ImageFile::path(imode, blockSize);
    std::vector<char> buffer(1 << 20);
    long long bytes = 0;
    for (auto _ : state)
        bytes += ImageFile::readPlainly(path, buffer);
    state.SetBytesProcessed(bytes);
}

// The console report, then each IMODE's library throughput as a share of the plain read's.
class RatioReporter : public benchmark::ConsoleReporter {
public:
    void ReportRuns(const std::vector<Run>& runs) override {
        ConsoleReporter::ReportRuns(runs);
        for (const Run& run : runs) {
            auto rate = run.counters.find("bytes_per_second");
            // With repetitions, the median stands for the benchmark.
            if (rate == run.counters.end())
                continue;
            if (run.run_type == Run::RT_Iteration && !m_rates.count(run.run_name.function_name))
                m_rates[run.run_name.function_name] = rate->second;
            if (run.run_type == Run::RT_Aggregate && run.aggregate_name == "median")
                m_rates[run.run_name.function_name] = rate->second;
        }
    }
    void Finalize() override {
        ConsoleReporter::Finalize();
        for (const auto& [name, library] : m_rates) {
            if (name.rfind("ReadBlocks/", 0) != 0)
                continue;
            const std::string layout = name.substr(std::string("ReadBlocks/").size());
            const double plain = m_rates["ReadPlainly/" + layout];
            if (library > 0 && plain > 0)
                std::printf("IMODE %s blocks: %.0f MB/s, read(): %.0f MB/s, ratio %.2f\n", layout.c_str(),
                            library / 1e6, plain / 1e6, library / plain);
        }
    }

private:
    std::map<std::string, double> m_rates;
};

} // namespace

int main(int argc, char** argv) {
    benchmark::Initialize(&argc, argv);
    // Consecutive benchmarks share one generated file.
    for (int blockSize : {1024, 512, 256})
        for (char imode : {'B', 'P', 'S'}) {
            const std::string layout = std::string(1, imode) + "/" + std::to_string(blockSize);
            benchmark::RegisterBenchmark(("ReadBlocks/" + layout).c_str(), readBlocks, imode, blockSize)
                ->Unit(benchmark::kMillisecond);
            benchmark::RegisterBenchmark(("ReadPlainly/" + layout).c_str(), readPlainly, imode, blockSize)
                ->Unit(benchmark::kMillisecond);
        }
    if (benchmark::ReportUnrecognizedArguments(argc, argv))
        return 1;
    RatioReporter reporter;
    benchmark::RunSpecifiedBenchmarks(&reporter);
    benchmark::Shutdown();
    return 0;
}
