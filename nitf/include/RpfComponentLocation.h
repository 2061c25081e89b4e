// One component location record of an RPF location section (10 bytes): where a component (a section or
// subsection, by its registered identifier) lies in the file.
#pragma once

#include "SerializableRecord.h"

namespace nitf {

class CRpfComponentLocation : public CSerializableRecord {
public:
    static constexpr const char* kName = "RPF component location records";
    static const int kLength = 10;

    unsigned short id = 0;
    unsigned int length = 0;
    unsigned int location = 0; // absolute file offset

    void fields(CBinaryFields& f) override;
    const char* recordName() const override { return kName; }
};

} // namespace nitf
