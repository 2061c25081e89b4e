// Host memory and string services. Everything these functions return is released with free().
#pragma once

#include <cstddef>

#include "HostCompat.h"

// Allocation that never returns null: an exhausted heap raises vexo::Exception("Out of memory").
void* HMalloc(size_t size);
void* HCalloc(size_t count, size_t size);
void* HRealloc(void* block, size_t size);

// A new copy of `text` (null stays null).
char* HString(const char* text);

// A new string formatted like printf.
char* MkName(const char* format, ...) __attribute__((format(printf, 1, 2)));

// Appends printf-formatted text to `text` (which may be null) and returns the grown string; `text` is consumed.
char* HSPrintf(char* text, const char* format, ...) __attribute__((format(printf, 2, 3)));

// Writes `value` in decimal into `buffer` (at least 21 bytes) and returns `buffer`.
char* PrintInt64(char* buffer, __int64 value);

// Decimal value of the first `length` characters of `text` (all of it when `length` is negative): leading blanks
// and a sign are accepted, conversion stops at the first non-digit, so "  12ab" is 12 and "ABC" is 0.
__int64 ScanInt64(const char* text, int length);

// The first character of `text` that is not white space.
char* LSCEatWS(char* text);

// Removes trailing white space from `text` in place and returns it.
char* RightTrimWS(char* text);
