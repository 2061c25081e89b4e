#include "RpfHeaderSection.h"

namespace nitf {

void CRpfHeaderSection::fields(CBinaryFields& f) {
    f(byteOrder);
    f(headerSectionLength);
    f(fileName);
    f(newReplacementUpdate);
    f(standardNumber);
    f(standardDate);
    f(classification);
    f(countryCode);
    f(releaseMarking);
    f(locationSectionLocation);
}

} // namespace nitf
