// The imagery access profile's person TREs, PIAPEA and PIAPEB (they differ in the birth date's width).
#pragma once

#include "NitfExtension.h"

class CPIAPEExtension : public CNitfExtension {
protected:
    // Only the sister TREs are built.
    CPIAPEExtension() = default;
};
