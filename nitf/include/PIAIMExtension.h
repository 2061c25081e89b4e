// The imagery access profile's image TREs, PIAIMB and PIAIMC (version C adds six fields to the 13 of
// version B).
#pragma once

#include "NitfExtension.h"

class CPIAIMExtension : public CNitfExtension {
protected:
    // Only the sister TREs are built.
    CPIAIMExtension() = default;
};
