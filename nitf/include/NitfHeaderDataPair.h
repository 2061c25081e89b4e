// One segment's sub-header and data: the data part begins right after the sub-header.
#pragma once

#include <vector>

#include "DataPointer.h"

class CNitfHeaderDataPair {
public:
    CNitfHeaderDataPair();
    CNitfHeaderDataPair(__int64 headerOffset, int headerLength, __int64 dataLength);
    CNitfHeaderDataPair(const CNitfHeaderDataPair& other);
    ~CNitfHeaderDataPair();
    // Copies the two pointer values (shallow).
    CNitfHeaderDataPair& operator=(const CNitfHeaderDataPair& other);

    void setOffsets(__int64 headerOffset, __int64 headerLength, __int64 dataLength);

    const CDataPointer* getHeader() const { return m_header; }
    const CDataPointer* getData() const { return m_data; }
    __int64 getHeaderOffset() const { return m_header->getOffset(); }
    __int64 getHeaderLength() const { return m_header->getLength(); }
    __int64 getHeaderEnd() const { return m_header->getEnd(); }
    __int64 getDataOffset() const { return m_data->getOffset(); }
    __int64 getDataLength() const { return m_data->getLength(); }
    __int64 getDataEnd() const { return m_data->getEnd(); }

    // Sum of sub-header and data lengths over the list; 0 for an empty list.
    static __int64 computeVectorLengths(std::vector<CNitfHeaderDataPair*>* pairs);

private:
    CDataPointer* m_header;
    CDataPointer* m_data;
};
