#include "NitfImageSubheaderV21.h"

#include <cstring>
#include <string>

#include "DataStreamWrite.h"
#include "FieldLayout.h"
#include "HostFile.h"

// The 2.1 / NSIF identification and security fields between IDATIM and ENCRYP.
static const CFieldLayout& securityLayout21() {
    static const CFieldLayout layout =
        CFieldLayout{{"TGTID", 17}, {"IID2", 80}}.add(CFieldLayout::security21("IS"));
    return layout;
}

void CNitfImageSubheaderV21::read(FILE* fp, eNitfVersion_t version) {
    clearContents();
    static const CFieldLayout head{{"IM", 2}, {"IID1", 10}, {"IDATIM", 14}};
    static const CFieldLayout osde{{"IINFO", 97}, {"ISCSEC", 167}};
    head.read(fp, m_properties, &m_fieldNames);
    if (version == eOsdeVersion01)
        osde.read(fp, m_properties, &m_fieldNames);
    else if (version == eNitfVersion21 || version == eNitfVersion21Variant || version == eNsifVersion10)
        securityLayout21().read(fp, m_properties, &m_fieldNames);
    readBody(fp, {version, false, true, true});
    m_propertiesModified = false;
}

void CNitfImageSubheaderV21::write(FILE* fp) {
    writeFields(fp, {{"IM", 2}, {"IID1", 10}, {"IDATIM", 14}});
    for (const FieldSpec& field : securityLayout21().fields())
        writeFields(fp, {{field.name, field.width}});
    writeBody(fp);
}

__int64 CNitfImageSubheaderV21::computeStorageLength() {
    return computeBodyStorageLength(375);
}

void CNitfImageSubheaderV21::getTitle(char* title) {
    buildTitle("IID2", title);
}
