// The J2KLRA TRE: JPEG 2000 Layer Information.
#pragma once

#include "NitfExtension.h"

class CJ2KLRAExtension : public CNitfExtension {
public:
    void readInfo(FILE* fp) override;
    const char* getName() const override { return "J2KLRA"; }
};
