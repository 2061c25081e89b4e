// The RPF location section: its 14-byte header and the table of component location records that it points
// to.
#pragma once

#include <vector>

#include "RpfComponentLocation.h"

namespace nitf {

class CRpfLocationSection : public CSerializableRecord {
public:
    static constexpr const char* kName = "RPF location section";
    static const int kHeaderLength = 14;

    unsigned short sectionLength = kHeaderLength;
    unsigned int tableOffset = kHeaderLength; // from the start of the section
    unsigned short recordCount = 0;
    unsigned short recordLength = CRpfComponentLocation::kLength;
    unsigned int aggregateLength = 0; // the lengths of all the components listed
    std::vector<CRpfComponentLocation> components;

    void fields(CBinaryFields& f) override;
    const char* recordName() const override { return kName; }

    // The record of component `id`, or null.
    CRpfComponentLocation* find(unsigned short id);
};

} // namespace nitf
