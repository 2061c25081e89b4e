#include "JpegStreamDecoder.h"

#include <algorithm>
#include <cstdio>
#include <cstring>
#include <strings.h>

#include <jerror.h>

#include "HostError.h"
#include "HostFile.h"
#include "Raise.h"

static const char kSourceFile[] = "nitf/lib/JpegStreamDecoder";

namespace {

// The NITF default quantisation tables, selected by the quality digit of COMRAT. They go into libjpeg's table
// exactly as listed: tables 1 and 2 are listed along the zig-zag diagonals and 3 to 5 row by row, and all
// five are used that way on purpose, so that images decode as they always have.
const unsigned short kDefaultQuant[5][CJpegStreamDecoder::kQuantValues] = {
    {8,   72,  72,  72,  72,  72,  72,  72,  72,  72,  78,  74,  76,  74,  78,  89,
     81,  84,  84,  81,  89,  106, 93,  94,  99,  94,  93,  106, 129, 111, 108, 116,
     116, 108, 111, 129, 135, 128, 136, 145, 136, 128, 135, 155, 160, 177, 177, 160,
     155, 193, 213, 228, 213, 193, 255, 255, 255, 255, 255, 255, 255, 255, 255, 255},
    {8,  36, 36, 36, 36, 36, 36,  36,  36,  36, 39,  37,  38,  37,  39,  45,  41,  42,  42,  41, 45, 53,
     47, 47, 50, 47, 47, 53, 65,  56,  54,  59, 59,  54,  56,  65,  68,  64,  69,  73,  69,  64, 68, 78,
     81, 89, 89, 81, 78, 98, 108, 115, 108, 98, 130, 144, 144, 130, 178, 190, 178, 243, 243, 255},
    {8,  10, 10, 10, 11, 13, 15, 18, 10, 10, 10, 10, 11, 13, 16, 19, 10, 10, 11, 12, 13, 15,
     18, 22, 10, 10, 12, 14, 16, 19, 23, 27, 11, 11, 13, 16, 21, 25, 30, 36, 13, 13, 15, 19,
     25, 32, 40, 50, 15, 16, 18, 23, 30, 40, 53, 68, 18, 19, 22, 27, 36, 50, 68, 91},
    {8,  7,  7,  7,  8,  9,  11, 13, 7,  7,  7,  7,  8,  9,  11, 14, 7,  7,  8,  8, 9,  11,
     13, 16, 7,  7,  8,  10, 12, 14, 16, 20, 8,  8,  9,  12, 15, 18, 22, 26, 9,  9, 11, 14,
     18, 23, 29, 36, 11, 11, 13, 16, 22, 29, 38, 49, 13, 14, 16, 20, 26, 36, 49, 65},
    {4,  4,  4,  4,  4, 5, 6, 7, 4,  4,  4,  4,  5, 5, 6, 8,  4,  4,  4,  5, 5, 6,
     7,  9,  4,  4,  5, 6, 6, 8, 9,  11, 4,  5,  5, 6, 8, 10, 12, 14, 5,  5, 6, 8,
     10, 13, 16, 20, 6, 6, 7, 9, 12, 16, 21, 27, 7, 8, 9, 11, 14, 20, 27, 36},
};

// The luminance Huffman tables of ITU-T T.81 Annex K (Tables K.3 and K.5): code counts by length (index 0
// unused), then the values in code order.
const UINT8 kDcBits[17] = {0, 0, 1, 5, 1, 1, 1, 1, 1, 1, 0, 0, 0, 0, 0, 0, 0};
const UINT8 kDcValues[12] = {0, 1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11};
const UINT8 kAcBits[17] = {0, 0, 2, 1, 3, 3, 2, 4, 3, 5, 5, 4, 4, 0, 0, 1, 0x7d};
const UINT8 kAcValues[162] = {
    0x01, 0x02, 0x03, 0x00, 0x04, 0x11, 0x05, 0x12, 0x21, 0x31, 0x41, 0x06, 0x13, 0x51, 0x61, 0x07, 0x22,
    0x71, 0x14, 0x32, 0x81, 0x91, 0xa1, 0x08, 0x23, 0x42, 0xb1, 0xc1, 0x15, 0x52, 0xd1, 0xf0, 0x24, 0x33,
    0x62, 0x72, 0x82, 0x09, 0x0a, 0x16, 0x17, 0x18, 0x19, 0x1a, 0x25, 0x26, 0x27, 0x28, 0x29, 0x2a, 0x34,
    0x35, 0x36, 0x37, 0x38, 0x39, 0x3a, 0x43, 0x44, 0x45, 0x46, 0x47, 0x48, 0x49, 0x4a, 0x53, 0x54, 0x55,
    0x56, 0x57, 0x58, 0x59, 0x5a, 0x63, 0x64, 0x65, 0x66, 0x67, 0x68, 0x69, 0x6a, 0x73, 0x74, 0x75, 0x76,
    0x77, 0x78, 0x79, 0x7a, 0x83, 0x84, 0x85, 0x86, 0x87, 0x88, 0x89, 0x8a, 0x92, 0x93, 0x94, 0x95, 0x96,
    0x97, 0x98, 0x99, 0x9a, 0xa2, 0xa3, 0xa4, 0xa5, 0xa6, 0xa7, 0xa8, 0xa9, 0xaa, 0xb2, 0xb3, 0xb4, 0xb5,
    0xb6, 0xb7, 0xb8, 0xb9, 0xba, 0xc2, 0xc3, 0xc4, 0xc5, 0xc6, 0xc7, 0xc8, 0xc9, 0xca, 0xd2, 0xd3, 0xd4,
    0xd5, 0xd6, 0xd7, 0xd8, 0xd9, 0xda, 0xe1, 0xe2, 0xe3, 0xe4, 0xe5, 0xe6, 0xe7, 0xe8, 0xe9, 0xea, 0xf1,
    0xf2, 0xf3, 0xf4, 0xf5, 0xf6, 0xf7, 0xf8, 0xf9, 0xfa};

// Input is read in chunks of this size.
const size_t kInputChunk = 65536;
// A progressive stream may carry any number of scans, each a pass over the whole image; a stream with more
// than this is damaged or hostile, and would only burn time.
const int kMaxScans = 1000;

// The amplitude-mapping marker: identifier "NITF0001.A" (NUL-terminated), two 32-bit and one 16-bit value,
// then the 16-bit amplitude offset; counted from the first byte after the length field.
const char kAmplitudeMarkerId[] = "NITF0001.A";
const int kAmplitudeMarkerBytes = 23;
const int kAmplitudeOffsetAt = 21;

CJpegStreamDecoder* owner(j_common_ptr cinfo) {
    return static_cast<CJpegStreamDecoder*>(cinfo->client_data);
}

void installHuffmanTable(j_common_ptr cinfo, JHUFF_TBL*& table, const UINT8* bits, const UINT8* values,
                         size_t count) {
    if (!table)
        table = jpeg_alloc_huff_table(cinfo);
    std::memcpy(table->bits, bits, sizeof table->bits);
    std::memcpy(table->huffval, values, count);
    table->sent_table = FALSE;
}

// One byte from the source manager (whose fill never comes back empty-handed: it raises instead).
unsigned nextByte(j_decompress_ptr cinfo) {
    jpeg_source_mgr* source = cinfo->src;
    if (source->bytes_in_buffer == 0)
        (*source->fill_input_buffer)(cinfo);
    --source->bytes_in_buffer;
    return *source->next_input_byte++;
}

} // namespace

