#include "NitfImageSourceVQ.h"

#include <climits>
#include <cmath>
#include <cstring>

#include "DataStreamRead.h"
#include "HostFile.h"
#include "NitfFile.h"
#include "NitfLutSource.h"
#include "Raise.h"
#include "VqDecoder.h"

static const char kSourceFile[] = "nitf/lib/NitfImageSourceVQ";

namespace {

const char kReadStartSignature[] =
    "void __cdecl CNitfImageSourceVQ::readStart(" NITF_FILE_SIG ",__int64,__int64)";

// Image data without the image display parameters begin with the compression section; the only grid such
// data can have is the CADRG one.
const unsigned kDefaultCodeGrid = 64;
const int kDefaultCodeBits = 12;
// Each compression lookup offset record: table id, record count, values per record, value bits, offset.
const int kLookupOffsetRecordLength = 2 + 4 + 2 + 2 + 4;

} // namespace

CNitfImageSourceVQ::CNitfImageSourceVQ(CNitfImageSubheader* subheader, char* fileName, const char* option)
    : CNitfImageSource(subheader, fileName), m_option(option ? option : ""),
      m_codeBitLength(kDefaultCodeBits), m_kernelWidth(0), m_kernelHeight(0), m_codesPerRow(0), m_codeRows(0),
      m_indexBytesPerBlock(0) {}

CNitfImageSourceVQ::~CNitfImageSourceVQ() = default;

// ---- lengths of the written form --------------------------------------------------------------------------

__int64 CNitfImageSourceVQ::computeVqIndexesPerTileLength() {
    const __int64 codes =
        static_cast<__int64>(m_properties.getTileWidth()) * m_properties.getTileHeight() / 4 / 4;
    return static_cast<__int64>(std::ceil(static_cast<double>(codes * 12) * 0.125));
}

__int64 CNitfImageSourceVQ::computeVqIndexesLength() {
    // Every band of every block has its own indexes.
    const __int64 blocks = static_cast<__int64>(m_properties.getTileCount()) * m_properties.getBandCount();
    return blocks * computeVqIndexesPerTileLength();
}

__int64 CNitfImageSourceVQ::computeStorageLength() {
    return computeVqIndexesLength() + computeVqHeaderLength() + computeVqCodebookLength();
}

// ---- starting ---------------------------------------------------------------------------------------------

// Checks made before anything is allocated (each raises vexo::Exception):
// - an IMODE other than S, B, P, R, or P and R with more than one band (the kernels hold one band's pixels);
// - block sizes and counts beyond the interface's ints (checkGeometry);
// - a code grid that does not fit the block, or codes of 0 or more than 16 bits;
// - a codebook or one block's indexes larger than what the file holds from there.
// Block offsets that point past the end of the file are not errors: those blocks read as zero codes.
void CNitfImageSourceVQ::readStart(FILE* fp, long long dataOffset, long long dataLength) {
    const CNitfImagePropertiesIF::eInterleavingType_t mode = m_properties.getInterleavingType();
    if (mode == CNitfImagePropertiesIF::eInterleavingUnknown) {
        CNitfProperty* field = m_subheader ? FindProperty(m_subheader->getProperties(), "IMODE") : nullptr;
        NITF_RAISE_FORMAT(kReadStartSignature, "Unknown interleaving mode (ISH.IMODE == '%s')",
                          field ? nitf_detail::printable(field->toText()).c_str() : "");
    }
    if ((mode == CNitfImagePropertiesIF::eBandInterleavedByPixel ||
         mode == CNitfImagePropertiesIF::eBandInterleavedByRow) &&
        m_properties.getBandCount() > 1)
        NITF_RAISE_FORMAT(kReadStartSignature,
                          "VQ images interleaved by pixel or by row must have one band (ISH.NBANDS == %d)",
                          m_properties.getBandCount());
    checkGeometry();
    CNitfImageSource::readStart(fp, dataOffset, dataLength);
    DKFSeek64(fp, dataOffset, SEEK_SET);
    readHeader(fp);
    readCodebook(fp);

    CDataStream::requireReadable(fp, m_indexBytesPerBlock, "The indexes of a VQ block");
    m_indexes.assign(static_cast<size_t>(m_indexBytesPerBlock) + CVqDecoder::kIndexPadding, 0);
    prepareTileOffsets(fp, DKFTell(fp), dataLength, m_blockMask, m_blockMaskCount);
    takeNoDataFromColours();
}

// Frames whose mask gives no pad pixel code leave the first code past their colours unused (216 of CADRG and
// CIB's 256): that code stands for no data, and absent subframes read as it.
void CNitfImageSourceVQ::takeNoDataFromColours() {
    m_padFromColours = false;
    if (m_hasPadPixel || getLutCount() == 0 || !getLutSource(0))
        return;
    const int colours = getLutSource(0)->getEntryCount();
    if (colours <= 0 || colours >= 256)
        return;
    m_hasPadPixel = true;
    m_padPixelValue = colours;
    m_padFromColours = true;
}

