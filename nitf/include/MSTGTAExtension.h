// The MSTGTA TRE: Mission Target Information.
#pragma once

#include "NitfExtension.h"

class CMSTGTAExtension : public CNitfExtension {
public:
    void readInfo(FILE* fp) override;
    const char* getName() const override { return "MSTGTA"; }
};
