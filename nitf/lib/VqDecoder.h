// The vector-quantisation codec of VQ image blocks: a block is a grid of codes, each code the index of a
// small kernel of pixels in a codebook, and decoding copies each code's kernel into place. Independent of
// files and block tables: it turns one block's index bytes into pixels in the caller's buffer.
#pragma once

#include <cstddef>
#include <vector>

class CVqDecoder {
public:
    // Index buffers handed to decode() carry this many readable bytes after the block's index bytes, so that
    // codes are unpacked whole; a block whose last code is cut short by the truncated index length reads the
    // missing bits from there.
    static const int kIndexPadding = 8;
    // Code bit lengths the codec accepts (a codebook of 2^bits kernels).
    static const int kLongestCode = 16;

    // A block of `codeRows` rows of `codesPerRow` codes of `codeBits` bits, each selecting a kernel of
    // `kernelWidth` x `kernelHeight` one-byte pixels. Raises vexo::Exception for sizes outside 1..65535
    // (kernels: 1..4096, bits: 1..16).
    CVqDecoder(int codesPerRow, int codeRows, int codeBits, int kernelWidth, int kernelHeight);

    int codesPerRow() const { return m_codesPerRow; }
    int codeRows() const { return m_codeRows; }
    int codeBits() const { return m_codeBits; }
    int kernelWidth() const { return m_kernelWidth; }
    int kernelHeight() const { return m_kernelHeight; }

    // The codebook's size as stored: kernel height tables of 2^bits records of kernel width bytes.
    size_t codebookBytes() const;
    // Index bytes of one block: codes x bits / 8, truncated.
    size_t indexBytes() const;

    // Takes the codebook as stored (codebookBytes() bytes): table r holds row r of every kernel, code after
    // code.
    void setCodebook(const unsigned char* tables);

    // Decodes one block: `indexes` holds indexBytes() bytes followed by kIndexPadding zeros; the pixels
    // (codeRows x kernel height lines of codesPerRow x kernel width bytes) go to `out`, lines `lineBytes`
    // apart.
    void decode(const unsigned char* indexes, unsigned char* out, ptrdiff_t lineBytes);

private:
    size_t kernelBytes() const { return static_cast<size_t>(m_kernelWidth) * m_kernelHeight; }
    void unpackCodes(const unsigned char* indexes);
    void copyKernels(unsigned char* out, ptrdiff_t lineBytes) const;
    void copyKernels4x4(unsigned char* out, ptrdiff_t lineBytes) const;

    int m_codesPerRow;
    int m_codeRows;
    int m_codeBits;
    int m_kernelWidth;
    int m_kernelHeight;
    // Kernel after kernel, each row after row: one code's pixels lie together.
    std::vector<unsigned char> m_kernels;
    // The codes of the block being decoded, row after row.
    std::vector<unsigned short> m_codes;
};
