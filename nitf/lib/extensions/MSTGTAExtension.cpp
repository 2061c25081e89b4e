#include "MSTGTAExtension.h"

#include "RecordLayout.h"

using namespace record;

// clang-format off
// Mission target information. 101 bytes
static const Entry kFields[] = {
    Text("TGT_NUM", 5),
    Text("TGT_ID", 12),
    Text("TGT_BE", 15),
    Text("TGT_PRI", 3),
    Text("TGT_REQ", 12),
    Text("TGT_LTIOV", 12),
    Text("TGT_TYPE", 1),
    Text("TGT_COLL", 1),
    Text("TGT_CAT", 5),
    Text("TGT_UTC", 7),
    Text("TGT_ELEV", 6),
    Text("TGT_ELEV_UNIT", 1),
    Text("TGT_LOC", 21),
};
// clang-format on

void CMSTGTAExtension::readInfo(FILE* fp) {
    static const CRecordLayout layout(kFields);
    readLayout(fp, layout);
}
