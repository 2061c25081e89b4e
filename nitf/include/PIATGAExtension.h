// The PIATGA TRE: Profile for Imagery Access: Target (version A).
#pragma once

#include "PIATGExtension.h"

class CPIATGAExtension : public CPIATGExtension {
public:
    void readInfo(FILE* fp) override;
    const char* getName() const override { return "PIATGA"; }
};
