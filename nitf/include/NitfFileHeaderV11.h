// NITF 1.1 is recognised but its header is not interpreted: a 1.1 file shows no fields and no segments.
#pragma once

#include "NitfFileHeader.h"

class CNitfFileHeaderV11 : public CNitfFileHeader {
public:
    CNitfFileHeaderV11() : CNitfFileHeader(eNitfVersion11) {}

    void read(FILE*, CNitfFileReader*) override {}
    void write(FILE*) override {}
    __int64 computeStorageLength() override { return 0; }
    void getTitle(char*) override {}
    CNitfImageSubheader* getNewImageSubheader(FILE*, int) override { return nullptr; }
};
