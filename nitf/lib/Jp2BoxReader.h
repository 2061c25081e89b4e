// Reads the box structure of JPEG 2000 image data: tells a bare codestream from a JP2 file, walks a JP2
// file's boxes (lengths of 32 and 64 bits, a last box running to the end, unknown boxes passed over by
// length), decodes the header superbox and the uuid and xml boxes, and records where the first contiguous
// codestream box lies. The codestream itself is not read here.
#pragma once

#include <cstdint>
#include <string>

#include "Jp2Boxes.h"

class CJ2kSegmentStream;

class CJp2BoxReader {
public:
    enum eContent_t { eCodestream, eJp2File, eUnknown };

    // What the range holds, from its first bytes.
    static eContent_t identify(CJ2kSegmentStream& range);

    // Reads the JP2 file in `range`. Raises vexo::Exception when the boxes are broken before a codestream
    // box is found, or there is none; damaged boxes of the header are skipped with a warning.
    void read(CJ2kSegmentStream& range);

    const jp2::Metadata& metadata() const { return m_metadata; }
    // The codestream box's contents, relative to the range.
    long long codestreamOffset() const { return m_codestreamOffset; }
    long long codestreamLength() const { return m_codestreamLength; }

    // Decoders of one box's contents, raising vexo::Exception when the contents are too short or
    // inconsistent.
    static jp2::FileType parseFileType(const std::string& content);
    static jp2::ImageHeader parseImageHeader(const std::string& content);
    static std::vector<jp2::Depth> parseBitsPerComponent(const std::string& content);
    static jp2::Colour parseColour(const std::string& content);
    static jp2::Palette parsePalette(const std::string& content);
    static std::vector<jp2::ComponentMapping> parseComponentMapping(const std::string& content);
    static std::vector<jp2::ChannelDefinition> parseChannelDefinition(const std::string& content);
    static jp2::Resolution parseResolution(const std::string& content);
    static jp2::Uuid parseUuid(const std::string& content);

private:
    void readHeaderBox(const std::string& content);
    void readResolutionBox(const std::string& content);

    jp2::Metadata m_metadata;
    long long m_codestreamOffset = 0;
    long long m_codestreamLength = 0;
};
