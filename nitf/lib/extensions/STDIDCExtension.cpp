#include "STDIDCExtension.h"

#include "RecordLayout.h"

using namespace record;

// clang-format off
// Standard identification (version C). 89 bytes
static const Entry kFields[] = {
    Text("ACQUISITION_DATE", 14),
    Text("MISSION", 14),
    Text("PASS", 2),
    Text("OP_NUM", 3),
    Text("START_SEGMENT", 2),
    Text("REPRO_NUM", 2),
    Text("REPLAY_REGEN", 3),
    Text("BLANK_FILL", 1),
    Text("START_COLUMN", 3),
    Text("START_ROW", 5),
    Text("END_SEGMENT", 2),
    Text("END_COLUMN", 3),
    Text("END_ROW", 5),
    Text("COUNTRY", 2),
    Text("WAC", 4),
    Text("LOCATION", 11),
    Text("RESERVED_1", 5),
    Text("RESERVED_2", 8),
};
// clang-format on

void CSTDIDCExtension::readInfo(FILE* fp) {
    static const CRecordLayout layout(kFields);
    readLayout(fp, layout);
}
