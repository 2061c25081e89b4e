#include "DataStreamRead.h"

#include <cstring>

#include "HostFile.h"
#include "HostMemory.h"
#include "Raise.h"

// Fields up to this size are read without first asking the file how much is left: they cost nothing to
// allocate, and a short read of them is handled by zero-filling.
static const int kSmallField = 1 << 16;

void CDataStreamRead::readRaw(void* buffer, size_t length) {
    readZeroFilled(m_fp, buffer, length);
}

unsigned char CDataStreamRead::readByte() {
    unsigned char value;
    readRaw(&value, 1);
    return value;
}

unsigned short CDataStreamRead::readUint16() {
    unsigned short value;
    readRaw(&value, sizeof value);
    swapIfNeeded(&value, sizeof value);
    return value;
}

int CDataStreamRead::readInt32() {
    int value;
    readRaw(&value, sizeof value);
    swapIfNeeded(&value, sizeof value);
    return value;
}

float CDataStreamRead::readFloat() {
    float value;
    readRaw(&value, sizeof value);
    swapIfNeeded(&value, sizeof value);
    return value;
}

double CDataStreamRead::readDouble() {
    double value;
    readRaw(&value, sizeof value);
    swapIfNeeded(&value, sizeof value);
    return value;
}

char* CDataStreamRead::readBytes(int length) {
    if (length < 0)
        length = 0;
    if (length > kSmallField)
        requireReadable(m_fp, length, "A field");
    char* buffer = static_cast<char*>(HMalloc(length > 0 ? length : 1));
    readRaw(buffer, length);
    return buffer;
}

char* CDataStreamRead::readText(int length) {
    if (length < 0)
        length = 0;
    if (length > kSmallField)
        requireReadable(m_fp, length, "A text field");
    char* buffer = static_cast<char*>(HMalloc(static_cast<size_t>(length) + 1));
    readRaw(buffer, length);
    buffer[length] = '\0';
    return buffer;
}

int CDataStreamRead::readDecimal(int width) {
    if (width >= 32 || width <= 0)
        return 0;
    char text[32];
    readRaw(text, width);
    text[width] = '\0';
    return nitf_detail::parseInt(text);
}

__int64 CDataStreamRead::readDecimal64(int width) {
    if (width >= 32 || width <= 0)
        return 0;
    char text[32];
    readRaw(text, width);
    text[width] = '\0';
    return ScanInt64(text, -1);
}

void CDataStreamRead::skip(__int64 length) {
    DKFSeek64(m_fp, length, SEEK_CUR);
}
