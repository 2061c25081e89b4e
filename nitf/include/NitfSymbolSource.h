// A NITF 2.1 / NSIF graphic segment (CGM) or a NITF 2.0 symbol segment: its sub-header and its data bytes.
#pragma once

#include "NitfSegmentSource.h"

class CNitfSymbolSource : public CNitfSegmentSource {
public:
    // Reads the sub-header in the layout of `version`; from `fp` where it stands, or when `fp` is null from
    // the file's stream positioned at the sub-header.
    void read(CNitfFile* file, eNitfVersion_t version, FILE* fp = nullptr);
};
