// The field layout of a tagged record extension described as data, and the one engine that reads every
// layout.
//
// A layout is an array of entries in file order: fields (a name and a width), repeated groups (a count taken
// from an earlier field), conditional groups (a test on an earlier field) and the End that closes a group.
// The engine reads each field as one text property holding exactly the field's bytes and stores it under its
// key: the bare name outside repeated groups, the name followed by "_<index>" per enclosing group (outermost
// first) inside them. A name holding "%d" takes the index of its one enclosing group in its place instead.
#pragma once

#include <cstdio>
#include <memory>
#include <vector>

#include "NitfProperty.h"

namespace tre {

enum class Op : unsigned char { Field, Repeat, If, End };

// Where a field's width comes from.
enum class Width : unsigned char {
    Fixed,     // `number` bytes
    OfField,   // the value of the field `ref`
    Product,   // the value of `ref` times the value of `other`
    BitsOf,    // the bytes that hold as many bits as the value of `ref`
    RestOfData // what remains of the TRE's data length
};

// Where a repeated group's count comes from.
enum class Count : unsigned char {
    OfField, // the value of the field `ref`, plus `adjust`
    Fixed,   // `number`
    External // given by the caller of the engine
};

// The test of a conditional group.
enum class Test : unsigned char {
    AnyBit,      // value of `ref` & `number` is not 0
    TextIs,      // the bytes of `ref` equal the text `other`
    TextIsNot,   // ... differ from it
    Odd,         // value of `ref` is odd
    DataLeft,    // at least `number` bytes of the TRE's data length remain
    DataFits,    // the data length is `number` plus a multiple of `adjust`
    DataFitsNot, // ... is not
};

struct Entry {
    Op op;
    unsigned char kind; // Width, Count or Test, by op
    bool binary;        // Field: its value is a big-endian unsigned integer, not decimal text
    const char* name;   // Field: the name (and key base)
    const char* ref;    // the field that the width, count or test refers to
    const char* other;  // Width::Product: the second field; Test::TextIs/TextIsNot: the text
    long long number;   // fixed width, fixed count, bit mask or byte count
    int adjust;         // Count::OfField: added to the count; Test::DataFits: the step
    int firstIndex;     // Repeat: the index of the first repetition
};

// ---- layout builders
// -----------------------------------------------------------------------------------------------

constexpr Entry Text(const char* name, int width) {
    return {Op::Field, static_cast<unsigned char>(Width::Fixed), false, name, nullptr, nullptr, width, 0, 0};
}
// A big-endian unsigned binary integer; kept as its bytes like every field, read as a number when referred
// to.
constexpr Entry Binary(const char* name, int width) {
    return {Op::Field, static_cast<unsigned char>(Width::Fixed), true, name, nullptr, nullptr, width, 0, 0};
}
constexpr Entry TextSizedBy(const char* name, const char* widthField) {
    return {Op::Field, static_cast<unsigned char>(Width::OfField), false, name, widthField, nullptr, 0, 0, 0};
}
constexpr Entry TextSizedByProduct(const char* name, const char* a, const char* b) {
    return {Op::Field, static_cast<unsigned char>(Width::Product), false, name, a, b, 0, 0, 0};
}
constexpr Entry TextSizedByBits(const char* name, const char* bitCountField) {
    return {Op::Field, static_cast<unsigned char>(Width::BitsOf), false, name, bitCountField, nullptr, 0, 0,
            0};
}
constexpr Entry RestOfData(const char* name) {
    return {Op::Field, static_cast<unsigned char>(Width::RestOfData), false, name, nullptr, nullptr, 0, 0, 0};
}

constexpr Entry Repeat(const char* countField, int adjust = 0, int firstIndex = 1) {
    return {Op::Repeat, static_cast<unsigned char>(Count::OfField),
            false,      nullptr,
            countField, nullptr,
            0,          adjust,
            firstIndex};
}
constexpr Entry RepeatFixed(int count, int firstIndex = 1) {
    return {Op::Repeat, static_cast<unsigned char>(Count::Fixed), false, nullptr, nullptr, nullptr, count, 0,
            firstIndex};
}
constexpr Entry RepeatExternal() {
    return {Op::Repeat, static_cast<unsigned char>(Count::External), false, nullptr, nullptr, nullptr, 0, 0,
            1};
}

constexpr Entry IfAnyBit(const char* field, unsigned long long mask) {
    return {Op::If,
            static_cast<unsigned char>(Test::AnyBit),
            false,
            nullptr,
            field,
            nullptr,
            static_cast<long long>(mask),
            0,
            0};
}
constexpr Entry IfText(const char* field, const char* text) {
    return {Op::If, static_cast<unsigned char>(Test::TextIs), false, nullptr, field, text, 0, 0, 0};
}
constexpr Entry IfTextNot(const char* field, const char* text) {
    return {Op::If, static_cast<unsigned char>(Test::TextIsNot), false, nullptr, field, text, 0, 0, 0};
}
constexpr Entry IfOdd(const char* field) {
    return {Op::If, static_cast<unsigned char>(Test::Odd), false, nullptr, field, nullptr, 0, 0, 0};
}
constexpr Entry IfDataLeft(int bytes) {
    return {Op::If, static_cast<unsigned char>(Test::DataLeft), false, nullptr, nullptr, nullptr, bytes, 0,
            0};
}
constexpr Entry IfDataFits(int base, int step) {
    return {Op::If, static_cast<unsigned char>(Test::DataFits), false, nullptr, nullptr, nullptr, base, step,
            0};
}
constexpr Entry IfDataFitsNot(int base, int step) {
    return {
        Op::If, static_cast<unsigned char>(Test::DataFitsNot), false, nullptr, nullptr, nullptr, base, step,
        0};
}

constexpr Entry End() {
    return {Op::End, 0, false, nullptr, nullptr, nullptr, 0, 0, 0};
}

// ---- the engine
// ----------------------------------------------------------------------------------------------------

// A layout checked and prepared once: group ends matched, field references resolved, minimal group widths
// known. A malformed table raises vexo::Exception (a fault of the library, caught by its tests).
class Layout {
public:
    template <size_t N> explicit Layout(const Entry (&entries)[N]) : Layout(entries, static_cast<int>(N)) {}
    Layout(const Entry* entries, int count);

