#include "RPFHDRExtension.h"

#include "RecordLayout.h"

using namespace record;

// clang-format off
// RPF header section (binary fields big-endian). 48 bytes
static const Entry kFields[] = {
    Unsigned("LITTLE_BIG_ENDIAN_INDICATOR", 1),
    Unsigned("HEADER_SECTION_LENGTH", 2),
    Text("FILE_NAME", 12),
    Unsigned("NEW_REPLACEMENT_UPDATE_INDICATOR", 1),
    Text("GOVERNING_STANDARD_NUMBER", 15),
    Text("GOVERNING_STANDARD_DATE", 8),
    Text("SECURITY_CLASSIFICATION", 1),
    Text("SECURITY_COUNTRY_INTERNATIONAL_CODE", 2),
    Text("SECURITY_RELEASE_MARKING", 2),
    Unsigned("LOCATION_SECTION_LOCATION", 4),
};
// clang-format on

void CRPFHDRExtension::readInfo(FILE* fp) {
    static const CRecordLayout layout(kFields);
    readLayout(fp, layout);
}
