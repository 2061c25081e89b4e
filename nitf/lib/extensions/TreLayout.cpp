#include "TreLayout.h"

#include <algorithm>
#include <cstring>
#include <string>

#include "DataStream.h"

#include "HostFile.h"
#include "Raise.h"

static const char kSourceFile[] = "nitf/lib/extensions/TreLayout";

namespace tre {

// No TRE can declare more data than five CEL digits hold; reading on past a TRE's end stops there as well.
static const __int64 kLargestTre = 99999;
// Limits that keep keys in a fixed buffer: names of at most 64 characters, at most 4 nested repeated groups.
static const size_t kLongestName = 64;
static const int kDeepestNesting = 4;

static void tableFault(const char* what, const char* name) {
    NITF_RAISE_FORMAT("__cdecl tre::Layout::Layout(const struct tre::Entry *,int)",
                      "TRE layout table: %s (%s)", what, name ? name : "-");
}

// ---- the checked layout
// --------------------------------------------------------------------------------------------

// Faults of a single entry, whatever its place.
static void checkEntry(const Entry& entry, int depth) {
    if (entry.op == Op::Field) {
        if (!entry.name || std::strlen(entry.name) > kLongestName)
            tableFault("a field needs a name of at most 64 characters", entry.name);
        if (entry.binary && (entry.number < 1 || entry.number > 8))
            tableFault("a binary field is 1 to 8 bytes wide", entry.name);
        if (static_cast<Width>(entry.kind) == Width::Fixed && entry.number < 0)
            tableFault("negative width", entry.name);
        if (std::strstr(entry.name, "%d") && depth != 1)
            tableFault("an indexed name belongs in exactly one repeated group", entry.name);
    }
    if (entry.op == Op::If &&
        (static_cast<Test>(entry.kind) == Test::DataFits ||
         static_cast<Test>(entry.kind) == Test::DataFitsNot) &&
        entry.adjust <= 0)
        tableFault("a data length test needs a positive step", nullptr);
}

Layout::Layout(const Entry* entries, int count) : m_maxDepth(0) {
    m_nodes.reserve(count);
    std::vector<int> open;
    int depth = 0;
    for (int i = 0; i < count; ++i) {
        const Entry& entry = entries[i];
        checkEntry(entry, depth);
        Node node = {&entry, -1, -1, -1, depth, 0};
        if (entry.op == Op::End) {
            if (open.empty())
                tableFault("End without a group", nullptr);
            int begin = open.back();
            open.pop_back();
            m_nodes[begin].end = i;
            node.end = begin; // an End points back at its group
            if (m_nodes[begin].entry->op == Op::Repeat)
                --depth;
            node.depth = depth;
        } else if (entry.op != Op::Field) {
            open.push_back(i);
            if (entry.op == Op::Repeat && ++depth > kDeepestNesting)
                tableFault("repeated groups nested too deep", nullptr);
            m_maxDepth = std::max(m_maxDepth, depth);
        }
        m_nodes.push_back(node);
    }
    if (!open.empty())
        tableFault("group without End", nullptr);

    for (int i = 0; i < count; ++i) {
        Node& node = m_nodes[i];
        const Entry& entry = *node.entry;
        if (entry.ref) {
            node.ref = findField(i, entry.ref);
            if (node.ref < 0)
                tableFault("reference to no earlier field", entry.ref);
        }
        if (entry.op == Op::Field && static_cast<Width>(entry.kind) == Width::Product) {
            node.other = findField(i, entry.other);
            if (node.other < 0)
                tableFault("reference to no earlier field", entry.other);
        }
        if (entry.op == Op::Repeat)
            node.minWidth = minimalWidth(i + 1, node.end);
    }
}

// The nearest field of that name before `from` that is still in scope there: fields of groups already closed
// at `from` (earlier repetitions, sister branches) are not.
int Layout::findField(int from, const char* name) const {
    for (int j = from - 1; j >= 0; --j) {
        const Node& node = m_nodes[j];
        if (node.entry->op == Op::End)
            j = node.end; // skip the closed group; the loop steps past its opening entry
        else if (node.entry->op == Op::Field && std::strcmp(node.entry->name, name) == 0)
            return j;
    }
    return -1;
}

// Bytes the entries [begin, end) take at the least: their unconditional fixed-width fields.
int Layout::minimalWidth(int begin, int end) const {
    int width = 0;
    for (int i = begin; i < end; ++i) {
        const Node& node = m_nodes[i];
        if (node.entry->op == Op::Field) {
            if (static_cast<Width>(node.entry->kind) == Width::Fixed)
                width += static_cast<int>(node.entry->number);
        } else if (node.entry->op != Op::End) {
            i = node.end; // a group may be absent or repeated zero times
        }
    }
    return width;
}

// ---- keys
// ----------------------------------------------------------------------------------------------------------

char* KeyStore::add(const char* key, size_t length) {
    static const size_t kBlock = 4096;
    if (m_used + length + 1 > m_capacity) {
        size_t size = std::max(kBlock, length + 1);
        m_blocks.emplace_back(new char[size]);
        m_used = 0;
        m_capacity = size;
    }
    char* copy = m_blocks.back().get() + m_used;
    std::memcpy(copy, key, length);
    copy[length] = '\0';
    m_used += length + 1;
    return copy;
}

__int64 bytesLeft(FILE* fp) {
    return CDataStream::remaining(fp);
}

// ---- field values
// --------------------------------------------------------------------------------------------------

__int64 fieldValue(const char* bytes, size_t length, bool binary) {
    if (binary) {
        unsigned long long value = 0;
        for (size_t i = 0; i < length && i < 8; ++i)
            value = (value << 8) | static_cast<unsigned char>(bytes[i]);
        return static_cast<__int64>(std::min<unsigned long long>(value, 1ULL << 62));
    }
    char text[32];
    size_t n = std::min(length, sizeof text - 1);
    std::memcpy(text, bytes, n);
    text[n] = '\0';
    // Kept well inside the 64-bit range, so that counts and widths can be adjusted without overflow.
    const long long kLimit = 1LL << 62;
    return std::max(-kLimit, std::min(kLimit, std::strtoll(text, nullptr, 10)));
}

// ---- the reader
// ----------------------------------------------------------------------------------------------------

namespace {

// The bytes from the stream's position on, loaded in as few reads as possible and never past the end of the
// file or the reading limit.
class Input {
public:
    Input(FILE* fp, __int64 limit, __int64 expected) : m_fp(fp), m_start(DKFTell(fp)) {
        m_available = m_start >= 0 ? std::min(bytesLeft(fp), limit) : 0;
        load(static_cast<size_t>(std::min(expected, m_available)));
    }

