#include "NitfSymbolSource.h"

#include "RecordLayout.h"
#include "SecurityFields.h"

using namespace record;

// clang-format off
static const Entry kHead[] = {
    Text("SY", 2), Text("SID", 10), Text("SNAME", 20),
};
static const Entry kExtendedArea[] = {
    Text("SXSHDL", 5),
    IfNotZero("SXSHDL"),
        Place("SXSOFL", 3),
        TagArea("SXSHD", "SXSHDL"),
    End(),
};
// NITF 2.1 / NSIF graphic (always CGM).
static const Entry kGraphic[] = {
    Text("ENCRYP", 1), Text("SFMT", 1), Text("SSTRUCT", 13), Text("SDLVL", 3), Text("SALVL", 3),
    Text("SLOC", 10), Text("SBND1", 10), Text("SCOLOR", 1), Text("SBND2", 10), Text("SRES2", 2),
};
// NITF 2.0 symbol (bit-mapped, CGM or object). The symbol LUT is taken as three bytes per entry.
static const Entry kSymbol[] = {
    Text("ENCRYP", 1), Text("STYPE", 1), Text("NLIPS", 4), Text("NPIXPL", 4), Text("NWDTH", 4), Text("NBPP", 1),
    Text("SDLVL", 3), Text("SALVL", 3), Text("SLOC", 10), Text("SLOC2", 10), Text("SCOLOR", 1), Text("SNUM", 6),
    Text("SROT", 3), Text("NELUT", 3),
    IfNotZero("NELUT"),
        field("DLUT", Width::OfField, eFieldBytes, 3, kTyped, "NELUT"),
    End(),
};
// clang-format on

void CNitfSymbolSource::read(CNitfFile* file, eNitfVersion_t version, FILE* fp) {
    static const CRecordLayout graphic({kHead, Part(securityFields21("SS")), kGraphic, kExtendedArea});
    static const CRecordLayout symbol({kHead, Part(securityFields20("SS")), kSymbol, kExtendedArea});
    clearContents();
    fp = positionAtSubheader(file, fp);
    readFields(fp, version == eNitfVersion20 ? symbol : graphic, "SXSHD", CNitfTag::eTagSourceSymbol);
}
