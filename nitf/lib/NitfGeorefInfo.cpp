#include "NitfGeorefInfo.h"

#include <algorithm>
#include <cmath>
#include <cstdarg>
#include <cstdio>
#include <cstring>
#include <memory>
#include <string>

#include "GeorefText.h"
#include "HostError.h"
#include "HostFile.h"
#include "NitfExtension.h"
#include "NitfImageSubheader.h"
#include "NitfTag.h"
#include "Raise.h"
#include "RpcSource.h"
#include "RpfFrame.h"

static const char kSourceFile[] = "nitf/lib/NitfGeorefInfo";

using nitf_georef::CornerPoint;

namespace {

// Puts a stream back where it was, whatever happens in between.
class KeptPosition {
public:
    explicit KeptPosition(FILE* fp) : m_fp(fp), m_position(fp ? DKFTell(fp) : 0) {}
    ~KeptPosition() {
        if (m_fp)
            DKFSeek64(m_fp, m_position, SEEK_SET);
    }
    KeptPosition(const KeptPosition&) = delete;
    KeptPosition& operator=(const KeptPosition&) = delete;

private:
    FILE* m_fp;
    __int64 m_position;
};

void warn(const std::string& message, int line) {
    vexo::nspio::Warning::Warn(message.c_str(), kSourceFile, line);
}

// printf into a std::string.
std::string format(const char* pattern, ...) __attribute__((format(printf, 1, 2)));
std::string format(const char* pattern, ...) {
    char text[512];
    va_list args;
    va_start(args, pattern);
    std::vsnprintf(text, sizeof text, pattern, args);
    va_end(args);
    return text;
}

// The record that a corner point's coordinates are in.
ProjInfo_t recordOf(const CornerPoint& point) {
    ProjInfo_t record;
    InitProjInfo(&record);
    record.system = point.system;
    record.zone = point.zone;
    record.southern = point.southern;
    return record;
}

bool sameSystem(const ProjInfo_t& a, const ProjInfo_t& b) {
    return a.system == b.system && (a.system != PROJ_UTM || (a.zone == b.zone && a.southern == b.southern)) &&
           (a.system != PROJ_UPS || a.southern == b.southern);
}

// Moves (x, y) from one record's system into another's.
bool convert(const ProjInfo_t& from, double x, double y, const ProjInfo_t& to, double* toX, double* toY) {
    if (sameSystem(from, to)) {
        *toX = x;
        *toY = y;
        return true;
    }
    double latitude, longitude;
    return ProjToGeocoded(&from, x, y, &latitude, &longitude) == 0 &&
           GeocodedToProj(&to, latitude, longitude, toX, toY) == 0;
}

// Column and row of the four corner pixels of a `width` x `height` image, in NITF order.
void cornerPixels(int width, int height, double col[4], double row[4]) {
    const double right = width - 1, bottom = height - 1;
    const double c[4] = {0, right, right, 0}, r[4] = {0, 0, bottom, bottom};
    std::memcpy(col, c, sizeof c);
    std::memcpy(row, r, sizeof r);
}

// A geographic record from corners in degrees.
bool geographicRecord(const double latitude[4], const double longitude[4], int width, int height,
                      ProjInfo_t* record) {
    InitProjInfo(record);
    record->system = PROJ_GEOGRAPHIC;
    return ProjSetGeoreferenceFromCorners(record, longitude, latitude, width, height) == 0;
}

// How far, in degrees of latitude and longitude, a corner may stray from an IGEOLO corner of this form and
// still be the same point: one unit of the form's last digit (writers truncate as often as they round).
void formTolerance(CNitfGeorefInfo::eCoordinateType_t form, double latitude, double* tolLatitude,
                   double* tolLongitude) {
    switch (form) {
    case CNitfGeorefInfo::eCoordinatesGeographic:
    case CNitfGeorefInfo::eCoordinatesGeocentric:
        *tolLatitude = *tolLongitude = 1 / 3600.0;
        return;
    case CNitfGeorefInfo::eCoordinatesDecimal:
        *tolLatitude = *tolLongitude = 0.001;
        return;
    default: {
        // A metre in easting and in northing, turned by the grid's convergence: 1.5 m along either axis.
        const double metresPerDegree = 111320.0;
        const double cosine = std::max(std::cos(latitude * M_PI / 180), 1e-6);
        *tolLatitude = 1.5 / metresPerDegree;
        *tolLongitude = 1.5 / (metresPerDegree * cosine);
        return;
    }
    }
}

// True when each corner of `candidate` (geographic) lies within the form's precision of the corner of
// `igeolo`, with `slackLatitude` and `slackLongitude` degrees more; names the first corner that does not.
bool agrees(const ProjInfo_t& igeolo, CNitfGeorefInfo::eCoordinateType_t form, const ProjInfo_t& candidate,
            double slackLatitude, double slackLongitude, int* badCorner) {
    for (int i = 0; i < 4; ++i) {
        double latitude, longitude;
        *badCorner = i + 1;
        if (ProjToGeocoded(&igeolo, igeolo.cornerX[i], igeolo.cornerY[i], &latitude, &longitude) != 0)
            return false;
        double tolLatitude, tolLongitude;
        formTolerance(form, latitude, &tolLatitude, &tolLongitude);
        const double lonDifference = std::fabs(std::remainder(candidate.cornerX[i] - longitude, 360.0));
        if (std::fabs(candidate.cornerY[i] - latitude) > tolLatitude + slackLatitude + 1e-9 ||
            lonDifference > tolLongitude + slackLongitude + 1e-9)
            return false;
    }
    return true;
}

// The data of the image TRE `name`, `size` bytes of it; false (with a warning when it is there but cannot
// be read whole) otherwise.
bool readTre(FILE* fp, CNitfImageSubheader* subheader, const char* name, int size, char* data) {
    CNitfTag* tag = CNitfTag::find(name, subheader->getTaggedRecords());
    if (!tag)
        return false;
    if (tag->getDataLength() < size) {
        warn(format("%s holds %lld bytes, short of its %d: its corners are not used", name,
                    tag->getDataLength(), size),
             __LINE__);
        return false;
    }
    if (DKFSeek64(fp, tag->getDataOffset(), SEEK_SET) != 0 ||
        DKFRead(data, 1, static_cast<size_t>(size), fp) != static_cast<size_t>(size)) {
        warn(format("%s could not be read: its corners are not used", name), __LINE__);
        return false;
    }
    return true;
}

// BLOCKA's corners, when they describe this image: its row count (L_LINES) must be the image's.
bool blockaRecord(FILE* fp, CNitfImageSubheader* subheader, int width, int height, ProjInfo_t* record) {
    static const int kSize = 123;
    // Locations in file order: first row last column, last row last column, last row first column, first
    // row first column; IGEOLO (and the record) start with the first row's first column.
    static const int kLocationOffset[4] = {97, 34, 55, 76};
    char data[kSize];
    if (!readTre(fp, subheader, "BLOCKA", kSize, data))
        return false;
    const std::string lines(data + 7, 5);
    if (lines.find_first_not_of(' ') != std::string::npos && std::atoi(lines.c_str()) != height) {
        warn(format("BLOCKA describes %d rows and the image has %d: its corners are not used",
                    std::atoi(lines.c_str()), height),
             __LINE__);
        return false;
    }
    double latitude[4], longitude[4];
    int blank = 0;
    for (int i = 0; i < 4; ++i) {
        const char* location = data + kLocationOffset[i];
        if (std::string(location, 21).find_first_not_of(' ') == std::string::npos) {
            ++blank;
            continue;
        }
        if (!nitf_georef::parseBlockaLocation(location, &latitude[i], &longitude[i])) {
            warn(format("BLOCKA corner location \"%.21s\" is not valid: its corners are not used", location),
                 __LINE__);
            return false;
        }
    }
    return blank == 0 && geographicRecord(latitude, longitude, width, height, record);
}

// The corners of the GEOLOB grid: the centres of the corner pixels, half a pixel in from its origin.
bool geolobRecord(FILE* fp, CNitfImageSubheader* subheader, int width, int height, ProjInfo_t* record,
                  double* halfPixelLatitude, double* halfPixelLongitude) {
    static const int kSize = 48;
    char data[kSize];
    if (!readTre(fp, subheader, "GEOLOB", kSize, data))
        return false;
    nitf_georef::GeolobGrid grid;
    if (!nitf_georef::parseGeolob(data, &grid)) {
        warn(format("GEOLOB \"%.48s\" is not a valid grid: it is not used", data), __LINE__);
        return false;
    }
    const double dx = 360 / grid.arv, dy = 360 / grid.brv;
    double col[4], row[4], latitude[4], longitude[4];
    cornerPixels(width, height, col, row);
    for (int i = 0; i < 4; ++i) {
        longitude[i] = grid.lso + (col[i] + 0.5) * dx;
        latitude[i] = grid.pso - (row[i] + 0.5) * dy;
    }
    *halfPixelLatitude = dy / 2;
    *halfPixelLongitude = dx / 2;
    return geographicRecord(latitude, longitude, width, height, record);
}

const char* sourceName(CNitfGeorefInfo::eCornerSource_t source) {
    switch (source) {
    case CNitfGeorefInfo::eCornerSourceBlocka:
        return "BLOCKA";
    case CNitfGeorefInfo::eCornerSourceGeolob:
        return "GEOLOB";
    case CNitfGeorefInfo::eCornerSourceRpfCoverage:
        return "The RPF coverage";
    default:
        return "IGEOLO";
    }
}

} // namespace

