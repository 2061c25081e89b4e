// A NITF 2.0 label segment: its sub-header and its text.
#pragma once

#include "NitfSegmentSource.h"

class CNitfLabelSource : public CNitfSegmentSource {
public:
    void read(CNitfFile* file, eNitfVersion_t version, FILE* fp = nullptr);
};
