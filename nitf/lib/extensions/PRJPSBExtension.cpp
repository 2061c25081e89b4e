#include "PRJPSBExtension.h"

#include "RecordLayout.h"

using namespace record;

// clang-format off
// Projection parameters: 113 + 15 bytes per parameter.
static const Entry kFields[] = {
    Text("PRN", 80),
    Text("PCO", 2),
    Text("NUM_PRJ", 1),
    Repeat("NUM_PRJ"),
        Text("PRJ", 15),
    End(),
    Text("XOR", 15),
    Text("YOR", 15),
};
// clang-format on

void CPRJPSBExtension::readInfo(FILE* fp) {
    static const CRecordLayout layout(kFields);
    readLayout(fp, layout);
}