CNitfGeorefInfo::CNitfGeorefInfo()
    : m_type(eCoordinatesNone), m_igeoloOffset(0), m_cornerSource(eCornerSourceNone),
      m_hasCoverage(false), m_coverageLatitude{}, m_coverageLongitude{} {}

void CNitfGeorefInfo::setCoordinateType(char icords, eNitfVersion_t version) {
    bool family21 = isNitf21Family(version);
    if ((family21 && icords == ' ') || (!family21 && icords == 'N') || icords == '\0') {
        m_type = eCoordinatesNone;
        return;
    }
    switch (icords) {
    case 'G':
        m_type = eCoordinatesGeographic;
        break;
    case 'D':
        m_type = eCoordinatesDecimal;
        break;
    case 'N':
        m_type = eCoordinatesUtmNorth;
        break;
    case 'S':
        m_type = eCoordinatesUtmSouth;
        break;
    case 'U':
        m_type = eCoordinatesMgrs;
        break;
    case 'P':
        m_type = eCoordinatesUps;
        break;
    case 'C':
        m_type = eCoordinatesGeocentric;
        break;
    default:
        m_type = eCoordinatesOther;
        break;
    }
}

char CNitfGeorefInfo::chooseIcords(const ProjInfo_t* info, eNitfVersion_t version) {
    const bool family21 = isNitf21Family(version);
    if (!info || (!info->hasCorners && !info->hasAffine) || info->system == PROJ_NONE)
        return family21 ? ' ' : 'N';
    if (!family21 || info->system != PROJ_UTM)
        return 'G';
    // UTM: the hemisphere of the northernmost corner.
    double col[4], row[4], northernmost = -90;
    cornerPixels(std::max(info->width, 1), std::max(info->height, 1), col, row);
    for (int i = 0; i < 4; ++i) {
        double x, y, latitude, longitude;
        if (ProjPixelToMap(info, col[i], row[i], &x, &y) == 0 &&
            ProjToGeocoded(info, x, y, &latitude, &longitude) == 0)
            northernmost = std::max(northernmost, latitude);
    }
    return northernmost >= 0 ? 'N' : 'S';
}

