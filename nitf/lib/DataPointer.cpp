#include "DataPointer.h"

#include "DataStream.h"

void CDataPointer::readData(FILE* fp, char* buffer) const {
    __int64 length = m_length > 0 ? m_length : 0;
    CDataStream::readZeroFilledAt(fp, m_offset, buffer, static_cast<size_t>(length));
    // Text segments and comments read this way end in a newline and are NUL-terminated.
    buffer[length] = '\n';
    buffer[length + 1] = '\0';
}
