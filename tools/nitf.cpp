// The nitf command-line tool: looks into NITF/NSIF files with the library.
#include <cstdio>
#include <cstring>
#include <string>

#include "Commands.h"
#include "HostError.h"
#include "NitfVersion.h"

static int usage(FILE* out) {
    std::fprintf(out, "usage: nitf --version\n"
                      "       nitf info [--json] FILE  describe the file's headers, segments and TREs\n"
                      "       nitf extract FILE [-i IMAGE] [-b BAND] -f raw|png|pgm|tiff [--cog]\n"
                      "                    [--compress deflate|zstd|none] [--threads N] -o OUT\n"
                      "                                decode an image (default 0) to canonical raw bytes, a "
                      "picture, or a\n"
                      "                                GeoTIFF (--cog: Cloud-Optimized, tiled, compressed, "
                      "with overviews)\n"
                      "       nitf sample OUT.ntf      write a small demo NITF 2.1 file\n"
                      "       nitf selfcheck [DIR]     write fields to a file in DIR and read them back\n");
    return out == stdout ? 0 : 2;
}

int main(int argc, char** argv) {
    if (argc < 2)
        return usage(stderr);
    std::string command = argv[1];
    try {
        if (command == "--version" || command == "version") {
            std::printf("nitf %s\n", nitfVersion());
            return 0;
        }
        if (command == "--help" || command == "help")
            return usage(stdout);
        if (command == "info")
            return runInfo(argc - 2, argv + 2);
        if (command == "sample")
            return runSample(argc - 2, argv + 2);
        if (command == "selfcheck")
            return runSelfCheck(argc - 2, argv + 2);
        if (command == "extract")
            return runExtract(argc - 2, argv + 2);
    } catch (const vexo::Exception& e) {
        std::fprintf(stderr, "nitf: %s\n", e.what());
        return 1;
    }
    std::fprintf(stderr, "nitf: unknown command '%s'\n", command.c_str());
    return usage(stderr);
}
