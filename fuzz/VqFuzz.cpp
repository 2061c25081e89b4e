// libFuzzer target: a small C4/M4 image whose shape the first byte chooses. With its top bit set the rest of
// the input is the whole image data (header, lookup records, codebook and indexes, all damaged at will);
// otherwise the input's rest is the block indexes behind a well-formed header and codebook of one of four
// code grids (12-bit 4 x 4 kernels with and without the grid in the header, 5-bit 2 x 3 kernels, 8-bit
// single pixels). It is read as readSample reads it. A damaged image may be refused with vexo::Exception or
// read as absent; anything else (a crash, a sanitizer report, another exception, a hang) is a finding.
#include <cstdint>
#include <string>
#include <vector>

#include "NitfSampleWriter.h"
#include "VqStreams.h"
#include "WalkFile.h"

namespace {

const vqtest::Layout kGrids[] = {
    {8, 8, 12, 4, 4, true}, {64, 64, 12, 4, 4, false}, {5, 3, 5, 2, 3, true}, {16, 16, 8, 1, 1, true}};

nitfsample::Image imageFor(uint8_t shape, const std::string& rest) {
    const vqtest::Layout& grid = kGrids[shape & 3];
    nitfsample::Image image;
    const bool masked = shape & 4;
    image.ic = masked ? "M4" : "C4";
    image.comrat = "0.75";
    switch ((shape >> 3) & 3) {
    case 0:
        break;
    case 1:
        image.bands = 2;
        image.imode = 'S';
        break;
    case 2:
        image.bands = 2;
        image.imode = 'B';
        break;
    default:
        image.imode = 'P';
        break;
    }
    image.irep = image.bands == 1 ? "MONO" : "MULTI";
    image.nppbh = grid.blockWidth();
    image.nppbv = grid.blockHeight();
    const int blocks = (shape & 0x20) ? 1 : 2;
    image.cols = blocks * image.nppbh;
    image.rows = blocks * image.nppbv - 1; // a partial last block row
    // Each grid's header and codebook, built once: the 12-bit ones are 64 KiB.
    static const std::vector<std::string> kHeaders = [] {
        std::vector<std::string> headers;
        for (const vqtest::Layout& layout : kGrids)
            headers.push_back(vqtest::headerAndCodebook(layout));
        return headers;
    }();
    const std::string data = (shape & 0x80) ? rest : kHeaders[shape & 3] + rest;
    if (!masked) {
        image.blockData = {data};
        return image;
    }
    // One element per block entry: the data split evenly, the entries whose bit of `rest`'s first byte is set
    // absent.
    const int entries = nitfsample::blockEntryCount(image);
    const size_t share = data.size() / entries;
    const uint8_t absent = rest.empty() ? 0 : static_cast<uint8_t>(rest[0]);
    for (int e = 0; e < entries; ++e) {
        const bool last = e == entries - 1;
        if (e > 0 && (absent >> e) & 1) {
            image.absentBlocks.insert(e);
            image.blockData.push_back(std::string());
            continue;
        }
        image.blockData.push_back(data.substr(e * share, last ? std::string::npos : share));
    }
    image.padCodeBits = (shape & 0x40) ? 8 : 0;
    image.padValue = 216;
    return image;
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    if (size >= 1)
        readSample(imageFor(data[0], std::string(reinterpret_cast<const char*>(data) + 1, size - 1)));
    return 0;
}
