#include "MHUDTGExtension.h"

#include "RecordLayout.h"

using namespace record;

// clang-format off
static const Entry kFields[] = {
    RestOfData("MHUDTG_DATA"),
};
// clang-format on

void CMHUDTGExtension::readInfo(FILE* fp) {
    static const CRecordLayout layout(kFields);
    readLayout(fp, layout);
}
