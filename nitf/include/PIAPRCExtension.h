// The PIAPRC TRE: Profile for Imagery Access: Product (version C).
#pragma once

#include "PIAPRExtension.h"

class CPIAPRCExtension : public CPIAPRExtension {
public:
    const char* getName() const override { return "PIAPRC"; }
};