bool CNitfGeorefInfo::coverageOfFrame(FILE* fp, CNitfImageSubheader& subheader) {
    RpfCoverage_t c;
    try {
        if (!CRpfFrame::readCoverage(fp, subheader, c))
            return false;
    } catch (const vexo::Exception&) {
        return false; // a damaged RPFIMG: IGEOLO serves
    }
    const double latitude[4] = {c.upperLeftLatitude, c.upperRightLatitude, c.lowerRightLatitude,
                                c.lowerLeftLatitude};
    const double longitude[4] = {c.upperLeftLongitude, c.upperRightLongitude, c.lowerRightLongitude,
                                 c.lowerLeftLongitude};
    setCoverageCorners(latitude, longitude);
    return true;
}

void CNitfGeorefInfo::setCoverageCorners(const double latitude[4], const double longitude[4]) {
    std::memcpy(m_coverageLatitude, latitude, sizeof m_coverageLatitude);
    std::memcpy(m_coverageLongitude, longitude, sizeof m_coverageLongitude);
    m_hasCoverage = true;
}

// ---- reading ----------------------------------------------------------------------------------------------

namespace {

// The ICORDS letter of a coordinate type, for messages.
char icordsLetter(CNitfGeorefInfo::eCoordinateType_t type) {
    static const char letters[] = " GDNSUPC?";
    return type >= 0 && type < static_cast<int>(sizeof letters - 1) ? letters[type] : '?';
}

// IGEOLO, decoded into a record in the first corner's system.
bool igeoloRecord(FILE* fp, __int64 offset, CNitfGeorefInfo::eCoordinateType_t type, int width, int height,
                  ProjInfo_t* record) {
    if (nitf_georef::systemOfForm(type) == PROJ_NONE) {
        warn(format("IGEOLO corners of ICORDS \"%c\" are not decoded", icordsLetter(type)), __LINE__);
        return false;
    }
    char text[60];
    if (DKFSeek64(fp, offset, SEEK_SET) != 0 || DKFRead(text, 1, sizeof text, fp) != sizeof text) {
        warn("IGEOLO could not be read: the image has no corners", __LINE__);
        return false;
    }
    CornerPoint points[4];
    for (int i = 0; i < 4; ++i) {
        if (!nitf_georef::parseIgeoloCorner(type, text + 15 * i, &points[i])) {
            warn(
                format("IGEOLO corner %d \"%.15s\" is not a valid ICORDS \"%c\" coordinate: the image has no "
                       "corners",
                       i + 1, text + 15 * i, icordsLetter(type)),
                __LINE__);
            return false;
        }
    }
    // Geocentric latitudes are made geodetic; corners in other UTM zones are carried into the first one's.
    ProjInfo_t target = recordOf(points[0]);
    if (target.system == PROJ_GEOCENTRIC)
        target.system = PROJ_GEOGRAPHIC;
    double x[4], y[4];
    for (int i = 0; i < 4; ++i) {
        if (!convert(recordOf(points[i]), points[i].x, points[i].y, target, &x[i], &y[i])) {
            warn(format(
                     "IGEOLO corner %d \"%.15s\" cannot be expressed in the first corner's system: the image "
                     "has no corners",
                     i + 1, text + 15 * i),
                 __LINE__);
            return false;
        }
    }
    *record = target;
    return ProjSetGeoreferenceFromCorners(record, x, y, width, height) == 0;
}

} // namespace

