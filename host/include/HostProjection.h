// Host projection service: the projection record that georeferencing fills, and the conversions it relies on.
#pragma once

// Coordinate systems a projection record can describe.
enum ProjSystem_t {
    PROJ_NONE = 0,
    PROJ_GEOGRAPHIC = 1, // latitude/longitude, degrees
    PROJ_UTM = 2,        // UTM, zone and hemisphere in the record
    PROJ_UPS = 3,        // universal polar stereographic
    PROJ_GEOCENTRIC = 4, // geocentric latitude/longitude, degrees
};

// Earth models (datum and ellipsoid) known to the service.
enum EarthModel_t {
    EARTH_WGS84 = 0,
    EARTH_UNKNOWN = -1,
};

// The host's projection record: the image's coordinate system and its georeferencing as an affine transform from
// pixel (column, row) to map (x, y), plus the four corners as they were given.
struct ProjInfo_t {
    int system;       // ProjSystem_t
    int zone;         // UTM zone 1..60; 0 when not UTM
    int southern;     // non-zero for the southern hemisphere (UTM, UPS)
    int earthModel;   // EarthModel_t
    double affine[6]; // x = a0 + a1*col + a2*row, y = a3 + a4*col + a5*row
    double cornerX[4], cornerY[4]; // corners in the record's system, NITF corner order (UL, UR, LR, LL)
    int hasCorners;
};

// Empties a record (system PROJ_NONE, WGS-84).
void InitProjInfo(ProjInfo_t* info);

// Fills system, zone and hemisphere from a coordinate system text ("GEO", "UTM 17N", "UPS S", ...);
// returns 0 on success, -1 when the text is not understood.
int DecodeGeosys(ProjInfo_t* info, const char* geosys);

// The earth model of a datum or ellipsoid name ("WGS84", "WGE", ...), or EARTH_UNKNOWN.
int GetEarthModel(const char* name);

// Geodetic latitude/longitude (degrees, WGS-84) to an MGRS reference of `precision` digits per axis (0..5)
// written into `mgrs` (at least 16 bytes). Returns 0 on success.
int GeocodedToMGRS(double latitude, double longitude, int precision, char* mgrs);

// An MGRS reference to the latitude/longitude of its south-west corner. Returns 0 on success.
int MGRSToGeocoded(const char* mgrs, double* latitude, double* longitude);

// Sets the affine transform of `info` from four corners in its own system, for an image of `width` by `height`
// pixels, and keeps the corners in the record; returns 0 on success, -1 for a size below 1 or a non-finite corner.
// As in IGEOLO, a corner is the centre of the corner pixel: UL is pixel (0, 0), UR (width-1, 0), LR
// (width-1, height-1), LL (0, height-1). The transform is fitted to UL, UR and LL; an image one pixel wide (high)
// gets a zero step along its columns (rows).
int ProjSetGeoreferenceFromCorners(ProjInfo_t* info, const double cornerX[4], const double cornerY[4], int width,
                                   int height);

// Degrees, minutes and seconds to decimal degrees (the sign of `degrees` or a non-zero `negative` makes it south or
// west), and back (seconds rounded to `secondDecimals` places).
double DMSToDec(int degrees, int minutes, double seconds, int negative);
void DecToDMS(double value, int* degrees, int* minutes, double* seconds, int* negative, int secondDecimals);
