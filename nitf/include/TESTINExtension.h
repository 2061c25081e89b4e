// The TESTIN TRE, whose layout is not published: its whole data is kept as the one field TESTIN_DATA.
#pragma once

#include "NitfExtension.h"

class CTESTINExtension : public CNitfExtension {
public:
    void readInfo(FILE* fp) override;
    const char* getName() const override { return "TESTIN"; }
};
