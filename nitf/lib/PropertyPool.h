// Storage of field values: the CNitfProperty objects and their text buffers come from per-thread free lists
// of a few block sizes, refilled from large chunks, instead of one heap allocation each. Opening a file
// creates and releases a few values per field; this keeps that cheap. Sanitizer builds use the heap directly
// so that use-after-free stays visible.
#pragma once

#include <cstddef>

class CPropertyPool {
public:
    // A block for one CNitfProperty object, and its release.
    static void* allocateObject(size_t size);
    static void releaseObject(void* object);

    // A text buffer of `size` bytes, and its release (null is ignored).
    static char* allocateText(size_t size);
    static void releaseText(char* text);
};
