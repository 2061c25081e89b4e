// The one list of the TREs the library knows: adding a TRE is its class file (whose layout reads its fields)
// and one line in TreRegistry.cpp. The factory (CNitfExtension::Build), the known-extension list, the names
// the tests and fuzz targets go through all follow from it.
#pragma once

#include <vector>

class CNitfExtension;

struct TreRegistration {
    const char* name;            // the identifier, without trailing blanks
    CNitfExtension* (*create)(); // a new parser, or null for TREs parsed elsewhere (the RPC source's)
};

// In the order Build tries them.
const std::vector<TreRegistration>& treRegistry();
