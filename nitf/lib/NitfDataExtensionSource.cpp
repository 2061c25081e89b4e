#include "NitfDataExtensionSource.h"

#include <cstring>
#include <string>

#include "DataStream.h"
#include "RecordLayout.h"
#include "SecurityFields.h"
#include "HostFile.h"
#include "HostMemory.h"
#include "NitfFile.h"
#include "NitfFileHeader.h"
#include "NitfImageSource.h"
#include "NitfSymbolSource.h"

// Identifiers are compared in their stored form, blank-padded to 25 characters, ignoring case.
static bool identifierIs(const char* bytes, size_t length, const char* word) {
    size_t n = std::strlen(word);
    if (length != 25 || _strnicmp(bytes, word, n) != 0)
        return false;
    for (size_t i = n; i < 25; ++i) {
        if (bytes[i] != ' ')
            return false;
    }
    return true;
}

static bool isOverflow20(const char* tag, size_t length) {
    return identifierIs(tag, length, "Registered Extensions") ||
           identifierIs(tag, length, "Controlled Extensions");
}
static bool isOverflow21(const char* id, size_t length) {
    return identifierIs(id, length, "TRE_OVERFLOW");
}
static bool isCloudShape(const char* id, size_t length) {
    return identifierIs(id, length, "CSSHPA DES");
}
static bool isNotCloudShape(const char* id, size_t length) {
    return !isCloudShape(id, length);
}
static bool isStreaming(const char* id, size_t length) {
    return identifierIs(id, length, "STREAMING_FILE_HEADER");
}

// Whether the identifier field read holds that kind.
static bool fieldIs(PropertyMap& map, const char* name, bool (*kind)(const char*, size_t)) {
    CNitfProperty* field = FindProperty(map, name);
    return field && field->getDataType() == CNitfProperty::eString &&
           kind(field->getBytes(), field->getStoredLength());
}

using namespace record;

// clang-format off
static const Entry kHead20[] = {Text("DE", 2), Text("DESTAG", 25), Text("DESVER", 2)};
static const Entry kHead21[] = {Text("DE", 2), Text("DESID", 25), Text("DESVER", 2)};
static const Entry kOsdeSecurity[] = {Text("DESSEC", 167)};
// The kinds follow the identifier: overflow segments name the area and item they overflowed from, cloud
// shapes carry their shape fields where other segments carry user-defined fields.
static const Entry kBody20[] = {
    IfCall("DESTAG", isOverflow20),
        Text("DESOFLW", 6), Text("DESITEM", 3),
    End(),
    Text("DESSHL", 4),
    IfNotZero("DESSHL"),
        TextSizedBy("DESSHF", "DESSHL"),
    End(),
};
static const Entry kBody21[] = {
    IfCall("DESID", isOverflow21),
        Text("DESOFLW", 6), Text("DESITEM", 3),
    End(),
    Text("DESSHL", 4),
    IfCall("DESID", isCloudShape),
        Text("SHAPE_USE", 25),
        Text("SHAPE_CLASS", 10),
        IfTextIgnoringCase("SHAPE_USE", "CLOUD_SHAPES             "),
            Text("CC_SOURCE", 18),
        End(),
        Text("SHAPE1_NAME", 3), Text("SHAPE1_START", 6),
        Text("SHAPE2_NAME", 3), Text("SHAPE2_START", 6),
        Text("SHAPE3_NAME", 3), Text("SHAPE3_START", 6),
    End(),
    IfCall("DESID", isNotCloudShape),
        IfNotZero("DESSHL"),
            TextSizedBy("DESSHF", "DESSHL"),
        End(),
    End(),
};
static const Entry kStreamingLead[] = {Text("SFH_L1", 7), Unsigned("SFH_DELIM1", 4, kTyped)};
static const Entry kStreamingTrail[] = {Unsigned("SFH_DELIM2", 4, kTyped), Text("SFH_L2", 7)};
// clang-format on

// DE, DESID (DESTAG in NITF 2.0), DESVER, the security group of the version, and the fields of the kind.
static const CRecordLayout& layoutOf(eNitfVersion_t version) {
    // The 2.0 control-and-handling field is kept as "DECTLH"; callers look it up by that name.
    static const CRecordLayout nitf20({kHead20, Part(securityFields20("DES", "DECTLH")), kBody20});
    static const CRecordLayout nitf21({kHead21, Part(securityFields21("DES")), kBody21});
    static const CRecordLayout osde({kHead21, kOsdeSecurity, kBody21});
    static const CRecordLayout other({kHead21, kBody21});
    switch (version) {
    case eNitfVersion20:
        return nitf20;
    case eNitfVersion21:
    case eNitfVersion21Variant:
    case eNsifVersion10:
        return nitf21;
    case eOsdeVersion01:
        return osde;
    default:
        return other;
    }
}

void CNitfDataExtensionSource::constructor() {
    m_streamingHeaderLength = 0;
    m_streamingHeader = nullptr;
    m_overflow = m_streaming = m_cloudShape = false;
}

