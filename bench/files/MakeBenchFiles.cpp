// Writes the large images the whole-process benchmarks (bench/extract-vs-reference.sh) read: made here, with
// the independent sample writer and libjpeg, so that the benchmarks need no files from elsewhere.
#include <cstdio>
#include <string>

#include "JpegStreams.h"
#include "NitfSampleWriter.h"

namespace {

const int kSize = 8192, kBlock = 1024;

nitfsample::Image rgbImage() {
    nitfsample::Image image;
    image.cols = image.rows = kSize;
    image.nppbh = image.nppbv = kBlock;
    image.bands = 3;
    return image;
}

// 8192 x 8192 RGB in 1024 x 1024 blocks, each one YCbCr 4:4:4 JPEG stream of quality 90 (IMODE P).
void writeJpeg(const std::string& path) {
    nitfsample::Image image = rgbImage();
    image.ic = "C3";
    image.comrat = "00.0";
    image.imode = 'P';
    image.irep = "YCbCr601";
    jpegtest::Coding coding;
    coding.quality = 90;
    for (int block = 0; block < (kSize / kBlock) * (kSize / kBlock); ++block)
        image.blockData.push_back(jpegtest::encode(jpegtest::pattern(kBlock, kBlock, 3, 8, block), coding));
    nitfsample::File file;
    file.images = {image};
    nitfsample::write(file, path);
}

// The same size uncompressed (201 MB of samples) in IMODE `imode`, blocks `blockWidth` pixels wide.
void writeUncompressed(const std::string& path, char imode, int blockWidth) {
    nitfsample::Image image = rgbImage();
    image.imode = imode;
    image.nppbh = blockWidth;
    image.sample = [](int band, int row, int col) {
        return static_cast<uint64_t>(row * 3 + col * (band + 1));
    };
    nitfsample::File file;
    file.images = {image};
    nitfsample::write(file, path);
}

} // namespace

int main(int argc, char** argv) {
    if (argc != 2) {
        std::fprintf(stderr, "usage: nitf-bench-files DIR\n");
        return 2;
    }
    const std::string dir = argv[1];
    writeJpeg(dir + "/jpeg-ycbcr-8192.ntf");
    // Band-interleaved by block, and band-sequential in blocks of whole rows: the raw form already.
    writeUncompressed(dir + "/nc-rgb-8192.ntf", 'B', kBlock);
    writeUncompressed(dir + "/nc-bsq-8192.ntf", 'S', kSize);
    return 0;
}
