// The base of every image data source: one object per image segment that hands out (or takes) the image's
// pixels block by block. It owns the blocking geometry, the block mask and pad pixel of masked images, the
// table of block offsets, the interleaving conversions and the bridge to the host projection record, and the
// block mechanics every codec shares: which block entry holds a band, the one-block decode cache from which
// the bands of a block are handed out, and the assembly of separately decoded bands into interleaved blocks.
// A codec subclass locates its blocks (prepareTileOffsets) and decodes one block entry (decodeBlock).
//
// Samples in block buffers. Whatever the compression, a buffer holds tile-height rows `rowBytes` apart, of
// one band (readTileNonInterleaved) or of every band pixel-interleaved (readTileInterleaved), with these
// samples:
//
//   source (IC)                  NBPP 8, 16, 32, 64            other NBPP (1, 4, 11, 12, ...)
//   uncompressed (NC, NM)        as stored: big-endian         as stored: one bit stream, most significant
//   bi-level (C1, M1)            -                             bit first, rows running on without padding
//   JPEG (C3, M3, C5, M5, I1)    whole samples in native byte order, in the smallest of 1, 2, 4 or 8
//   VQ (C4, M4)                  bytes that holds NBPP bits (12-bit JPEG: two bytes), unsigned values
//   JPEG 2000 (C8, M8)           zero-extended, PVTYPE SI values sign-extended
//
// CNitfImagePropertiesIF::deliversWholeSamples() tells the two columns apart and getSampleContainerBytes()
// gives the container; getTileBandReadBufferSize() and getTileReadBufferSize() size the buffers. Row-
// interleaved (IMODE R) bands come out of readTileNonInterleaved as packed rows whatever `rowBytes` says, and
// readTileInterleaved of an IMODE R block gives the block as stored (row-interleaved): both kept for callers
// that rely on them. For typed samples of any window, use CNitfRegionReader.
//
// Threads: a source is used by one thread at a time. Sources of one file on different readers (each with its
// own stream) may be used on different threads at once.
#pragma once

#include <cstdio>
#include <set>
#include <string>
#include <vector>

#include "HostProjection.h"
#include "NitfImagePropertiesIF.h"
#include "NitfImageSubheader.h"

class CNitfFile;
class CNitfRegionReader;

class CNitfImageSource {
public:
    // The block offset that marks a block absent from the file (block mask entry 0xFFFFFFFF).
    static constexpr unsigned long long kAbsentBlock = 0xFFFFFFFFULL;

    // What one decoded block entry holds (an entry is one band of a block for IMODE S, the whole block
    // otherwise).
    enum eBlockLayout_t {
        eBlockBands,  // band after band, each of which decodes on its own (IMODE S, uncompressed "B")
        eBlockPlanes, // band after band, decoded together
        eBlockPixels, // pixel-interleaved
        eBlockRows,   // row-interleaved: a row of each band in turn
    };

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
    // One whole block, pixel-interleaved, `rowBytes` apart; false when the block is absent or cannot be read.
    virtual bool readTileInterleaved(CNitfFile* file, char* buffer, int rowBytes, int x, int y);
    // One band of one block, `rowBytes` apart; false when the block is absent or cannot be read.
    virtual bool readTileNonInterleaved(CNitfFile* file, char* buffer, int rowBytes, int x, int y, int band);
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

    // Whether (x, y) is a block of the image and `band` one of its bands.
    bool isValidBlock(int x, int y, int band) const;
    // Whether the file records block (x, y) (band `band` for IMODE S) as absent: a masked image's block mask
    // entry 0xFFFFFFFF, or an image whose blocks could not be located. Such blocks read as zeros.
    bool isBlockAbsent(int x, int y, int band) const;
    // Resolution levels the source can read straight from its data: level 0 is the image, level N the image
    // reduced N times by two (JPEG 2000 codestreams have them; other sources only level 0).
    virtual int getResolutionLevels() const;
    // The image's size at `level`.
    virtual int getLevelWidth(int level) const;
    virtual int getLevelHeight(int level) const;
    // Bands [firstBand, firstBand + bands) of the area x, y, width, height at `level` (coordinates at that
    // level), pixel-interleaved, rows `rowBytes` apart, whole samples as block reads deliver them. Raises
    // vexo::Exception for a level the source does not have, an area outside the image or damaged data.
    virtual void readRegion(CNitfFile* file, int level, int x, int y, int width, int height, int firstBand,
                            int bands, char* buffer, int rowBytes);

    // How many block entries have been decoded (read from the file) so far.
    long long getDecodeCount() const { return m_decodeCount; }
    // How many block reads met data the file does not hold (cut short, or a block that should be there and is
    // not); such blocks read as zeros where their data is missing.
    long long getIncompleteBlockCount() const { return m_incompleteBlocks; }

    int getDisplayLevel();
    // Returns IDLVL as well, like getDisplayLevel: kept for callers that rely on it.
    int getAttachmentLevel();
    CNitfImagePropertiesIF::ePVType_t getPvtype();

    CNitfImageSubheader* getImageSubheader() { return m_subheader; }
    CNitfImagePropertiesIF& getImageProperties() { return m_properties; }
    const CNitfImagePropertiesIF& getImageProperties() const { return m_properties; }
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
    // ---- what a codec supplies
    // -----------------------------------------------------------------------------

