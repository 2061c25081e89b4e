// The file header of NITF 2.1 and its family: NSIF 1.0 and "OSDE01.00" (whose originator block differs).
#pragma once

#include "NitfFileHeader.h"

class CNitfFileHeaderV21 : public CNitfFileHeader {
public:
    explicit CNitfFileHeaderV21(eNitfVersion_t version = eNitfVersion21);

    void read(FILE* fp, CNitfFileReader* reader) override;
    void write(FILE* fp) override;
    __int64 computeStorageLength() override;
    void getTitle(char* title) override;
    CNitfImageSubheader* getNewImageSubheader(FILE* fp, int index) override;

    // True when the header was replaced by the one carried in a streaming file header segment.
    bool isStreamingReplacement() const { return m_streamingReplacement; }

private:
    void readFields(FILE* fp);
    // The file offset of a replacement header carried at the end of the file, or -1 when there is none.
    __int64 findStreamingHeader(FILE* fp);

    bool m_streamingReplacement = false;
    __int64 m_fieldsEnd = -1; // where the fields end (after the tag areas); -1 when reading stopped early
};
