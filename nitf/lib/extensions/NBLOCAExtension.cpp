#include "NBLOCAExtension.h"

#include "RecordLayout.h"

using namespace record;

// clang-format off
// Image frame offsets (binary, big-endian). Frames 2..N are keyed FRAME_2_OFFSET.. like the first one.
static const Entry kFields[] = {
    Unsigned("FRAME_1_OFFSET", 4),
    Unsigned("NUMBER_OF_FRAMES", 4),
    Repeat("NUMBER_OF_FRAMES", -1, 2),
        Unsigned("FRAME_%d_OFFSET", 4),
    End(),
};
// clang-format on

void CNBLOCAExtension::readInfo(FILE* fp) {
    static const CRecordLayout layout(kFields);
    readLayout(fp, layout);
}
