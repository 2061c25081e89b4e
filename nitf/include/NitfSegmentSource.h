// What the graphic/symbol, label, text and data extension segments share: where the segment lies, its
// sub-header fields, the TREs of its extended area, and access to its data bytes.
#pragma once

#include <cstdio>
#include <list>
#include <vector>

#include "NitfHeaderDataPair.h"
#include "NitfProperty.h"
#include "NitfTag.h"
#include "NitfTypes.h"

class CNitfFile;

class CNitfSegmentSource {
public:
    CNitfSegmentSource();
    virtual ~CNitfSegmentSource();
    CNitfSegmentSource(const CNitfSegmentSource&) = delete;
    CNitfSegmentSource& operator=(const CNitfSegmentSource&) = delete;

    // Records where the sub-header and the data lie.
    void prepare(const CNitfHeaderDataPair* pair);

    PropertyMap& getProperties() { return m_properties; }
    std::list<CNitfTag*>& getTaggedRecords() { return m_taggedRecords; }
    // The names of the fields read, in file order.
    const std::vector<const char*>& getFieldNames() const { return m_fieldNames; }
    // The text of a field with trailing blanks removed, or "" when absent.
    std::string getField(const char* name);

    __int64 getSubheaderOffset() const { return m_subheaderOffset; }
    __int64 getDataOffset() const { return m_dataOffset; }
    __int64 getDataLength() const { return m_dataLength; }
    int getIndex() const { return m_index; }
    void setIndex(int index) { m_index = index; }

    // The segment's data bytes in a new buffer (released with free()), `getDataLength()` bytes long; a length
    // the file cannot hold raises vexo::Exception.
    char* getNewData(CNitfFile* file);

protected:
    // Seeks the stream to the sub-header (when `fp` is null, the file's own stream) and returns it.
    FILE* positionAtSubheader(CNitfFile* file, FILE* fp);
    // Reads a TRE area: its 5-digit length (stored under `lengthName`), then when not 0 the overflow number
    // (skipped) and the TREs, numbered in this segment's list.
    void readTagArea(FILE* fp, const char* lengthName, CNitfTag::eTagSource_t source);
    void clearContents();

    __int64 m_subheaderOffset;
    __int64 m_dataOffset;
    __int64 m_dataLength;
    int m_index;
    PropertyMap m_properties;
    std::list<CNitfTag*> m_taggedRecords;
    std::vector<const char*> m_fieldNames;
};
