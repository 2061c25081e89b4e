#include "NitfFileReader.h"

#include <cstring>
#include <memory>
#include <string>

#include "HostFile.h"
#include "NitfDataExtensionSource.h"
#include "NitfExtension.h"
#include "NitfFileHeaderV11.h"
#include "NitfFileHeaderV20.h"
#include "NitfFileHeaderV21.h"
#include "NitfImageSource.h"
#include "NitfImagePropertiesIF.h"
#include "NitfImageSourceBilevel.h"
#include "NitfImageSourceJpeg.h"
#include "NitfImageSourceJpeg2000.h"
#include "NitfImageSourceUncompressed.h"
#include "NitfImageSourceVQ.h"
#include "NitfImageSubheader.h"
#include "NitfLabelSource.h"
#include "NitfSymbolSource.h"
#include "NitfTextSource.h"
#include "Raise.h"
#include "RpfSource.h"

static const char kSourceFile[] = "nitf/lib/NitfFileReader";

CNitfFileReader::CNitfFileReader() : m_open(false), m_fp(nullptr), m_header(nullptr) {}

CNitfFileReader::~CNitfFileReader() {
    delete m_header;
    if (m_open)
        DKClose(m_fp);
}

FILE* CNitfFileReader::open(const char* fileName, const char* access) {
    return adopt(DKOpen(fileName, DK_MODE_READ_BINARY, access));
}

FILE* CNitfFileReader::openMemory(const void* data, size_t size) {
    return adopt(DKOpenMemory(data, size, "<memory>"));
}

FILE* CNitfFileReader::openStream(const DKStreamCallbacks& callbacks) {
    return adopt(DKOpenCallbacks(&callbacks, "<stream>"));
}

FILE* CNitfFileReader::adopt(FILE* fp) {
    if (!fp)
        return nullptr;
    if (m_open)
        DKClose(m_fp);
    m_fp = fp;
    m_open = true;
    if (!m_header)
        getNewFileHeader();
    return m_fp;
}

void CNitfFileReader::close() {
    if (m_open) {
        DKClose(m_fp);
        m_open = false;
    }
}

CNitfFileHeader* CNitfFileReader::getNewFileHeader() {
    DKFSeek64(m_fp, 0, SEEK_SET);
    eNitfVersion_t version = CNitfFileHeader::readVersion(m_fp);
    DKFSeek64(m_fp, 0, SEEK_SET);
    switch (version) {
    case eNitfVersion11:
        m_header = new CNitfFileHeaderV11;
        break;
    case eNitfVersion20:
        m_header = new CNitfFileHeaderV20;
        break;
    case eNitfVersion21:
    case eNitfVersion21Variant:
    case eNsifVersion10:
    case eOsdeVersion01:
        m_header = new CNitfFileHeaderV21(version);
        break;
    default:
        NITF_RAISE("Unknown NITF file version",
                   "class CNitfFileHeader *__cdecl CNitfFileReader::getNewFileHeader(void)");
    }
    m_header->read(m_fp, this);
    return m_header;
}

int CNitfFileReader::getImageCount() const {
    return m_header ? m_header->getImageCount() : 0;
}
int CNitfFileReader::getSymbolCount() const {
    return m_header ? m_header->getSymbolCount() : 0;
}
int CNitfFileReader::getLabelCount() const {
    return m_header ? m_header->getLabelCount() : 0;
}
int CNitfFileReader::getTextCount() const {
    return m_header ? m_header->getTextCount() : 0;
}
int CNitfFileReader::getDataExtensionCount() const {
    return m_header ? m_header->getDataExtensionCount() : 0;
}

namespace {

// Builds a segment object for the pair at `index` and lets it read its sub-header; the caller owns the
// result.
template <typename Source, typename Read>
Source* newSegment(const CNitfFileHeader& header, CNitfHeaderDataPair* pair, const char* kind, int index,
                   Read read) {
    header.requireSubheaderInFile(pair, kind, index);
    Source* source = new Source;
    try {
        source->prepare(pair);
        source->setIndex(index);
        read(*source);
    } catch (...) {
        delete source;
        throw;
    }
    return source;
}

} // namespace

CNitfSymbolSource* CNitfFileReader::getNewSymbolSource(int index) {
    CNitfHeaderDataPair* pair = m_header && m_open ? m_header->getSymbolHeaderDataPair(index) : nullptr;
    if (!pair)
        NITF_RAISE("Invalid symbol index",
                   "class CNitfSymbolSource *__cdecl CNitfFileReader::getNewSymbolSource(int)");
    return newSegment<CNitfSymbolSource>(*m_header, pair, "graphic", index, [&](CNitfSymbolSource& source) {
        source.read(this, m_header->getVersion(), nullptr);
    });
}

