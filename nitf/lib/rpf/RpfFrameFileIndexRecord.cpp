#include "RpfFrameFileIndexRecord.h"

namespace nitf {

void CRpfFrameFileIndexRecord::fields(CBinaryFields& f) {
    f(boundaryRectangle);
    f(row);
    f(column);
    f(pathnameOffset);
    f(fileName);
    f(geographicLocation);
    f(classification);
    f(countryCode);
    f(releaseMarking);
}

} // namespace nitf