    // Takes up to `width` bytes at the cursor; returns how many there were and where they are.
    size_t take(__int64 width, size_t* offset) {
        size_t n = static_cast<size_t>(std::max<__int64>(0, std::min(width, remaining())));
        if (m_position + n > m_loaded)
            load(std::max(m_position + n, std::min(m_loaded * 2, static_cast<size_t>(m_available))));
        n = std::min(n, m_loaded - m_position);
        *offset = m_position;
        m_position += n;
        return n;
    }
    const char* at(size_t offset) const { return m_buffer.empty() ? "" : m_buffer.data() + offset; }
    __int64 consumed() const { return static_cast<__int64>(m_position); }
    __int64 remaining() const { return m_available - consumed(); }
    // Leaves the stream just after the bytes taken.
    void finish() { DKFSeek64(m_fp, m_start + consumed(), SEEK_SET); }

private:
    void load(size_t upTo) {
        if (upTo <= m_loaded)
            return;
        m_buffer.resize(upTo);
        size_t got = DKFRead(m_buffer.data() + m_loaded, 1, upTo - m_loaded, m_fp);
        m_loaded += got;
        if (m_loaded < upTo) // the file is shorter than it said
            m_available = static_cast<__int64>(m_loaded);
    }

    FILE* m_fp;
    __int64 m_start;
    __int64 m_available;
    std::vector<char> m_buffer;
    size_t m_loaded = 0;
    size_t m_position = 0;
};

class Reader {
    using Node = Layout::Node;

public:
    Reader(const Layout& layout, Input& input, __int64 dataLength, PropertyMap& properties, KeyStore& keys,
           __int64 externalCount)
        : m_nodes(layout.nodes()), m_input(input), m_dataLength(dataLength), m_properties(properties),
          m_keys(keys), m_externalCount(externalCount), m_spans(m_nodes.size()),
          m_indices(layout.maxDepth()) {}

