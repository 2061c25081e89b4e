#include "NitfTextSource.h"

#include "DataPointer.h"
#include "DataStream.h"
#include "FieldLayout.h"
#include "NitfFile.h"

static const CFieldLayout& textLayout21() {
    static const CFieldLayout layout =
        CFieldLayout{{"TE", 2}, {"TEXTID", 7}, {"TXTALVL", 3}, {"TXTDT", 14}, {"TXTITL", 80}}
            .add(CFieldLayout::security21("TS"))
            .add(CFieldLayout{{"ENCRYP", 1}, {"TXTFMT", 3}});
    return layout;
}

static const CFieldLayout& textLayout20() {
    static const CFieldLayout layout = CFieldLayout{{"TE", 2}, {"TEXTID", 10}, {"TXTDT", 14}, {"TXTITL", 80}}
                                           .add(CFieldLayout::security20("TS"))
                                           .add(CFieldLayout{{"ENCRYP", 1}, {"TXTFMT", 3}});
    return layout;
}

void CNitfTextSource::read(CNitfFile* file, eNitfVersion_t version, FILE* fp) {
    clearContents();
    fp = positionAtSubheader(file, fp);
    (version == eNitfVersion20 ? textLayout20() : textLayout21()).read(fp, m_properties, &m_fieldNames);
    readTagArea(fp, "TXSHDL", CNitfTag::eTagSourceText);
}

void CNitfTextSource::readText(CNitfFile* file, char* buffer) {
    CDataPointer(m_dataOffset, m_dataLength > 0 ? m_dataLength : 0).readData(file->getInputStream(), buffer);
}
