#include "NitfTextSource.h"

#include "DataPointer.h"
#include "DataStream.h"
#include "NitfFile.h"
#include "RecordLayout.h"
#include "SecurityFields.h"

using namespace record;

// clang-format off
static const Entry kHead21[] = {
    Text("TE", 2), Text("TEXTID", 7), Text("TXTALVL", 3), Text("TXTDT", 14), Text("TXTITL", 80),
};
static const Entry kHead20[] = {
    Text("TE", 2), Text("TEXTID", 10), Text("TXTDT", 14), Text("TXTITL", 80),
};
static const Entry kTail[] = {
    Text("ENCRYP", 1), Text("TXTFMT", 3),
    Text("TXSHDL", 5),
    IfNotZero("TXSHDL"),
        Place("TXSOFL", 3),
        TagArea("TXSHD", "TXSHDL"),
    End(),
};
// clang-format on

void CNitfTextSource::read(CNitfFile* file, eNitfVersion_t version, FILE* fp) {
    static const CRecordLayout text21({kHead21, Part(securityFields21("TS")), kTail});
    static const CRecordLayout text20({kHead20, Part(securityFields20("TS")), kTail});
    clearContents();
    fp = positionAtSubheader(file, fp);
    readFields(fp, version == eNitfVersion20 ? text20 : text21, "TXSHD", CNitfTag::eTagSourceText);
}

void CNitfTextSource::readText(CNitfFile* file, char* buffer) {
    CDataPointer(m_dataOffset, m_dataLength > 0 ? m_dataLength : 0).readData(file->getInputStream(), buffer);
}
