// Bi-level (C1) pages: decoding through the library in the process, and whole processes side by side: the
// nitf tool extracting the page as raw samples against gdal_translate writing it as ENVI, both one byte per
// pixel. The pages are the corpus's largest bi-level images and two typed pages of 2560 x 3300 pixels coded
// here. Throughput counts output bytes (one per pixel).
#include <benchmark/benchmark.h>

#include <cstdio>
#include <fcntl.h>
#include <functional>
#include <map>
#include <memory>
#include <string>
#include <vector>

#include "BilevelStreams.h"
#include "BenchProcess.h"
#include "NitfFileReader.h"
#include "NitfImageSource.h"
#include "NitfSampleWriter.h"
#include "TestFiles.h"

namespace {

// A page and how to find (or make) its file; the path is empty when the page is not available.
struct BenchPage {
    const char* name;
    std::function<std::string()> locate;

    const std::string& path() const {
        static std::map<std::string, std::string> paths;
        auto found = paths.find(name);
        if (found == paths.end())
            found = paths.emplace(name, locate()).first;
        return found->second;
    }
};

std::string typedPage(int k, const char* comrat) {
    static std::vector<std::unique_ptr<TempFile>> files;
    const bileveltest::Page page = bileveltest::documentPage(2560, 3300, 17);
    nitfsample::Image image;
    image.ic = "C1";
    image.comrat = comrat;
    image.nbpp = 1;
    image.pvtype = "B";
    image.cols = page.width;
    image.rows = page.height;
    image.blockData = {bileveltest::encode(page, bileveltest::Coding{k, 0, 6})};
    nitfsample::File file;
    file.images = {image};
    files.push_back(std::make_unique<TempFile>(nitfsample::build(file)));
    return files.back()->path();
}

std::function<std::string()> corpusPage(const char* relative) {
    return [relative] {
        const std::string root = corpusRoot();
        return root.empty() ? std::string() : root + "/" + relative;
    };
}

const std::vector<BenchPage>& pages() {
    static const std::vector<BenchPage> list = {
        {"typed-2560x3300-1D", [] { return typedPage(1, "1D"); }},
        {"typed-2560x3300-2DH", [] { return typedPage(4, "2DH"); }},
        {"U_4004B-2221x2223-1D", corpusPage("nitf20/U_4004B.NTF")},
        {"U_1050A-1024x1024-2DH", corpusPage("nitf20/U_1050A.NTF")},
        {"ns3038a-1024x1024-1D", corpusPage("nsif/ns3038a.nsf")},
        {"i_3041a-512x512-2DS", corpusPage("nitf21/i_3041a.ntf")},
    };
    return list;
}

// Every block of the page decoded into one block buffer.
void decodeBlocks(benchmark::State& state, const BenchPage& page) {
    CNitfFileReader reader;
    if (page.path().empty() || !reader.open(page.path().c_str()))
        return state.SkipWithError("page not available");
    // The source decodes the page when it starts (its blocks are then cut from that bitmap): each iteration
    // starts a source and reads every block.
    std::unique_ptr<CNitfImageSource> first(reader.getNewImageSource(0));
    const CNitfImagePropertiesIF& p = first->getImageProperties();
    std::vector<char> block(static_cast<size_t>(p.getTileBandReadBufferSize()));
    for (auto _ : state) {
        std::unique_ptr<CNitfImageSource> source(reader.getNewImageSource(0));
        for (int y = 0; y < p.getTileCountY(); ++y)
            for (int x = 0; x < p.getTileCountX(); ++x) {
                source->readTileNonInterleaved(&reader, block.data(), 0, x, y);
                benchmark::DoNotOptimize(block.data());
            }
    }
    state.SetBytesProcessed(state.iterations() * p.getImageActualWidth() * p.getImageActualHeight());
}

// One whole process per iteration, writing one byte per pixel.
void wholeProcess(benchmark::State& state, const BenchPage& page, bool gdal) {
    if (page.path().empty())
        return state.SkipWithError("page not available");
    if (gdal && runQuietly({"gdal_translate", "--version"}) != 0)
        return state.SkipWithError("gdal_translate is not installed");
    const TempFile output(std::string(), gdal ? ".envi" : ".raw");
    // One thread each, as GDAL decodes.
    const std::vector<std::string> command =
        gdal ? std::vector<std::string>{"gdal_translate", "-q", "-of", "ENVI", page.path(), output.path()}
             : std::vector<std::string>{NITF_TOOL_PATH, "extract",     "-f",       "raw", "-j", "1",
                                        "-o",           output.path(), page.path()};
    for (auto _ : state)
        if (runQuietly(command) != 0)
            return state.SkipWithError((command[0] + " cannot decode this page").c_str());
    state.SetBytesProcessed(state.iterations() * static_cast<int64_t>(output.read().size()));
    if (gdal) {
        std::remove((output.path().substr(0, output.path().size() - 5) + ".hdr").c_str());
        std::remove((output.path() + ".aux.xml").c_str());
    }
}

const bool registered = [] {
    for (const BenchPage& page : pages()) {
        benchmark::RegisterBenchmark((std::string("BilevelDecode/") + page.name).c_str(), decodeBlocks, page)
            ->Unit(benchmark::kMillisecond);
        benchmark::RegisterBenchmark((std::string("BilevelProcess/nitf/") + page.name).c_str(), wholeProcess,
                                     page, false)
            ->Unit(benchmark::kMillisecond)
            ->UseRealTime();
        benchmark::RegisterBenchmark((std::string("BilevelProcess/gdal/") + page.name).c_str(), wholeProcess,
                                     page, true)
            ->Unit(benchmark::kMillisecond)
            ->UseRealTime();
    }
    return true;
}();

} // namespace
