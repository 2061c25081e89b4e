// The JITCID TRE: JITC Identification.
#pragma once

#include "NitfExtension.h"

class CJITCIDExtension : public CNitfExtension {
public:
    void readInfo(FILE* fp) override;
    const char* getName() const override { return "JITCID"; }
};
