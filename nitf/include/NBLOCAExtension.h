// The NBLOCA TRE: Image Frame (Block) Offsets.
#pragma once

#include "NitfExtension.h"

class CNBLOCAExtension : public CNitfExtension {
public:
    void readInfo(FILE* fp) override;
    const char* getName() const override { return "NBLOCA"; }
};
