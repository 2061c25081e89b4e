#include "RpfBoundaryRectangleRecord.h"

namespace nitf {

void CRpfBoundaryRectangleRecord::fields(CBinaryFields& f) {
    f(productDataType);
    f(compressionRatio);
    f(scale);
    f(zone);
    f(producer);
    f(upperLeftLatitude);
    f(upperLeftLongitude);
    f(lowerLeftLatitude);
    f(lowerLeftLongitude);
    f(upperRightLatitude);
    f(upperRightLongitude);
    f(lowerRightLatitude);
    f(lowerRightLongitude);
    f(verticalResolution);
    f(horizontalResolution);
    f(verticalInterval);
    f(horizontalInterval);
    f(verticalFrames);
    f(horizontalFrames);
}

} // namespace nitf
