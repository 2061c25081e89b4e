#include "J2kSegmentStream.h"

#include <algorithm>

#include "HostFile.h"

namespace {

// OpenJPEG reads marker segments through a buffer of this size, and the data of a tile-part straight into
// its own memory whatever its size. Fetching one tile walks the headers of every tile-part of the
// codestream, each walk costing one buffer fill: a small buffer keeps that cheap.
const OPJ_SIZE_T kStreamChunk = 4096;

} // namespace

// One OpenJPEG stream's position in the range.
struct CJ2kSegmentStream::Cursor {
    CJ2kSegmentStream* range;
    long long position;
};

CJ2kSegmentStream::CJ2kSegmentStream(FILE* fp, long long offset, long long length)
    : m_fp(fp), m_offset(offset), m_length(0), m_bytesRead(0), m_filePosition(-1) {
    const long long size = fp ? DKSize(fp) : 0;
    if (offset >= 0 && offset < size && length > 0)
        m_length = std::min(length, size - offset);
}

void CJ2kSegmentStream::narrow(long long offset, long long length) {
    offset = std::clamp(offset, 0LL, m_length);
    m_offset += offset;
    m_length = std::clamp(length, 0LL, m_length - offset);
}

size_t CJ2kSegmentStream::readAt(long long position, void* buffer, size_t size) {
    if (position < 0 || position >= m_length || size == 0)
        return 0;
    const size_t wanted =
        static_cast<size_t>(std::min<long long>(static_cast<long long>(size), m_length - position));
    // Reads that follow each other need no seek (a seek drops the stream's buffer); see forgetFilePosition.
    const long long at = m_offset + position;
    if (at != m_filePosition && DKFSeek64(m_fp, at, SEEK_SET) != 0) {
        m_filePosition = -1;
        return 0;
    }
    const size_t got = DKFRead(buffer, 1, wanted, m_fp);
    m_filePosition = got == wanted ? at + static_cast<long long>(got) : -1;
    m_bytesRead += static_cast<long long>(got);
    return got;
}

opj_stream_t* CJ2kSegmentStream::newOpenJpegStream() {
    opj_stream_t* stream = opj_stream_create(kStreamChunk, OPJ_TRUE);
    if (!stream)
        return nullptr;
    opj_stream_set_user_data(stream, new Cursor{this, 0}, freeCallback);
    opj_stream_set_user_data_length(stream, static_cast<OPJ_UINT64>(m_length));
    opj_stream_set_read_function(stream, readCallback);
    opj_stream_set_skip_function(stream, skipCallback);
    opj_stream_set_seek_function(stream, seekCallback);
    return stream;
}

OPJ_SIZE_T CJ2kSegmentStream::readCallback(void* buffer, OPJ_SIZE_T size, void* userData) {
    Cursor* cursor = static_cast<Cursor*>(userData);
    const size_t got = cursor->range->readAt(cursor->position, buffer, size);
    cursor->position += static_cast<long long>(got);
    return got == 0 ? static_cast<OPJ_SIZE_T>(-1) : got; // OpenJPEG's end-of-stream mark
}

// Skips within the range only; a skip past its end stops at the end and reports how far it went.
OPJ_OFF_T CJ2kSegmentStream::skipCallback(OPJ_OFF_T count, void* userData) {
    Cursor* cursor = static_cast<Cursor*>(userData);
    const long long target = std::clamp<long long>(cursor->position + count, 0, cursor->range->m_length);
    const OPJ_OFF_T skipped = target - cursor->position;
    cursor->position = target;
    return skipped;
}

OPJ_BOOL CJ2kSegmentStream::seekCallback(OPJ_OFF_T position, void* userData) {
    Cursor* cursor = static_cast<Cursor*>(userData);
    if (position < 0 || position > cursor->range->m_length)
        return OPJ_FALSE;
    cursor->position = position;
    return OPJ_TRUE;
}

void CJ2kSegmentStream::freeCallback(void* userData) {
    delete static_cast<Cursor*>(userData);
}
