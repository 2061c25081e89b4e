// The security group that every header and sub-header carries, named by its owner's prefix ("FS", "IS",
// "DES",
// ...), as layout entries.
#pragma once

#include <vector>

#include "RecordLayout.h"

// The 2.1-family group: CLAS, CLSY, CODE, CTLH, REL, DCTP, DCDT, DCXM, DG, DGDT, CLTX, CATP, CAUT, CRSN,
// SRDT, CTLN.
const std::vector<record::Entry>& securityFields21(const char* prefix);

// The NITF 2.0 group: CLAS, CODE, CTLH, REL, CAUT, CTLN, DWNG, and DEVT only for the downgrade code "999998"
// (always, when `alwaysEvent`, as NITF 1.x readers take it). `controlName` replaces the control-and-handling
// field's name when given.
const std::vector<record::Entry>& securityFields20(const char* prefix, const char* controlName = nullptr,
                                                   bool alwaysEvent = false);
