#include "PIATGAExtension.h"

#include "RecordLayout.h"

using namespace record;

// clang-format off
// Imagery access profile: target (version A). 96 bytes
static const Entry kFields[] = {
    Text("TGTUTM", 15),
    Text("PIATGAID", 15),
    Text("PIACTRY", 2),
    Text("PIACAT", 5),
    Text("TGTGEO", 15),
    Text("DATUM", 3),
    Text("TGTNAME", 38),
    Text("PERCOVER", 3),
};
// clang-format on

void CPIATGAExtension::readInfo(FILE* fp) {
    static const CRecordLayout layout(kFields);
    readLayout(fp, layout);
}
