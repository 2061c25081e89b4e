#include "BiLevelHuffman.h"

#include <algorithm>
#include <cstring>

#include "PackedBits.h"

namespace {

// Code-word look-up tables over the next 12 (white), 13 (black) or 7 (mode) bits, enough for the longest
// code word of each: every index that starts with a code word holds its value and length, every other index
// length 0. A run entry is value << 4 | length, a mode entry mode << 3 | length.
const int kWhiteBits = 12;
const int kBlackBits = 13;
const int kModeBits = 7;
// Mode values: pass, horizontal, and vertical a1 - b1 = -3 .. 3 as kVertical0 - 3 .. kVertical0 + 3.
const int kPassMode = 1;
const int kHorizontalMode = 2;
const int kVertical0 = 6;
// Eleven 0 bits in a row occur in no line's codes: they only begin an EOL (after any fill).
const int kEolZeros = 11;

struct CodeTables {
    uint16_t white[1 << kWhiteBits];
    uint16_t black[1 << kBlackBits];
    uint8_t mode[1 << kModeBits];
};

template <typename Entry>
void addCode(Entry* table, int indexBits, const char* code, int value, int valueShift) {
    const int length = static_cast<int>(std::strlen(code));
    uint32_t bits = 0;
    for (const char* c = code; *c; ++c)
        bits = bits << 1 | static_cast<uint32_t>(*c - '0');
    const uint32_t first = bits << (indexBits - length);
    const uint32_t count = 1u << (indexBits - length);
    for (uint32_t i = 0; i < count; ++i)
        table[first + i] = static_cast<Entry>(value << valueShift | length);
}

void addRunCodes(uint16_t* table, int indexBits, const char* const* terminating, const char* const* makeUp) {
    for (int run = 0; run < 64; ++run)
        addCode(table, indexBits, terminating[run], run, 4);
    for (int i = 0; i < 27; ++i)
        addCode(table, indexBits, makeUp[i], 64 * (i + 1), 4);
    for (int i = 0; i < 13; ++i)
        addCode(table, indexBits, BiLevelHuffman::kExtendedMakeUp[i], 1792 + 64 * i, 4);
}

const CodeTables& codeTables() {
    static CodeTables tables;
    static const bool built = [] {
        std::memset(&tables, 0, sizeof tables);
        addRunCodes(tables.white, kWhiteBits, BiLevelHuffman::kWhiteTerminating,
                    BiLevelHuffman::kWhiteMakeUp);
        addRunCodes(tables.black, kBlackBits, BiLevelHuffman::kBlackTerminating,
                    BiLevelHuffman::kBlackMakeUp);
        addCode(tables.mode, kModeBits, BiLevelHuffman::kPass, kPassMode, 3);
        addCode(tables.mode, kModeBits, BiLevelHuffman::kHorizontal, kHorizontalMode, 3);
        for (int i = 0; i < 7; ++i)
            addCode(tables.mode, kModeBits, BiLevelHuffman::kVertical[i], kVertical0 - 3 + i, 3);
        return true;
    }();
    (void)built;
    return tables;
}

uint64_t loadBigEndian64(const unsigned char* bytes) {
    uint64_t value;
    std::memcpy(&value, bytes, sizeof value);
    return __builtin_bswap64(value);
}

} // namespace

// ---- code words -------------------------------------------------------------------------------------------