CJpegStreamDecoder::CJpegStreamDecoder()
    : m_inputBuffer(kInputChunk), m_quality(0), m_sawAmplitudeMarker(false), m_amplitudeOffset(0) {
    std::memset(&m_cinfo, 0, sizeof m_cinfo);
    std::memset(&m_source, 0, sizeof m_source);
    std::memset(&m_progress, 0, sizeof m_progress);
    m_message[0] = '\0';
    m_cinfo.err = jpeg_std_error(&m_errors.pub);
    m_errors.pub.error_exit = onError;
    m_errors.pub.emit_message = onMessage;
    m_cinfo.client_data = this;
    if (!guardedCreate()) {
        jpeg_destroy_decompress(&m_cinfo);
        NITF_RAISE(m_message, "__cdecl CJpegStreamDecoder::CJpegStreamDecoder(void)");
    }
    m_source.buffer = m_inputBuffer.data();
    m_source.pub.init_source = initSource;
    m_source.pub.fill_input_buffer = fillInput;
    m_source.pub.skip_input_data = skipInput;
    m_source.pub.resync_to_restart = jpeg_resync_to_restart;
    m_source.pub.term_source = termSource;
    m_cinfo.src = &m_source.pub;
    m_progress.progress_monitor = onProgress;
    m_cinfo.progress = &m_progress;
    jpeg_set_marker_processor(&m_cinfo, JPEG_APP0 + 6, readApplicationMarker);
}

CJpegStreamDecoder::~CJpegStreamDecoder() {
    jpeg_destroy_decompress(&m_cinfo);
}

void CJpegStreamDecoder::setDefaultQuality(int quality) {
    m_quality = quality;
}

const unsigned short* CJpegStreamDecoder::defaultQuantTable(int quality) {
    return quality >= 1 && quality <= 5 ? kDefaultQuant[quality - 1] : nullptr;
}

