#include "CSCRNAExtension.h"

#include "RecordLayout.h"

using namespace record;

// clang-format off
// Corner footprint. 109 bytes
static const Entry kFields[] = {
    Text("PREDICT_CORNERS", 1),
    Text("ULCNR_LAT", 9),
    Text("ULCNR_LONG", 10),
    Text("ULCNR_HT", 8),
    Text("URCNR_LAT", 9),
    Text("URCNR_LONG", 10),
    Text("URCNR_HT", 8),
    Text("LRCNR_LAT", 9),
    Text("LRCNR_LONG", 10),
    Text("LRCNR_HT", 8),
    Text("LLCNR_LAT", 9),
    Text("LLCNR_LONG", 10),
    Text("LLCNR_HT", 8),
};
// clang-format on

void CCSCRNAExtension::readInfo(FILE* fp) {
    static const CRecordLayout layout(kFields);
    readLayout(fp, layout);
}
