#include "NitfFileHeaderV20.h"

#include <cstring>
#include <string>

#include "DataStreamWrite.h"
#include "FieldLayout.h"
#include "HostFile.h"
#include "NitfImageSubheaderV20.h"

// From FHDR to HL.
static const CFieldLayout& fieldLayout() {
    static const CFieldLayout layout =
        CFieldLayout{{"FHDR", 9}, {"CLEVEL", 2}, {"STYPE", 4}, {"OSTAID", 10}, {"FDT", 14}, {"FTITLE", 80}}
            .add(CFieldLayout::security20("FS"))
            .add(CFieldLayout{{"FSCOP", 5}, {"FSCPYS", 5}, {"ENCRYP", 1}, {"ONAME", 27}, {"OPHONE", 18}})
            .add(CFieldLayout{{"FL", 12}, {"HL", 6}});
    return layout;
}

void CNitfFileHeaderV20::read(FILE* fp, CNitfFileReader*) {
    clearContents();
    fieldLayout().read(fp, m_properties, &m_fieldNames);
    __int64 offset = FindProperty(m_properties, "HL")->getAsInt64();
    offset += readSegmentTable(fp, "NUMI", offset, 6, 10, &m_images);
    offset += readSegmentTable(fp, "NUMS", offset, 4, 6, &m_symbols);
    offset += readSegmentTable(fp, "NUML", offset, 4, 3, &m_labels);
    offset += readSegmentTable(fp, "NUMT", offset, 4, 5, &m_texts);
    offset += readSegmentTable(fp, "NUMDES", offset, 4, 9, &m_dataExtensions);
    offset += readSegmentTable(fp, "NUMRES", offset, 4, 7, &m_reservedExtensions);
    readTagArea(fp, "UDHDL");
    readTagArea(fp, "XHDL");
    m_propertiesModified = false;
}

// NUMS, NUML, NUMT, NUMDES, NUMRES, UDHDL and XHDL of a written header: images only, no TREs.
static const char kWrittenTail[] = "000000000000000"
                                   "00000"
                                   "00000";

void CNitfFileHeaderV20::write(FILE* fp) {
    CFieldLayout head;
    for (const FieldSpec& field : fieldLayout().fields()) {
        if (std::strcmp(field.name, "FL") != 0 && std::strcmp(field.name, "HL") != 0)
            head.add(field);
    }
    head.write(fp, m_properties);
    CDataStreamWrite out(fp);
    out.writeDecimal64(computeFileLength(), 12, true);
    out.writeDecimal64(computeStorageLength(), 6, true);
    writePairs(fp, 3, 6, 10, &m_images);
    out.writeBytes(kWrittenTail, sizeof kWrittenTail - 1);
}

__int64 CNitfFileHeaderV20::computeStorageLength() {
    return fieldLayout().length(m_properties) + 3 + 16 * static_cast<__int64>(m_images.size()) +
           static_cast<__int64>(sizeof kWrittenTail - 1);
}

void CNitfFileHeaderV20::getTitle(char* title) {
    CNitfProperty* field = FindProperty(m_properties, "FTITLE");
    std::string text = field ? field->toText().substr(0, 80) : std::string();
    text.erase(text.find_last_not_of(' ') + 1);
    std::strcpy(title, text.c_str());
}

CNitfImageSubheader* CNitfFileHeaderV20::getNewImageSubheader(FILE* fp, int index) {
    return readImageSubheader<CNitfImageSubheaderV20>(fp, index);
}
