// A parsed tagged record extension: every field of one TRE occurrence as a named value.
#pragma once

#include <cstdio>
#include <memory>
#include <vector>

#include "NitfField.h"
#include "NitfProperty.h"

class CNitfFile;
class CNitfTag;
class CRecordLayout;
class CKeyStore;

class CNitfExtension {
public:
    // The field reader: reads the TRE's fields from the stream's position into the property map, each as the
    // text of exactly its bytes, and leaves the stream after them. A TRE shorter than its layout is read on
    // past its end, never past the end of the file.
    virtual void readInfo(FILE* fp) = 0;
    // Deletes the properties and the keys built for them (once the last copy sharing them goes).
    virtual ~CNitfExtension();
    // The TRE identifier this class parses, without trailing blanks ("ACFTB", "BANDSB", ...).
    virtual const char* getName() const = 0;
    // Seeks to the TRE's data and reads its fields (a TRE of length 0 has none). `flag` is passed on to the
    // RPFIMG section reader and otherwise unused.
    virtual void readNewInfo(FILE* fp, bool flag);
    // The same on the file's input stream.
    virtual void readNewInfo(CNitfFile* file, bool flag);

    CNitfExtension();
    // Copies offset, length and the map's entries: the copy shares the property objects (and their keys) with
    // the original; they are released with the last of the two. A later read into either one gives it its
    // own.
    CNitfExtension(const CNitfExtension& other);
    CNitfExtension& operator=(const CNitfExtension&) = delete;

    // A new parser for the tag's identifier with the tag's data place, or null; the caller owns it and then
    // calls readNewInfo.
    static CNitfExtension* Build(CNitfTag* tag);
    // Copies the tag's data offset and length (for parsers constructed directly).
    void prepare(CNitfTag* tag);
    static bool isKnownExtension(const char* identifier);
    // The identifiers Build makes parsers for, in the order it tries them.
    static std::vector<const char*> getBuiltExtensionNames();
    // Appends every non-empty field to a host metadata list, in key order, under "P.NS.F", "P.N.F", "NS.F" or
    // "N.F" (P the prefix, N the TRE name, S the suffix, F the field key; null prefix or suffix leave theirs
    // out).
    void asMetadata(char**& list, const char* prefix, const char* suffix);

    // The big-endian unsigned number in a binary field of `width` bytes (1 to 8). Field readers keep every
    // field as text holding its bytes, whose buffer always holds the field's full width; a binary value
    // usually begins with NUL bytes, so its text conversions do not apply. 0 for a null property.
    static unsigned __int64 getBinaryValue(CNitfProperty* field, int width);

    PropertyMap& getProperties() { return m_properties; }
    // The fields the last read met, in file order (asMetadata gives them in key order instead).
    const std::vector<NitfField_t>& getFields() const { return m_fields; }
    __int64 getDataOffset() const { return m_dataOffset; }
    __int64 getDataLength() const { return m_dataLength; }
    // Bytes the last read consumed from the TRE's data (equal to the data length for a well-formed TRE).
    __int64 getReadLength() const { return m_readLength; }

protected:
    // Reads the fields of `layout` at the stream's position (see CRecordLayout::read) and records the bytes
    // consumed; the fields join those of earlier reads in the order met.
    void readLayout(FILE* fp, const CRecordLayout& layout, __int64 externalCount = 0);

    __int64 m_dataOffset;
    __int64 m_dataLength;
    PropertyMap m_properties;
    __int64 m_readLength;
    std::vector<NitfField_t> m_fields;

private:
    // The key store of this extension, made its own first if it is shared with a copy.
    CKeyStore& ownKeys();

    std::shared_ptr<CKeyStore> m_keys;
};
