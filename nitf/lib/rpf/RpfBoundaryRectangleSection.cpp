#include "RpfBoundaryRectangleSection.h"

namespace nitf {

void CRpfBoundaryRectangleSection::fields(CBinaryFields& f) {
    f(tableOffset);
    f(recordCount);
    f(recordLength);
}

} // namespace nitf
