// Opens random bytes as a NITF file and walks everything in it: a malformed file must be read or refused with
// vexo::Exception, never crash, hang or allocate more than it can justify.
#include <cstdint>

#include "WalkFile.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    walkBytes(data, size);
    return 0;
}
