// libFuzzer target: the input bytes are the image data of a C8 image segment (a JPEG 2000 codestream or a JP2
// file) after one shape byte. The NITF geometry follows the codestream's own header where it has one (so that
// the decoder gets past its checks), cut to a sane size; the shape byte picks the band count, the sample
// container and signedness. It is read as readSample reads it, a reduced level too. A damaged codestream may
// be refused with vexo::Exception; anything else (a crash, a sanitizer report, another exception, a hang, a
// huge allocation) is a finding.
#include <algorithm>
#include <cstdint>
#include <string>

#include "HostError.h"
#include "NitfSampleWriter.h"
#include "WalkFile.h"

namespace {

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
    readSample(image);
    return 0;
}
