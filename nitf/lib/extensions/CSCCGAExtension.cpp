#include "CSCCGAExtension.h"

#include "RecordLayout.h"

using namespace record;

// clang-format off
// Cloud cover grid. 60 bytes
static const Entry kFields[] = {
    Text("CCG_SOURCE", 18),
    Text("REG_SENSOR", 6),
    Text("ORIGIN_LINE", 7),
    Text("ORIGIN_SAMPLE", 5),
    Text("AS_CELL_SIZE", 7),
    Text("CS_CELL_SIZE", 5),
    Text("CCG_MAX_LINE", 7),
    Text("CCG_MAX_SAMPLE", 5),
};
// clang-format on

void CCSCCGAExtension::readInfo(FILE* fp) {
    static const CRecordLayout layout(kFields);
    readLayout(fp, layout);
}
