// A view over raw bytes that a serializer moves as they stand, never byte-swapped.
#pragma once

#include <cstddef>

namespace nitf {

class CSerializableArray {
public:
    CSerializableArray(void* data, size_t length) : m_data(data), m_length(length) {}
    CSerializableArray(const void* data, size_t length) : m_data(const_cast<void*>(data)), m_length(length) {}

    void* getData() const { return m_data; }
    size_t getLength() const { return m_length; }

private:
    void* m_data;
    size_t m_length;
};

} // namespace nitf
