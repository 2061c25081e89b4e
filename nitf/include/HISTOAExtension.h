// The HISTOA TRE: Softcopy History.
#pragma once

#include "NitfExtension.h"

class CHISTOAExtension : public CNitfExtension {
public:
    void readInfo(FILE* fp) override;
    const char* getName() const override { return "HISTOA"; }
};
