#include "RecordLayout.h"

#include <algorithm>
#include <cstdint>
#include <cstring>
#include <memory>
#include <string>

#include "DataStream.h"
#include "HostFile.h"
#include "Raise.h"
#include "Serializer.h"
#include "SerializableArray.h"

static const char kSourceFile[] = "nitf/lib/RecordLayout";

using record::Count;
using record::Entry;
using record::Op;
using record::Test;
using record::Width;

// No TRE can declare more data than five CEL digits hold; reading on past a TRE's end stops there as well.
static const __int64 kLargestTre = 99999;
// Limits that keep keys in a fixed buffer: names of at most 64 characters, at most 4 nested repeated groups.
static const size_t kLongestName = 64;
static const int kDeepestNesting = 4;
// Values of referenced fields are kept from this many of their bytes (counts, flags, short codes).
static const size_t kKeptValueBytes = 32;

static void tableFault(const char* what, const char* name) {
    NITF_RAISE_FORMAT(
        "__cdecl CRecordLayout::CRecordLayout(class std::initializer_list<struct record::Part>)",
        "Record layout table: %s (%s)", what, name ? name : "-");
}

static bool isBinary(eNitfFieldForm_t form) {
    return form == eFieldUnsigned || form == eFieldSigned || form == eFieldFloat || form == eFieldDouble;
}

__int64 recordFieldValue(const char* bytes, size_t length, eNitfFieldForm_t form) {
    const long long kLimit = 1LL << 62;
    if (form == eFieldUnsigned || form == eFieldSigned || form == eFieldBytes) {
        unsigned long long value = 0;
        size_t n = std::min<size_t>(length, 8);
        for (size_t i = 0; i < n; ++i)
            value = (value << 8) | static_cast<unsigned char>(bytes[i]);
        if (form == eFieldSigned && n > 0 && n < 8 && (static_cast<unsigned char>(bytes[0]) & 0x80))
            value |= ~0ULL << (8 * n);
        long long signedValue = static_cast<long long>(value);
        if (form != eFieldSigned)
            return static_cast<__int64>(std::min<unsigned long long>(value, kLimit));
        return std::max(-kLimit, std::min(kLimit, signedValue));
    }
    if (form == eFieldFloat || form == eFieldDouble)
        return 0; // floating-point fields count nothing
    // atoi's reading: leading blanks, a sign, then digits up to the first other character.
    size_t i = 0;
    while (i < length && (bytes[i] == ' ' || (bytes[i] >= '\t' && bytes[i] <= '\r')))
        ++i;
    bool negative = i < length && bytes[i] == '-';
    if (i < length && (bytes[i] == '-' || bytes[i] == '+'))
        ++i;
    long long value = 0;
    for (; i < length && bytes[i] >= '0' && bytes[i] <= '9'; ++i) {
        value = value * 10 + (bytes[i] - '0');
        if (value >= kLimit)
            return negative ? -kLimit : kLimit;
    }
    return negative ? -value : value;
}

// ---- the checked layout
// --------------------------------------------------------------------------------------------

static void checkEntry(const Entry& entry, int depth) {
    if (entry.op == Op::Field) {
        eNitfFieldForm_t form = static_cast<eNitfFieldForm_t>(entry.form);
        if (!entry.name || std::strlen(entry.name) > kLongestName)
            tableFault("a field needs a name of at most 64 characters", entry.name);
        if ((form == eFieldUnsigned || form == eFieldSigned) && (entry.number < 1 || entry.number > 8))
            tableFault("a binary integer is 1 to 8 bytes wide", entry.name);
        if (static_cast<Width>(entry.kind) == Width::Fixed && entry.number < 0)
            tableFault("negative width", entry.name);
        if (std::strstr(entry.name, "%d") && depth != 1)
            tableFault("an indexed name belongs in exactly one repeated group", entry.name);
    }
    if (entry.op == Op::If) {
        Test test = static_cast<Test>(entry.kind);
        if ((test == Test::DataFits || test == Test::DataFitsNot) && entry.adjust <= 0)
            tableFault("a data length test needs a positive step", nullptr);
        if ((test == Test::TextIs || test == Test::TextIsNot || test == Test::TextIn) && !entry.other)
            tableFault("a text test needs its text", entry.ref);
        if (test == Test::Call && !entry.call)
            tableFault("a called test needs its function", entry.ref);
    }
}

CRecordLayout::CRecordLayout(std::initializer_list<record::Part> parts) {
    for (const record::Part& part : parts)
        m_entries.insert(m_entries.end(), part.entries, part.entries + part.count);
    const int count = static_cast<int>(m_entries.size());
    m_nodes.reserve(m_entries.size());
    std::vector<int> open;
    std::vector<int> repeats;
    for (int i = 0; i < count; ++i) {
        const Entry& entry = m_entries[i];
        checkEntry(entry, static_cast<int>(repeats.size()));
        Node node = {&entry, -1, -1, -1, static_cast<int>(repeats.size()), 0, -1, -1};
        if (entry.op == Op::End) {
            if (open.empty())
                tableFault("End without a group", nullptr);
            int begin = open.back();
            open.pop_back();
            m_nodes[begin].end = i;
            node.end = begin;
            if (m_nodes[begin].entry->op == Op::Repeat)
                repeats.pop_back();
            node.depth = static_cast<int>(repeats.size());
        } else if (entry.op != Op::Field) {
            open.push_back(i);
            if (entry.op == Op::Repeat) {
                repeats.push_back(i);
                if (static_cast<int>(repeats.size()) > kDeepestNesting)
                    tableFault("repeated groups nested too deep", nullptr);
                m_maxDepth = std::max(m_maxDepth, static_cast<int>(repeats.size()));
            }
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
            keepValue(node.ref);
        }
        bool product = entry.op == Op::Field && static_cast<Width>(entry.kind) == Width::Product;
        bool fallback = entry.op == Op::Repeat && entry.other;
        if (product || fallback) {
            node.other = findField(i, entry.other);
            if (node.other < 0 && product)
                tableFault("reference to no earlier field", entry.other);
            if (node.other >= 0)
                keepValue(node.other);
        }
        if (entry.op == Op::Repeat)
            node.minWidth = minimalWidth(i + 1, node.end);
    }
    m_minimalLength = minimalWidth(0, count);
    rankKeys();
}

