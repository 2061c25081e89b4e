// Default host projection service: the projection record, coordinate-system texts, DMS conversions, and the
// UTM, UPS, MGRS and geocentric conversions on WGS-84 (through GeographicLib).
#include "HostProjection.h"

#include <cctype>
#include <cmath>
#include <cstdio>
#include <cstring>
#include <exception>
#include <string>

#include <GeographicLib/Constants.hpp>
#include <GeographicLib/MGRS.hpp>
#include <GeographicLib/UTMUPS.hpp>

#include "HostCompat.h"

namespace {

// `text` without surrounding white space, upper-cased: fixed-width fields arrive space-padded.
std::string normalized(const char* text) {
    std::string result;
    for (const char* c = text; c && *c; ++c)
        result += static_cast<char>(std::toupper(static_cast<unsigned char>(*c)));
    size_t first = result.find_first_not_of(" \t\r\n");
    if (first == std::string::npos)
        return "";
    return result.substr(first, result.find_last_not_of(" \t\r\n") - first + 1);
}

// Reads an optional run of blanks at `pos`.
void skipBlanks(const std::string& text, size_t& pos) {
    while (pos < text.size() && text[pos] == ' ')
        ++pos;
}

// Reads the hemisphere letter at `pos` as the last character of `text`: 1 for S, 0 for N, -1 otherwise.
int hemisphereAtEnd(const std::string& text, size_t pos) {
    if (pos + 1 != text.size())
        return -1;
    return text[pos] == 'S' ? 1 : text[pos] == 'N' ? 0 : -1;
}

// UTM's false northing of the southern hemisphere.
const double kFalseNorthing = 10000000.0;

// WGS-84's first eccentricity squared.
double eccentricitySquared() {
    const double f = GeographicLib::Constants::WGS84_f();
    return f * (2 - f);
}

// tan(geodetic) = tan(geocentric) / (1 - e²), for points on the ellipsoid; the poles map to themselves.
double geodeticLatitude(double geocentric) {
    if (std::fabs(geocentric) >= 90)
        return geocentric;
    const double radians = geocentric * M_PI / 180;
    return std::atan(std::tan(radians) / (1 - eccentricitySquared())) * 180 / M_PI;
}

double geocentricLatitude(double geodetic) {
    if (std::fabs(geodetic) >= 90)
        return geodetic;
    const double radians = geodetic * M_PI / 180;
    return std::atan(std::tan(radians) * (1 - eccentricitySquared())) * 180 / M_PI;
}

bool allFinite(const double values[4]) {
    for (int i = 0; i < 4; ++i)
        if (!std::isfinite(values[i]))
            return false;
    return true;
}

// Longitudes of an image across the antimeridian (174E to 169W) taken on from the first corner (to 191E), so
// that positions between the corners step east rather than most of the way round the earth.
void unwrapLongitudes(const ProjInfo_t& info, const double cornerX[4], double out[4]) {
    for (int i = 0; i < 4; ++i) {
        out[i] = cornerX[i];
        if (info.system == PROJ_GEOGRAPHIC || info.system == PROJ_GEOCENTRIC) {
            while (out[i] - cornerX[0] > 180)
                out[i] -= 360;
            while (out[i] - cornerX[0] < -180)
                out[i] += 360;
        }
    }
}

} // namespace

void InitProjInfo(ProjInfo_t* info) {
    if (!info)
        return;
    *info = ProjInfo_t{};
    info->system = PROJ_NONE;
    info->earthModel = EARTH_WGS84;
}

int DecodeGeosys(ProjInfo_t* info, const char* geosys) {
    if (!info)
        return -1;
    std::string text = normalized(geosys);
    int system = PROJ_NONE, zone = 0, southern = 0;
    if (text == "GEO") {
        system = PROJ_GEOGRAPHIC;
    } else if (text == "GEOCENTRIC") {
        system = PROJ_GEOCENTRIC;
    } else if (text.compare(0, 3, "UTM") == 0) {
        size_t pos = 3;
        skipBlanks(text, pos);
        size_t digits = 0;
        while (pos < text.size() && digits < 3 && std::isdigit(static_cast<unsigned char>(text[pos]))) {
            zone = zone * 10 + (text[pos++] - '0');
            ++digits;
        }
        skipBlanks(text, pos);
        southern = hemisphereAtEnd(text, pos);
        if (digits == 0 || zone < 1 || zone > 60 || southern < 0)
            return -1;
        system = PROJ_UTM;
    } else if (text.compare(0, 3, "UPS") == 0) {
        size_t pos = 3;
        skipBlanks(text, pos);
        southern = hemisphereAtEnd(text, pos);
        if (southern < 0)
            return -1;
        system = PROJ_UPS;
    } else {
        return -1;
    }
    info->system = system;
    info->zone = zone;
    info->southern = southern;
    return 0;
}

