// Moves binary records between memory and a file (or a length counter), field by field in file order.
#pragma once

#include <cstdint>

#include "HostCompat.h"

namespace nitf {

class CSerializable;
class CSerializableArray;

class CSerializer {
public:
    virtual ~CSerializer() {}

    virtual CSerializer& operator<<(__int64 value) = 0;
    virtual CSerializer& operator<<(int value) = 0;
    virtual CSerializer& operator<<(short value) = 0;
    virtual CSerializer& operator<<(char value) = 0;
    virtual CSerializer& operator<<(double value) = 0;
    virtual CSerializer& operator<<(unsigned int value) = 0;
    virtual CSerializer& operator<<(unsigned short value) = 0;
    virtual CSerializer& operator<<(unsigned char value) = 0;
    virtual CSerializer& operator<<(const CSerializableArray& array) = 0;
    virtual CSerializer& operator<<(CSerializable& object) = 0;

    virtual CSerializer& operator>>(double& value) = 0;
    virtual CSerializer& operator>>(int& value) = 0;
    virtual CSerializer& operator>>(short& value) = 0;
    virtual CSerializer& operator>>(char& value) = 0;
    virtual CSerializer& operator>>(__int64& value) = 0;
    virtual CSerializer& operator>>(unsigned int& value) = 0;
    virtual CSerializer& operator>>(unsigned short& value) = 0;
    virtual CSerializer& operator>>(unsigned char& value) = 0;
    virtual CSerializer& operator>>(CSerializableArray& array) = 0;
    virtual CSerializer& operator>>(CSerializable& object) = 0;

    // Absolute position from the start.
    virtual CSerializer& seek(__int64 position) = 0;
    virtual __int64 tell() = 0;
};

} // namespace nitf