// ---- the stream's steps
// ------------------------------------------------------------------------------------

void CJpegStreamDecoder::readHeader(FILE* fp, unsigned long long offset, unsigned long long length) {
    static const char signature[] =
        "void __cdecl CJpegStreamDecoder::readHeader(" NITF_FILE_SIG ",unsigned __int64,unsigned __int64)";
    jpeg_abort_decompress(&m_cinfo);
    m_sawAmplitudeMarker = false;
    m_source.fp = fp;
    m_source.remaining = length;
    m_source.pub.next_input_byte = nullptr;
    m_source.pub.bytes_in_buffer = 0;
    if (!fp || DKFSeek64(fp, static_cast<__int64>(offset), SEEK_SET) != 0)
        NITF_RAISE_FORMAT(signature, "Cannot reach the JPEG stream at offset %llu", offset);
    if (!guardedReadHeader())
        fail(signature);
}

void CJpegStreamDecoder::setColorSpaces(J_COLOR_SPACE stream, J_COLOR_SPACE output) {
    m_cinfo.jpeg_color_space = stream;
    m_cinfo.out_color_space = output;
}

void CJpegStreamDecoder::start() {
    if (!guardedStart())
        fail("void __cdecl CJpegStreamDecoder::start(void)");
}

void CJpegStreamDecoder::readRows(unsigned char** rows, int count) {
    if (!guardedReadRows(rows, count))
        fail("void __cdecl CJpegStreamDecoder::readRows(unsigned char **,int)");
}

void CJpegStreamDecoder::finish() {
    if (!guardedFinish())
        jpeg_abort_decompress(&m_cinfo);
}

[[noreturn]] void CJpegStreamDecoder::fail(const char* signature) {
    jpeg_abort_decompress(&m_cinfo);
    NITF_RAISE(m_message, signature);
}

// ---- the guards: no object with a destructor lives in these frames or in the steps they call
// ---------------

bool CJpegStreamDecoder::guardedCreate() {
    if (setjmp(m_errors.jump))
        return false;
    jpeg_CreateDecompress(&m_cinfo, JPEG_LIB_VERSION, sizeof m_cinfo);
    return true;
}

bool CJpegStreamDecoder::guardedReadHeader() {
    if (setjmp(m_errors.jump))
        return false;
    installDefaultTables();
    jpeg_read_header(&m_cinfo, TRUE);
    return true;
}

bool CJpegStreamDecoder::guardedStart() {
    if (setjmp(m_errors.jump))
        return false;
    jpeg_start_decompress(&m_cinfo);
    return true;
}

bool CJpegStreamDecoder::guardedReadRows(unsigned char** rows, int count) {
    if (setjmp(m_errors.jump))
        return false;
    decodeRows(rows, count);
    return true;
}

bool CJpegStreamDecoder::guardedFinish() {
    if (setjmp(m_errors.jump))
        return false;
    jpeg_finish_decompress(&m_cinfo);
    return true;
}

void CJpegStreamDecoder::decodeRows(unsigned char** rows, int count) {
    for (int done = 0; done < count;) {
        JDIMENSION wanted = static_cast<JDIMENSION>(count - done);
        JDIMENSION got;
        if (m_cinfo.data_precision <= 8)
            got = jpeg_read_scanlines(&m_cinfo, rows + done, wanted);
        else if (m_cinfo.data_precision <= 12)
            got = jpeg12_read_scanlines(&m_cinfo, reinterpret_cast<J12SAMPARRAY>(rows + done), wanted);
        else
            got = jpeg16_read_scanlines(&m_cinfo, reinterpret_cast<J16SAMPARRAY>(rows + done), wanted);
        if (got == 0)
            ERREXIT(&m_cinfo, JERR_INPUT_EOF); // asked for rows past the image's end
        done += static_cast<int>(got);
    }
}

// Tables in the stream replace these as its header is read. They are put back before every stream, so that a
// block's pixels never depend on which block was decoded before it.
void CJpegStreamDecoder::installDefaultTables() {
    j_common_ptr common = reinterpret_cast<j_common_ptr>(&m_cinfo);
    if (const unsigned short* values = defaultQuantTable(m_quality)) {
        JQUANT_TBL*& table = m_cinfo.quant_tbl_ptrs[0];
        if (!table)
            table = jpeg_alloc_quant_table(common);
        for (int i = 0; i < kQuantValues; ++i)
            table->quantval[i] = values[i];
        table->sent_table = FALSE;
    }
    installHuffmanTable(common, m_cinfo.dc_huff_tbl_ptrs[0], kDcBits, kDcValues, sizeof kDcValues);
    installHuffmanTable(common, m_cinfo.ac_huff_tbl_ptrs[0], kAcBits, kAcValues, sizeof kAcValues);
}

