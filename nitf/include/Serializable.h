// A record that can be written to and read from a serializer, field by field in file order.
#pragma once

namespace nitf {

class CSerializer;

class CSerializable {
public:
    virtual ~CSerializable() {}
    virtual void serialize(CSerializer& out) = 0;
    virtual void deserialize(CSerializer& in) = 0;
};

} // namespace nitf
