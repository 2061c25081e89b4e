#include "MAPLOBExtension.h"

#include "RecordLayout.h"

using namespace record;

// clang-format off
// Local cartographic coordinates. 43 bytes
static const Entry kFields[] = {
    Text("UNILOA", 3),
    Text("LOD", 5),
    Text("LAD", 5),
    Text("LSO", 15),
    Text("PSO", 15),
};
// clang-format on

void CMAPLOBExtension::readInfo(FILE* fp) {
    static const CRecordLayout layout(kFields);
    readLayout(fp, layout);
}
