#include "DataPointer.h"

#include "HostFile.h"

void CDataPointer::readData(FILE* fp, char* buffer) const {
    DKFSeek64(fp, m_offset, SEEK_SET);
    __int64 length = m_length > 0 ? m_length : 0;
    size_t got = length > 0 ? DKFRead(buffer, 1, static_cast<size_t>(length), fp) : 0;
    for (__int64 i = static_cast<__int64>(got); i < length; ++i)
        buffer[i] = 0;
    // Text segments and comments read this way end in a newline and are NUL-terminated.
    buffer[length] = '\n';
    buffer[length + 1] = '\0';
}
