// The tool's commands, in the order `nitf --help` lists them.
#include "CommandLine.h"
#include "Commands.h"

const std::vector<cli::Command>& cli::commands() {
    static const std::vector<Command> list = {
        {"info", "[--json] [--tre NAME] FILE...", "describe the files' headers, segments and TREs",
         "  --json         one JSON object per file (a JSON array for several files)\n"
         "  --tre NAME     show only the TREs of that identifier\n",
         runInfo},
        {"extract", "FILE -f raw|png|pgm|tiff -o OUT [options]",
         "decode an image to canonical raw samples, a picture or a GeoTIFF",
         "  raw   the canonical samples: band after band, each band's rows top first, each sample in\n"
         "        ceil(NBPP/8) bytes big-endian as stored (0 or 1 for NBPP 1)\n"
         "  png   a picture for looking at (look-up tables applied, three bands as RGB, a colour table's\n"
         "        no-data code clear); pgm: the same as PGM/PPM\n"
         "  tiff  a GeoTIFF of the samples in their own types, with the image's corners, RPC model, colour\n"
         "        map and pad value (the whole image, into a file)\n"
         "OUT may be - for standard output (raw, png, pgm). Warnings go to stderr; the exit status is 1 "
         "when\n"
         "blocks could not be read (they are written as zeros).\n"
         "\n"
         "  -i, --image N          image segment, from 0 (default 0)\n"
         "  -b, --band N           one band, from 0\n"
         "      --bands LIST       bands, from 0, in this order: 0,2,1\n"
         "      --window X,Y,W,H   part of the image: W x H pixels from column X, row Y\n"
         "      --level N          a reduced resolution level (JPEG 2000): the image halved N times; the\n"
         "                         window is at that level\n"
         "  -j, --threads N        decoding (raw) or compressing (tiff) threads (default: the processors)\n"
         "      --cog              tiff: Cloud-Optimized (tiled, compressed, internal overviews)\n"
         "      --compress C       tiff: deflate (the default), zstd or none\n"
         "      --allow-partial    exit 0 even when blocks could not be read\n",
         runExtract},
        {"toc", "[--json] PATH",
         "an RPF table of contents (A.TOC, raw or NITF-wrapped) or a CADRG/CIB frame file",
         "  --json         the same as one JSON object\n"
         "The boundary rectangles with their products, scales, zones, corners and frame grids, each frame's\n"
         "path and whether the file is there; or, for a frame file, its coverage, colours, transparent\n"
         "pixel code and location code.\n",
         runToc},
        {"sample", "OUT.ntf", "write a small demo NITF 2.1 file", "", runSample},
        {"selfcheck", "[DIR]", "write fields to a file in DIR and read them back", "", runSelfCheck},
    };
    return list;
}
