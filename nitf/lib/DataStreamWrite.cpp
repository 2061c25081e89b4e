#include "DataStreamWrite.h"

#include <cstring>
#include <vector>

#include "HostFile.h"
#include "HostMemory.h"

void CDataStreamWrite::formatDecimal(char* out, __int64 value, int width, bool zeroFill) {
    char digits[32];
    PrintInt64(digits, value);
    int length = static_cast<int>(std::strlen(digits));
    int fill = width > length ? width - length : 0;
    std::memset(out, zeroFill ? '0' : ' ', fill);
    std::memcpy(out + fill, digits, length + 1);
}

void CDataStreamWrite::writeDecimal(int value, int width, bool zeroFill) {
    writeDecimal64(value, width, zeroFill);
}

void CDataStreamWrite::writeDecimal64(__int64 value, int width, bool zeroFill) {
    std::vector<char> text(static_cast<size_t>(width > 0 ? width : 0) + 32);
    formatDecimal(text.data(), value, width, zeroFill);
    writeBytes(text.data(), std::strlen(text.data()));
}

void CDataStreamWrite::writeText(const char* text, int width) {
    if (width <= 0)
        return;
    std::vector<char> field(width, ' ');
    size_t length = text ? strnlen(text, width) : 0;
    std::memcpy(field.data(), text, length);
    writeBytes(field.data(), width);
}

void CDataStreamWrite::writeByte(unsigned char value) {
    writeBytes(&value, 1);
}

void CDataStreamWrite::writeUint16(unsigned short value) {
    swapIfNeeded(&value, sizeof value);
    writeBytes(&value, sizeof value);
}

void CDataStreamWrite::writeInt32(int value) {
    swapIfNeeded(&value, sizeof value);
    writeBytes(&value, sizeof value);
}

void CDataStreamWrite::writeBytes(const void* bytes, size_t length) {
    if (length > 0)
        DKFWrite(bytes, length, 1, m_fp);
}
