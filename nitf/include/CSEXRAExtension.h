// The CSEXRA TRE: Exploitation Reference Data (version A).
#pragma once

#include "NitfExtension.h"

class CCSEXRAExtension : public CNitfExtension {
public:
    void readInfo(FILE* fp) override;
    const char* getName() const override { return "CSEXRA"; }
};
