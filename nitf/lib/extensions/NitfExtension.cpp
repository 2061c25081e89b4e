#include "NitfExtension.h"

#include <cstdlib>
#include <cstring>
#include <memory>
#include <string>

#include "ACFTBExtension.h"
#include "AIMIDBExtension.h"
#include "BANDSBExtension.h"
#include "CSCCGAExtension.h"
#include "CSCRNAExtension.h"
#include "CSDIDAExtension.h"
#include "CSEXRAExtension.h"
#include "CSPROAExtension.h"
#include "CSSFAAExtension.h"
#include "ENGRDAExtension.h"
#include "ESD001Extension.h"
#include "GEOPSBExtension.h"
#include "HISTOAExtension.h"
#include "HostCompat.h"
#include "HostConfig.h"
#include "HostFile.h"
#include "HostMemory.h"
#include "ICHIPBExtension.h"
#include "IMUDTGExtension.h"
#include "IMXDTGExtension.h"
#include "IOMAPAExtension.h"
#include "J2KLRAExtension.h"
#include "JITCIDExtension.h"
#include "MAPLOBExtension.h"
#include "MHUDTGExtension.h"
#include "MHXDTGExtension.h"
#include "MSTGTAExtension.h"
#include "NBLOCAExtension.h"
#include "NitfFile.h"
#include "NitfTag.h"
#include "PIAEQAExtension.h"
#include "PIAEVAExtension.h"
#include "PIAIMBExtension.h"
#include "PIAIMCExtension.h"
#include "PIAPEAExtension.h"
#include "PIAPEBExtension.h"
#include "PIAPRCExtension.h"
#include "PIAPRDExtension.h"
#include "PIATGAExtension.h"
#include "PIATGBExtension.h"
#include "PRJPSBExtension.h"
#include "RPFHDRExtension.h"
#include "RPFIMGExtension.h"
#include "STDIDCExtension.h"
#include "STREOBExtension.h"
#include "TESTINExtension.h"
#include "TreLayout.h"
#include "USE00AExtension.h"

// ---- construction and release
// --------------------------------------------------------------------------------------

CNitfExtension::CNitfExtension()
    : m_dataOffset(0), m_dataLength(0), m_readLength(0), m_keys(std::make_shared<tre::KeyStore>()) {}

CNitfExtension::CNitfExtension(const CNitfExtension& other)
    : m_dataOffset(other.m_dataOffset), m_dataLength(other.m_dataLength), m_properties(other.m_properties),
      m_readLength(other.m_readLength), m_keys(other.m_keys) {}

CNitfExtension::~CNitfExtension() {
    // A copy shares the properties: the last one to go releases them (and, with the key store, their keys).
    if (m_keys.use_count() <= 1)
        DestroyPropertyMap(m_properties);
}

tre::KeyStore& CNitfExtension::ownKeys() {
    if (m_keys.use_count() > 1) {
        // The shared properties stay with the copy; this extension starts afresh.
        m_properties.clear();
        m_keys = std::make_shared<tre::KeyStore>();
    }
    return *m_keys;
}

void CNitfExtension::prepare(CNitfTag* tag) {
    m_dataOffset = tag->getDataOffset();
    m_dataLength = tag->getDataLength();
}

// ---- the factory
// ---------------------------------------------------------------------------------------------------

template <typename Extension> static CNitfExtension* make() {
    return new Extension;
}

