// libFuzzer target: the RPF table of contents reader. The first byte chooses the input's form:
// - 0: the rest is a raw A.TOC file;
// - 1: the rest is a NITF file whose RPFHDR TRE locates the table (read through the file reader);
// - otherwise: the rest patches a well-formed raw A.TOC of two rectangles and six frames built at start-up:
//   two bytes give its new length, then each three bytes a position (two bytes) and the byte to put there,
//   so that mutations land in counts, offsets, record lengths and pathnames.
// The table is read and turned into boundary descriptions. A damaged table may be refused with
// vexo::Exception; anything else (a crash, a sanitizer report, another exception, a hang, an allocation
// beyond libFuzzer's limit) is a finding.
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <memory>
#include <string>
#include <unistd.h>

#include "HostError.h"
#include "HostFile.h"
#include "NitfFileReader.h"
#include "RpfSource.h"

namespace {

std::string scratchPath(const char* name) {
    const char* dir = std::getenv("TMPDIR");
    std::string pattern = std::string(dir && *dir ? dir : "/tmp") + "/nitf-tocfuzz-" + name + "-XXXXXX";
    int fd = mkstemp(&pattern[0]);
    if (fd >= 0)
        close(fd);
    return pattern;
}

void writeFile(const std::string& path, const std::string& bytes) {
    FILE* out = std::fopen(path.c_str(), "wb");
    if (!out)
        return;
    std::fwrite(bytes.data(), 1, bytes.size(), out);
    std::fclose(out);
}

// A raw A.TOC: one rectangle of 3 x 2 frames in two directories (one place empty), one of a single frame.
const std::string& wellFormedToc() {
    static const std::string bytes = [] {
        std::string paths[] = {"./RPF/ONC/001ZC013.ON1", "./RPF/ONC/001ZD013.ON1", "./RPF/TPC/001ZE013.ON1",
                               "./RPF/ONC/001ZF013.ON1", "./RPF/TPC/001ZG013.ON1", "./001ALL26.I12"};
        char* grid[] = {&paths[0][0], &paths[1][0], &paths[2][0], nullptr, &paths[3][0], &paths[4][0]};
        char* single[] = {&paths[5][0]};
        CRpfSource toc;
        toc.writeStart();
        RPFBoundaryRectangle_t rectangle{};
        rectangle.zone = '1';
        rectangle.verticalFrames = 3;
        rectangle.horizontalFrames = 2;
        rectangle.verticalInterval = rectangle.horizontalInterval = 2.0;
        rectangle.frameCount = 6;
        rectangle.frameFiles = grid;
        toc.writeAddBoundaryRectangle(rectangle);
        rectangle.verticalFrames = rectangle.horizontalFrames = 1;
        rectangle.frameCount = 1;
        rectangle.frameFiles = single;
        toc.writeAddBoundaryRectangle(rectangle);
        toc.writePrepareHeaders(0, 48);
        const std::string path = scratchPath("seed");
        FILE* fp = std::fopen(path.c_str(), "w+b");
        toc.writeFinish(fp);
        std::fseek(fp, 0, SEEK_END);
        std::string written(static_cast<size_t>(std::ftell(fp)), '\0');
        std::fseek(fp, 0, SEEK_SET);
        written.resize(std::fread(&written[0], 1, written.size(), fp));
        std::fclose(fp);
        std::remove(path.c_str());
        return written;
    }();
    return bytes;
}

std::string patched(const uint8_t* data, size_t size) {
    std::string bytes = wellFormedToc();
    if (size >= 2)
        bytes.resize(((data[0] << 8) | data[1]) % (bytes.size() + 1));
    for (size_t i = 2; i + 3 <= size && !bytes.empty(); i += 3)
        bytes[((data[i] << 8) | data[i + 1]) % bytes.size()] = static_cast<char>(data[i + 2]);
    return bytes;
}

void readBoundaries(CRpfSource& toc, FILE* fp) {
    RPFBoundaryRectangle_t** boundaries = toc.readRpfBoundaries(fp);
    CRpfSource::freeRpfBoundaries(boundaries);
    toc.computeTotalLength();
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    if (size < 1)
        return 0;
    static const std::string path = scratchPath("input");
    const std::string bytes = data[0] == 0 || data[0] == 1
                                  ? std::string(reinterpret_cast<const char*>(data) + 1, size - 1)
                                  : patched(data + 1, size - 1);
    writeFile(path, bytes);
    try {
        if (data[0] == 1) {
            CNitfFileReader reader;
            if (!reader.open(path.c_str()))
                return 0;
            std::unique_ptr<CRpfSource> toc(reader.getNewExtensionRpfSource());
            if (toc)
                readBoundaries(*toc, reader.getInputStream());
            return 0;
        }
        FILE* fp = DKOpen(path.c_str(), DK_MODE_READ_BINARY, "rb");
        if (!fp)
            return 0;
        try {
            CRpfSource toc;
            CRpfSource::isRawToc(fp);
            toc.readStartAt(fp, 0);
            readBoundaries(toc, fp);
        } catch (...) {
            DKClose(fp);
            throw;
        }
        DKClose(fp);
    } catch (const vexo::Exception&) {
    }
    return 0;
}
