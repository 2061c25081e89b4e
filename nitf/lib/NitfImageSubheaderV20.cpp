#include "NitfImageSubheaderV20.h"

#include "FieldLayout.h"

const CFieldLayout& CNitfImageSubheaderV20::headLayout() const {
    static const CFieldLayout layout =
        CFieldLayout{{"IM", 2}, {"IID", 10}, {"IDATIM", 14}, {"TGTID", 17}, {"ITITLE", 80}}.add(
            CFieldLayout::security20("IS"));
    return layout;
}

void CNitfImageSubheaderV20::read(FILE* fp, eNitfVersion_t version) {
    clearContents();
    headLayout().read(fp, m_properties, &m_fieldNames);
    readBody(fp, {version, true, false, true});
    m_propertiesModified = false;
}

void CNitfImageSubheaderV20::write(FILE* fp) {
    headLayout().write(fp, m_properties);
    writeBody(fp);
}

__int64 CNitfImageSubheaderV20::computeStorageLength() {
    // ENCRYP to ICORDS (82 bytes), NICOM and IC follow the head.
    return computeBodyStorageLength(headLayout().length(m_properties) + 82 + 1 + 2);
}

void CNitfImageSubheaderV20::getTitle(char* title) {
    buildTitle("ITITLE", title);
}