// Reading into an empty map, a field whose key's place among the layout's fixed keys is known goes in beside
// its nearest neighbour already there, without searching the map.
void CRecordLayout::rankKeys() {
    std::vector<const char*> names;
    for (const Node& node : m_nodes) {
        if (node.entry->op == Op::Field && node.depth == 0 && !(node.entry->flags & record::kNotKept))
            names.push_back(node.entry->name);
    }
    std::sort(names.begin(), names.end(), ltstr());
    names.erase(std::unique(names.begin(), names.end(),
                            [](const char* a, const char* b) { return std::strcmp(a, b) == 0; }),
                names.end());
    m_rankCount = static_cast<int>(names.size());
    for (Node& node : m_nodes) {
        if (node.entry->op == Op::Field && node.depth == 0 && !(node.entry->flags & record::kNotKept))
            node.rank = static_cast<int>(
                std::lower_bound(names.begin(), names.end(), node.entry->name, ltstr()) - names.begin());
    }
}

void CRecordLayout::keepValue(int field) {
    if (m_nodes[field].span < 0)
        m_nodes[field].span = m_spanCount++;
}

// The nearest field of that name before `from` that is still in scope there: fields of repeated groups
// already closed at `from` (earlier repetitions) are not; those of closed conditional groups are (they read
// as 0 when their group was absent).
int CRecordLayout::findField(int from, const char* name) const {
    for (int j = from - 1; j >= 0; --j) {
        const Node& node = m_nodes[j];
        if (node.entry->op == Op::End && m_nodes[node.end].entry->op == Op::Repeat)
            j = node.end; // skip the closed group; the loop steps past its opening entry
        else if (node.entry->op == Op::Field && std::strcmp(node.entry->name, name) == 0)
            return j;
    }
    return -1;
}

// Bytes the entries [begin, end) take at the least: their unconditional fixed-width fields.
long long CRecordLayout::minimalWidth(int begin, int end) const {
    long long width = 0;
    for (int i = begin; i < end; ++i) {
        const Node& node = m_nodes[i];
        if (node.entry->op == Op::Field) {
            if (static_cast<Width>(node.entry->kind) == Width::Fixed)
                width += node.entry->number;
        } else if (node.entry->op != Op::End) {
            i = node.end; // a group may be absent or repeated zero times
        }
    }
    return width;
}

// ---- ports: where a walk's bytes come from and go to
// ---------------------------------------------------------------

namespace {

// The value of a field that later entries refer to.
struct Span {
    char bytes[kKeptValueBytes];
    size_t length = 0;
    bool set = false;
};
// The repetition that the fields at one depth of repeated groups belong to.
struct Level {
    long long index = 0;
    long long count = 0;
    bool bandKeys = false;
};

// The working storage of the walks on one thread, kept from one walk to the next so that reading a record
// allocates little but its values.
struct Scratch {
    std::vector<Span> spans;
    std::vector<Level> levels;
    std::vector<PropertyMap::iterator> byRank; // reading into an empty map: where each ranked key went
    std::vector<uint64_t> ranked;              // which ranks are in
    std::vector<char> input;
    std::string bytes;
    bool busy = false;
};

// The thread's scratch, or one of its own for a walk that starts while another is under way.
class ScratchLease {
public:
    ScratchLease() {
        __attribute__((tls_model("initial-exec"))) thread_local Scratch shared;
        if (shared.busy) {
            m_own.reset(new Scratch);
            m_scratch = m_own.get();
        } else {
            m_scratch = &shared;
        }
        m_scratch->busy = true;
    }
    ~ScratchLease() {
        // The thread keeps its scratch from walk to walk, but not the buffer of an unusually large record.
        static const size_t kKeptInput = 1 << 20;
        if (m_scratch->input.capacity() > kKeptInput)
            std::vector<char>().swap(m_scratch->input);
        m_scratch->busy = false;
    }
    ScratchLease(const ScratchLease&) = delete;
    ScratchLease& operator=(const ScratchLease&) = delete;
    Scratch& operator*() const { return *m_scratch; }

private:
    Scratch* m_scratch;
    std::unique_ptr<Scratch> m_own;
};

class Port {
public:
    virtual ~Port() = default;
    // Reading: up to `width` bytes of the field at the cursor; returns how many there were. They stay valid
    // until the next call.
    virtual size_t take(__int64 width, const Entry& field, const char** bytes) = 0;
    // Writing: the field's `width` bytes.
    virtual void put(const char* bytes, size_t width, const Entry& field) = 0;
    // Passes over up to `width` bytes (a hole when writing); returns how many.
    virtual __int64 skip(__int64 width) = 0;
    // The absolute position of the cursor, and the bytes passed since the walk began.
    virtual __int64 position() const = 0;
    virtual __int64 consumed() const = 0;
    // Bytes that can still be read.
    virtual __int64 remaining() const = 0;
};

// The bytes from the stream's position on, read as the walk needs them: the first read takes what every
// record of the layout needs, later ones what a field needs, so that the stream ends where the walk does.
// Never past the end of the file or the reading limit.
class FileInput : public Port {
public:
    FileInput(FILE* fp, __int64 limit, size_t firstRead, std::vector<char>& buffer)
        : m_fp(fp), m_start(DKFTell(fp)), m_streamAt(m_start), m_limit(limit), m_firstRead(firstRead),
          m_buffer(buffer) {
        m_buffer.clear();
        if (m_start < 0)
            m_limit = 0;
    }

