// libFuzzer target: the input bytes are the JPEG stream(s) of a small C3/M3 image, whose shape the first byte
// chooses (8- or 12-bit, one band or three pixel-interleaved, block size, masked or not, a COMRAT with or
// without default tables), read as readSample reads it. A damaged stream may be refused with vexo::Exception
// or read as absent; anything else (a crash, a sanitizer report, another exception, a hang) is a finding.
#include <cstdint>
#include <string>

#include "NitfSampleWriter.h"
#include "WalkFile.h"

namespace {

// The image the shape byte describes, with the rest of the input as its block data: one stream for an
// unmasked image (the reader finds the blocks by scanning), split in two for a masked 2 x 1 image.
nitfsample::Image imageFor(uint8_t shape, const std::string& data) {
    nitfsample::Image image;
    const bool masked = shape & 1;
    image.ic = masked ? "M3" : "C3";
    image.comrat = (shape & 2) ? "00.2" : "00.0";
    image.nbpp = (shape & 4) ? 12 : 8;
    image.bands = (shape & 8) ? 3 : 1;
    image.imode = image.bands == 3 ? 'P' : 'B';
    image.irep = image.bands == 3 ? ((shape & 16) ? "YCbCr601" : "RGB") : "MONO";
    const int block = (shape & 32) ? 16 : 8;
    image.nppbh = image.nppbv = block;
    image.rows = block;
    image.cols = 2 * block;
    if (masked) {
        const size_t half = data.size() / 2;
        image.blockData = {data.substr(0, half), data.substr(half)};
        if (shape & 64)
            image.absentBlocks = {1};
    } else {
        image.blockData = {data};
    }
    return image;
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    if (size >= 1)
        readSample(imageFor(data[0], std::string(reinterpret_cast<const char*>(data) + 1, size - 1)));
    return 0;
}
