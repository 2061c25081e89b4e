// A place in the file: absolute offset and length, both 64-bit.
#pragma once

#include <cstdio>

#include "HostCompat.h"

class CDataPointer {
public:
    CDataPointer() : m_offset(0), m_length(0) {}
    CDataPointer(__int64 offset, __int64 length) : m_offset(offset), m_length(length) {}

    __int64 getOffset() const { return m_offset; }
    __int64 getLength() const { return m_length; }
    __int64 getEnd() const { return m_offset + m_length; }
    void setOffset(__int64 offset) { m_offset = offset; }
    void setLength(__int64 length) { m_length = length; }

    // Reads the bytes into `buffer` and appends a line feed and a NUL, so `buffer` must hold length + 2
    // bytes. Bytes beyond the end of the file read as zeros.
    void readData(FILE* fp, char* buffer) const;

private:
    __int64 m_offset;
    __int64 m_length;
};