    size_t take(__int64 width, const Entry&, const char** bytes) override {
        size_t n = static_cast<size_t>(readable(width));
        if (m_position + n > m_buffer.size())
            load(m_position + n);
        n = std::min(n, m_buffer.size() - m_position);
        *bytes = m_buffer.empty() ? "" : m_buffer.data() + m_position;
        m_position += n;
        return n;
    }
    void put(const char*, size_t, const Entry&) override {}
    __int64 skip(__int64 width) override {
        // Small gaps are read through: a read costs less than a seek and keeps the stream in step.
        static const __int64 kReadThrough = 65536;
        if (width <= kReadThrough) {
            const char* bytes;
            return static_cast<__int64>(take(width, Entry(), &bytes));
        }
        __int64 n = std::max<__int64>(0, std::min(width, remaining()));
        m_position += static_cast<size_t>(n);
        return n;
    }
    __int64 position() const override { return m_start + consumed(); }
    __int64 consumed() const override { return static_cast<__int64>(m_position); }
    __int64 remaining() const override {
        if (!m_ended && m_fileRemaining < 0) {
            // Asked only for large counts and widths: sizing the file costs a system call.
            m_fileRemaining = CDataStream::remaining(m_fp) + (m_streamAt - m_start);
        }
        __int64 left = m_ended ? static_cast<__int64>(m_buffer.size()) : m_fileRemaining;
        if (m_limit >= 0)
            left = std::min(left, m_limit);
        return left - consumed();
    }

    // Leaves the stream just after the bytes passed.
    void finish() {
        if (m_streamAt != position())
            DKFSeek64(m_fp, position(), SEEK_SET);
    }

private:
    // How many of `width` bytes can be read: the file is sized only for widths beyond what a header field
    // takes, before a buffer that large is allocated.
    __int64 readable(__int64 width) const {
        static const __int64 kUnsized = 1 << 20;
        __int64 left = m_limit >= 0 ? m_limit - consumed() : width;
        if (m_ended)
            left = std::min(left, static_cast<__int64>(m_buffer.size()) - consumed());
        else if (width > kUnsized)
            left = std::min(left, remaining());
        return std::max<__int64>(0, std::min(width, left));
    }

    // Reads on until the buffer holds `upTo` bytes (more on the first read).
    void load(size_t upTo) {
        size_t loaded = m_buffer.size();
        size_t wanted = std::max(upTo, loaded == 0 ? m_firstRead : 0);
        if (m_limit >= 0)
            wanted = std::min(wanted, static_cast<size_t>(m_limit));
        if (wanted <= loaded || m_ended)
            return;
        if (m_start + static_cast<__int64>(loaded) != m_streamAt)
            DKFSeek64(m_fp, m_start + static_cast<__int64>(loaded), SEEK_SET);
        m_buffer.resize(wanted);
        size_t got = DKFRead(m_buffer.data() + loaded, 1, wanted - loaded, m_fp);
        m_buffer.resize(loaded + got);
        m_streamAt = m_start + static_cast<__int64>(loaded + got);
        if (loaded + got < wanted) // the file ends here
            m_ended = true;
    }

    FILE* m_fp;
    __int64 m_start;
    __int64 m_streamAt; // where the stream stands
    __int64 m_limit;
    size_t m_firstRead;
    std::vector<char>& m_buffer; // the bytes from the start, as far as read
    size_t m_position = 0;
    bool m_ended = false;
    mutable __int64 m_fileRemaining = -1;
};

// Counts the bytes a walk passes, from `base`: measuring a layout.
class Counter : public Port {
public:
    explicit Counter(__int64 base = 0) : m_base(base) {}
    size_t take(__int64, const Entry&, const char**) override { return 0; }
    void put(const char*, size_t width, const Entry&) override { m_count += static_cast<__int64>(width); }
    __int64 skip(__int64 width) override {
        m_count += width;
        return width;
    }
    __int64 position() const override { return m_base + m_count; }
    __int64 consumed() const override { return m_count; }
    __int64 remaining() const override { return INT64_MAX / 4; }

private:
    __int64 m_base;
    __int64 m_count = 0;
};

// Writes what it counts to a stream, from the stream's position.
class FileOutput : public Counter {
public:
    explicit FileOutput(FILE* fp) : Counter(DKFTell(fp)), m_fp(fp) {}
    void put(const char* bytes, size_t width, const Entry& field) override {
        DKFWrite(bytes, 1, width, m_fp);
        Counter::put(bytes, width, field);
    }
    __int64 skip(__int64 width) override {
        DKFSeek64(m_fp, width, SEEK_CUR);
        return Counter::skip(width);
    }

private:
    FILE* m_fp;
};

// Binary records over the serializer family: integers and floating-point values through the typed operators
// (which byte-swap as the serializer is set up to), text and bytes as arrays.
class SerializerPort : public Port {
public:
    explicit SerializerPort(nitf::CSerializer& serializer)
        : m_serializer(serializer), m_start(serializer.tell()) {}

