// Reads fixed-width text fields and big-endian binary fields.
#pragma once

#include "DataStream.h"

class CDataStreamRead : public CDataStream {
public:
    explicit CDataStreamRead(FILE* fp, bool swap = true) : CDataStream(fp, swap) {}

    unsigned char readByte();
    unsigned short readUint16();
    int readInt32();
    unsigned int readUint32() { return static_cast<unsigned int>(readInt32()); }
    float readFloat();
    double readDouble();

    // New buffers from HMalloc: `length` bytes, or `length` bytes and a NUL. Bytes past the end of the file
    // read as zeros; a length the rest of the file cannot hold raises vexo::Exception.
    char* readBytes(int length);
    char* readText(int length);

    // Decimal fields: `width` characters converted like atoi / ScanInt64. A width of 32 or more reads nothing
    // and gives 0: no field of the format is that wide.
    int readDecimal(int width);
    __int64 readDecimal64(int width);

    // Moves the stream on by `length` bytes.
    void skip(__int64 length);

private:
    // Reads `length` bytes; what lies past the end of the file is zero-filled.
    void readRaw(void* buffer, size_t length);
};
