#include "NitfImageSubheader.h"

#include <algorithm>
#include <cstring>
#include <string>

#include "DataStream.h"
#include "DataStreamWrite.h"
#include "HostFile.h"
#include "HostMemory.h"
#include "MAPLOBExtension.h"
#include "RPFIMGExtension.h"
#include "RpcSource.h"
#include "Raise.h"

static const char kSourceFile[] = "nitf/lib/NitfImageSubheader";

CNitfImageSubheader::CNitfImageSubheader() : m_propertiesModified(false) {}

CNitfImageSubheader::CNitfImageSubheader(const CNitfImageSubheader& other) : m_propertiesModified(false) {
    *this = other;
}

// A property holding its own copy of the other's value.
static CNitfProperty* cloneProperty(CNitfProperty* source) {
    CNitfProperty* copy = new CNitfProperty;
    switch (source->getDataType()) {
    case CNitfProperty::eString:
        copy->setString(source->getAsString());
        break;
    case CNitfProperty::eChars:
        copy->setChars(source->getBytes(), static_cast<int>(source->getLength()));
        break;
    case CNitfProperty::eNone:
        break;
    default:
        *copy = *source; // numbers own nothing
        break;
    }
    return copy;
}

CNitfImageSubheader& CNitfImageSubheader::operator=(const CNitfImageSubheader& other) {
    if (this == &other)
        return *this;
    clearContents();
    for (const CDataPointer* comment : other.m_comments)
        m_comments.push_back(new CDataPointer(*comment));
    for (const CNitfLutSource* lut : other.m_luts)
        m_luts.push_back(new CNitfLutSource(*lut));
    m_georef = other.m_georef;
    for (const CNitfTag* tag : other.m_taggedRecords)
        m_taggedRecords.push_back(new CNitfTag(*tag));
    for (const auto& entry : other.m_properties) {
        const char* key = entry.first;
        bool owned =
            std::find(other.m_ownedNames.begin(), other.m_ownedNames.end(), key) != other.m_ownedNames.end();
        if (owned) {
            m_ownedNames.push_back(HString(key));
            key = m_ownedNames.back();
        }
        SetProperty(m_properties, key, cloneProperty(entry.second));
    }
    m_fieldNames.clear();
    for (const char* name : other.m_fieldNames) {
        auto found = m_properties.find(const_cast<char*>(name));
        m_fieldNames.push_back(found != m_properties.end() ? found->first : name);
    }
    m_propertiesModified = other.m_propertiesModified;
    return *this;
}

CNitfImageSubheader::~CNitfImageSubheader() {
    clearContents();
}

void CNitfImageSubheader::clearContents() {
    for (CDataPointer* comment : m_comments)
        delete comment;
    m_comments.clear();
    for (CNitfLutSource* lut : m_luts)
        delete lut;
    m_luts.clear();
    CNitfTag::destroyList(m_taggedRecords);
    DestroyPropertyMap(m_properties);
    for (char* name : m_ownedNames)
        free(name);
    m_ownedNames.clear();
    m_fieldNames.clear();
    m_georef = CNitfGeorefInfo();
}

int CNitfImageSubheader::readComment(FILE* fp, int index, char* buffer) {
    if (index >= 0 && index < static_cast<int>(m_comments.size()))
        m_comments[index]->readData(fp, buffer);
    return static_cast<int>(m_comments.size());
}

CNitfLutSource* CNitfImageSubheader::getLutSource(int index) {
    return index >= 0 && index < static_cast<int>(m_luts.size()) ? m_luts[index] : nullptr;
}

CNitfLutSource* CNitfImageSubheader::addNewLutSource() {
    m_luts.push_back(new CNitfLutSource);
    return m_luts.back();
}

template <typename Extension> static Extension* preparedOn(CNitfTag* tag) {
    if (!tag)
        return nullptr;
    Extension* extension = new Extension;
    extension->prepare(tag);
    return extension;
}

CMAPLOBExtension* CNitfImageSubheader::getMAPLOBExtension() {
    return preparedOn<CMAPLOBExtension>(CNitfTag::find("MAPLOB", m_taggedRecords));
}

CRPFIMGExtension* CNitfImageSubheader::getRpfImgExtension() {
    return preparedOn<CRPFIMGExtension>(CNitfTag::find("RPFIMG", m_taggedRecords));
}

CRpcSource* CNitfImageSubheader::getNewExtensionRpcSource() {
    CNitfTag* tag = CNitfTag::find("RPC00B", m_taggedRecords);
    if (!tag)
        tag = CNitfTag::find("RPC00A", m_taggedRecords);
    return tag ? new CRpcSource(tag) : nullptr;
}

