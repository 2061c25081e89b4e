#include "IMXDTGExtension.h"

#include "RecordLayout.h"

using namespace record;

// clang-format off
static const Entry kFields[] = {
    RestOfData("IMXDTG_DATA"),
};
// clang-format on

void CIMXDTGExtension::readInfo(FILE* fp) {
    static const CRecordLayout layout(kFields);
    readLayout(fp, layout);
}
