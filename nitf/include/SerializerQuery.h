// Measures records without writing them: a running byte count, and the offset and length of registered
// objects.
#pragma once

#include <map>

#include "Serializer.h"

namespace nitf {

struct SerializerQueryInfo_t {
    bool found;     // the object was serialized
    __int64 length; // bytes it produced
    __int64 offset; // running count when it began
};

class CSerializerQuery : public CSerializer {
public:
    CSerializerQuery() : m_count(0) {}
    ~CSerializerQuery() override;
    CSerializerQuery(const CSerializerQuery&) = delete;
    CSerializerQuery& operator=(const CSerializerQuery&) = delete;

    CSerializer& operator<<(__int64) override { return add(8); }
    CSerializer& operator<<(int) override { return add(4); }
    CSerializer& operator<<(short) override { return add(2); }
    CSerializer& operator<<(char) override { return add(1); }
    CSerializer& operator<<(double) override { return add(8); }
    CSerializer& operator<<(unsigned int) override { return add(4); }
    CSerializer& operator<<(unsigned short) override { return add(2); }
    CSerializer& operator<<(unsigned char) override { return add(1); }
    CSerializer& operator<<(const CSerializableArray& array) override;
    CSerializer& operator<<(CSerializable& object) override;

    // A query reads nothing: reads leave the values alone and count their width like writes.
    CSerializer& operator>>(double&) override { return add(8); }
    CSerializer& operator>>(int&) override { return add(4); }
    CSerializer& operator>>(short&) override { return add(2); }
    CSerializer& operator>>(char&) override { return add(1); }
    CSerializer& operator>>(__int64&) override { return add(8); }
    CSerializer& operator>>(unsigned int&) override { return add(4); }
    CSerializer& operator>>(unsigned short&) override { return add(2); }
    CSerializer& operator>>(unsigned char&) override { return add(1); }
    CSerializer& operator>>(CSerializableArray& array) override;
    CSerializer& operator>>(CSerializable& object) override;

    CSerializer& seek(__int64 position) override;
    __int64 tell() override { return m_count; }

    // Registers an object whose offset and length are to be recorded when it is serialized.
    void addQuery(const void* object);
    // The info of a registered object that was serialized; null otherwise.
    SerializerQueryInfo_t* getQueryInfo(const void* object);

private:
    CSerializer& add(__int64 bytes) {
        m_count += bytes;
        return *this;
    }

    __int64 m_count;
    std::map<const void*, SerializerQueryInfo_t*> m_queries;
};

} // namespace nitf
