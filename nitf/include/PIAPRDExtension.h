// The PIAPRD TRE: Profile for Imagery Access: Product (version D).
#pragma once

#include "PIAPRExtension.h"

class CPIAPRDExtension : public CPIAPRExtension {
public:
    const char* getName() const override { return "PIAPRD"; }
};
