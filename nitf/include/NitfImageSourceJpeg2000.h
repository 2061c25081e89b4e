// Image segments compressed with JPEG 2000 ("C8", "M8"): the image data is one codestream, bare or in a JP2
// file, for the whole image; NITF blocks mirror its tiles. A block read decodes the area of the image under
// the block (only the tiles under it); a region read decodes any area at any resolution level the codestream
// has, level N being the image reduced N times by two, straight from the codestream.
//
// Samples are delivered whole, in native byte order, in the smallest container of 1, 2, 4 or 8 bytes that
// holds NBPP bits (11-, 12- and 16-bit samples in two bytes), sign-extended where the codestream's
// components are signed. Components sub-sampled in the codestream are replicated to the image's size; a JP2
// palette gives the bands when the image has as many bands as the palette's component mapping.
#pragma once

#include <memory>

#include "NitfImageSource.h"

class CJ2kDecoder;

class CNitfImageSourceJpeg2000 : public CNitfImageSource {
public:
    CNitfImageSourceJpeg2000(CNitfImageSubheader* subheader, char* fileName);
    ~CNitfImageSourceJpeg2000() override;

    using CNitfImageSource::readTileInterleaved;
    using CNitfImageSource::readTileNonInterleaved;

    // Reads the JPEG 2000 headers. Raises vexo::Exception when the data is not JPEG 2000, its headers are
    // damaged, or it cannot give the image's bands in NBPP bits.
    void readStart(FILE* fp, long long dataOffset, long long dataLength) override;

    // Resolution levels the codestream has: level 0 is the full image, level N is reduced by 2^N.
    int getResolutionLevels() const override;
    // The image's size at `level` (the codestream's image: normally NCOLS x NROWS at level 0).
    int getLevelWidth(int level) const override;
    int getLevelHeight(int level) const override;
    // Bands [firstBand, firstBand + bands) of the area x, y, width, height at `level` (coordinates at that
    // level), pixel-interleaved: row r at buffer + r * rowBytes. Raises vexo::Exception for an area outside
    // the image and for a damaged codestream; the source stays usable.
    void readRegion(CNitfFile* file, int level, int x, int y, int width, int height, int firstBand, int bands,
                    char* buffer, int rowBytes) override;

    // OpenJPEG tile decodes, and bytes of the image data read, so far.
    long long getTileDecodeCount() const;
    long long getBytesRead() const;

protected:
    void prepareTileOffsets(FILE* fp, long long dataOffset, long long dataLength, unsigned int* blockMask,
                            int count) override;
    // Every band comes out of one decode of the codestream's area under the block: pixel-interleaved.
    eBlockLayout_t getBlockLayout() const override;
    // Decodes every band of the block of entry `entry` (the area of the image under it; its padding
    // zero-filled); false when it is absent. Raises vexo::Exception for a damaged codestream.
    bool decodeBlock(FILE* fp, int entry, int band, unsigned char* buffer, int rowBytes,
                     bool interleaved) override;

private:
    // The decoder, reopened on `fp` when reads come through another stream than the last.
    CJ2kDecoder& decoderFor(FILE* fp);

    std::unique_ptr<CJ2kDecoder> m_decoder;
    FILE* m_fp;
};
