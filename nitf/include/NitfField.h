// The fields of a header, sub-header or TRE in file order, as their readers met them, and their values for
// people.
#pragma once

#include <string>

#include "HostCompat.h"

class CNitfProperty;

// What a field's bytes mean in the file.
enum eNitfFieldForm_t {
    eFieldText = 0,     // text (BCS), kept as it stands, blanks included
    eFieldBytes = 1,    // opaque bytes
    eFieldUnsigned = 2, // a big-endian unsigned integer of 1 to 8 bytes
    eFieldSigned = 3,   // a big-endian two's complement integer of 1 to 8 bytes
    eFieldFloat = 4,    // a big-endian IEEE single
    eFieldDouble = 5,   // a big-endian IEEE double
};

// One field as read: its key in the owner's property map, the form of its bytes, their number and their
// absolute file offset.
struct NitfField_t {
    const char* name;
    eNitfFieldForm_t form;
    int width;
    __int64 offset;
};

// The value of a field for people: text without trailing blanks, binary numbers in decimal, opaque bytes (and
// text holding bytes outside printable ASCII) as upper-case hexadecimal digits. "" for a null value.
std::string nitfFieldDisplayText(const NitfField_t& field, CNitfProperty* value);

// The number a binary field holds (integers in `integer` as well, when they are integers); false for text
// and opaque bytes, whose values are texts.
bool nitfFieldNumber(const NitfField_t& field, CNitfProperty* value, double* number, long long* integer,
                     bool* isInteger);
