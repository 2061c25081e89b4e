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

private:
    bool isPixelOrRowInterleaved() const;
    bool isPacked() const { return m_properties.getBpp() % 8 != 0; }
    bool isValidBlock(int x, int y) const;
    // Reads `size` stored bytes at `offset` (absent: zeros) into `buffer`: for byte-multiple depths as rows
    // of `storedRow` bytes placed `rowBytes` apart, for packed depths as one bit stream.
    bool readStored(FILE* fp, unsigned long long offset, char* buffer, long long size, int storedRow,
                    int rowBytes);
    // Makes the block buffer hold block (x, y) of a pixel- or row-interleaved image.
    bool loadBlockCache(CNitfFile* file, int x, int y);
    void extractBand(char* buffer, int rowBytes, int band);
    // A buffer of `size` bytes the image data can justify, or a raised vexo::Exception.
    char* allocateJustified(long long size, const char* what);
    // Lays the blocks of a bi-level image out as one image-wide bitmap.
    char* ReassemblingBitmap(const char* data, long long dataSize, long long dataOffset, int tileWidth,
                             int tileHeight, int tilesX, int tilesY, long long rowBits, long long rows);
    void buildBitmap(FILE* fp);

    long long m_tileBandBytes; // one band of one block, as stored
    long long m_tileBytes;     // one block, every band
    // IMODE P and R: the last whole block read, for handing out its bands (block m_cacheX, m_cacheY; -1 when
    // none). IMODE B and S: scratch for interleaving the bands of a block. The work buffer of the base holds
    // the image-wide bitmap of a bi-level image.
    char* m_blockBuffer;
    int m_cacheX;
    int m_cacheY;
    long long m_bitmapRowBits;
    long long m_bitmapRows;
};
