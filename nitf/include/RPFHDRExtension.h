// The RPFHDR TRE: RPF Header (Raster Product Format header section).
#pragma once

#include "NitfExtension.h"

class CRPFHDRExtension : public CNitfExtension {
public:
    void readInfo(FILE* fp) override;
    const char* getName() const override { return "RPFHDR"; }
};
