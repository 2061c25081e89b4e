#include "NitfExtension.h"

#include <cstdlib>
#include <cstring>
#include <memory>
#include <string>

#include "HostCompat.h"
#include "HostConfig.h"
#include "HostFile.h"
#include "HostMemory.h"
#include "NitfFile.h"
#include "NitfTag.h"
#include "RPFIMGExtension.h"
#include "RecordLayout.h"
#include "TreRegistry.h"

// ---- construction and release
// --------------------------------------------------------------------------------------

CNitfExtension::CNitfExtension()
    : m_dataOffset(0), m_dataLength(0), m_readLength(0), m_keys(std::make_shared<CKeyStore>()) {}

CNitfExtension::CNitfExtension(const CNitfExtension& other)
    : m_dataOffset(other.m_dataOffset), m_dataLength(other.m_dataLength), m_properties(other.m_properties),
      m_readLength(other.m_readLength), m_fields(other.m_fields), m_keys(other.m_keys) {}

CNitfExtension::~CNitfExtension() {
    // A copy shares the properties: the last one to go releases them (and, with the key store, their keys).
    if (m_keys.use_count() <= 1)
        DestroyPropertyMap(m_properties);
}

CKeyStore& CNitfExtension::ownKeys() {
    if (m_keys.use_count() > 1) {
        // The shared properties stay with the copy; this extension starts afresh.
        m_properties.clear();
        m_keys = std::make_shared<CKeyStore>();
    }
    return *m_keys;
}

void CNitfExtension::prepare(CNitfTag* tag) {
    m_dataOffset = tag->getDataOffset();
    m_dataLength = tag->getDataLength();
}

// ---- the factory
// ---------------------------------------------------------------------------------------------------

CNitfExtension* CNitfExtension::Build(CNitfTag* tag) {
    const char* identifier = tag->getIdentifier();
    // Identifiers of four or five significant characters stand blank-padded in the file and are not built
    // (isKnownExtension accepts them all the same). A five-letter name matches only an identifier whose sixth
    // character is NUL.
    if (identifier[4] == ' ' || identifier[5] == ' ')
        return nullptr;
    for (const TreRegistration& tre : treRegistry()) {
        if (tre.create && _strnicmp(identifier, tre.name, 6) == 0) {
            CNitfExtension* extension = tre.create();
            extension->prepare(tag);
            return extension;
        }
    }
    return nullptr;
}

bool CNitfExtension::isKnownExtension(const char* identifier) {
    // Identifiers of four or five significant characters stand blank-padded in the file.
    size_t compared = 6;
    if (identifier[0] && identifier[1] && identifier[2] && identifier[3] && identifier[4] == ' ')
        compared = 4;
    else if (identifier[0] && identifier[1] && identifier[2] && identifier[3] && identifier[4] &&
             identifier[5] == ' ')
        compared = 5;
    for (const TreRegistration& tre : treRegistry()) {
        if (_strnicmp(identifier, tre.name, compared) == 0)
            return true;
    }
    return false;
}

std::vector<const char*> CNitfExtension::getBuiltExtensionNames() {
    std::vector<const char*> names;
    for (const TreRegistration& tre : treRegistry()) {
        if (tre.create)
            names.push_back(tre.name);
    }
    return names;
}

// ---- reading
// -------------------------------------------------------------------------------------------------------

void CNitfExtension::readNewInfo(FILE* fp, bool flag) {
    DKFSeek64(fp, m_dataOffset, SEEK_SET);
    m_fields.clear();
    if (m_dataLength <= 0) {
        m_readLength = 0; // no data, no fields
        return;
    }
    CRPFIMGExtension* rpfImage = dynamic_cast<CRPFIMGExtension*>(this);
    if (rpfImage && _stricmp(getName(), "RPFIMG") == 0)
        rpfImage->readRpfSections(fp, flag);
    else
        readInfo(fp);
}

void CNitfExtension::readNewInfo(CNitfFile* file, bool flag) {
    readNewInfo(file->getInputStream(), flag);
}

void CNitfExtension::readLayout(FILE* fp, const CRecordLayout& layout, __int64 externalCount) {
    record::Report report;
    report.fields = &m_fields;
    m_readLength = layout.read(fp, m_properties, ownKeys(), report, m_dataLength, -1, externalCount);
}

unsigned __int64 CNitfExtension::getBinaryValue(CNitfProperty* field, int width) {
    if (!field)
        return 0;
    if (field->getDataType() != CNitfProperty::eString)
        return static_cast<unsigned __int64>(field->getAsInt64());
    const unsigned char* bytes = reinterpret_cast<const unsigned char*>(field->getAsString());
    unsigned __int64 value = 0;
    for (int i = 0; i < width && i < 8; ++i)
        value = (value << 8) | bytes[i];
    return value;
}

// ---- metadata
// ------------------------------------------------------------------------------------------------------

// P.NS.F, P.N.F, NS.F or N.F: the suffix (an occurrence mark chosen by the caller) is glued to the name.
static char* metadataKey(const char* prefix, const char* name, const char* suffix, const char* field) {
    if (prefix && suffix)
        return MkName("%s.%s%s.%s", prefix, name, suffix, field);
    if (prefix)
        return MkName("%s.%s.%s", prefix, name, field);
    if (suffix)
        return MkName("%s%s.%s", name, suffix, field);
    return MkName("%s.%s", name, field);
}

void CNitfExtension::asMetadata(char**& list, const char* prefix, const char* suffix) {
    for (auto& entry : m_properties) {
        CNitfProperty* property = entry.second;
        if (!property || property->getDataType() == CNitfProperty::eNone)
            continue;
        std::unique_ptr<char, void (*)(void*)> key(metadataKey(prefix, getName(), suffix, entry.first), free);
        std::string value = property->toText();
        // The value goes in as it stands, leading blanks included.
        LSCEatWS(&value[0]);
        if (!value.empty())
            list = SetAuxEntry(list, key.get(), value.c_str());
    }
}
