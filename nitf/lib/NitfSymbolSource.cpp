#include "NitfSymbolSource.h"

#include "FieldLayout.h"

// NITF 2.1 / NSIF graphic (always CGM).
static const CFieldLayout& graphicLayout() {
    static const CFieldLayout layout = CFieldLayout{{"SY", 2}, {"SID", 10}, {"SNAME", 20}}
                                           .add(CFieldLayout::security21("SS"))
                                           .add(CFieldLayout{{"ENCRYP", 1},
                                                             {"SFMT", 1},
                                                             {"SSTRUCT", 13},
                                                             {"SDLVL", 3},
                                                             {"SALVL", 3},
                                                             {"SLOC", 10},
                                                             {"SBND1", 10},
                                                             {"SCOLOR", 1},
                                                             {"SBND2", 10},
                                                             {"SRES2", 2}});
    return layout;
}

// NITF 2.0 symbol (bit-mapped, CGM or object). The symbol LUT is taken as three bytes per entry.
static const CFieldLayout& symbolLayout() {
    static const CFieldLayout layout = CFieldLayout{{"SY", 2}, {"SID", 10}, {"SNAME", 20}}
                                           .add(CFieldLayout::security20("SS"))
                                           .add(CFieldLayout{{"ENCRYP", 1},
                                                             {"STYPE", 1},
                                                             {"NLIPS", 4},
                                                             {"NPIXPL", 4},
                                                             {"NWDTH", 4},
                                                             {"NBPP", 1},
                                                             {"SDLVL", 3},
                                                             {"SALVL", 3},
                                                             {"SLOC", 10},
                                                             {"SLOC2", 10},
                                                             {"SCOLOR", 1},
                                                             {"SNUM", 6},
                                                             {"SROT", 3},
                                                             {"NELUT", 3}});
    return layout;
}

void CNitfSymbolSource::read(CNitfFile* file, eNitfVersion_t version, FILE* fp) {
    clearContents();
    fp = positionAtSubheader(file, fp);
    if (version == eNitfVersion20) {
        symbolLayout().read(fp, m_properties, &m_fieldNames);
        int entries = FindProperty(m_properties, "NELUT")->getAsInt();
        if (entries > 0)
            CFieldLayout{{"DLUT", 3 * entries, FieldForm::Bytes}}.read(fp, m_properties, &m_fieldNames);
    } else {
        graphicLayout().read(fp, m_properties, &m_fieldNames);
    }
    readTagArea(fp, "SXSHDL", CNitfTag::eTagSourceSymbol);
}
