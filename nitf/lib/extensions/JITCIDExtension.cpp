#include "JITCIDExtension.h"

#include "RecordLayout.h"

using namespace record;

// clang-format off
// Test identification text: the whole data.
static const Entry kFields[] = {
    RestOfData("FILCMT"),
};
// clang-format on

void CJITCIDExtension::readInfo(FILE* fp) {
    static const CRecordLayout layout(kFields);
    readLayout(fp, layout);
}
