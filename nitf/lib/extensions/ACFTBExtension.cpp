#include "ACFTBExtension.h"

#include "RecordLayout.h"

using namespace record;

// clang-format off
// Aircraft information (version B). 207 bytes
static const Entry kFields[] = {
    Text("AC_MSN_ID", 20),
    Text("AC_TAIL_NO", 10),
    Text("AC_TO", 12),
    Text("SENSOR_ID_TYPE", 4),
    Text("SENSOR_ID", 6),
    Text("SCENE_SOURCE", 1),
    Text("SCNUM", 6),
    Text("PDATE", 8),
    Text("IMHOSTNO", 6),
    Text("IMREQID", 5),
    Text("MPLAN", 3),
    Text("ENTLOC", 25),
    Text("LOC_ACCY", 6),
    Text("ENTELV", 6),
    Text("ELV_UNIT", 1),
    Text("EXITLOC", 25),
    Text("EXITELV", 6),
    Text("TMAP", 7),
    Text("ROW_SPACING", 7),
    Text("ROW_SPACING_UNITS", 1),
    Text("COL_SPACING", 7),
    Text("COL_SPACING_UNITS", 1),
    Text("FOCAL_LENGTH", 6),
    Text("SENSERIAL", 6),
    Text("ABSWVER", 7),
    Text("CAL_DATE", 8),
    Text("PATCH_TOT", 4),
    Text("MTI_TOT", 3),
};
// clang-format on

void CACFTBExtension::readInfo(FILE* fp) {
    static const CRecordLayout layout(kFields);
    readLayout(fp, layout);
}
