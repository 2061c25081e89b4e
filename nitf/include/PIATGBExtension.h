// The PIATGB TRE: Profile for Imagery Access: Target (version B).
#pragma once

#include "PIATGExtension.h"

class CPIATGBExtension : public CPIATGExtension {
public:
    void readInfo(FILE* fp) override;
    const char* getName() const override { return "PIATGB"; }
};
