#include "RpfLocationSection.h"

namespace nitf {

void CRpfLocationSection::fields(CBinaryFields& f) {
    const __int64 start = f.position();
    f(sectionLength);
    f(tableOffset);
    f(recordCount);
    f(recordLength);
    f(aggregateLength);
    f.table(components, recordCount, start + tableOffset, recordLength);
}

CRpfComponentLocation* CRpfLocationSection::find(unsigned short id) {
    for (CRpfComponentLocation& component : components)
        if (component.id == id)
            return &component;
    return nullptr;
}

} // namespace nitf
