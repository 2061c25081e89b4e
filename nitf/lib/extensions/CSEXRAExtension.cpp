#include "CSEXRAExtension.h"

#include "RecordLayout.h"

using namespace record;

// clang-format off
// Exploitation reference data (version A). 132 bytes
static const Entry kFields[] = {
    Text("SENSOR", 6),
    Text("TIME_FIRST_LINE_IMAGE", 12),
    Text("TIME_IMAGE_DURATION", 12),
    Text("MAX_GSD", 5),
    Text("ALONG_SCAN_GSD", 5),
    Text("CROSS_SCAN_GSD", 5),
    Text("GEO_MEAN_GSD", 5),
    Text("A_S_VERT_GSD", 5),
    Text("C_S_VERT_GSD", 5),
    Text("GEO_MEAN_VERT_GSD", 5),
    Text("GSD_BETA_ANGLE", 5),
    Text("DYNAMIC_RANGE", 5),
    Text("NUM_LINES", 7),
    Text("NUM_SAMPLES", 5),
    Text("ANGLE_TO_NORTH", 7),
    Text("OBLIQUITY_ANGLE", 6),
    Text("AZ_OF_OBLIQUITY", 7),
    Text("GRD_COVER", 1),
    Text("SNOW_DEPTH_CAT", 1),
    Text("SUN_AZIMUTH", 7),
    Text("SUN_ELEVATION", 7),
    Text("PREDICTED_NIIRS", 3),
    Text("CIRCL_ERR", 3),
    Text("LINEAR_ERR", 3),
};
// clang-format on

void CCSEXRAExtension::readInfo(FILE* fp) {
    static const CRecordLayout layout(kFields);
    readLayout(fp, layout);
}
