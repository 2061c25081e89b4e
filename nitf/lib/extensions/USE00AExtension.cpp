#include "USE00AExtension.h"

#include "RecordLayout.h"

using namespace record;

// clang-format off
// Exploitation usability. 107 bytes
static const Entry kFields[] = {
    Text("ANGLE_TO_NORTH", 3),
    Text("MEAN_GSD", 5),
    Text("RESERVED_1", 1),
    Text("DYNAMIC_RANGE", 5),
    Text("RESERVED_2", 3),
    Text("RESERVED_3", 1),
    Text("RESERVED_4", 3),
    Text("OBL_ANG", 5),
    Text("ROLL_ANG", 6),
    Text("RESERVED_5", 12),
    Text("RESERVED_6", 15),
    Text("RESERVED_7", 4),
    Text("RESERVED_8", 1),
    Text("RESERVED_9", 3),
    Text("RESERVED_10", 1),
    Text("RESERVED_11", 1),
    Text("N_REF", 2),
    Text("REV_NUM", 5),
    Text("N_SEG", 3),
    Text("MAX_LP_SEG", 6),
    Text("RESERVED_12", 6),
    Text("RESERVED_13", 6),
    Text("SUN_EL", 5),
    Text("SUN_AZ", 5),
};
// clang-format on

void CUSE00AExtension::readInfo(FILE* fp) {
    static const CRecordLayout layout(kFields);
    readLayout(fp, layout);
}
