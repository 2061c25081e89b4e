// The GEOPSB TRE: Geo-Positioning Information.
#pragma once

#include "NitfExtension.h"

class CGEOPSBExtension : public CNitfExtension {
public:
    void readInfo(FILE* fp) override;
    const char* getName() const override { return "GEOPSB"; }
};
