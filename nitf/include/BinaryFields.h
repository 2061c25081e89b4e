// The one field list of a binary record, driven in either direction. A record lists its fields once, in file
// order, as calls on a CBinaryFields; writing hands each field to a serializer, reading takes it from one
// (checking every read against the end of the file), and measuring is writing into a CSerializerQuery.
// Tables of records and counted runs of variable records are described the same way, with the fields that
// hold their counts, positions and record lengths.
#pragma once

#include <array>
#include <cstddef>
#include <string>
#include <vector>

#include "HostCompat.h"
#include "Serializer.h"

namespace nitf {

class CSerializableRecord;

// A fixed-width text field: its bytes as stored, blank-padded, with no terminator.
template <size_t N> using FixedText = std::array<char, N>;

// `text` cut or blank-padded to the field's width, left-justified or right-justified.
template <size_t N> FixedText<N> makeText(const std::string& text, bool rightJustified = false) {
    FixedText<N> field;
    field.fill(' ');
    const size_t length = text.size() < N ? text.size() : N;
    text.copy(field.data() + (rightJustified ? N - length : 0), length);
    return field;
}

// The field's text without the blanks and NULs around it.
template <size_t N> std::string textOf(const FixedText<N>& field) {
    size_t first = 0, last = N;
    while (first < last && (field[first] == ' ' || field[first] == '\0'))
        ++first;
    while (last > first && (field[last - 1] == ' ' || field[last - 1] == '\0'))
        --last;
    return std::string(field.data() + first, last - first);
}

class CBinaryFields {
public:
    enum eDirection_t { eWrite, eRead };

    // Reading checks every field against `readLimit`, the position where the readable data end (the size of
    // the file); writing and measuring ignore it.
    CBinaryFields(CSerializer& serializer, eDirection_t direction, __int64 readLimit = 0);

    bool reading() const { return m_direction == eRead; }
    // The position of the next field (absolute, like the serializer's).
    __int64 position() const { return m_position; }
    CBinaryFields& seek(__int64 position);

    // Big-endian binary fields (the serializer does the byte order).
    CBinaryFields& operator()(unsigned char& value);
    CBinaryFields& operator()(unsigned short& value);
    CBinaryFields& operator()(unsigned int& value);
    CBinaryFields& operator()(double& value);
    template <size_t N> CBinaryFields& operator()(FixedText<N>& text) { return bytes(text.data(), N); }
    // A nested record, through the serializer when writing (so that a query can locate it).
    CBinaryFields& operator()(CSerializableRecord& record);

    // Raw bytes, never swapped.
    CBinaryFields& bytes(void* data, size_t length);
    // A text of `length` bytes (a field before it), which must lie in [shortest, longest]: refused when
    // reading otherwise. Writing a text whose size is not `length` raises vexo::Exception.
    CBinaryFields& text(std::string& text, unsigned length, unsigned shortest, unsigned longest);

    // A table of `count` records, the first at `at`, each `recordLength` bytes after the previous one. When
    // reading, record lengths shorter than the record's fields and tables that run past the end are refused
    // before anything is allocated; when writing, every record of the vector is written.
    template <class Record>
    CBinaryFields& table(std::vector<Record>& records, __int64 count, __int64 at, __int64 recordLength) {
        if (reading()) {
            checkTable(Record::kName, count, at, recordLength, Record::kLength);
            records.assign(static_cast<size_t>(count), Record());
        }
        for (size_t i = 0; i < records.size(); ++i) {
            seek(at + static_cast<__int64>(i) * recordLength);
            (*this)(records[i]);
        }
        return *this;
    }

    // `count` records of variable length, one after the other from the position, each at least `shortest`
    // bytes: when reading, a count that cannot fit before the end is refused before anything is allocated.
    template <class Record>
    CBinaryFields& run(std::vector<Record>& records, __int64 count, __int64 shortest) {
        if (reading()) {
            checkTable(Record::kName, count, m_position, shortest, shortest);
            records.assign(static_cast<size_t>(count), Record());
        }
        for (Record& record : records)
            (*this)(record);
        return *this;
    }

private:
    // Raises vexo::Exception unless `length` bytes can be read at the position.
    void require(__int64 length);
    void checkTable(const char* name, __int64 count, __int64 at, __int64 recordLength, __int64 fieldsLength);

    CSerializer& m_serializer;
    eDirection_t m_direction;
    __int64 m_readLimit;
    __int64 m_position;
    const char* m_record; // the name of the record being read, for messages
};

} // namespace nitf
