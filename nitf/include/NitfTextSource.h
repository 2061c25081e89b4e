// A text segment (both layouts): its sub-header and its text.
#pragma once

#include "NitfSegmentSource.h"

class CNitfTextSource : public CNitfSegmentSource {
public:
    void read(CNitfFile* file, eNitfVersion_t version, FILE* fp = nullptr);
    // The text followed by a line feed and a NUL; `buffer` holds getDataLength() + 2 bytes.
    void readText(CNitfFile* file, char* buffer);
};
