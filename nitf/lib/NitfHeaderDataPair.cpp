#include "NitfHeaderDataPair.h"

// The two records are allocated together: a file header holds one pair per segment, thousands for some.
CNitfHeaderDataPair::CNitfHeaderDataPair() : m_header(new CDataPointer[2]), m_data(m_header + 1) {}

CNitfHeaderDataPair::CNitfHeaderDataPair(__int64 headerOffset, int headerLength, __int64 dataLength)
    : CNitfHeaderDataPair() {
    setOffsets(headerOffset, headerLength, dataLength);
}

CNitfHeaderDataPair::CNitfHeaderDataPair(const CNitfHeaderDataPair& other) : CNitfHeaderDataPair() {
    *this = other;
}

CNitfHeaderDataPair::~CNitfHeaderDataPair() {
    delete[] m_header;
}

CNitfHeaderDataPair& CNitfHeaderDataPair::operator=(const CNitfHeaderDataPair& other) {
    *m_header = *other.m_header;
    *m_data = *other.m_data;
    return *this;
}

void CNitfHeaderDataPair::setOffsets(__int64 headerOffset, __int64 headerLength, __int64 dataLength) {
    *m_header = CDataPointer(headerOffset, headerLength);
    *m_data = CDataPointer(headerOffset + headerLength, dataLength);
}

__int64 CNitfHeaderDataPair::computeVectorLengths(std::vector<CNitfHeaderDataPair*>* pairs) {
    __int64 total = 0;
    for (const CNitfHeaderDataPair* pair : *pairs)
        total += pair->getHeaderLength() + pair->getDataLength();
    return total;
}
