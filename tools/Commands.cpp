// The tool's commands, in the order `nitf --help` lists them.
#include "CommandLine.h"
#include "Commands.h"

const std::vector<cli::Command>& cli::commands() {
    static const std::vector<Command> list = {
        {"info", "[--json] [--tre NAME] FILE...", "describe the files' headers, segments and TREs",
         "  --json         one JSON object per file (a JSON array for several files)\n"
         "  --tre NAME     show only the TREs of that identifier\n",
         runInfo},
        {"extract", "FILE [-i IMAGE] [-b BAND] -f raw|png|pgm -o OUT",
         "decode an image (default 0) to canonical raw bytes or a picture",
         "  -i IMAGE       the image segment, from 0\n"
         "  -b BAND        one band, from 0 (default: every band)\n"
         "  -f FORMAT      raw (canonical samples), png or pgm (for looking at)\n"
         "  -o OUT         the output file\n",
         runExtract},
        {"sample", "OUT.ntf", "write a small demo NITF 2.1 file", "", runSample},
        {"selfcheck", "[DIR]", "write fields to a file in DIR and read them back", "", runSelfCheck},
    };
    return list;
}
