// Default host memory and string services. Every block comes from malloc so that callers release it with
// free.
#include "HostMemory.h"

#include <cctype>
#include <cstdarg>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>

#include "HostError.h"

namespace {

const char* const kModule = "host/HostMemory";

[[noreturn]] void outOfMemory(const char* signature, int line) {
    throw vexo::Exception("Out of memory", signature, kModule, line);
}

bool isBlank(char c) {
    return std::isspace(static_cast<unsigned char>(c)) != 0;
}

// Length of the text that `format` produces, or -1 for a format that vsnprintf rejects.
int formattedLength(const char* format, va_list args) {
    va_list copy;
    va_copy(copy, args);
    int length = std::vsnprintf(nullptr, 0, format, copy);
    va_end(copy);
    return length;
}

// Appends the formatted text to `text`, which holds `used` characters and is consumed.
char* appendFormatted(char* text, size_t used, const char* format, va_list args) {
    int length = format ? formattedLength(format, args) : -1;
    if (length < 0)
        length = 0; // a rejected format appends nothing rather than leaving the text unterminated
    char* grown = static_cast<char*>(HRealloc(text, used + static_cast<size_t>(length) + 1));
    if (length > 0)
        std::vsnprintf(grown + used, static_cast<size_t>(length) + 1, format, args);
    grown[used + static_cast<size_t>(length)] = '\0';
    return grown;
}

} // namespace

// A zero-size request still returns a distinct block, so that a null result always means failure.
void* HMalloc(size_t size) {
    void* block = std::malloc(size ? size : 1);
    if (!block)
        outOfMemory("void* HMalloc(size_t)", __LINE__);
    return block;
}

void* HCalloc(size_t count, size_t size) {
    void* block = (count == 0 || size == 0) ? std::calloc(1, 1) : std::calloc(count, size);
    if (!block)
        outOfMemory("void* HCalloc(size_t, size_t)", __LINE__);
    return block;
}

void* HRealloc(void* block, size_t size) {
    void* grown = std::realloc(block, size ? size : 1);
    if (!grown)
        outOfMemory("void* HRealloc(void*, size_t)", __LINE__);
    return grown;
}

char* HString(const char* text) {
    if (!text)
        return nullptr;
    size_t size = std::strlen(text) + 1;
    char* copy = static_cast<char*>(HMalloc(size));
    std::memcpy(copy, text, size);
    return copy;
}

char* MkName(const char* format, ...) {
    va_list args;
    va_start(args, format);
    char* text = appendFormatted(nullptr, 0, format, args);
    va_end(args);
    return text;
}

char* HSPrintf(char* text, const char* format, ...) {
    va_list args;
    va_start(args, format);
    char* grown = appendFormatted(text, text ? std::strlen(text) : 0, format, args);
    va_end(args);
    return grown;
}

char* PrintInt64(char* buffer, __int64 value) {
    if (buffer)
        std::snprintf(buffer, 21, "%lld", value);
    return buffer;
}

__int64 ScanInt64(const char* text, int length) {
    if (!text)
        return 0;
    // Never look past `length` characters nor past the terminating NUL.
    auto inRange = [&](int i) { return (length < 0 || i < length) && text[i] != '\0'; };
    int i = 0;
    while (inRange(i) && isBlank(text[i]))
        ++i;
    bool negative = false;
    if (inRange(i) && (text[i] == '+' || text[i] == '-')) {
        negative = text[i] == '-';
        ++i;
    }
    // Accumulate the magnitude unsigned and stop growing at the largest value the sign allows.
    const uint64_t limit = negative ? uint64_t(INT64_MAX) + 1 : uint64_t(INT64_MAX);
    uint64_t magnitude = 0;
    for (; inRange(i) && text[i] >= '0' && text[i] <= '9'; ++i) {
        unsigned digit = unsigned(text[i] - '0');
        magnitude = magnitude > (limit - digit) / 10 ? limit : magnitude * 10 + digit;
    }
    if (!negative)
        return static_cast<__int64>(magnitude);
    return magnitude == limit ? INT64_MIN : -static_cast<__int64>(magnitude);
}

char* LSCEatWS(char* text) {
    if (!text)
        return nullptr;
    while (*text && isBlank(*text))
        ++text;
    return text;
}

char* RightTrimWS(char* text) {
    if (!text)
        return nullptr;
    size_t length = std::strlen(text);
    while (length > 0 && isBlank(text[length - 1]))
        --length;
    text[length] = '\0';
    return text;
}
