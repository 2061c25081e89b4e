// One boundary rectangle record of an A.TOC (component 149, 132 bytes): a set of frames sharing product,
// scale and zone, with its corners, resolutions, pixel intervals and frame grid.
#pragma once

#include "SerializableRecord.h"

namespace nitf {

class CRpfBoundaryRectangleRecord : public CSerializableRecord {
public:
    static constexpr const char* kName = "RPF boundary rectangle records";
    static const int kLength = 132;

    FixedText<5> productDataType = makeText<5>("");
    FixedText<5> compressionRatio = makeText<5>("");
    FixedText<12> scale = makeText<12>("");
    FixedText<1> zone = makeText<1>("");
    FixedText<5> producer = makeText<5>("");
    // Corners as latitude and longitude in degrees.
    double upperLeftLatitude = 0, upperLeftLongitude = 0;
    double lowerLeftLatitude = 0, lowerLeftLongitude = 0;
    double upperRightLatitude = 0, upperRightLongitude = 0;
    double lowerRightLatitude = 0, lowerRightLongitude = 0;
    // Metres per pixel.
    double verticalResolution = 0, horizontalResolution = 0;
    // Degrees per pixel.
    double verticalInterval = 0, horizontalInterval = 0;
    unsigned int verticalFrames = 0, horizontalFrames = 0;

    void fields(CBinaryFields& f) override;
    const char* recordName() const override { return kName; }
};

} // namespace nitf
