// The STREOB TRE: Stereo Information (version B).
#pragma once

#include "NitfExtension.h"

class CSTREOBExtension : public CNitfExtension {
public:
    void readInfo(FILE* fp) override;
    const char* getName() const override { return "STREOB"; }
};
