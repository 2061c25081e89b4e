#include "TESTINExtension.h"

#include "RecordLayout.h"

using namespace record;

// clang-format off
static const Entry kFields[] = {
    RestOfData("TESTIN_DATA"),
};
// clang-format on

void CTESTINExtension::readInfo(FILE* fp) {
    static const CRecordLayout layout(kFields);
    readLayout(fp, layout);
}
