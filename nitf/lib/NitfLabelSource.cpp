#include "NitfLabelSource.h"

#include "FieldLayout.h"

static const CFieldLayout& labelLayout() {
    static const CFieldLayout layout = CFieldLayout{{"LA", 2}, {"LID", 10}}
                                           .add(CFieldLayout::security20("LS"))
                                           .add(CFieldLayout{{"ENCRYP", 1},
                                                             {"LFS", 1},
                                                             {"LCW", 2},
                                                             {"LCH", 2},
                                                             {"LDLVL", 3},
                                                             {"LALVL", 3},
                                                             {"LLOC", 10},
                                                             {"LTC", 3, FieldForm::Bytes},
                                                             {"LBC", 3, FieldForm::Bytes}});
    return layout;
}

void CNitfLabelSource::read(CNitfFile* file, eNitfVersion_t, FILE* fp) {
    clearContents();
    fp = positionAtSubheader(file, fp);
    labelLayout().read(fp, m_properties, &m_fieldNames);
    // Labels have no TRE source of their own.
    readTagArea(fp, "LXSHDL", CNitfTag::eTagSourceUnknown);
}
