// One byte range of an open host file (the JPEG 2000 data of an image segment), read through positions
// relative to the range's start. The box reader reads it directly; OpenJPEG reads it through a stream whose
// read, skip and seek callbacks never leave the range, so a codestream is never read past its segment and
// the rest of the file is never touched.
#pragma once

#include <cstddef>
#include <cstdio>

#include <openjpeg.h>

class CJ2kSegmentStream {
public:
    // The `length` bytes from `offset` on, cut to what the file holds.
    CJ2kSegmentStream(FILE* fp, long long offset, long long length);
    CJ2kSegmentStream(const CJ2kSegmentStream&) = delete;
    CJ2kSegmentStream& operator=(const CJ2kSegmentStream&) = delete;

    long long length() const { return m_length; }
    // A narrower range of the same file: `length` bytes from `offset` (relative to this range), cut to it.
    void narrow(long long offset, long long length);

    // Reads up to `size` bytes at `position`; returns the count read (short at the end of the range).
    size_t readAt(long long position, void* buffer, size_t size);
    // The file is shared with the rest of the library, which moves its position freely: call this before a
    // run of reads that may follow other users of the file.
    void forgetFilePosition() { m_filePosition = -1; }

    // A new OpenJPEG input stream over the range, positioned at its start; destroy it with
    // opj_stream_destroy before this object goes. Each stream has its own position.
    opj_stream_t* newOpenJpegStream();

    // Bytes handed out so far through readAt and every stream (tests check how much a read touches).
    long long bytesRead() const { return m_bytesRead; }

private:
    struct Cursor;
    static OPJ_SIZE_T readCallback(void* buffer, OPJ_SIZE_T size, void* userData);
    static OPJ_OFF_T skipCallback(OPJ_OFF_T count, void* userData);
    static OPJ_BOOL seekCallback(OPJ_OFF_T position, void* userData);
    static void freeCallback(void* userData);

    FILE* m_fp;
    long long m_offset;
    long long m_length;
    long long m_bytesRead;
    long long m_filePosition; // where the file stands after this range's last read, or -1
};
