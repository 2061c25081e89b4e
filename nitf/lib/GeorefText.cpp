#include "GeorefText.h"

#include <cctype>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <cstring>

#include "HostProjection.h"

namespace nitf_georef {

namespace {

using Form = CNitfGeorefInfo::eCoordinateType_t;

// `count` decimal digits at `text`, and nothing else.
bool digitsAt(const char* text, int count, long long* value) {
    long long result = 0;
    for (int i = 0; i < count; ++i) {
        if (!std::isdigit(static_cast<unsigned char>(text[i])))
            return false;
        result = result * 10 + (text[i] - '0');
    }
    *value = result;
    return true;
}

// "ddd.ffff": `whole` digits, a point and `fraction` digits.
bool fixedDecimalAt(const char* text, int whole, int fraction, double* value) {
    long long integer, decimals;
    if (!digitsAt(text, whole, &integer) || text[whole] != '.' ||
        !digitsAt(text + whole + 1, fraction, &decimals))
        return false;
    *value = static_cast<double>(integer) + static_cast<double>(decimals) / std::pow(10.0, fraction);
    return true;
}

// +1 for `positive`, -1 for `negative`, 0 for anything else.
int signOf(char c, char positive, char negative) {
    return c == positive ? 1 : c == negative ? -1 : 0;
}

bool isLatitude(double value) {
    return std::fabs(value) <= 90;
}

bool isLongitude(double value) {
    return std::fabs(value) <= 180;
}

// "ddmmssXdddmmssY" (whole seconds) or, with `secondDecimals`, "Xddmmss.ssYdddmmss.ss" is read by the two
// callers below from these parts: degrees of `degreeDigits`, minutes, seconds with optional decimals.
bool dmsAt(const char* text, int degreeDigits, int secondDecimals, double* value) {
    long long degrees, minutes;
    double seconds;
    if (!digitsAt(text, degreeDigits, &degrees) || !digitsAt(text + degreeDigits, 2, &minutes))
        return false;
    const char* secondText = text + degreeDigits + 2;
    if (secondDecimals > 0) {
        if (!fixedDecimalAt(secondText, 2, secondDecimals, &seconds))
            return false;
    } else {
        long long whole;
        if (!digitsAt(secondText, 2, &whole))
            return false;
        seconds = static_cast<double>(whole);
    }
    if (minutes >= 60 || seconds >= 60)
        return false;
    *value = DMSToDec(static_cast<int>(degrees), static_cast<int>(minutes), seconds, 0);
    return true;
}

bool parseDms(const char* text, CornerPoint* point) {
    double latitude, longitude;
    const int north = signOf(text[6], 'N', 'S'), east = signOf(text[14], 'E', 'W');
    if (!dmsAt(text, 2, 0, &latitude) || !dmsAt(text + 7, 3, 0, &longitude) || north == 0 || east == 0)
        return false;
    point->x = east * longitude;
    point->y = north * latitude;
    return isLatitude(point->y) && isLongitude(point->x);
}

bool parseDecimal(const char* text, CornerPoint* point) {
    double latitude, longitude;
    const int north = signOf(text[0], '+', '-'), east = signOf(text[7], '+', '-');
    if (north == 0 || east == 0 || !fixedDecimalAt(text + 1, 2, 3, &latitude) ||
        !fixedDecimalAt(text + 8, 3, 3, &longitude))
        return false;
    point->x = east * longitude;
    point->y = north * latitude;
    return isLatitude(point->y) && isLongitude(point->x);
}

bool parseUtm(const char* text, bool southern, CornerPoint* point) {
    long long zone, easting, northing;
    if (!digitsAt(text, 2, &zone) || !digitsAt(text + 2, 6, &easting) || !digitsAt(text + 8, 7, &northing) ||
        zone < 1 || zone > 60)
        return false;
    point->zone = static_cast<int>(zone);
    point->southern = southern;
    point->x = static_cast<double>(easting);
    point->y = static_cast<double>(northing);
    return true;
}

// MGRS latitude bands: C to X without I and O; N and later lie north of the equator.
bool isBandLetter(char c) {
    return c >= 'C' && c <= 'X' && c != 'I' && c != 'O';
}

bool parseMgrs(const char* text, CornerPoint* point) {
    long long zone, easting, northing;
    if (!digitsAt(text, 2, &zone) || zone < 1 || zone > 60 || !isBandLetter(text[2]) ||
        !std::isupper(static_cast<unsigned char>(text[3])) ||
        !std::isupper(static_cast<unsigned char>(text[4])) || !digitsAt(text + 5, 5, &easting) ||
        !digitsAt(text + 10, 5, &northing))
        return false;
    char reference[16];
    std::memcpy(reference, text, 15);
    reference[15] = '\0';
    double latitude, longitude;
    if (MGRSToGeocoded(reference, &latitude, &longitude) != 0)
        return false;
    // Back to UTM in the zone and hemisphere the reference names, which may differ from the point's
    // standard zone near a zone edge.
    ProjInfo_t utm;
    InitProjInfo(&utm);
    utm.system = PROJ_UTM;
    utm.zone = static_cast<int>(zone);
    utm.southern = text[2] < 'N';
    if (GeocodedToProj(&utm, latitude, longitude, &point->x, &point->y) != 0)
        return false;
    point->zone = utm.zone;
    point->southern = utm.southern;
    return true;
}

bool formatDms(const CornerPoint& point, char* text) {
    double longitude = std::remainder(point.x, 360.0); // -180 .. 180
    if (!isLatitude(point.y) || !std::isfinite(longitude))
        return false;
    int latDegrees, latMinutes, latNegative, lonDegrees, lonMinutes, lonNegative;
    double latSeconds, lonSeconds;
    DecToDMS(point.y, &latDegrees, &latMinutes, &latSeconds, &latNegative, 0);
    DecToDMS(longitude, &lonDegrees, &lonMinutes, &lonSeconds, &lonNegative, 0);
    std::snprintf(text, 16, "%02d%02d%02d%c%03d%02d%02d%c", latDegrees, latMinutes,
                  static_cast<int>(latSeconds), latNegative ? 'S' : 'N', lonDegrees, lonMinutes,
                  static_cast<int>(lonSeconds), lonNegative ? 'W' : 'E');
    return std::strlen(text) == 15;
}

bool formatDecimal(const CornerPoint& point, char* text) {
    const double longitude = std::remainder(point.x, 360.0);
    if (!isLatitude(point.y) || !std::isfinite(longitude))
        return false;
    // A value that rounds to zero from below keeps a sign that says which side it came from; either is valid.
    return std::snprintf(text, 16, "%+07.3f%+08.3f", point.y, longitude) == 15;
}

bool formatUtm(const CornerPoint& point, bool southern, char* text) {
    if (point.zone < 1 || point.zone > 60 || (point.southern != 0) != southern || !std::isfinite(point.x) ||
        !std::isfinite(point.y))
        return false;
    const double easting = std::round(point.x), northing = std::round(point.y);
    if (easting < 0 || easting > 999999 || northing < 0 || northing > 9999999)
        return false;
    std::snprintf(text, 16, "%02d%06lld%07lld", point.zone, static_cast<long long>(easting),
                  static_cast<long long>(northing));
    return true;
}

bool formatMgrs(const CornerPoint& point, char* text) {
    ProjInfo_t utm;
    InitProjInfo(&utm);
    utm.system = PROJ_UTM;
    utm.zone = point.zone;
    utm.southern = point.southern;
    double latitude, longitude;
    char reference[16];
    if (ProjToGeocoded(&utm, point.x, point.y, &latitude, &longitude) != 0 ||
        GeocodedToMGRS(latitude, longitude, 5, reference) != 0)
        return false;
    // Zones below 10 may come with one digit; the corner form always has two. Polar (UPS) references have
    // no zone at all and no place in this form.
    const size_t length = std::strlen(reference);
    if (length == 14 && std::isdigit(static_cast<unsigned char>(reference[0])))
        std::snprintf(text, 16, "0%s", reference);
    else if (length == 15 && std::isdigit(static_cast<unsigned char>(reference[0])))
        std::memcpy(text, reference, 16);
    else
        return false;
    return true;
}

// A signed decimal number filling `width` characters (blanks may pad it on the right).
bool signedNumberAt(const char* text, int width, double* value) {
    char field[32];
    if (width >= static_cast<int>(sizeof field))
        return false;
    std::memcpy(field, text, width);
    field[width] = '\0';
    for (int i = 0; i < width; ++i) {
        const char c = field[i];
        if (!std::isdigit(static_cast<unsigned char>(c)) && c != '+' && c != '-' && c != '.' && c != ' ')
            return false;
    }
    char* end = nullptr;
    *value = std::strtod(field, &end);
    if (end == field)
        return false;
    while (*end == ' ')
        ++end;
    return *end == '\0' && std::isfinite(*value);
}

} // namespace

int systemOfForm(Form form) {
    switch (form) {
    case CNitfGeorefInfo::eCoordinatesGeographic:
    case CNitfGeorefInfo::eCoordinatesDecimal:
        return PROJ_GEOGRAPHIC;
    case CNitfGeorefInfo::eCoordinatesGeocentric:
        return PROJ_GEOCENTRIC;
    case CNitfGeorefInfo::eCoordinatesUtmNorth:
    case CNitfGeorefInfo::eCoordinatesUtmSouth:
    case CNitfGeorefInfo::eCoordinatesMgrs:
        return PROJ_UTM;
    default:
        return PROJ_NONE;
    }
}

bool parseIgeoloCorner(Form form, const char* text, CornerPoint* point) {
    *point = CornerPoint();
    point->system = systemOfForm(form);
    switch (form) {
    case CNitfGeorefInfo::eCoordinatesGeographic:
    case CNitfGeorefInfo::eCoordinatesGeocentric:
        return parseDms(text, point);
    case CNitfGeorefInfo::eCoordinatesDecimal:
        return parseDecimal(text, point);
    case CNitfGeorefInfo::eCoordinatesUtmNorth:
        return parseUtm(text, false, point);
    case CNitfGeorefInfo::eCoordinatesUtmSouth:
        return parseUtm(text, true, point);
    case CNitfGeorefInfo::eCoordinatesMgrs:
        return parseMgrs(text, point);
    default:
        return false;
    }
}

bool formatIgeoloCorner(Form form, const CornerPoint& point, char* text) {
    if (point.system != systemOfForm(form) || point.system == PROJ_NONE)
        return false;
    switch (form) {
    case CNitfGeorefInfo::eCoordinatesGeographic:
    case CNitfGeorefInfo::eCoordinatesGeocentric:
        return formatDms(point, text);
    case CNitfGeorefInfo::eCoordinatesDecimal:
        return formatDecimal(point, text);
    case CNitfGeorefInfo::eCoordinatesUtmNorth:
        return formatUtm(point, false, text);
    case CNitfGeorefInfo::eCoordinatesUtmSouth:
        return formatUtm(point, true, text);
    case CNitfGeorefInfo::eCoordinatesMgrs:
        return formatMgrs(point, text);
    default:
        return false;
    }
}

bool parseBlockaLocation(const char* text, double* latitude, double* longitude) {
    double lat, lon;
    int north, east;
    if (text[0] == '+' || text[0] == '-') {
        north = signOf(text[0], '+', '-');
        east = signOf(text[10], '+', '-');
        if (east == 0 || !fixedDecimalAt(text + 1, 2, 6, &lat) || !fixedDecimalAt(text + 11, 3, 6, &lon))
            return false;
    } else {
        north = signOf(text[0], 'N', 'S');
        east = signOf(text[10], 'E', 'W');
        if (north == 0 || east == 0 || !dmsAt(text + 1, 2, 2, &lat) || !dmsAt(text + 11, 3, 2, &lon))
            return false;
    }
    *latitude = north * lat;
    *longitude = east * lon;
    return isLatitude(*latitude) && isLongitude(*longitude);
}

bool parseGeolob(const char* text, GeolobGrid* grid) {
    long long arv, brv;
    if (!digitsAt(text, 9, &arv) || !digitsAt(text + 9, 9, &brv) || arv == 0 || brv == 0 ||
        !signedNumberAt(text + 18, 15, &grid->lso) || !signedNumberAt(text + 33, 15, &grid->pso))
        return false;
    grid->arv = static_cast<double>(arv);
    grid->brv = static_cast<double>(brv);
    return isLongitude(grid->lso) && isLatitude(grid->pso);
}

} // namespace nitf_georef
