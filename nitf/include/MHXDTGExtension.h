// The MHXDTG TRE, whose layout is not published: its whole data is kept as the one field MHXDTG_DATA.
#pragma once

#include "NitfExtension.h"

class CMHXDTGExtension : public CNitfExtension {
public:
    void readInfo(FILE* fp) override;
    const char* getName() const override { return "MHXDTG"; }
};
