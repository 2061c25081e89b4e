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
    // Reads the stored bytes of one band of a block (eBlockBands) or of a whole block; absent blocks, and
    // what the file does not hold, read as zeros.
    bool decodeBlock(FILE* fp, int entry, int band, unsigned char* buffer, int rowBytes,
                     bool interleaved) override;
    bool decodeBlockRows(FILE* fp, int entry, int band, int firstRow, int rows, unsigned char* buffer,
                         int rowBytes) override;
    // Bands of blocks stored whole-byte sample by sample can be read row by row.
    bool canDecodeBlockRows() const override;

private:
    // Reads `size` stored bytes at `offset` (absent: zeros) into `buffer`: for byte-multiple depths as rows
    // of `storedRow` bytes placed `rowBytes` apart, for packed depths as one bit stream.
    void readStored(FILE* fp, unsigned long long offset, unsigned char* buffer, long long size, int storedRow,
                    int rowBytes);
    // Refuses a buffer of `size` bytes that the image data in the file cannot justify.
    void checkJustified(long long size, const char* what) const;
    // Lays the blocks of a bi-level image out as one image-wide bitmap.
    char* ReassemblingBitmap(const char* data, long long dataSize, long long dataOffset, int tileWidth,
                             int tileHeight, int tilesX, int tilesY, long long rowBits, long long rows);
    void buildBitmap(FILE* fp);
    void computeSizes();
    // The stored size of one block entry.
    long long entryBytes() const;
    void checkDataPresent();

    long long m_tileBandBytes; // one band of one block, as stored
    long long m_tileBytes;     // one block, every band
    // The work buffer of the base holds the image-wide bitmap of a bi-level image.
    long long m_bitmapRowBits;
    long long m_bitmapRows;
};
