#include "NitfProperty.h"

#include <climits>
#include <cstdlib>
#include <cstring>
#include <string>

#include "DataStreamRead.h"
#include "DataStreamWrite.h"
#include "HostFile.h"
#include "HostMemory.h"
#include "PropertyPool.h"
#include "Raise.h"

static const char kSourceFile[] = "nitf/lib/NitfProperty";

void* CNitfProperty::operator new(size_t size) {
    return CPropertyPool::allocateObject(size);
}

void CNitfProperty::operator delete(void* object) {
    CPropertyPool::releaseObject(object);
}

CNitfProperty::CNitfProperty() {
    baseConstruct();
}

CNitfProperty::CNitfProperty(int value) {
    baseConstruct();
    setInt4(value);
}

CNitfProperty::CNitfProperty(const char* text) {
    baseConstruct();
    setString(text);
}

CNitfProperty::CNitfProperty(const CNitfProperty& other)
    : m_value(other.m_value), m_count(other.m_count), m_type(other.m_type) {}

CNitfProperty::~CNitfProperty() {
    release();
}

CNitfProperty& CNitfProperty::operator=(const CNitfProperty& other) {
    m_value = other.m_value;
    m_count = other.m_count;
    m_type = other.m_type;
    return *this;
}

void CNitfProperty::baseConstruct() {
    m_value.d = 0;
    m_count = 0;
    m_type = eNone;
}

void CNitfProperty::release() {
    if (m_type == eString || m_type == eChars) {
        CPropertyPool::releaseText(m_value.text);
        m_value.text = nullptr;
        m_type = eNone;
    }
    m_count = 0;
}

// ---- readers
// -------------------------------------------------------------------------------------------------

char* CNitfProperty::allocateBuffer(int length, FILE* fp) {
    // Short reads leave zeros, never stale bytes; the buffer is always terminated.
    size_t size = length > 0 ? static_cast<size_t>(length) : 0;
    char* buffer = CPropertyPool::allocateText(size + 1);
    size_t got = size ? DKFRead(buffer, 1, size, fp) : 0;
    std::memset(buffer + got, 0, size + 1 - got);
    return buffer;
}

void CNitfProperty::readString(FILE* fp, int length) {
    char* text = allocateBuffer(length, fp);
    release();
    m_value.text = text;
    m_count = length > 0 ? length : 0;
    m_type = eString;
}

void CNitfProperty::readChars(FILE* fp, int length) {
    char* bytes = allocateBuffer(length, fp);
    release();
    m_value.text = bytes;
    m_count = length > 0 ? length : 0;
    m_type = eChars;
}

void CNitfProperty::readUint1(FILE* fp) {
    release();
    m_value.integer = CDataStreamRead(fp).readByte();
    m_type = eUint1;
}

void CNitfProperty::readUint2(FILE* fp) {
    release();
    m_value.integer = CDataStreamRead(fp).readUint16();
    m_type = eUint2;
}

void CNitfProperty::readInt4(FILE* fp) {
    release();
    m_value.integer = CDataStreamRead(fp).readInt32();
    m_type = eInt4;
}

void CNitfProperty::readFloat(FILE* fp) {
    release();
    m_value.d = 0;
    m_value.f = CDataStreamRead(fp).readFloat();
    m_type = eFloat;
}

void CNitfProperty::readDouble(FILE* fp) {
    release();
    m_value.d = CDataStreamRead(fp).readDouble();
    m_type = eDouble;
}

// ---- factories
// ------------------------------------------------------------------------------------------------

template <typename Reader> static CNitfProperty* makeRead(Reader read) {
    CNitfProperty* property = new CNitfProperty;
    try {
        read(*property);
    } catch (...) {
        delete property;
        throw;
    }
    return property;
}

