// The image sub-header of NITF 2.0 (IID and ITITLE, the 2.0 security group, COMRAT for every compressed code,
// no XBANDS).
#pragma once

#include "NitfImageSubheader.h"

class CNitfImageSubheaderV20 : public CNitfImageSubheader {
public:
    CNitfImageSubheaderV20() = default;
    CNitfImageSubheaderV20(const CNitfImageSubheaderV20& other) = default;
    ~CNitfImageSubheaderV20() override = default;

    void read(FILE* fp, eNitfVersion_t version) override;
    void write(FILE* fp) override;
    __int64 computeStorageLength() override;
    void getTitle(char* title) override;

protected:
    const CRecordLayout& readLayout(eNitfVersion_t version) const override;
    const CRecordLayout& writeLayout() const override;
};
