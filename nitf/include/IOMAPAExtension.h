// The IOMAPA TRE: Input/Output Amplitude Mapping.
#pragma once

#include "NitfExtension.h"

class CIOMAPAExtension : public CNitfExtension {
public:
    void readInfo(FILE* fp) override;
    const char* getName() const override { return "IOMAPA"; }
};
