#include "PIAIMCExtension.h"

#include "RecordLayout.h"

using namespace record;

// clang-format off
// Imagery access profile: image (version C). 362 bytes
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
    Text("MEANGSD", 7),
    Text("IDATUM", 3),
    Text("IELLIP", 3),
    Text("PREPROC", 2),
    Text("IPROJ", 2),
    Text("SATTRACK", 8),
};
// clang-format on

void CPIAIMCExtension::readInfo(FILE* fp) {
    static const CRecordLayout layout(kFields);
    readLayout(fp, layout);
}
