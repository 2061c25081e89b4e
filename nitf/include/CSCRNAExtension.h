// The CSCRNA TRE: Corner Footprint.
#pragma once

#include "NitfExtension.h"

class CCSCRNAExtension : public CNitfExtension {
public:
    void readInfo(FILE* fp) override;
    const char* getName() const override { return "CSCRNA"; }
};
