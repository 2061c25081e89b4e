#include "PIAEQAExtension.h"

#include "RecordLayout.h"

using namespace record;

// clang-format off
// Imagery access profile: equipment. 130 bytes
static const Entry kFields[] = {
    Text("EQPCODE", 7),
    Text("EQPNOMEN", 45),
    Text("EQPMAN", 64),
    Text("OBTYPE", 1),
    Text("ORDBAT", 3),
    Text("CTRYPROD", 2),
    Text("CTRYDSN", 2),
    Text("OBJVIEW", 6),
};
// clang-format on

void CPIAEQAExtension::readInfo(FILE* fp) {
    static const CRecordLayout layout(kFields);
    readLayout(fp, layout);
}