    size_t take(__int64 width, const Entry& field, const char** bytes) override {
        m_bytes.assign(static_cast<size_t>(std::max<__int64>(0, width)), '\0');
        uint64_t value = 0;
        switch (binaryWidth(field, width)) {
        case 1: {
            unsigned char v = 0;
            m_serializer >> v;
            value = v;
            break;
        }
        case 2: {
            unsigned short v = 0;
            m_serializer >> v;
            value = v;
            break;
        }
        case 4: {
            unsigned int v = 0;
            m_serializer >> v;
            value = v;
            break;
        }
        case 8: {
            if (static_cast<eNitfFieldForm_t>(field.form) == eFieldDouble) {
                double v = 0;
                m_serializer >> v;
                std::memcpy(&value, &v, 8);
            } else {
                __int64 v = 0;
                m_serializer >> v;
                value = static_cast<uint64_t>(v);
            }
            break;
        }
        default: {
            nitf::CSerializableArray array(&m_bytes[0], m_bytes.size());
            m_serializer >> array;
            *bytes = m_bytes.data();
            return m_bytes.size();
        }
        }
        for (size_t i = 0; i < m_bytes.size(); ++i)
            m_bytes[m_bytes.size() - 1 - i] = static_cast<char>(value >> (8 * i));
        *bytes = m_bytes.data();
        return m_bytes.size();
    }

    void put(const char* bytes, size_t width, const Entry& field) override {
        uint64_t value = 0;
        for (size_t i = 0; i < width && i < 8; ++i)
            value = (value << 8) | static_cast<unsigned char>(bytes[i]);
        switch (binaryWidth(field, static_cast<__int64>(width))) {
        case 1:
            m_serializer << static_cast<unsigned char>(value);
            break;
        case 2:
            m_serializer << static_cast<unsigned short>(value);
            break;
        case 4:
            m_serializer << static_cast<unsigned int>(value);
            break;
        case 8:
            if (static_cast<eNitfFieldForm_t>(field.form) == eFieldDouble) {
                double v;
                std::memcpy(&v, &value, 8);
                m_serializer << v;
            } else {
                m_serializer << static_cast<__int64>(value);
            }
            break;
        default:
            m_serializer << nitf::CSerializableArray(bytes, width);
        }
    }

    __int64 skip(__int64 width) override {
        m_serializer.seek(m_serializer.tell() + width);
        return width;
    }
    __int64 position() const override { return m_serializer.tell(); }
    __int64 consumed() const override { return m_serializer.tell() - m_start; }
    __int64 remaining() const override { return INT64_MAX / 4; }

private:
    // The width of the typed operator that moves the field, or 0 for an array.
    static int binaryWidth(const Entry& field, __int64 width) {
        if (!isBinary(static_cast<eNitfFieldForm_t>(field.form)))
            return 0;
        return width == 1 || width == 2 || width == 4 || width == 8 ? static_cast<int>(width) : 0;
    }

