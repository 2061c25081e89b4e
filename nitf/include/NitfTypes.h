// Types shared across the library's interface.
#pragma once

// The file's format version; the numbers are fixed (the creator, the sub-header factories and the
// georeferencing compare against them).
enum eNitfVersion_t {
    eNitfVersion11 = 0,        // "NITF01.10"
    eNitfVersion20 = 1,        // "NITF02.00"
    eNitfVersion21 = 2,        // "NITF02.10"
    eNitfVersion21Variant = 3, // a further member of the 2.1 family: never detected, handled as NITF 2.1
    eNsifVersion10 = 4,        // "NSIF01.00" and "NSIF01.01"
    eOsdeVersion01 = 5,        // "OSDE01.00": the 2.1 layout with its own security and originator fields
    eNitfVersionUnknown = 6,
};

// True for the versions read with the NITF 2.1 layout (2.1, the variant value, NSIF and OSDE).
inline bool isNitf21Family(eNitfVersion_t version) {
    return version == eNitfVersion21 || version == eNitfVersion21Variant || version == eNsifVersion10 ||
           version == eOsdeVersion01;
}
