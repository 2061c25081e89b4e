#include "J2kCodestreamHeader.h"

#include "J2kSegmentStream.h"
#include "Raise.h"

static const char kSourceFile[] = "nitf/lib/J2kCodestreamHeader";

namespace {

const char kSignature[] = "void __cdecl CJ2kCodestreamHeader::read(class CJ2kSegmentStream &)";
const int kMaxComponents = 16384;
const int kMaxPrecision = 31;

uint32_t bigEndian(const unsigned char* bytes, int width) {
    uint32_t value = 0;
    for (int i = 0; i < width; ++i)
        value = (value << 8) | bytes[i];
    return value;
}

long long ceilDiv(long long a, long long b) {
    return (a + b - 1) / b;
}

} // namespace

long long CJ2kCodestreamHeader::tilesAcross() const {
    return tileWidth ? ceilDiv(static_cast<long long>(x1) - tileX0, tileWidth) : 0;
}

long long CJ2kCodestreamHeader::tilesDown() const {
    return tileHeight ? ceilDiv(static_cast<long long>(y1) - tileY0, tileHeight) : 0;
}

void CJ2kCodestreamHeader::read(CJ2kSegmentStream& range) {
    // SOC, then the SIZ marker and its length, then 36 bytes of sizes and 3 bytes per component.
    unsigned char head[42];
    if (range.readAt(0, head, sizeof head) != sizeof head || bigEndian(head, 2) != 0xFF4F ||
        bigEndian(head + 2, 2) != 0xFF51)
        NITF_RAISE(std::string("The JPEG 2000 data does not start with a codestream header"), kSignature);
    const uint32_t length = bigEndian(head + 4, 2);
    capabilities = static_cast<int>(bigEndian(head + 6, 2));
    x1 = bigEndian(head + 8, 4);
    y1 = bigEndian(head + 12, 4);
    x0 = bigEndian(head + 16, 4);
    y0 = bigEndian(head + 20, 4);
    tileWidth = bigEndian(head + 24, 4);
    tileHeight = bigEndian(head + 28, 4);
    tileX0 = bigEndian(head + 32, 4);
    tileY0 = bigEndian(head + 36, 4);
    const int count = static_cast<int>(bigEndian(head + 40, 2));
    if (count < 1 || count > kMaxComponents || length != 38u + 3u * count)
        NITF_RAISE_FORMAT(kSignature, "The JPEG 2000 codestream declares %d components in %u bytes", count,
                          length);
    if (x1 <= x0 || y1 <= y0 || tileWidth == 0 || tileHeight == 0 || tileX0 > x0 || tileY0 > y0 ||
        static_cast<long long>(tileX0) + tileWidth <= x0 || static_cast<long long>(tileY0) + tileHeight <= y0)
        NITF_RAISE_FORMAT(kSignature,
                          "The JPEG 2000 codestream's sizes are inconsistent (image %u x %u from (%u, %u), "
                          "tiles %u x %u from (%u, %u))",
                          x1, y1, x0, y0, tileWidth, tileHeight, tileX0, tileY0);

    std::vector<unsigned char> bytes(3 * static_cast<size_t>(count));
    if (range.readAt(sizeof head, bytes.data(), bytes.size()) != bytes.size())
        NITF_RAISE(std::string("The JPEG 2000 codestream header is cut short"), kSignature);
    components.assign(static_cast<size_t>(count), Component());
    for (int i = 0; i < count; ++i) {
        Component& c = components[static_cast<size_t>(i)];
        const unsigned char* entry = &bytes[3 * static_cast<size_t>(i)];
        c.precision = (entry[0] & 0x7F) + 1;
        c.isSigned = (entry[0] & 0x80) != 0;
        c.dx = entry[1];
        c.dy = entry[2];
        if (c.precision > kMaxPrecision || c.dx == 0 || c.dy == 0)
            NITF_RAISE_FORMAT(
                kSignature,
                "JPEG 2000 component %d is invalid or unsupported (%d bits, sub-sampling %d x %d)", i,
                c.precision, c.dx, c.dy);
    }
    hasPackedPacketHeaders = false;
    scanMainHeader(range, static_cast<long long>(sizeof head + bytes.size()));
}

// Walks the marker segments after SIZ up to the first tile-part (or the end of the range).
void CJ2kCodestreamHeader::scanMainHeader(CJ2kSegmentStream& range, long long position) {
    const unsigned kStartOfTile = 0xFF90, kEndOfCodestream = 0xFFD9, kPackedPacketHeaders = 0xFF60;
    unsigned char bytes[4];
    while (range.readAt(position, bytes, 4) == 4) {
        const unsigned marker = bigEndian(bytes, 2);
        if (marker == kStartOfTile || marker == kEndOfCodestream || marker < 0xFF00)
            return;
        if (marker >= 0xFF30 && marker <= 0xFF3F) { // reserved markers without a segment
            position += 2;
            continue;
        }
        if (marker == kPackedPacketHeaders)
            hasPackedPacketHeaders = true;
        position += 2 + bigEndian(bytes + 2, 2);
    }
}
