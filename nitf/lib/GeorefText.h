// The text forms of image coordinates: the four 15-character corner forms of IGEOLO, the 21-character corner
// locations of the BLOCKA TRE and the geographic grid of the GEOLOB TRE. Parsing refuses anything that is not
// exactly the form, so that damaged fields are reported instead of becoming wrong coordinates.
#pragma once

#include "NitfGeorefInfo.h"

namespace nitf_georef {

// A point as a corner text gives it, in the system of its form (a ProjSystem_t): longitude (x) and latitude
// (y) in degrees for PROJ_GEOGRAPHIC and PROJ_GEOCENTRIC; easting (x) and northing (y) in metres, with the
// zone and hemisphere, for PROJ_UTM.
struct CornerPoint {
    int system = 0;
    int zone = 0;
    int southern = 0;
    double x = 0, y = 0;
};

// The system a corner form's points are in (PROJ_NONE for forms that are not decoded).
int systemOfForm(CNitfGeorefInfo::eCoordinateType_t form);

// Decodes one IGEOLO corner (15 characters, not NUL-terminated) of the given form. An MGRS corner becomes UTM
// in the zone and hemisphere that it names. False when the text is not that form or names no point.
bool parseIgeoloCorner(CNitfGeorefInfo::eCoordinateType_t form, const char* text, CornerPoint* point);

// Writes one IGEOLO corner of the given form (15 characters and a NUL). `point` must be in the form's system;
// an MGRS corner takes a UTM point and is written in the point's own standard zone, truncated to the metre.
// False when the point cannot be written in the form (outside its ranges, or a form that is not written).
bool formatIgeoloCorner(CNitfGeorefInfo::eCoordinateType_t form, const CornerPoint& point, char* text);

// A BLOCKA corner location (21 characters): "+dd.dddddd+ddd.dddddd" or "Nddmmss.ssEdddmmss.ss". False when it
// is blank (unknown) or not one of the two forms.
bool parseBlockaLocation(const char* text, double* latitude, double* longitude);

// The geographic grid of GEOLOB (48 characters): pixels per 360 degrees of longitude (ARV) and of latitude
// (BRV), and the longitude (LSO) and latitude (PSO) of the outer corner of the first pixel.
struct GeolobGrid {
    double arv = 0, brv = 0, lso = 0, pso = 0;
};
bool parseGeolob(const char* text, GeolobGrid* grid);

} // namespace nitf_georef