void CNitfGeorefInfo::read(FILE* fp, CNitfImageSubheader* subheader, ProjInfo_t* info, int width, int height,
                           bool precise) {
    m_cornerSource = eCornerSourceNone;
    if (!info)
        return;
    InitProjInfo(info);
    if (!fp || width < 1 || height < 1)
        return;
    KeptPosition kept(fp);

    ProjInfo_t igeolo;
    InitProjInfo(&igeolo);
    const bool hasIgeolo =
        hasCoordinates() && igeoloRecord(fp, m_igeoloOffset, m_type, width, height, &igeolo);

    if (precise) {
        // The most precise first. A candidate that does not agree with IGEOLO describes something else (or
        // IGEOLO is wrong, which cannot be told apart): IGEOLO, the mandatory field, is kept.
        for (eCornerSource_t source : {eCornerSourceRpfCoverage, eCornerSourceGeolob, eCornerSourceBlocka}) {
            ProjInfo_t candidate;
            double slackLatitude = 0, slackLongitude = 0;
            bool found = false;
            switch (source) {
            case eCornerSourceRpfCoverage:
                found = (m_hasCoverage || (subheader && coverageOfFrame(fp, *subheader))) &&
                        geographicRecord(m_coverageLatitude, m_coverageLongitude, width, height, &candidate);
                break;
            case eCornerSourceGeolob:
                // Some producers give the outer edges of the corner pixels in IGEOLO: half a pixel apart.
                found = subheader && geolobRecord(fp, subheader, width, height, &candidate, &slackLatitude,
                                                  &slackLongitude);
                break;
            default:
                found = subheader && blockaRecord(fp, subheader, width, height, &candidate);
                break;
            }
            if (!found)
                continue;
            int corner = 0;
            if (hasIgeolo && !agrees(igeolo, m_type, candidate, slackLatitude, slackLongitude, &corner)) {
                warn(format("%s corner %d disagrees with IGEOLO beyond its precision: IGEOLO is used",
                            sourceName(source), corner),
                     __LINE__);
                continue;
            }
            *info = candidate;
            m_cornerSource = source;
            return;
        }
    }
    if (hasIgeolo) {
        *info = igeolo;
        m_cornerSource = eCornerSourceIgeolo;
    }
}

