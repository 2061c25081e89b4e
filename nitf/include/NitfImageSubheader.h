// Every field of one image segment's sub-header, with what it points at in the file: comments, band look-up
// tables, the corner coordinates and the segment's TREs.
#pragma once

#include <cstdio>
#include <list>
#include <memory>
#include <vector>

#include "DataPointer.h"
#include "NitfField.h"
#include "NitfGeorefInfo.h"
#include "NitfLutSource.h"
#include "NitfProperty.h"
#include "NitfTag.h"
#include "NitfTypes.h"

class CNitfExtension;
class CMAPLOBExtension;
class CRPFIMGExtension;
class CRpcSource;
class CNitfFile;
class CKeyStore;
class CRecordLayout;

class CNitfImageSubheader {
public:
    CNitfImageSubheader();
    CNitfImageSubheader(const CNitfImageSubheader& other);
    CNitfImageSubheader& operator=(const CNitfImageSubheader& other);
    virtual ~CNitfImageSubheader();

    // Reads the sub-header at the stream's position; the version chooses the security block layout.
    virtual void read(FILE* fp, eNitfVersion_t version) = 0;
    virtual void write(FILE* fp) = 0;
    virtual __int64 computeStorageLength() = 0;
    virtual void getTitle(char* title) = 0;
    // Reads comment `index` (80 bytes, then a line feed and a NUL: `buffer` holds 82 bytes) when it exists;
    // returns the number of comments either way.
    virtual int readComment(FILE* fp, int index, char* buffer);

    bool hasComments() const { return !m_comments.empty(); }
    int getCommentCount() const { return static_cast<int>(m_comments.size()); }
    PropertyMap& getProperties() { return m_properties; }
    std::list<CNitfTag*>& getTaggedRecords() { return m_taggedRecords; }
    CNitfGeorefInfo& getGeorefSource() { return m_georef; }
    int getLutCount() const { return static_cast<int>(m_luts.size()); }
    // The look-up table at `index`, or null.
    CNitfLutSource* getLutSource(int index);
    CNitfLutSource* addNewLutSource();
    void setPropertiesModified() { m_propertiesModified = true; }
    bool getPropertiesModified() const { return m_propertiesModified; }
    // The fields read, in file order.
    const std::vector<NitfField_t>& getFields() const;

    // The integer value of "LALVL" (an empty field is created when absent, so this is 0 for files read).
    int getImageAttachment();

    bool hasExtensionCSCCGA() { return hasTag("CSCCGA"); }
    bool hasExtensionIChipB() { return hasTag("ICHIPB"); }
    bool hasExtensionMAPLOB() { return hasTag("MAPLOB"); }
    bool hasExtensionRpfImg() { return hasTag("RPFIMG"); }
    bool hasExtensionRpc() { return hasTag("RPC00B") || hasTag("RPC00A"); }

    // New parsers placed on the segment's TRE (null when it is absent); the caller owns them and reads them
    // with readNewInfo.
    CMAPLOBExtension* getMAPLOBExtension();
    CRPFIMGExtension* getRpfImgExtension();
    // A rational polynomial source on "RPC00B", else on "RPC00A"; null when neither is present.
    CRpcSource* getNewExtensionRpcSource();
    // Appends an image TRE entry for an RPC TRE ("RPC00B" when `name` is null) sized for its storage.
    void addExtensionRpcSource(const char* name);

    // Per-band field names: the field name and the band number (from 1), zero-padded to the width of the band
    // count for counts below 1000, unpadded from 1000 bands on. Released with free().
    static char* bandFieldName(const char* name, int index, int count);

    // The number of bands: XBANDS when NBANDS is 0, else NBANDS.
    int getBandCount();

    // Warns when a TRE or a look-up table reaches past `fileSize`, the end of the file read.
    void warnOfRecordsPastTheEnd(__int64 fileSize);

protected:
    bool hasTag(const char* name) { return CNitfTag::find(name, m_taggedRecords) != nullptr; }
    void clearContents();

    // The layout a version's sub-header is read with, and the one this class writes.
    virtual const CRecordLayout& readLayout(eNitfVersion_t version) const = 0;
    virtual const CRecordLayout& writeLayout() const = 0;
    // Reads the sub-header with the layout of `version`, then what its fields point at: comments, look-up
    // tables, corners and TREs.
    void readWith(FILE* fp, eNitfVersion_t version);
    // Writes the sub-header in this class's layout with the values that writing computes (see
    // writtenValues), and places the look-up table, the corners and the TREs; returns the bytes written.
    __int64 writeWithLayout(FILE* fp);
    // The bytes writeWithLayout produces, plus the extended area of a sub-header read from a file (IXSHDL is
    // still counted, although it is written as "00000").
    __int64 storageLength();
    // The title: the classification word unless unclassified, then the text of `nameField`; cut to 80
    // characters.
    void buildTitle(const char* nameField, char* title);

    std::vector<CDataPointer*> m_comments;
    std::vector<CNitfLutSource*> m_luts;
    CNitfGeorefInfo m_georef;
    std::list<CNitfTag*> m_taggedRecords;
    PropertyMap m_properties;
    bool m_propertiesModified;
    std::unique_ptr<CKeyStore> m_keys; // the keys of the band fields
    // Where the sub-header was read: its fields are listed from there when first asked for.
    const CRecordLayout* m_readLayout = nullptr;
    __int64 m_readOffset = 0;
    mutable std::vector<NitfField_t> m_fields;
    mutable bool m_fieldsListed = false;

private:
    // The values that writing computes rather than takes from the map: IREP, NICOM, IFCn, IMFLTn, the look-up
    // table fields, UDIDL, UDOFL and IXSHDL.
    void writtenValues(PropertyMap& values, CKeyStore& keys);
};
