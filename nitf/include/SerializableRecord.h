// A binary record described once: its fields(), listed in file order on a CBinaryFields, serve writing,
// reading and measuring alike.
#pragma once

#include "BinaryFields.h"
#include "Serializable.h"

namespace nitf {

class CSerializableRecord : public CSerializable {
public:
    void serialize(CSerializer& out) override;
    // Reads through a file serializer, each field checked against the end of its file; raises vexo::Exception
    // for a record that runs past it, and for serializers whose end cannot be told.
    void deserialize(CSerializer& in) override;

    // The record's fields in file order.
    virtual void fields(CBinaryFields& fields) = 0;
    // What the record is, for messages ("RPF header section").
    virtual const char* recordName() const = 0;
};

} // namespace nitf