    // What a decoded block entry holds. The default follows IMODE: bands for "S", "B" and single-band images,
    // pixels for "P", rows for "R".
    virtual eBlockLayout_t getBlockLayout() const;
    // Decodes block entry `entry` of the tile offset table into `buffer`, rows `rowBytes` apart. For the
    // eBlockBands layout `band` is the band of the entry to decode (always 0 for IMODE S); for the others it
    // is -1 and every band of the entry is decoded, in the layout's order. `interleaved` is true when the
    // result is handed out as a whole interleaved block rather than as one band. Returns false when the block
    // is absent; raises vexo::Exception when it cannot be decoded. `rowBytes` is at least the row size of the
    // layout (planes lie tile height x `rowBytes`, or getTileBandBufferSize() for packed depths, apart).
    virtual bool decodeBlock(FILE* fp, int entry, int band, unsigned char* buffer, int rowBytes,
                             bool interleaved) = 0;
    // Reads rows [firstRow, firstRow + rows) of band `band` of block entry `entry` (the eBlockBands layout)
    // into `buffer`, rows `rowBytes` apart, without decoding the rest of the block; false when the source
    // cannot, and the whole block is decoded instead. Sources whose blocks are stored as they are offer it,
    // so that windows of huge blocks cost only what they read.
    virtual bool decodeBlockRows(FILE* fp, int entry, int band, int firstRow, int rows, unsigned char* buffer,
                                 int rowBytes);
    // Whether decodeBlockRows reads parts of blocks of this image.
    virtual bool canDecodeBlockRows() const;
    // Called on every band handed out by readTileNonInterleaved, after decoding (and band extraction): the
    // place for amplitude mappings that apply to bands only.
    virtual void finishBand(CNitfFile* file, unsigned char* buffer, int rowBytes);

    // ---- shared mechanics for codecs
    // -----------------------------------------------------------------------

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
    // The first step of every prepareTileOffsets: true when nothing is left to locate, because there is no
    // table (an unknown IMODE) or because the block mask gave every entry (entry i is mask entry i plus
    // `start`; an absent entry, 0xFFFFFFFF or beyond the mask's `count` entries, stays absent).
    bool tileOffsetsFromMask(unsigned long long start, const unsigned int* blockMask, int count);
    // The entry of the tile offset table that holds band `band` of block (x, y), and the band's place in it.
    int blockEntry(int x, int y, int band) const;
    int bandInEntry(int band) const;
    // The offset of the entry, or kAbsentBlock for an index outside the table.
    unsigned long long entryOffset(int entry) const;
    // Bytes of one band row in a block buffer, and of one band plane of a decoded block.
    int bandRowBytes() const { return m_properties.getTileBandWidthBufferSize(); }
    long long bandPlaneBytes() const { return m_properties.getTileBandReadBufferSize(); }
    // Whether samples are a packed bit stream rather than whole bytes.
    bool isPacked() const;
    // Forgets the cached block (for instance after the stream changed).
    void dropCachedBlock() { m_cachedX = m_cachedY = -1; }
    // Block entry `entry` should be in the file and is not: it is not absent by the block mask, it is damage.
    // Reading it raises vexo::Exception.
    void markMissing(int entry);
    // A block read met data the file does not hold.
    void noteIncompleteBlock() { ++m_incompleteBlocks; }
    // Warns through vexo::nspio::Warning::Warn, naming the image, once per source for each `cause`.
    void warnOnce(const char* cause, const std::string& message);

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

private:
    friend class CNitfRegionReader;

    // One band of block (x, y) into `buffer`, rows `rowBytes` apart (row-interleaved bands packed when
    // `packRows` is set). False when the block is absent.
    bool readBand(CNitfFile* file, unsigned char* buffer, int rowBytes, int x, int y, int band,
                  bool packRows);
    // Makes the cache hold block (x, y) decoded whole; false when the block is absent.
    bool loadCachedBlock(FILE* fp, int x, int y);
    // Band `band` of the cached block into `buffer`.
    void extractCachedBand(unsigned char* buffer, int rowBytes, int band, bool packRows) const;
    // Interleaves band planes (planeBytes apart, rows of bandRowBytes()) into pixel-interleaved rows.
    void interleavePlanes(const unsigned char* planes, unsigned char* buffer, int rowBytes) const;
    void checkRowBytes(int rowBytes, int wanted, const char* signature) const;
    bool decodeCounted(FILE* fp, int entry, int band, unsigned char* buffer, int rowBytes, bool interleaved);
    // Rows of one band of a block read without decoding the rest, when the source can; see decodeBlockRows.
    bool readBandRows(CNitfFile* file, unsigned char* buffer, int rowBytes, int x, int y, int band,
                      int firstRow, int rows);

    std::vector<unsigned char> m_cachedBlock; // one whole decoded block, for handing out its bands
    int m_cachedX;
    int m_cachedY;
    std::vector<unsigned char> m_planes; // scratch for assembling interleaved blocks from their bands
    long long m_decodeCount;
    long long m_incompleteBlocks = 0;
    std::vector<bool> m_missing; // entries that should be in the file and are not (empty: none)
    std::set<std::string> m_warned;
};