const char* const BiLevelHuffman::kWhiteTerminating[64] = {
    "00110101", "000111",   "0111",     "1000",     "1011",     "1100",     "1110",     "1111",
    "10011",    "10100",    "00111",    "01000",    "001000",   "000011",   "110100",   "110101",
    "101010",   "101011",   "0100111",  "0001100",  "0001000",  "0010111",  "0000011",  "0000100",
    "0101000",  "0101011",  "0010011",  "0100100",  "0011000",  "00000010", "00000011", "00011010",
    "00011011", "00010010", "00010011", "00010100", "00010101", "00010110", "00010111", "00101000",
    "00101001", "00101010", "00101011", "00101100", "00101101", "00000100", "00000101", "00001010",
    "00001011", "01010010", "01010011", "01010100", "01010101", "00100100", "00100101", "01011000",
    "01011001", "01011010", "01011011", "01001010", "01001011", "00110010", "00110011", "00110100",
};
const char* const BiLevelHuffman::kBlackTerminating[64] = {
    "0000110111",   "010",          "11",           "10",           "011",          "0011",
    "0010",         "00011",        "000101",       "000100",       "0000100",      "0000101",
    "0000111",      "00000100",     "00000111",     "000011000",    "0000010111",   "0000011000",
    "0000001000",   "00001100111",  "00001101000",  "00001101100",  "00000110111",  "00000101000",
    "00000010111",  "00000011000",  "000011001010", "000011001011", "000011001100", "000011001101",
    "000001101000", "000001101001", "000001101010", "000001101011", "000011010010", "000011010011",
    "000011010100", "000011010101", "000011010110", "000011010111", "000001101100", "000001101101",
    "000011011010", "000011011011", "000001010100", "000001010101", "000001010110", "000001010111",
    "000001100100", "000001100101", "000001010010", "000001010011", "000000100100", "000000110111",
    "000000111000", "000000100111", "000000101000", "000001011000", "000001011001", "000000101011",
    "000000101100", "000001011010", "000001100110", "000001100111",
};
const char* const BiLevelHuffman::kWhiteMakeUp[27] = {
    "11011",     "10010",     "010111",    "0110111",   "00110110",  "00110111",  "01100100",
    "01100101",  "01101000",  "01100111",  "011001100", "011001101", "011010010", "011010011",
    "011010100", "011010101", "011010110", "011010111", "011011000", "011011001", "011011010",
    "011011011", "010011000", "010011001", "010011010", "011000",    "010011011",
};
const char* const BiLevelHuffman::kBlackMakeUp[27] = {
    "0000001111",    "000011001000",  "000011001001",  "000001011011",  "000000110011",  "000000110100",
    "000000110101",  "0000001101100", "0000001101101", "0000001001010", "0000001001011", "0000001001100",
    "0000001001101", "0000001110010", "0000001110011", "0000001110100", "0000001110101", "0000001110110",
    "0000001110111", "0000001010010", "0000001010011", "0000001010100", "0000001010101", "0000001011010",
    "0000001011011", "0000001100100", "0000001100101",
};
const char* const BiLevelHuffman::kExtendedMakeUp[13] = {
    "00000001000",  "00000001100",  "00000001101",  "000000010010", "000000010011",
    "000000010100", "000000010101", "000000010110", "000000010111", "000000011100",
    "000000011101", "000000011110", "000000011111",
};
const char* const BiLevelHuffman::kPass = "0001";
const char* const BiLevelHuffman::kHorizontal = "001";
const char* const BiLevelHuffman::kVertical[7] = {"0000010", "000010", "010",    "1",
                                                  "011",     "000011", "0000011"};
const char* const BiLevelHuffman::kEol = "000000000001";

// ---- reading bits -----------------------------------------------------------------------------------------

// The coded bits through a 64-bit window, next bit most significant. Bits past the end of the data read as
// 0, and the position tells how far past the end a reader has gone.
class BiLevelHuffman::BitReader {
public:
    BitReader(const unsigned char* data, size_t size) : m_data(data), m_size(size) { refill(); }

    // Tops the window up to at least 56 bits. Eight bytes are loaded at once where the data allow: the bits
    // below the counted ones are the data's next bits, so loading them again later changes nothing.
    void refill() {
        if (m_next + 8 <= m_size) {
            m_window |= loadBigEndian64(m_data + m_next) >> m_count;
            m_next += (63 - m_count) >> 3;
            m_count |= 56;
            return;
        }
        for (; m_count < 56; m_count += 8, ++m_next)
            m_window |= static_cast<uint64_t>(m_next < m_size ? m_data[m_next] : 0) << (56 - m_count);
    }
    void ensure(int bits) {
        if (m_count < bits)
            refill();
    }
    // The next `bits` bits (at most 56 after ensure).
    uint32_t peek(int bits) const { return static_cast<uint32_t>(m_window >> (64 - bits)); }
    void skip(int bits) {
        m_window <<= bits;
        m_count -= bits;
    }
    bool bit() {
        ensure(1);
        const bool value = (m_window >> 63) != 0;
        skip(1);
        return value;
    }
    // Passes over 0 bits up to the next 1 bit (left next) and returns how many there were; stops once past
    // the end of the data.
    uint64_t skipZeros() {
        uint64_t zeros = 0;
        for (;;) {
            refill();
            const int leading = m_window ? __builtin_clzll(m_window) : 64;
            if (leading < m_count) {
                skip(leading);
                return zeros + leading;
            }
            zeros += m_count;
            skip(m_count);
            if (pastEnd())
                return zeros;
        }
    }

    uint64_t position() const { return static_cast<uint64_t>(m_next) * 8 - m_count; }
    bool pastEnd() const { return position() > static_cast<uint64_t>(m_size) * 8; }
    uint64_t bitsLeft() const { return pastEnd() ? 0 : static_cast<uint64_t>(m_size) * 8 - position(); }

private:
    const unsigned char* m_data;
    size_t m_size;
    size_t m_next = 0; // the next byte to load
    uint64_t m_window = 0;
    int m_count = 0; // bits of the window that are counted as loaded
};

// ---- decoding ---------------------------------------------------------------------------------------------

