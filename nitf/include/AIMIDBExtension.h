// The AIMIDB TRE: Additional Image Identification (version B).
#pragma once

#include "NitfExtension.h"

class CAIMIDBExtension : public CNitfExtension {
public:
    void readInfo(FILE* fp) override;
    const char* getName() const override { return "AIMIDB"; }
};
