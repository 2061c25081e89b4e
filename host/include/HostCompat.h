// Portable spellings of the few compiler-specific names that the library's interface uses.
#pragma once

#include <strings.h>

#ifndef _MSC_VER
// A 64-bit integer under the name that the exported interface uses for file positions and lengths. A macro, not a
// typedef, so that "unsigned __int64" works as it does where the name is built in.
#define __int64 long long

// Case-insensitive comparisons (ASCII), as the format's identifiers need them.
inline int _stricmp(const char* a, const char* b) { return strcasecmp(a, b); }
inline int _strnicmp(const char* a, const char* b, size_t n) { return strncasecmp(a, b, n); }
#endif

// The function signature texts carried by exceptions spell a C stream as the host's stdio structure.
#define NITF_FILE_SIG "struct _iobuf *"
