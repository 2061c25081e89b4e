// Records described as data, and the one walk that reads, writes and measures them.
//
// A layout is a list of entries in file order: fields (a name, a width and the form of their bytes), repeated
// groups (a count taken from an earlier field), conditional groups (a test on an earlier field) and the End
// that closes a group. Headers, sub-headers, TREs and binary records are all described this way. Reading,
// writing and measuring walk the same entries, so a record's measured length is, by construction, the number
// of bytes its writer produces; only where the bytes come from and go to differs (a file, a counter, or a
// nitf::CSerializer for binary records).
//
// Keys: a field outside repeated groups is kept under its bare name; inside them under the name followed by
// "_<index>" per enclosing group (outermost first), or, for a group of band fields, by the band number padded
// as CNitfImageSubheader::bandFieldName pads it. A name holding "%d" takes the index of its one enclosing
// group in its place instead.
#pragma once

#include <cstdio>
#include <initializer_list>
#include <string>
#include <vector>

#include "KeyStore.h"
#include "NitfField.h"
#include "NitfProperty.h"

namespace nitf {
class CSerializer;
}

namespace record {

enum class Op : unsigned char { Field, Repeat, If, End };

// Where a field's width comes from.
enum class Width : unsigned char {
    Fixed,     // `number` bytes
    OfField,   // the value of the field `ref` times `number` (when above 1), or plus `adjust`
    Product,   // the value of `ref` times the value of `other`
    BitsOf,    // the bytes that hold as many bits as the value of `ref`
    RestOfData // what remains of the record's data length
};

// Where a repeated group's count comes from.
enum class Count : unsigned char {
    OfField, // the value of `ref` plus `adjust`; when that is 0 and `other` is named, the value of `other`
    Fixed,   // `number`
    External // given by the caller of the walk
};

// The test of a conditional group.
enum class Test : unsigned char {
    AnyBit,      // value of `ref` & `number` is not 0
    NotZero,     // value of `ref` is not 0
    Odd,         // value of `ref` is odd
    TextIs,      // the bytes of `ref` equal the text `other` (ignoring case when `number` is 1)
    TextIsNot,   // ... differ from it
    TextIn,      // the bytes of `ref` equal one of the words of `other`, separated by '|'
    Call,        // `call` returns true for the bytes of `ref`
    DataLeft,    // at least `number` bytes of the record's data length remain
    DataFits,    // the data length is `number` plus a multiple of `adjust`
    DataFitsNot, // ... is not
};

// How a field is kept and written.
enum Flags : unsigned char {
    kTyped = 1, // kept as a typed value (eChars, eUint1, eUint2, eInt4, eFloat, eDouble), not as its bytes
    kNotKept =
        2,     // not kept in the map: the walk reports only its place (comments, look-up tables, TRE areas)
    kHole = 4, // written only when it has a value; otherwise its bytes are left for someone else to fill
    kBandKeys = 8, // Repeat: keys carry the band number, padded to the width of the count
    kLoaded = 16   // a field not kept whose bytes the walk reports with its place (TRE areas)
};

struct Entry {
    Op op;
    unsigned char kind; // Width, Count or Test, by op
    unsigned char form; // eNitfFieldForm_t of a field
    unsigned char flags;
    const char* name;  // Field: the name (and key base)
    const char* ref;   // the field that the width, count or test refers to
    const char* other; // Width::Product: the second field; Count::OfField: the fallback; Test: the text
    long long number;  // fixed width, fixed count, bit mask or byte count
    int adjust;        // Width/Count::OfField: added to the value; Test::DataFits: the step
    int firstIndex;    // Repeat: the index of the first repetition
    bool (*call)(const char* bytes, size_t length);
};

// ---- layout builders
// -----------------------------------------------------------------------------------------------

constexpr Entry field(const char* name, Width width, eNitfFieldForm_t form, long long number,
                      unsigned char flags = 0, const char* ref = nullptr, const char* other = nullptr,
                      int adjust = 0) {
    return {Op::Field,
            static_cast<unsigned char>(width),
            static_cast<unsigned char>(form),
            flags,
            name,
            ref,
            other,
            number,
            adjust,
            0,
            nullptr};
}

// Text of a fixed width, kept as it stands.
constexpr Entry Text(const char* name, int width, unsigned char flags = 0) {
    return field(name, Width::Fixed, eFieldText, width, flags);
}
// Opaque bytes: kept as their bytes, or as an eChars value when typed.
constexpr Entry Bytes(const char* name, int width, unsigned char flags = 0) {
    return field(name, Width::Fixed, eFieldBytes, width, flags);
}
// Big-endian binary numbers of 1, 2, 4 or 8 bytes.
constexpr Entry Unsigned(const char* name, int width, unsigned char flags = 0) {
    return field(name, Width::Fixed, eFieldUnsigned, width, flags);
}
constexpr Entry Signed(const char* name, int width, unsigned char flags = 0) {
    return field(name, Width::Fixed, eFieldSigned, width, flags);
}
constexpr Entry Float(const char* name, unsigned char flags = 0) {
    return field(name, Width::Fixed, eFieldFloat, 4, flags);
}
constexpr Entry Double(const char* name, unsigned char flags = 0) {
    return field(name, Width::Fixed, eFieldDouble, 8, flags);
}
// A field not kept in the map, only placed: `width` bytes.
constexpr Entry Place(const char* name, int width) {
    return field(name, Width::Fixed, eFieldBytes, width, kNotKept);
}
// A TRE area of a header: its bytes, sized by the area's length field less the overflow number's 3 bytes,
// reported with its place.
constexpr Entry TagArea(const char* name, const char* lengthField) {
    return field(name, Width::OfField, eFieldBytes, 0, kNotKept | kLoaded, lengthField, nullptr, -3);
}
// Fields whose width is the value of an earlier field (plus `adjust`).
constexpr Entry TextSizedBy(const char* name, const char* widthField, int adjust = 0,
                            unsigned char flags = 0) {
    return field(name, Width::OfField, eFieldText, 0, flags, widthField, nullptr, adjust);
}
constexpr Entry PlaceSizedBy(const char* name, const char* widthField, int adjust = 0) {
    return field(name, Width::OfField, eFieldBytes, 0, kNotKept, widthField, nullptr, adjust);
}
constexpr Entry TextSizedByProduct(const char* name, const char* a, const char* b) {
    return field(name, Width::Product, eFieldText, 0, 0, a, b);
}
constexpr Entry PlaceSizedByProduct(const char* name, const char* a, const char* b) {
    return field(name, Width::Product, eFieldBytes, 0, kNotKept, a, b);
}
constexpr Entry BytesSizedByBits(const char* name, const char* bitCountField) {
    return field(name, Width::BitsOf, eFieldBytes, 0, 0, bitCountField);
}
constexpr Entry RestOfData(const char* name) {
    return field(name, Width::RestOfData, eFieldText, 0);
}

constexpr Entry Repeat(const char* countField, int adjust = 0, int firstIndex = 1) {
    return {Op::Repeat, static_cast<unsigned char>(Count::OfField),
            0,          0,
            nullptr,    countField,
            nullptr,    0,
            adjust,     firstIndex,
            nullptr};
}
// Band fields: as many as the value of `countField`, or of `fallbackField` when that is 0; keyed by band.
constexpr Entry RepeatBands(const char* countField, const char* fallbackField) {
    return {Op::Repeat,
            static_cast<unsigned char>(Count::OfField),
            0,
            kBandKeys,
            nullptr,
            countField,
            fallbackField,
            0,
            0,
            1,
            nullptr};
}
constexpr Entry RepeatFixed(int count, int firstIndex = 1) {
    return {Op::Repeat, static_cast<unsigned char>(Count::Fixed),
            0,          0,
            nullptr,    nullptr,
            nullptr,    count,
            0,          firstIndex,
            nullptr};
}
constexpr Entry RepeatExternal() {
    return {Op::Repeat, static_cast<unsigned char>(Count::External), 0, 0, nullptr, nullptr, nullptr, 0, 0, 1,
            nullptr};
}

constexpr Entry If(Test test, const char* field, const char* text, long long number, int step = 0) {
    return {Op::If, static_cast<unsigned char>(test), 0, 0, nullptr, field, text, number, step, 0, nullptr};
}
constexpr Entry IfAnyBit(const char* field, unsigned long long mask) {
    return If(Test::AnyBit, field, nullptr, static_cast<long long>(mask));
}
constexpr Entry IfNotZero(const char* field) {
    return If(Test::NotZero, field, nullptr, 0);
}
constexpr Entry IfOdd(const char* field) {
    return If(Test::Odd, field, nullptr, 0);
}
constexpr Entry IfText(const char* field, const char* text) {
    return If(Test::TextIs, field, text, 0);
}
constexpr Entry IfTextIgnoringCase(const char* field, const char* text) {
    return If(Test::TextIs, field, text, 1);
}
constexpr Entry IfTextNot(const char* field, const char* text) {
    return If(Test::TextIsNot, field, text, 0);
}
constexpr Entry IfTextIn(const char* field, const char* words) {
    return If(Test::TextIn, field, words, 0);
}
constexpr Entry IfCall(const char* field, bool (*call)(const char*, size_t)) {
    return {Op::If, static_cast<unsigned char>(Test::Call), 0, 0, nullptr, field, nullptr, 0, 0, 0, call};
}
constexpr Entry IfDataLeft(int bytes) {
    return If(Test::DataLeft, nullptr, nullptr, bytes);
}
constexpr Entry IfDataFits(int base, int step) {
    return If(Test::DataFits, nullptr, nullptr, base, step);
}
constexpr Entry IfDataFitsNot(int base, int step) {
    return If(Test::DataFitsNot, nullptr, nullptr, base, step);
}

constexpr Entry End() {
    return {Op::End, 0, 0, 0, nullptr, nullptr, nullptr, 0, 0, 0, nullptr};
}

// A run of entries: one table, or a part of one that several layouts share.
struct Part {
    const Entry* entries;
    size_t count;
    template <size_t N> constexpr Part(const Entry (&table)[N]) : entries(table), count(N) {}
    constexpr Part(const Entry* table, size_t n) : entries(table), count(n) {}
    // A group built at run time (the security fields of a prefix); the vector outlives the layout.
    Part(const std::vector<Entry>& group) : entries(group.data()), count(group.size()) {}
};

// Where a field that is not kept (or any field, when asked) lay in the walk.
struct Placed {
    const Entry* entry;
    __int64 offset; // absolute in the file (or the serializer's position)
    __int64 width;
    long long index;   // the number of its innermost repetition (0 outside repeated groups)
    std::string bytes; // read: the bytes of a field marked kLoaded
};

// What a walk reports besides the map. Every member is optional.
struct Report {
    std::vector<NitfField_t>* fields = nullptr; // kept fields, in file order
    std::vector<Placed>* places = nullptr;      // fields not kept, and holes, in file order
    __int64* start = nullptr;                   // reading: where the record began
};

} // namespace record

