// libFuzzer target: the input bytes are the image data of a C8 image segment (a JPEG 2000 codestream or a JP2
// file) after one shape byte. The NITF geometry follows the codestream's own header where it has one (so that
// the decoder gets past its checks), cut to a sane size; the shape byte picks the band count, the sample
// container and signedness. Every block is read whole and band by band, and a region at a reduced level. A
// damaged codestream may be refused with vexo::Exception; anything else (a crash, a sanitizer report, another
// exception, a hang, a huge allocation) is a finding.
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
#include "NitfImageSourceJpeg2000.h"
#include "NitfSampleWriter.h"

namespace {

const std::string& scratchPath() {
    static const std::string path = [] {
        const char* dir = std::getenv("TMPDIR");
        std::string pattern = std::string(dir && *dir ? dir : "/tmp") + "/nitf-j2kfuzz-XXXXXX";
        int fd = mkstemp(&pattern[0]);
        if (fd >= 0)
            close(fd);
        return pattern;
    }();
    return path;
}

uint32_t bigEndian(const std::string& data, size_t at) {
    uint32_t value = 0;
    for (size_t i = 0; i < 4; ++i)
        value = (value << 8) | uint8_t(data[at + i]);
    return value;
}

// Image and block size from a bare codestream's SIZ, when it has one.
void geometryFrom(const std::string& data, nitfsample::Image& image) {
    image.rows = image.cols = 64;
    if (data.size() < 40 || data.compare(0, 4, "\xFF\x4F\xFF\x51", 4) != 0)
        return;
    auto clampTo = [](long long v, int most) { return int(std::clamp<long long>(v, 1, most)); };
    image.cols = clampTo(static_cast<long long>(bigEndian(data, 8)) - bigEndian(data, 16), 2048);
    image.rows = clampTo(static_cast<long long>(bigEndian(data, 12)) - bigEndian(data, 20), 2048);
    image.nppbh = clampTo(bigEndian(data, 24), 2048);
    image.nppbv = clampTo(bigEndian(data, 28), 2048);
    if (static_cast<long long>(image.cols + image.nppbh - 1) / image.nppbh *
            ((image.rows + image.nppbv - 1) / image.nppbv) >
        256)
        image.nppbh = image.nppbv = 0;
}

void readEverything(CNitfFileReader& reader) {
    std::unique_ptr<CNitfImageSource> base(reader.getNewImageSource(0));
    auto* source = dynamic_cast<CNitfImageSourceJpeg2000*>(base.get());
    if (!source)
        return;
    const CNitfImagePropertiesIF& p = source->getImageProperties();
    std::vector<char> block(size_t(p.getTileReadBufferSize()));
    for (int y = 0; y < p.getTileCountY(); ++y)
        for (int x = 0; x < p.getTileCountX(); ++x) {
            for (int band = 0; band < p.getBandCount(); ++band)
                source->readTileNonInterleaved(&reader, block.data(), band, x, y);
            try {
                source->readTileInterleaved(&reader, block.data(), x, y);
            } catch (const vexo::Exception&) {
            }
        }
    const int level = std::min(2, source->getResolutionLevels() - 1);
    const int width = std::min(64, source->getLevelWidth(level)),
              height = std::min(64, source->getLevelHeight(level));
    if (width > 0 && height > 0) {
        const int rowBytes = width * p.getBandCount() * p.getSampleContainerBytes();
        std::vector<char> region(size_t(rowBytes) * height);
        try {
            source->readRegion(&reader, level, 0, 0, width, height, 0, p.getBandCount(), region.data(),
                               rowBytes);
        } catch (const vexo::Exception&) {
        }
    }
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    if (size < 1)
        return 0;
    static bool quiet = [] {
        vexo::nspio::Warning::setHandler([](const char*, const char*, int) {});
        return true;
    }();
    (void)quiet;
    const uint8_t shape = data[0];
    nitfsample::Image image;
    image.ic = "C8";
    image.comrat = "N001";
    image.blockData = {std::string(reinterpret_cast<const char*>(data) + 1, size - 1)};
    geometryFrom(image.blockData[0], image);
    image.bands = (shape & 1) ? 3 : 1;
    image.nbpp = (shape & 2) ? 16 : 8;
    image.pvtype = (shape & 4) ? "SI" : "INT";
    nitfsample::File file;
    file.images.push_back(image);
    try {
        nitfsample::write(file, scratchPath());
    } catch (const std::exception&) {
        return 0;
    }
    CNitfFileReader reader;
    if (!reader.open(scratchPath().c_str()))
        return 0;
    try {
        readEverything(reader);
    } catch (const vexo::Exception&) {
    }
    return 0;
}
