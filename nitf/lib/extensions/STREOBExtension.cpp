#include "STREOBExtension.h"

#include "RecordLayout.h"

using namespace record;

// clang-format off
// Stereo information (version B). 94 bytes
static const Entry kFields[] = {
    Text("ST_ID", 60),
    Text("N_MATES", 1),
    Text("MATE_INSTANCE", 1),
    Text("B_CONV", 5),
    Text("E_CONV", 5),
    Text("B_ASYM", 5),
    Text("E_ASYM", 5),
    Text("B_BIE", 6),
    Text("E_BIE", 6),
};
// clang-format on

void CSTREOBExtension::readInfo(FILE* fp) {
    static const CRecordLayout layout(kFields);
    readLayout(fp, layout);
}
