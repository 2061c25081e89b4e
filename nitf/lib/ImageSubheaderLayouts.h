// The image sub-header layouts of every version, from IM to the extended sub-header data.
#pragma once

#include "NitfTypes.h"
#include "RecordLayout.h"

// NITF 2.1 and NSIF; OSDE's identification and security fields when `version` is OSDE; neither block for a
// version outside the 2.1 family.
const CRecordLayout& imageSubheaderLayout21(eNitfVersion_t version);
// NITF 2.0: IID and ITITLE, the 2.0 security group, COMRAT for every compressed code, no XBANDS.
const CRecordLayout& imageSubheaderLayout20();
// NITF 1.x: the 2.0 layout with the downgrading event always present and no TRE areas.
const CRecordLayout& imageSubheaderLayout10();