// The identifiers Build recognises, in the order they are tried.
static const struct {
    const char* name;
    CNitfExtension* (*create)();
} kParsers[] = {
    {"STDIDC", make<CSTDIDCExtension>}, {"AIMIDB", make<CAIMIDBExtension>},
    {"ACFTB", make<CACFTBExtension>},   {"USE00A", make<CUSE00AExtension>},
    {"STREOB", make<CSTREOBExtension>}, {"PIAIMB", make<CPIAIMBExtension>},
    {"PIAIMC", make<CPIAIMCExtension>}, {"PIAPRC", make<CPIAPRCExtension>},
    {"PIAPRD", make<CPIAPRDExtension>}, {"PIAPEA", make<CPIAPEAExtension>},
    {"PIAPEB", make<CPIAPEBExtension>}, {"IOMAPA", make<CIOMAPAExtension>},
    {"MSTGTA", make<CMSTGTAExtension>}, {"RPFHDR", make<CRPFHDRExtension>},
    {"RPFIMG", make<CRPFIMGExtension>}, {"ESD001", make<CESD001Extension>},
    {"J2KLRA", make<CJ2KLRAExtension>}, {"HISTOA", make<CHISTOAExtension>},
    {"PIATGA", make<CPIATGAExtension>}, {"PIATGB", make<CPIATGBExtension>},
    {"PIAEQA", make<CPIAEQAExtension>}, {"PIAEVA", make<CPIAEVAExtension>},
    {"GEOPSB", make<CGEOPSBExtension>}, {"MHUDTG", make<CMHUDTGExtension>},
    {"MHXDTG", make<CMHXDTGExtension>}, {"IMUDTG", make<CIMUDTGExtension>},
    {"IMXDTG", make<CIMXDTGExtension>}, {"JITCID", make<CJITCIDExtension>},
    {"TESTIN", make<CTESTINExtension>}, {"ENGRDA", make<CENGRDAExtension>},
    {"BANDSB", make<CBANDSBExtension>}, {"NBLOCA", make<CNBLOCAExtension>},
    {"ICHIPB", make<CICHIPBExtension>}, {"CSCRNA", make<CCSCRNAExtension>},
    {"CSDIDA", make<CCSDIDAExtension>}, {"CSEXRA", make<CCSEXRAExtension>},
    {"CSSFAA", make<CCSSFAAExtension>}, {"PRJPSB", make<CPRJPSBExtension>},
    {"CSPROA", make<CCSPROAExtension>}, {"MAPLOB", make<CMAPLOBExtension>},
    {"CSCCGA", make<CCSCCGAExtension>},
};

CNitfExtension* CNitfExtension::Build(CNitfTag* tag) {
    const char* identifier = tag->getIdentifier();
    // Identifiers of four or five significant characters stand blank-padded in the file and are not built
    // (isKnownExtension accepts them all the same). A five-letter name matches only an identifier whose sixth
    // character is NUL.
    if (identifier[4] == ' ' || identifier[5] == ' ')
        return nullptr;
    for (const auto& parser : kParsers) {
        if (_strnicmp(identifier, parser.name, 6) == 0) {
            CNitfExtension* extension = parser.create();
            extension->prepare(tag);
            return extension;
        }
    }
    return nullptr;
}

// The identifiers the library understands, by parser or (RPC00A/B) by the rational polynomial source.
static const char* const kKnownExtensions[] = {
    "ACFTB",  "AIMIDB", "BANDSB", "CSCCGA",  "CSCRNA", "CSDIDA", "CSEXRA", "CSPROA", "CSSFAA",
    "ENGRDA", "ESD001", "GEOPSB", "HISTOA",  "MHUDTG", "MHXDTG", "IMUDTG", "IMXDTG", "ICHIPB",
    "IOMAPA", "J2KLRA", "JITCID", "MAPLOB",  "MSTGTA", "NBLOCA", "PIAEQA", "PIAEVA", "PIAIMB",
    "PIAIMC", "PIAPEA", "PIAPEB", "PIATGA",  "PIATGB", "PIAPRC", "PIAPRD", "PRJPSB", "RPFHDR",
    "RPFIMG", "STDIDC", "STREOB", "TESTING", "USE00A", "RPC00B", "RPC00A",
};

bool CNitfExtension::isKnownExtension(const char* identifier) {
    // Identifiers of four or five significant characters stand blank-padded in the file.
    size_t compared = 6;
    if (identifier[0] && identifier[1] && identifier[2] && identifier[3] && identifier[4] == ' ')
        compared = 4;
    else if (identifier[0] && identifier[1] && identifier[2] && identifier[3] && identifier[4] &&
             identifier[5] == ' ')
        compared = 5;
    for (const char* name : kKnownExtensions) {
        if (_strnicmp(identifier, name, compared) == 0)
            return true;
    }
    return false;
}

// ---- reading
// -------------------------------------------------------------------------------------------------------

void CNitfExtension::readNewInfo(FILE* fp, bool flag) {
    DKFSeek64(fp, m_dataOffset, SEEK_SET);
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

void CNitfExtension::readLayout(FILE* fp, const tre::Layout& layout, __int64 externalCount) {
    m_readLength = tre::readLayout(fp, layout, m_dataLength, m_properties, ownKeys(), externalCount);
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
