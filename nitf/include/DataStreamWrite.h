// Writes fixed-width text fields and big-endian binary fields.
#pragma once

#include "DataStream.h"

class CDataStreamWrite : public CDataStream {
public:
    explicit CDataStreamWrite(FILE* fp, bool swap = true) : CDataStream(fp, swap) {}

    // Right-justified in `width`, filled on the left with '0' (zeroFill) or blanks; fill goes before a minus
    // sign and a value wider than `width` is not cut.
    void writeDecimal(int value, int width, bool zeroFill);
    void writeDecimal64(__int64 value, int width, bool zeroFill);
    // Cut to `width`, then blanks up to `width`.
    void writeText(const char* text, int width);
    void writeByte(unsigned char value);
    void writeUint16(unsigned short value);
    void writeInt32(int value);
    void writeBytes(const void* bytes, size_t length);

    // The decimal field text itself, as written by writeDecimal64.
    static void formatDecimal(char* out, __int64 value, int width, bool zeroFill);
};
