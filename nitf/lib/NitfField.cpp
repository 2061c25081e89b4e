#include "NitfField.h"

#include <climits>
#include <cstdint>
#include <cstring>

#include "NitfProperty.h"
#include "Raise.h"
#include "RecordLayout.h"

static std::string hexDigits(const char* bytes, size_t length) {
    static const char digits[] = "0123456789ABCDEF";
    std::string hex;
    hex.reserve(2 * length);
    for (size_t i = 0; i < length; ++i) {
        unsigned char byte = static_cast<unsigned char>(bytes[i]);
        hex += digits[byte >> 4];
        hex += digits[byte & 15];
    }
    return hex;
}

bool nitfFieldNumber(const NitfField_t& field, CNitfProperty* value, double* number, long long* integer,
                     bool* isInteger) {
    if (!value || value->getDataType() == CNitfProperty::eNone || field.form == eFieldText ||
        field.form == eFieldBytes)
        return false;
    *isInteger = field.form == eFieldUnsigned || field.form == eFieldSigned;
    if (value->getDataType() != CNitfProperty::eString) {
        // Typed values (a header's binary fields) convert themselves.
        *number = value->getAsDouble();
        *integer = nitf_detail::truncateTo<long long>(*number, LLONG_MIN, LLONG_MAX);
        *isInteger =
            value->getDataType() != CNitfProperty::eFloat && value->getDataType() != CNitfProperty::eDouble;
        return true;
    }
    const char* bytes = value->getBytes();
    size_t length = value->getStoredLength();
    if (*isInteger) {
        *integer = recordFieldValue(bytes, length, field.form);
        *number = static_cast<double>(*integer);
        return true;
    }
    uint64_t bits = 0;
    for (size_t i = 0; i < length && i < 8; ++i)
        bits = (bits << 8) | static_cast<unsigned char>(bytes[i]);
    if (field.form == eFieldFloat && length == 4) {
        uint32_t single = static_cast<uint32_t>(bits);
        float real;
        std::memcpy(&real, &single, 4);
        *number = real;
    } else if (field.form == eFieldDouble && length == 8) {
        std::memcpy(number, &bits, 8);
    } else {
        return false;
    }
    *integer = 0;
    return true;
}

std::string nitfFieldDisplayText(const NitfField_t& field, CNitfProperty* value) {
    if (!value || value->getDataType() == CNitfProperty::eNone)
        return std::string();
    double number = 0;
    long long integer = 0;
    bool isInteger = false;
    if (nitfFieldNumber(field, value, &number, &integer, &isInteger)) {
        if (isInteger)
            return std::to_string(integer);
        char text[32];
        std::snprintf(text, sizeof text, "%.9g", number);
        return text;
    }
    if (value->getDataType() != CNitfProperty::eString)
        return value->toText(); // eChars as hexadecimal digits, numbers in decimal
    const char* bytes = value->getBytes();
    size_t length = field.form == eFieldBytes ? value->getStoredLength() : std::strlen(bytes);
    bool printable = field.form == eFieldText && CNitfProperty::isBCSA(bytes, static_cast<int>(length)) &&
                     (field.width <= 0 || length == static_cast<size_t>(field.width));
    if (!printable)
        return hexDigits(bytes, value->getStoredLength());
    std::string text(bytes, length);
    text.erase(text.find_last_not_of(' ') + 1);
    return text;
}
