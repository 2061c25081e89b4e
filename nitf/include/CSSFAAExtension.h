// The CSSFAA TRE: Sensor Field Alignment.
#pragma once

#include "NitfExtension.h"

class CCSSFAAExtension : public CNitfExtension {
public:
    void readInfo(FILE* fp) override;
    const char* getName() const override { return "CSSFAA"; }
};