BiLevelHuffman::BiLevelHuffman(int width, bool twoDimensional)
    : m_width(width), m_twoDimensional(twoDimensional), m_whiteCodes(codeTables().white),
      m_blackCodes(codeTables().black), m_modeCodes(codeTables().mode), m_capacity(0) {}

const char* BiLevelHuffman::describe(eDamage_t damage) {
    switch (damage) {
    case eDamageNone:
        return "no damage";
    case eDamageBadCode:
        return "an invalid code word";
    case eDamageRunPastLine:
        return "a run past the end of the line";
    case eDamageShortLine:
        return "a line that ends early";
    case eDamageMissingEol:
        return "a line without its EOL";
    case eDamageTruncated:
        return "coded data that end early";
    }
    return "unknown damage";
}

inline BiLevelHuffman::eDamage_t BiLevelHuffman::invalidCode(const BitReader& in) {
    // The longest code word is 13 bits: with fewer left, the data ended inside one.
    if (in.bitsLeft() < 13)
        return eDamageTruncated;
    return in.peek(kEolZeros) == 0 ? eDamageShortLine : eDamageBadCode;
}

BiLevelHuffman::Result BiLevelHuffman::decode(const unsigned char* data, size_t size, int rows,
                                              unsigned char* out, uint64_t firstBit, uint64_t lineBits) {
    Result result;
    if (m_width <= 0 || rows <= 0)
        return result;
    // A line changes colour at most once per pixel, and every change costs at least one coded bit.
    m_capacity =
        static_cast<int>(std::min<uint64_t>(static_cast<uint64_t>(m_width), 8 * uint64_t(size) + 16));
    const size_t stride = static_cast<size_t>(m_capacity) + kEndMarkers;
    m_lines.resize(2 * stride);
    Line reference{m_lines.data(), 0, 0}, line{m_lines.data() + stride, 0, 0};
    finishLine(reference); // a first line coded two-dimensionally refers to a white line

    BitReader in(data, size);
    for (int row = 0; row < rows; ++row) {
        line.count = line.end = 0;
        bool oneDimensional = true;
        bool decoded = startLine(in, oneDimensional, result) &&
                       (oneDimensional ? decodeOneDimensional(in, line, result)
                                       : decodeTwoDimensional(in, reference, line, result));
        if (!decoded || in.pastEnd()) {
            // Codes completed by bits past the end are made up: the data were cut.
            if (in.pastEnd())
                result.damage = eDamageTruncated;
            decoded = false;
            closeLine(line);
        }
        finishLine(line);
        if (out)
            paint(line, out, firstBit + row * lineBits);
        if (!decoded) {
            // The damaged line keeps what was decoded of it; the rows after it are white.
            result.damagedRow = row;
            result.codedBytes = size;
            for (int rest = row + 1; out && rest < rows; ++rest)
                packedbits::setBits(out, firstBit + rest * lineBits, static_cast<uint64_t>(m_width), false);
            return result;
        }
        std::swap(reference, line);
        result.rows = row + 1;
    }
    result.codedBytes = endOfCoding(in, size);
    return result;
}

// Reads the EOL (after any fill) that introduces a line, and its tag bit; EOLs that follow at once (a
// repeated EOL, a spare one between blocks) are passed over.
inline bool BiLevelHuffman::startLine(BitReader& in, bool& oneDimensional, Result& result) const {
    for (;;) {
        const uint64_t zeros = in.skipZeros();
        if (in.pastEnd()) {
            result.damage = eDamageTruncated;
            return false;
        }
        if (zeros < kEolZeros) {
            result.damage = eDamageMissingEol;
            return false;
        }
        in.skip(1);
        oneDimensional = !m_twoDimensional || in.bit();
        in.ensure(kEolZeros);
        if (in.peek(kEolZeros) != 0)
            return true;
    }
}

// One run: make-up codes, then one terminating code. -1 when the run is damaged or longer than `room`.
inline int BiLevelHuffman::readRun(BitReader& in, bool black, int room, Result& result) const {
    const uint16_t* table = black ? m_blackCodes : m_whiteCodes;
    const int indexBits = black ? kBlackBits : kWhiteBits;
    int run = 0;
    for (;;) {
        in.ensure(kBlackBits);
        const uint16_t entry = table[in.peek(indexBits)];
        const int length = entry & 15;
        if (length == 0) {
            result.damage = invalidCode(in);
            return -1;
        }
        in.skip(length);
        const int value = entry >> 4;
        run += value;
        if (run > room) {
            result.damage = eDamageRunPastLine;
            return -1;
        }
        if (value < 64)
            return run;
    }
}

