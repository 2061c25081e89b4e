// The RPF table of contents of an A.TOC file tied to a file: read from the data of an RPFHDR TRE (a
// NITF-wrapped A.TOC) or from the start of a raw A.TOC, turned into boundary rectangle descriptions; and
// built rectangle by rectangle for a new product, measured and written.
#pragma once

#include <cstdio>
#include <string>

#include "HostCompat.h"
#include "RpfToc.h"

class CNitfTag;

// One boundary rectangle as callers see it, in both directions. The texts are NUL-terminated, without their
// padding blanks.
struct RPFBoundaryRectangle_t {
    char productDataType[6];
    char compressionRatio[6];
    char scale[13];
    char zone;
    char producer[6];
    // Corners, latitude and longitude in degrees.
    double upperLeftLatitude, upperLeftLongitude;
    double lowerLeftLatitude, lowerLeftLongitude;
    double upperRightLatitude, upperRightLongitude;
    double lowerRightLatitude, lowerRightLongitude;
    // Degrees per frame, north-south and east-west.
    double verticalInterval, horizontalInterval;
    unsigned int verticalFrames, horizontalFrames;
    // The frames' full paths (directory, then the file name), row by row from the north-west corner: entry
    // (verticalFrames - 1 - row) x horizontalFrames + column. Null where there is no frame.
    int frameCount;
    char** frameFiles;
};

class CRpfSource {
public:
    // Pixels along each side of a CADRG or CIB frame: the records count intervals per pixel, the descriptions
    // per frame.
    static const int kFramePixels = 1536;

    CRpfSource();

    // Reads the table whose header section is the data of `tag` (RPFHDR). Raises vexo::Exception when the
    // table is damaged: counts, offsets, record lengths or path lengths beyond the file, frames outside their
    // rectangles' grids, an unknown byte order.
    void readStart(FILE* fp, CNitfTag* tag);
    // The same for the header section at `headerOffset` (0 for a raw A.TOC).
    void readStartAt(FILE* fp, __int64 headerOffset);
    // One new description per boundary rectangle, then a null entry. Everything is allocated with HMalloc:
    // release it with freeRpfBoundaries. The stream is not used: the table was read by readStart.
    RPFBoundaryRectangle_t** readRpfBoundaries(FILE* fp);
    static void freeRpfBoundaries(RPFBoundaryRectangle_t** boundaries);

    // Starts an empty table for a new product.
    void writeStart();
    // Appends a rectangle and its frames (frames listed from the north-west corner row by row; null entries
    // are skipped); returns the rectangle's number. Raises vexo::Exception for frames beyond the grid, file
    // names longer than 12 characters, directories longer than 256, and tables beyond their counts' widths.
    int writeAddBoundaryRectangle(const RPFBoundaryRectangle_t& rectangle);
    // Lays the table out: the header section at `headerPosition`, the location section at `locationPosition`
    // and the four components after it, with every count, length, position and pathname offset.
    void writePrepareHeaders(__int64 headerPosition, __int64 locationPosition);
    // Writes the table where writePrepareHeaders placed it.
    void writeFinish(FILE* fp);

    // Serialized lengths: the header section (the RPFHDR data), the location section with the components, and
    // both.
    __int64 computeTagLength();
    __int64 computeComponentsLength();
    __int64 computeTotalLength();

    nitf::CRpfToc& getToc() { return m_toc; }
    int getBoundaryRectangleCount() const { return m_rectangleCount; }

    // The 6-character geographic location code of a point: 15-degree cells of longitude and latitude, whole
    // degrees within them (letters without I and O), and tenths of a degree (digits). (0, 0) is "NGAA00".
    static std::string getGeographicLocation(double latitude, double longitude);
    // Reads the header section alone at `offset`, in the byte order it gives; raises vexo::Exception for an
    // unknown byte order or a header beyond the end of the file.
    static void readHeaderSection(FILE* fp, __int64 offset, nitf::CRpfHeaderSection& header);
    // True when the stream starts with the header section of an A.TOC (a raw A.TOC file).
    static bool isRawToc(FILE* fp);

private:
    // Whether the values of the RPF sections whose header section is at `offset` are byte-reversed from this
    // host's order (the header's byte order indicator says).
    static bool swappingAt(FILE* fp, __int64 offset);
    // Bytes the fields produce, measured with a query.
    template <class Fields> static __int64 measure(Fields fields);
    void checkFrameTables() const;

    nitf::CRpfToc m_toc;
    int m_rectangleCount;
    __int64 m_headerPosition;
};
