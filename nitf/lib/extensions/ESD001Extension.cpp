#include "ESD001Extension.h"

#include "RecordLayout.h"

using namespace record;

// clang-format off
// TREs without a published layout keep their whole data as one field.
static const Entry kFields[] = {
    RestOfData("ESD001_DATA"),
};
// clang-format on

void CESD001Extension::readInfo(FILE* fp) {
    static const CRecordLayout layout(kFields);
    readLayout(fp, layout);
}