// Records a colour change at `position` (below the width, not before the last change). A change at the
// position of the last one undoes it: the run between them is empty.
inline bool BiLevelHuffman::pushChange(Line& line, int position, Result& result) const {
    if (line.count > 0 && line.changes[line.count - 1] == position) {
        --line.count;
        return true;
    }
    if (line.count == m_capacity) {
        result.damage = eDamageBadCode;
        return false;
    }
    line.changes[line.count++] = position;
    return true;
}

// Runs of alternating colour, white first, that add up to the width.
inline bool BiLevelHuffman::decodeOneDimensional(BitReader& in, Line& line, Result& result) const {
    bool black = false;
    for (int position = 0; position < m_width; black = !black) {
        const int run = readRun(in, black, m_width - position, result);
        if (run < 0)
            return false;
        position += run;
        if (position < m_width && !pushChange(line, position, result))
            return false;
        line.end = position;
    }
    return true;
}

// Changes coded against the reference line. a0 is the position reached (-1 before the line's first pixel),
// `black` its colour; b indexes b1, the reference's first change after a0 to the other colour: changes at
// even indexes turn black, so b's parity follows a0's colour.
inline bool BiLevelHuffman::decodeTwoDimensional(BitReader& in, const Line& reference, Line& line,
                                                 Result& result) const {
    const int* changes = reference.changes;
    int a0 = -1;
    bool black = false;
    int b = 0;
    while (a0 < m_width) {
        // The end markers (the width, three times) stop this and make b2 readable.
        while (changes[b] <= a0)
            b += 2;
        const int b1 = changes[b], b2 = changes[b + 1];
        in.ensure(kModeBits);
        const uint8_t entry = m_modeCodes[in.peek(kModeBits)];
        const int length = entry & 7;
        if (length == 0) {
            result.damage = invalidCode(in);
            return false;
        }
        in.skip(length);
        const int mode = entry >> 3;
        if (mode == kPassMode) {
            a0 = line.end = b2;
            b += 2;
            continue;
        }
        const int start = std::max(a0, 0);
        if (mode == kHorizontalMode) {
            const int first = readRun(in, black, m_width - start, result);
            const int second = first < 0 ? -1 : readRun(in, !black, m_width - start - first, result);
            if (second < 0)
                return false;
            a0 = start + first;
            if (a0 < m_width && !pushChange(line, a0, result))
                return false;
            a0 += second;
            if (a0 < m_width && !pushChange(line, a0, result))
                return false;
            line.end = a0;
            continue;
        }
        const int a1 = b1 + mode - kVertical0;
        if (a1 > m_width || a1 < start) {
            result.damage = a1 > m_width ? eDamageRunPastLine : eDamageBadCode;
            return false;
        }
        if (a1 < m_width && !pushChange(line, a1, result))
            return false;
        a0 = line.end = a1;
        black = !black;
        // b1 must now be of the other colour: the candidate before the current one may lie after a1.
        b = b > 0 ? b - 1 : 1;
    }
    return true;
}

// A damaged line keeps the runs decoded whole: a run whose end was not decoded is left white.
inline void BiLevelHuffman::closeLine(Line& line) const {
    if (line.count % 2 != 0 && line.end < m_width) {
        Result ignored;
        pushChange(line, line.end, ignored);
    }
}

inline void BiLevelHuffman::finishLine(Line& line) const {
    for (int i = 0; i < kEndMarkers; ++i)
        line.changes[line.count + i] = m_width;
}

// Clears the row, then sets its black runs (from each even-indexed change to the next change).
inline void BiLevelHuffman::paint(const Line& line, unsigned char* out, uint64_t rowBit) const {
    packedbits::setBits(out, rowBit, static_cast<uint64_t>(m_width), false);
    for (int i = 0; i < line.count; i += 2)
        packedbits::setBits(out, rowBit + line.changes[i],
                            static_cast<uint64_t>(line.changes[i + 1] - line.changes[i]), true);
}

// Passes over the RTC (six EOLs, each with its tag bit in two-dimensional coding) and the padding to a
// whole byte. Some files carry a seventh EOL. A following block starts on a whole byte, perhaps with fill:
// an EOL beyond the sixth is taken only when it cannot be that block's first, that is when fewer than eleven
// of its 0 bits lie beyond the next whole byte.
size_t BiLevelHuffman::endOfCoding(BitReader& in, size_t size) const {
    for (int eols = 0;; ++eols) {
        BitReader probe = in;
        const uint64_t start = probe.position();
        const uint64_t zeros = probe.skipZeros();
        if (zeros < kEolZeros || probe.pastEnd())
            break;
        if (eols >= 6 && probe.position() - (start + 7) / 8 * 8 >= kEolZeros)
            break;
        probe.skip(1);
        if (m_twoDimensional)
            probe.bit();
        in = probe;
    }
    return static_cast<size_t>(std::min<uint64_t>(size, (in.position() + 7) / 8));
}
