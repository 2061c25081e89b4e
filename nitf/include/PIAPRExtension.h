// The imagery access profile's product TREs, PIAPRC and PIAPRD, which share one layout and field reader.
#pragma once

#include "NitfExtension.h"

class CPIAPRExtension : public CNitfExtension {
public:
    void readInfo(FILE* fp) override;

protected:
    // Only the sister TREs are built.
    CPIAPRExtension() = default;
};
