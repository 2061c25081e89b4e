#include "NitfLabelSource.h"

#include "RecordLayout.h"
#include "SecurityFields.h"

using namespace record;

// clang-format off
static const Entry kHead[] = {
    Text("LA", 2), Text("LID", 10),
};
static const Entry kTail[] = {
    Text("ENCRYP", 1), Text("LFS", 1), Text("LCW", 2), Text("LCH", 2), Text("LDLVL", 3), Text("LALVL", 3),
    Text("LLOC", 10), Bytes("LTC", 3, kTyped), Bytes("LBC", 3, kTyped),
    Text("LXSHDL", 5),
    IfNotZero("LXSHDL"),
        Place("LXSOFL", 3),
        TagArea("LXSHD", "LXSHDL"),
    End(),
};
// clang-format on

void CNitfLabelSource::read(CNitfFile* file, eNitfVersion_t, FILE* fp) {
    static const CRecordLayout layout({kHead, Part(securityFields20("LS")), kTail});
    clearContents();
    fp = positionAtSubheader(file, fp);
    // Labels have no TRE source of their own.
    readFields(fp, layout, "LXSHD", CNitfTag::eTagSourceUnknown);
}