    void read() { readRange(0, static_cast<int>(m_nodes.size())); }

private:
    struct Span {
        size_t offset = 0;
        size_t length = 0;
        bool read = false;
    };

    void readRange(int begin, int end) {
        for (int i = begin; i < end && !m_stopped; ++i) {
            const Node& node = m_nodes[i];
            switch (node.entry->op) {
            case Op::Field:
                readField(i);
                break;
            case Op::Repeat:
                readRepeat(i);
                i = node.end;
                break;
            case Op::If:
                if (passes(node))
                    readRange(i + 1, node.end);
                i = node.end;
                break;
            case Op::End:
                break;
            }
        }
    }

    void readField(int index) {
        const Node& node = m_nodes[index];
        __int64 width = fieldWidth(node);
        Span& span = m_spans[index];
        size_t got = m_input.take(width, &span.offset);
        if (static_cast<__int64>(got) < width) {
            // The end of the file (or of the reading limit): a field cut by it keeps the bytes there are, one
            // wholly past it is absent, and reading stops.
            m_stopped = true;
            if (got == 0)
                return;
        }
        span.length = got;
        span.read = true;
        store(node, m_input.at(span.offset), got);
    }

    void readRepeat(int index) {
        const Node& node = m_nodes[index];
        __int64 count = repeatCount(node);
        // Every repetition takes at least minWidth bytes: no more of them than the bytes left can feed (one
        // more may start and come out short).
        if (node.minWidth > 0)
            count = std::min(count, m_input.remaining() / node.minWidth + 1);
        for (__int64 n = 0; n < count && !m_stopped; ++n) {
            for (int i = index + 1; i < node.end; ++i)
                m_spans[i].read = false;
            m_indices[node.depth] = node.entry->firstIndex + n;
            __int64 before = m_input.consumed();
            readRange(index + 1, node.end);
            // A repetition that consumed nothing depends on nothing that changes: the following ones would be
            // the same again.
            if (m_input.consumed() == before)
                break;
        }
    }

    __int64 fieldWidth(const Node& node) const {
        const Entry& entry = *node.entry;
        switch (static_cast<Width>(entry.kind)) {
        case Width::Fixed:
            return entry.number;
        case Width::OfField:
            return std::max<__int64>(0, value(node.ref));
        case Width::Product: {
            __int64 a = std::max<__int64>(0, value(node.ref));
            __int64 b = std::max<__int64>(0, value(node.other));
            // A product beyond the readable bytes makes the field run to their end anyway.
            __int64 limit = m_input.remaining() + 1;
            if (a == 0 || b == 0)
                return 0;
            return a > limit / b ? limit : a * b;
        }
        case Width::BitsOf: {
            __int64 bits = std::max<__int64>(0, value(node.ref));
            return bits / 8 + (bits % 8 != 0);
        }
        case Width::RestOfData:
            return std::max<__int64>(0, m_dataLength - m_input.consumed());
        }
        return 0;
    }

    __int64 repeatCount(const Node& node) const {
        switch (static_cast<Count>(node.entry->kind)) {
        case Count::OfField:
            return std::max<__int64>(0, value(node.ref) + node.entry->adjust);
        case Count::Fixed:
            return node.entry->number;
        case Count::External:
            return std::max<__int64>(0, m_externalCount);
        }
        return 0;
    }

