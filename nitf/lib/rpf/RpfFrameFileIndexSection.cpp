#include "RpfFrameFileIndexSection.h"

namespace nitf {

void CRpfFrameFileIndexSection::fields(CBinaryFields& f) {
    f(classification);
    f(tableOffset);
    f(recordCount);
    f(pathnameCount);
    f(recordLength);
}

} // namespace nitf
