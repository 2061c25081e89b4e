#include "SerializerQuery.h"

#include "Serializable.h"
#include "SerializableArray.h"

namespace nitf {

CSerializerQuery::~CSerializerQuery() {
    for (auto& entry : m_queries)
        delete entry.second;
}

CSerializer& CSerializerQuery::operator<<(const CSerializableArray& array) {
    return add(static_cast<__int64>(array.getLength()));
}

CSerializer& CSerializerQuery::operator<<(CSerializable& object) {
    auto found = m_queries.find(&object);
    if (found == m_queries.end()) {
        object.serialize(*this);
        return *this;
    }
    SerializerQueryInfo_t* info = found->second;
    info->offset = m_count;
    info->found = true;
    object.serialize(*this);
    info->length = m_count - info->offset;
    return *this;
}

CSerializer& CSerializerQuery::operator>>(CSerializableArray& array) {
    return add(static_cast<__int64>(array.getLength()));
}

CSerializer& CSerializerQuery::operator>>(CSerializable& object) {
    return *this << object;
}

CSerializer& CSerializerQuery::seek(__int64 position) {
    m_count = position;
    return *this;
}

void CSerializerQuery::addQuery(const void* object) {
    if (m_queries.count(object) == 0)
        m_queries[object] = new SerializerQueryInfo_t{false, 0, 0};
}

SerializerQueryInfo_t* CSerializerQuery::getQueryInfo(const void* object) {
    auto found = m_queries.find(object);
    if (found == m_queries.end() || !found->second->found)
        return nullptr;
    return found->second;
}

} // namespace nitf
