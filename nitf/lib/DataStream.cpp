#include "DataStream.h"

#include <algorithm>
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
    __int64 size = DKSize(fp);
    __int64 position = DKFTell(fp);
    if (size < 0 || position < 0 || position > size)
        return 0;
    return size - position;
}

void CDataStream::requireReadable(FILE* fp, __int64 length, const char* what) {
    if (length < 0)
        NITF_RAISE_FORMAT("void __cdecl CDataStream::requireReadable(" NITF_FILE_SIG ",__int64,const char *)",
                          "%s has a negative length (%lld)", what, length);
    if (length > remaining(fp))
        NITF_RAISE_FORMAT("void __cdecl CDataStream::requireReadable(" NITF_FILE_SIG ",__int64,const char *)",
                          "%s of %lld bytes runs past the end of the file", what, length);
}
