// The NITF 2.0 file header: the 2.0 security group, a 27-byte ONAME, and symbol and label segment tables.
#pragma once

#include "NitfFileHeader.h"

class CNitfFileHeaderV20 : public CNitfFileHeader {
public:
    CNitfFileHeaderV20() : CNitfFileHeader(eNitfVersion20) {}

    void read(FILE* fp, CNitfFileReader* reader) override;
    void write(FILE* fp) override;
    __int64 computeStorageLength() override;
    void getTitle(char* title) override;
    CNitfImageSubheader* getNewImageSubheader(FILE* fp, int index) override;
};
