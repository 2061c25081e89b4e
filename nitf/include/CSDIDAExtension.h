// The CSDIDA TRE: Dataset Identification.
#pragma once

#include "NitfExtension.h"

class CCSDIDAExtension : public CNitfExtension {
public:
    void readInfo(FILE* fp) override;
    const char* getName() const override { return "CSDIDA"; }
};
