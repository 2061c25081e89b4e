// The georeferencing of an image segment as the tool shows it: the corners in decimal degrees, the projection
// record, and the sensor model, as text lines (nitf info) and as a JSON object (nitf info --json); and the
// same facts for the GeoTIFF export.
#pragma once

#include <cstdio>
#include <optional>
#include <string>
#include <vector>

#include <nlohmann/json.hpp>

#include "HostProjection.h"
#include "NitfGeorefInfo.h"
#include "RpcSource.h"

class CNitfImageSubheader;

namespace nitfgeoref {

struct Summary {
    char icords = ' ';
    CNitfGeorefInfo::eCoordinateType_t type = CNitfGeorefInfo::eCoordinatesNone;
    CNitfGeorefInfo::eCornerSource_t source = CNitfGeorefInfo::eCornerSourceNone;
    ProjInfo_t record{};
    // The centres of the corner pixels, NITF order, in degrees; valid when record.hasCorners.
    double latitude[4] = {}, longitude[4] = {};
    // The affine transform with its origin at the outer corner of the first pixel (x = gt0 + gt1 col + gt2
    // row, y = gt3 + gt4 col + gt5 row, pixel (0, 0) covering [0, 1) x [0, 1)); when record.hasAffine.
    double geotransform[6] = {};
    // The transform has no rotation: the corners form a rectangle along the system's axes.
    bool axisAligned = false;
    std::optional<CRpcSource> sensorModel;

    bool hasCorners() const { return record.hasCorners != 0; }
};

// Reads the georeferencing of an image (its sub-header read from `fp`), taking the most precise corners
// present; for every image, whatever its compression.
Summary summarize(FILE* fp, CNitfImageSubheader* subheader);

// "Coordinates: ...", one line per corner, "Projection: ...", the transform or tie points, the sensor model.
std::vector<std::string> reportLines(const Summary& summary);
// {"icords", "coordinate_type", "corner_source", "corners": [{"row", "column", "latitude", "longitude", "x",
// "y"}], "projection": {"system", "earth_model", "zone", "hemisphere", "geotransform" or "tie_points"},
// "sensor_model": {"type", "valid", "chip"}}; only "icords" and "coordinate_type" without coordinates.
nlohmann::json reportJson(const Summary& summary);

} // namespace nitfgeoref
