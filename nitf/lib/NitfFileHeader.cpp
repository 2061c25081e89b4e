#include "NitfFileHeader.h"

#include <cstring>

#include "DataStreamRead.h"
#include "DataStreamWrite.h"
#include "HostError.h"
#include "HostFile.h"
#include "Raise.h"
#include "RecordLayout.h"
#include "TagAreas.h"

static const char kSourceFile[] = "nitf/lib/NitfFileHeader";

CNitfFileHeader::CNitfFileHeader(eNitfVersion_t version) : m_version(version), m_propertiesModified(false) {}

CNitfFileHeader::~CNitfFileHeader() {
    clearContents();
}

void CNitfFileHeader::clearContents() {
    for (auto* list :
         {&m_symbols, &m_images, &m_labels, &m_texts, &m_dataExtensions, &m_reservedExtensions}) {
        for (CNitfHeaderDataPair* pair : *list)
            delete pair;
        list->clear();
    }
    DestroyPropertyMap(m_properties);
    CNitfTag::destroyList(m_taggedRecords);
    m_fields.clear();
}

eNitfVersion_t CNitfFileHeader::readVersion(FILE* fp) {
    char text[10] = {0};
    DKFRead(text, 1, 9, fp);
    static const struct {
        const char* text;
        eNitfVersion_t version;
    } known[] = {{"NITF01.10", eNitfVersion11}, {"NITF02.00", eNitfVersion20}, {"NITF02.10", eNitfVersion21},
                 {"NSIF01.00", eNsifVersion10}, {"NSIF01.01", eNsifVersion10}, {"OSDE01.00", eOsdeVersion01}};
    for (const auto& entry : known) {
        if (std::strcmp(text, entry.text) == 0)
            return entry.version;
    }
    return eNitfVersionUnknown;
}

__int64 CNitfFileHeader::readPairs(FILE* fp, __int64 firstOffset, int countWidth, int headerLengthWidth,
                                   int dataLengthWidth, std::vector<CNitfHeaderDataPair*>* list,
                                   __int64& fieldBytes, int& count) {
    CDataStreamRead in(fp);
    count = in.readDecimal(countWidth);
    fieldBytes = countWidth;
    if (count <= 0)
        return 0;
    __int64 position = firstOffset;
    __int64 total = 0;
    for (int i = 0; i < count; ++i) {
        int headerLength = in.readDecimal(headerLengthWidth);
        __int64 dataLength = in.readDecimal64(dataLengthWidth);
        list->push_back(new CNitfHeaderDataPair(position, headerLength, dataLength));
        fieldBytes += headerLengthWidth + dataLengthWidth;
        position += headerLength + dataLength;
        total += headerLength + dataLength;
    }
    return total;
}

void CNitfFileHeader::writePairs(FILE* fp, int countWidth, int headerLengthWidth, int dataLengthWidth,
                                 std::vector<CNitfHeaderDataPair*>* list) {
    CDataStreamWrite out(fp);
    out.writeDecimal(static_cast<int>(list->size()), countWidth, true);
    for (const CNitfHeaderDataPair* pair : *list) {
        out.writeDecimal64(pair->getHeaderLength(), headerLengthWidth, true);
        // Every data length is clamped to ten nines; only the image table's field is that wide.
        __int64 dataLength = pair->getDataLength();
        out.writeDecimal64(dataLength > 9999999999LL ? 9999999999LL : dataLength, dataLengthWidth, true);
    }
}

// NUMS, the reserved count (or NUML), NUMT, NUMDES, NUMRES, UDHDL and XHDL of a written header.
static const char kWrittenTail[] = "000000000000000"
                                   "00000"
                                   "00000";

void CNitfFileHeader::writeImagesOnly(FILE* fp, const CRecordLayout& head) {
    PropertyMap lengths;
    char text[32];
    std::snprintf(text, sizeof text, "%012lld", static_cast<long long>(computeFileLength()));
    SetProperty(lengths, "FL", new CNitfProperty(text));
    std::snprintf(text, sizeof text, "%06lld", static_cast<long long>(computeStorageLength()));
    SetProperty(lengths, "HL", new CNitfProperty(text));
    try {
        head.write(fp, m_properties, &lengths);
    } catch (...) {
        DestroyPropertyMap(lengths);
        throw;
    }
    DestroyPropertyMap(lengths);
    writePairs(fp, 3, 6, 10, &m_images);
    CDataStreamWrite(fp).writeBytes(kWrittenTail, sizeof kWrittenTail - 1);
}

__int64 CNitfFileHeader::imagesOnlyLength(const CRecordLayout& head) {
    return head.length(m_properties) + 3 + 16 * static_cast<__int64>(m_images.size()) +
           static_cast<__int64>(sizeof kWrittenTail - 1);
}

__int64 CNitfFileHeader::computeFileLength() {
    return computeStorageLength() + CNitfHeaderDataPair::computeVectorLengths(&m_images);
}

__int64 CNitfFileHeader::readSegmentTable(FILE* fp, const char* countName, __int64 firstOffset,
                                          int headerLengthWidth, int dataLengthWidth,
                                          std::vector<CNitfHeaderDataPair*>* list) {
    recordField(countName, 3, DKFTell(fp));
    SetProperty(m_properties, countName, CNitfProperty::getNewFromString(fp, 3));
    DKFSeek64(fp, -3, SEEK_CUR);
    __int64 fieldBytes = 0;
    int count = 0;
    return readPairs(fp, firstOffset, 3, headerLengthWidth, dataLengthWidth, list, fieldBytes, count);
}