CNitfLabelSource* CNitfFileReader::getNewLabelSource(int index) {
    CNitfHeaderDataPair* pair = m_header && m_open ? m_header->getLabelHeaderDataPair(index) : nullptr;
    if (!pair)
        NITF_RAISE("Invalid label index",
                   "class CNitfLabelSource *__cdecl CNitfFileReader::getNewLabelSource(int)");
    return newSegment<CNitfLabelSource>(*m_header, pair, "label", index, [&](CNitfLabelSource& source) {
        source.read(this, m_header->getVersion(), nullptr);
    });
}

CNitfTextSource* CNitfFileReader::getNewTextSource(int index) {
    CNitfHeaderDataPair* pair = m_header && m_open ? m_header->getTextHeaderDataPair(index) : nullptr;
    if (!pair)
        NITF_RAISE("Invalid text index",
                   "class CNitfTextSource *__cdecl CNitfFileReader::getNewTextSource(int)");
    return newSegment<CNitfTextSource>(*m_header, pair, "text", index, [&](CNitfTextSource& source) {
        source.read(this, m_header->getVersion(), nullptr);
    });
}

CNitfDataExtensionSource* CNitfFileReader::getNewDataExtensionSource(int index) {
    CNitfHeaderDataPair* pair =
        m_header && m_open ? m_header->getDataExtensionHeaderDataPair(index) : nullptr;
    if (!pair)
        NITF_RAISE("Invalid data extension index",
                   "class CNitfDataExtensionSource *__cdecl CNitfFileReader::getNewDataExtensionSource(int)");
    return newSegment<CNitfDataExtensionSource>(
        *m_header, pair, "data extension", index, [&](CNitfDataExtensionSource& source) {
            source.read(this, m_header->getVersion(), nullptr, nullptr, nullptr);
        });
}

namespace {

struct CompressionCode {
    const char* ic;
    CNitfImagePropertiesIF::eCompressionType_t type;
    bool masked;
};

// IC to compression type: exact, case-sensitive codes.
const CompressionCode kCompressionCodes[] = {
    {"NC", CNitfImagePropertiesIF::eCompressionUncompressed, false},
    {"NM", CNitfImagePropertiesIF::eCompressionUncompressed, true},
    {"I1", CNitfImagePropertiesIF::eCompressionDownsampledJpeg, false},
    {"C0", CNitfImagePropertiesIF::eCompressionUserDefined, false},
    {"M0", CNitfImagePropertiesIF::eCompressionUserDefined, true},
    {"C1", CNitfImagePropertiesIF::eCompressionBilevel, false},
    {"M1", CNitfImagePropertiesIF::eCompressionBilevel, true},
    {"C2", CNitfImagePropertiesIF::eCompressionAridPcm, false},
    {"M2", CNitfImagePropertiesIF::eCompressionAridPcm, true},
    {"C3", CNitfImagePropertiesIF::eCompressionJpeg, false},
    {"M3", CNitfImagePropertiesIF::eCompressionJpeg, true},
    {"C4", CNitfImagePropertiesIF::eCompressionVQ, false},
    {"M4", CNitfImagePropertiesIF::eCompressionVQ, true},
    {"C5", CNitfImagePropertiesIF::eCompressionJpegLossless, false},
    {"M5", CNitfImagePropertiesIF::eCompressionJpegLossless, true},
    {"C6", CNitfImagePropertiesIF::eCompressionCorrelated, false},
    {"M6", CNitfImagePropertiesIF::eCompressionCorrelated, true},
    {"C7", CNitfImagePropertiesIF::eCompressionComplexSar, false},
    {"M7", CNitfImagePropertiesIF::eCompressionComplexSar, true},
    {"C8", CNitfImagePropertiesIF::eCompressionJpeg2000, false},
    {"M8", CNitfImagePropertiesIF::eCompressionJpeg2000, true},
};

const char kImageSourceSignature[] =
    "class CNitfImageSource *__cdecl CNitfFileReader::getNewImageSource(int)";

} // namespace

