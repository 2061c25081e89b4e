#include "GEOPSBExtension.h"

#include "RecordLayout.h"

using namespace record;

// clang-format off
// Geo-positioning information. 443 bytes
static const Entry kFields[] = {
    Text("TYP", 3),
    Text("UNI", 3),
    Text("DAG", 80),
    Text("DCD", 4),
    Text("ELL", 80),
    Text("ELC", 3),
    Text("DVR", 80),
    Text("VDCDVR", 4),
    Text("SDA", 80),
    Text("VDCSDA", 4),
    Text("ZOR", 15),
    Text("GRD", 3),
    Text("GRN", 80),
    Text("ZNA", 4),
};
// clang-format on

void CGEOPSBExtension::readInfo(FILE* fp) {
    static const CRecordLayout layout(kFields);
    readLayout(fp, layout);
}