// A layout checked and prepared once: group ends matched, field references resolved, minimal group widths
// known. A malformed table raises vexo::Exception (a fault of the library, caught by its tests).
class CRecordLayout {
public:
    CRecordLayout(std::initializer_list<record::Part> parts);
    template <size_t N>
    explicit CRecordLayout(const record::Entry (&entries)[N]) : CRecordLayout({record::Part(entries)}) {}
    CRecordLayout(const CRecordLayout&) = delete;
    CRecordLayout& operator=(const CRecordLayout&) = delete;

    // Reads the fields at the stream's position into `map`, replacing values of the same keys; keys built for
    // repeated fields go to `keys`. `dataLength` is the record's own length (a TRE's CEL) for the fields and
    // tests that depend on it, or -1. Reading stops at the end of the file, at `limit` bytes when that is not
    // negative, and at 99999 bytes past the data length for TREs: a field cut there keeps the bytes there are
    // (a fixed-width one padded with zeros), later fields are absent. Leaves the stream after the bytes
    // consumed and returns their number.
    __int64 read(FILE* fp, PropertyMap& map, CKeyStore& keys, const record::Report& report = {},
                 __int64 dataLength = -1, __int64 limit = -1, __int64 externalCount = 0) const;

    // Writes the fields at the stream's position, each value taken from `overrides` when it holds the key,
    // else from `map`. A field without a value is written as blanks (zeros for binary forms), or left as a
    // hole when it is not kept or marked as one. A number that does not fit its width raises
    // vexo::Exception. Returns the bytes written (holes included).
    __int64 write(FILE* fp, const PropertyMap& map, const PropertyMap* overrides = nullptr,
                  const record::Report& report = {}) const;

