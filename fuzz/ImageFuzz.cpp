// libFuzzer target: every image of the input through its image source, every block of every band read into
// buffers sized by the image's properties, a window through the region reader. A damaged file may be refused
// with vexo::Exception; anything else (a crash, a sanitizer report, another exception, a hang) is a finding.
#include <cstdint>

#include "HostError.h"
#include "NitfFileReader.h"
#include "WalkFile.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    CNitfFileReader reader;
    try {
        if (!reader.openMemory(data, size))
            return 0;
    } catch (const vexo::Exception&) {
        return 0;
    }
    readEveryImage(reader);
    return 0;
}
