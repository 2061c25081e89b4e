#include "NitfVersion.h"

const char* nitfVersion() {
    return NITF_VERSION_TEXT;
}
