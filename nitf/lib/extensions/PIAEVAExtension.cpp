#include "PIAEVAExtension.h"

#include "RecordLayout.h"

using namespace record;

// clang-format off
// Imagery access profile: event. 46 bytes
static const Entry kFields[] = {
    Text("EVENTNAME", 38),
    Text("EVENTTYPE", 8),
};
// clang-format on

void CPIAEVAExtension::readInfo(FILE* fp) {
    static const CRecordLayout layout(kFields);
    readLayout(fp, layout);
}
