#include "ICHIPBExtension.h"

#include "RecordLayout.h"

using namespace record;

// clang-format off
// Image chip support: the chip to full image grid points. 224 bytes
static const Entry kFields[] = {
    Text("XFRM_FLAG", 2),
    Text("SCALE_FACTOR", 10),
    Text("ANAMRPH_CORR", 2),
    Text("SCANBLK_NUM", 2),
    Text("OP_ROW_11", 12),
    Text("OP_COL_11", 12),
    Text("OP_ROW_12", 12),
    Text("OP_COL_12", 12),
    Text("OP_ROW_21", 12),
    Text("OP_COL_21", 12),
    Text("OP_ROW_22", 12),
    Text("OP_COL_22", 12),
    Text("FI_ROW_11", 12),
    Text("FI_COL_11", 12),
    Text("FI_ROW_12", 12),
    Text("FI_COL_12", 12),
    Text("FI_ROW_21", 12),
    Text("FI_COL_21", 12),
    Text("FI_ROW_22", 12),
    Text("FI_COL_22", 12),
    Text("FI_ROW", 8),
    Text("FI_COL", 8),
};
// clang-format on

void CICHIPBExtension::readInfo(FILE* fp) {
    static const CRecordLayout layout(kFields);
    readLayout(fp, layout);
}
