// libFuzzer target: every image of the input through its image source, every block of every band read into
// buffers sized by the image's properties. A damaged file may be refused with vexo::Exception; anything else
// (a crash, a sanitizer report, another exception, a hang) is a finding.
#include <algorithm>
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
#include "NitfLutSource.h"

namespace {

// Buffers beyond this are skipped: a caller would not allocate them for a file this small.
const long long kLargestBuffer = 64LL << 20;
// Enough block reads to reach every code path without making a single input slow.
const int kBlockReads = 4096;

const std::string& scratchPath() {
    static const std::string path = [] {
        const char* dir = std::getenv("TMPDIR");
        std::string pattern = std::string(dir && *dir ? dir : "/tmp") + "/nitf-fuzz-XXXXXX";
        int fd = mkstemp(&pattern[0]);
        if (fd >= 0)
            close(fd);
        return pattern;
    }();
    return path;
}

void readImage(CNitfFileReader& reader, int index) {
    std::unique_ptr<CNitfImageSource> source(reader.getNewImageSource(index));
    const CNitfImagePropertiesIF& p = source->getImageProperties();
    const long long height = std::max(p.getTileHeight(), 0);
    const long long bandSize =
        std::max<long long>(p.getTileBandBufferSize(), height * std::max(p.getTileBandWidthBufferSize(), 0));
    const long long blockSize =
        std::max<long long>(p.getTileBufferSize(), height * std::max(p.getTileWidthBufferSize(), 0));
    if (bandSize <= 0 || blockSize <= 0 || blockSize > kLargestBuffer)
        return;
    std::vector<char> buffer(static_cast<size_t>(blockSize));
    int reads = 0;
    for (int band = 0; band < p.getBandCount() && reads < kBlockReads; ++band)
        for (int y = 0; y < p.getTileCountY() && reads < kBlockReads; ++y)
            for (int x = 0; x < p.getTileCountX() && reads < kBlockReads; ++x, ++reads)
                source->readTileNonInterleaved(&reader, buffer.data(), band, x, y);
    source->readTileInterleaved(&reader, buffer.data(), 0, 0);
    source->readTileInterleaved(&reader, buffer.data(), p.getTileCountX() - 1, p.getTileCountY() - 1);

    // A bi-level image's first rows, sampled down by two.
    if (p.getBpp() == 1) {
        const int width = std::min(p.getImageActualWidth(), 4096);
        const int rows = std::min(p.getImageActualHeight(), 64);
        std::vector<char> bits(static_cast<size_t>(std::max(rows, 1)) * ((std::max(width, 0) + 7) / 8) + 1);
        source->readBitmap(bits.data(), 0, 0, width, rows, (width + 7) / 8 * 8, rows / 2);
    }
    for (int i = 0; i < source->getLutCount(); ++i) {
        CNitfLutSource* lut = source->getLutSource(i);
        std::vector<char> entries(static_cast<size_t>(std::max(lut->getSize(), 0)) + 1);
        lut->readInterleaved(&reader, entries.data(), lut->getSize());
    }
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    const std::string& path = scratchPath();
    FILE* out = std::fopen(path.c_str(), "wb");
    if (!out)
        return 0;
    std::fwrite(data, 1, size, out);
    std::fclose(out);

    // The name is removed once the file is open, so that no scratch file outlives the run.
    CNitfFileReader reader;
    bool opened = false;
    try {
        opened = reader.open(path.c_str()) != nullptr;
    } catch (const vexo::Exception&) {
    }
    std::remove(path.c_str());
    if (!opened)
        return 0;
    for (int index = 0; index < std::min(reader.getImageCount(), 32); ++index) {
        try {
            readImage(reader, index);
        } catch (const vexo::Exception&) {
            // refused: fine
        }
    }
    return 0;
}
