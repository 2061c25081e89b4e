#include "NitfFileHeaderV21.h"

#include <cstring>
#include <string>

#include "DataStreamRead.h"
#include "DataStreamWrite.h"
#include "RecordLayout.h"
#include "SecurityFields.h"
#include "HostFile.h"
#include "NitfImageSubheaderV21.h"
#include "Raise.h"

static const char kSourceFile[] = "nitf/lib/NitfFileHeaderV21";
static const char kReadSignature[] =
    "void __cdecl CNitfFileHeaderV21::read(" NITF_FILE_SIG ",class CNitfFileReader *)";

using namespace record;

// clang-format off
static const Entry kIdentity[] = {
    Text("FHDR", 9), Text("CLEVEL", 2), Text("STYPE", 4), Text("OSTAID", 10), Text("FDT", 14), Text("FTITLE", 80),
};
static const Entry kCopies[] = {
    Text("FSCOP", 5), Text("FSCPYS", 5), Text("ENCRYP", 1),
};
// The background colour (three binary bytes) and originator, or OSDE's single originator field of the same
// 45 bytes.
static const Entry kOriginator[] = {
    Bytes("FBKGC", 3, kTyped), Text("ONAME", 24), Text("OPHONE", 18),
};
static const Entry kOsdeOriginator[] = {
    Text("OID", 45),
};
static const Entry kLengths[] = {
    Text("FL", 12), Text("HL", 6),
};
// clang-format on

// From FHDR to HL.
static const CRecordLayout& headLayout(eNitfVersion_t version) {
    static const CRecordLayout nitf(
        {kIdentity, Part(securityFields21("FS")), kCopies, kOriginator, kLengths});
    static const CRecordLayout osde(
        {kIdentity, Part(securityFields21("FS")), kCopies, kOsdeOriginator, kLengths});
    return version == eOsdeVersion01 ? osde : nitf;
}

CNitfFileHeaderV21::CNitfFileHeaderV21(eNitfVersion_t version) : CNitfFileHeader(version) {}

void CNitfFileHeaderV21::readFields(FILE* fp) {
    Report report;
    report.fields = &m_fields;
    CKeyStore keys;
    headLayout(m_version).read(fp, m_properties, keys, report);
    CNitfProperty* headerLength = FindProperty(m_properties, "HL");
    if (!headerLength)
        NITF_RAISE("The file header is cut short by the end of the file", kReadSignature);

    __int64 offset = headerLength->getAsInt64();
    offset += readSegmentTable(fp, "NUMI", offset, 6, 10, &m_images);
    offset += readSegmentTable(fp, "NUMS", offset, 4, 6, &m_symbols);

    recordField("NUMX", 3, DKFTell(fp));
    CNitfProperty* reserved = CNitfProperty::getNewFromString(fp, 3);
    SetProperty(m_properties, "NUMX", reserved);
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
    readTagAreas(fp);
    m_fieldsEnd = DKFTell(fp);
}

void CNitfFileHeaderV21::read(FILE* fp, CNitfFileReader*) {
    clearContents();
    m_streamingReplacement = false;
    m_fieldsEnd = -1;
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
    // A replacement header stands at the end of the file: its length describes the header at the start.
    if (!m_streamingReplacement && m_fieldsEnd >= 0)
        checkHeaderLength(fp, m_fieldsEnd);
    checkSegmentsInFile(fp);
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
    writeImagesOnly(fp, headLayout(m_version));
}

__int64 CNitfFileHeaderV21::computeStorageLength() {
    return imagesOnlyLength(headLayout(m_version));
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
