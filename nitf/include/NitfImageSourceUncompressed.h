// Image segments stored uncompressed ("NC", "NM"), in any of the four IMODE layouts, with or without a block
// mask; bi-level images (NBPP 1) are reassembled once into an image-wide bitmap from which regions are cut.
#pragma once

#include "NitfImageSource.h"

class CNitfImageSourceUncompressed : public CNitfImageSource {
public:
    CNitfImageSourceUncompressed(CNitfImageSubheader* subheader, char* fileName);
    ~CNitfImageSourceUncompressed() override;

    using CNitfImageSource::readTileInterleaved;
    using CNitfImageSource::readTileNonInterleaved;

    __int64 computeStorageLength() override;
    void readStart(FILE* fp, long long dataOffset, long long dataLength) override;
    bool readTileInterleaved(CNitfFile* file, char* buffer, int rowBytes, int x, int y) override;
    bool readTileNonInterleaved(CNitfFile* file, char* buffer, int rowBytes, int x, int y, int band) override;
    bool readBitmap(char* buffer, int x0, int y0, int width, int srcRows, int outWidthBits,
                    int outRows) override;
    void writeStart(FILE* fp, long long dataOffset, long long dataLength) override;
    bool isWriteable() override;
    bool writeTileNonInterleaved(CNitfFile* file, char* buffer, int x, int y, int band) override;

    // The file offset of one band of block (x, y), or 0xFFFFFFFF when the block is absent.
    unsigned long long getTileOffset(int x, int y, int band) const;
    using CNitfImageSource::getTileOffset;

protected:
    void prepareTileOffsets(FILE* fp, long long dataOffset, long long dataLength, unsigned int* blockMask,
                            int count) override;
};
