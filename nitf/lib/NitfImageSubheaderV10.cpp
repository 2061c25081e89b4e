#include "NitfImageSubheaderV10.h"

#include "FieldLayout.h"

const CFieldLayout& CNitfImageSubheaderV10::headLayout() const {
    // Readers of 1.x take the downgrading event as always present.
    static const CFieldLayout layout = [] {
        CFieldLayout head{{"IM", 2}, {"IID", 10}, {"IDATIM", 14}, {"TGTID", 17}, {"ITITLE", 80}};
        const CFieldLayout security = CFieldLayout::security20("IS");
        for (FieldSpec field : security.fields()) {
            field.when = {};
            head.add(field);
        }
        return head;
    }();
    return layout;
}

void CNitfImageSubheaderV10::read(FILE* fp, eNitfVersion_t version) {
    clearContents();
    headLayout().read(fp, m_properties, &m_fieldNames);
    readBody(fp, {version, true, false, false});
    m_propertiesModified = false;
}
