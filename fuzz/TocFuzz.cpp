// libFuzzer target: the RPF table of contents reader. The first byte chooses the input's form:
// - 0: the rest is a raw A.TOC file;
// - 1: the rest is a NITF file whose RPFHDR TRE locates the table (read through the file reader);
// - otherwise: the rest patches a well-formed raw A.TOC of two rectangles and six frames (the tests' known
//   rectangles): two bytes give its new length, then each three bytes a position (two bytes) and the byte to
//   put there, so that mutations land in counts, offsets, record lengths and pathnames.
// The table is read and turned into boundary descriptions. A damaged table may be refused with
// vexo::Exception; anything else (a crash, a sanitizer report, another exception, a hang, an allocation
// beyond libFuzzer's limit) is a finding.
#include <cstdint>
#include <memory>
#include <string>

#include "HostError.h"
#include "NitfFileReader.h"
#include "RpfSource.h"
#include "RpfTables.h"
#include "TestFiles.h"

namespace {

std::string patched(const uint8_t* data, size_t size) {
    static const std::string wellFormed = rawRpfToc(knownRpfRectangles());
    std::string bytes = wellFormed;
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
    const std::string bytes = data[0] == 0 || data[0] == 1
                                  ? std::string(reinterpret_cast<const char*>(data) + 1, size - 1)
                                  : patched(data + 1, size - 1);
    try {
        if (data[0] == 1) {
            CNitfFileReader reader;
            if (!reader.openMemory(bytes.data(), bytes.size()))
                return 0;
            std::unique_ptr<CRpfSource> toc(reader.getNewExtensionRpfSource());
            if (toc)
                readBoundaries(*toc, reader.getInputStream());
            return 0;
        }
        ByteStream stream(bytes);
        CRpfSource toc;
        CRpfSource::isRawToc(stream);
        toc.readStartAt(stream, 0);
        readBoundaries(toc, stream);
    } catch (const vexo::Exception&) {
    }
    return 0;
}