int EncodeGeosys(const ProjInfo_t* info, char* text, size_t size) {
    if (!info || !text || size == 0)
        return -1;
    const char hemisphere = info->southern ? 'S' : 'N';
    int length = -1;
    switch (info->system) {
    case PROJ_GEOGRAPHIC:
        length = std::snprintf(text, size, "GEO");
        break;
    case PROJ_GEOCENTRIC:
        length = std::snprintf(text, size, "GEOCENTRIC");
        break;
    case PROJ_UTM:
        length = std::snprintf(text, size, "UTM %d%c", info->zone, hemisphere);
        break;
    case PROJ_UPS:
        length = std::snprintf(text, size, "UPS %c", hemisphere);
        break;
    default:
        break;
    }
    if (length < 0 || static_cast<size_t>(length) >= size) {
        text[0] = '\0';
        return -1;
    }
    return 0;
}

int GetEarthModel(const char* name) {
    std::string text = normalized(name);
    if (text == "WGS84" || text == "WGS-84" || text == "WGS 84" || text == "WGE")
        return EARTH_WGS84;
    return EARTH_UNKNOWN;
}

int GeocodedToMGRS(double latitude, double longitude, int precision, char* mgrs) {
    if (!mgrs || precision < 0 || precision > 5)
        return -1;
    try {
        int zone;
        bool northern;
        double x, y;
        GeographicLib::UTMUPS::Forward(latitude, longitude, zone, northern, x, y);
        // MGRS truncates toward the south-west; a point that came from whole metres and went through a
        // latitude/longitude round trip must not lose a metre to a rounding error a billion times smaller.
        x = std::round(x * 1e6) / 1e6;
        y = std::round(y * 1e6) / 1e6;
        std::string text;
        GeographicLib::MGRS::Forward(zone, northern, x, y, latitude, precision, text);
        if (text.size() > 15)
            return -1;
        std::memcpy(mgrs, text.c_str(), text.size() + 1);
        return 0;
    } catch (const std::exception&) {
        return -1;
    }
}

int MGRSToGeocoded(const char* mgrs, double* latitude, double* longitude) {
    if (!mgrs || !latitude || !longitude)
        return -1;
    try {
        int zone, precision;
        bool northern;
        double x, y;
        GeographicLib::MGRS::Reverse(normalized(mgrs), zone, northern, x, y, precision, false);
        GeographicLib::UTMUPS::Reverse(zone, northern, x, y, *latitude, *longitude);
        return 0;
    } catch (const std::exception&) {
        return -1;
    }
}

int ProjSetGeoreferenceFromCorners(ProjInfo_t* info, const double cornerX[4], const double cornerY[4],
                                   int width, int height) {
    if (!info || !cornerX || !cornerY || width < 1 || height < 1 || !allFinite(cornerX) ||
        !allFinite(cornerY))
        return -1;
    enum { UL = 0, UR = 1, LR = 2, LL = 3 }; // NITF corner order
    const double* given = cornerX;
    double unwrapped[4];
    unwrapLongitudes(*info, cornerX, unwrapped);
    cornerX = unwrapped;
    // An image one pixel wide or high has no extent along that axis, so its step there is zero.
    const double lastCol = width - 1, lastRow = height - 1;
    auto step = [](double from, double to, double span) { return span > 0 ? (to - from) / span : 0.0; };
    double* a = info->affine;
    a[0] = cornerX[UL];
    a[1] = step(cornerX[UL], cornerX[UR], lastCol);
    a[2] = step(cornerX[UL], cornerX[LL], lastRow);
    a[3] = cornerY[UL];
    a[4] = step(cornerY[UL], cornerY[UR], lastCol);
    a[5] = step(cornerY[UL], cornerY[LL], lastRow);

    // How far, in pixels, the given last corner lies from where the transform puts it.
    const double missX = cornerX[LR] - (a[0] + a[1] * lastCol + a[2] * lastRow);
    const double missY = cornerY[LR] - (a[3] + a[4] * lastCol + a[5] * lastRow);
    const double determinant = a[1] * a[5] - a[2] * a[4];
    bool parallelogram;
    if (determinant != 0) {
        const double missCol = (missX * a[5] - missY * a[2]) / determinant;
        const double missRow = (missY * a[1] - missX * a[4]) / determinant;
        parallelogram = std::fabs(missCol) <= 0.5 && std::fabs(missRow) <= 0.5;
    } else {
        // No pixel size to measure with (a single row or column): only an exact fit will do.
        const double scale = std::fabs(cornerX[UL]) + std::fabs(cornerY[UL]) + 1;
        parallelogram = std::fabs(missX) + std::fabs(missY) <= 1e-12 * scale;
    }
    info->hasAffine = parallelogram ? 1 : 0;
    for (int i = 0; i < 4; ++i) {
        info->cornerX[i] = given[i]; // as given: they are written back as they came
        info->cornerY[i] = cornerY[i];
    }
    info->width = width;
    info->height = height;
    info->hasCorners = 1;
    return 0;
}

