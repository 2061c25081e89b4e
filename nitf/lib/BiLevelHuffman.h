// The coding of bi-level image blocks ("C1", "M1"): the facsimile (T.4) Modified Huffman one-dimensional code
// and, when lines carry tag bits, the Modified READ two-dimensional code. A block is a sequence of coded
// lines, each introduced by an EOL (and, two-dimensionally, a tag bit saying how the line is coded), ended by
// six EOLs (RTC) and padding to a whole byte.
//
// One decoder serves the blocks of one image: it decodes the coded bytes of one block into packed rows, most
// significant bit first, wherever the caller wants them: row r starts at bit firstBit + r x lineBits of the
// output, so rows can run on without padding (the block's bit stream), stand on whole bytes, or lie inside an
// image-wide bitmap. Only the bits of the block's rows are written.
//
// White runs are 0 bits and black runs 1 bits. That is how the conformance files' reference renderings come
// out (document pages have a background of 0), and it is the background a bi-level bitmap is delivered with.
//
// Damaged coding (a code word that does not exist, a run past the end of the line, a line without its EOL,
// data that end early) ends the block: what was decoded stays, the rest of the block is white, and the
// result says what went wrong. The work is linear in the coded bytes and the output; the only memory taken
// is two lines of changing positions, bounded by the coded bytes.
#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

class BiLevelHuffman {
public:
    enum eDamage_t {
        eDamageNone,
        eDamageBadCode,     // a bit pattern that is no code word
        eDamageRunPastLine, // runs or changing positions beyond the line's width
        eDamageShortLine,   // an EOL before the line's width is reached
        eDamageMissingEol,  // a line not introduced by an EOL
        eDamageTruncated,   // the data end before the block's last line does
    };

    struct Result {
        int rows = 0; // rows decoded whole
        eDamage_t damage = eDamageNone;
        int damagedRow = -1; // the row the damage was met in
        // The bytes of the block's coding, its RTC and padding included: where a following block begins. All
        // of the data when the block is damaged.
        size_t codedBytes = 0;
    };

    // Lines of `width` pixels; `twoDimensional` when every EOL is followed by a tag bit (COMRAT "2DS ",
    // "2DH "), whatever the tags then say.
    BiLevelHuffman(int width, bool twoDimensional);

    // Decodes `rows` lines from `size` coded bytes into `out` (row r at bit firstBit + r x lineBits). A null
    // `out` only walks the coding, to find where the block ends.
    Result decode(const unsigned char* data, size_t size, int rows, unsigned char* out, uint64_t firstBit,
                  uint64_t lineBits);

    int width() const { return m_width; }
    bool twoDimensional() const { return m_twoDimensional; }

    // A phrase for a damage kind, for warnings ("an invalid code word", ...).
    static const char* describe(eDamage_t damage);

    // The code words, bits in the order they are sent. Terminating codes are for runs 0 to 63 (by index),
    // make-up codes for 64 x (index + 1), up to 1728; the extended make-up codes (1792 + 64 x index, up to
    // 2560) serve both colours. The mode codes of two-dimensional lines: pass, horizontal, and vertical with
    // a1 - b1 from -3 to 3 (by index - 3).
    static const char* const kWhiteTerminating[64];
    static const char* const kBlackTerminating[64];
    static const char* const kWhiteMakeUp[27];
    static const char* const kBlackMakeUp[27];
    static const char* const kExtendedMakeUp[13];
    static const char* const kPass;
    static const char* const kHorizontal;
    static const char* const kVertical[7];
    static const char* const kEol;

private:
    class BitReader;
    struct Line {
        int* changes; // positions where the colour changes, white to black first, ascending, below the width
        int count;
        int end; // the pixels before it are decoded
    };

    static const int kEndMarkers = 3; // the width, after a line's changes, so b1 and b2 can always be read

    // The line decoding runs for every run of every line: inline, so calls stay inside the library.
    static inline eDamage_t invalidCode(const BitReader& in);
    inline bool startLine(BitReader& in, bool& oneDimensional, Result& result) const;
    inline bool decodeOneDimensional(BitReader& in, Line& line, Result& result) const;
    inline bool decodeTwoDimensional(BitReader& in, const Line& reference, Line& line, Result& result) const;
    inline int readRun(BitReader& in, bool black, int room, Result& result) const;
    inline bool pushChange(Line& line, int position, Result& result) const;
    inline void closeLine(Line& line) const;
    inline void finishLine(Line& line) const;
    inline void paint(const Line& line, unsigned char* out, uint64_t rowBit) const;
    size_t endOfCoding(BitReader& in, size_t size) const;

    int m_width;
    bool m_twoDimensional;
    const uint16_t* m_whiteCodes; // the code word look-up tables
    const uint16_t* m_blackCodes;
    const uint8_t* m_modeCodes;
    int m_capacity;           // changing positions a line can hold in the current block
    std::vector<int> m_lines; // two lines of changing positions, each with room for end markers
};
