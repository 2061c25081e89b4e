#include "PIAPEBExtension.h"

#include "RecordLayout.h"

using namespace record;

// clang-format off
// Imagery access profile: person (version B), birth date CCYYMMDD. 94 bytes
static const Entry kFields[] = {
    Text("LASTNME", 28),
    Text("FIRSTNME", 28),
    Text("MIDNME", 28),
    Text("DOB", 8),
    Text("ASSOCTRY", 2),
};
// clang-format on

void CPIAPEBExtension::readInfo(FILE* fp) {
    static const CRecordLayout layout(kFields);
    readLayout(fp, layout);
}
