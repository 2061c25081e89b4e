#include "NitfSegmentSource.h"

#include <cstring>
#include <string>

#include "DataStream.h"
#include "HostFile.h"
#include "HostMemory.h"
#include "NitfFile.h"

CNitfSegmentSource::CNitfSegmentSource()
    : m_subheaderOffset(0), m_dataOffset(0), m_dataLength(0), m_index(-1) {}

CNitfSegmentSource::~CNitfSegmentSource() {
    clearContents();
}

void CNitfSegmentSource::clearContents() {
    DestroyPropertyMap(m_properties);
    CNitfTag::destroyList(m_taggedRecords);
    m_fieldNames.clear();
}

void CNitfSegmentSource::prepare(const CNitfHeaderDataPair* pair) {
    m_subheaderOffset = pair->getHeaderOffset();
    m_dataOffset = pair->getDataOffset();
    m_dataLength = pair->getDataLength();
}

std::string CNitfSegmentSource::getField(const char* name) {
    CNitfProperty* value = FindProperty(m_properties, name);
    if (!value || value->getDataType() == CNitfProperty::eNone)
        return std::string();
    std::string text = value->toText();
    text.erase(text.find_last_not_of(' ') + 1);
    return text;
}

FILE* CNitfSegmentSource::positionAtSubheader(CNitfFile* file, FILE* fp) {
    if (fp)
        return fp;
    fp = file->getInputStream();
    DKFSeek64(fp, m_subheaderOffset, SEEK_SET);
    return fp;
}

void CNitfSegmentSource::readTagArea(FILE* fp, const char* lengthName, CNitfTag::eTagSource_t source) {
    CNitfProperty* length = CNitfProperty::getNewFromString(fp, 5);
    SetProperty(m_properties, lengthName, length);
    m_fieldNames.push_back(lengthName);
    int bytes = length->getAsInt();
    if (bytes <= 0)
        return;
    DKFSeek64(fp, 3, SEEK_CUR); // the overflow number: resolved when its data extension segment is read
    CNitfTag::readArea(fp, bytes - 3, source, m_taggedRecords, true);
}

char* CNitfSegmentSource::getNewData(CNitfFile* file) {
    FILE* fp = file->getInputStream();
    DKFSeek64(fp, m_dataOffset, SEEK_SET);
    __int64 length = m_dataLength > 0 ? m_dataLength : 0;
    CDataStream::requireReadable(fp, length, "Segment data");
    char* data = static_cast<char*>(HMalloc(static_cast<size_t>(length) + 1));
    CDataStream::readZeroFilled(fp, data, static_cast<size_t>(length));
    data[length] = '\0';
    return data;
}
