#include "CSDIDAExtension.h"

#include "RecordLayout.h"

using namespace record;

// clang-format off
// Dataset identification. 70 bytes
static const Entry kFields[] = {
    Text("DAY", 2),
    Text("MONTH", 3),
    Text("YEAR", 4),
    Text("PLATFORM_CODE", 2),
    Text("VEHICLE_ID", 2),
    Text("PASS", 2),
    Text("OPERATION", 3),
    Text("SENSOR_ID", 2),
    Text("PRODUCT_ID", 2),
    Text("RESERVED_1", 4),
    Text("TIME", 14),
    Text("PROCESS_TIME", 14),
    Text("RESERVED_2", 2),
    Text("RESERVED_3", 2),
    Text("RESERVED_4", 1),
    Text("RESERVED_5", 1),
    Text("SOFTWARE_VERSION_NUMBER", 10),
};
// clang-format on

void CCSDIDAExtension::readInfo(FILE* fp) {
    static const CRecordLayout layout(kFields);
    readLayout(fp, layout);
}
