// libFuzzer target: a small C4/M4 image whose shape the first byte chooses. With its top bit set the rest of
// the input is the whole image data (header, lookup records, codebook and indexes, all damaged at will);
// otherwise the input's rest is the block indexes behind a well-formed header and codebook of one of four
// code grids (12-bit 4 x 4 kernels with and without the grid in the header, 5-bit 2 x 3 kernels, 8-bit
// single pixels). Every block is read band by band and whole. A damaged image may be refused with
// vexo::Exception or read as absent; anything else (a crash, a sanitizer report, another exception, a hang)
// is a finding.
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <memory>
#include <string>
#include <unistd.h>
#include <vector>

#include "HostError.h"
#include "NitfFileReader.h"
#include "NitfImageSource.h"
#include "NitfSampleWriter.h"

namespace {

const std::string& scratchPath() {
    static const std::string path = [] {
        const char* dir = std::getenv("TMPDIR");
        std::string pattern = std::string(dir && *dir ? dir : "/tmp") + "/nitf-vqfuzz-XXXXXX";
        int fd = mkstemp(&pattern[0]);
        if (fd >= 0)
            close(fd);
        return pattern;
    }();
    return path;
}

struct Grid {
    unsigned codesPerRow, codeRows, bits, kernelWidth, kernelHeight;
    bool inHeader;
};

const Grid kGrids[] = {
    {8, 8, 12, 4, 4, true}, {64, 64, 12, 4, 4, false}, {5, 3, 5, 2, 3, true}, {16, 16, 8, 1, 1, true}};

void put(std::string& out, uint64_t value, int bytes) {
    for (int i = bytes - 1; i >= 0; --i)
        out += static_cast<char>((value >> (8 * i)) & 0xFF);
}

std::string headerAndCodebook(const Grid& grid) {
    std::string out;
    if (grid.inHeader) {
        put(out, grid.codeRows, 4);
        put(out, grid.codesPerRow, 4);
        put(out, grid.bits, 1);
    }
    put(out, 1, 2);
    put(out, 4, 2);
    put(out, 0, 2);
    put(out, 6, 4);
    put(out, 14, 2);
    for (unsigned id = 1; id <= 4; ++id) {
        put(out, id, 2);
        put(out, 1u << grid.bits, 4);
        put(out, grid.kernelWidth, 2);
        put(out, 8, 2);
        put(out, 62 + 16384 * (id - 1), 4);
    }
    const size_t codebook = (size_t(grid.kernelWidth) * grid.kernelHeight) << grid.bits;
    for (size_t i = 0; i < codebook; ++i)
        out += static_cast<char>(i * 37 + (i >> 7));
    return out;
}

nitfsample::Image imageFor(uint8_t shape, const std::string& rest) {
    const Grid& grid = kGrids[shape & 3];
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
    image.nppbh = static_cast<int>(grid.codesPerRow * grid.kernelWidth);
    image.nppbv = static_cast<int>(grid.codeRows * grid.kernelHeight);
    const int blocks = (shape & 0x20) ? 1 : 2;
    image.cols = blocks * image.nppbh;
    image.rows = blocks * image.nppbv - 1; // a partial last block row
    const std::string data = (shape & 0x80) ? rest : headerAndCodebook(grid) + rest;
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

void readEveryBlock(CNitfFileReader& reader) {
    std::unique_ptr<CNitfImageSource> source(reader.getNewImageSource(0));
    const CNitfImagePropertiesIF& p = source->getImageProperties();
    const int bandRow = p.getTileBandWidthBufferSize();
    std::vector<char> buffer(static_cast<size_t>(p.getTileReadBufferSize()));
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
    try {
        nitfsample::write(file, scratchPath());
    } catch (const std::exception&) {
        return 0; // a shape the writer cannot lay out
    }
    CNitfFileReader reader;
    if (!reader.open(scratchPath().c_str()))
        return 0;
    try {
        readEveryBlock(reader);
    } catch (const vexo::Exception&) {
    }
    return 0;
}
