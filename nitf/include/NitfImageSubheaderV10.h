// The image sub-header of NITF 1.x: the 2.0 layout with the downgrading event always present and no
// user-defined or extended data areas.
#pragma once

#include "NitfImageSubheaderV20.h"

class CNitfImageSubheaderV10 : public CNitfImageSubheaderV20 {
protected:
    const CRecordLayout& readLayout(eNitfVersion_t version) const override;
};
