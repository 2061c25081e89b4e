#include "NitfTag.h"

#include <algorithm>
#include <cstdlib>
#include <cstring>

#include "DataStreamRead.h"
#include "DataStreamWrite.h"
#include "HostFile.h"
#include "NitfExtension.h"

void CNitfTag::constructor() {
    std::memset(m_identifier, 0, sizeof m_identifier);
    m_data = CDataPointer(0, 0);
    m_source = eTagSourceUnknown;
    m_occurrence = 0;
    m_total = 0;
}

void CNitfTag::setIdentifier(const char* name) {
    std::memset(m_identifier, ' ', 6);
    std::strncpy(m_identifier, name, 6);
    m_identifier[6] = '\0';
}

bool CNitfTag::fromDES() const {
    return m_source == eTagSourceFileHeaderDES || m_source == eTagSourceImageDES ||
           m_source == eTagSourceSymbolDES || m_source == eTagSourceTextDES;
}

long long CNitfTag::read(FILE* fp) {
    CDataStreamRead in(fp);
    char* identifier = in.readText(6);
    std::memcpy(m_identifier, identifier, 7);
    free(identifier);
    long long length = in.readDecimal(5);
    // A signed CEL would walk the reader backwards; no TRE has a negative length.
    if (length < 0)
        length = 0;
    m_data = CDataPointer(DKFTell(fp), length);
    DKFSeek64(fp, length, SEEK_CUR);
    return length + getSize();
}

long long CNitfTag::read(const char* header, long long dataOffset) {
    std::memcpy(m_identifier, header, 6);
    m_identifier[6] = '\0';
    char digits[6];
    std::memcpy(digits, header + 6, 5);
    digits[5] = '\0';
    // A signed CEL would walk the reader backwards; no TRE has a negative length.
    long long length = std::max(0, std::atoi(digits));
    m_data = CDataPointer(dataOffset, length);
    return length + getSize();
}

long long CNitfTag::write(FILE* fp) {
    CDataStreamWrite out(fp);
    out.writeBytes(m_identifier, 6);
    out.writeDecimal64(m_data.getLength(), 5, true);
    m_data.setOffset(DKFTell(fp));
    DKFSeek64(fp, m_data.getLength(), SEEK_CUR);
    return m_data.getLength() + getSize();
}

void CNitfTag::setOccurrence(std::list<CNitfTag*>& list) {
    for (CNitfTag* other : list) {
        if (other == this || _stricmp(other->m_identifier, m_identifier) != 0)
            continue;
        if (other->m_occurrence == 0) {
            other->SetOccurrence(1);
            SetOccurrence(2);
        } else if (m_occurrence == 0) {
            SetOccurrence(other->m_total + 1);
        }
        other->IncrementTotal();
    }
}

bool CNitfTag::isKnownExtension() {
    return CNitfExtension::isKnownExtension(m_identifier);
}

CNitfTag* CNitfTag::find(const char* name, std::list<CNitfTag*>& list) {
    for (CNitfTag* tag : list) {
        if (std::strcmp(tag->m_identifier, name) == 0)
            return tag;
    }
    return nullptr;
}

long long CNitfTag::computeListDataLengths(std::list<CNitfTag*>* list) {
    long long total = 0;
    for (const CNitfTag* tag : *list)
        total += tag->getDataLength();
    return total;
}

long long CNitfTag::computeListTotalLengths(std::list<CNitfTag*>* list) {
    return getSize() * static_cast<long long>(list->size()) + computeListDataLengths(list);
}

long long CNitfTag::readArea(FILE* fp, long long length, eTagSource_t source, std::list<CNitfTag*>& list,
                             bool number) {
    // Every TRE consumes at least its 11-byte header, so the walk ends; it also ends at the end of the file.
    const long long available = CDataStream::remaining(fp);
    long long consumed = 0;
    while (consumed < length && available - consumed >= getSize()) {
        CNitfTag* tag = new CNitfTag;
        tag->setSource(source);
        consumed += tag->read(fp);
        if (number)
            tag->setOccurrence(list);
        list.push_back(tag);
    }
    return consumed;
}

long long CNitfTag::readArea(const char* area, long long length, long long offset, eTagSource_t source,
                             std::list<CNitfTag*>& list, bool number) {
    long long consumed = 0;
    while (consumed + getSize() <= length) {
        CNitfTag* tag = new CNitfTag;
        tag->setSource(source);
        consumed += tag->read(area + consumed, offset + consumed + getSize());
        if (number)
            tag->setOccurrence(list);
        list.push_back(tag);
    }
    return consumed;
}

void CNitfTag::destroyList(std::list<CNitfTag*>& list) {
    for (CNitfTag* tag : list)
        delete tag;
    list.clear();
}
