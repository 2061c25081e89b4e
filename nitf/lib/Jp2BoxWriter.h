// Writes JP2 file-format boxes: each box on its own, the header superbox from its parts, or a whole JP2 file
// around a codestream. Box lengths are computed here; boxes too long for a 32-bit length get the 64-bit form.
#pragma once

#include <cstdint>
#include <string>

#include "Jp2Boxes.h"

class CJp2BoxWriter {
public:
    // One box of `type` around `content`.
    static std::string box(uint32_t type, const std::string& content);

    static std::string signature();
    static std::string fileType(const jp2::FileType& type);
    static std::string imageHeader(const jp2::ImageHeader& header);
    static std::string bitsPerComponent(const std::vector<jp2::Depth>& depths);
    static std::string colour(const jp2::Colour& colour);
    static std::string palette(const jp2::Palette& palette);
    static std::string componentMapping(const std::vector<jp2::ComponentMapping>& mapping);
    static std::string channelDefinition(const std::vector<jp2::ChannelDefinition>& channels);
    // The res superbox with whichever of resc and resd the metadata has; empty when it has neither.
    static std::string resolution(const jp2::Metadata& metadata);
    static std::string uuid(const jp2::Uuid& uuid);
    static std::string xml(const std::string& text);
    static std::string codestream(const std::string& codestream);

    // The jp2h superbox: ihdr, then bpcc (when given), colr, pclr, cmap, cdef and res as present.
    static std::string header(const jp2::Metadata& metadata);
    // A complete JP2 file: signature, file type, header, the uuid and xml boxes, then the codestream.
    static std::string file(const jp2::Metadata& metadata, const std::string& codestream);
};
