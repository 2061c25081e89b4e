// nitf sample: writes the project's demo file (a small NITF 2.1 image with a TRE, a comment and a text).
#include <cstdio>
#include <exception>

#include "Commands.h"
#include "NitfSampleWriter.h"

int runSample(int argc, char** argv) {
    if (argc != 1) {
        std::fprintf(stderr, "usage: nitf sample OUT.ntf\n");
        return 2;
    }
    try {
        nitfsample::write(nitfsample::defaultSample(), argv[0]);
    } catch (const std::exception& e) {
        std::fprintf(stderr, "nitf: %s\n", e.what());
        return 1;
    }
    std::printf("wrote %s\n", argv[0]);
    return 0;
}
