// The ACFTB TRE: Aircraft Information (version B).
#pragma once

#include "NitfExtension.h"

class CACFTBExtension : public CNitfExtension {
public:
    void readInfo(FILE* fp) override;
    const char* getName() const override { return "ACFTB"; }
};
