// The ICHIPB TRE: Image Chip Support.
#pragma once

#include "NitfExtension.h"

class CICHIPBExtension : public CNitfExtension {
public:
    void readInfo(FILE* fp) override;
    const char* getName() const override { return "ICHIPB"; }
};
