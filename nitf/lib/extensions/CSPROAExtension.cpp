#include "CSPROAExtension.h"

#include "RecordLayout.h"

using namespace record;

// clang-format off
// Processing information: nine reserved fields, then the bandwidth compression. 120 bytes
static const Entry kFields[] = {
    Text("RESERVED_1", 12),
    Text("RESERVED_2", 12),
    Text("RESERVED_3", 12),
    Text("RESERVED_4", 12),
    Text("RESERVED_5", 12),
    Text("RESERVED_6", 12),
    Text("RESERVED_7", 12),
    Text("RESERVED_8", 12),
    Text("RESERVED_9", 12),
    Text("BWC", 12),
};
// clang-format on

void CCSPROAExtension::readInfo(FILE* fp) {
    static const CRecordLayout layout(kFields);
    readLayout(fp, layout);
}
