// Decoding JPEG-compressed images through the library against libjpeg decoding the very same streams directly
// in a tight loop: the library should add almost nothing on top of the codec. Throughput counts decoded
// bytes (samples delivered).
#include <benchmark/benchmark.h>

#include <cstdio>
#include <memory>
#include <stdexcept>
#include <string>
#include <vector>

#include <jpeglib.h>

#include "JpegStreams.h"
#include "NitfFileReader.h"
#include "NitfImageSource.h"
#include "NitfSampleWriter.h"
#include "TestFiles.h"

namespace {

// An image of `size` x `size` pixels in `block` x `block` blocks, its streams kept for the direct decoder.
struct BenchImage {
    std::vector<std::string> streams;
    std::unique_ptr<TempFile> file;
    int size;
    int block;
    int bands;
    int bytes; // per sample
};

BenchImage makeImage(int size, int block, int bands, int precision, const char* irep) {
    BenchImage image{{}, nullptr, size, block, bands, precision <= 8 ? 1 : 2};
    jpegtest::Coding coding;
    coding.precision = precision;
    coding.quality = 85;
    const int perSide = size / block;
    for (int i = 0; i < perSide * perSide; ++i) {
        jpegtest::Raster raster = jpegtest::pattern(block, block, bands, precision, 37 * i);
        // Texture on top of the smooth pattern, so the entropy decoder has work like on real imagery.
        unsigned noise = 12345u + i;
        for (uint16_t& sample : raster.samples) {
            noise = noise * 1103515245u + 12345u;
            const int top = (1 << precision) - 1;
            int value = sample + static_cast<int>((noise >> 16) % 33) - 16;
            sample = static_cast<uint16_t>(value < 0 ? 0 : value > top ? top : value);
        }
        image.streams.push_back(jpegtest::encode(raster, coding));
    }
    nitfsample::Image nitf;
    nitf.ic = "C3";
    nitf.comrat = "00.0";
    nitf.rows = nitf.cols = size;
    nitf.nppbh = nitf.nppbv = block;
    nitf.bands = bands;
    nitf.nbpp = precision;
    nitf.imode = bands > 1 ? 'P' : 'B';
    nitf.irep = irep;
    nitf.blockData = image.streams;
    nitfsample::File file;
    file.images.push_back(nitf);
    image.file = std::make_unique<TempFile>(nitfsample::build(file));
    return image;
}

const BenchImage& greyImage() {
    static const BenchImage image = makeImage(4096, 512, 1, 8, "MONO");
    return image;
}
const BenchImage& colourImage() {
    static const BenchImage image = makeImage(2048, 512, 3, 8, "YCbCr601");
    return image;
}
const BenchImage& twelveBitImage() {
    static const BenchImage image = makeImage(2048, 512, 1, 12, "MONO");
    return image;
}

void countBytes(benchmark::State& state, const BenchImage& image) {
    state.SetBytesProcessed(static_cast<int64_t>(state.iterations()) * image.size * image.size * image.bands *
                            image.bytes);
}

void libraryDecode(benchmark::State& state, const BenchImage& image) {
    CNitfFileReader reader;
    if (!reader.open(image.file->path().c_str()))
        throw std::runtime_error("cannot open the bench image");
    std::unique_ptr<CNitfImageSource> source(reader.getNewImageSource(0));
    const int rowBytes = image.block * image.bands * image.bytes;
    std::vector<char> buffer(static_cast<size_t>(rowBytes) * image.block);
    const int perSide = image.size / image.block;
    for (auto _ : state) {
        for (int y = 0; y < perSide; ++y)
            for (int x = 0; x < perSide; ++x) {
                source->readTileInterleaved(&reader, buffer.data(), rowBytes, x, y);
                benchmark::DoNotOptimize(buffer.data());
            }
    }
    countBytes(state, image);
}

// libjpeg alone: one decompression object, each stream from memory straight into one block buffer.
void directDecode(benchmark::State& state, const BenchImage& image) {
    jpeg_decompress_struct cinfo;
    jpeg_error_mgr errors;
    cinfo.err = jpeg_std_error(&errors);
    jpeg_create_decompress(&cinfo);
    const int rowBytes = image.block * image.bands * image.bytes;
    std::vector<unsigned char> buffer(static_cast<size_t>(rowBytes) * image.block);
    std::vector<unsigned char*> rows(image.block);
    for (int r = 0; r < image.block; ++r)
        rows[r] = buffer.data() + static_cast<size_t>(r) * rowBytes;
    for (auto _ : state) {
        for (const std::string& stream : image.streams) {
            jpeg_mem_src(&cinfo, reinterpret_cast<const unsigned char*>(stream.data()), stream.size());
            jpeg_read_header(&cinfo, TRUE);
            jpeg_start_decompress(&cinfo);
            while (cinfo.output_scanline < cinfo.output_height) {
                unsigned char** next = rows.data() + cinfo.output_scanline;
                const JDIMENSION left = cinfo.output_height - cinfo.output_scanline;
                if (cinfo.data_precision <= 8)
                    jpeg_read_scanlines(&cinfo, next, left);
                else
                    jpeg12_read_scanlines(&cinfo, reinterpret_cast<J12SAMPARRAY>(next), left);
            }
            jpeg_finish_decompress(&cinfo);
            benchmark::DoNotOptimize(buffer.data());
        }
    }
    jpeg_destroy_decompress(&cinfo);
    countBytes(state, image);
}

void LibraryGrey8(benchmark::State& state) {
    libraryDecode(state, greyImage());
}
void DirectGrey8(benchmark::State& state) {
    directDecode(state, greyImage());
}
void LibraryYCbCr8(benchmark::State& state) {
    libraryDecode(state, colourImage());
}
void DirectYCbCr8(benchmark::State& state) {
    directDecode(state, colourImage());
}
void LibraryGrey12(benchmark::State& state) {
    libraryDecode(state, twelveBitImage());
}
void DirectGrey12(benchmark::State& state) {
    directDecode(state, twelveBitImage());
}

BENCHMARK(LibraryGrey8)->Unit(benchmark::kMillisecond);
BENCHMARK(DirectGrey8)->Unit(benchmark::kMillisecond);
BENCHMARK(LibraryYCbCr8)->Unit(benchmark::kMillisecond);
BENCHMARK(DirectYCbCr8)->Unit(benchmark::kMillisecond);
BENCHMARK(LibraryGrey12)->Unit(benchmark::kMillisecond);
BENCHMARK(DirectGrey12)->Unit(benchmark::kMillisecond);

} // namespace
