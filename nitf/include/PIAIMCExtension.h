// The PIAIMC TRE: Profile for Imagery Access: Image (version C).
#pragma once

#include "PIAIMExtension.h"

class CPIAIMCExtension : public CPIAIMExtension {
public:
    void readInfo(FILE* fp) override;
    const char* getName() const override { return "PIAIMC"; }
};
