#include "VqDecoder.h"

#include <cstdint>
#include <cstring>

#if defined(__SSE2__)
#include <emmintrin.h>
#endif

#include "BitStream.h"
#include "Raise.h"

static const char kSourceFile[] = "nitf/lib/VqDecoder";

CVqDecoder::CVqDecoder(int codesPerRow, int codeRows, int codeBits, int kernelWidth, int kernelHeight)
    : m_codesPerRow(codesPerRow), m_codeRows(codeRows), m_codeBits(codeBits), m_kernelWidth(kernelWidth),
      m_kernelHeight(kernelHeight) {
    if (codesPerRow <= 0 || codeRows <= 0 || kernelWidth <= 0 || kernelHeight <= 0 || codeBits <= 0 ||
        codeBits > kLongestCode)
        NITF_RAISE_FORMAT("__cdecl CVqDecoder::CVqDecoder(int,int,int,int,int)",
                          "Invalid VQ block layout (%d x %d codes of %d bits, %d x %d kernels)", codesPerRow,
                          codeRows, codeBits, kernelWidth, kernelHeight);
}

size_t CVqDecoder::codebookBytes() const {
    return kernelBytes() << m_codeBits;
}

size_t CVqDecoder::indexBytes() const {
    return static_cast<size_t>(m_codesPerRow) * m_codeRows * m_codeBits / 8;
}

void CVqDecoder::setCodebook(const unsigned char* tables) {
    // Stored row-table by row-table; kept kernel by kernel, so that copying a code's kernel touches one
    // cache line instead of one per table.
    const size_t codes = size_t(1) << m_codeBits;
    const size_t width = m_kernelWidth;
    m_kernels.resize(codebookBytes());
    for (size_t row = 0; row < static_cast<size_t>(m_kernelHeight); ++row) {
        const unsigned char* table = tables + row * codes * width;
        for (size_t code = 0; code < codes; ++code)
            std::memcpy(&m_kernels[code * kernelBytes() + row * width], table + code * width, width);
    }
}

void CVqDecoder::decode(const unsigned char* indexes, unsigned char* out, ptrdiff_t lineBytes) {
    unpackCodes(indexes);
    if (m_kernelWidth == 4 && m_kernelHeight == 4)
        copyKernels4x4(out, lineBytes);
    else
        copyKernels(out, lineBytes);
}

// Codes of 12 bits come two in three bytes, most significant bits first; other lengths go through the bit
// reader. The padding after the index bytes lets the last pair be read whole.
void CVqDecoder::unpackCodes(const unsigned char* indexes) {
    const size_t count = static_cast<size_t>(m_codesPerRow) * m_codeRows;
    m_codes.resize(count + 1);
    unsigned short* codes = m_codes.data();
    if (m_codeBits == 12) {
        const unsigned char* in = indexes;
        for (size_t i = 0; i < count; i += 2, in += 3) {
            codes[i] = static_cast<unsigned short>((in[0] << 4) | (in[1] >> 4));
            codes[i + 1] = static_cast<unsigned short>(((in[1] & 0x0F) << 8) | in[2]);
        }
        return;
    }
    // The bit reader only reads: it takes a writable pointer for its writing half.
    CBitStream bits(const_cast<unsigned char*>(indexes));
    for (size_t i = 0; i < count; ++i)
        codes[i] = static_cast<unsigned short>(bits.read16(m_codeBits));
}

void CVqDecoder::copyKernels(unsigned char* out, ptrdiff_t lineBytes) const {
    const unsigned short* code = m_codes.data();
    const size_t width = m_kernelWidth;
    for (int row = 0; row < m_codeRows; ++row) {
        unsigned char* band = out + static_cast<ptrdiff_t>(row) * m_kernelHeight * lineBytes;
        for (int column = 0; column < m_codesPerRow; ++column, ++code) {
            const unsigned char* kernel = &m_kernels[*code * kernelBytes()];
            unsigned char* at = band + column * width;
            for (int line = 0; line < m_kernelHeight; ++line, kernel += width, at += lineBytes)
                std::memcpy(at, kernel, width);
        }
    }
}

// The CADRG/CIB case: each kernel row is one 32-bit word. Four codes side by side make a 4 x 4 matrix of
// words (a kernel per vector, a kernel row per lane): transposed, each vector is 16 bytes of one line.
void CVqDecoder::copyKernels4x4(unsigned char* out, ptrdiff_t lineBytes) const {
    const unsigned short* code = m_codes.data();
    const unsigned char* kernels = m_kernels.data();
    for (int row = 0; row < m_codeRows; ++row) {
        unsigned char* line[4];
        line[0] = out + static_cast<ptrdiff_t>(row) * 4 * lineBytes;
        for (int i = 1; i < 4; ++i)
            line[i] = line[i - 1] + lineBytes;
        int column = 0;
#if defined(__SSE2__)
        for (; column + 4 <= m_codesPerRow; column += 4, code += 4) {
            const __m128i a =
                _mm_loadu_si128(reinterpret_cast<const __m128i*>(kernels + 16 * size_t(code[0])));
            const __m128i b =
                _mm_loadu_si128(reinterpret_cast<const __m128i*>(kernels + 16 * size_t(code[1])));
            const __m128i c =
                _mm_loadu_si128(reinterpret_cast<const __m128i*>(kernels + 16 * size_t(code[2])));
            const __m128i d =
                _mm_loadu_si128(reinterpret_cast<const __m128i*>(kernels + 16 * size_t(code[3])));
            const __m128i ab01 = _mm_unpacklo_epi32(a, b), cd01 = _mm_unpacklo_epi32(c, d);
            const __m128i ab23 = _mm_unpackhi_epi32(a, b), cd23 = _mm_unpackhi_epi32(c, d);
            _mm_storeu_si128(reinterpret_cast<__m128i*>(line[0] + 4 * column),
                             _mm_unpacklo_epi64(ab01, cd01));
            _mm_storeu_si128(reinterpret_cast<__m128i*>(line[1] + 4 * column),
                             _mm_unpackhi_epi64(ab01, cd01));
            _mm_storeu_si128(reinterpret_cast<__m128i*>(line[2] + 4 * column),
                             _mm_unpacklo_epi64(ab23, cd23));
            _mm_storeu_si128(reinterpret_cast<__m128i*>(line[3] + 4 * column),
                             _mm_unpackhi_epi64(ab23, cd23));
        }
#endif
        for (; column < m_codesPerRow; ++column, ++code) {
            const unsigned char* kernel = kernels + 16 * static_cast<size_t>(*code);
            for (int i = 0; i < 4; ++i)
                std::memcpy(line[i] + 4 * column, kernel + 4 * i, 4);
        }
    }
}
