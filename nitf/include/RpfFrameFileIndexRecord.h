// One frame file index record of an A.TOC (33 bytes): a frame file, its place in the frame grid of its
// boundary rectangle (row 0 at the south, column 0 at the west) and the pathname record of its directory.
#pragma once

#include "SerializableRecord.h"

namespace nitf {

class CRpfFrameFileIndexRecord : public CSerializableRecord {
public:
    static constexpr const char* kName = "RPF frame file index records";
    static const int kLength = 33;

    unsigned short boundaryRectangle = 0; // index into the boundary rectangle records
    unsigned short row = 0;
    unsigned short column = 0;
    unsigned int pathnameOffset = 0; // from the start of the frame file index (component 151)
    FixedText<12> fileName = makeText<12>("");
    FixedText<6> geographicLocation = makeText<6>("");
    FixedText<1> classification = makeText<1>("U");
    FixedText<2> countryCode = makeText<2>("");
    FixedText<2> releaseMarking = makeText<2>("");

    // Not stored: the index of the pathname record at pathnameOffset (-1 when there is none).
    int pathname = -1;

    void fields(CBinaryFields& f) override;
    const char* recordName() const override { return kName; }
};

} // namespace nitf
