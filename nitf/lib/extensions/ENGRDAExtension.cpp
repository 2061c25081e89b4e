#include "ENGRDAExtension.h"

#include "RecordLayout.h"

using namespace record;

// clang-format off
// Engineering data: labelled records whose label and data widths come from earlier fields of the record.
static const Entry kFields[] = {
    Text("RESRC", 20),
    Text("RECNT", 3),
    Repeat("RECNT"),
        Text("ENGLN", 2),
        TextSizedBy("ENGLBL", "ENGLN"),
        Text("ENGMTXC", 4),
        Text("ENGMTXR", 4),
        Text("ENGTYP", 1),
        Text("ENGDTS", 1),
        Text("ENGDATU", 2),
        Text("ENGDATC", 8),
        TextSizedByProduct("ENGDATA", "ENGDATC", "ENGDTS"), // ENGDATC elements of ENGDTS bytes
    End(),
};
// clang-format on

void CENGRDAExtension::readInfo(FILE* fp) {
    static const CRecordLayout layout(kFields);
    readLayout(fp, layout);
}
