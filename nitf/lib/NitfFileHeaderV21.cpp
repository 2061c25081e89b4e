#include "NitfFileHeaderV21.h"

#include <cstring>
#include <string>

#include "DataStreamRead.h"
#include "DataStreamWrite.h"
#include "FieldLayout.h"
#include "HostFile.h"
#include "NitfImageSubheaderV21.h"
#include "Raise.h"

static const char kSourceFile[] = "nitf/lib/NitfFileHeaderV21";
static const char kReadSignature[] =
    "void __cdecl CNitfFileHeaderV21::read(" NITF_FILE_SIG ",class CNitfFileReader *)";

// From FHDR to ENCRYP: the same for every member of the family.
static const CFieldLayout& identityLayout() {
    static const CFieldLayout layout =
        CFieldLayout{
            {"FHDR", 9}, {"CLEVEL", 2}, {"STYPE", 4}, {"OSTAID", 10}, {"FDT", 14}, {"FTITLE", 80},
        }
            .add(CFieldLayout::security21("FS"))
            .add({"FSCOP", 5})
            .add({"FSCPYS", 5})
            .add({"ENCRYP", 1});
    return layout;
}

// The background colour and originator, or OSDE's single originator field of the same 45 bytes.
static const CFieldLayout& originatorLayout(eNitfVersion_t version) {
    static const CFieldLayout nitf{{"FBKGC", 3, FieldForm::Bytes}, {"ONAME", 24}, {"OPHONE", 18}};
    static const CFieldLayout osde{{"OID", 45}};
    return version == eOsdeVersion01 ? osde : nitf;
}

static const CFieldLayout& lengthLayout() {
    static const CFieldLayout layout{{"FL", 12}, {"HL", 6}};
    return layout;
}

// The fixed tail that follows the image table in a written header: NUMS, NUMX, NUMT, NUMDES, NUMRES, UDHDL,
// XHDL.
static const char kWrittenTail[] = "000000000000000"
                                   "00000"
                                   "00000";

CNitfFileHeaderV21::CNitfFileHeaderV21(eNitfVersion_t version) : CNitfFileHeader(version) {}

void CNitfFileHeaderV21::readFields(FILE* fp) {
    identityLayout().read(fp, m_properties, &m_fieldNames);
    originatorLayout(m_version).read(fp, m_properties, &m_fieldNames);
    lengthLayout().read(fp, m_properties, &m_fieldNames);

    __int64 offset = FindProperty(m_properties, "HL")->getAsInt64();
    offset += readSegmentTable(fp, "NUMI", offset, 6, 10, &m_images);
    offset += readSegmentTable(fp, "NUMS", offset, 4, 6, &m_symbols);

    CNitfProperty* reserved = CNitfProperty::getNewFromString(fp, 3);
    SetProperty(m_properties, "NUMX", reserved);
    recordField("NUMX");
    if (reserved->getAsInt() != 0) {
        // Nothing after a non-zero reserved count is trusted. Two conformance files are known to carry one;
        // the outcome is the same for them as for any other file.
        const char* name = fp2filename(fp);
        bool knownConformanceFile = std::strstr(name, "i_3125d.ntf") || std::strstr(name, "i_3125c.ntf");
        (void)knownConformanceFile;
        return;
    }

    offset += readSegmentTable(fp, "NUMT", offset, 4, 5, &m_texts);
    offset += readSegmentTable(fp, "NUMDES", offset, 4, 9, &m_dataExtensions);
    offset += readSegmentTable(fp, "NUMRES", offset, 4, 7, &m_reservedExtensions);
    readTagArea(fp, "UDHDL");
    readTagArea(fp, "XHDL");
}

void CNitfFileHeaderV21::read(FILE* fp, CNitfFileReader*) {
    clearContents();
    m_streamingReplacement = false;
    readFields(fp);

    // A streaming writer leaves the lengths as nines and carries the real header in its last segment.
    CNitfProperty* fileLength = FindProperty(m_properties, "FL");
    if (fileLength && std::strcmp(fileLength->getAsString(), "999999999999") == 0) {
        __int64 replacement = findStreamingHeader(fp);
        if (replacement >= 0) {
            clearContents();
            DKFSeek64(fp, replacement, SEEK_SET);
            readFields(fp);
            m_streamingReplacement = true;
        }
    }
    m_propertiesModified = false;
}

