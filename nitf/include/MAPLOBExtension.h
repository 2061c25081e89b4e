// The MAPLOB TRE: Local Cartographic Coordinates.
#pragma once

#include "NitfExtension.h"

class CMAPLOBExtension : public CNitfExtension {
public:
    void readInfo(FILE* fp) override;
    const char* getName() const override { return "MAPLOB"; }
};
