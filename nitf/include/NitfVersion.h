// The library's version, as built.
#pragma once

// "MAJOR.MINOR.PATCH"
const char* nitfVersion();
