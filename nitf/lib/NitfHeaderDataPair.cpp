#include "NitfHeaderDataPair.h"

CNitfHeaderDataPair::CNitfHeaderDataPair() : m_header(new CDataPointer), m_data(new CDataPointer) {}

CNitfHeaderDataPair::CNitfHeaderDataPair(__int64 headerOffset, int headerLength, __int64 dataLength)
    : m_header(new CDataPointer(headerOffset, headerLength)),
      m_data(new CDataPointer(headerOffset + headerLength, dataLength)) {}

CNitfHeaderDataPair::CNitfHeaderDataPair(const CNitfHeaderDataPair& other)
    : m_header(new CDataPointer(*other.m_header)), m_data(new CDataPointer(*other.m_data)) {}

CNitfHeaderDataPair::~CNitfHeaderDataPair() {
    delete m_header;
    delete m_data;
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
