// Image segments compressed with JPEG: DCT ("C3", "M3", 8- and 12-bit), lossless ("C5", "M5") and downsampled
// ("I1"). Every block (every block and band for IMODE "S") is one complete JPEG stream; streams are found
// through the block mask or by scanning for their start markers, and decoded with libjpeg straight into the
// caller's buffer. Streams without tables get the NITF defaults chosen by COMRAT; streams of another size
// than their block are fitted to it; 12-bit data are mapped by an IOMAPA extension when the stream asks for
// it.
//
// Samples are delivered as 1 byte (up to 8 bits) or 2 bytes in native order (12 and 16 bits). A buffer for a
// block holds tile-height rows of the row size given; three-band YCbCr streams are delivered as RGB. A band
// read fits a stream of another size to its block; a whole interleaved block is delivered as coded: a smaller
// stream fills only its own rows and columns, a larger one is cut to the block.
#pragma once

#include <memory>
#include <vector>

#include "NitfImageSource.h"

class CJpegStreamDecoder;
class CJpegAmplitudeMap;

class CNitfImageSourceJpeg : public CNitfImageSource {
public:
    CNitfImageSourceJpeg(CNitfImageSubheader* subheader, char* fileName);
    ~CNitfImageSourceJpeg() override;

    using CNitfImageSource::readTileInterleaved;
    using CNitfImageSource::readTileNonInterleaved;

    // Locates the blocks' streams and prepares the decoder.
    void readStart(FILE* fp, long long dataOffset, long long dataLength) override;

    // The file positions of the first `limit` start-of-image markers in `length` bytes from `offset`, in
    // order. Comment segments are skipped, so a marker pattern inside one does not count (entropy-coded data
    // cannot hold the pattern); a comment that runs past the end of a 64 KiB read chunk is skipped only to
    // that chunk's end, as streams have always been located.
    static std::vector<unsigned long long> findStreamStarts(FILE* fp, long long offset, long long length,
                                                            size_t limit);

    // Whether a stream carried the "NITF0001.A" marker (12-bit amplitude mapping), and its offset.
    bool hasNitfApp6() const { return m_hasNitfApp6; }
    unsigned short getAmplitudeOffset() const { return m_amplitudeOffset; }

protected:
    void prepareTileOffsets(FILE* fp, long long dataOffset, long long dataLength, unsigned int* blockMask,
                            int count) override;
    // One stream per band for IMODE S and single-band images; otherwise one stream holds every band.
    eBlockLayout_t getBlockLayout() const override;
    // Decodes the stream of one block entry; false when the block is absent. Raises vexo::Exception for a
    // damaged stream.
    bool decodeBlock(FILE* fp, int entry, int band, unsigned char* buffer, int rowBytes,
                     bool interleaved) override;
    // The IOMAPA amplitude mapping of 12-bit bands whose streams ask for it.
    void finishBand(CNitfFile* file, unsigned char* buffer, int rowBytes) override;

private:
    // How IREP sets libjpeg's colour spaces.
    enum eColour_t { eColourAsStored, eColourRgb, eColourMulti, eColourYCbCr };

    int sampleBytes() const;
    void checkStream(int rowBytes, int components) const;
    void setColourSpaces(bool interleaved);
    void readRowsResampled(unsigned char* buffer, int rowBytes, int components);
    // The stream's rows as coded, cut to the block.
    void readRowsAsCoded(unsigned char* buffer, int rowBytes, int components);
    // The bytes from `offset` to the next block's stream or the end of the image data.
    unsigned long long streamLength(unsigned long long offset) const;
    void applyAmplitudeMapping(unsigned char* buffer, int rowBytes, CNitfFile* file);

    std::unique_ptr<CJpegStreamDecoder> m_decoder;
    std::unique_ptr<CJpegAmplitudeMap> m_amplitudeMap;
    std::vector<unsigned long long> m_sortedOffsets;
    std::vector<unsigned char> m_rowBuffer;
    std::vector<unsigned char*> m_rowPointers;
    unsigned long long m_dataEnd;
    unsigned long long m_streamLength = 0; // of the stream being decoded
    eColour_t m_colour;
    unsigned short m_amplitudeOffset;
    unsigned short m_mappedOffset; // the amplitude offset m_amplitudeMap was built with
    bool m_hasNitfApp6;
    bool m_method3Warned;
};
