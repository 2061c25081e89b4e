#include "AIMIDBExtension.h"

#include "RecordLayout.h"

using namespace record;

// clang-format off
// Additional image identification (version B). 89 bytes
static const Entry kFields[] = {
    Text("ACQUISITION_DATE", 14),
    Text("MISSION_NO", 4),
    Text("MISSION_IDENTIFICATION", 10),
    Text("FLIGHT_NO", 2),
    Text("OP_NUM", 3),
    Text("CURRENT_SEGMENT", 2),
    Text("REPRO_NUM", 2),
    Text("REPLAY", 3),
    Text("RESERVED_1", 1),
    Text("START_TILE_COLUMN", 3),
    Text("START_TILE_ROW", 5),
    Text("END_SEGMENT", 2),
    Text("END_TILE_COLUMN", 3),
    Text("END_TILE_ROW", 5),
    Text("COUNTRY", 2),
    Text("RESERVED_2", 4),
    Text("LOCATION", 11),
    Text("RESERVED_3", 13),
};
// clang-format on

void CAIMIDBExtension::readInfo(FILE* fp) {
    static const CRecordLayout layout(kFields);
    readLayout(fp, layout);
}
