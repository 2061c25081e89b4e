#include "NitfFileHeaderV20.h"

#include <cstring>
#include <string>

#include "DataStreamWrite.h"
#include "RecordLayout.h"
#include "Raise.h"
#include "SecurityFields.h"

static const char kSourceFile[] = "nitf/lib/NitfFileHeaderV20";
#include "HostFile.h"
#include "NitfImageSubheaderV20.h"

using namespace record;

// From FHDR to HL.
static const CRecordLayout& headLayout() {
    // clang-format off
    static const Entry kIdentity[] = {
        Text("FHDR", 9), Text("CLEVEL", 2), Text("STYPE", 4), Text("OSTAID", 10), Text("FDT", 14),
        Text("FTITLE", 80),
    };
    static const Entry kTail[] = {
        Text("FSCOP", 5), Text("FSCPYS", 5), Text("ENCRYP", 1), Text("ONAME", 27), Text("OPHONE", 18),
        Text("FL", 12), Text("HL", 6),
    };
    // clang-format on
    static const CRecordLayout layout({kIdentity, Part(securityFields20("FS")), kTail});
    return layout;
}

void CNitfFileHeaderV20::read(FILE* fp, CNitfFileReader*) {
    clearContents();
    Report report;
    report.fields = &m_fields;
    CKeyStore keys;
    headLayout().read(fp, m_properties, keys, report);
    CNitfProperty* headerLength = FindProperty(m_properties, "HL");
    if (!headerLength)
        NITF_RAISE("The file header is cut short by the end of the file",
                   "void __cdecl CNitfFileHeaderV20::read(" NITF_FILE_SIG ",class CNitfFileReader *)");
    __int64 offset = headerLength->getAsInt64();
    offset += readSegmentTable(fp, "NUMI", offset, 6, 10, &m_images);
    offset += readSegmentTable(fp, "NUMS", offset, 4, 6, &m_symbols);
    offset += readSegmentTable(fp, "NUML", offset, 4, 3, &m_labels);
    offset += readSegmentTable(fp, "NUMT", offset, 4, 5, &m_texts);
    offset += readSegmentTable(fp, "NUMDES", offset, 4, 9, &m_dataExtensions);
    offset += readSegmentTable(fp, "NUMRES", offset, 4, 7, &m_reservedExtensions);
    readTagAreas(fp);
    checkHeaderLength(fp, DKFTell(fp));
    checkSegmentsInFile(fp);
    m_propertiesModified = false;
}

void CNitfFileHeaderV20::write(FILE* fp) {
    writeImagesOnly(fp, headLayout());
}

__int64 CNitfFileHeaderV20::computeStorageLength() {
    return imagesOnlyLength(headLayout());
}

void CNitfFileHeaderV20::getTitle(char* title) {
    CNitfProperty* field = FindProperty(m_properties, "FTITLE");
    std::string text = field ? field->toText().substr(0, 80) : std::string();
    text.erase(text.find_last_not_of(' ') + 1);
    std::strcpy(title, text.c_str());
}

CNitfImageSubheader* CNitfFileHeaderV20::getNewImageSubheader(FILE* fp, int index) {
    return readImageSubheader<CNitfImageSubheaderV20>(fp, index);
}