    bool passes(const Node& node) const {
        const Entry& entry = *node.entry;
        switch (static_cast<Test>(entry.kind)) {
        case Test::AnyBit:
            return (value(node.ref) & entry.number) != 0;
        case Test::TextIs:
            return textIs(node.ref, entry.other);
        case Test::TextIsNot:
            return !textIs(node.ref, entry.other);
        case Test::Odd:
            return (value(node.ref) & 1) != 0;
        case Test::DataLeft:
            return m_dataLength - m_input.consumed() >= entry.number;
        case Test::DataFits:
            return dataFits(entry);
        case Test::DataFitsNot:
            return !dataFits(entry);
        }
        return false;
    }

    bool dataFits(const Entry& entry) const {
        return m_dataLength >= entry.number && (m_dataLength - entry.number) % entry.adjust == 0;
    }

    // A field not read (absent, or of a later repetition) has the value 0 and empty text.
    __int64 value(int index) const {
        const Span& span = m_spans[index];
        return span.read ? fieldValue(m_input.at(span.offset), span.length, m_nodes[index].entry->binary) : 0;
    }

    bool textIs(int index, const char* text) const {
        const Span& span = m_spans[index];
        size_t length = span.read ? span.length : 0;
        return length == std::strlen(text) && std::memcmp(m_input.at(span.offset), text, length) == 0;
    }

    void store(const Node& node, const char* bytes, size_t length) {
        std::unique_ptr<CNitfProperty> property(new CNitfProperty);
        __int64 width = node.entry->number;
        if (static_cast<Width>(node.entry->kind) == Width::Fixed && static_cast<__int64>(length) < width) {
            // A fixed-width field cut by the end of the file still holds its width: binary fields can always
            // be read whole (the missing bytes are zeros).
            std::string padded(bytes, length);
            padded.resize(static_cast<size_t>(width), '\0');
            property->setString(padded.data(), static_cast<int>(width));
        } else {
            property->setString(bytes, static_cast<int>(length));
        }

        char built[kLongestName + kDeepestNesting * 24 + 1];
        size_t keyLength = 0;
        char* key = keyOf(node, built, &keyLength);
        // One search: replace the value of a key already there, or insert beside it.
        auto place = m_properties.lower_bound(key);
        if (place != m_properties.end() && std::strcmp(place->first, key) == 0) {
            delete place->second;
            place->second = property.release();
            return;
        }
        if (key == built) // a key of a repeated field, new to this extension: kept with it
            key = m_keys.add(built, keyLength);
        m_properties.emplace_hint(place, key, property.get());
        property.release();
    }

    // The bare name outside repeated groups (a constant of the table); inside them the name with the indices
    // of the enclosing repetitions, built into `buffer`.
    char* keyOf(const Node& node, char* buffer, size_t* length) {
        const char* name = node.entry->name;
        if (node.depth == 0)
            return const_cast<char*>(name);
        const char* slot = std::strstr(name, "%d");
        if (slot) {
            size_t n = static_cast<size_t>(slot - name);
            std::memcpy(buffer, name, n);
            n += std::sprintf(buffer + n, "%lld", m_indices[0]);
            n += std::sprintf(buffer + n, "%s", slot + 2);
            *length = n;
        } else {
            size_t n = std::strlen(name);
            std::memcpy(buffer, name, n);
            for (int level = 0; level < node.depth; ++level)
                n += std::sprintf(buffer + n, "_%lld", m_indices[level]);
            buffer[n] = '\0';
            *length = n;
        }
        return buffer;
    }

    const std::vector<Node>& m_nodes;
    Input& m_input;
    __int64 m_dataLength;
    PropertyMap& m_properties;
    KeyStore& m_keys;
    __int64 m_externalCount;
    std::vector<Span> m_spans;
    std::vector<__int64> m_indices;
    bool m_stopped = false;
};

} // namespace

__int64 readLayout(FILE* fp, const Layout& layout, __int64 dataLength, PropertyMap& properties,
                   KeyStore& keys, __int64 externalCount) {
    Input input(fp, std::max(dataLength, kLargestTre), std::max<__int64>(dataLength, 0));
    Reader(layout, input, dataLength, properties, keys, externalCount).read();
    input.finish();
    return input.consumed();
}

} // namespace tre
