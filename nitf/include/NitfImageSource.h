// The base of every image data source: one object per image segment that hands out (or takes) the image's
// pixels block by block. It owns the blocking geometry, the block mask and pad pixel of masked images, the
// table of block offsets, the interleaving conversions and the bridge to the host projection record.
#pragma once

#include <cstdio>

#include "HostProjection.h"
#include "NitfImagePropertiesIF.h"
#include "NitfImageSubheader.h"

class CNitfFile;

class CNitfImageSource {
public:
    // The block offset that marks a block absent from the file (block mask entry 0xFFFFFFFF).
    static constexpr unsigned long long kAbsentBlock = 0xFFFFFFFFULL;

    // Takes ownership of the sub-header; the file name is accepted and not used.
    CNitfImageSource(CNitfImageSubheader* subheader, char* fileName);
    CNitfImageSource(const CNitfImageSource&) = delete;
    CNitfImageSource& operator=(const CNitfImageSource&) = delete;

protected:
    // Fills the tile offset table from the data offset and the block mask (null when unmasked).
    virtual void prepareTileOffsets(FILE* fp, long long dataOffset, long long dataLength,
                                    unsigned int* blockMask, int count) = 0;

public:
    virtual ~CNitfImageSource();
    virtual __int64 computeStorageLength();
    virtual bool validateParameters(FILE* fp);
    virtual void readStart(FILE* fp, long long dataOffset, long long dataLength);
    // Georeferencing into the host's record: see CNitfGeorefInfo::read (`precise`: take the most precise
    // corners present) and CNitfGeorefInfo::write.
    virtual void readProjection(FILE* fp, ProjInfo_t* info, bool precise);
    // One whole block, pixel-interleaved, `rowBytes` apart.
    virtual bool readTileInterleaved(CNitfFile* file, char* buffer, int rowBytes, int x, int y) = 0;
    // One band of one block, `rowBytes` apart.
    virtual bool readTileNonInterleaved(CNitfFile* file, char* buffer, int rowBytes, int x, int y,
                                        int band) = 0;
    virtual bool readBitmap(char* buffer, int x0, int y0, int width, int srcRows, int outWidthBits,
                            int outRows);
    virtual void readFinish();
    virtual void writeStart(FILE* fp, long long dataOffset, long long dataLength);
    virtual bool isWriteable();
    virtual void writeProjection(FILE* fp, ProjInfo_t* info);
    virtual bool writeTileNonInterleaved(CNitfFile* file, char* buffer, int x, int y, int band);
    virtual void writeFinish(FILE* fp);

    // The block readers callers use: the row size is the image's own.
    bool readTileInterleaved(CNitfFile* file, char* buffer, int x, int y);
    // Reads band `band` of block (x, y); a failed or throwing read zero-fills the block and returns false.
    bool readTileNonInterleaved(CNitfFile* file, char* buffer, int band, int x, int y);

    // Reads the block mask record at the stream's position; returns its length in bytes. Raises
    // vexo::Exception when the block offsets run past the end of the file or the record is absurdly long.
    int readBlockMask(FILE* fp);
    __int64 computeBlockMaskStorageLength() const;
    // The file offset of block entry `index` (0xFFFFFFFF: absent), or 0 before the table exists or for an
    // index outside it.
    unsigned long long getTileOffset(int index) const;
    bool hasPadPixel() const { return m_hasPadPixel; }
    __int64 getPadPixelValue() const { return m_padPixelValue; }
    void fillTileBlank(char* buffer, int rowStride);

    int getDisplayLevel();
    // Returns IDLVL as well, like getDisplayLevel: kept for callers that rely on it.
    int getAttachmentLevel();
    CNitfImagePropertiesIF::ePVType_t getPvtype();

    CNitfImageSubheader* getImageSubheader() { return m_subheader; }
    CNitfImagePropertiesIF& getImageProperties() { return m_properties; }
    int getLutCount() { return m_subheader->getLutCount(); }
    CNitfLutSource* getLutSource(int index) { return m_subheader->getLutSource(index); }
    // "NITF Image error" whatever the code; released with free().
    char* getErrorMessage(int code);

    int GetChanIndex() const { return m_channelIndex; }
    void SetChanIndex(int index) { m_channelIndex = index; }
    void SetChanType(int type) { m_channelType = type; }
    int getImageIndex() const { return m_imageIndex; }
    void setImageIndex(int index) { m_imageIndex = index; }

    // Interleaving conversions for byte-multiple sample sizes.
    static void deinterleaveBandToPixel(char* dst, int dstRowStride, char* src, int rows, int cols, int bands,
                                        int bitsPerPixel);
    static void deinterleavePixelToBand(char* dst, int dstRowStride, char* src, int rows, int cols, int bands,
                                        int bitsPerPixel, int band);
    static void deinterleaveRowToBand(char* dst, int dstRowStride, char* src, int rows, int cols, int bands,
                                      int bitsPerPixel, int band);

protected:
    // Number of entries in the block tables: blocks × bands for IMODE S, blocks for B, P, R, 0 otherwise.
    // Raises vexo::Exception when the count does not fit in an int.
    int blockEntryCount() const;
    // Refuses blocking geometry whose sizes the block readers cannot represent (see the definition).
    void checkGeometry() const;
    // Bytes the file holds from the image data offset on (0 when the offset lies past its end); set by
    // readStart.
    long long availableData() const { return m_availableData; }
    // Makes an empty tile offset table of blockEntryCount() entries (none for an unknown IMODE).
    void allocateTileOffsets();

    CNitfImagePropertiesIF m_properties;
    unsigned long long* m_tileOffsets;
    int m_tileOffsetCount;
    unsigned int* m_blockMask;
    int m_blockMaskCount;
    CNitfImageSubheader* m_subheader;
    char* m_workBuffer;
    int m_workBufferSize;
    int m_workBufferUsed;
    __int64 m_padPixelValue;
    bool m_hasPadPixel;
    long long m_dataOffset;
    long long m_dataLength;
    long long m_availableData;
    int m_channelType;
    int m_channelIndex;
    int m_imageIndex;
};
