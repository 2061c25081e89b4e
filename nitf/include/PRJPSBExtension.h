// The PRJPSB TRE: Projection Parameters.
#pragma once

#include "NitfExtension.h"

class CPRJPSBExtension : public CNitfExtension {
public:
    void readInfo(FILE* fp) override;
    const char* getName() const override { return "PRJPSB"; }
};
