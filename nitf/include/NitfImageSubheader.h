// Every field of one image segment's sub-header, with what it points at in the file: comments, band look-up
// tables, the corner coordinates and the segment's TREs.
#pragma once

#include <cstdio>
#include <initializer_list>
#include <utility>
#include <list>
#include <vector>

#include "DataPointer.h"
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
    // The names of the fields read, in file order.
    const std::vector<const char*>& getFieldNames() const { return m_fieldNames; }

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

protected:
    bool hasTag(const char* name) { return CNitfTag::find(name, m_taggedRecords) != nullptr; }
    // A band field name owned by this sub-header.
    const char* ownBandFieldName(const char* name, int index, int count);
    void clearContents();

    // Reads the fields from ENCRYP to the end, common to every version; `rules` says where versions differ.
    struct BodyRules {
        eNitfVersion_t version;
        bool comratForAllCompressed; // NITF 2.0: COMRAT for every IC but NC/NM (2.1: a closed list)
        bool hasXbands;
        bool hasTagAreas;
    };
    void readBody(FILE* fp, const BodyRules& rules);
    void readField(FILE* fp, const char* name, int width);
    void readBand(FILE* fp, int band, int count, int representation);
    void readTagArea(FILE* fp, const char* lengthName);

    // Writes the fields from ENCRYP to the end in the 2.1 layout (shared by the 2.0 writer, whose fields
    // there are the same), and the length that produces on top of `fixedLength` (the fields up to IC, without
    // IGEOLO).
    void writeBody(FILE* fp);
    __int64 computeBodyStorageLength(__int64 fixedLength);
    // The title: the classification word unless unclassified, then the text of `nameField`; cut to 80
    // characters.
    void buildTitle(const char* nameField, char* title);
    // Writes the named fields from the map in their widths; a field with no value writes nothing.
    void writeFields(FILE* fp, std::initializer_list<std::pair<const char*, int>> fields);

    std::vector<CDataPointer*> m_comments;
    std::vector<CNitfLutSource*> m_luts;
    CNitfGeorefInfo m_georef;
    std::list<CNitfTag*> m_taggedRecords;
    PropertyMap m_properties;
    bool m_propertiesModified;
    std::vector<const char*> m_fieldNames;
    std::vector<char*> m_ownedNames;
};
