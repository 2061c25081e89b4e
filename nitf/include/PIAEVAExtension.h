// The PIAEVA TRE: Profile for Imagery Access: Event.
#pragma once

#include "NitfExtension.h"

class CPIAEVAExtension : public CNitfExtension {
public:
    void readInfo(FILE* fp) override;
    const char* getName() const override { return "PIAEVA"; }
};
