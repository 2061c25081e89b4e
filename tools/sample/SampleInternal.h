// Pieces shared by the sample writer's source files; not part of its interface.
#pragma once

#include "NitfSampleWriter.h"

#include <cstddef>
#include <string>

namespace nitfsample::detail {

// The layouts the writer knows: NITF 2.0, the NITF 2.1 / NSIF family, and OSDE (2.1 with merged fields).
enum class Family { V20, V21, Osde };
Family familyOf(const std::string& version);

// Appends fixed-width fields, applying the owner's overrides by field name.
class Fields {
public:
    explicit Fields(const Overrides& overrides) : overrides_(overrides) {}

    // Left-justified, space-filled (or cut) text.
    void text(const std::string& name, const std::string& value, std::size_t width);
    void character(const std::string& name, char value) { text(name, std::string(1, value), 1); }
    // Right-justified, zero-filled decimal; throws std::invalid_argument when it does not fit.
    void number(const std::string& name, uint64_t value, std::size_t width);
    // Raw bytes of a fixed width (an override is cut or space-padded to it).
    void binary(const std::string& name, const std::string& bytes);
    // Unnamed bytes (TRE runs, LUT tables).
    void raw(const std::string& bytes) { out_ += bytes; }

    // A TRE area: the length field, then, when there are TREs or an overflow number, the overflow field and
    // the TREs. The length counts the overflow field and the TREs.
    void treArea(const std::string& lengthName, const std::string& overflowName, const std::vector<Tre>& tres,
                 int overflow);
    // The security group of the family with the owner's prefix (F, I, S, L, T, DE, RE).
    void security(Family family, const std::string& prefix, const Security& security);

    const std::string& bytes() const { return out_; }

private:
    const Overrides& overrides_;
    std::string out_;
};

// The 2.1 security group as one 167-byte text (OSDE's ISCSEC and DESSEC).
std::string security21Text(const std::string& prefix, const Security& security);
// A fixed date/time in the version's form (CCYYMMDDhhmmss, or DDHHMMSSZMONYY for 2.0).
std::string defaultDate(Family family);

std::string imageSubheader(const Image& image, Family family);
std::string graphicSubheader(const Graphic& graphic, Family family);
std::string labelSubheader(const Label& label);
std::string textSubheader(const Text& text, Family family);
std::string desSubheader(const Des& des, Family family);
std::string resSubheader(const Res& res, Family family);

// Destination of the bytes of a file.
class Sink {
public:
    virtual ~Sink() = default;
    virtual void put(const char* data, std::size_t size) = 0;
    void put(const std::string& bytes) { put(bytes.data(), bytes.size()); }
};

// Image data: length, and the bytes (mask record, then the blocks), streamed block by block.
uint64_t imageDataLength(const Image& image);
void writeImageData(const Image& image, Sink& sink);
// Checks the image's pixel-related members; throws std::invalid_argument.
void checkImage(const Image& image, Family family);

} // namespace nitfsample::detail
