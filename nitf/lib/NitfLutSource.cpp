#include "NitfLutSource.h"

#include <cstring>
#include <vector>

#include "DataStream.h"
#include "HostFile.h"
#include "NitfFile.h"

CNitfLutSource::CNitfLutSource()
    : m_entryType(eEntryTypeNone), m_entryCount(0), m_entryOffset(0), m_interleaved(false), m_band(0) {}

int CNitfLutSource::getEntrySize() const {
    switch (m_entryType) {
    case eEntryTypeRGB:
        return 3;
    case eEntryTypeRGBA:
    case eEntryTypeCMYK:
        return 4;
    case eEntryTypeMono:
    case eEntryTypeMono5:
    case eEntryTypeMono6:
    case eEntryTypeMono7:
        return 1;
    default:
        return 0;
    }
}

int CNitfLutSource::getSize() const {
    return m_entryCount > 0 ? getEntrySize() * m_entryCount : 0;
}

void CNitfLutSource::deinterleave(char* dst, char* src, int entries, int components, int stride) {
    for (int e = 0; e < entries; ++e) {
        for (int c = 0; c < components; ++c)
            dst[e + c * stride] = *src++;
    }
}

void CNitfLutSource::interleave(char* dst, char* src, int entries, int components, int stride) {
    for (int e = 0; e < entries; ++e) {
        for (int c = 0; c < components; ++c)
            *dst++ = src[e + c * stride];
    }
}

static void readStored(CNitfFile* file, __int64 offset, char* buffer, int size) {
    CDataStream::readZeroFilledAt(file->getInputStream(), offset, buffer, static_cast<size_t>(size));
}

// The stored table, or (convert) its entries gathered from the component tables into entry order.
static void readTable(CNitfFile* file, const CNitfLutSource& lut, char* buffer, bool convert) {
    int size = lut.getSize();
    if (size <= 0)
        return;
    if (!convert) {
        readStored(file, lut.getEntryOffset(), buffer, size);
        return;
    }
    std::vector<char> stored(size);
    readStored(file, lut.getEntryOffset(), stored.data(), size);
    CNitfLutSource::interleave(buffer, stored.data(), lut.getEntryCount(), lut.getEntrySize(),
                               lut.getEntryCount());
}

void CNitfLutSource::readInterleaved(CNitfFile* file, char* buffer, int) {
    readTable(file, *this, buffer, !m_interleaved);
}

// With the interleaved flag set the caller's buffer is in entry order, so the stored tables are converted.
void CNitfLutSource::readNonInterleaved(CNitfFile* file, char* buffer, int) {
    readTable(file, *this, buffer, m_interleaved);
}

void CNitfLutSource::writeNonInterleaved(CNitfFile* file, char* buffer, int) {
    int size = getSize();
    if (size <= 0)
        return;
    FILE* fp = file->getOutputStream();
    DKFSeek64(fp, m_entryOffset, SEEK_SET);
    if (!m_interleaved) {
        DKFWrite(buffer, size, 1, fp);
        return;
    }
    std::vector<char> stored(size);
    deinterleave(stored.data(), buffer, m_entryCount, getEntrySize(), m_entryCount);
    DKFWrite(stored.data(), size, 1, fp);
}
