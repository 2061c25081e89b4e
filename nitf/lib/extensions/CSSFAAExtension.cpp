#include "CSSFAAExtension.h"

#include "RecordLayout.h"

using namespace record;

// clang-format off
// Sensor field alignment: 1 + 106 bytes per band.
static const Entry kFields[] = {
    Text("NUM_BANDS", 1),
    Repeat("NUM_BANDS"),
        Text("BAND_TYPE", 1),
        Text("BAND_ID", 6),
        Text("FOC_LENGTH", 11),
        Text("NUM_DAP", 8),
        Text("NUM_FIR", 8),
        Text("DELTA", 7),
        Text("OPPOFF_X", 7),
        Text("OPPOFF_Y", 7),
        Text("OPPOFF_Z", 7),
        Text("START_X", 11),
        Text("START_Y", 11),
        Text("FINISH_X", 11),
        Text("FINISH_Y", 11),
    End(),
};
// clang-format on

void CCSSFAAExtension::readInfo(FILE* fp) {
    static const CRecordLayout layout(kFields);
    readLayout(fp, layout);
}
