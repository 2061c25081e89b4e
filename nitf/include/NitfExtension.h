// A parsed tagged record extension: every field of one TRE occurrence as a named value.
#pragma once

#include <cstdio>

#include "NitfProperty.h"

class CNitfFile;
class CNitfTag;

class CNitfExtension {
public:
    // The field reader: reads the TRE's fields from the stream's position into the property map.
    virtual void readInfo(FILE* fp) = 0;
    virtual ~CNitfExtension();
    // The TRE identifier this class parses, without trailing blanks ("ACFTB", "BANDSB", ...).
    virtual const char* getName() const = 0;
    // Seeks to the TRE's data and reads its fields.
    virtual void readNewInfo(FILE* fp, bool flag);
    virtual void readNewInfo(CNitfFile* file, bool flag);

    CNitfExtension();
    // Copies offset, length and the map's entries (the copy shares the property objects).
    CNitfExtension(const CNitfExtension& other);
    CNitfExtension& operator=(const CNitfExtension&) = delete;

    // A new parser for the tag's identifier with the tag's data place, or null; the caller owns it and then
    // calls readNewInfo.
    static CNitfExtension* Build(CNitfTag* tag);
    // Copies the tag's data offset and length (for parsers constructed directly).
    void prepare(CNitfTag* tag);
    static bool isKnownExtension(const char* identifier);
    // Appends the fields to a host metadata list as "KEY=VALUE" entries; see the implementation for key
    // forms.
    void asMetadata(char**& list, const char* prefix, const char* suffix);

    PropertyMap& getProperties() { return m_properties; }
    __int64 getDataOffset() const { return m_dataOffset; }
    __int64 getDataLength() const { return m_dataLength; }

protected:
    __int64 m_dataOffset;
    __int64 m_dataLength;
    PropertyMap m_properties;
};
