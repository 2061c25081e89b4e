#include "Jp2BoxReader.h"

#include <algorithm>
#include <cstring>

#include "HostError.h"
#include "J2kSegmentStream.h"
#include "Raise.h"

static const char kSourceFile[] = "nitf/lib/Jp2BoxReader";

namespace {

const char kReadSignature[] = "void __cdecl CJp2BoxReader::read(class CJ2kSegmentStream &)";
const char kParseSignature[] = "CJp2BoxReader::parse(const std::string &)";

// Big-endian fields out of one box's contents; running past the end raises.
class Fields {
public:
    Fields(const std::string& bytes, const char* box) : m_bytes(bytes), m_box(box) {}

    uint32_t get(int width) {
        need(static_cast<size_t>(width));
        uint32_t value = 0;
        for (int i = 0; i < width; ++i)
            value = (value << 8) | static_cast<uint8_t>(m_bytes[m_position++]);
        return value;
    }
    uint8_t u8() { return static_cast<uint8_t>(get(1)); }
    uint16_t u16() { return static_cast<uint16_t>(get(2)); }
    uint32_t u32() { return get(4); }
    std::string bytes(size_t count) {
        need(count);
        std::string part = m_bytes.substr(m_position, count);
        m_position += count;
        return part;
    }
    std::string rest() { return bytes(left()); }
    size_t left() const { return m_bytes.size() - m_position; }

private:
    void need(size_t count) const {
        if (count > left())
            NITF_RAISE_FORMAT(kParseSignature, "The JP2 %s box is too short", m_box);
    }

    const std::string& m_bytes;
    const char* m_box;
    size_t m_position = 0;
};

jp2::Depth depthOf(uint8_t code) {
    return jp2::Depth{(code & 0x7F) + 1, (code & 0x80) != 0};
}

std::string typeName(uint32_t type) {
    std::string name;
    for (int shift = 24; shift >= 0; shift -= 8) {
        const char c = static_cast<char>((type >> shift) & 0xFF);
        name += (c >= 0x20 && c < 0x7F) ? c : '?';
    }
    return name;
}

// One box header read out of a sequence of boxes that spans [position, end).
struct BoxHeader {
    uint32_t type = 0;
    long long contentOffset = 0;
    long long contentLength = 0;
};

// The header of the box at `position`; false when fewer than 8 bytes remain. Raises for a length that
// cannot be (shorter than its header, or past the end).
template <typename ReadAt>
bool readBoxHeader(ReadAt readAt, long long position, long long end, BoxHeader& box) {
    unsigned char header[16];
    if (end - position < 8 || readAt(position, header, 8) != 8)
        return false;
    auto be = [&](int at, int width) {
        unsigned long long value = 0;
        for (int i = 0; i < width; ++i)
            value = (value << 8) | header[at + i];
        return value;
    };
    unsigned long long length = be(0, 4);
    box.type = static_cast<uint32_t>(be(4, 4));
    long long headerLength = 8;
    if (length == 1) {
        if (end - position < 16 || readAt(position + 8, header + 8, 8) != 8)
            NITF_RAISE_FORMAT(kReadSignature, "The JP2 %s box's extended length is missing",
                              typeName(box.type).c_str());
        length = be(8, 8);
        headerLength = 16;
    } else if (length == 0) {
        length = static_cast<unsigned long long>(end - position); // the last box runs to the end
    }
    if (length < static_cast<unsigned long long>(headerLength) ||
        length > static_cast<unsigned long long>(end - position))
        NITF_RAISE_FORMAT(kReadSignature, "The JP2 %s box's length %llu does not fit its %lld bytes",
                          typeName(box.type).c_str(), length, end - position);
    box.contentOffset = position + headerLength;
    box.contentLength = static_cast<long long>(length) - headerLength;
    return true;
}

// Calls visit(type, contents) for each box in the contents of a superbox.
template <typename Visit> void forEachChild(const std::string& content, Visit visit) {
    auto readAt = [&content](long long position, void* buffer, size_t size) {
        const size_t count = std::min(size, content.size() - static_cast<size_t>(position));
        std::memcpy(buffer, content.data() + position, count);
        return count;
    };
    BoxHeader box;
    for (long long position = 0; readBoxHeader(readAt, position, static_cast<long long>(content.size()), box);
         position = box.contentOffset + box.contentLength)
        visit(box.type,
              content.substr(static_cast<size_t>(box.contentOffset), static_cast<size_t>(box.contentLength)));
}

} // namespace