void CNitfFileHeader::readTagAreas(FILE* fp) {
    using namespace record;
    // clang-format off
    static const Entry kAreas[] = {
        Text("UDHDL", 5),
        IfNotZero("UDHDL"),
            Place("UDHOFL", 3),
            TagArea("UDHD", "UDHDL"),
        End(),
        Text("XHDL", 5),
        IfNotZero("XHDL"),
            Place("XHDLOFL", 3),
            TagArea("XHD", "XHDL"),
        End(),
    };
    // clang-format on
    static const CRecordLayout layout(kAreas);
    std::vector<Placed> places;
    Report report;
    report.fields = &m_fields;
    report.places = &places;
    CKeyStore keys;
    layout.read(fp, m_properties, keys, report);
    // The overflow numbers are not kept: an overflow is resolved when its data extension segment is read.
    ::readTagAreas(places, {"UDHD", "XHD"}, CNitfTag::eTagSourceFileHeader, m_taggedRecords);
}

// ---- what the file holds --------------------------------------------------------------------------------

namespace {

void warn(const std::string& message) {
    vexo::nspio::Warning::Warn(message.c_str(), kSourceFile, __LINE__);
}

} // namespace

void CNitfFileHeader::requireSubheaderInFile(const CNitfHeaderDataPair* pair, const char* kind,
                                             int index) const {
    const __int64 size = m_fileSize;
    if (!pair || size < 0 || pair->getHeaderEnd() <= size)
        return;
    static const char signature[] = "void __cdecl CNitfFileHeader::requireSubheaderInFile(const class "
                                    "CNitfHeaderDataPair *,const char *,int)";
    if (pair->getHeaderOffset() >= size)
        NITF_RAISE_FORMAT(
            signature,
            "The sub-header of %s segment %d (at byte %lld) lies beyond the end of the file (%lld bytes)",
            kind, index, static_cast<long long>(pair->getHeaderOffset()), static_cast<long long>(size));
    NITF_RAISE_FORMAT(
        signature,
        "The sub-header of %s segment %d is cut short by the end of the file (%lld of its %lld bytes)", kind,
        index, static_cast<long long>(size - pair->getHeaderOffset()),
        static_cast<long long>(pair->getHeaderLength()));
}

void CNitfFileHeader::checkHeaderLength(FILE* fp, __int64 fieldsEnd) {
    CNitfProperty* field = FindProperty(m_properties, "HL");
    const std::string text = field ? field->toText() : std::string();
    const bool digits = !text.empty() && text.find_first_not_of("0123456789") == std::string::npos;
    const __int64 declared = digits ? field->getAsInt64() : 0;
    const __int64 size = m_fileSize = DKSize(fp);
    const bool allNines = digits && text.find_first_not_of('9') == std::string::npos;
    if (digits && !allNines && declared >= fieldsEnd && (size < 0 || declared <= size))
        return;
    warn("The file header's length (HL \"" + nitf_detail::printable(text) +
         "\") cannot be right: its fields end at byte " + std::to_string(fieldsEnd) +
         ", where the segments are read from");
    const __int64 shift = fieldsEnd - (field ? field->getAsInt64() : 0);
    for (auto* list : {&m_images, &m_symbols, &m_labels, &m_texts, &m_dataExtensions, &m_reservedExtensions})
        for (CNitfHeaderDataPair* pair : *list)
            pair->setOffsets(pair->getHeaderOffset() + shift, pair->getHeaderLength(), pair->getDataLength());
}

void CNitfFileHeader::checkSegmentsInFile(FILE* fp) {
    m_fileSize = DKSize(fp);
    const __int64 size = m_fileSize;
    if (size < 0)
        return;
    const struct {
        const std::vector<CNitfHeaderDataPair*>* list;
        const char* kind;
    } types[] = {{&m_images, "image"},
                 {&m_symbols, "graphic"},
                 {&m_labels, "label"},
                 {&m_texts, "text"},
                 {&m_dataExtensions, "data extension"},
                 {&m_reservedExtensions, "reserved extension"}};
    for (const auto& type : types) {
        int beyond = 0, cut = 0, first = -1;
        for (size_t i = 0; i < type.list->size(); ++i) {
            const CNitfHeaderDataPair* pair = (*type.list)[i];
            if (pair->getDataEnd() <= size)
                continue;
            ++(pair->getHeaderEnd() > size ? beyond : cut);
            if (first < 0)
                first = static_cast<int>(i);
        }
        if (beyond > 0)
            warn(std::to_string(beyond) + " " + type.kind +
                 " segment(s) lie wholly or partly beyond the end of the file (" + std::to_string(size) +
                 " bytes), the first being " + type.kind + " " + std::to_string(first));
        else if (cut > 0)
            warn(std::to_string(cut) + " " + type.kind +
                 " segment(s) have data running past the end of the file (" + std::to_string(size) +
                 " bytes), the first being " + type.kind + " " + std::to_string(first));
    }
}

void CNitfFileHeader::seekToImageSubheader(FILE* fp, int index) {
    DKFSeek64(fp, getImageHeaderDataPair(index)->getHeaderOffset(), SEEK_SET);
}
