#include "PIAPRExtension.h"

#include "RecordLayout.h"

using namespace record;

// clang-format off
// Imagery access profile: product (versions C and D share the layout).
static const Entry kFields[] = {
    Text("ACCESSID", 64),
    Text("FMCONTROL", 32),
    Text("SUBDET", 1),
    Text("PRODCODE", 2),
    Text("PRODUCERSE", 6),
    Text("PRODIDNO", 20),
    Text("PRODSNME", 10),
    Text("PRODUCERCD", 2),
    Text("PRODCRTIME", 14),
    Text("MAPID", 40),
    Text("SECTITLEREP", 2),
    Repeat("SECTITLEREP"),
        Text("SECTITLE", 40),
        Text("PPNUM", 5),
        Text("TPP", 3),
    End(),
    Text("REQORGREP", 2),
    Repeat("REQORGREP"),
        Text("REQORG", 64),
    End(),
    Text("KEYWORDREP", 2),
    Repeat("KEYWORDREP"),
        Text("KEYWORD", 255),
    End(),
    Text("ASSRPTREP", 2),
    Repeat("ASSRPTREP"),
        Text("ASSRPT", 20),
    End(),
    Text("ATEXTREP", 2),
    Repeat("ATEXTREP"),
        Text("ATEXT", 255),
    End(),
};
// clang-format on

void CPIAPRExtension::readInfo(FILE* fp) {
    static const CRecordLayout layout(kFields);
    readLayout(fp, layout);
}
