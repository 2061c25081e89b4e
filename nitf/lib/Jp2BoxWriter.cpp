#include "Jp2BoxWriter.h"

namespace {

void put(std::string& out, uint64_t value, int width) {
    for (int shift = 8 * (width - 1); shift >= 0; shift -= 8)
        out += static_cast<char>((value >> shift) & 0xFF);
}

uint8_t depthCode(const jp2::Depth& depth) {
    return static_cast<uint8_t>(((depth.bits - 1) & 0x7F) | (depth.isSigned ? 0x80 : 0));
}

} // namespace

std::string CJp2BoxWriter::box(uint32_t type, const std::string& content) {
    std::string out;
    const uint64_t length = 8 + static_cast<uint64_t>(content.size());
    if (length > 0xFFFFFFFFull) {
        put(out, 1, 4);
        put(out, type, 4);
        put(out, length + 8, 8);
    } else {
        put(out, length, 4);
        put(out, type, 4);
    }
    return out + content;
}

std::string CJp2BoxWriter::signature() {
    std::string content;
    put(content, jp2::kSignatureContent, 4);
    return box(jp2::kSignature, content);
}

std::string CJp2BoxWriter::fileType(const jp2::FileType& type) {
    std::string content;
    put(content, type.brand, 4);
    put(content, type.minorVersion, 4);
    for (uint32_t brand : type.compatible)
        put(content, brand, 4);
    return box(jp2::kFileType, content);
}

std::string CJp2BoxWriter::imageHeader(const jp2::ImageHeader& header) {
    std::string content;
    put(content, header.height, 4);
    put(content, header.width, 4);
    put(content, header.components, 2);
    put(content, header.bitsPerComponent, 1);
    put(content, header.compression, 1);
    put(content, header.colourspaceUnknown, 1);
    put(content, header.intellectualProperty, 1);
    return box(jp2::kImageHeader, content);
}

std::string CJp2BoxWriter::bitsPerComponent(const std::vector<jp2::Depth>& depths) {
    std::string content;
    for (const jp2::Depth& depth : depths)
        put(content, depthCode(depth), 1);
    return box(jp2::kBitsPerComponent, content);
}

std::string CJp2BoxWriter::colour(const jp2::Colour& colour) {
    std::string content;
    put(content, colour.method, 1);
    put(content, static_cast<uint8_t>(colour.precedence), 1);
    put(content, colour.approximation, 1);
    if (colour.method == 1)
        put(content, colour.enumerated, 4);
    else
        content += colour.iccProfile;
    return box(jp2::kColour, content);
}

std::string CJp2BoxWriter::palette(const jp2::Palette& palette) {
    std::string content;
    put(content, palette.entries.size(), 2);
    put(content, palette.columns.size(), 1);
    for (const jp2::Depth& depth : palette.columns)
        put(content, depthCode(depth), 1);
    for (const auto& entry : palette.entries)
        for (size_t c = 0; c < palette.columns.size(); ++c)
            put(content, static_cast<uint32_t>(c < entry.size() ? entry[c] : 0),
                (palette.columns[c].bits + 7) / 8);
    return box(jp2::kPalette, content);
}

std::string CJp2BoxWriter::componentMapping(const std::vector<jp2::ComponentMapping>& mapping) {
    std::string content;
    for (const jp2::ComponentMapping& entry : mapping) {
        put(content, entry.component, 2);
        put(content, entry.type, 1);
        put(content, entry.column, 1);
    }
    return box(jp2::kComponentMapping, content);
}

std::string CJp2BoxWriter::channelDefinition(const std::vector<jp2::ChannelDefinition>& channels) {
    std::string content;
    put(content, channels.size(), 2);
    for (const jp2::ChannelDefinition& channel : channels) {
        put(content, channel.channel, 2);
        put(content, channel.type, 2);
        put(content, channel.association, 2);
    }
    return box(jp2::kChannelDefinition, content);
}

std::string CJp2BoxWriter::resolution(const jp2::Metadata& metadata) {
    auto one = [](uint32_t type, const jp2::Resolution& resolution) {
        std::string content;
        put(content, resolution.verticalNumerator, 2);
        put(content, resolution.verticalDenominator, 2);
        put(content, resolution.horizontalNumerator, 2);
        put(content, resolution.horizontalDenominator, 2);
        put(content, static_cast<uint8_t>(resolution.verticalExponent), 1);
        put(content, static_cast<uint8_t>(resolution.horizontalExponent), 1);
        return box(type, content);
    };
    std::string content;
    if (metadata.hasCaptureResolution)
        content += one(jp2::kCaptureResolution, metadata.captureResolution);
    if (metadata.hasDisplayResolution)
        content += one(jp2::kDisplayResolution, metadata.displayResolution);
    return content.empty() ? content : box(jp2::kResolution, content);
}

std::string CJp2BoxWriter::uuid(const jp2::Uuid& uuid) {
    std::string id = uuid.id.substr(0, 16);
    id.resize(16, '\0');
    return box(jp2::kUuid, id + uuid.data);
}

std::string CJp2BoxWriter::xml(const std::string& text) {
    return box(jp2::kXml, text);
}

std::string CJp2BoxWriter::codestream(const std::string& codestream) {
    return box(jp2::kCodestream, codestream);
}

std::string CJp2BoxWriter::header(const jp2::Metadata& metadata) {
    std::string content = imageHeader(metadata.imageHeader);
    if (!metadata.bitsPerComponent.empty())
        content += bitsPerComponent(metadata.bitsPerComponent);
    for (const jp2::Colour& c : metadata.colours)
        content += colour(c);
    if (metadata.hasPalette)
        content += palette(metadata.palette);
    if (!metadata.componentMapping.empty())
        content += componentMapping(metadata.componentMapping);
    if (!metadata.channels.empty())
        content += channelDefinition(metadata.channels);
    content += resolution(metadata);
    return box(jp2::kHeader, content);
}

std::string CJp2BoxWriter::file(const jp2::Metadata& metadata, const std::string& codestream) {
    std::string out = signature() + fileType(metadata.fileType) + header(metadata);
    for (const jp2::Uuid& u : metadata.uuids)
        out += uuid(u);
    for (const std::string& text : metadata.xml)
        out += xml(text);
    return out + CJp2BoxWriter::codestream(codestream);
}
