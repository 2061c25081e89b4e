#include "NitfImageSubheader.h"

#include <algorithm>
#include <cstring>
#include <string>

#include "DataStream.h"
#include "DataStreamWrite.h"
#include "HostError.h"
#include "HostFile.h"
#include "HostMemory.h"
#include "KeyStore.h"
#include "MAPLOBExtension.h"
#include "RPFIMGExtension.h"
#include "Raise.h"
#include "RecordLayout.h"
#include "RpcSource.h"
#include "TagAreas.h"

static const char kSourceFile[] = "nitf/lib/NitfImageSubheader";

CNitfImageSubheader::CNitfImageSubheader() : m_propertiesModified(false), m_keys(new CKeyStore) {}

CNitfImageSubheader::CNitfImageSubheader(const CNitfImageSubheader& other)
    : m_propertiesModified(false), m_keys(new CKeyStore) {
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
    // The keys are copied with the values: the other's band keys go with it.
    for (const auto& entry : other.m_properties)
        SetProperty(m_properties, m_keys->add(entry.first, std::strlen(entry.first)),
                    cloneProperty(entry.second));
    m_readLayout = other.m_readLayout;
    m_readOffset = other.m_readOffset;
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
    m_keys->clear();
    m_readLayout = nullptr;
    m_fields.clear();
    m_fieldsListed = false;
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

// The representation codes that decide whether look-up tables are attached.
static int representationCode(CNitfProperty* irep) {
    static const char* const codes[] = {"MONO    ", "RGB/LUT ", "RGB     ", "MULTI   ", "YCbCr601",
                                        "NODISPLY", "NVECTOR ", "POLAR   ", "VPH     "};
    const char* text = irep && irep->getDataType() == CNitfProperty::eString ? irep->getAsString() : "";
    for (int i = 0; i < 9; ++i) {
        if (std::strcmp(text, codes[i]) == 0)
            return i + 1;
    }
    return 0;
}

// The integer value of a band's field (0 when absent).
static int bandValue(PropertyMap& map, const char* name, int band, int count) {
    char* key = CNitfImageSubheader::bandFieldName(name, band, count);
    CNitfProperty* value = FindProperty(map, key);
    free(key);
    return value && value->getDataType() != CNitfProperty::eNone ? value->getAsInt() : 0;
}

const std::vector<NitfField_t>& CNitfImageSubheader::getFields() const {
    if (!m_fieldsListed && m_readLayout) {
        m_fields.clear();
        m_readLayout->listFields(m_properties, m_readOffset, m_fields);
    }
    m_fieldsListed = true;
    return m_fields;
}

void CNitfImageSubheader::readWith(FILE* fp, eNitfVersion_t version) {
    clearContents();
    std::vector<record::Placed> places;
    places.reserve(8); // the TRE areas and their overflow numbers, comments, look-up tables
    record::Report report;
    report.places = &places;
    report.start = &m_readOffset;
    m_readLayout = &readLayout(version);
    m_readLayout->read(fp, m_properties, *m_keys, report);

    CNitfProperty* icords = FindProperty(m_properties, "ICORDS");
    m_georef.setCoordinateType(icords ? icords->getAsString()[0] : '\0', version);
    const record::Placed* corners = findPlace(places, "IGEOLO1");
    if (m_georef.hasCoordinates() && corners)
        m_georef.setIgeoloOffset(corners->offset);

    const int representation = representationCode(FindProperty(m_properties, "IREP"));
    const int bands = getBandCount();
    for (const record::Placed& place : places) {
        const char* name = place.entry->name;
        if (std::strcmp(name, "ICOM") == 0) {
            m_comments.push_back(new CDataPointer(place.offset, 80));
        } else if (std::strcmp(name, "LUTD") == 0) {
            int band = static_cast<int>(place.index);
            int tables = bandValue(m_properties, "NLUTS", band, bands);
            int entries = bandValue(m_properties, "NELUT", band, bands);
            int type = CNitfLutSource::eEntryTypeNone;
            if (tables == 3 && (representation == 1 || representation == 2 || representation == 4))
                type = CNitfLutSource::eEntryTypeRGB;
            else if (tables == 1 && representation == 1)
                type = CNitfLutSource::eEntryTypeMono;
            if (type == CNitfLutSource::eEntryTypeNone || entries < 0)
                continue;
            CNitfLutSource* lut = addNewLutSource();
            lut->setInterleaving(false);
            lut->setEntryType(type);
            lut->setEntryCount(entries);
            lut->setEntryOffset(place.offset);
            lut->setBand(band);
        }
    }
    // The overflow numbers are not kept: an overflow is resolved when its data extension segment is read.
    readTagAreas(places, {"UDID", "IXSHD"}, CNitfTag::eTagSourceImage, m_taggedRecords);
    m_propertiesModified = false;
}

// TREs and look-up tables whose lengths reach past the end of the file: what is missing reads as blanks or
// zeros, and saying so is all that helps a reader of the file.
void CNitfImageSubheader::warnOfRecordsPastTheEnd(__int64 size) {
    if (size < 0)
        return;
    for (CNitfTag* tag : m_taggedRecords) {
        if (tag->getDataOffset() + tag->getDataLength() <= size)
            continue;
        const std::string message =
            std::string("The image TRE ") + nitf_detail::printable(tag->getIdentifier()) + " (" +
            std::to_string(tag->getDataLength()) + " bytes) runs past the end of the file; it is cut there";
        vexo::nspio::Warning::Warn(message.c_str(), kSourceFile, __LINE__);
        break;
    }
    for (CNitfLutSource* lut : m_luts) {
        if (lut->getEntryOffset() + lut->getSize() <= size)
            continue;
        const std::string message = "The look-up table of image band " + std::to_string(lut->getBand()) +
                                    " runs past the end of the file; what is missing reads as zeros";
        vexo::nspio::Warning::Warn(message.c_str(), kSourceFile, __LINE__);
        break;
    }
}

// ---- writing
// ------------------------------------------------------------------------------------------------

void CNitfImageSubheader::writtenValues(PropertyMap& values, CKeyStore& keys) {
    const int bands = getBandCount();
    CNitfLutSource* lut = getLutSource(0);
    // The representation follows from what is written, not from the map.
    const char* representation = "MULTI";
    if (bands == 1)
        representation = lut && lut->getEntrySize() == 3 ? "RGB/LUT" : "MONO";
    else if (bands == 3)
        representation = "RGB";
    SetProperty(values, "IREP", new CNitfProperty(representation));
    SetProperty(values, "NICOM", new CNitfProperty("0")); // comments are never written

    auto bandKey = [&](const char* name, int band) {
        char* built = bandFieldName(name, band, bands);
        char* key = keys.add(built, std::strlen(built));
        free(built);
        return key;
    };
    for (int band = 1; band <= bands; ++band) {
        if (bands == 1)
            SetProperty(values, bandKey("IREPBAND", band),
                        new CNitfProperty(lut && lut->getEntrySize() != 0 ? "LU" : "M"));
        SetProperty(values, bandKey("IFC", band), new CNitfProperty("N"));
        SetProperty(values, bandKey("IMFLT", band), new CNitfProperty(""));
        if (bands == 1 && lut) {
            // The look-up table writes its entries at the place the walk leaves for them.
            SetProperty(values, bandKey("NLUTS", band), new CNitfProperty(lut->getEntrySize()));
            SetProperty(values, bandKey("NELUT", band), new CNitfProperty(lut->getEntryCount()));
        } else {
            SetProperty(values, bandKey("NLUTS", band), new CNitfProperty("0"));
        }
    }

    // Every TRE goes into the user-defined area; the extended area is always written empty.
    if (!m_taggedRecords.empty()) {
        SetProperty(
            values, "UDIDL",
            new CNitfProperty(static_cast<int>(CNitfTag::computeListTotalLengths(&m_taggedRecords) + 3)));
        SetProperty(values, "UDOFL", new CNitfProperty("000"));
    } else {
        SetProperty(values, "UDIDL", new CNitfProperty("00000"));
    }
    SetProperty(values, "IXSHDL", new CNitfProperty("00000"));
}

__int64 CNitfImageSubheader::writeWithLayout(FILE* fp) {
    PropertyMap values;
    CKeyStore keys;
    std::vector<record::Placed> places;
    record::Report report;
    report.places = &places;
    __int64 written = 0;
    try {
        writtenValues(values, keys);
        written = writeLayout().write(fp, m_properties, &values, report);
    } catch (...) {
        DestroyPropertyMap(values);
        throw;
    }
    DestroyPropertyMap(values);

    // The corners, the look-up table and the TRE data are written at their places by their owners.
    const record::Placed* corners = findPlace(places, "IGEOLO1");
    if (corners)
        m_georef.setIgeoloOffset(corners->offset);
    CNitfLutSource* lut = getLutSource(0);
    for (const record::Placed& place : places) {
        if (lut && std::strcmp(place.entry->name, "LUTD") == 0)
            lut->setEntryOffset(place.offset);
    }
    writeTagArea(fp, places, "UDID", m_taggedRecords);
    return written;
}

__int64 CNitfImageSubheader::storageLength() {
    PropertyMap values;
    CKeyStore keys;
    __int64 length = 0;
    try {
        writtenValues(values, keys);
        length = writeLayout().length(m_properties, &values);
    } catch (...) {
        DestroyPropertyMap(values);
        throw;
    }
    DestroyPropertyMap(values);
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
