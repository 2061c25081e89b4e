// Image segments compressed with the bi-level (facsimile) coding, "C1" and "M1": one-bit images whose blocks
// are each coded on their own, one-dimensionally (COMRAT "1D  ") or with two-dimensional lines (COMRAT "2DS
// ", "2DH "). Masked images find their blocks through the block mask; unmasked ones by walking the coding,
// one block after another.
//
// The samples come out as an uncompressed one-bit image delivers them: a block (or one band of a block) is
// its bit stream, most significant bit first, rows running on without padding; readBitmap cuts regions out of
// an image-wide bitmap, made once when reading starts, and inverts them when the pad pixel value is 1. White
// is 0 and black is 1 (document pages have a background of 0). Absent blocks read as 0.
//
// Damaged coding is not an error: the block keeps what was decoded and the rest of it is white, and the
// image gives one warning.
#pragma once

#include <cstdint>
#include <memory>
#include <vector>

#include "NitfImageSource.h"

class BiLevelHuffman;

class CNitfImageSourceBilevel : public CNitfImageSource {
public:
    CNitfImageSourceBilevel(CNitfImageSubheader* subheader, char* fileName);
    ~CNitfImageSourceBilevel() override;

    using CNitfImageSource::readTileInterleaved;
    using CNitfImageSource::readTileNonInterleaved;

    // Locates the blocks and decodes them all into the image-wide bitmap. Raises vexo::Exception for images
    // the coding cannot describe (other than one bit per pixel, several bands not stored band-sequentially)
    // and for a bitmap larger than the coded data could fill.
    void readStart(FILE* fp, long long dataOffset, long long dataLength) override;
    bool readBitmap(char* buffer, int x0, int y0, int width, int srcRows, int outWidthBits,
                    int outRows) override;

    // How many blocks were found damaged so far.
    int getDamagedBlockCount() const { return m_damagedBlocks; }

protected:
    void prepareTileOffsets(FILE* fp, long long dataOffset, long long dataLength, unsigned int* blockMask,
                            int count) override;
    // Block entry `entry` as its bit stream (the row size is not used); absent blocks read as 0.
    bool decodeBlock(FILE* fp, int entry, int band, unsigned char* buffer, int rowBytes,
                     bool interleaved) override;

private:
    // Decodes block entry `index` into `out`, its row r at bit firstBit + r x lineBits; an absent block
    // clears those bits. False when the entry does not exist.
    bool decodeInto(FILE* fp, int index, unsigned char* out, uint64_t firstBit, uint64_t lineBits);
    // The coded bytes from `offset` to the next block or the end of the image data.
    unsigned long long codedLength(unsigned long long offset) const;
    void buildBitmap(FILE* fp);
    void noteDamage(int index, int damagedRow, const char* what);

    std::unique_ptr<BiLevelHuffman> m_decoder;
    std::vector<unsigned char> m_coded;              // the coded bytes of the block being decoded
    std::vector<unsigned long long> m_sortedOffsets; // the recorded blocks' offsets, ascending
    unsigned long long m_dataEnd;
    long long m_bitmapRowBits;
    long long m_bitmapRows;
    int m_damagedBlocks;
    std::vector<bool> m_damageNoted; // per block entry, so a block read again is not counted twice
};
