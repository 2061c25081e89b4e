// The ENGRDA TRE: Engineering Data.
#pragma once

#include "NitfExtension.h"

class CENGRDAExtension : public CNitfExtension {
public:
    void readInfo(FILE* fp) override;
    const char* getName() const override { return "ENGRDA"; }
};
