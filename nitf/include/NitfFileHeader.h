// What every version's file header has in common: version, field values, segment layout lists, file-level
// TREs.
#pragma once

#include <cstdio>
#include <list>
#include <vector>

#include "NitfField.h"
#include "NitfHeaderDataPair.h"
#include "NitfProperty.h"
#include "NitfTag.h"
#include "NitfTypes.h"

class CNitfFileReader;
class CRecordLayout;
class CNitfImageSubheader;

class CNitfFileHeader {
public:
    explicit CNitfFileHeader(eNitfVersion_t version);
    virtual ~CNitfFileHeader();
    CNitfFileHeader(const CNitfFileHeader&) = delete;
    CNitfFileHeader& operator=(const CNitfFileHeader&) = delete;

    // Reads the whole header from the stream's position (the start of the file).
    virtual void read(FILE* fp, CNitfFileReader* reader) = 0;
    virtual void write(FILE* fp) = 0;
    // The header's length in bytes as it would be written now.
    virtual __int64 computeStorageLength() = 0;
    // Copies the file title into `title` (at least 81 bytes).
    virtual void getTitle(char* title) = 0;
    // A new image sub-header of this header's version for image `index`, read from the file; the caller owns
    // it.
    virtual CNitfImageSubheader* getNewImageSubheader(FILE* fp, int index) = 0;

    // Reads nine bytes and maps them to a version; the stream is left after them.
    static eNitfVersion_t readVersion(FILE* fp);

    eNitfVersion_t getVersion() const { return m_version; }
    PropertyMap& getProperties() { return m_properties; }
    std::list<CNitfTag*>& getTaggedRecords() { return m_taggedRecords; }
    bool getPropertiesModified() const { return m_propertiesModified; }
    void setPropertiesModified() { m_propertiesModified = true; }
    // The fields read, in file order (the segment tables by their count fields).
    const std::vector<NitfField_t>& getFields() const { return m_fields; }

    int getImageCount() const { return static_cast<int>(m_images.size()); }
    int getSymbolCount() const { return static_cast<int>(m_symbols.size()); }
    int getLabelCount() const { return static_cast<int>(m_labels.size()); }
    int getTextCount() const { return static_cast<int>(m_texts.size()); }
    int getDataExtensionCount() const { return static_cast<int>(m_dataExtensions.size()); }
    int getReservedExtensionCount() const { return static_cast<int>(m_reservedExtensions.size()); }

    // The pair at a 0-based index, or null when the index is out of range.
    CNitfHeaderDataPair* getImageHeaderDataPair(int index) { return pairAt(m_images, index); }
    CNitfHeaderDataPair* getSymbolHeaderDataPair(int index) { return pairAt(m_symbols, index); }
    CNitfHeaderDataPair* getLabelHeaderDataPair(int index) { return pairAt(m_labels, index); }
    CNitfHeaderDataPair* getTextHeaderDataPair(int index) { return pairAt(m_texts, index); }
    CNitfHeaderDataPair* getDataExtensionHeaderDataPair(int index) { return pairAt(m_dataExtensions, index); }
    CNitfHeaderDataPair* getReservedExtensionHeaderDataPair(int index) {
        return pairAt(m_reservedExtensions, index);
    }

    // Ownership passes to the header.
    void addImageHeaderDataPair(CNitfHeaderDataPair* pair) { m_images.push_back(pair); }
    void addTaggedRecord(CNitfTag* tag) { m_taggedRecords.push_back(tag); }

    // Reads one segment table at the stream's position (its count field); returns the sum of its sub-header
    // and data lengths. `fieldBytes` and `count` report the table's own size and entry count.
    static __int64 readPairs(FILE* fp, __int64 firstOffset, int countWidth, int headerLengthWidth,
                             int dataLengthWidth, std::vector<CNitfHeaderDataPair*>* list,
                             __int64& fieldBytes, int& count);
    static void writePairs(FILE* fp, int countWidth, int headerLengthWidth, int dataLengthWidth,
                           std::vector<CNitfHeaderDataPair*>* list);

    // The header's storage length plus the image segments (the other segment types are not counted).
    __int64 computeFileLength();

    // Raises vexo::Exception when the sub-header of segment `index` of `kind` ("image", "graphic", ...) is
    // not wholly in the file: every field after the end would read as blanks.
    void requireSubheaderInFile(const CNitfHeaderDataPair* pair, const char* kind, int index) const;

protected:
    // Reads the user-defined and extended header data: UDHDL and XHDL, then the TREs of each area (the
    // overflow numbers are skipped).
    void readTagAreas(FILE* fp);
    // Reads one counted field (NUMI, ...) as text and the segment table behind it; returns the segments'
    // total.
    __int64 readSegmentTable(FILE* fp, const char* countName, __int64 firstOffset, int headerLengthWidth,
                             int dataLengthWidth, std::vector<CNitfHeaderDataPair*>* list);
    // After the segment tables and tag areas have been read (the header's fields end at `fieldsEnd`): an HL
    // that cannot be right (not a number, 0, all nines, shorter than the fields or longer than the file)
    // gives way to the length the fields imply, with a warning, and the segments are placed after it.
    void checkHeaderLength(FILE* fp, __int64 fieldsEnd);
    // Warns, once per segment type, of segments whose sub-header or data lie past the end of the file.
    void checkSegmentsInFile(FILE* fp);
    void recordField(const char* name, int width, __int64 offset) {
        m_fields.push_back({name, eFieldText, width, offset});
    }
    // A new sub-header of type `Subheader` read from image `index`'s place, or null for an unknown index.
    template <typename Subheader> CNitfImageSubheader* readImageSubheader(FILE* fp, int index);
    void clearContents();
    // Writes a header of image segments only: the fields of `head` (FHDR to HL, with FL and HL as they are
    // now), the image table, then no other segments and no TREs (NUMS, the reserved count, NUMT, NUMDES and
    // NUMRES "000", UDHDL and XHDL "00000").
    void writeImagesOnly(FILE* fp, const CRecordLayout& head);
    __int64 imagesOnlyLength(const CRecordLayout& head);

    std::vector<CNitfHeaderDataPair*> m_symbols;
    std::vector<CNitfHeaderDataPair*> m_images;
    std::vector<CNitfHeaderDataPair*> m_labels;
    std::vector<CNitfHeaderDataPair*> m_texts;
    std::vector<CNitfHeaderDataPair*> m_dataExtensions;
    std::vector<CNitfHeaderDataPair*> m_reservedExtensions;
    PropertyMap m_properties;
    std::list<CNitfTag*> m_taggedRecords;
    eNitfVersion_t m_version;
    bool m_propertiesModified;
    std::vector<NitfField_t> m_fields;
    __int64 m_fileSize = -1; // of the file read, taken once when the header is read

private:
    void seekToImageSubheader(FILE* fp, int index);
    static CNitfHeaderDataPair* pairAt(std::vector<CNitfHeaderDataPair*>& list, int index) {
        return index >= 0 && index < static_cast<int>(list.size()) ? list[index] : nullptr;
    }
};

template <typename Subheader> CNitfImageSubheader* CNitfFileHeader::readImageSubheader(FILE* fp, int index) {
    if (!getImageHeaderDataPair(index))
        return nullptr;
    requireSubheaderInFile(getImageHeaderDataPair(index), "image", index);
    seekToImageSubheader(fp, index);
    Subheader* subheader = new Subheader;
    try {
        subheader->read(fp, m_version);
        subheader->warnOfRecordsPastTheEnd(m_fileSize);
    } catch (...) {
        delete subheader;
        throw;
    }
    return subheader;
}
