#include "RpfComponentLocation.h"

namespace nitf {

void CRpfComponentLocation::fields(CBinaryFields& f) {
    f(id);
    f(length);
    f(location);
}

} // namespace nitf