CNitfProperty* CNitfProperty::getNewFromString(FILE* fp, int length) {
    return makeRead([&](CNitfProperty& p) { p.readString(fp, length); });
}
CNitfProperty* CNitfProperty::getNewFromChars(FILE* fp, int length) {
    return makeRead([&](CNitfProperty& p) { p.readChars(fp, length); });
}
CNitfProperty* CNitfProperty::getNewFromUint1(FILE* fp) {
    return makeRead([&](CNitfProperty& p) { p.readUint1(fp); });
}
CNitfProperty* CNitfProperty::getNewFromUint2(FILE* fp) {
    return makeRead([&](CNitfProperty& p) { p.readUint2(fp); });
}
CNitfProperty* CNitfProperty::getNewFromInt4(FILE* fp) {
    return makeRead([&](CNitfProperty& p) { p.readInt4(fp); });
}
// There is no unsigned 32-bit kind: the four bytes are kept as an eInt4.
CNitfProperty* CNitfProperty::getNewFromUint4(FILE* fp) {
    return getNewFromInt4(fp);
}
CNitfProperty* CNitfProperty::getNewFromFloat(FILE* fp) {
    return makeRead([&](CNitfProperty& p) { p.readFloat(fp); });
}
CNitfProperty* CNitfProperty::getNewFromDouble(FILE* fp) {
    return makeRead([&](CNitfProperty& p) { p.readDouble(fp); });
}

// ---- setters
// --------------------------------------------------------------------------------------------------

// A buffer of the pool holding `length` bytes of `text` and a NUL.
static char* copyText(const char* text, size_t length) {
    char* copy = CPropertyPool::allocateText(length + 1);
    std::memcpy(copy, text, length);
    copy[length] = '\0';
    return copy;
}

void CNitfProperty::setString(const char* text) {
    size_t length = text ? std::strlen(text) : 0;
    char* copy = copyText(text ? text : "", length);
    release();
    m_value.text = copy;
    m_count = length;
    m_type = eString;
}

void CNitfProperty::setString(const char* text, int length) {
    if (length < 0)
        length = 0;
    char* copy = copyText(text, static_cast<size_t>(length));
    release();
    m_value.text = copy;
    m_count = static_cast<unsigned __int64>(length);
    m_type = eString;
}

void CNitfProperty::setCharsFromString(const char* text) {
    char* copy = copyText(text ? text : "", text ? std::strlen(text) : 0);
    release();
    m_value.text = copy;
    m_count = std::strlen(copy);
    m_type = eChars;
}

void CNitfProperty::setChars(const char* bytes, int length) {
    setString(bytes, length);
    m_count = length > 0 ? length : 0;
    m_type = eChars;
}

void CNitfProperty::setInt4(int value) {
    release();
    m_value.integer = value;
    m_type = eInt4;
}

void CNitfProperty::setUint1(int value) {
    release();
    m_value.integer = value & 0xFF;
    m_type = eUint1;
}

void CNitfProperty::setUint2(int value) {
    release();
    m_value.integer = value & 0xFFFF;
    m_type = eUint2;
}

void CNitfProperty::setFloat(float value) {
    release();
    m_value.d = 0;
    m_value.f = value;
    m_type = eFloat;
}

void CNitfProperty::setDouble(double value) {
    release();
    m_value.d = value;
    m_type = eDouble;
}

// ---- conversions
// ----------------------------------------------------------------------------------------------

static bool isInteger(CNitfProperty::eDataType type) {
    return type == CNitfProperty::eUint1 || type == CNitfProperty::eUint2 || type == CNitfProperty::eInt4;
}

const char* CNitfProperty::getAsString() {
    switch (m_type) {
    case eString:
        return m_value.text;
    case eChars: {
        std::string hex;
        hex.reserve(m_count * 2);
        static const char digits[] = "0123456789ABCDEF";
        for (unsigned __int64 i = 0; i < m_count; ++i) {
            unsigned char byte = static_cast<unsigned char>(m_value.text[i]);
            hex += digits[byte >> 4];
            hex += digits[byte & 15];
        }
        return MkName("%s", hex.c_str());
    }
    case eUint1:
    case eUint2:
    case eInt4:
        return MkName("%d", m_value.integer);
    case eFloat:
        return MkName("%g", static_cast<double>(m_value.f));
    case eDouble:
        return MkName("%g", m_value.d);
    default:
        NITF_RAISE("Unknown data, can't return as string",
                   "const char *__cdecl CNitfProperty::getAsString(void)");
    }
}

std::string CNitfProperty::toText() {
    if (m_type == eNone)
        return std::string();
    const char* text = getAsString();
    std::string result(text);
    if (m_type != eString)
        free(const_cast<char*>(text));
    return result;
}

int CNitfProperty::getAsInt() {
    if (m_type == eString)
        return nitf_detail::parseInt(m_value.text);
    if (isInteger(m_type))
        return m_value.integer;
    if (m_type == eFloat)
        return nitf_detail::truncateTo<int>(m_value.f, INT_MIN, INT_MAX);
    if (m_type == eDouble)
        return nitf_detail::truncateTo<int>(m_value.d, INT_MIN, INT_MAX);
    NITF_RAISE("Unknown data, can't return as integer", "int __cdecl CNitfProperty::getAsInt(void)");
}

