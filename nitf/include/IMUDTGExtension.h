// The IMUDTG TRE, whose layout is not published: its whole data is kept as the one field IMUDTG_DATA.
#pragma once

#include "NitfExtension.h"

class CIMUDTGExtension : public CNitfExtension {
public:
    void readInfo(FILE* fp) override;
    const char* getName() const override { return "IMUDTG"; }
};
