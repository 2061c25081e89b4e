// Typed samples of any window of an image, from any image source: the one place where the delivered block
// forms of the codecs (see NitfImageSource.h) become plain numbers.
//
// A read takes a window (x, y, width, height) of the image's NCOLS x NROWS pixels and a list of bands, and
// fills the caller's buffer with one sample type for the whole image:
//
//   PVTYPE            NBPP         samples
//   INT, B            1            uint8 holding 0 or 1 (as stored: no pad-pixel inversion)
//   INT, B            4 .. 64      uint8, uint16, uint32 or uint64: the smallest that holds NBPP bits
//   SI                8 .. 64      int8 .. int64 the same way, sign-extended from NBPP bits
//   R                 32, 64       float32, float64
//   C                 64           complex float32: real then imaginary part
//
// Samples are in native byte order (or big-endian, the order of the canonical raw form, when asked); they
// are not scaled, not shifted for ABPP and not mapped through look-up tables. Band-sequential output holds
// one plane of height rows of width samples per band, in the order the bands were asked for;
// pixel-interleaved output holds rows of width pixels of all the bands asked for.
//
// Each block under the window is decoded at most once per read, and decoded straight into the caller's buffer
// where its samples need no conversion. Blocks recorded as absent read as zeros; blocks that cannot be
// decoded read as zeros and are counted, with the first error's text. Like an image source, a region reader
// is used by one thread at a time; readers on sources of separate file readers may run on separate threads.
#pragma once

#include <cstddef>
#include <string>
#include <vector>

class CNitfFile;
class CNitfImageSource;

class CNitfRegionReader {
public:
    enum eSampleType_t {
        eUInt8,
        eInt8,
        eUInt16,
        eInt16,
        eUInt32,
        eInt32,
        eUInt64,
        eInt64,
        eFloat32,
        eFloat64,
        eComplexFloat32,
        eComplexFloat64,
    };
    enum eLayout_t { eBandSequential, ePixelInterleaved };

    // What a read met besides samples.
    struct Result {
        int absentBlocks = 0; // recorded as absent: zeros
        int failedBlocks = 0; // could not be decoded, or not wholly in the file: zeros where data are missing
        std::string firstError;
    };

    // Neither the file nor the source is owned; the source must have been started for reading (the file
    // reader hands sources out so).
    CNitfRegionReader(CNitfFile* file, CNitfImageSource* source);

    int getWidth() const { return m_width; }
    int getHeight() const { return m_height; }
    int getBandCount() const { return m_bands; }
    eSampleType_t getSampleType() const { return m_type; }
    // Bytes of one sample (both parts of a complex one).
    int getSampleBytes() const { return m_sampleBytes; }
    static const char* getSampleTypeName(eSampleType_t type);

    // Delivers samples big-endian instead of in native order.
    void setBigEndian(bool bigEndian) { m_bigEndianOut = bigEndian; }

    // Reads resolution level `level` from now on (0: the image; N: reduced N times by two, for sources that
    // hold such levels, see CNitfImageSource::getResolutionLevels); windows, getWidth and getHeight are at
    // that level. Raises vexo::Exception for a level the source does not have.
    void setLevel(int level);
    int getLevel() const { return m_level; }
    int getResolutionLevels() const;

    // How many rows, at most, to read at a time for windows `width` pixels wide of `bands` bands so that a
    // read needs no more than about `budget` bytes: a whole block row, unless that is larger and the source
    // can read parts of blocks without decoding them whole. Always at least one row; callers start their
    // windows on block rows.
    int getRowsPerRead(int width, int bands, size_t budget) const;
    // The widest window, in whole blocks, whose block row of `bands` bands fits about `budget` bytes.
    int getColumnsPerRead(int bands, size_t budget) const;

    // Bytes a read of `width` x `height` pixels of `bands` bands needs.
    size_t getBufferSize(int width, int height, int bands) const;

    // Reads the window into `out` (getBufferSize bytes). An empty band list means every band. Raises
    // vexo::Exception for a window outside the image or a band it does not have.
    Result read(int x, int y, int width, int height, const std::vector<int>& bands, void* out,
                eLayout_t layout = eBandSequential);

private:
    // Where the samples of one block band go: the part of the block, and the output's first sample and
    // strides in bytes.
    struct Target {
        int column, row, width, height; // within the block
        unsigned char* out;
        size_t pixelStride, rowStride;
    };

    // A window at a reduced level, through the source's own region read.
    void readReduced(int x, int y, int width, int height, const std::vector<int>& bands, unsigned char* out,
                     eLayout_t layout, Result& result);
    void readBlockBand(int blockX, int blockY, int band, const Target& target, bool wholeBlock,
                       Result& result);
    // Reads only the target's rows of a block, when the source can; false otherwise.
    bool readRows(int blockX, int blockY, int band, const Target& target);
    void convert(const unsigned char* block, const Target& target) const;
    // Counts a block whose read met data the file does not hold (the source's count grew since `before`).
    void countIncomplete(long long before, int blockX, int blockY, int band, Result& result) const;
    void convertPacked(const unsigned char* block, const Target& target) const;
    void convertWhole(const unsigned char* block, const Target& target) const;
    void swapInPlace(const Target& target) const;
    // Whether whole samples in the blocks are in another byte order than the output wants.
    bool needsSwap() const;
    static void zero(const Target& target, size_t sampleBytes);
    // Absent blocks read as the image's pad pixel (as zeros when it has none).
    void fillAbsent(const Target& target) const;
    std::vector<unsigned char> padSample() const;

    CNitfFile* m_file;
    CNitfImageSource* m_source;
    int m_width, m_height, m_bands, m_bits;
    int m_blockWidth, m_blockHeight;
    eSampleType_t m_type;
    int m_sampleBytes;  // bytes of an output sample
    int m_elementBytes; // bytes swapped as one number (half a complex sample)
    bool m_signed;
    bool m_packed;        // the blocks hold a bit stream
    bool m_bigEndianIn;   // whole samples in the blocks are big-endian
    int m_deliveredBytes; // bytes of a whole sample in the blocks
    bool m_bigEndianOut = false;
    int m_level = 0;
    int m_blockRowBytes;
    std::vector<unsigned char> m_block;
};
