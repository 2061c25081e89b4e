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