    nitf::CSerializer& m_serializer;
    __int64 m_start;
    std::string m_bytes;
};

// ---- values written
// ------------------------------------------------------------------------------------------------

void bigEndian(uint64_t value, size_t width, std::string& out) {
    out.assign(width, '\0');
    for (size_t i = 0; i < width && i < 8; ++i)
        out[width - 1 - i] = static_cast<char>(value >> (8 * i));
}

void fixedBytes(const char* bytes, size_t length, size_t width, char fill, std::string& out) {
    out.assign(width, fill);
    std::memcpy(&out[0], bytes, std::min(length, width));
}

bool isInteger(CNitfProperty::eDataType type) {
    return type == CNitfProperty::eUint1 || type == CNitfProperty::eUint2 || type == CNitfProperty::eInt4;
}

// The number a property holds, for a binary field.
void numberOf(CNitfProperty& value, bool typed, double* real, long long* integer) {
    CNitfProperty::eDataType type = value.getDataType();
    if (isInteger(type)) {
        *integer = value.getAsInt();
        *real = static_cast<double>(*integer);
    } else if (type == CNitfProperty::eFloat || type == CNitfProperty::eDouble) {
        *real = type == CNitfProperty::eFloat ? value.getFloat() : value.getDouble();
        *integer = nitf_detail::truncateTo<long long>(*real, INT64_MIN, INT64_MAX);
    } else if (typed && type == CNitfProperty::eString) {
        *real = std::atof(value.getAsString());
        *integer = std::strtoll(value.getAsString(), nullptr, 10);
    } else {
        *real = 0;
        *integer = 0;
    }
}

const char kWriteSignature[] =
    "__int64 __cdecl CRecordLayout::write(struct _iobuf *,const class std::map<char "
    "*,class CNitfProperty *,struct ltstr> &)";

// The `width` bytes a value is written as. Text is left-justified and blank-filled, integers in text fields
// right-justified and zero-filled; bytes kept as they were read go out as they stand, cut or zero-filled.
void bytesOf(const Entry& field, const char* key, CNitfProperty& value, size_t width, std::string& out) {
    const eNitfFieldForm_t form = static_cast<eNitfFieldForm_t>(field.form);
    const bool typed = (field.flags & record::kTyped) != 0;
    const CNitfProperty::eDataType type = value.getDataType();
    const char* stored = value.getBytes();
    // Text read from a file holds exactly its field's bytes, NULs included.
    const size_t storedLength = value.getStoredLength();

    if (form == eFieldText) {
        if (type == CNitfProperty::eString) {
            fixedBytes(stored, storedLength, width, ' ', out);
        } else if (type == CNitfProperty::eChars) {
            fixedBytes(stored, storedLength, width, '\0', out);
        } else if (isInteger(type)) {
            std::string digits = std::to_string(value.getAsInt());
            if (digits.size() > width)
                NITF_RAISE_FORMAT(kWriteSignature, "Field %s: %s does not fit in %d digits", key,
                                  digits.c_str(), static_cast<int>(width));
            out.assign(width - digits.size(), '0');
            out += digits;
        } else {
            std::string text = value.toText();
            fixedBytes(text.data(), text.size(), width, ' ', out);
        }
        return;
    }
    if (form == eFieldBytes) {
        if (type == CNitfProperty::eString && typed) {
            // Typed bytes given as text are hexadecimal digits, two per byte ("FF8000").
            out.assign(width, '\0');
            for (size_t i = 0; i < width && 2 * i + 1 < storedLength; ++i) {
                unsigned int byte = 0;
                if (std::sscanf(stored + 2 * i, "%2x", &byte) == 1)
                    out[i] = static_cast<char>(byte);
            }
        } else if (stored) {
            fixedBytes(stored, storedLength, width, '\0', out);
        } else {
            out.assign(width, '\0');
        }
        return;
    }
    if (type == CNitfProperty::eString && !typed) {
        fixedBytes(stored, storedLength, width, '\0', out);
        return;
    }
    double real = 0;
    long long integer = 0;
    numberOf(value, typed, &real, &integer);
    if (form == eFieldFloat) {
        float single = static_cast<float>(real);
        uint32_t bits;
        std::memcpy(&bits, &single, 4);
        bigEndian(bits, width, out);
    } else if (form == eFieldDouble) {
        uint64_t bits;
        std::memcpy(&bits, &real, 8);
        bigEndian(bits, width, out);
    } else {
        bigEndian(static_cast<uint64_t>(integer), width, out);
    }
}

// ---- the walk
// ------------------------------------------------------------------------------------------------------

class Walk {
    using Node = CRecordLayout::Node;

public:
    Walk(const CRecordLayout& layout, Port& port, Scratch& scratch, const record::Report& report,
         __int64 dataLength, __int64 externalCount)
        : m_nodes(layout.nodes()), m_port(port), m_report(report), m_dataLength(dataLength),
          m_externalCount(externalCount), m_spans(scratch.spans), m_levels(scratch.levels),
          m_byRank(scratch.byRank), m_ranked(scratch.ranked), m_rankCount(layout.rankCount()),
          m_scratch(scratch.bytes) {
        m_spans.assign(static_cast<size_t>(layout.spanCount()), Span());
        // Only a first walk into the list: reserving for each of several would defeat the vector's growth.
        if (report.fields && report.fields->empty())
            report.fields->reserve(m_nodes.size());
        m_levels.assign(static_cast<size_t>(layout.maxDepth() + 1), Level());
    }

    void read(PropertyMap& map, CKeyStore& keys) {
        m_readMap = &map;
        m_keys = &keys;
        m_fresh = map.empty();
        if (m_fresh) {
            m_byRank.assign(static_cast<size_t>(m_rankCount), map.end());
            m_ranked.assign(static_cast<size_t>(m_rankCount / 64 + 1), 0);
        }
        range(0, static_cast<int>(m_nodes.size()));
    }

    void write(const PropertyMap& map, const PropertyMap* overrides) {
        m_writeMap = &map;
        m_overrides = overrides;
        range(0, static_cast<int>(m_nodes.size()));
    }

    // Walks as writing does, reporting only the fields the map holds.
    void list(const PropertyMap& map) {
        m_listing = true;
        m_writeMap = &map;
        range(0, static_cast<int>(m_nodes.size()));
    }

private:
    bool reading() const { return m_readMap != nullptr; }

    void range(int begin, int end) {
        for (int i = begin; i < end && !m_stopped; ++i) {
            const Node& node = m_nodes[i];
            switch (node.entry->op) {
            case Op::Field:
                field(i);
                break;
            case Op::Repeat:
                repeat(i);
                i = node.end;
                break;
            case Op::If:
                if (passes(node))
                    range(i + 1, node.end);
                i = node.end;
                break;
            case Op::End:
                break;
            }
        }
    }

    void field(int index) {
        const Node& node = m_nodes[index];
        const Entry& entry = *node.entry;
        const __int64 width = fieldWidth(node);
        const __int64 offset = m_port.position();
        if (entry.flags & record::kNotKept) {
            const char* bytes = nullptr;
            __int64 passed = width;
            if (reading() && (entry.flags & record::kLoaded))
                passed = static_cast<__int64>(m_port.take(width, entry, &bytes));
            else if (reading() || !writeValue(node, width))
                passed = m_port.skip(width);
            if (passed < width)
                m_stopped = true;
            if (m_report.places) {
                m_report.places->push_back(
                    {&entry, offset, passed, m_levels[node.depth].index, std::string()});
                if (bytes)
                    m_report.places->back().bytes.assign(bytes, static_cast<size_t>(passed));
            }
            return;
        }
        if (reading())
            readField(node, width, offset);
        else
            writeField(node, width, offset);
        // Holes are placed too: their owners fill them in.
        if ((entry.flags & record::kHole) && m_report.places)
            m_report.places->push_back({&entry, offset, width, m_levels[node.depth].index, std::string()});
    }