void CNitfImageSourceVQ::readHeader(FILE* fp) {
    const __int64 start = DKFTell(fp);
    CDataStreamRead in(fp);
    unsigned codeRows = in.readUint32();
    unsigned codesPerRow = in.readUint32();
    int codeBits = in.readByte();
    const unsigned algorithm = in.readUint16();
    if (((codeRows != kDefaultCodeGrid && codesPerRow != kDefaultCodeGrid) || codesPerRow == 0) &&
        algorithm != 1) {
        // No image display parameters: the data begin with the algorithm identifier.
        DKFSeek64(fp, start, SEEK_SET);
        codeBits = kDefaultCodeBits;
        in.readUint16(); // the algorithm identifier
        codeRows = codesPerRow = kDefaultCodeGrid;
    }
    const int width = m_properties.getTileWidth();
    const int height = m_properties.getTileHeight();
    m_kernelWidth = codesPerRow != 0 && codesPerRow <= static_cast<unsigned>(width) ? width / codesPerRow : 0;
    m_kernelHeight = codeRows != 0 && codeRows <= static_cast<unsigned>(height) ? height / codeRows : 0;
    if (m_kernelWidth == 0 || m_kernelHeight == 0 || codeBits <= 0 || codeBits > CVqDecoder::kLongestCode)
        NITF_RAISE_FORMAT(
            kReadStartSignature,
            "The VQ header describes no usable code grid (%u x %u codes of %d bits in blocks of "
            "%d x %d pixels)",
            codesPerRow, codeRows, codeBits, width, height);
    m_codesPerRow = static_cast<int>(codesPerRow);
    m_codeRows = static_cast<int>(codeRows);
    m_codeBitLength = codeBits;
    m_decoder = std::make_unique<CVqDecoder>(m_codesPerRow, m_codeRows, m_codeBitLength, m_kernelWidth,
                                             m_kernelHeight);
    const size_t indexBytes = m_decoder->indexBytes();
    if (indexBytes > static_cast<size_t>(INT_MAX))
        NITF_RAISE_FORMAT(kReadStartSignature, "VQ blocks of %zu index bytes are too large", indexBytes);
    m_indexBytesPerBlock = static_cast<int>(indexBytes);

    // The lookup offset records are passed over: their table offsets are not followed, and the codebook is
    // read from where they end.
    const unsigned lookupRecords = in.readUint16();
    in.readUint16(); // compression parameter offset records
    const __int64 tableBase = DKFTell(fp);
    const unsigned tableOffset = in.readUint32();
    in.readUint16(); // lookup offset record length
    DKFSeek64(fp, tableBase + tableOffset, SEEK_SET);
    in.skip(static_cast<__int64>(lookupRecords) * kLookupOffsetRecordLength);
}

void CNitfImageSourceVQ::readCodebook(FILE* fp) {
    const size_t size = m_decoder->codebookBytes();
    // The codebook must be in the file: that bounds it, whatever the header claims.
    CDataStream::requireReadable(fp, static_cast<__int64>(size), "The VQ codebook");
    std::vector<unsigned char> tables(size);
    CDataStream::readZeroFilled(fp, tables.data(), size);
    m_decoder->setCodebook(tables.data());
}

void CNitfImageSourceVQ::prepareTileOffsets(FILE*, long long blocksStart, long long, unsigned int* blockMask,
                                            int count) {
    const unsigned long long start = static_cast<unsigned long long>(blocksStart);
    if (tileOffsetsFromMask(start, blockMask, count))
        return;
    const int entries = m_tileOffsetCount;
    // Stored one after the other: each band-block for IMODE S, each block with all its bands for IMODE B.
    unsigned long long entryBytes = static_cast<unsigned long long>(m_indexBytesPerBlock);
    if (m_properties.getInterleavingType() == CNitfImagePropertiesIF::eBandInterleavedByBlock)
        entryBytes *= static_cast<unsigned long long>(m_properties.getBandCount());
    for (int i = 0; i < entries; ++i)
        m_tileOffsets[i] = start + static_cast<unsigned long long>(i) * entryBytes;
}

// ---- reading blocks ---------------------------------------------------------------------------------------

bool CNitfImageSourceVQ::decodeBlock(FILE* fp, int entry, int band, unsigned char* out, int rowBytes, bool) {
    unsigned long long offset = entryOffset(entry);
    if (!m_decoder || offset == kAbsentBlock)
        return false;
    // Band-interleaved blocks hold the code grids of their bands one after the other.
    offset += static_cast<unsigned long long>(std::max(band, 0)) * m_indexBytesPerBlock;
    const __int64 position =
        offset <= static_cast<unsigned long long>(LLONG_MAX) ? static_cast<__int64>(offset) : -1;
    if (CDataStream::readZeroFilledAt(fp, position, m_indexes.data(),
                                      static_cast<size_t>(m_indexBytesPerBlock)) <
        static_cast<size_t>(m_indexBytesPerBlock))
        noteIncompleteBlock();
    // A grid that leaves a margin of the block uncovered (a block size that is not a whole number of kernels)
    // leaves zeros there, not what the buffer held before.
    const int height = m_properties.getTileHeight();
    if (m_codesPerRow * m_kernelWidth < m_properties.getTileWidth() || m_codeRows * m_kernelHeight < height)
        for (int row = 0; row < height; ++row)
            std::memset(out + static_cast<ptrdiff_t>(row) * rowBytes, 0,
                        static_cast<size_t>(m_properties.getTileWidth()));
    m_decoder->decode(m_indexes.data(), out, rowBytes);
    return true;
}
