// The PIAIMB TRE: Profile for Imagery Access: Image (version B).
#pragma once

#include "PIAIMExtension.h"

class CPIAIMBExtension : public CPIAIMExtension {
public:
    void readInfo(FILE* fp) override;
    const char* getName() const override { return "PIAIMB"; }
};
