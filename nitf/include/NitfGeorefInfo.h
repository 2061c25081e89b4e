// The georeferencing of an image segment: the coordinate type given by ICORDS, where IGEOLO lies in the file,
// and the bridge between the image's corner coordinates (IGEOLO and the more precise corners of the BLOCKA
// and GEOLOB TREs or of an RPF frame's coverage) and the host's projection record; also the image's sensor
// model.
#pragma once

#include <cstdio>

#include "HostCompat.h"
#include "HostProjection.h"
#include "NitfTypes.h"

class CNitfImageSubheader;
class CRpcSource;

class CNitfGeorefInfo {
public:
    enum eCoordinateType_t {
        eCoordinatesNone = 0,
        eCoordinatesGeographic = 1, // "G": ddmmssXdddmmssY
        eCoordinatesDecimal = 2,    // "D": +-dd.ddd+-ddd.ddd
        eCoordinatesUtmNorth = 3,   // "N" (2.1 family)
        eCoordinatesUtmSouth = 4,   // "S"
        eCoordinatesMgrs = 5,       // "U"
        eCoordinatesUps = 6,        // "P": present, not decoded
        eCoordinatesGeocentric = 7, // "C" (NITF 2.0)
        eCoordinatesOther = 8,      // present but not understood
    };

    // Where the corners of the last read came from.
    enum eCornerSource_t {
        eCornerSourceNone = 0,
        eCornerSourceIgeolo = 1,
        eCornerSourceBlocka = 2,
        eCornerSourceGeolob = 3,
        eCornerSourceRpfCoverage = 4,
    };

    CNitfGeorefInfo();

    // Derives the coordinate type from ICORDS: a blank means none in the 2.1 family, "N" means none in
    // NITF 2.0 and 1.x (where it is UTM north in 2.1).
    void setCoordinateType(char icords, eNitfVersion_t version);
    eCoordinateType_t getCoordinateType() const { return m_type; }
    bool hasCoordinates() const { return m_type != eCoordinatesNone; }
    // The ICORDS letter that writes a record of `info`'s system in a file of `version`: "G" for geographic
    // records and for every NITF 2.0 file, "N" or "S" for UTM; a blank (2.1) or "N" (2.0) when the record has
    // no georeferencing.
    static char chooseIcords(const ProjInfo_t* info, eNitfVersion_t version);

    __int64 getIgeoloOffset() const { return m_igeoloOffset; }
    void setIgeoloOffset(__int64 offset) { m_igeoloOffset = offset; }

    // The corners of an RPF frame's coverage (CADRG, CIB), in NITF corner order, degrees on WGS-84: once set
    // (a precise read sets them from the image's RPFIMG coverage section), a precise read takes them in place
    // of IGEOLO.
    void setCoverageCorners(const double latitude[4], const double longitude[4]);
    bool hasCoverageCorners() const { return m_hasCoverage; }

    // Fills `info` with the georeferencing of an image of `width` x `height` pixels (the actual image size):
    // IGEOLO, read from the stream at the IGEOLO offset, in its own system (geographic for G, D and C, UTM in
    // the first corner's zone for N, S and U). When `precise` is set, the most precise of the RPF coverage
    // corners, the GEOLOB grid and the BLOCKA corners replaces it, provided it agrees with IGEOLO to within
    // IGEOLO's precision (it is then geographic). `info` is emptied first; what cannot be decoded is warned
    // about and leaves it without corners. The stream's position is kept.
    void read(FILE* fp, CNitfImageSubheader* subheader, ProjInfo_t* info, int width, int height,
              bool precise);
    // Writes IGEOLO at the IGEOLO offset in the form of the coordinate type, with the corners of an image of
    // `width` x `height` pixels taken from `info` (interpolated or extrapolated when `info` describes another
    // size). Does nothing without coordinates; raises vexo::Exception when `info` has no georeferencing or a
    // corner cannot be written in the form. The stream's position is kept.
    void write(FILE* fp, ProjInfo_t* info, int width, int height);
    eCornerSource_t getCornerSource() const { return m_cornerSource; }

    // The image's sensor model: the rational polynomial coefficients of RPC00B, else RPC00A, read from the
    // stream, mapped to the image through its ICHIPB chip when it has one. Null when the image has neither
    // TRE or it cannot be read (with a warning). The caller owns the result.
    CRpcSource* getNewSensorModel(FILE* fp, CNitfImageSubheader* subheader) const;

private:
    // Sets the coverage corners from the RPFIMG coverage section of the sub-header; false without one.
    bool coverageOfFrame(FILE* fp, CNitfImageSubheader& subheader);

    eCoordinateType_t m_type;
    __int64 m_igeoloOffset;
    eCornerSource_t m_cornerSource;
    bool m_hasCoverage;
    double m_coverageLatitude[4], m_coverageLongitude[4];
};
