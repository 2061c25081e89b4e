#include "DataStream.h"

#include <algorithm>
#include <cstring>
#include <utility>

#include "HostFile.h"
#include "Raise.h"

static const char kSourceFile[] = "nitf/lib/DataStream";

void CDataStream::reverse(void* value, int size) {
    if (size != 2 && size != 4 && size != 8)
        return;
    unsigned char* bytes = static_cast<unsigned char*>(value);
    std::reverse(bytes, bytes + size);
}

__int64 CDataStream::remaining(FILE* fp) {
    __int64 position = DKFTell(fp);
    if (position < 0)
        return 0;
    __int64 size = DKSize(fp);
    if (size < 0) {
        if (DKFSeek64(fp, 0, SEEK_END) != 0)
            return 0;
        size = DKFTell(fp);
        DKFSeek64(fp, position, SEEK_SET);
    }
    return size > position ? size - position : 0;
}

size_t CDataStream::readZeroFilled(FILE* fp, void* buffer, size_t length) {
    size_t got = length > 0 ? DKFRead(buffer, 1, length, fp) : 0;
    if (got < length)
        std::memset(static_cast<char*>(buffer) + got, 0, length - got);
    return got;
}

size_t CDataStream::readZeroFilledAt(FILE* fp, __int64 offset, void* buffer, size_t length) {
    if (offset < 0 || DKFSeek64(fp, offset, SEEK_SET) != 0) {
        std::memset(buffer, 0, length);
        return 0;
    }
    return readZeroFilled(fp, buffer, length);
}

void CDataStream::requireReadable(FILE* fp, __int64 length, const char* what) {
    if (length < 0)
        NITF_RAISE_FORMAT("void __cdecl CDataStream::requireReadable(" NITF_FILE_SIG ",__int64,const char *)",
                          "%s has a negative length (%lld)", what, length);
    if (length > remaining(fp))
        NITF_RAISE_FORMAT("void __cdecl CDataStream::requireReadable(" NITF_FILE_SIG ",__int64,const char *)",
                          "%s of %lld bytes runs past the end of the file", what, length);
}