CJp2BoxReader::eContent_t CJp2BoxReader::identify(CJ2kSegmentStream& range) {
    static const unsigned char codestream[] = {0xFF, 0x4F, 0xFF, 0x51};
    static const unsigned char jp2File[] = {0, 0, 0, 12, 'j', 'P', ' ', ' ', 0x0D, 0x0A, 0x87, 0x0A};
    unsigned char first[12] = {};
    const size_t got = range.readAt(0, first, sizeof first);
    if (got >= sizeof codestream && std::memcmp(first, codestream, sizeof codestream) == 0)
        return eCodestream;
    if (got == sizeof jp2File && std::memcmp(first, jp2File, sizeof jp2File) == 0)
        return eJp2File;
    return eUnknown;
}

void CJp2BoxReader::read(CJ2kSegmentStream& range) {
    m_metadata = jp2::Metadata();
    m_codestreamOffset = m_codestreamLength = 0;
    auto readAt = [&range](long long position, void* buffer, size_t size) {
        return range.readAt(position, buffer, size);
    };
    auto contents = [&range](const BoxHeader& box) {
        std::string bytes(static_cast<size_t>(box.contentLength), '\0'); // within the range: in the file
        bytes.resize(range.readAt(box.contentOffset, &bytes[0], bytes.size()));
        return bytes;
    };

    const long long end = range.length();
    BoxHeader box;
    for (long long position = 0; readBoxHeader(readAt, position, end, box);
         position = box.contentOffset + box.contentLength) {
        try {
            switch (box.type) {
            case jp2::kCodestream:
                m_codestreamOffset = box.contentOffset;
                m_codestreamLength = box.contentLength;
                return; // the first codestream is the image; what follows it does not change its meaning
            case jp2::kFileType:
                m_metadata.fileType = parseFileType(contents(box));
                break;
            case jp2::kHeader:
                readHeaderBox(contents(box));
                break;
            case jp2::kUuid:
                m_metadata.uuids.push_back(parseUuid(contents(box)));
                break;
            case jp2::kXml:
                m_metadata.xml.push_back(contents(box));
                break;
            default:
                break; // signature, reader requirements, intellectual property, anything unknown
            }
        } catch (const vexo::Exception& e) {
            vexo::nspio::Warning::Warn(e.getMessage(), kSourceFile, __LINE__);
        }
    }
    NITF_RAISE(std::string("The JP2 data holds no codestream box"), kReadSignature);
}

void CJp2BoxReader::readHeaderBox(const std::string& content) {
    forEachChild(content, [this](uint32_t type, const std::string& inner) {
        try {
            switch (type) {
            case jp2::kImageHeader:
                m_metadata.imageHeader = parseImageHeader(inner);
                break;
            case jp2::kBitsPerComponent:
                m_metadata.bitsPerComponent = parseBitsPerComponent(inner);
                break;
            case jp2::kColour:
                m_metadata.colours.push_back(parseColour(inner));
                break;
            case jp2::kPalette:
                m_metadata.palette = parsePalette(inner);
                m_metadata.hasPalette = true;
                break;
            case jp2::kComponentMapping:
                m_metadata.componentMapping = parseComponentMapping(inner);
                break;
            case jp2::kChannelDefinition:
                m_metadata.channels = parseChannelDefinition(inner);
                break;
            case jp2::kResolution:
                readResolutionBox(inner);
                break;
            default:
                break;
            }
        } catch (const vexo::Exception& e) {
            vexo::nspio::Warning::Warn(e.getMessage(), kSourceFile, __LINE__);
        }
    });
}

void CJp2BoxReader::readResolutionBox(const std::string& content) {
    forEachChild(content, [this](uint32_t type, const std::string& inner) {
        if (type == jp2::kCaptureResolution) {
            m_metadata.captureResolution = parseResolution(inner);
            m_metadata.hasCaptureResolution = true;
        } else if (type == jp2::kDisplayResolution) {
            m_metadata.displayResolution = parseResolution(inner);
            m_metadata.hasDisplayResolution = true;
        }
    });
}

// ---- box contents -----------------------------------------------------------------------------------------

