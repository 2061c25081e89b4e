#include "RpfPathnameRecord.h"

namespace nitf {

void CRpfPathnameRecord::fields(CBinaryFields& f) {
    f(length);
    f.text(text, length, 1, kLongestText);
}

} // namespace nitf