CNitfImageSource* CNitfFileReader::getNewImageSource(int index) {
    if (!m_header || !m_open || index < 0 || index >= getImageCount())
        NITF_RAISE("Invalid image index", kImageSourceSignature);
    CNitfImageSubheader* subheader = m_header->getNewImageSubheader(m_fp, index);
    if (!subheader)
        NITF_RAISE("Invalid image index", kImageSourceSignature);

    CNitfProperty* icField = FindProperty(subheader->getProperties(), "IC");
    std::string ic = icField ? icField->toText() : std::string();
    const CompressionCode* code = nullptr;
    for (const CompressionCode& entry : kCompressionCodes) {
        if (ic == entry.ic) {
            code = &entry;
            break;
        }
    }

    CNitfImageSource* source = nullptr;
    try {
        if (!code)
            NITF_RAISE_FORMAT(kImageSourceSignature, "Compression not supported (ISH.IC == %s)",
                              nitf_detail::printable(ic).c_str());
        switch (code->type) {
        case CNitfImagePropertiesIF::eCompressionUncompressed:
            source = new CNitfImageSourceUncompressed(subheader, nullptr);
            break;
        case CNitfImagePropertiesIF::eCompressionBilevel:
            source = new CNitfImageSourceBilevel(subheader, nullptr);
            break;
        case CNitfImagePropertiesIF::eCompressionJpeg:
        case CNitfImagePropertiesIF::eCompressionJpegLossless:
        case CNitfImagePropertiesIF::eCompressionDownsampledJpeg:
            source = new CNitfImageSourceJpeg(subheader, nullptr);
            break;
        case CNitfImagePropertiesIF::eCompressionJpeg2000:
            source = new CNitfImageSourceJpeg2000(subheader, nullptr);
            break;
        case CNitfImagePropertiesIF::eCompressionVQ:
            source = new CNitfImageSourceVQ(subheader, nullptr);
            break;
        case CNitfImagePropertiesIF::eCompressionAridPcm:
            NITF_RAISE("AridPcm compression not supported (ISH.IC == M2/C2)", kImageSourceSignature);
        case CNitfImagePropertiesIF::eCompressionCorrelated:
            NITF_RAISE("Correlated Multicomponent compression not supported (ISH.IC == M6/C6)",
                       kImageSourceSignature);
        case CNitfImagePropertiesIF::eCompressionComplexSar:
            NITF_RAISE("Complex SAR compression not supported (ISH.IC == M7/C7)", kImageSourceSignature);
        case CNitfImagePropertiesIF::eCompressionUserDefined:
            // The message names the internal type number in both places (so C0/M0 read "M2/C2").
            NITF_RAISE_FORMAT(kImageSourceSignature, "Unsupported compression type (ISH.IC == M%d/C%d)",
                              static_cast<int>(code->type), static_cast<int>(code->type));
        default:
            // Every compression the library reads has a source; the others are refused above.
            NITF_RAISE_FORMAT(kImageSourceSignature,
                              "Compression not yet supported by this build (ISH.IC == %s)",
                              nitf_detail::printable(ic).c_str());
        }
    } catch (...) {
        if (!source)
            delete subheader;
        throw;
    }

    try {
        source->getImageProperties().setCompressionType(code->type);
        source->setImageIndex(index); // warnings while the data are located name the image
        CNitfHeaderDataPair* pair = m_header->getImageHeaderDataPair(index);
        __int64 dataOffset = pair->getDataOffset();
        __int64 dataLength = pair->getDataLength();
        if (code->masked) {
            DKFSeek64(m_fp, dataOffset, SEEK_SET);
            int maskLength = source->readBlockMask(m_fp);
            dataOffset += maskLength;
            dataLength -= maskLength;
        }
        source->readStart(m_fp, dataOffset, dataLength);
    } catch (...) {
        delete source;
        throw;
    }
    return source;
}

CNitfTag* CNitfFileReader::getExtensionTag(const char* name) {
    return m_header ? CNitfTag::find(name, m_header->getTaggedRecords()) : nullptr;
}

bool CNitfFileReader::hasExtensionRpf() {
    return getExtensionTag("RPFHDR") != nullptr;
}

CRpfSource* CNitfFileReader::getNewExtensionRpfSource() {
    CNitfTag* tag = getExtensionTag("RPFHDR");
    if (!tag)
        return nullptr;
    auto source = std::make_unique<CRpfSource>();
    source->readStart(m_fp, tag);
    return source.release();
}

CNitfExtension* CNitfFileReader::getNewExtensionPIAPRD() {
    CNitfTag* tag = getExtensionTag("PIAPRD");
    if (!tag)
        return nullptr;
    CNitfExtension* extension = CNitfExtension::Build(tag);
    if (!extension)
        return nullptr;
    try {
        extension->readNewInfo(m_fp, false);
    } catch (...) {
        delete extension;
        throw;
    }
    return extension;
}

void CNitfFileReader::describeImageSource(int index, char* text) {
    CNitfImageSubheader* subheader = m_header ? m_header->getNewImageSubheader(m_fp, index) : nullptr;
    if (!subheader)
        NITF_RAISE("Invalid image index", "void __cdecl CNitfFileReader::describeImageSource(int,char *)");
    CNitfImagePropertiesIF properties;
    properties.setProperties(subheader->getProperties());
    std::sprintf(text, "%dx%d Pixels, %d Bits per Pixel", properties.getImageWidth(),
                 properties.getImageHeight(), properties.getBpp());
    delete subheader;
}
