// Raising the library's exception from a source file: each .cpp names itself once in kSourceFile.
#pragma once

#include <climits>
#include <cmath>
#include <cstdlib>
#include <string>

#include "HostError.h"
#include "HostMemory.h"

#define NITF_RAISE(message, signature) throw vexo::Exception((message), (signature), kSourceFile, __LINE__)

// A message formatted with MkName, raised and released.
#define NITF_RAISE_FORMAT(signature, ...)                                                                    \
    do {                                                                                                     \
        char* nitfMessage_ = MkName(__VA_ARGS__);                                                            \
        std::string nitfText_(nitfMessage_);                                                                 \
        free(nitfMessage_);                                                                                  \
        throw vexo::Exception(nitfText_, (signature), kSourceFile, __LINE__);                                \
    } while (0)

namespace nitf_detail {

// atoi semantics (leading blanks, sign, stop at the first non-digit) without atoi's undefined overflow.
inline int parseInt(const char* text) {
    long value = std::strtol(text, nullptr, 10);
    if (value > INT_MAX)
        return INT_MAX;
    if (value < INT_MIN)
        return INT_MIN;
    return static_cast<int>(value);
}

// Truncation toward zero that saturates instead of overflowing (NaN gives 0).
template <typename Int> inline Int truncateTo(double value, Int lowest, Int highest) {
    if (std::isnan(value))
        return 0;
    if (value <= static_cast<double>(lowest))
        return lowest;
    if (value >= static_cast<double>(highest))
        return highest;
    return static_cast<Int>(value);
}

// A field's text as it may stand in a message: bytes that are not printable ASCII are written as \xHH, so
// that a damaged field cannot put control bytes on a terminal ("ISH.IC == \x0b\x0b").
inline std::string printable(const std::string& text) {
    static const char digits[] = "0123456789abcdef";
    std::string out;
    for (unsigned char c : text) {
        if (c >= 0x20 && c < 0x7F && c != '\\') {
            out += static_cast<char>(c);
        } else {
            out += "\\x";
            out += digits[c >> 4];
            out += digits[c & 15];
        }
    }
    return out;
}

} // namespace nitf_detail
