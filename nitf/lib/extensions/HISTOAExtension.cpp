#include "HISTOAExtension.h"

#include "RecordLayout.h"

using namespace record;

// clang-format off
// Softcopy history: processing events, each with its comments and the values of the operations it flags.
static const Entry kFields[] = {
    Text("SYSTYPE", 20),
    Text("PC", 12),
    Text("PE", 4),
    Text("REMAP_FLAG", 1),
    Text("LUTID", 2),
    Text("NEVENTS", 2),
    Repeat("NEVENTS"),
        Text("PDATE", 14),
        Text("PSITE", 10),
        Text("PAS", 10),
        Text("NIPCOM", 1),
        Repeat("NIPCOM"),
            Text("IPCOM", 80),
        End(),
        Text("IBPP", 2),
        Text("IPVTYPE", 3),
        Text("INBWC", 10),
        Text("DISP_FLAG", 1),
        Text("ROT_FLAG", 1),
        IfText("ROT_FLAG", "1"),
            Text("ROT_ANGLE", 8),
        End(),
        Text("ASYM_FLAG", 1),
        IfText("ASYM_FLAG", "1"),
            Text("ZOOMROW", 7),
            Text("ZOOMCOL", 7),
        End(),
        Text("PROJ_FLAG", 1),
        Text("SHARP_FLAG", 1),
        IfText("SHARP_FLAG", "1"),
            Text("SHARPFAM", 2),
            Text("SHARPMEM", 2),
        End(),
        Text("MAG_FLAG", 1),
        IfText("MAG_FLAG", "1"),
            Text("MAG_LEVEL", 7),
        End(),
        Text("DRA_FLAG", 1),
        IfText("DRA_FLAG", "1"),
            Text("DRA_MULT", 7),
            Text("DRA_SUB", 5),
        End(),
        Text("TTC_FLAG", 1),
        IfText("TTC_FLAG", "1"),
            Text("TTCFAM", 2),
            Text("TTCMEM", 2),
        End(),
        Text("DEVLUT_FLAG", 1),
        Text("OBPP", 2),
        Text("OPVTYPE", 3),
        Text("OUTBWC", 10),
    End(),
};
// clang-format on

void CHISTOAExtension::readInfo(FILE* fp) {
    static const CRecordLayout layout(kFields);
    readLayout(fp, layout);
}
