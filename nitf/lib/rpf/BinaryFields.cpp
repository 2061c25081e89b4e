#include "BinaryFields.h"

#include "Raise.h"
#include "SerializableArray.h"
#include "SerializableRecord.h"

static const char kSourceFile[] = "nitf/lib/rpf/BinaryFields";

namespace nitf {

CBinaryFields::CBinaryFields(CSerializer& serializer, eDirection_t direction, __int64 readLimit)
    : m_serializer(serializer), m_direction(direction), m_readLimit(readLimit), m_position(serializer.tell()),
      m_record("RPF record") {}

CBinaryFields& CBinaryFields::seek(__int64 position) {
    m_serializer.seek(position);
    m_position = position;
    return *this;
}

void CBinaryFields::require(__int64 length) {
    if (m_position < 0 || length > m_readLimit - m_position)
        NITF_RAISE_FORMAT("void __cdecl nitf::CBinaryFields::require(__int64)",
                          "The %s at byte %lld runs past the end of the file (%lld bytes)", m_record,
                          m_position, m_readLimit);
}

void CBinaryFields::checkTable(const char* name, __int64 count, __int64 at, __int64 recordLength,
                               __int64 fieldsLength) {
    static const char signature[] =
        "void __cdecl nitf::CBinaryFields::checkTable(const char *,__int64,__int64,__int64,__int64)";
    if (count <= 0)
        return;
    if (recordLength < fieldsLength)
        NITF_RAISE_FORMAT(signature, "The %s length of %lld bytes is shorter than its fields (%lld bytes)",
                          name, recordLength, fieldsLength);
    // Each record must be in the file: that bounds what is allocated for them by the file's size.
    if (at < 0 || at > m_readLimit || count > (m_readLimit - at) / recordLength)
        NITF_RAISE_FORMAT(signature,
                          "%lld of the %s (%lld bytes each, from byte %lld) run past the end of the file "
                          "(%lld bytes)",
                          count, name, recordLength, at, m_readLimit);
}

namespace {

template <typename Value> void move(CSerializer& serializer, bool reading, Value& value) {
    if (reading)
        serializer >> value;
    else
        serializer << value;
}

} // namespace

CBinaryFields& CBinaryFields::operator()(unsigned char& value) {
    if (reading())
        require(sizeof value);
    move(m_serializer, reading(), value);
    m_position += sizeof value;
    return *this;
}

CBinaryFields& CBinaryFields::operator()(unsigned short& value) {
    if (reading())
        require(sizeof value);
    move(m_serializer, reading(), value);
    m_position += sizeof value;
    return *this;
}

CBinaryFields& CBinaryFields::operator()(unsigned int& value) {
    if (reading())
        require(sizeof value);
    move(m_serializer, reading(), value);
    m_position += sizeof value;
    return *this;
}

CBinaryFields& CBinaryFields::operator()(double& value) {
    if (reading())
        require(sizeof value);
    move(m_serializer, reading(), value);
    m_position += sizeof value;
    return *this;
}

CBinaryFields& CBinaryFields::bytes(void* data, size_t length) {
    CSerializableArray array(data, length);
    if (reading()) {
        require(static_cast<__int64>(length));
        m_serializer >> array;
    } else {
        m_serializer << array;
    }
    m_position += static_cast<__int64>(length);
    return *this;
}

CBinaryFields& CBinaryFields::text(std::string& text, unsigned length, unsigned shortest, unsigned longest) {
    static const char signature[] =
        "class nitf::CBinaryFields &__cdecl nitf::CBinaryFields::text(class std::string "
        "&,unsigned int,unsigned int,unsigned int)";
    if (reading()) {
        if (length < shortest || length > longest)
            NITF_RAISE_FORMAT(signature, "The %s at byte %lld has a text of %u bytes (%u to %u are allowed)",
                              m_record, m_position, length, shortest, longest);
        require(length);
        text.assign(length, '\0');
    } else if (text.size() != length) {
        // The length field and the text disagree: the record would not read back.
        NITF_RAISE_FORMAT(signature, "A text of %zu bytes is given a length of %u", text.size(), length);
    }
    return bytes(&text[0], text.size());
}

CBinaryFields& CBinaryFields::operator()(CSerializableRecord& record) {
    if (!reading()) {
        m_serializer << record;
        m_position = m_serializer.tell();
        return *this;
    }
    // Nested records read on this driver, under their own name.
    const char* outer = m_record;
    m_record = record.recordName();
    record.fields(*this);
    m_record = outer;
    return *this;
}

} // namespace nitf
