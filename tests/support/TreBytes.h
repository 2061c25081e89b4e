// Building TRE data by hand in tests, and parsing it with the extension framework.
#pragma once

#include <memory>
#include <string>

#include "NitfExtension.h"
#include "NitfProperty.h"

// `text` left-justified and blank-filled (or cut) to `width`.
std::string padText(const std::string& text, size_t width);
// `value` right-justified and zero-filled to `width`.
std::string padNumber(long long value, size_t width);
// `value` as `width` big-endian bytes.
std::string bigEndian(unsigned long long value, size_t width);

// Builds the extension for `name` on data at offset `offset` of a scratch stream holding `file` (the TRE's
// data unless told otherwise), with data length `length` (the data's size when negative), and reads it.
std::unique_ptr<CNitfExtension> parseTre(const char* name, const std::string& file, long long length = -1,
                                         long long offset = 0);

// The text of the property `key` (exactly `width` bytes when given), or "<absent>".
std::string field(CNitfExtension& extension, const char* key, size_t width = 0);
bool hasField(CNitfExtension& extension, const char* key);

// RPC00B data of a simple model: line = 500 - 500 P, sample = 500 + 500 L, with P = (lat - 45) / 0.1 and
// L = (lon - 10) / 0.1 (so 45.1 N 10.1 E is line 0, sample 1000), valid, errors 1.00 and 0.50 m.
std::string sampleRpc00b();
// ICHIPB data of a chip at twice its full image's pixel size: full row = 100 + 2 chip row, full column = 200
// + 2 chip column, in the grid points' coordinates.
std::string sampleIchipb();