    void readField(const Node& node, __int64 width, __int64 offset) {
        const char* bytes = nullptr;
        size_t got = m_port.take(width, *node.entry, &bytes);
        if (static_cast<__int64>(got) < width) {
            // The end of the file (or of the reading limit): a field cut by it keeps the bytes there are, one
            // wholly past it is absent, and reading stops.
            m_stopped = true;
            if (got == 0)
                return;
        }
        remember(node, bytes, got);
        const char* key = store(node, bytes, got, width);
        if (m_report.fields)
            m_report.fields->push_back(
                {key, static_cast<eNitfFieldForm_t>(node.entry->form), static_cast<int>(got), offset});
    }

    void writeField(const Node& node, __int64 width, __int64 offset) {
        const char* key = writeValue(node, width);
        if (!key) {
            if (node.entry->flags & record::kHole) {
                m_port.skip(width);
            } else {
                char fill = static_cast<eNitfFieldForm_t>(node.entry->form) == eFieldText ? ' ' : '\0';
                m_scratch.assign(static_cast<size_t>(width), fill);
                remember(node, m_scratch.data(), m_scratch.size());
                m_port.put(m_scratch.data(), m_scratch.size(), *node.entry);
            }
        }
        if (m_report.fields && (key || !m_listing))
            m_report.fields->push_back({key ? key : node.entry->name,
                                        static_cast<eNitfFieldForm_t>(node.entry->form),
                                        static_cast<int>(width), offset});
    }

    // Writes the field's value when it has one and returns its key (the map's own, when the map holds it);
    // null when it has none.
    const char* writeValue(const Node& node, __int64 width) {
        char built[kLongestName + kDeepestNesting * 24 + 1];
        const char* key = keyOf(node, built, nullptr);
        CNitfProperty* value = nullptr;
        if (m_overrides)
            value = FindProperty(*m_overrides, key);
        if (value) {
            key = node.entry->name;
        } else {
            auto found = m_writeMap->find(const_cast<char*>(key));
            if (found != m_writeMap->end()) {
                value = found->second;
                key = found->first;
            }
        }
        if (!value || value->getDataType() == CNitfProperty::eNone)
            return nullptr;
        if (static_cast<Width>(node.entry->kind) == Width::RestOfData && m_dataLength < 0)
            width = static_cast<__int64>(value->getLength());
        bytesOf(*node.entry, key, *value, static_cast<size_t>(std::max<__int64>(0, width)), m_scratch);
        remember(node, m_scratch.data(), m_scratch.size());
        m_port.put(m_scratch.data(), m_scratch.size(), *node.entry);
        return key;
    }

    void repeat(int index) {
        const Node& node = m_nodes[index];
        __int64 count = repeatCount(node);
        Level& level = m_levels[node.depth + 1];
        level.count = count; // as declared: band keys are padded to its width
        // Every repetition takes at least minWidth bytes: no more of them than the bytes left can feed (one
        // more may start and come out short). A count that cannot pass much is left to meet the end of the
        // file as it reads: sizing the file costs a system call.
        static const __int64 kUnsizedBytes = 1 << 20;
        if (reading() && node.minWidth > 0 && count > kUnsizedBytes / node.minWidth)
            count = std::min(count, m_port.remaining() / node.minWidth + 1);
        level.bandKeys = (node.entry->flags & record::kBandKeys) != 0;
        for (__int64 n = 0; n < count && !m_stopped; ++n) {
            for (int i = index + 1; i < node.end; ++i) {
                if (m_nodes[i].span >= 0)
                    m_spans[m_nodes[i].span].set = false;
            }
            level.index = node.entry->firstIndex + n;
            __int64 before = m_port.consumed();
            range(index + 1, node.end);
            // A repetition that passed no bytes depends on nothing that changes: the following ones would be
            // the same again.
            if (m_port.consumed() == before)
                break;
        }
        level.index = 0;
    }

    __int64 fieldWidth(const Node& node) const {
        const Entry& entry = *node.entry;
        switch (static_cast<Width>(entry.kind)) {
        case Width::Fixed:
            return entry.number;
        case Width::OfField:
            if (entry.number > 1)
                return product(value(node.ref), entry.number);
            return std::max<__int64>(0, value(node.ref) + entry.adjust);
        case Width::Product:
            return product(value(node.ref), value(node.other));
        case Width::BitsOf: {
            __int64 bits = std::max<__int64>(0, value(node.ref));
            return bits / 8 + (bits % 8 != 0);
        }
        case Width::RestOfData:
            return std::max<__int64>(0, m_dataLength - m_port.consumed());
        }
        return 0;
    }

    // Saturates rather than overflows: a width beyond the readable bytes is cut to them when it is read.
    static __int64 product(__int64 a, __int64 b) {
        static const __int64 kLargest = INT64_MAX / 4;
        a = std::max<__int64>(0, a);
        b = std::max<__int64>(0, b);
        if (a == 0 || b == 0)
            return 0;
        return a > kLargest / b ? kLargest : a * b;
    }