// ---- writing ----------------------------------------------------------------------------------------------

void CNitfGeorefInfo::write(FILE* fp, ProjInfo_t* info, int width, int height) {
    static const char signature[] =
        "void __cdecl CNitfGeorefInfo::write(" NITF_FILE_SIG ",struct ProjInfo_t *,int,int)";
    if (!hasCoordinates())
        return;
    if (!fp || !info || (!info->hasCorners && !info->hasAffine) || info->system == PROJ_NONE)
        NITF_RAISE("The projection record holds no georeferencing to write", signature);
    if (width < 1 || height < 1)
        NITF_RAISE_FORMAT(signature, "Cannot write the corners of an image of %d x %d pixels", width, height);
    const int system = nitf_georef::systemOfForm(m_type);
    if (system == PROJ_NONE)
        NITF_RAISE_FORMAT(signature, "Corners of ICORDS \"%c\" cannot be written", icordsLetter(m_type));

    // Corners given for this very size are written as they are (a single pixel's four "corners" included);
    // for another size they are interpolated or extrapolated.
    double col[4], row[4], x[4], y[4];
    cornerPixels(width, height, col, row);
    const bool sameSize = info->hasCorners && info->width == width && info->height == height;
    for (int i = 0; i < 4; ++i) {
        if (sameSize) {
            x[i] = info->cornerX[i];
            y[i] = info->cornerY[i];
        } else if (ProjPixelToMap(info, col[i], row[i], &x[i], &y[i]) != 0) {
            NITF_RAISE("The projection record holds no georeferencing to write", signature);
        }
    }

    // The form's record: UTM corners go in the record's zone when it is UTM, else in the first corner's
    // standard zone (MGRS corners then take their own standard zones).
    ProjInfo_t target;
    InitProjInfo(&target);
    target.system = system;
    if (system == PROJ_UTM) {
        target.southern = m_type == eCoordinatesUtmSouth;
        if (info->system == PROJ_UTM) {
            target.zone = info->zone;
        } else {
            double latitude, longitude;
            if (ProjToGeocoded(info, x[0], y[0], &latitude, &longitude) != 0)
                NITF_RAISE("The projection record's corners are not on the earth", signature);
            target.zone = static_cast<int>(std::floor((std::remainder(longitude, 360.0) + 180) / 6)) % 60 + 1;
        }
    }

    char igeolo[61];
    for (int i = 0; i < 4; ++i) {
        CornerPoint point;
        point.system = target.system;
        point.zone = target.zone;
        point.southern = target.southern;
        if (!convert(*info, x[i], y[i], target, &point.x, &point.y) ||
            !nitf_georef::formatIgeoloCorner(m_type, point, igeolo + 15 * i))
            NITF_RAISE_FORMAT(signature, "IGEOLO corner %d cannot be written with ICORDS \"%c\"", i + 1,
                              icordsLetter(m_type));
    }

    KeptPosition kept(fp);
    if (DKFSeek64(fp, m_igeoloOffset, SEEK_SET) != 0 || DKFWrite(igeolo, 1, 60, fp) != 60)
        NITF_RAISE("IGEOLO could not be written", signature);
}

// ---- sensor model -----------------------------------------------------------------------------------------

CRpcSource* CNitfGeorefInfo::getNewSensorModel(FILE* fp, CNitfImageSubheader* subheader) const {
    if (!fp || !subheader)
        return nullptr;
    std::unique_ptr<CRpcSource> rpc(subheader->getNewExtensionRpcSource());
    if (!rpc)
        return nullptr;
    KeptPosition kept(fp);
    try {
        rpc->readNewInfo(fp);
        // The coefficients describe the full image; a chip needs its mapping to use them.
        CNitfTag* chipTag = CNitfTag::find("ICHIPB", subheader->getTaggedRecords());
        if (chipTag) {
            std::unique_ptr<CNitfExtension> chip(CNitfExtension::Build(chipTag));
            if (chip)
                chip->readNewInfo(fp, false);
            if (!chip || !rpc->setChip(chip.get())) {
                warn("ICHIPB does not map the chip to its full image: the RPC model is not used", __LINE__);
                return nullptr;
            }
        }
    } catch (const vexo::Exception& e) {
        warn(format("%s: the RPC model is not used", e.what()), __LINE__);
        return nullptr;
    }
    return rpc.release();
}
