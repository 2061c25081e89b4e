// The ESD001 TRE, whose layout is not published: its whole data is kept as the one field ESD001_DATA.
#pragma once

#include "NitfExtension.h"

class CESD001Extension : public CNitfExtension {
public:
    void readInfo(FILE* fp) override;
    const char* getName() const override { return "ESD001"; }
};