CNitfDataExtensionSource::~CNitfDataExtensionSource() {
    free(m_streamingHeader);
    CNitfTag::destroyList(m_overflowTags);
}

void CNitfDataExtensionSource::read(CNitfFile* file, eNitfVersion_t version, FILE* fp,
                                    CNitfImageSource* image, CNitfSymbolSource* graphic) {
    clearContents();
    CNitfTag::destroyList(m_overflowTags);
    free(m_streamingHeader);
    constructor();
    fp = positionAtSubheader(file, fp);

    readPart(fp, layoutOf(version), {});
    if (version == eNitfVersion20) {
        m_overflow = fieldIs(m_properties, "DESTAG", isOverflow20);
    } else {
        m_streaming = fieldIs(m_properties, "DESID", isStreaming);
        m_overflow = fieldIs(m_properties, "DESID", isOverflow21);
        m_cloudShape = fieldIs(m_properties, "DESID", ::isCloudShape);
    }
    // DESITEM names the overflowed segment; the TREs are attached by area, not by item.

    if (m_streaming) {
        readStreamingHeader(fp);
        return;
    }
    if (m_overflow)
        readOverflowTags(file, fp, image, graphic);
}

void CNitfDataExtensionSource::readStreamingHeader(FILE* fp) {
    static const CRecordLayout lead(kStreamingLead);
    static const CRecordLayout trail(kStreamingTrail);
    readPart(fp, lead, {});
    CNitfProperty* declared = FindProperty(m_properties, "SFH_L1");
    if (!declared)
        return; // the file ends before the streaming header
    int length = declared->getAsInt();
    if (length < 0)
        length = 0;
    CDataStream::requireReadable(fp, length, "A streaming file header");
    m_streamingHeaderLength = length;
    m_streamingHeader = static_cast<char*>(HMalloc(length > 0 ? length : 1));
    CDataStream::readZeroFilled(fp, m_streamingHeader, static_cast<size_t>(length));
    readPart(fp, trail, {});
    // Leave the stream at the first byte of the replacement header.
    DKFSeek64(fp, -(11 + static_cast<__int64>(length)), SEEK_CUR);
}

void CNitfDataExtensionSource::readOverflowTags(CNitfFile* file, FILE* fp, CNitfImageSource* image,
                                                CNitfSymbolSource* graphic) {
    CNitfFileHeader* header = file ? file->getFileHeader() : nullptr;
    std::list<CNitfTag*>* target = header ? &header->getTaggedRecords() : nullptr;
    CNitfTag::eTagSource_t source = CNitfTag::eTagSourceUnknown;

    auto area = [&](const char* name) {
        CNitfProperty* field = FindProperty(m_properties, "DESOFLW");
        char padded[7];
        std::snprintf(padded, sizeof padded, "%-6s", name);
        return field && field->getDataType() == CNitfProperty::eString &&
               _stricmp(field->getAsString(), padded) == 0;
    };
    if (area("XHD") || area("UDHD")) {
        source = CNitfTag::eTagSourceFileHeaderDES;
    } else if (area("IXSHD") || area("UDID")) {
        source = CNitfTag::eTagSourceImageDES;
        if (image)
            target = &image->getImageSubheader()->getTaggedRecords();
    } else if (area("SXSHD")) {
        source = CNitfTag::eTagSourceSymbolDES;
        if (graphic)
            target = &graphic->getTaggedRecords();
    } else if (area("TXSHD")) {
        // Text segments are not passed in: their overflow joins the file header's list.
        source = CNitfTag::eTagSourceTextDES;
    } else if (area("LXSHD")) {
        return; // label overflow is not read
    }

    std::list<CNitfTag*> read;
    CNitfTag::readArea(fp, m_dataLength, source, read, false);
    for (CNitfTag* tag : read) {
        m_overflowTags.push_back(new CNitfTag(*tag));
        if (target)
            target->push_back(tag);
        else
            delete tag;
    }
}

bool CNitfDataExtensionSource::isCSSHPAImageShapeDES() {
    // Whole-text comparisons against the unpadded words: fields read from a file keep their blanks, so only
    // values set by a program qualify.
    CNitfProperty*& id = m_properties[const_cast<char*>("DESID")];
    if (!id)
        id = new CNitfProperty("");
    CNitfProperty*& use = m_properties[const_cast<char*>("SHAPE_USE")];
    if (!use)
        use = new CNitfProperty("");
    return _stricmp(id->toText().c_str(), "CSSHPA DES") == 0 &&
           _stricmp(use->toText().c_str(), "IMAGE_SHAPE") == 0;
}

bool CNitfDataExtensionSource::isXMLDES() {
    CNitfProperty* id = FindProperty(m_properties, "DESID");
    return id && _strnicmp(id->toText().c_str(), "XML_DATA_CONTENT", 16) == 0;
}
