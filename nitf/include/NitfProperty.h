// One field value of a header, sub-header or tagged record: text, raw bytes, a binary integer or a float.
#pragma once

#include <cstdio>
#include <cstring>
#include <map>
#include <string>

#include "HostCompat.h"

class CNitfProperty {
public:
    // The numbers are part of the interface: several operations test ranges of them.
    enum eDataType {
        eString = 0, // NUL-terminated text in an owned buffer
        eChars = 1,  // raw bytes in an owned buffer, with a byte count
        eUint1 = 2,  // unsigned 8-bit integer
        eUint2 = 3,  // unsigned 16-bit integer
        eInt4 = 4,   // 32-bit integer (also what unsigned 32-bit values are read as)
        eFloat = 5,  // 32-bit IEEE float
        eDouble = 6, // 64-bit IEEE double
        eNone = 7,   // nothing
    };

    CNitfProperty();
    explicit CNitfProperty(int value);
    explicit CNitfProperty(const char* text);
    ~CNitfProperty();

    // Copies the three members as they stand: a text buffer is shared, not duplicated. Callers never destroy
    // both.
    CNitfProperty& operator=(const CNitfProperty& other);
    CNitfProperty(const CNitfProperty& other);

    // Values come from pooled storage: a file's headers hold thousands of them.
    static void* operator new(size_t size);
    static void operator delete(void* object);

    // Readers: each releases the old value first. Binary values are big-endian in the file.
    void readString(FILE* fp, int length);
    void readChars(FILE* fp, int length);
    void readUint1(FILE* fp);
    void readUint2(FILE* fp);
    void readInt4(FILE* fp);
    void readFloat(FILE* fp);
    void readDouble(FILE* fp);

    // Factories filled like the reader of the same name; the caller owns the result.
    static CNitfProperty* getNewFromString(FILE* fp, int length);
    static CNitfProperty* getNewFromChars(FILE* fp, int length);
    static CNitfProperty* getNewFromUint1(FILE* fp);
    static CNitfProperty* getNewFromUint2(FILE* fp);
    static CNitfProperty* getNewFromInt4(FILE* fp);
    static CNitfProperty* getNewFromUint4(FILE* fp);
    static CNitfProperty* getNewFromFloat(FILE* fp);
    static CNitfProperty* getNewFromDouble(FILE* fp);

    // Setters (each releases first).
    void setString(const char* text);
    // Text of exactly `length` bytes taken from `text` (which need not be terminated).
    void setString(const char* text, int length);
    void setCharsFromString(const char* text);
    // Raw bytes (eChars) copied from `bytes`.
    void setChars(const char* bytes, int length);
    void setInt4(int value);
    void setUint1(int value);
    void setUint2(int value);
    void setFloat(float value);
    void setDouble(double value);

    eDataType getDataType() const { return m_type; }
    // The owned buffer of an eString or eChars value (null for other kinds); getLength() tells its size.
    const char* getBytes() const { return m_type == eString || m_type == eChars ? m_value.text : nullptr; }
    // The bytes an eString or eChars value holds as it was set or read, NULs included (getLength() of an
    // eString stops at its first NUL); 0 for other kinds.
    size_t getStoredLength() const {
        return m_type == eString || m_type == eChars ? static_cast<size_t>(m_count) : 0;
    }
    float getFloat() const { return m_value.f; }
    double getDouble() const { return m_value.d; }

    // Conversions. getAsString returns the property's own text for eString (do not free it) and a new string,
    // released with free(), for every other kind.
    const char* getAsString();
    int getAsInt();
    __int64 getAsInt64();
    double getAsDouble();
    unsigned __int64 getLength();

    // The value as text in a std::string, whatever the kind (an empty text for eNone).
    std::string toText();

    // The classification word of a security code ("Unclassified", "Secret", "NATO", ...).
    const char* getAsSecurityString();

    static bool isBCSA(char c);
    static bool isBCSA(const char* text, int length);
    // For the file background colour: true when the value holds the three binary colour bytes rather than
    // text.
    bool isFBKGC();

    // Writes exactly `width` bytes: text left-justified and blank-filled, integers right-justified and
    // zero-filled. Other kinds write nothing.
    void writeString(FILE* fp, int width);
    // Writes an eInt4 value's four bytes in host order (not swapped); other kinds write nothing.
    void writeInt4(FILE* fp);

private:
    void baseConstruct();
    void release();
    // A new buffer of `length` bytes read from the stream (zeros where the file ends) and a NUL.
    static char* allocateBuffer(int length, FILE* fp);

    union Value {
        char* text;
        int integer;
        float f;
        double d;
    } m_value;
    unsigned __int64 m_count;
    eDataType m_type;
};

// Orders field names by strcmp (written out inline: field names are short and maps are searched a lot).
struct ltstr {
    bool operator()(const char* a, const char* b) const {
        while (*a && *a == *b) {
            ++a;
            ++b;
        }
        return static_cast<unsigned char>(*a) < static_cast<unsigned char>(*b);
    }
};

// Field name to value. Keys are constant names (not freed with the map); the map's holder owns the values.
typedef std::map<char*, CNitfProperty*, ltstr> PropertyMap;

// Deletes every value of the map and empties it (keys are not freed).
void DestroyPropertyMap(PropertyMap& map);

// The value stored under `name`, or null. Unlike operator[], nothing is inserted.
CNitfProperty* FindProperty(const PropertyMap& map, const char* name);

// Stores `value` under `name`, deleting any earlier value of that name; the map takes ownership of `value`.
void SetProperty(PropertyMap& map, const char* name, CNitfProperty* value);