    __int64 repeatCount(const Node& node) const {
        switch (static_cast<Count>(node.entry->kind)) {
        case Count::OfField: {
            __int64 count = value(node.ref) + node.entry->adjust;
            if (count == 0 && node.other >= 0)
                count = value(node.other);
            return std::max<__int64>(0, count);
        }
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
        case Test::NotZero:
            return value(node.ref) != 0;
        case Test::Odd:
            return (value(node.ref) & 1) != 0;
        case Test::TextIs:
            return textIs(node.ref, entry.other, std::strlen(entry.other), entry.number == 1);
        case Test::TextIsNot:
            return !textIs(node.ref, entry.other, std::strlen(entry.other), entry.number == 1);
        case Test::TextIn:
            for (const char* word = entry.other; *word;) {
                size_t length = std::strcspn(word, "|");
                if (textIs(node.ref, word, length, false))
                    return true;
                word += length + (word[length] == '|');
            }
            return false;
        case Test::Call: {
            const Span& span = m_spans[m_nodes[node.ref].span];
            return entry.call(span.bytes, span.set ? std::min(span.length, kKeptValueBytes) : 0);
        }
        case Test::DataLeft:
            return m_dataLength - m_port.consumed() >= entry.number;
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

    // A field not met (absent, or of a later repetition) has the value 0 and empty text.
    __int64 value(int index) const {
        if (index < 0)
            return 0;
        const Span& span = m_spans[m_nodes[index].span];
        return span.set ? recordFieldValue(span.bytes, std::min(span.length, kKeptValueBytes),
                                           static_cast<eNitfFieldForm_t>(m_nodes[index].entry->form))
                        : 0;
    }

    bool textIs(int index, const char* text, size_t length, bool ignoreCase) const {
        const Span& span = m_spans[m_nodes[index].span];
        size_t have = span.set ? span.length : 0;
        if (have != length || length > kKeptValueBytes)
            return false;
        return ignoreCase ? _strnicmp(span.bytes, text, length) == 0 && !std::memchr(span.bytes, 0, length)
                          : std::memcmp(span.bytes, text, length) == 0;
    }

    void remember(const Node& node, const char* bytes, size_t length) {
        if (node.span < 0)
            return;
        Span& span = m_spans[node.span];
        std::memcpy(span.bytes, bytes, std::min(length, kKeptValueBytes));
        span.length = length;
        span.set = true;
    }

    // Keeps the field in the map; returns its key.
    const char* store(const Node& node, const char* bytes, size_t length, __int64 width) {
        CNitfProperty* property = new CNitfProperty;
        if ((node.entry->flags & record::kTyped) != 0) {
            setTyped(*property, static_cast<eNitfFieldForm_t>(node.entry->form), bytes, length);
        } else if (static_cast<Width>(node.entry->kind) == Width::Fixed &&
                   static_cast<__int64>(length) < width) {
            // A fixed-width field cut by the end of the file still holds its width: binary fields can always
            // be read whole (the missing bytes are zeros).
            std::string padded(bytes, length);
            padded.resize(static_cast<size_t>(width), '\0');
            property->setString(padded.data(), static_cast<int>(width));
        } else {
            property->setString(bytes, static_cast<int>(length));
        }

        if (m_fresh && node.rank >= 0)
            return storeRanked(node, property);
        char built[kLongestName + kDeepestNesting * 24 + 1];
        size_t keyLength = 0;
        char* key = keyOf(node, built, &keyLength);
        // One search: replace the value of a key already there, or insert beside it.
        PropertyMap& map = *m_readMap;
        auto place = map.lower_bound(key);
        if (place != map.end() && std::strcmp(place->first, key) == 0) {
            delete place->second;
            place->second = property;
            return place->first;
        }
        if (key == built) // a key of a repeated field, new to this map: kept with it
            key = m_keys->add(built, keyLength);
        map.emplace_hint(place, key, property);
        return key;
    }

    // Inserts beside the next ranked key already in: right unless a key of a repeated field came between,
    // which the map then finds itself.
    const char* storeRanked(const Node& node, CNitfProperty* property) {
        PropertyMap& map = *m_readMap;
        const size_t rank = static_cast<size_t>(node.rank);
        PropertyMap::iterator& place = m_byRank[rank];
        if (place == map.end()) {
            PropertyMap::iterator next = map.end();
            for (size_t word = rank / 64; word < m_ranked.size(); ++word) {
                uint64_t bits = m_ranked[word];
                if (word == rank / 64)
                    bits &= ~0ULL << (rank % 64);
                if (bits) {
                    next = m_byRank[word * 64 + static_cast<size_t>(__builtin_ctzll(bits))];
                    break;
                }
            }
            place = map.emplace_hint(next, const_cast<char*>(node.entry->name), property);
            m_ranked[rank / 64] |= 1ULL << (rank % 64);
            if (place->second == property)
                return place->first;
        }
        // The key is in already: the new value replaces the old.
        delete place->second;
        place->second = property;
        return place->first;
    }

    static void setTyped(CNitfProperty& property, eNitfFieldForm_t form, const char* bytes, size_t length) {
        long long number = recordFieldValue(bytes, length, form);
        switch (form) {
        case eFieldText:
            property.setString(bytes, static_cast<int>(length));
            break;
        case eFieldBytes:
            property.setChars(bytes, static_cast<int>(length));
            break;
        case eFieldUnsigned:
        case eFieldSigned:
            if (length == 1 && form == eFieldUnsigned)
                property.setUint1(static_cast<int>(number));
            else if (length == 2 && form == eFieldUnsigned)
                property.setUint2(static_cast<int>(number));
            else if (length <= 4)
                property.setInt4(static_cast<int>(static_cast<uint32_t>(number)));
            else
                property.setDouble(static_cast<double>(number));
            break;
        case eFieldFloat: {
            uint32_t bits = static_cast<uint32_t>(recordFieldValue(bytes, length, eFieldUnsigned));
            float single;
            std::memcpy(&single, &bits, 4);
            property.setFloat(single);
            break;
        }
        case eFieldDouble: {
            uint64_t bits = 0;
            for (size_t i = 0; i < length && i < 8; ++i)
                bits = (bits << 8) | static_cast<unsigned char>(bytes[i]);
            double real;
            std::memcpy(&real, &bits, 8);
            property.setDouble(real);
            break;
        }
        }
    }

    // The bare name outside repeated groups (a constant of the table); inside them the name with the numbers
    // of the enclosing repetitions, built into `buffer`.
    char* keyOf(const Node& node, char* buffer, size_t* length) const {
        const char* name = node.entry->name;
        if (node.depth == 0)
            return const_cast<char*>(name);
        size_t n = 0;
        const char* slot = std::strstr(name, "%d");
        if (slot) {
            n = static_cast<size_t>(slot - name);
            std::memcpy(buffer, name, n);
            n += putNumber(buffer + n, m_levels[1].index, 1);
            size_t rest = std::strlen(slot + 2);
            std::memcpy(buffer + n, slot + 2, rest);
            n += rest;
        } else {
            n = std::strlen(name);
            std::memcpy(buffer, name, n);
            for (int level = 1; level <= node.depth; ++level) {
                const Level& at = m_levels[level];
                if (at.bandKeys) {
                    // Padded to the width of the count below 1000 bands, not padded at all from 1000 on.
                    int digits = at.count < 10 || at.count >= 1000 ? 1 : at.count < 100 ? 2 : 3;
                    n += putNumber(buffer + n, at.index, digits);
                } else {
                    buffer[n++] = '_';
                    n += putNumber(buffer + n, at.index, 1);
                }
            }
        }
        buffer[n] = '\0';
        if (length)
            *length = n;
        return buffer;
    }

    // Writes `value` in decimal, zero-padded to `digits`; returns the characters written.
    static size_t putNumber(char* out, long long value, int digits) {
        char reversed[24];
        size_t n = 0;
        bool negative = value < 0;
        unsigned long long magnitude = negative ? 0ULL - static_cast<unsigned long long>(value) : value;
        do {
            reversed[n++] = static_cast<char>('0' + magnitude % 10);
            magnitude /= 10;
        } while (magnitude);
        while (n < static_cast<size_t>(digits))
            reversed[n++] = '0';
        size_t length = 0;
        if (negative)
            out[length++] = '-';
        while (n)
            out[length++] = reversed[--n];
        return length;
    }

    const std::vector<Node>& m_nodes;
    Port& m_port;
    const record::Report& m_report;
    __int64 m_dataLength;
    __int64 m_externalCount;
    std::vector<Span>& m_spans;
    std::vector<Level>& m_levels; // [depth]: the repetition a field at that depth belongs to
    std::vector<PropertyMap::iterator>& m_byRank;
    std::vector<uint64_t>& m_ranked;
    int m_rankCount;
    bool m_fresh = false;
    PropertyMap* m_readMap = nullptr;
    CKeyStore* m_keys = nullptr;
    const PropertyMap* m_writeMap = nullptr;
    const PropertyMap* m_overrides = nullptr;
    std::string& m_scratch;
    bool m_stopped = false;
    bool m_listing = false;
};

} // namespace

__int64 CRecordLayout::read(FILE* fp, PropertyMap& map, CKeyStore& keys, const record::Report& report,
                            __int64 dataLength, __int64 limit, __int64 externalCount) const {
    if (dataLength >= 0)
        limit = limit >= 0 ? std::min(limit, std::max(dataLength, kLargestTre))
                           : std::max(dataLength, kLargestTre);
    ScratchLease scratch;
    FileInput input(fp, limit, static_cast<size_t>(std::min<long long>(m_minimalLength, 1 << 16)),
                    (*scratch).input);
    if (report.start)
        *report.start = input.position();
    Walk(*this, input, *scratch, report, dataLength, externalCount).read(map, keys);
    input.finish();
    return input.consumed();
}

__int64 CRecordLayout::write(FILE* fp, const PropertyMap& map, const PropertyMap* overrides,
                             const record::Report& report) const {
    ScratchLease scratch;
    FileOutput output(fp);
    Walk(*this, output, *scratch, report, -1, 0).write(map, overrides);
    return output.consumed();
}

__int64 CRecordLayout::length(const PropertyMap& map, const PropertyMap* overrides) const {
    ScratchLease scratch;
    Counter counter;
    Walk(*this, counter, *scratch, {}, -1, 0).write(map, overrides);
    return counter.consumed();
}

void CRecordLayout::listFields(const PropertyMap& map, __int64 offset,
                               std::vector<NitfField_t>& fields) const {
    ScratchLease scratch;
    Counter counter(offset);
    record::Report report;
    report.fields = &fields;
    Walk(*this, counter, *scratch, report, -1, 0).list(map);
}

void CRecordLayout::deserialize(nitf::CSerializer& in, PropertyMap& map, CKeyStore& keys,
                                __int64 externalCount) const {
    ScratchLease scratch;
    SerializerPort port(in);
    Walk(*this, port, *scratch, {}, -1, externalCount).read(map, keys);
}

void CRecordLayout::serialize(nitf::CSerializer& out, const PropertyMap& map) const {
    ScratchLease scratch;
    SerializerPort port(out);
    Walk(*this, port, *scratch, {}, -1, 0).write(map, nullptr);
}
