// A.TOC tables built from known rectangles and frames through the library's record classes, for the tests,
// the tool's tests and the benchmarks.
#pragma once

#include <memory>
#include <string>
#include <vector>

#include "RpfSource.h"

// A boundary rectangle description with its frame paths ("" for no frame); the description's frame table
// points into `paths`.
struct RpfTestRectangle {
    RPFBoundaryRectangle_t description{};
    std::vector<std::string> paths;
    std::vector<char*> table;

    // A rectangle of rows x columns frames of frameDegrees north-south (1.25 times that east-west) from its
    // south-west corner; frames listed from the north-west corner row by row.
    RpfTestRectangle(const char* product, const char* scale, char zone, unsigned rows, unsigned columns,
                     double southLatitude, double westLongitude, double frameDegrees,
                     std::vector<std::string> frames);
    RpfTestRectangle(const RpfTestRectangle&) = delete;
    RpfTestRectangle& operator=(const RpfTestRectangle&) = delete;
};

using RpfTestRectangles = std::vector<std::unique_ptr<RpfTestRectangle>>;

// Two rectangles: 3 x 2 CADRG frames in ./RPF/ONC/ and ./RPF/TPC/ with one place empty, and one CIB frame
// at (0, 0) beside the table.
RpfTestRectangles knownRpfRectangles();

// A table of the rectangles laid out with the header section at `header` and the location section at
// `location`.
CRpfSource builtRpfToc(const RpfTestRectangles& rectangles, long long header, long long location);
// The bytes of a raw A.TOC file: the header section, then the location section at byte 48.
std::string rawRpfToc(const RpfTestRectangles& rectangles);
// The bytes of a NITF 2.0 A.TOC: the header section in the file header's RPFHDR TRE, the rest in an RPFDES
// TRE of a registered extensions DES.
std::string nitfWrappedRpfToc(const RpfTestRectangles& rectangles);
