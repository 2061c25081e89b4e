#include "PIAPEAExtension.h"

#include "RecordLayout.h"

using namespace record;

// clang-format off
// Imagery access profile: person (version A), birth date DDMMYY. 92 bytes
static const Entry kFields[] = {
    Text("LASTNME", 28),
    Text("FIRSTNME", 28),
    Text("MIDNME", 28),
    Text("DOB", 6),
    Text("ASSOCTRY", 2),
};
// clang-format on

void CPIAPEAExtension::readInfo(FILE* fp) {
    static const CRecordLayout layout(kFields);
    readLayout(fp, layout);
}
