// What a CADRG or CIB frame file says about itself: its RPF header section, the corners and intervals of its
// coverage section, the colours its pixel indexes stand for (the image's look-up tables), the pixel code that
// stands for no data, and the geographic location code of its south-west corner.
#pragma once

#include <cstdio>
#include <string>
#include <vector>

#include "RpfHeaderSection.h"

class CNitfFileReader;
class CNitfImageSubheader;

// The coverage section of a frame: corners in degrees, resolutions in metres per pixel, intervals in degrees
// per pixel.
struct RpfCoverage_t {
    double upperLeftLatitude, upperLeftLongitude;
    double lowerLeftLatitude, lowerLeftLongitude;
    double upperRightLatitude, upperRightLongitude;
    double lowerRightLatitude, lowerRightLongitude;
    double verticalResolution, horizontalResolution;
    double verticalInterval, horizontalInterval;
};

struct RpfColour_t {
    unsigned char red, green, blue, alpha;
};

class CRpfFrame {
public:
    // Reads the description of the frame in image `image` of an open reader. Raises vexo::Exception when the
    // file has no RPF header section (no RPFHDR TRE) or the image does not exist.
    CRpfFrame(CNitfFileReader& reader, int image = 0);

    const nitf::CRpfHeaderSection& getHeader() const { return m_header; }
    std::string getFileName() const { return nitf::textOf(m_header.fileName); }

    // The coverage section, when the image's RPFIMG TRE carries one.
    bool hasCoverage() const { return m_hasCoverage; }
    const RpfCoverage_t& getCoverage() const { return m_coverage; }
    // The code of the coverage's south-west corner (CRpfSource::getGeographicLocation); empty without
    // coverage.
    std::string getLocationCode() const;

    // One colour per look-up table entry (three tables: red, green, blue; one: grey), opaque but for the
    // transparent code's entry. Empty when the image has no look-up table.
    const std::vector<RpfColour_t>& getColours() const { return m_colours; }
    // The pixel code that stands for no data (absent subframes): the transparent output pixel code of the
    // image's mask when it has one, else the first code past the colours (216 for CADRG and CIB, whose 216
    // colours leave it unused); -1 when every code is a colour.
    int getTransparentCode() const { return m_transparentCode; }
    bool isTransparentCodeStored() const { return m_transparentCodeStored; }

    // The coverage section carried in the RPFIMG TRE of an image sub-header read from `fp`; false when there
    // is none.
    static bool readCoverage(FILE* fp, CNitfImageSubheader& subheader, RpfCoverage_t& coverage);

private:
    void readHeader(CNitfFileReader& reader);
    void readColours(CNitfFileReader& reader, CNitfImageSubheader& subheader);
    void readTransparentCode(CNitfFileReader& reader, int image);

    nitf::CRpfHeaderSection m_header;
    bool m_hasCoverage;
    RpfCoverage_t m_coverage;
    std::vector<RpfColour_t> m_colours;
    int m_transparentCode;
    bool m_transparentCodeStored;
};