__int64 CNitfFileHeaderV21::findStreamingHeader(FILE* fp) {
    static const unsigned char kDelimiter1[4] = {0x0A, 0x6E, 0x1D, 0x97};
    static const unsigned char kDelimiter2[4] = {0x0E, 0xCA, 0x14, 0xBF};
    static const char kName[] = "DESTREAMING_FILE_HEADER";
    const __int64 size = DKSize(fp);
    if (size < 22)
        return -1;

    // The segment's data ends the file: SFH_L1 (7) DELIM1 (4) SFH_DR DELIM2 (4) SFH_L2 (7).
    unsigned char tail[11];
    DKFSeek64(fp, size - 11, SEEK_SET);
    if (DKFRead(tail, 1, 11, fp) != 11 || std::memcmp(tail, kDelimiter2, 4) != 0)
        return -1;
    __int64 headerLength = ScanInt64(reinterpret_cast<char*>(tail) + 4, 7);
    __int64 start = size - 11 - headerLength - 11;
    if (headerLength <= 0 || start < 0)
        return -1;
    unsigned char head[11];
    DKFSeek64(fp, start, SEEK_SET);
    if (DKFRead(head, 1, 11, fp) != 11 || std::memcmp(head + 7, kDelimiter1, 4) != 0)
        return -1;

    // The segment's sub-header stands right before its data; look for its identifier there.
    const __int64 window = 10000;
    __int64 from = start - window > 0 ? start - window : 0;
    std::string before(static_cast<size_t>(start - from), '\0');
    DKFSeek64(fp, from, SEEK_SET);
    before.resize(DKFRead(&before[0], 1, before.size(), fp));
    if (before.rfind(kName) == std::string::npos)
        return -1;

    CNitfProperty* declared = FindProperty(m_properties, "HL");
    if (!declared || ScanInt64(reinterpret_cast<char*>(head), 7) != declared->getAsInt64())
        NITF_RAISE("Only a file header replacement is supported for a streaming file header.",
                   kReadSignature);
    return start + 11;
}

void CNitfFileHeaderV21::write(FILE* fp) {
    identityLayout().write(fp, m_properties);
    CDataStreamWrite out(fp);
    if (m_version == eOsdeVersion01) {
        originatorLayout(m_version).write(fp, m_properties);
    } else {
        unsigned int red = 0, green = 0, blue = 0;
        CNitfProperty* colour = FindProperty(m_properties, "FBKGC");
        if (colour && colour->getDataType() != CNitfProperty::eNone)
            std::sscanf(colour->toText().c_str(), "%2x%2x%2x", &red, &green, &blue);
        out.writeByte(static_cast<unsigned char>(red));
        out.writeByte(static_cast<unsigned char>(green));
        out.writeByte(static_cast<unsigned char>(blue));
        CFieldLayout{{"ONAME", 24}, {"OPHONE", 18}}.write(fp, m_properties);
    }
    out.writeDecimal64(computeFileLength(), 12, true);
    out.writeDecimal64(computeStorageLength(), 6, true);
    writePairs(fp, 3, 6, 10, &m_images);
    // Files written here carry images only, and no file-level TREs.
    out.writeBytes(kWrittenTail, sizeof kWrittenTail - 1);
}

__int64 CNitfFileHeaderV21::computeStorageLength() {
    return identityLayout().length(m_properties) + originatorLayout(m_version).length(m_properties) +
           lengthLayout().length(m_properties) + 3 + 16 * static_cast<__int64>(m_images.size()) +
           static_cast<__int64>(sizeof kWrittenTail - 1);
}

void CNitfFileHeaderV21::getTitle(char* title) {
    CNitfProperty* field = FindProperty(m_properties, "FTITLE");
    std::string text = field ? field->toText() : std::string();
    text = text.substr(0, 80);
    text.erase(text.find_last_not_of(' ') + 1);
    std::strcpy(title, text.c_str());
}

CNitfImageSubheader* CNitfFileHeaderV21::getNewImageSubheader(FILE* fp, int index) {
    return readImageSubheader<CNitfImageSubheaderV21>(fp, index);
}
