// The IMXDTG TRE, whose layout is not published: its whole data is kept as the one field IMXDTG_DATA.
#pragma once

#include "NitfExtension.h"

class CIMXDTGExtension : public CNitfExtension {
public:
    void readInfo(FILE* fp) override;
    const char* getName() const override { return "IMXDTG"; }
};
