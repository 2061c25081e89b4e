// One pathname record of an A.TOC frame file index: the directory of some frames, relative to the A.TOC's
// ("./" or "./RPF/ONC/"), shared by all the frame records that point to it.
#pragma once

#include <string>

#include "SerializableRecord.h"

namespace nitf {

class CRpfPathnameRecord : public CSerializableRecord {
public:
    static constexpr const char* kName = "RPF pathname records";
    // The length field and at least one byte of text.
    static const int kShortest = 3;
    static const unsigned kLongestText = 256;

    unsigned short length = 0; // of the text, no terminator counted
    std::string text;

    void fields(CBinaryFields& f) override;
    const char* recordName() const override { return kName; }
};

} // namespace nitf