    // The bytes `write` produces for the same values.
    __int64 length(const PropertyMap& map, const PropertyMap* overrides = nullptr) const;

    // Appends the fields of `map` that this layout holds, in file order, as read from `offset`: listing them
    // after reading costs nothing while nobody asks.
    void listFields(const PropertyMap& map, __int64 offset, std::vector<NitfField_t>& fields) const;

    // The same walks over the binary serializer family (binary forms through its typed operators, text and
    // bytes as arrays): reading fills `map`, writing takes its values from it.
    void deserialize(nitf::CSerializer& in, PropertyMap& map, CKeyStore& keys,
                     __int64 externalCount = 0) const;
    void serialize(nitf::CSerializer& out, const PropertyMap& map) const;

    struct Node {
        const record::Entry* entry;
        int end;            // Repeat/If: index of the matching End; End: index of its group
        int ref;            // index of the field named by entry->ref, or -1
        int other;          // index of the field named by entry->other (Product, Count fallback), or -1
        int depth;          // number of enclosing repeated groups
        long long minWidth; // Repeat: bytes one repetition needs at the least
        int span;           // the slot that keeps this field's value for later entries, or -1
        int rank;           // a kept field outside repeated groups: its key's place among those keys, or -1
    };
    const std::vector<Node>& nodes() const { return m_nodes; }
    int maxDepth() const { return m_maxDepth; }
    int spanCount() const { return m_spanCount; }
    int rankCount() const { return m_rankCount; }
    // Bytes that every record of this layout takes at the least.
    long long minimalLength() const { return m_minimalLength; }

private:
    int findField(int from, const char* name) const;
    void keepValue(int field);
    void rankKeys();
    long long minimalWidth(int begin, int end) const;

    std::vector<record::Entry> m_entries;
    std::vector<Node> m_nodes;
    int m_maxDepth = 0;
    int m_spanCount = 0;
    int m_rankCount = 0;
    long long m_minimalLength = 0;
};

// The value of a field's bytes: a big-endian integer (signed or not), or decimal text converted like atoi (0
// when not numeric). Kept well inside the 64-bit range, so that counts and widths can be adjusted without
// overflow.
__int64 recordFieldValue(const char* bytes, size_t length, eNitfFieldForm_t form);
