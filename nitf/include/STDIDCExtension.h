// The STDIDC TRE: Standard ID (version C).
#pragma once

#include "NitfExtension.h"

class CSTDIDCExtension : public CNitfExtension {
public:
    void readInfo(FILE* fp) override;
    const char* getName() const override { return "STDIDC"; }
};
