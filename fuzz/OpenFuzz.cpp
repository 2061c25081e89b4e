// Opens random bytes as a NITF file and walks everything in it: a malformed file must be read or refused with
// vexo::Exception, never crash, hang or allocate more than it can justify.
#include <cstdint>
#include <cstdio>
#include <string>
#include <unistd.h>

#include "WalkFile.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    static const std::string path = "/tmp/nitf-fuzz-open-" + std::to_string(getpid()) + ".ntf";
    FILE* out = std::fopen(path.c_str(), "wb");
    if (!out)
        return 0;
    std::fwrite(data, 1, size, out);
    std::fclose(out);
    walkFile(path);
    return 0;
}
