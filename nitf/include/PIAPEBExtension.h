// The PIAPEB TRE: Profile for Imagery Access: Person (version B).
#pragma once

#include "PIAPEExtension.h"

class CPIAPEBExtension : public CPIAPEExtension {
public:
    void readInfo(FILE* fp) override;
    const char* getName() const override { return "PIAPEB"; }
};
