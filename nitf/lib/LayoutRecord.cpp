#include "LayoutRecord.h"

namespace nitf {

void CLayoutRecord::deserialize(CSerializer& in, __int64 count) {
    DestroyPropertyMap(m_fields);
    m_keys.clear();
    m_layout.deserialize(in, m_fields, m_keys, count);
}

} // namespace nitf
