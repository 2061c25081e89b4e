#include "J2KLRAExtension.h"

#include "RecordLayout.h"

using namespace record;

// clang-format off
// JPEG 2000 layer information. The values of the parsed stream follow for the odd ("parsed") origins, when the
// data has room for them.
static const Entry kFields[] = {
    Text("ORIG", 1),
    Text("NLEVELS_O", 2),
    Text("NBANDS_O", 5),
    Text("NLAYERS_O", 3),
    Repeat("NLAYERS_O"),
        Text("LAYER_ID", 3),
        Text("BITRATE", 9),
    End(),
    IfOdd("ORIG"),
        IfDataLeft(10),
            Text("NLEVELS_I", 2),
            Text("NBANDS_I", 5),
            Text("NLAYERS_I", 3),
        End(),
    End(),
};
// clang-format on

void CJ2KLRAExtension::readInfo(FILE* fp) {
    static const CRecordLayout layout(kFields);
    readLayout(fp, layout);
}
