// The USE00A TRE: Exploitation Usability.
#pragma once

#include "NitfExtension.h"

class CUSE00AExtension : public CNitfExtension {
public:
    void readInfo(FILE* fp) override;
    const char* getName() const override { return "USE00A"; }
};
