#include "GeorefReport.h"

#include <algorithm>
#include <cmath>
#include <cstdarg>
#include <cstdio>
#include <cstring>
#include <memory>

#include "NitfImageSubheader.h"
#include "NitfProperty.h"

namespace nitfgeoref {

namespace {

const char* const kCornerNames[4] = {"first row, first column", "first row, last column",
                                     "last row, last column", "last row, first column"};

const char* typeName(CNitfGeorefInfo::eCoordinateType_t type) {
    switch (type) {
    case CNitfGeorefInfo::eCoordinatesNone:
        return "none";
    case CNitfGeorefInfo::eCoordinatesGeographic:
        return "geographic";
    case CNitfGeorefInfo::eCoordinatesDecimal:
        return "decimal degrees";
    case CNitfGeorefInfo::eCoordinatesUtmNorth:
        return "UTM north";
    case CNitfGeorefInfo::eCoordinatesUtmSouth:
        return "UTM south";
    case CNitfGeorefInfo::eCoordinatesMgrs:
        return "MGRS";
    case CNitfGeorefInfo::eCoordinatesUps:
        return "UPS";
    case CNitfGeorefInfo::eCoordinatesGeocentric:
        return "geocentric";
    default:
        return "other";
    }
}

const char* sourceName(CNitfGeorefInfo::eCornerSource_t source) {
    switch (source) {
    case CNitfGeorefInfo::eCornerSourceIgeolo:
        return "IGEOLO";
    case CNitfGeorefInfo::eCornerSourceBlocka:
        return "BLOCKA";
    case CNitfGeorefInfo::eCornerSourceGeolob:
        return "GEOLOB";
    case CNitfGeorefInfo::eCornerSourceRpfCoverage:
        return "RPF coverage";
    default:
        return "none";
    }
}

std::string format(const char* pattern, ...) __attribute__((format(printf, 1, 2)));
std::string format(const char* pattern, ...) {
    char text[512];
    va_list args;
    va_start(args, pattern);
    std::vsnprintf(text, sizeof text, pattern, args);
    va_end(args);
    return text;
}

std::string systemText(const ProjInfo_t& record) {
    char text[32];
    return EncodeGeosys(&record, text, sizeof text) == 0 ? text : "none";
}

bool isMetric(const ProjInfo_t& record) {
    return record.system == PROJ_UTM || record.system == PROJ_UPS;
}

// The corner pixel (column, row) of corner `i` in NITF order.
void cornerPixel(const ProjInfo_t& record, int i, int* column, int* row) {
    *column = i == 1 || i == 2 ? record.width - 1 : 0;
    *row = i >= 2 ? record.height - 1 : 0;
}

} // namespace

Summary summarize(FILE* fp, CNitfImageSubheader* subheader) {
    Summary summary;
    InitProjInfo(&summary.record);
    if (!subheader)
        return summary;
    PropertyMap& fields = subheader->getProperties();
    CNitfProperty* icords = FindProperty(fields, "ICORDS");
    const std::string icordsText = icords ? icords->toText() : std::string();
    summary.icords = icordsText.empty() ? ' ' : icordsText[0];
    CNitfGeorefInfo& georef = subheader->getGeorefSource();
    summary.type = georef.getCoordinateType();

    CNitfProperty* columns = FindProperty(fields, "NCOLS");
    CNitfProperty* rows = FindProperty(fields, "NROWS");
    const int width = columns ? columns->getAsInt() : 0;
    const int height = rows ? rows->getAsInt() : 0;
    georef.read(fp, subheader, &summary.record, width, height, true);
    summary.source = georef.getCornerSource();

    const ProjInfo_t& record = summary.record;
    if (record.hasCorners) {
        for (int i = 0; i < 4; ++i) {
            if (ProjToGeocoded(&record, record.cornerX[i], record.cornerY[i], &summary.latitude[i],
                               &summary.longitude[i]) != 0)
                summary.latitude[i] = summary.longitude[i] = NAN;
        }
    }
    if (record.hasAffine) {
        // From pixel centres to the outer corner of the first pixel.
        const double* a = record.affine;
        const double gt[6] = {a[0] - 0.5 * (a[1] + a[2]), a[1], a[2], a[3] - 0.5 * (a[4] + a[5]), a[4], a[5]};
        std::copy(gt, gt + 6, summary.geotransform);
        // Rotation terms that move the image by less than a millionth of a pixel across its whole extent
        // are rounding, not rotation.
        summary.axisAligned = std::fabs(gt[2]) * record.height <= 1e-6 * std::fabs(gt[1]) &&
                              std::fabs(gt[4]) * record.width <= 1e-6 * std::fabs(gt[5]) && gt[1] != 0 &&
                              gt[5] != 0;
    }

    std::unique_ptr<CRpcSource> model(georef.getNewSensorModel(fp, subheader));
    if (model)
        summary.sensorModel = *model;
    return summary;
}

std::vector<std::string> reportLines(const Summary& summary) {
    std::vector<std::string> lines;
    if (summary.type == CNitfGeorefInfo::eCoordinatesNone) {
        lines.push_back("Coordinates: none");
    } else {
        lines.push_back(format("Coordinates: ICORDS \"%c\" (%s), corners from %s", summary.icords,
                               typeName(summary.type), sourceName(summary.source)));
    }
    const ProjInfo_t& record = summary.record;
    if (record.hasCorners) {
        for (int i = 0; i < 4; ++i) {
            int column, row;
            cornerPixel(record, i, &column, &row);
            std::string line =
                format("  corner %d (%s, row %d, column %d): %+.8f, %+.8f", i + 1, kCornerNames[i], row,
                       column, summary.latitude[i], summary.longitude[i]);
            if (isMetric(record))
                line += format(" (E %.3f, N %.3f)", record.cornerX[i], record.cornerY[i]);
            lines.push_back(line);
        }
        lines.push_back("Projection: " + systemText(record) + " on WGS 84");
        if (record.hasAffine) {
            const double* gt = summary.geotransform;
            lines.push_back(
                format("  geotransform: origin %.10g, %.10g; pixel %.10g x %.10g; rotation %.10g, %.10g",
                       gt[0], gt[3], gt[1], gt[5], gt[2], gt[4]));
        } else {
            lines.push_back("  tie points: the four corners (they do not form a parallelogram)");
        }
    }
    if (summary.sensorModel) {
        const CRpcSource& model = *summary.sensorModel;
        lines.push_back(format("Sensor model: %.6s%s%s", model.getName(),
                               model.hasChip() ? ", through ICHIPB" : "",
                               model.isValid() ? "" : " (not declared valid)"));
    }
    return lines;
}

nlohmann::json reportJson(const Summary& summary) {
    nlohmann::json json;
    json["icords"] = std::string(1, summary.icords);
    json["coordinate_type"] = typeName(summary.type);
    const ProjInfo_t& record = summary.record;
    if (record.hasCorners) {
        json["corner_source"] = sourceName(summary.source);
        nlohmann::json corners = nlohmann::json::array();
        for (int i = 0; i < 4; ++i) {
            int column, row;
            cornerPixel(record, i, &column, &row);
            corners.push_back({{"row", row},
                               {"column", column},
                               {"latitude", summary.latitude[i]},
                               {"longitude", summary.longitude[i]},
                               {"x", record.cornerX[i]},
                               {"y", record.cornerY[i]}});
        }
        json["corners"] = corners;
        nlohmann::json projection = {{"system", systemText(record)}, {"earth_model", "WGS 84"}};
        if (record.system == PROJ_UTM)
            projection["zone"] = record.zone;
        if (record.system == PROJ_UTM || record.system == PROJ_UPS)
            projection["hemisphere"] = record.southern ? "S" : "N";
        if (record.hasAffine)
            projection["geotransform"] = std::vector<double>(summary.geotransform, summary.geotransform + 6);
        else
            projection["tie_points"] = true;
        json["projection"] = projection;
    }
    if (summary.sensorModel) {
        const CRpcSource& model = *summary.sensorModel;
        json["sensor_model"] = {{"type", std::string(model.getName(), strnlen(model.getName(), 6))},
                                {"valid", model.isValid()},
                                {"chip", model.hasChip()}};
    }
    return json;
}

} // namespace nitfgeoref
