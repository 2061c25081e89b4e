// The PIAEQA TRE: Profile for Imagery Access: Equipment.
#pragma once

#include "NitfExtension.h"

class CPIAEQAExtension : public CNitfExtension {
public:
    void readInfo(FILE* fp) override;
    const char* getName() const override { return "PIAEQA"; }
};
