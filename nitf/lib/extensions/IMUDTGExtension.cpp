#include "IMUDTGExtension.h"

#include "RecordLayout.h"

using namespace record;

// clang-format off
static const Entry kFields[] = {
    RestOfData("IMUDTG_DATA"),
};
// clang-format on

void CIMUDTGExtension::readInfo(FILE* fp) {
    static const CRecordLayout layout(kFields);
    readLayout(fp, layout);
}