    struct Node {
        const Entry* entry;
        int end;      // Repeat/If: index of the matching End
        int ref;      // index of the field named by entry->ref, or -1
        int other;    // index of the field named by entry->other (Width::Product), or -1
        int depth;    // number of enclosing repeated groups
        int minWidth; // Repeat: bytes one repetition needs at the least
    };
    const std::vector<Node>& nodes() const { return m_nodes; }
    int maxDepth() const { return m_maxDepth; }

private:
    int findField(int from, const char* name) const;
    int minimalWidth(int begin, int end) const;

    std::vector<Node> m_nodes;
    int m_maxDepth;
};

// The keys the reader had to build (those of repeated fields): allocated once, kept until the last extension
// sharing them goes.
class KeyStore {
public:
    KeyStore() = default;
    KeyStore(const KeyStore&) = delete;
    KeyStore& operator=(const KeyStore&) = delete;

    // A stable copy of `key`.
    char* add(const char* key, size_t length);

private:
    std::vector<std::unique_ptr<char[]>> m_blocks;
    size_t m_used = 0;
    size_t m_capacity = 0;
};

// Reads `layout` from the stream's position into `properties`, replacing values of the same keys.
// `dataLength` is the TRE's length (CEL) for the fields and tests that depend on it; fields may run past it,
// never past the end of the file: a field cut by the end of the file keeps the bytes there are, and reading
// stops. Leaves the stream after the bytes consumed and returns their number.
__int64 readLayout(FILE* fp, const Layout& layout, __int64 dataLength, PropertyMap& properties,
                   KeyStore& keys, __int64 externalCount = 0);

// Bytes from the stream's position to the end of the file (0 when that cannot be told). Streams the host
// cannot size (in memory, for one) are asked themselves.
__int64 bytesLeft(FILE* fp);

// The value of a field's bytes: a big-endian unsigned integer, or decimal text converted like atoi (0 when
// not numeric).
__int64 fieldValue(const char* bytes, size_t length, bool binary);

} // namespace tre
