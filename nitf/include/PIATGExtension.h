// The imagery access profile's target TREs, PIATGA and PIATGB (version B adds the target's latitude and
// longitude).
#pragma once

#include "NitfExtension.h"

class CPIATGExtension : public CNitfExtension {
protected:
    // Only the sister TREs are built.
    CPIATGExtension() = default;
};
