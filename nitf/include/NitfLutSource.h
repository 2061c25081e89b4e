// One look-up table of an image band: where its entries lie in the file and how they are laid out.
#pragma once

#include "HostCompat.h"

class CNitfFile;

class CNitfLutSource {
public:
    // Codes of the table layouts; the entry size follows from the code.
    enum eEntryType_t {
        eEntryTypeNone = 0,
        eEntryTypeRGB = 1,   // three component tables (red, green, blue), 3 bytes per entry
        eEntryTypeRGBA = 2,  // four component tables, 4 bytes per entry
        eEntryTypeCMYK = 3,  // four component tables, 4 bytes per entry
        eEntryTypeMono = 4,  // one table, 1 byte per entry
        eEntryTypeMono5 = 5, // single-table variants, 1 byte per entry
        eEntryTypeMono6 = 6,
        eEntryTypeMono7 = 7,
    };

    CNitfLutSource();
    virtual ~CNitfLutSource() {}

    int getEntryType() const { return m_entryType; }
    void setEntryType(int type) { m_entryType = type; }
    int getBand() const { return m_band; }
    void setBand(int band) { m_band = band; }
    int getEntryCount() const { return m_entryCount; }
    void setEntryCount(int count) { m_entryCount = count; }
    __int64 getEntryOffset() const { return m_entryOffset; }
    void setEntryOffset(__int64 offset) { m_entryOffset = offset; }
    bool getInterleaving() const { return m_interleaved; }
    void setInterleaving(bool interleaved) { m_interleaved = interleaved; }

    // Bytes per entry (3, 4, 1 or 0 for unknown types) and of the whole table.
    int getEntrySize() const;
    int getSize() const;

    // Component tables `stride` bytes apart <-> entry-interleaved bytes.
    static void deinterleave(char* dst, char* src, int entries, int components, int stride);
    static void interleave(char* dst, char* src, int entries, int components, int stride);

    // The table as entries (each entry's components together); with the interleaved flag set, the stored
    // bytes unchanged. `buffer` holds getSize() bytes.
    void readInterleaved(CNitfFile* file, char* buffer, int size);
    // The table in the file's component-table layout (converted from the caller's entry layout when the
    // interleaved flag is set), read from and written to the entry offset.
    virtual void readNonInterleaved(CNitfFile* file, char* buffer, int size);
    virtual void writeNonInterleaved(CNitfFile* file, char* buffer, int size);

private:
    int m_entryType;
    int m_entryCount;
    __int64 m_entryOffset;
    bool m_interleaved;
    int m_band;
};