void CNitfImageSubheader::addExtensionRpcSource(const char* name) {
    const char* identifier = name ? name : "RPC00B";
    CNitfTag* tag = new CNitfTag;
    tag->setIdentifier(identifier);
    tag->setSource(CNitfTag::eTagSourceImage);
    tag->setDataLength(CRpcSource(identifier).computeStorageLength());
    m_taggedRecords.push_back(tag);
}

int CNitfImageSubheader::getImageAttachment() {
    CNitfProperty*& value = m_properties[const_cast<char*>("LALVL")];
    if (!value)
        value = new CNitfProperty("");
    return value->getAsInt();
}

char* CNitfImageSubheader::bandFieldName(const char* name, int index, int count) {
    // Zero-padded to the width of the band count below 1000 bands; from 1000 bands on, not padded at all.
    int width = count < 10 || count >= 1000 ? 1 : count < 100 ? 2 : 3;
    char digits[16];
    int length = 0;
    for (unsigned value = static_cast<unsigned>(index); value > 0 || length == 0; value /= 10)
        digits[length++] = static_cast<char>('0' + value % 10);
    while (length < width)
        digits[length++] = '0';
    size_t nameLength = std::strlen(name);
    char* result = static_cast<char*>(HMalloc(nameLength + length + 1));
    std::memcpy(result, name, nameLength);
    for (int i = 0; i < length; ++i)
        result[nameLength + i] = digits[length - 1 - i];
    result[nameLength + length] = '\0';
    return result;
}

const char* CNitfImageSubheader::ownBandFieldName(const char* name, int index, int count) {
    char* key = bandFieldName(name, index, count);
    auto found = m_properties.find(key);
    if (found != m_properties.end()) {
        free(key);
        return found->first;
    }
    m_ownedNames.push_back(key);
    return key;
}

int CNitfImageSubheader::getBandCount() {
    CNitfProperty* bands = FindProperty(m_properties, "NBANDS");
    int count = bands && bands->getDataType() != CNitfProperty::eNone ? bands->getAsInt() : 0;
    if (count == 0) {
        CNitfProperty* extended = FindProperty(m_properties, "XBANDS");
        count = extended && extended->getDataType() != CNitfProperty::eNone ? extended->getAsInt() : 0;
    }
    return count;
}

// ---- reading
// ------------------------------------------------------------------------------------------------

void CNitfImageSubheader::readField(FILE* fp, const char* name, int width) {
    SetProperty(m_properties, name, CNitfProperty::getNewFromString(fp, width));
    m_fieldNames.push_back(name);
}

// The representation codes that decide whether look-up tables are attached.
static int representationCode(const char* irep) {
    static const char* const codes[] = {"MONO    ", "RGB/LUT ", "RGB     ", "MULTI   ", "YCbCr601",
                                        "NODISPLY", "NVECTOR ", "POLAR   ", "VPH     "};
    for (int i = 0; i < 9; ++i) {
        if (std::strcmp(irep, codes[i]) == 0)
            return i + 1;
    }
    return 0;
}

static bool carriesComrat(const char* ic, bool allCompressed) {
    if (allCompressed)
        return std::strcmp(ic, "NC") != 0 && std::strcmp(ic, "NM") != 0;
    // The list is closed on purpose: other codes (C0, C2, C6, C7, M0, ...) carry no COMRAT.
    static const char* const codes[] = {"C1", "C3", "C4", "C5", "C8", "I1", "M1", "M3", "M4", "M5", "M8"};
    for (const char* code : codes) {
        if (std::strcmp(ic, code) == 0)
            return true;
    }
    return false;
}

void CNitfImageSubheader::readBand(FILE* fp, int band, int count, int representation) {
    readField(fp, ownBandFieldName("IREPBAND", band, count), 2);
    readField(fp, ownBandFieldName("ISUBCAT", band, count), 6);
    readField(fp, ownBandFieldName("IFC", band, count), 1);
    readField(fp, ownBandFieldName("IMFLT", band, count), 3);
    const char* lutCountName = ownBandFieldName("NLUTS", band, count);
    readField(fp, lutCountName, 1);
    int tables = FindProperty(m_properties, lutCountName)->getAsInt();
    if (tables == 0)
        return;
    const char* entriesName = ownBandFieldName("NELUT", band, count);
    readField(fp, entriesName, 5);
    int entries = FindProperty(m_properties, entriesName)->getAsInt();
    if (tables < 0 || entries < 0)
        return;

    int type = CNitfLutSource::eEntryTypeNone;
    if (tables == 3 && (representation == 1 || representation == 2 || representation == 4))
        type = CNitfLutSource::eEntryTypeRGB;
    else if (tables == 1 && representation == 1)
        type = CNitfLutSource::eEntryTypeMono;
    if (type != CNitfLutSource::eEntryTypeNone) {
        CNitfLutSource* lut = addNewLutSource();
        lut->setInterleaving(false);
        lut->setEntryType(type);
        lut->setEntryCount(entries);
        lut->setEntryOffset(DKFTell(fp));
        lut->setBand(band);
    }
    DKFSeek64(fp, static_cast<__int64>(tables) * entries, SEEK_CUR);
}

