// The PIAPEA TRE: Profile for Imagery Access: Person (version A).
#pragma once

#include "PIAPEExtension.h"

class CPIAPEAExtension : public CPIAPEExtension {
public:
    void readInfo(FILE* fp) override;
    const char* getName() const override { return "PIAPEA"; }
};
