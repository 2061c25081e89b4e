// The contents of the JP2 file-format boxes that matter to a reader of NITF image data (and that a writer
// produces): the header superbox's image header, colour specifications, palette, component mapping, channel
// definitions, bit depths and resolutions, plus the uuid and xml boxes. Plain values; CJp2BoxReader fills
// them and CJp2BoxWriter writes them.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

namespace jp2 {

// Box types: four ASCII characters read as a big-endian integer.
constexpr uint32_t boxType(const char (&name)[5]) {
    return (uint32_t(uint8_t(name[0])) << 24) | (uint32_t(uint8_t(name[1])) << 16) |
           (uint32_t(uint8_t(name[2])) << 8) | uint32_t(uint8_t(name[3]));
}
constexpr uint32_t kSignature = boxType("jP  ");
constexpr uint32_t kFileType = boxType("ftyp");
constexpr uint32_t kHeader = boxType("jp2h");
constexpr uint32_t kImageHeader = boxType("ihdr");
constexpr uint32_t kBitsPerComponent = boxType("bpcc");
constexpr uint32_t kColour = boxType("colr");
constexpr uint32_t kPalette = boxType("pclr");
constexpr uint32_t kComponentMapping = boxType("cmap");
constexpr uint32_t kChannelDefinition = boxType("cdef");
constexpr uint32_t kResolution = boxType("res ");
constexpr uint32_t kCaptureResolution = boxType("resc");
constexpr uint32_t kDisplayResolution = boxType("resd");
constexpr uint32_t kCodestream = boxType("jp2c");
constexpr uint32_t kUuid = boxType("uuid");
constexpr uint32_t kXml = boxType("xml ");
constexpr uint32_t kBrandJp2 = boxType("jp2 ");

// The signature box's four content bytes.
constexpr uint32_t kSignatureContent = 0x0D0A870A;

// A component depth as JP2 and the codestream code it: precision 1-38 and a sign.
struct Depth {
    int bits = 8;
    bool isSigned = false;
};

struct FileType {
    uint32_t brand = kBrandJp2;
    uint32_t minorVersion = 0;
    std::vector<uint32_t> compatible{kBrandJp2};
};

struct ImageHeader {
    uint32_t height = 0;
    uint32_t width = 0;
    uint16_t components = 0;
    uint8_t bitsPerComponent = 7; // 0xFF: the depths differ, see the bpcc box
    uint8_t compression = 7;
    uint8_t colourspaceUnknown = 0;
    uint8_t intellectualProperty = 0;
};

struct Colour {
    uint8_t method = 1; // 1 enumerated, 2 restricted ICC (JPX adds 3 and 4)
    int8_t precedence = 0;
    uint8_t approximation = 0;
    uint32_t enumerated = 0; // method 1: 16 sRGB, 17 greyscale, 18 sYCC
    std::string iccProfile;  // methods 2-4
};

struct Palette {
    std::vector<Depth> columns;
    std::vector<std::vector<int32_t>> entries; // entries[entry][column]
};

struct ComponentMapping {
    uint16_t component = 0;
    uint8_t type = 0;   // 0 the component itself, 1 through the palette
    uint8_t column = 0; // palette column when type is 1
};

struct ChannelDefinition {
    uint16_t channel = 0;
    uint16_t type = 0;        // 0 colour, 1 opacity, 2 premultiplied opacity, 65535 unspecified
    uint16_t association = 0; // 0 whole image, k colour k, 65535 none
};

// Grid points per metre: numerator / denominator x 10^exponent, vertically and horizontally.
struct Resolution {
    uint16_t verticalNumerator = 0, verticalDenominator = 1;
    uint16_t horizontalNumerator = 0, horizontalDenominator = 1;
    int8_t verticalExponent = 0, horizontalExponent = 0;
};

struct Uuid {
    std::string id; // 16 bytes
    std::string data;
};

// Everything of a JP2 file but the codestream, whose place the reader records instead.
struct Metadata {
    FileType fileType;
    ImageHeader imageHeader;
    std::vector<Depth> bitsPerComponent;
    std::vector<Colour> colours;
    bool hasPalette = false;
    Palette palette;
    std::vector<ComponentMapping> componentMapping;
    std::vector<ChannelDefinition> channels;
    bool hasCaptureResolution = false, hasDisplayResolution = false;
    Resolution captureResolution, displayResolution;
    std::vector<Uuid> uuids;
    std::vector<std::string> xml;
};

} // namespace jp2