// ---- libjpeg's callbacks
// -----------------------------------------------------------------------------------

void CJpegStreamDecoder::onError(j_common_ptr cinfo) {
    CJpegStreamDecoder* self = owner(cinfo);
    (*cinfo->err->format_message)(cinfo, self->m_message);
    longjmp(self->m_errors.jump, 1);
}

// Warnings about damaged data and traces: the decoder carries on, so they only matter when debugging.
void CJpegStreamDecoder::onMessage(j_common_ptr cinfo, int level) {
    if (level < 0)
        ++cinfo->err->num_warnings;
    else if (level > cinfo->err->trace_level)
        return;
    if (!DebugOver(0))
        return;
    char text[JMSG_LENGTH_MAX];
    (*cinfo->err->format_message)(cinfo, text);
    vexo::nspio::Debugger::Debug("segrix", text, kSourceFile, __LINE__);
}

void CJpegStreamDecoder::onProgress(j_common_ptr cinfo) {
    if (reinterpret_cast<j_decompress_ptr>(cinfo)->input_scan_number <= kMaxScans)
        return;
    CJpegStreamDecoder* self = owner(cinfo);
    std::snprintf(self->m_message, sizeof self->m_message, "The JPEG stream has more than %d scans",
                  kMaxScans);
    longjmp(self->m_errors.jump, 1);
}

void CJpegStreamDecoder::initSource(j_decompress_ptr) {}

void CJpegStreamDecoder::termSource(j_decompress_ptr) {}

// The stream's range ends where the next block's begins (or the image data ends): running out there means
// the stream is cut short, which is an error rather than an invitation to invent the rest.
boolean CJpegStreamDecoder::fillInput(j_decompress_ptr cinfo) {
    FileSource& source = owner(reinterpret_cast<j_common_ptr>(cinfo))->m_source;
    size_t wanted = static_cast<size_t>(std::min<unsigned long long>(source.remaining, kInputChunk));
    size_t got = wanted ? DKFRead(source.buffer, 1, wanted, source.fp) : 0;
    if (got == 0)
        ERREXIT(cinfo, JERR_INPUT_EOF);
    source.remaining -= got;
    source.pub.next_input_byte = source.buffer;
    source.pub.bytes_in_buffer = got;
    return TRUE;
}

void CJpegStreamDecoder::skipInput(j_decompress_ptr cinfo, long count) {
    FileSource& source = owner(reinterpret_cast<j_common_ptr>(cinfo))->m_source;
    if (count <= 0)
        return;
    unsigned long long skip = static_cast<unsigned long long>(count);
    if (skip <= source.pub.bytes_in_buffer) {
        source.pub.next_input_byte += skip;
        source.pub.bytes_in_buffer -= skip;
        return;
    }
    // Past the buffer: seek over the rest instead of reading it.
    skip -= source.pub.bytes_in_buffer;
    source.pub.bytes_in_buffer = 0;
    if (skip > source.remaining || DKFSeek64(source.fp, static_cast<__int64>(skip), SEEK_CUR) != 0)
        ERREXIT(cinfo, JERR_INPUT_EOF);
    source.remaining -= skip;
}

// APP6: a "NITF0001.A" marker gives the amplitude offset of 12-bit data; any other (the "NITF" marker that
// repeats sub-header facts, or foreign ones) is skipped.
boolean CJpegStreamDecoder::readApplicationMarker(j_decompress_ptr cinfo) {
    CJpegStreamDecoder* self = owner(reinterpret_cast<j_common_ptr>(cinfo));
    unsigned length = nextByte(cinfo) << 8;
    length |= nextByte(cinfo);
    long dataLength = length > 2 ? static_cast<long>(length) - 2 : 0;
    unsigned char data[kAmplitudeMarkerBytes];
    int kept = static_cast<int>(std::min<long>(dataLength, kAmplitudeMarkerBytes));
    for (int i = 0; i < kept; ++i)
        data[i] = static_cast<unsigned char>(nextByte(cinfo));
    if (dataLength > kept)
        (*cinfo->src->skip_input_data)(cinfo, dataLength - kept);

    const size_t idLength = sizeof kAmplitudeMarkerId; // with its NUL
    if (kept == kAmplitudeMarkerBytes && data[idLength - 1] == '\0' &&
        strncasecmp(reinterpret_cast<const char*>(data), kAmplitudeMarkerId, idLength) == 0) {
        self->m_amplitudeOffset =
            static_cast<unsigned short>(data[kAmplitudeOffsetAt] << 8 | data[kAmplitudeOffsetAt + 1]);
        self->m_sawAmplitudeMarker = true;
    }
    return TRUE;
}
