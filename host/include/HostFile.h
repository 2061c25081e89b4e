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
