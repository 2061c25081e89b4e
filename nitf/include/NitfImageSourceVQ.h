// Image segments compressed by vector quantisation ("C4", "M4"; the form of CADRG and CIB frames). The image
// data start with a header (the block's code grid and code length, then the compression lookup records) and a
// codebook of kernels; every block (every block and band for IMODE "S") is a grid of fixed-length codes, each
// selecting a kernel of one-byte pixels.
//
// Samples are delivered as single bytes; a buffer for a block holds tile-height rows of the row size given.
// The colour tables of a frame are the sub-header's look-up tables: this source hands out indexes only. The
// pad pixel is the code that stands for no data: the mask's, or the first code past the colours.
#pragma once

#include <memory>
#include <string>
#include <vector>

#include "NitfImageSource.h"

class CVqDecoder;

class CNitfImageSourceVQ : public CNitfImageSource {
public:
    // `option`, when given, is the target peak signal-to-noise ratio of codebook training (in decibels).
    CNitfImageSourceVQ(CNitfImageSubheader* subheader, char* fileName, const char* option = nullptr);
    ~CNitfImageSourceVQ() override;

    using CNitfImageSource::readTileInterleaved;
    using CNitfImageSource::readTileNonInterleaved;

    // Bytes the image data take when written: the 77-byte header, the 65,536-byte codebook and the 12-bit
    // indexes of every block.
    __int64 computeStorageLength() override;
    // Reads the header and the codebook and locates the blocks. Raises vexo::Exception when the header
    // describes no usable code grid or the codebook or a block's indexes are larger than the image data.
    void readStart(FILE* fp, long long dataOffset, long long dataLength) override;

    // Lengths of the written form (12-bit codes of 4 x 4 kernels, four lookup tables).
    static __int64 computeVqHeaderLength() { return 77; }
    static __int64 computeVqCodebookLength() { return 65536; }
    // ceil(block width x block height / 16 x 12 / 8): the indexes of one block.
    __int64 computeVqIndexesPerTileLength();
    __int64 computeVqIndexesLength();

    // What readStart found.
    int getCodeBitLength() const { return m_codeBitLength; }
    int getCodesPerRow() const { return m_codesPerRow; }
    int getCodeRows() const { return m_codeRows; }
    int getKernelWidth() const { return m_kernelWidth; }
    int getKernelHeight() const { return m_kernelHeight; }
    int getIndexBytesPerBlock() const { return m_indexBytesPerBlock; }
    // Whether the pad pixel (the code of no data, which absent subframes read as) is the first code past the
    // colours rather than one the mask stores.
    bool isPadPixelFromColours() const { return m_padFromColours; }

protected:
    void prepareTileOffsets(FILE* fp, long long dataOffset, long long dataLength, unsigned int* blockMask,
                            int count) override;
    // Decodes the code grid of one band of a block entry (each band has its own grid) into `out`, lines
    // `rowBytes` apart; false when the block is absent.
    bool decodeBlock(FILE* fp, int entry, int band, unsigned char* out, int rowBytes,
                     bool interleaved) override;

private:
    // Reads the code grid, the lookup records and the codebook at the stream's position (the data offset).
    void readHeader(FILE* fp);
    void readCodebook(FILE* fp);
    void takeNoDataFromColours();

    std::string m_option;
    int m_codeBitLength;
    int m_kernelWidth;
    int m_kernelHeight;
    int m_codesPerRow;
    int m_codeRows;
    int m_indexBytesPerBlock;
    std::unique_ptr<CVqDecoder> m_decoder;
    // One block's indexes and the decoder's padding.
    std::vector<unsigned char> m_indexes;
    bool m_padFromColours = false;
};
