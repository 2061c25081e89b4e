#include "PIAIMBExtension.h"

#include "RecordLayout.h"

using namespace record;

// clang-format off
// Imagery access profile: image (version B), the first 13 fields of version C. 337 bytes
static const Entry kFields[] = {
    Text("CLOUDCVR", 3),
    Text("SRP", 1),
    Text("SENSMODE", 12),
    Text("SENSNAME", 18),
    Text("SOURCE", 255),
    Text("COMGEN", 2),
    Text("SUBQUAL", 1),
    Text("PIAMSNNUM", 7),
    Text("CAMSPECS", 32),
    Text("PROJID", 2),
    Text("GENERATION", 1),
    Text("ESD", 1),
    Text("OTHERCOND", 2),
};
// clang-format on

void CPIAIMBExtension::readInfo(FILE* fp) {
    static const CRecordLayout layout(kFields);
    readLayout(fp, layout);
}
