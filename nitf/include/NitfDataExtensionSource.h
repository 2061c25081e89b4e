// A data extension segment's sub-header, recognising four kinds by identifier: TRE overflow (whose TREs join
// the tag list of the header they overflowed from), the streaming file header (whose replacement header bytes
// it loads), cloud shapes ("CSSHPA DES") and XML data.
#pragma once

#include "NitfSegmentSource.h"

class CNitfImageSource;
class CNitfSymbolSource;

class CNitfDataExtensionSource : public CNitfSegmentSource {
public:
    CNitfDataExtensionSource() { constructor(); }
    ~CNitfDataExtensionSource() override;

    void constructor();

    // Reads the sub-header: from `fp` where it stands, or (null `fp`) from the file's stream at the
    // sub-header. Overflow TREs go to `image`'s or `graphic`'s list when the overflowed area is theirs and
    // they are given, else to the file header's list.
    void read(CNitfFile* file, eNitfVersion_t version, FILE* fp, CNitfImageSource* image,
              CNitfSymbolSource* graphic);

    bool isOverflow() const { return m_overflow; }
    bool isStreamingFileHeader() const { return m_streaming; }
    bool isCloudShape() const { return m_cloudShape; }
    bool isCSSHPAImageShapeDES();
    bool isXMLDES();

    int getStreamingHeaderLength() const { return m_streamingHeaderLength; }
    const char* getStreamingHeader() const { return m_streamingHeader; }
    // Copies of the TREs this segment carried (it keeps them for display; the owning lists hold their own).
    std::list<CNitfTag*>& getOverflowTags() { return m_overflowTags; }

private:
    void readStreamingHeader(FILE* fp);
    void readOverflowTags(CNitfFile* file, FILE* fp, CNitfImageSource* image, CNitfSymbolSource* graphic);

    int m_streamingHeaderLength;
    char* m_streamingHeader;
    bool m_overflow;
    bool m_streaming;
    bool m_cloudShape;
    std::list<CNitfTag*> m_overflowTags;
};
