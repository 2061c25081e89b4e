// The image sub-header of NITF 2.1 and NSIF, and of "OSDE01.00" when read with that version.
#pragma once

#include "NitfImageSubheader.h"

class CNitfImageSubheaderV21 : public CNitfImageSubheader {
public:
    CNitfImageSubheaderV21() = default;
    CNitfImageSubheaderV21(const CNitfImageSubheaderV21& other) = default;
    ~CNitfImageSubheaderV21() override = default;

    void read(FILE* fp, eNitfVersion_t version) override;
    // Always the NITF 2.1 layout, whatever version was read.
    void write(FILE* fp) override;
    __int64 computeStorageLength() override;
    void getTitle(char* title) override;

protected:
    const CRecordLayout& readLayout(eNitfVersion_t version) const override;
    const CRecordLayout& writeLayout() const override;
};
