// The BANDSB TRE: General Purpose Band Parameters (version B).
#pragma once

#include "NitfExtension.h"

class CBANDSBExtension : public CNitfExtension {
public:
    void readInfo(FILE* fp) override;
    const char* getName() const override { return "BANDSB"; }
};