void CNitfImageSubheader::readTagArea(FILE* fp, const char* lengthName) {
    readField(fp, lengthName, 5);
    int length = FindProperty(m_properties, lengthName)->getAsInt();
    if (length <= 0)
        return;
    DKFSeek64(fp, 3, SEEK_CUR); // the overflow number: resolved when its data extension segment is read
    CNitfTag::readArea(fp, length - 3, CNitfTag::eTagSourceImage, m_taggedRecords, true);
}

void CNitfImageSubheader::readBody(FILE* fp, const BodyRules& rules) {
    static const struct {
        const char* name;
        int width;
    } identity[] = {{"ENCRYP", 1}, {"ISORCE", 42}, {"NROWS", 8}, {"NCOLS", 8}, {"PVTYPE", 3},
                    {"IREP", 8},   {"ICAT", 8},    {"ABPP", 2},  {"PJUST", 1}, {"ICORDS", 1}};
    for (const auto& field : identity)
        readField(fp, field.name, field.width);
    int representation = representationCode(FindProperty(m_properties, "IREP")->getAsString());

    m_georef.setCoordinateType(FindProperty(m_properties, "ICORDS")->getAsString()[0], rules.version);
    if (m_georef.hasCoordinates()) {
        m_georef.setIgeoloOffset(DKFTell(fp));
        for (const char* corner : {"IGEOLO1", "IGEOLO2", "IGEOLO3", "IGEOLO4"})
            readField(fp, corner, 15);
    }

    readField(fp, "NICOM", 1);
    int comments = FindProperty(m_properties, "NICOM")->getAsInt();
    for (int i = 0; i < comments; ++i) {
        m_comments.push_back(new CDataPointer(DKFTell(fp), 80));
        DKFSeek64(fp, 80, SEEK_CUR);
    }

    readField(fp, "IC", 2);
    if (carriesComrat(FindProperty(m_properties, "IC")->getAsString(), rules.comratForAllCompressed))
        readField(fp, "COMRAT", 4);

    readField(fp, "NBANDS", 1);
    int bands = FindProperty(m_properties, "NBANDS")->getAsInt();
    if (rules.hasXbands && std::strcmp(FindProperty(m_properties, "NBANDS")->getAsString(), "0") == 0) {
        readField(fp, "XBANDS", 5);
        bands = FindProperty(m_properties, "XBANDS")->getAsInt();
    }
    // Each band takes at least 13 bytes: a count the rest of the file cannot hold is damage, not data.
    if (bands > 9 && static_cast<__int64>(bands) * 13 > CDataStream::remaining(fp))
        NITF_RAISE_FORMAT("void __cdecl CNitfImageSubheader::read(" NITF_FILE_SIG ",enum eNitfVersion_t)",
                          "Image band count %d runs past the end of the file", bands);
    for (int band = 1; band <= bands; ++band)
        readBand(fp, band, bands, representation);

    static const struct {
        const char* name;
        int width;
    } blocking[] = {{"ISYNC", 1}, {"IMODE", 1}, {"NBPR", 4},  {"NBPC", 4},  {"NPPBH", 4}, {"NPPBV", 4},
                    {"NBPP", 2},  {"IDLVL", 3}, {"IALVL", 3}, {"ILOC", 10}, {"IMAG", 4}};
    for (const auto& field : blocking)
        readField(fp, field.name, field.width);

    if (rules.hasTagAreas) {
        readTagArea(fp, "UDIDL");
        readTagArea(fp, "IXSHDL");
    }
}

// ---- writing
// ------------------------------------------------------------------------------------------------

void CNitfImageSubheader::writeFields(FILE* fp, std::initializer_list<std::pair<const char*, int>> fields) {
    for (const auto& field : fields) {
        CNitfProperty* value = FindProperty(m_properties, field.first);
        if (value)
            value->writeString(fp, field.second);
    }
}

