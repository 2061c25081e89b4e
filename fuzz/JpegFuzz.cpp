// libFuzzer target: the input bytes are the JPEG stream(s) of a small C3/M3 image, whose shape the first byte
// chooses (8- or 12-bit, one band or three pixel-interleaved, block size, masked or not, a COMRAT with or
// without default tables). Every block is read, band by band and whole. A damaged stream may be refused with
// vexo::Exception or read as absent; anything else (a crash, a sanitizer report, another exception, a hang)
// is a finding.
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <memory>
#include <string>
#include <vector>

#include "HostError.h"
#include "NitfFileReader.h"
#include "NitfImageSource.h"
#include "NitfSampleWriter.h"

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

void readEveryBlock(CNitfFileReader& reader) {
    std::unique_ptr<CNitfImageSource> source(reader.getNewImageSource(0));
    const CNitfImagePropertiesIF& p = source->getImageProperties();
    const int bytes = p.getBpp() <= 8 ? 1 : 2;
    const int bandRow = p.getTileWidth() * bytes;
    std::vector<char> buffer(static_cast<size_t>(bandRow) * p.getBandCount() * p.getTileHeight());
    for (int y = 0; y < p.getTileCountY(); ++y)
        for (int x = 0; x < p.getTileCountX(); ++x) {
            for (int band = 0; band < p.getBandCount(); ++band)
                source->readTileNonInterleaved(&reader, buffer.data(), band, x, y);
            try {
                source->readTileInterleaved(&reader, buffer.data(), bandRow * p.getBandCount(), x, y);
            } catch (const vexo::Exception&) {
            }
        }
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    if (size < 1)
        return 0;
    nitfsample::File file;
    file.images.push_back(imageFor(data[0], std::string(reinterpret_cast<const char*>(data) + 1, size - 1)));
    std::string bytes;
    try {
        bytes = nitfsample::build(file);
    } catch (const std::exception&) {
        return 0; // a shape the writer cannot lay out
    }
    CNitfFileReader reader;
    if (!reader.openMemory(bytes.data(), bytes.size()))
        return 0;
    try {
        readEveryBlock(reader);
    } catch (const vexo::Exception&) {
    }
    return 0;
}
