// The georeferencing of an image segment: the coordinate type given by ICORDS and where IGEOLO lies in the
// file.
#pragma once

#include "HostCompat.h"
#include "NitfTypes.h"

class CNitfGeorefInfo {
public:
    enum eCoordinateType_t {
        eCoordinatesNone = 0,
        eCoordinatesGeographic = 1, // "G": ddmmssXdddmmssY
        eCoordinatesDecimal = 2,    // "D": +-dd.ddd+-ddd.ddd
        eCoordinatesUtmNorth = 3,   // "N" (2.1 family)
        eCoordinatesUtmSouth = 4,   // "S"
        eCoordinatesMgrs = 5,       // "U"
        eCoordinatesUps = 6,        // "P"
        eCoordinatesGeocentric = 7, // "C" (NITF 2.0)
        eCoordinatesOther = 8,      // present but not understood
    };

    CNitfGeorefInfo() : m_type(eCoordinatesNone), m_igeoloOffset(0) {}

    // Derives the coordinate type from ICORDS: a blank means none in the 2.1 family, "N" means none in
    // NITF 2.0 and 1.x (where it is UTM north in 2.1).
    void setCoordinateType(char icords, eNitfVersion_t version);
    eCoordinateType_t getCoordinateType() const { return m_type; }
    bool hasCoordinates() const { return m_type != eCoordinatesNone; }

    __int64 getIgeoloOffset() const { return m_igeoloOffset; }
    void setIgeoloOffset(__int64 offset) { m_igeoloOffset = offset; }

private:
    eCoordinateType_t m_type;
    __int64 m_igeoloOffset;
};
