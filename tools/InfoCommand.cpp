// nitf info: what a user needs to understand a file, as aligned text or as one JSON object.
#include <cstdio>
#include <cstring>
#include <memory>
#include <stdexcept>
#include <string>
#include <utility>
#include <vector>

#include "Commands.h"
#include "HostConfig.h"
#include "HostError.h"
#include "HostFile.h"
#include "JsonWriter.h"
#include "NitfDataExtensionSource.h"
#include "NitfExtension.h"
#include "NitfFileHeader.h"
#include "NitfFileReader.h"
#include "NitfImagePropertiesIF.h"
#include "NitfImageSubheader.h"
#include "NitfLabelSource.h"
#include "NitfSymbolSource.h"
#include "NitfTextSource.h"

namespace {

struct TreEntry {
    std::string tag;
    long long length;
    int source;
    int occurrence;
    int total;
    std::vector<std::pair<std::string, std::string>> fields; // parsed fields, "TRE.FIELD" keys
    std::string error;
};

// One header or sub-header: its fields in file order, its TREs, and summary lines for the text form.
struct Section {
    std::vector<std::pair<std::string, std::string>> fields;
    std::vector<TreEntry> tres;
    std::vector<std::string> summary;
};

struct FileInfo {
    std::string version;
    int versionCode = eNitfVersionUnknown;
    Section header;
    int counts[6] = {0, 0, 0, 0, 0, 0}; // image, graphic, label, text, des, res
    std::vector<Section> images, graphics, labels, texts, des;
};

const char* const kSourceNames[] = {"unknown",       "file header", "file header (DES)",
                                    "image",         "image (DES)", "graphic",
                                    "graphic (DES)", "text",        "text (DES)"};

std::string trimmed(std::string text) {
    text.erase(text.find_last_not_of(' ') + 1);
    return text;
}

// A field's value as stored: text without trailing blanks, raw bytes as hex digits, numbers in decimal.
std::string fieldText(CNitfProperty* value) {
    if (!value || value->getDataType() == CNitfProperty::eNone)
        return std::string();
    return value->getDataType() == CNitfProperty::eString ? trimmed(value->toText()) : value->toText();
}

std::string format(const char* fmt, long long a, long long b = 0, long long c = 0, long long d = 0) {
    char text[256];
    std::snprintf(text, sizeof text, fmt, a, b, c, d);
    return text;
}

void addFields(Section& section, PropertyMap& map, const std::vector<NitfField_t>& fields) {
    for (const NitfField_t& field : fields)
        section.fields.emplace_back(field.name, fieldText(FindProperty(map, field.name)));
}

// The fields of a TRE the library parses, as its metadata entries.
void parseTre(CNitfTag* tag, FILE* fp, TreEntry& entry) {
    std::unique_ptr<CNitfExtension> extension(CNitfExtension::Build(tag));
    if (!extension)
        return;
    char** list = nullptr;
    try {
        extension->readNewInfo(fp, false);
        extension->asMetadata(list, nullptr, nullptr);
    } catch (const vexo::Exception& e) {
        entry.error = e.what();
    }
    for (int i = 0; list && list[i]; ++i) {
        std::string item = list[i];
        size_t equals = item.find('=');
        entry.fields.emplace_back(item.substr(0, equals),
                                  equals == std::string::npos ? "" : trimmed(item.substr(equals + 1)));
    }
    DestroyStringList(list);
}

void addTres(Section& section, const std::list<CNitfTag*>& tags, FILE* fp) {
    for (CNitfTag* tag : tags) {
        TreEntry entry{trimmed(tag->getIdentifier()),
                       tag->getDataLength(),
                       tag->getSource(),
                       tag->getOccurrence(),
                       tag->getTotal(),
                       {},
                       {}};
        parseTre(tag, fp, entry);
        section.tres.push_back(entry);
    }
}

// The file header's fields, with each segment table's lengths right after its count, as they stand in the
// file.
Section describeHeader(CNitfFileHeader* header, FILE* fp) {
    struct Table {
        const char* count;
        const char* headerName;
        const char* dataName;
        int headerWidth, dataWidth;
        CNitfHeaderDataPair* (CNitfFileHeader::*pair)(int);
    };
    static const Table tables[] = {
        {"NUMI", "LISH", "LI", 6, 10, &CNitfFileHeader::getImageHeaderDataPair},
        {"NUMS", "LSSH", "LS", 4, 6, &CNitfFileHeader::getSymbolHeaderDataPair},
        {"NUML", "LLSH", "LL", 4, 3, &CNitfFileHeader::getLabelHeaderDataPair},
        {"NUMT", "LTSH", "LT", 4, 5, &CNitfFileHeader::getTextHeaderDataPair},
        {"NUMDES", "LDSH", "LD", 4, 9, &CNitfFileHeader::getDataExtensionHeaderDataPair},
        {"NUMRES", "LRESH", "LRE", 4, 7, &CNitfFileHeader::getReservedExtensionHeaderDataPair},
    };
    Section section;
    for (const NitfField_t& field : header->getFields()) {
        const char* name = field.name;
        section.fields.emplace_back(name, fieldText(FindProperty(header->getProperties(), name)));
        for (const Table& table : tables) {
            if (std::strcmp(name, table.count) != 0)
                continue;
            for (int i = 0; CNitfHeaderDataPair* pair = (header->*table.pair)(i); ++i) {
                std::string number = format("%03lld", i + 1);
                section.fields.emplace_back(table.headerName + number,
                                            format("%0*lld", table.headerWidth, pair->getHeaderLength()));
                section.fields.emplace_back(table.dataName + number,
                                            format("%0*lld", table.dataWidth, pair->getDataLength()));
            }
        }
    }
    addTres(section, header->getTaggedRecords(), fp);
    return section;
}

Section describeImage(CNitfImageSubheader* subheader, FILE* fp) {
    Section section;
    addFields(section, subheader->getProperties(), subheader->getFields());
    addTres(section, subheader->getTaggedRecords(), fp);

    CNitfImagePropertiesIF geometry;
    PropertyMap& map = subheader->getProperties();
    geometry.setProperties(map);
    static const char* const modes[] = {"S", "B", "P", "R", "?"};
    std::string comrat =
        FindProperty(map, "COMRAT") ? " (COMRAT " + fieldText(FindProperty(map, "COMRAT")) + ")" : "";
    section.summary.push_back(
        format("%lld x %lld pixels, %lld band(s) of %lld bits", geometry.getImageActualWidth(),
               geometry.getImageActualHeight(), geometry.getBandCount(), geometry.getBpp()) +
        format(" (ABPP %lld)", geometry.getActualBpp()) + ", IMODE " + modes[geometry.getInterleavingType()]);
    section.summary.push_back(
        format("%lld x %lld blocks of %lld x %lld", geometry.getTileCountX(), geometry.getTileCountY(),
               geometry.getTileWidth(), geometry.getTileHeight()) +
        ", IC " + fieldText(FindProperty(map, "IC")) + comrat + ", IREP " +
        fieldText(FindProperty(map, "IREP")) + ", PVTYPE " + fieldText(FindProperty(map, "PVTYPE")));
    for (int i = 0; i < subheader->getLutCount(); ++i) {
        CNitfLutSource* lut = subheader->getLutSource(i);
        section.summary.push_back(format("LUT: band %lld, %lld entries of %lld byte(s)", lut->getBand(),
                                         lut->getEntryCount(), lut->getEntrySize()));
    }
    for (int i = 0; i < subheader->getCommentCount(); ++i) {
        char comment[82];
        subheader->readComment(fp, i, comment);
        comment[80] = '\0';
        section.summary.push_back("comment: " + trimmed(comment));
    }
    if (FindProperty(map, "IGEOLO1")) {
        std::string corners = "corners (ICORDS " + fieldText(FindProperty(map, "ICORDS")) + "):";
        for (const char* corner : {"IGEOLO1", "IGEOLO2", "IGEOLO3", "IGEOLO4"})
            corners += " " + FindProperty(map, corner)->toText();
        section.summary.push_back(corners);
    }
    if (!geometry.dataValid())
        section.summary.push_back("geometry is not valid for decoding");
    return section;
}

Section describeSegment(CNitfSegmentSource& segment, FILE* fp) {
    Section section;
    addFields(section, segment.getProperties(), segment.getFields());
    addTres(section, segment.getTaggedRecords(), fp);
    section.summary.push_back(
        format("data: %lld bytes at offset %lld", segment.getDataLength(), segment.getDataOffset()));
    return section;
}

Section describeDes(CNitfDataExtensionSource& des, FILE* fp) {
    Section section = describeSegment(des, fp);
    section.tres.clear();
    addTres(section, des.getOverflowTags(), fp);
    if (des.isOverflow())
        section.summary.push_back(
            format("TRE overflow: %lld TRE(s)", static_cast<long long>(des.getOverflowTags().size())));
    if (des.isStreamingFileHeader())
        section.summary.push_back(
            format("streaming file header: %lld-byte replacement header", des.getStreamingHeaderLength()));
    if (des.isXMLDES())
        section.summary.push_back("XML data");
    if (des.isCloudShape())
        section.summary.push_back("cloud shape");
    return section;
}

FileInfo collect(const char* path) {
    FileInfo info;
    CNitfFileReader reader;
    if (!reader.open(path))
        throw std::runtime_error(std::string("cannot open ") + path);
    CNitfFileHeader* header = reader.getFileHeader();
    FILE* fp = reader.getInputStream();

    char version[10] = {0};
    DKFSeek64(fp, 0, SEEK_SET);
    DKFRead(version, 1, 9, fp);
    info.version = version;
    info.versionCode = header->getVersion();
    info.counts[0] = header->getImageCount();
    info.counts[1] = header->getSymbolCount();
    info.counts[2] = header->getLabelCount();
    info.counts[3] = header->getTextCount();
    info.counts[4] = header->getDataExtensionCount();
    info.counts[5] = header->getReservedExtensionCount();

    // Overflow segments first: their TREs join the lists of the headers they overflowed from.
    for (int i = 0; i < info.counts[4]; ++i) {
        std::unique_ptr<CNitfDataExtensionSource> des(reader.getNewDataExtensionSource(i));
        info.des.push_back(describeDes(*des, fp));
    }
    for (int i = 0; i < info.counts[0]; ++i) {
        std::unique_ptr<CNitfImageSubheader> subheader(header->getNewImageSubheader(fp, i));
        info.images.push_back(describeImage(subheader.get(), fp));
    }
    for (int i = 0; i < info.counts[1]; ++i) {
        std::unique_ptr<CNitfSymbolSource> graphic(reader.getNewSymbolSource(i));
        info.graphics.push_back(describeSegment(*graphic, fp));
    }
    for (int i = 0; i < info.counts[2]; ++i) {
        std::unique_ptr<CNitfLabelSource> label(reader.getNewLabelSource(i));
        info.labels.push_back(describeSegment(*label, fp));
    }
    for (int i = 0; i < info.counts[3]; ++i) {
        std::unique_ptr<CNitfTextSource> text(reader.getNewTextSource(i));
        info.texts.push_back(describeSegment(*text, fp));
    }
    info.header = describeHeader(header, fp);
    return info;
}

// ---- JSON
// ---------------------------------------------------------------------------------------------------

void writeTres(JsonWriter& json, const std::vector<TreEntry>& tres) {
    json.beginArray("tres");
    for (const TreEntry& tre : tres) {
        json.beginObject();
        json.value("tag", tre.tag);
        json.value("length", tre.length);
        json.value("source", static_cast<long long>(tre.source));
        json.value("occurrence", static_cast<long long>(tre.occurrence));
        json.value("total", static_cast<long long>(tre.total));
        if (!tre.fields.empty()) {
            json.beginObject("fields");
            for (const auto& field : tre.fields)
                json.value(field.first.c_str(), field.second);
            json.endObject();
        }
        if (!tre.error.empty())
            json.value("error", tre.error);
        json.endObject();
    }
    json.endArray();
}

void writeFields(JsonWriter& json, const char* key, const Section& section) {
    json.beginObject(key);
    for (const auto& field : section.fields)
        json.value(field.first.c_str(), field.second);
    json.endObject();
}

void writeSegments(JsonWriter& json, const char* key, const std::vector<Section>& sections) {
    json.beginArray(key);
    for (const Section& section : sections) {
        json.beginObject();
        writeFields(json, "subheader", section);
        writeTres(json, section.tres);
        json.endObject();
    }
    json.endArray();
}

void printJson(const FileInfo& info) {
    JsonWriter json(stdout);
    json.beginObject();
    json.value("version", info.version);
    json.value("versionCode", static_cast<long long>(info.versionCode));
    writeFields(json, "header", info.header);
    json.beginObject("segments");
    const char* const names[] = {"image", "graphic", "label", "text", "des", "res"};
    for (int i = 0; i < 6; ++i)
        json.value(names[i], static_cast<long long>(info.counts[i]));
    json.endObject();
    writeTres(json, info.header.tres);
    writeSegments(json, "images", info.images);
    writeSegments(json, "graphics", info.graphics);
    writeSegments(json, "labels", info.labels);
    writeSegments(json, "texts", info.texts);
    writeSegments(json, "des", info.des);
    json.endObject();
    json.finish();
}

// ---- text
// ---------------------------------------------------------------------------------------------------

void printSection(const Section& section, const char* indent) {
    for (const std::string& line : section.summary)
        std::printf("%s%s\n", indent, line.c_str());
    size_t width = 0;
    for (const auto& field : section.fields)
        width = std::max(width, field.first.size());
    for (const auto& field : section.fields)
        std::printf("%s  %-*s  %s\n", indent, static_cast<int>(width), field.first.c_str(),
                    field.second.c_str());
    for (const TreEntry& tre : section.tres) {
        std::printf("%s  TRE %-6s %6lld bytes, %s", indent, tre.tag.c_str(), tre.length,
                    tre.source >= 0 && tre.source <= 8 ? kSourceNames[tre.source] : "?");
        if (tre.occurrence)
            std::printf(", occurrence %d of %d", tre.occurrence, tre.total);
        std::printf("\n");
        size_t width = 0;
        for (const auto& field : tre.fields)
            width = std::max(width, field.first.size());
        for (const auto& field : tre.fields)
            std::printf("%s      %-*s  %s\n", indent, static_cast<int>(width), field.first.c_str(),
                        field.second.c_str());
        if (!tre.error.empty())
            std::printf("%s      (not parsed: %s)\n", indent, tre.error.c_str());
    }
}

void printSegments(const char* kind, const std::vector<Section>& sections) {
    for (size_t i = 0; i < sections.size(); ++i) {
        std::printf("\n%s %zu:\n", kind, i);
        printSection(sections[i], "  ");
    }
}

void printText(const char* path, const FileInfo& info) {
    static const char* const versions[] = {"NITF 1.1", "NITF 2.0", "NITF 2.1", "NITF 2.1",
                                           "NSIF 1.0", "OSDE",     "unknown"};
    std::printf("File: %s\nVersion: %s (%s)\n", path, info.version.c_str(), versions[info.versionCode]);
    std::printf("Segments: %d image, %d graphic, %d label, %d text, %d DES, %d RES\n\nFile header:\n",
                info.counts[0], info.counts[1], info.counts[2], info.counts[3], info.counts[4],
                info.counts[5]);
    printSection(info.header, "");
    printSegments("Image", info.images);
    printSegments("Graphic", info.graphics);
    printSegments("Label", info.labels);
    printSegments("Text", info.texts);
    printSegments("DES", info.des);
}

} // namespace

int runInfo(int argc, char** argv) {
    bool json = false;
    const char* path = nullptr;
    for (int i = 0; i < argc; ++i) {
        if (std::strcmp(argv[i], "--json") == 0)
            json = true;
        else
            path = argv[i];
    }
    if (!path) {
        std::fprintf(stderr, "usage: nitf info [--json] FILE\n");
        return 2;
    }
    try {
        FileInfo info = collect(path);
        if (json)
            printJson(info);
        else
            printText(path, info);
    } catch (const vexo::Exception& e) {
        std::fprintf(stderr, "nitf: %s: %s\n", path, e.what());
        return 1;
    } catch (const std::exception& e) {
        std::fprintf(stderr, "nitf: %s\n", e.what());
        return 1;
    }
    return 0;
}
