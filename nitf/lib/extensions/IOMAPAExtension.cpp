#include "IOMAPAExtension.h"

#include "RecordLayout.h"

using namespace record;

// clang-format off
// Input/output amplitude mapping: one of four forms chosen by MAP_SELECT. The table of form 1 holds the output
// amplitude of each input amplitude 0..4095 as a 16-bit big-endian number. Form 3 has been written with a 1-byte
// TABLE_ID as well: its data length tells which.
static const Entry kFields[] = {
    Text("BAND_NUMBER", 3),
    Text("MAP_SELECT", 1),
    IfText("MAP_SELECT", "0"), // shift
        Text("S2", 2),
    End(),
    IfText("MAP_SELECT", "1"), // look-up table
        Text("TABLE_ID", 2),
        Text("S1", 2),
        Text("S2", 2),
        RepeatFixed(4096, 0),
            Unsigned("OUTPUT_MAP_VALUE", 2),
        End(),
    End(),
    IfText("MAP_SELECT", "2"), // logarithmic
        Text("TABLE_ID", 2),
        Text("S1", 2),
        Text("S2", 2),
        Text("R_WHOLE", 3),
        Text("R_FRACTION", 3),
    End(),
    IfText("MAP_SELECT", "3"), // piecewise polynomial
        IfDataFits(18, 24),
            Text("TABLE_ID", 1),
        End(),
        IfDataFitsNot(18, 24),
            Text("TABLE_ID", 2),
        End(),
        Text("S1", 2),
        Text("S2", 2),
        Text("NO_OF_SEGMENTS", 1),
        Text("XOB_1", 4),
        Text("XOB_2", 4),
        Repeat("NO_OF_SEGMENTS"),
            Float("OUT_B0"),
            Float("OUT_B1"),
            Float("OUT_B2"),
            Float("OUT_B3"),
            Float("OUT_B4"),
            Float("OUT_B5"),
        End(),
    End(),
};
// clang-format on

void CIOMAPAExtension::readInfo(FILE* fp) {
    static const CRecordLayout layout(kFields);
    readLayout(fp, layout);
}
