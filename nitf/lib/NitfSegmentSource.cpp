#include "NitfSegmentSource.h"

#include <cstring>
#include <string>

#include "DataStream.h"
#include "HostFile.h"
#include "HostMemory.h"
#include "NitfFile.h"
#include "RecordLayout.h"
#include "TagAreas.h"

CNitfSegmentSource::CNitfSegmentSource()
    : m_subheaderOffset(0), m_dataOffset(0), m_dataLength(0), m_index(-1) {}

CNitfSegmentSource::~CNitfSegmentSource() {
    clearContents();
}

void CNitfSegmentSource::clearContents() {
    DestroyPropertyMap(m_properties);
    CNitfTag::destroyList(m_taggedRecords);
    m_parts.clear();
    m_fields.clear();
    m_fieldsListed = false;
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

void CNitfSegmentSource::readFields(FILE* fp, const CRecordLayout& layout, const char* area,
                                    CNitfTag::eTagSource_t source) {
    std::vector<record::Placed> places;
    record::Report report;
    report.places = &places;
    readPart(fp, layout, report);
    // The overflow number is not kept: an overflow is resolved when its data extension segment is read.
    if (area)
        readTagAreas(places, {area}, source, m_taggedRecords);
}

void CNitfSegmentSource::readPart(FILE* fp, const CRecordLayout& layout, const record::Report& report) {
    // Segment layouts have no repeated fields: no keys are built.
    CKeyStore keys;
    m_parts.emplace_back(&layout, 0);
    record::Report withStart = report;
    withStart.start = &m_parts.back().second;
    layout.read(fp, m_properties, keys, withStart);
}

const std::vector<NitfField_t>& CNitfSegmentSource::getFields() const {
    if (!m_fieldsListed) {
        m_fields.clear();
        for (const auto& part : m_parts)
            part.first->listFields(m_properties, part.second, m_fields);
        m_fieldsListed = true;
    }
    return m_fields;
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
