// The CSPROA TRE: Processing Information.
#pragma once

#include "NitfExtension.h"

class CCSPROAExtension : public CNitfExtension {
public:
    void readInfo(FILE* fp) override;
    const char* getName() const override { return "CSPROA"; }
};
