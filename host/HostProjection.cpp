// Default host projection service: the projection record, coordinate-system texts, DMS conversions and MGRS
// (through GeographicLib, which also handles the polar UPS areas).
#include "HostProjection.h"

#include <cctype>
#include <cmath>
#include <cstring>
#include <exception>
#include <string>

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

bool allFinite(const double values[4]) {
    for (int i = 0; i < 4; ++i)
        if (!std::isfinite(values[i]))
            return false;
    return true;
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
    enum { UL = 0, UR = 1, LL = 3 }; // NITF corner order; the lower right follows from the other three
    // The corners are the centres of the corner pixels: UL at (0, 0), UR at (width-1, 0), LL at (0,
    // height-1). An image one pixel wide or high has no extent along that axis, so its step there is zero.
    const double lastCol = width - 1, lastRow = height - 1;
    auto step = [](double from, double to, double span) { return span > 0 ? (to - from) / span : 0.0; };
    info->affine[0] = cornerX[UL];
    info->affine[1] = step(cornerX[UL], cornerX[UR], lastCol);
    info->affine[2] = step(cornerX[UL], cornerX[LL], lastRow);
    info->affine[3] = cornerY[UL];
    info->affine[4] = step(cornerY[UL], cornerY[UR], lastCol);
    info->affine[5] = step(cornerY[UL], cornerY[LL], lastRow);
    for (int i = 0; i < 4; ++i) {
        info->cornerX[i] = cornerX[i];
        info->cornerY[i] = cornerY[i];
    }
    info->hasCorners = 1;
    return 0;
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
