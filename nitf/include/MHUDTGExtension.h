// The MHUDTG TRE, whose layout is not published: its whole data is kept as the one field MHUDTG_DATA.
#pragma once

#include "NitfExtension.h"

class CMHUDTGExtension : public CNitfExtension {
public:
    void readInfo(FILE* fp) override;
    const char* getName() const override { return "MHUDTG"; }
};
