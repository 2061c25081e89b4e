#include "MHXDTGExtension.h"

#include "RecordLayout.h"

using namespace record;

// clang-format off
static const Entry kFields[] = {
    RestOfData("MHXDTG_DATA"),
};
// clang-format on

void CMHXDTGExtension::readInfo(FILE* fp) {
    static const CRecordLayout layout(kFields);
    readLayout(fp, layout);
}
