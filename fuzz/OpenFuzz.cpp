// Opens random bytes as a NITF file, walks everything in it and reads every image through its source (every
// block of every band, windows through the region reader): a malformed file must be read or refused with
// vexo::Exception, never crash, hang or allocate more than it can justify.
#include <cstdint>

#include "HostError.h"
#include "NitfFileReader.h"
#include "WalkFile.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    walkBytes(data, size);
    CNitfFileReader reader;
    try {
        if (reader.openMemory(data, size))
            readEveryImage(reader);
    } catch (const vexo::Exception&) {
    }
    return 0;
}
