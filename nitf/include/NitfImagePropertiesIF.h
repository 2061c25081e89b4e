// The integers every image source works with, derived from a sub-header's fields: image and block dimensions,
// bands, bit depths, interleaving, and the buffer sizes a caller provides. Blocks are called tiles here.
#pragma once

#include "NitfProperty.h"

class CNitfImagePropertiesIF {
public:
    // How image data is compressed; set by whoever builds the source.
    enum eCompressionType_t {
        eCompressionNone = 0,
        eCompressionUncompressed = 1,    // NC, NM
        eCompressionUserDefined = 2,     // C0, M0
        eCompressionBilevel = 3,         // C1, M1
        eCompressionAridPcm = 4,         // C2, M2
        eCompressionJpeg = 5,            // C3, M3 (12-bit samples are delivered in two bytes)
        eCompressionVQ = 6,              // C4, M4
        eCompressionJpegLossless = 7,    // C5, M5 (12-bit samples also in two bytes)
        eCompressionDownsampledJpeg = 8, // I1
        eCompressionJpeg2000 = 9,        // C8, M8
        eCompressionCorrelated = 10,     // C6, M6
        eCompressionComplexSar = 11,     // C7, M7
    };
    // IMODE: "S", "B", "P", "R", anything else.
    enum eInterleavingType_t {
        eBandSequential = 0,
        eBandInterleavedByBlock = 1,
        eBandInterleavedByPixel = 2,
        eBandInterleavedByRow = 3,
        eInterleavingUnknown = 4,
    };
    enum ePVType_t {
        ePVTypeUnknown = 0,
        ePVTypeInteger = 1,
        ePVTypeBilevel = 2,
        ePVTypeSignedInteger = 3,
        ePVTypeReal = 4,
        ePVTypeComplex = 5,
    };

    CNitfImagePropertiesIF();

    // Derives every field but the compression type from the map; absent fields read as 0 (and are inserted).
    void setProperties(PropertyMap& map);

    eCompressionType_t getCompressionType() const { return m_compressionType; }
    void setCompressionType(eCompressionType_t type) { m_compressionType = type; }
    eInterleavingType_t getInterleavingType() const { return m_interleavingType; }
    void setInterleavingType(eInterleavingType_t type) { m_interleavingType = type; }
    int getImageWidth() const { return m_imageWidth; }
    int getImageHeight() const { return m_imageHeight; }
    int getImageActualWidth() const { return m_actualWidth; }
    int getImageActualHeight() const { return m_actualHeight; }
    int getBandCount() const { return m_bandCount; }
    int getBpp() const { return m_bpp; }
    int getActualBpp() const { return m_actualBpp; }
    int getTileWidth() const { return m_tileWidth; }
    int getTileHeight() const { return m_tileHeight; }
    int getTileCountX() const { return m_tileCountX; }
    int getTileCountY() const { return m_tileCountY; }
    bool dataValid() const { return m_dataValid; }

    int getTileCount() const { return m_tileCountX * m_tileCountY; }
    int getTileIndex(int x, int y) const { return y * m_tileCountX + x; }
    // Band-sequential numbering: each band's blocks follow the previous band's.
    int getTileIndex(int x, int y, int band) const { return (band * m_tileCountY + y) * m_tileCountX + x; }

    int getImageBandWidthBufferSize() const;
    int getImageWidthBufferSize() const;
    __int64 getImageBandBufferSize() const;
    __int64 getImageBufferSize() const;
    // The row sizes of block buffers. Sources that deliver whole samples (every compression but uncompressed
    // and bi-level) use getSampleContainerBytes() per sample; the others use NBPP bits, truncated to bytes.
    int getTileBandWidthBufferSize() const;
    int getTileWidthBufferSize() const;
    // The stored size of one band of a block, and of a whole block (NBPP bits per sample, rounded up).
    __int64 getTileBandBufferSize() const;
    __int64 getTileBufferSize() const;

    // The bytes a caller's buffer needs for one band of one block (readTileNonInterleaved), and for a whole
    // block of every band (readTileInterleaved): the stored size or tile-height rows of the row size,
    // whichever is larger. Size block buffers with these.
    __int64 getTileBandReadBufferSize() const;
    __int64 getTileReadBufferSize() const;

    // Whether block buffers hold whole samples (true for every compression but uncompressed and bi-level,
    // which deliver samples as stored), and the bytes of each: the smallest of 1, 2, 4 or 8 holding NBPP
    // bits.
    bool deliversWholeSamples() const;
    int getSampleContainerBytes() const;

    // Setters that also put the value into the map (only where the field is already present).
    void setActualBpp(PropertyMap& map, int value);
    void setBandCount(PropertyMap& map, int value);
    void setBpp(PropertyMap& map, int value);
    void setImageActualHeight(PropertyMap& map, int value);
    void setImageActualWidth(PropertyMap& map, int value);
    void setTileCountX(PropertyMap& map, int value);
    void setTileCountY(PropertyMap& map, int value);
    void setTileHeight(PropertyMap& map, int value);
    void setTileWidth(PropertyMap& map, int value);
    void setImageWidth(int value) { m_imageWidth = value; }
    void setImageHeight(int value) { m_imageHeight = value; }

    static const char* getPVType(int type);

private:
    eCompressionType_t m_compressionType;
    eInterleavingType_t m_interleavingType;
    int m_imageWidth;
    int m_imageHeight;
    int m_actualWidth;
    int m_actualHeight;
    int m_bandCount;
    int m_bpp;
    int m_actualBpp;
    int m_tileWidth;
    int m_tileHeight;
    int m_tileCountX;
    int m_tileCountY;
    bool m_dataValid;
};
