// The image and tile size marker segment (SIZ) at the start of a JPEG 2000 codestream, read and checked
// before OpenJPEG sees the codestream: the decoder bounds what OpenJPEG will allocate by these figures.
#pragma once

#include <cstdint>
#include <vector>

class CJ2kSegmentStream;

class CJ2kCodestreamHeader {
public:
    struct Component {
        int precision = 8; // 1 to 31 bits (what OpenJPEG decodes)
        bool isSigned = false;
        int dx = 1; // sub-sampling on the reference grid
        int dy = 1;
    };

    // Reads SOC and SIZ at the start of the range and looks through the rest of the main header. Raises
    // vexo::Exception when the range is not a codestream or the sizes are inconsistent.
    void read(CJ2kSegmentStream& range);

    // The reference grid: the image area is [x0, x1) x [y0, y1).
    uint32_t x0 = 0, y0 = 0, x1 = 0, y1 = 0;
    // Tiles of tileWidth x tileHeight from (tileX0, tileY0).
    uint32_t tileWidth = 0, tileHeight = 0, tileX0 = 0, tileY0 = 0;
    int capabilities = 0; // Rsiz
    std::vector<Component> components;
    // The main header carries the packet headers of every tile (PPM): they can only be read in tile order.
    bool hasPackedPacketHeaders = false;

    long long tilesAcross() const;
    long long tilesDown() const;
    long long tileCount() const { return tilesAcross() * tilesDown(); }

private:
    void scanMainHeader(CJ2kSegmentStream& range, long long position);
};
