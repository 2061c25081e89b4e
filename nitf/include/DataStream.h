// A small wrapper made on the stack around one field access: the stream and whether binary values are
// byte-reversed between file (big-endian) and host order.
#pragma once

#include <cstdio>

#include "HostCompat.h"

class CDataStream {
public:
    explicit CDataStream(FILE* fp, bool swap = true) : m_fp(fp), m_swap(swap) {}

    FILE* getStream() const { return m_fp; }
    bool getSwap() const { return m_swap; }

    // Reverses a 2-, 4- or 8-byte value in place (other sizes are left alone).
    static void reverse(void* value, int size);

    // Bytes between the stream's position and the end of the file (0 when it cannot be told). Streams the
    // host cannot size (memory streams) are measured by seeking to their end and back.
    static __int64 remaining(FILE* fp);

    // Reads `length` bytes at the stream's position (at `offset`); what the file does not hold reads as
    // zeros, never as stale bytes. Returns the bytes actually read.
    static size_t readZeroFilled(FILE* fp, void* buffer, size_t length);
    static size_t readZeroFilledAt(FILE* fp, __int64 offset, void* buffer, size_t length);

    // Raises vexo::Exception when `length` bytes cannot be read at the stream's position: the guard in front
    // of every allocation whose size comes from the file.
    static void requireReadable(FILE* fp, __int64 length, const char* what);

protected:
    void swapIfNeeded(void* value, int size) const {
        if (m_swap)
            reverse(value, size);
    }

    FILE* m_fp;
    bool m_swap;
};
