// The frame file index section subheader of an A.TOC (component 150, 13 bytes): how many frame file index
// records and pathname records the frame file index (component 151) holds.
#pragma once

#include "RpfFrameFileIndexRecord.h"

namespace nitf {

class CRpfFrameFileIndexSection : public CSerializableRecord {
public:
    static constexpr const char* kName = "RPF frame file index section subheader";
    static const int kLength = 13;

    FixedText<1> classification = makeText<1>("U"); // the highest of the frames'
    unsigned int tableOffset = 0;                   // not followed, like the boundary rectangles'
    unsigned int recordCount = 0;
    unsigned short pathnameCount = 0;
    unsigned short recordLength = CRpfFrameFileIndexRecord::kLength;

    void fields(CBinaryFields& f) override;
    const char* recordName() const override { return kName; }
};

} // namespace nitf
