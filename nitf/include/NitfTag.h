// One tagged record extension (TRE) occurrence in a header's tag list: its identifier, where its data bytes
// lie, which header area holds it, and its number among the list's TREs of the same identifier.
#pragma once

#include <cstdio>
#include <list>

#include "DataPointer.h"

class CNitfTag {
public:
    // Odd values are header areas; the even values above 0 are the same areas reached through a TRE_OVERFLOW
    // data extension segment.
    enum eTagSource_t {
        eTagSourceUnknown = 0,
        eTagSourceFileHeader = 1,
        eTagSourceFileHeaderDES = 2,
        eTagSourceImage = 3,
        eTagSourceImageDES = 4,
        eTagSourceSymbol = 5,
        eTagSourceSymbolDES = 6,
        eTagSourceText = 7,
        eTagSourceTextDES = 8,
    };

    CNitfTag() { constructor(); }
    CNitfTag(const CNitfTag& other) = default;
    CNitfTag& operator=(const CNitfTag& other) = default;

    void constructor();

    // Blank-fills the six characters, then copies at most six characters of `name` with strncpy semantics (so
    // a shorter name ends NUL-filled, not blank-filled).
    void setIdentifier(const char* name);
    const char* getIdentifier() const { return m_identifier; }

    void setSource(eTagSource_t source) { m_source = source; }
    eTagSource_t getSource() const { return m_source; }
    // True for the overflow sources 2, 4, 6 and 8.
    bool fromDES() const;

    // Reads the 11-byte TRE header at the stream's position and skips the data; returns the bytes consumed.
    long long read(FILE* fp);
    // The same from the 11 bytes at `header`, whose data begins at the file offset `dataOffset`; returns the
    // bytes the TRE takes.
    long long read(const char* header, long long dataOffset);
    // Writes the 11-byte TRE header and skips the data (the caller puts it there); returns the bytes
    // accounted for.
    long long write(FILE* fp);

    long long getDataOffset() const { return m_data.getOffset(); }
    long long getDataLength() const { return m_data.getLength(); }
    void setDataOffset(long long offset) { m_data.setOffset(offset); }
    void setDataLength(long long length) { m_data.setLength(length); }
    const CDataPointer* getDataPointer() const { return &m_data; }

    // Size of the TRE header: CETAG (6) and CEL (5).
    static int getSize() { return 11; }

    void SetOccurrence(int n) { m_occurrence = m_total = n; }
    void IncrementTotal() { ++m_total; }
    int getOccurrence() const { return m_occurrence; }
    int getTotal() const { return m_total; }
    bool hasOccurrence() const { return m_occurrence != 0; }
    // Numbers this entry against the entries of the same identifier (ignoring case) already in `list`.
    void setOccurrence(std::list<CNitfTag*>& list);

    bool isKnownExtension();

    // First entry whose identifier equals `name` exactly (case-sensitive), or null.
    static CNitfTag* find(const char* name, std::list<CNitfTag*>& list);
    static long long computeListDataLengths(std::list<CNitfTag*>* list);
    // Bytes the TREs occupy in a header's extension area: 11 per entry plus the data lengths.
    static long long computeListTotalLengths(std::list<CNitfTag*>* list);

    // Reads TREs from the stream's position until `length` bytes are consumed, appending them to `list` with
    // `source`; numbered by occurrence unless they came through an overflow segment. Returns the bytes
    // consumed.
    static long long readArea(FILE* fp, long long length, eTagSource_t source, std::list<CNitfTag*>& list,
                              bool number);
    // The same over an area already in memory that begins at the file offset `offset`: a TRE header cut by
    // the area's end ends the walk.
    static long long readArea(const char* area, long long length, long long offset, eTagSource_t source,
                              std::list<CNitfTag*>& list, bool number);
    // Deletes every entry and empties the list.
    static void destroyList(std::list<CNitfTag*>& list);

private:
    char m_identifier[7];
    CDataPointer m_data;
    eTagSource_t m_source;
    int m_occurrence;
    int m_total;
};
