// A binary record described by a layout, serialized through the serializer family: the join between the
// record engine and nitf::CSerializable. A record class holds one and forwards serialize and deserialize to
// it; its fields are then named values like those of every header.
#pragma once

#include "KeyStore.h"
#include "NitfProperty.h"
#include "RecordLayout.h"
#include "Serializable.h"

namespace nitf {

class CLayoutRecord : public CSerializable {
public:
    explicit CLayoutRecord(const CRecordLayout& layout) : m_layout(layout) {}
    ~CLayoutRecord() override { DestroyPropertyMap(m_fields); }
    CLayoutRecord(const CLayoutRecord&) = delete;
    CLayoutRecord& operator=(const CLayoutRecord&) = delete;

    void serialize(CSerializer& out) override { m_layout.serialize(out, m_fields); }
    // Replaces the fields by those read; `count` is the number of repetitions of an externally counted
    // group.
    void deserialize(CSerializer& in) override { deserialize(in, 0); }
    void deserialize(CSerializer& in, __int64 count);

    PropertyMap& getFields() { return m_fields; }
    // The bytes serialize produces.
    __int64 length() const { return m_layout.length(m_fields); }

private:
    const CRecordLayout& m_layout;
    PropertyMap m_fields;
    CKeyStore m_keys;
};

} // namespace nitf
