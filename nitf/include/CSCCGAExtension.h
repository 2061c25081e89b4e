// The CSCCGA TRE: Cloud Cover Grid.
#pragma once

#include "NitfExtension.h"

class CCSCCGAExtension : public CNitfExtension {
public:
    void readInfo(FILE* fp) override;
    const char* getName() const override { return "CSCCGA"; }
};
