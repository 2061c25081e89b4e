// Host file layer: C streams with true 64-bit positions.
#pragma once

#include <cstddef>
#include <cstdio>

#include "HostCompat.h"

// Mode flags of DKOpen; combine them with |.
enum {
    DK_READ = 4,      // open for reading
    DK_WRITE = 2,     // open for writing
    DK_BINARY = 8,    // binary (no text translation)
    DK_CREATE = 16,   // create the file, replacing an existing one
    DK_EXISTING = 32, // the file must exist
};
// The reader's mode: read-only binary of an existing file (4 | 8 | 32).
const int DK_MODE_READ_BINARY = DK_READ | DK_BINARY | DK_EXISTING;
// The creator's mode: a new binary file open for reading and writing (2 | 4 | 8 | 16).
const int DK_MODE_CREATE_BINARY = DK_WRITE | DK_READ | DK_BINARY | DK_CREATE;

// Opens `name`. `access` is an fopen mode ("rb", "w+b", ...); when null or empty it is derived from `flags`:
// DK_CREATE gives "w" ("w+" with DK_READ); DK_WRITE keeps an existing file ("r+") and creates a missing one
// unless DK_EXISTING is set; DK_READ alone gives "r"; DK_BINARY adds "b". So DK_MODE_READ_BINARY is "rb" and
// DK_MODE_CREATE_BINARY is "w+b". Returns null when the file cannot be opened.
FILE* DKOpen(const char* name, int flags, const char* access);
int DKClose(FILE* fp);

// A stream the caller supplies: reads at the current position, absolute seeks and the size. The library calls
// them from the thread that uses the stream only.
struct DKStreamCallbacks {
    void* user;
    // Reads up to `size` bytes into `buffer`; returns how many (0 at the end), or -1 on failure.
    long long (*read)(void* user, void* buffer, size_t size);
    // Moves to `offset` bytes from the start; returns 0 on success.
    int (*seek)(void* user, long long offset);
    // The stream's size in bytes, or -1 when it cannot be told.
    long long (*size)(void* user);
    // Called once when the stream is closed; may be null.
    void (*close)(void* user);
};

// A read-only C stream over `size` bytes of memory, which must stay valid until the stream is closed; `name`
// is what fp2filename reports. Null when `data` is null and `size` is not 0.
FILE* DKOpenMemory(const void* data, size_t size, const char* name);
// A read-only C stream over the caller's callbacks (read and seek are required). Null when they are missing.
FILE* DKOpenCallbacks(const DKStreamCallbacks* callbacks, const char* name);

size_t DKFRead(void* buffer, size_t size, size_t count, FILE* fp);
size_t DKFWrite(const void* buffer, size_t size, size_t count, FILE* fp);

// Both return 0 on success, like fseek.
int DKFSeek(FILE* fp, long offset, int whence);
int DKFSeek64(FILE* fp, __int64 offset, int whence);
__int64 DKFTell(FILE* fp);

// Size in bytes of the open file, or -1 when it cannot be told.
__int64 DKSize(FILE* fp);

// True when `name` names an existing file.
bool DKCheck(const char* name);

// The name a stream was opened under by DKOpen, or "" for streams that DKOpen did not open.
const char* fp2filename(FILE* fp);
