#include "SerializerFileRaw.h"

#include <cstring>
#include <utility>

#include "HostFile.h"
#include "Serializable.h"
#include "SerializableArray.h"

namespace nitf {

void CSerializerFileRaw::swap(void* data, int size) {
    if (size < 2)
        return;
    unsigned char* bytes = static_cast<unsigned char*>(data);
    int half = size / 2;
    for (int i = 0; i < half; ++i)
        std::swap(bytes[i], bytes[half + i]);
    swap(bytes, half);
    swap(bytes + half, half);
}

CSerializer& CSerializerFileRaw::put(const void* value, int size) {
    unsigned char bytes[8];
    std::memcpy(bytes, value, size);
    if (m_swapping)
        swap(bytes, size);
    DKFWrite(bytes, size, 1, m_fp);
    return *this;
}

CSerializer& CSerializerFileRaw::get(void* value, int size) {
    unsigned char bytes[8] = {0};
    DKFRead(bytes, 1, size, m_fp);
    if (m_swapping)
        swap(bytes, size);
    std::memcpy(value, bytes, size);
    return *this;
}

CSerializer& CSerializerFileRaw::operator<<(const CSerializableArray& array) {
    if (array.getLength() > 0)
        DKFWrite(array.getData(), array.getLength(), 1, m_fp);
    return *this;
}

CSerializer& CSerializerFileRaw::operator<<(CSerializable& object) {
    object.serialize(*this);
    return *this;
}

CSerializer& CSerializerFileRaw::operator>>(CSerializableArray& array) {
    size_t length = array.getLength();
    size_t got = length > 0 ? DKFRead(array.getData(), 1, length, m_fp) : 0;
    if (got < length)
        std::memset(static_cast<char*>(array.getData()) + got, 0, length - got);
    return *this;
}

CSerializer& CSerializerFileRaw::operator>>(CSerializable& object) {
    object.deserialize(*this);
    return *this;
}

CSerializer& CSerializerFileRaw::seek(__int64 position) {
    DKFSeek64(m_fp, position, SEEK_SET);
    return *this;
}

__int64 CSerializerFileRaw::tell() {
    return DKFTell(m_fp);
}

} // namespace nitf
