// What the graphic/symbol, label, text and data extension segments share: where the segment lies, its
// sub-header fields, the TREs of its extended area, and access to its data bytes.
#pragma once

#include <cstdio>
#include <list>
#include <utility>
#include <vector>

#include "NitfField.h"
#include "NitfHeaderDataPair.h"
#include "NitfProperty.h"
#include "NitfTag.h"
#include "NitfTypes.h"

class CNitfFile;
class CRecordLayout;
namespace record {
struct Report;
}

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
    // The fields read, in file order.
    const std::vector<NitfField_t>& getFields() const;
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
    // Reads the fields of `layout` at the stream's position, then the TREs of its area named `area` (when
    // given) into this segment's list with `source`.
    void readFields(FILE* fp, const CRecordLayout& layout, const char* area = nullptr,
                    CNitfTag::eTagSource_t source = CNitfTag::eTagSourceUnknown);
    // Reads one part of the sub-header at the stream's position (the parts follow each other).
    void readPart(FILE* fp, const CRecordLayout& layout, const record::Report& report);
    void clearContents();

    __int64 m_subheaderOffset;
    __int64 m_dataOffset;
    __int64 m_dataLength;
    int m_index;
    PropertyMap m_properties;
    std::list<CNitfTag*> m_taggedRecords;
    // Where the parts of the sub-header were read: the fields are listed from there when first asked for.
    std::vector<std::pair<const CRecordLayout*, __int64>> m_parts;
    mutable std::vector<NitfField_t> m_fields;
    mutable bool m_fieldsListed = false;
};