int ProjPixelToMap(const ProjInfo_t* info, double col, double row, double* x, double* y) {
    if (!info || !x || !y)
        return -1;
    if (info->hasCorners && info->width >= 1 && info->height >= 1) {
        // Bilinear in the corners: exact at the corners themselves, and the affine map for a parallelogram.
        const double u = info->width > 1 ? col / (info->width - 1) : 0;
        const double v = info->height > 1 ? row / (info->height - 1) : 0;
        const double w[4] = {(1 - u) * (1 - v), u * (1 - v), u * v, (1 - u) * v};
        double cornerX[4];
        unwrapLongitudes(*info, info->cornerX, cornerX);
        *x = *y = 0;
        for (int i = 0; i < 4; ++i) {
            *x += w[i] * cornerX[i];
            *y += w[i] * info->cornerY[i];
        }
        return 0;
    }
    if (info->hasAffine) {
        const double* a = info->affine;
        *x = a[0] + a[1] * col + a[2] * row;
        *y = a[3] + a[4] * col + a[5] * row;
        return 0;
    }
    return -1;
}

int ProjToGeocoded(const ProjInfo_t* info, double x, double y, double* latitude, double* longitude) {
    if (!info || !latitude || !longitude || info->earthModel != EARTH_WGS84 || !std::isfinite(x) ||
        !std::isfinite(y))
        return -1;
    try {
        switch (info->system) {
        case PROJ_GEOGRAPHIC:
            if (std::fabs(y) > 90)
                return -1;
            *latitude = y;
            *longitude = x;
            return 0;
        case PROJ_GEOCENTRIC:
            if (std::fabs(y) > 90)
                return -1;
            *latitude = geodeticLatitude(y);
            *longitude = x;
            return 0;
        case PROJ_UTM: {
            if (info->zone < 1 || info->zone > 60)
                return -1;
            // A northing outside the record's hemisphere belongs to the other one.
            bool northern = !info->southern;
            if (northern && y < 0) {
                northern = false;
                y += kFalseNorthing;
            } else if (!northern && y >= kFalseNorthing) {
                northern = true;
                y -= kFalseNorthing;
            }
            GeographicLib::UTMUPS::Reverse(info->zone, northern, x, y, *latitude, *longitude);
            return 0;
        }
        case PROJ_UPS:
            GeographicLib::UTMUPS::Reverse(GeographicLib::UTMUPS::UPS, !info->southern, x, y, *latitude,
                                           *longitude);
            return 0;
        default:
            return -1;
        }
    } catch (const std::exception&) {
        return -1;
    }
}

int GeocodedToProj(const ProjInfo_t* info, double latitude, double longitude, double* x, double* y) {
    if (!info || !x || !y || info->earthModel != EARTH_WGS84 || !std::isfinite(latitude) ||
        !std::isfinite(longitude) || std::fabs(latitude) > 90)
        return -1;
    try {
        switch (info->system) {
        case PROJ_GEOGRAPHIC:
            *x = longitude;
            *y = latitude;
            return 0;
        case PROJ_GEOCENTRIC:
            *x = longitude;
            *y = geocentricLatitude(latitude);
            return 0;
        case PROJ_UTM: {
            if (info->zone < 1 || info->zone > 60)
                return -1;
            int zone;
            bool northern;
            GeographicLib::UTMUPS::Forward(latitude, longitude, zone, northern, *x, *y, info->zone);
            if (northern && info->southern)
                *y += kFalseNorthing;
            else if (!northern && !info->southern)
                *y -= kFalseNorthing;
            return 0;
        }
        case PROJ_UPS: {
            int zone;
            bool northern;
            GeographicLib::UTMUPS::Forward(latitude, longitude, zone, northern, *x, *y,
                                           GeographicLib::UTMUPS::UPS);
            return northern == !info->southern ? 0 : -1;
        }
        default:
            return -1;
        }
    } catch (const std::exception&) {
        return -1;
    }
}

double DMSToDec(int degrees, int minutes, double seconds, int negative) {
    double value =
        std::abs(static_cast<double>(degrees)) + std::abs(minutes) / 60.0 + std::fabs(seconds) / 3600.0;
    return (degrees < 0 || negative) ? -value : value;
}

void DecToDMS(double value, int* degrees, int* minutes, double* seconds, int* negative, int secondDecimals) {
    // Round once, in whole units of the last kept second decimal, so that 59.9999 s carries into the minutes
    // and 59' 60" into the degrees instead of printing as 60.
    const int decimals = secondDecimals < 0 ? 0 : secondDecimals > 6 ? 6 : secondDecimals;
    const long long unitsPerSecond = static_cast<long long>(std::pow(10.0, decimals) + 0.5);
    const double magnitude = std::fabs(value);
    long long units = 0;
    if (std::isfinite(magnitude) && magnitude <= 1e6) // beyond that the text is meaningless anyway
        units = std::llround(magnitude * 3600.0 * static_cast<double>(unitsPerSecond));
    const long long unitsPerMinute = 60 * unitsPerSecond, unitsPerDegree = 60 * unitsPerMinute;
    if (degrees)
        *degrees = static_cast<int>(units / unitsPerDegree);
    if (minutes)
        *minutes = static_cast<int>(units % unitsPerDegree / unitsPerMinute);
    if (seconds)
        *seconds = static_cast<double>(units % unitsPerMinute) / static_cast<double>(unitsPerSecond);
    if (negative)
        *negative = (value < 0 && units > 0) ? 1 : 0;
}
