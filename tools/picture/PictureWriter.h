// Pictures for looking at decoded images: PNG and Netpbm (PGM/PPM), written row by row.
#pragma once

#include <cstdio>
#include <memory>
#include <vector>

// Rows of a picture: `channels` samples of `depth` bits per pixel (16-bit samples big-endian, 1-bit samples
// one byte 0/1 each), optionally a palette of RGB triplets. Channels: 1 grey, 2 grey and alpha, 3 RGB, 4 RGB
// and alpha (PNG only beyond 3).
struct PictureFormat {
    int width = 0, height = 0, channels = 1, depth = 8;
    std::vector<unsigned char> palette;
    int transparentIndex = -1; // a palette entry shown transparent
};

class PictureWriter {
public:
    virtual ~PictureWriter() {}
    virtual void row(const unsigned char* samples) = 0;
    virtual void finish() = 0;
};

// Raise std::runtime_error when the picture cannot be written.
std::unique_ptr<PictureWriter> makePngWriter(FILE* out, const PictureFormat& format);
std::unique_ptr<PictureWriter> makePnmWriter(FILE* out, const PictureFormat& format);