// Some writers put the count of compatible brands in front of them as an extra entry; it is kept as read
// (a reader looks for the brand it knows among the entries, so the count does no harm).
jp2::FileType CJp2BoxReader::parseFileType(const std::string& content) {
    Fields in(content, "ftyp");
    jp2::FileType type;
    type.brand = in.u32();
    type.minorVersion = in.u32();
    type.compatible.clear();
    while (in.left() >= 4)
        type.compatible.push_back(in.u32());
    return type;
}

jp2::ImageHeader CJp2BoxReader::parseImageHeader(const std::string& content) {
    Fields in(content, "ihdr");
    jp2::ImageHeader header;
    header.height = in.u32();
    header.width = in.u32();
    header.components = in.u16();
    header.bitsPerComponent = in.u8();
    header.compression = in.u8();
    header.colourspaceUnknown = in.u8();
    header.intellectualProperty = in.u8();
    return header;
}

std::vector<jp2::Depth> CJp2BoxReader::parseBitsPerComponent(const std::string& content) {
    std::vector<jp2::Depth> depths;
    for (unsigned char code : content)
        depths.push_back(depthOf(code));
    return depths;
}

jp2::Colour CJp2BoxReader::parseColour(const std::string& content) {
    Fields in(content, "colr");
    jp2::Colour colour;
    colour.method = in.u8();
    colour.precedence = static_cast<int8_t>(in.u8());
    colour.approximation = in.u8();
    if (colour.method == 1)
        colour.enumerated = in.u32();
    else
        colour.iccProfile = in.rest();
    return colour;
}

jp2::Palette CJp2BoxReader::parsePalette(const std::string& content) {
    Fields in(content, "pclr");
    const int entries = in.u16();
    const int columns = in.u8();
    if (entries < 1 || entries > 1024 || columns < 1)
        NITF_RAISE_FORMAT(kParseSignature, "The JP2 palette of %d entries in %d columns is invalid", entries,
                          columns);
    jp2::Palette palette;
    for (int c = 0; c < columns; ++c) {
        palette.columns.push_back(depthOf(in.u8()));
        if (palette.columns.back().bits > 32)
            NITF_RAISE_FORMAT(kParseSignature, "The JP2 palette's column %d has %d bits", c,
                              palette.columns.back().bits);
    }
    palette.entries.assign(static_cast<size_t>(entries), std::vector<int32_t>(static_cast<size_t>(columns)));
    for (auto& entry : palette.entries)
        for (int c = 0; c < columns; ++c) {
            const jp2::Depth depth = palette.columns[static_cast<size_t>(c)];
            const int width = (depth.bits + 7) / 8;
            uint32_t value = in.get(width);
            if (depth.isSigned && depth.bits < 32 && (value >> (depth.bits - 1)) & 1)
                value |= ~0u << depth.bits; // sign-extend
            entry[static_cast<size_t>(c)] = static_cast<int32_t>(value);
        }
    return palette;
}

std::vector<jp2::ComponentMapping> CJp2BoxReader::parseComponentMapping(const std::string& content) {
    Fields in(content, "cmap");
    std::vector<jp2::ComponentMapping> mapping;
    while (in.left() >= 4) {
        jp2::ComponentMapping entry;
        entry.component = in.u16();
        entry.type = in.u8();
        entry.column = in.u8();
        mapping.push_back(entry);
    }
    return mapping;
}

std::vector<jp2::ChannelDefinition> CJp2BoxReader::parseChannelDefinition(const std::string& content) {
    Fields in(content, "cdef");
    const int count = in.u16();
    std::vector<jp2::ChannelDefinition> channels;
    for (int i = 0; i < count; ++i) {
        jp2::ChannelDefinition channel;
        channel.channel = in.u16();
        channel.type = in.u16();
        channel.association = in.u16();
        channels.push_back(channel);
    }
    return channels;
}

jp2::Resolution CJp2BoxReader::parseResolution(const std::string& content) {
    Fields in(content, "resc/resd");
    jp2::Resolution resolution;
    resolution.verticalNumerator = in.u16();
    resolution.verticalDenominator = in.u16();
    resolution.horizontalNumerator = in.u16();
    resolution.horizontalDenominator = in.u16();
    resolution.verticalExponent = static_cast<int8_t>(in.u8());
    resolution.horizontalExponent = static_cast<int8_t>(in.u8());
    return resolution;
}

jp2::Uuid CJp2BoxReader::parseUuid(const std::string& content) {
    Fields in(content, "uuid");
    jp2::Uuid uuid;
    uuid.id = in.bytes(16);
    uuid.data = in.rest();
    return uuid;
}
