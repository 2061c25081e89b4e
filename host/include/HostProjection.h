// Host projection service: the projection record that georeferencing fills, and the conversions it relies on.
#pragma once

#include <cstddef>

// Coordinate systems a projection record can describe. Georeferencing fills records in PROJ_GEOGRAPHIC or
// PROJ_UTM; the others are understood by the conversions below.
enum ProjSystem_t {
    PROJ_NONE = 0,
    PROJ_GEOGRAPHIC = 1, // geodetic longitude (x) and latitude (y), degrees
    PROJ_UTM = 2,        // UTM easting (x) and northing (y), metres, in the record's zone and hemisphere
    PROJ_UPS = 3,        // universal polar stereographic, metres, in the record's hemisphere
    PROJ_GEOCENTRIC = 4, // longitude (x) and geocentric latitude (y), degrees
};

// Earth models (datum and ellipsoid) known to the service.
enum EarthModel_t {
    EARTH_WGS84 = 0,
    EARTH_UNKNOWN = -1,
};

// The host's projection record: an image's coordinate system and where its pixels lie in it.
//
// Pixel positions are (column, row) of pixel centres: (0, 0) is the centre of the first pixel, as for the
// corners of IGEOLO. Two descriptions may be present:
// - corners: the centres of the four corner pixels of a `width` x `height` image, in NITF order (first row
// first
//   column, first row last column, last row last column, last row first column). Between and beyond them a
//   position is interpolated bilinearly.
// - affine: x = a0 + a1*col + a2*row, y = a3 + a4*col + a5*row. Set from corners only when the four corners
//   form a parallelogram to within half a pixel; otherwise the corners stand as tie points alone.
struct ProjInfo_t {
    int system;     // ProjSystem_t
    int zone;       // UTM zone 1..60; 0 when not UTM
    int southern;   // non-zero for the southern hemisphere (UTM, UPS)
    int earthModel; // EarthModel_t
    int width, height;
    int hasAffine;
    double affine[6];
    int hasCorners;
    double cornerX[4], cornerY[4];
};

// Empties a record (system PROJ_NONE, WGS-84, no corners, no transform).
void InitProjInfo(ProjInfo_t* info);

// Fills system, zone and hemisphere from a coordinate system text ("GEO", "UTM 17N", "UPS S", ...);
// returns 0 on success, -1 when the text is not understood.
int DecodeGeosys(ProjInfo_t* info, const char* geosys);
// The coordinate system text of a record ("GEO", "UTM 17N", "UPS S", "GEOCENTRIC"), as DecodeGeosys reads it
// back, into `text` of `size` bytes; returns 0, or -1 for PROJ_NONE or a text that does not fit.
int EncodeGeosys(const ProjInfo_t* info, char* text, size_t size);

// The earth model of a datum or ellipsoid name ("WGS84", "WGE", ...), or EARTH_UNKNOWN.
int GetEarthModel(const char* name);

// Geodetic latitude/longitude (degrees, WGS-84) to an MGRS reference of `precision` digits per axis (0..5)
// written into `mgrs` (at least 16 bytes), in the point's standard UTM zone (or UPS). Returns 0 on success.
int GeocodedToMGRS(double latitude, double longitude, int precision, char* mgrs);

// An MGRS reference to the latitude/longitude of its south-west corner. Returns 0 on success.
int MGRSToGeocoded(const char* mgrs, double* latitude, double* longitude);

// Sets the georeferencing of `info` from the centres of the four corner pixels of a `width` by `height` image
// (NITF order, in the record's system): keeps them as corners, and sets the affine transform fitted to the
// first-row-first-column, first-row-last-column and last-row-first-column corners when the fourth lies within
// half a pixel of where that transform puts it. An image one pixel wide (high) gets a zero step along its
// columns (rows). Returns 0 on success, -1 for a size below 1 or a non-finite corner.
int ProjSetGeoreferenceFromCorners(ProjInfo_t* info, const double cornerX[4], const double cornerY[4],
                                   int width, int height);

// The record's coordinates of pixel position (col, row): bilinear in the corners when the record has them,
// else by the affine transform. Returns 0, or -1 when the record has neither.
int ProjPixelToMap(const ProjInfo_t* info, double col, double row, double* x, double* y);

// A point of the record's system to geodetic latitude/longitude on WGS-84 and back. The UTM conversions keep
// the record's zone and hemisphere even for points outside them (northings below 0 or above 10 000 km).
// Return 0, or -1 for an unknown system or earth model, or a point the system cannot represent.
int ProjToGeocoded(const ProjInfo_t* info, double x, double y, double* latitude, double* longitude);
int GeocodedToProj(const ProjInfo_t* info, double latitude, double longitude, double* x, double* y);

// Degrees, minutes and seconds to decimal degrees (the sign of `degrees` or a non-zero `negative` makes it
// south or west), and back (seconds rounded to `secondDecimals` places).
double DMSToDec(int degrees, int minutes, double seconds, int negative);
void DecToDMS(double value, int* degrees, int* minutes, double* seconds, int* negative, int secondDecimals);
