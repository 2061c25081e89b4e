// The boundary rectangle section subheader of an A.TOC (component 148, 8 bytes): how many boundary rectangle
// records the table (component 149) holds, and their length.
#pragma once

#include "RpfBoundaryRectangleRecord.h"

namespace nitf {

class CRpfBoundaryRectangleSection : public CSerializableRecord {
public:
    static constexpr const char* kName = "RPF boundary rectangle section subheader";
    static const int kLength = 8;

    unsigned int tableOffset = 0; // not followed: the table is found through its own component location
    unsigned short recordCount = 0;
    unsigned short recordLength = CRpfBoundaryRectangleRecord::kLength;

    void fields(CBinaryFields& f) override;
    const char* recordName() const override { return kName; }
};

} // namespace nitf