__int64 CNitfProperty::getAsInt64() {
    if (m_type == eString)
        return ScanInt64(m_value.text, -1);
    if (isInteger(m_type))
        return m_value.integer;
    // eFloat is refused here while getAsInt and getAsDouble accept it: kept as the interface has always been.
    if (m_type == eDouble)
        return nitf_detail::truncateTo<__int64>(m_value.d, LLONG_MIN, LLONG_MAX);
    NITF_RAISE("Unknown data, can't return as int64", "__int64 __cdecl CNitfProperty::getAsInt64(void)");
}

double CNitfProperty::getAsDouble() {
    if (m_type == eString)
        return std::atof(m_value.text);
    if (isInteger(m_type))
        return m_value.integer;
    if (m_type == eFloat)
        return m_value.f;
    if (m_type == eDouble)
        return m_value.d;
    NITF_RAISE("Unknown data, can't return as double", "double __cdecl CNitfProperty::getAsDouble(void)");
}

unsigned __int64 CNitfProperty::getLength() {
    switch (m_type) {
    case eString:
        return std::strlen(m_value.text);
    case eChars:
        return m_count;
    case eUint1:
        return 1;
    case eUint2:
        return 2;
    case eInt4:
    case eFloat:
        return 4;
    case eDouble:
        return 8;
    default:
        NITF_RAISE("Unknown data, can't get length.",
                   "unsigned __int64 __cdecl CNitfProperty::getLength(void)");
    }
}

const char* CNitfProperty::getAsSecurityString() {
    std::string code = toText();
    char first = code.empty() ? '\0' : code[0];
    switch (first) {
    case 'U':
        return "Unclassified";
    case 'R':
        return "Restricted";
    case 'C':
        return "Confidential";
    case 'S':
        return "Secret";
    case 'T':
        return "Top Secret";
    case 'X':
        if (code.size() > 1 && code[1] == 'N')
            return "NATO";
        return "Unknown Classification";
    default:
        return "Unknown Classification";
    }
}

// ---- character tests
// ------------------------------------------------------------------------------------------

bool CNitfProperty::isBCSA(char c) {
    return c >= 0x20 && c <= 0x7E;
}

bool CNitfProperty::isBCSA(const char* text, int length) {
    for (int i = 0; i < length; ++i) {
        if (!isBCSA(text[i]))
            return false;
    }
    return true;
}

bool CNitfProperty::isFBKGC() {
    if (m_type != eString && m_type != eChars)
        return false;
    const char* bytes = m_value.text;
    unsigned __int64 available = m_type == eChars ? m_count : std::strlen(bytes);
    if (available < 3)
        return true;
    for (int i = 0; i < 3; ++i) {
        if (!isBCSA(bytes[i]))
            return true;
    }
    return bytes[0] == bytes[1] && bytes[1] == bytes[2];
}

// ---- writers
// --------------------------------------------------------------------------------------------------

void CNitfProperty::writeString(FILE* fp, int width) {
    CDataStreamWrite out(fp);
    if (m_type == eString)
        out.writeText(m_value.text, width);
    else if (isInteger(m_type))
        out.writeDecimal(m_value.integer, width, true);
}

void CNitfProperty::writeInt4(FILE* fp) {
    // Host byte order on purpose: binary fields that must be big-endian are written by their segment's
    // writer.
    if (m_type == eInt4)
        DKFWrite(&m_value.integer, sizeof m_value.integer, 1, fp);
}

// ---- property maps
// --------------------------------------------------------------------------------------------

void DestroyPropertyMap(PropertyMap& map) {
    for (auto& entry : map)
        delete entry.second;
    map.clear();
}

CNitfProperty* FindProperty(const PropertyMap& map, const char* name) {
    auto found = map.find(const_cast<char*>(name));
    return found == map.end() ? nullptr : found->second;
}

void SetProperty(PropertyMap& map, const char* name, CNitfProperty* value) {
    auto inserted = map.emplace(const_cast<char*>(name), value);
    if (inserted.second)
        return;
    if (inserted.first->second != value)
        delete inserted.first->second;
    inserted.first->second = value;
}
