// The RPF header section (48 bytes): the first part of every RPF file, carried as the data of the RPFHDR TRE
// or as the first bytes of a raw A.TOC file.
#pragma once

#include "SerializableRecord.h"

namespace nitf {

class CRpfHeaderSection : public CSerializableRecord {
public:
    static constexpr const char* kName = "RPF header section";
    static const int kLength = 48;

    unsigned char byteOrder = 0; // 0x00 big-endian, 0xFF little-endian
    unsigned short headerSectionLength = kLength;
    FixedText<12> fileName = makeText<12>("");
    unsigned char newReplacementUpdate = 0; // 0 new, 1 replacement, 2 update
    FixedText<15> standardNumber = makeText<15>("");
    FixedText<8> standardDate = makeText<8>("");
    FixedText<1> classification = makeText<1>("U");
    FixedText<2> countryCode = makeText<2>("");
    FixedText<2> releaseMarking = makeText<2>("");
    unsigned int locationSectionLocation = 0; // absolute file offset

    void fields(CBinaryFields& f) override;
    const char* recordName() const override { return kName; }
};

} // namespace nitf