void CNitfImageSubheader::writeBody(FILE* fp) {
    CDataStreamWrite out(fp);
    writeFields(fp, {{"ENCRYP", 1}, {"ISORCE", 42}, {"NROWS", 8}, {"NCOLS", 8}, {"PVTYPE", 3}});

    int bands = getBandCount();
    CNitfLutSource* lut = getLutSource(0);
    // The representation follows from what is written, not from the map.
    const char* representation = "MULTI";
    if (bands == 1)
        representation = lut && lut->getEntrySize() == 3 ? "RGB/LUT" : "MONO";
    else if (bands == 3)
        representation = "RGB";
    out.writeText(representation, 8);

    writeFields(fp, {{"ICAT", 8}, {"ABPP", 2}, {"PJUST", 1}, {"ICORDS", 1}});
    if (m_georef.hasCoordinates()) {
        // The corners are written here later, by the georeferencing.
        m_georef.setIgeoloOffset(DKFTell(fp));
        DKFSeek64(fp, 60, SEEK_CUR);
    }
    out.writeText("0", 1); // comments are never written

    writeFields(fp, {{"IC", 2}});
    CNitfProperty* ic = FindProperty(m_properties, "IC");
    if (ic && ic->toText()[0] != 'N')
        writeFields(fp, {{"COMRAT", 4}});
    writeFields(fp, {{"NBANDS", 1}});
    CNitfProperty* nbands = FindProperty(m_properties, "NBANDS");
    if (nbands && nbands->getAsInt() == 0)
        writeFields(fp, {{"XBANDS", 5}});

    for (int band = 1; band <= bands; ++band) {
        if (bands > 1) {
            char* name = bandFieldName("IREPBAND", band, bands);
            writeFields(fp, {{name, 2}});
            free(name);
        } else {
            out.writeText(lut && lut->getEntrySize() != 0 ? "LU" : "M", 2);
        }
        char* subcategory = bandFieldName("ISUBCAT", band, bands);
        writeFields(fp, {{subcategory, 6}});
        free(subcategory);
        out.writeText("N", 1);
        out.writeText("", 3);
        if (bands == 1 && lut) {
            out.writeDecimal(lut->getEntrySize(), 1, true);
            out.writeDecimal(lut->getEntryCount(), 5, true);
            // The look-up table writes its entries here itself.
            lut->setEntryOffset(DKFTell(fp));
            DKFSeek64(fp, lut->getSize(), SEEK_CUR);
        } else {
            out.writeText("0", 1);
        }
    }

    writeFields(fp, {{"ISYNC", 1},
                     {"IMODE", 1},
                     {"NBPR", 4},
                     {"NBPC", 4},
                     {"NPPBH", 4},
                     {"NPPBV", 4},
                     {"NBPP", 2},
                     {"IDLVL", 3},
                     {"IALVL", 3},
                     {"ILOC", 10},
                     {"IMAG", 4}});

    // Every TRE goes into the user-defined area; the extended area is always written empty.
    if (!m_taggedRecords.empty()) {
        out.writeDecimal64(CNitfTag::computeListTotalLengths(&m_taggedRecords) + 3, 5, true);
        out.writeText("000", 3);
        for (CNitfTag* tag : m_taggedRecords)
            tag->write(fp);
    } else {
        out.writeText("00000", 5);
    }
    out.writeText("00000", 5);
}

__int64 CNitfImageSubheader::computeBodyStorageLength(__int64 fixedLength) {
    int bands = getBandCount();
    __int64 length = fixedLength + (m_georef.hasCoordinates() ? 60 : 0);
    CNitfProperty* ic = FindProperty(m_properties, "IC");
    if (ic && ic->toText()[0] != 'N')
        length += 4;
    length += bands > 9 ? 6 : 1;
    length += 13 * static_cast<__int64>(bands);
    if (!m_luts.empty())
        length += m_luts.front()->getSize() + 5;
    length += 45;
    if (!m_taggedRecords.empty())
        length += CNitfTag::computeListTotalLengths(&m_taggedRecords) + 3;
    length += 5;
    // A sub-header read from a file still counts its old extended area here.
    CNitfProperty* extended = FindProperty(m_properties, "IXSHDL");
    if (extended && extended->getDataType() != CNitfProperty::eNone && extended->getAsInt() > 0)
        length += extended->getAsInt();
    return length;
}

void CNitfImageSubheader::buildTitle(const char* nameField, char* title) {
    std::string text;
    CNitfProperty* classification = FindProperty(m_properties, "ISCLAS");
    if (classification) {
        const char* word = classification->getAsSecurityString();
        if (_stricmp(word, "Unclassified") != 0)
            text = std::string(word) + ": ";
    }
    CNitfProperty* name = FindProperty(m_properties, nameField);
    if (name)
        text += name->toText();
    text = text.substr(0, 80);
    text.erase(text.find_last_not_of(" \t\r\n") + 1);
    std::strcpy(title, text.c_str());
}
