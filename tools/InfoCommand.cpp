// nitf info: what a user needs to understand a file, as aligned text or as JSON. Both forms come from one
// description of the file: fields in file order as their raw texts, binary values as numbers, and a summary
// of each image with its numbers as numbers.
#include <cstdio>
#include <cstring>
#include <functional>
#include <memory>
#include <string>
#include <vector>

#include <nlohmann/json.hpp>

#include "CommandLine.h"
#include "Commands.h"
#include "GeorefReport.h"
#include "HostError.h"
#include "HostFile.h"
#include "NitfDataExtensionSource.h"
#include "NitfExtension.h"
#include "NitfFileHeader.h"
#include "NitfFileReader.h"
#include "NitfImagePropertiesIF.h"
#include "NitfImageSubheader.h"
#include "NitfLabelSource.h"
#include "NitfSymbolSource.h"
#include "NitfTextSource.h"
#include "RpfFrameDescription.h"

namespace {

using Json = nlohmann::ordered_json;

const char* const kSourceNames[] = {"unknown",       "file header", "file header (DES)",
                                    "image",         "image (DES)", "graphic",
                                    "graphic (DES)", "text",        "text (DES)"};

struct Settings {
    bool json = false;
    std::string tre; // show only the TREs of this identifier
};

std::string trimmed(std::string text) {
    text.erase(text.find_last_not_of(' ') + 1);
    return text;
}

// A field's value for the JSON: a number for binary numbers, else the text people read.
Json fieldValue(const NitfField_t& field, CNitfProperty* value) {
    double number = 0;
    long long integer = 0;
    bool isInteger = false;
    if (nitfFieldNumber(field, value, &number, &integer, &isInteger))
        return isInteger ? Json(integer) : Json(number);
    return nitfFieldDisplayText(field, value);
}

Json fieldsOf(PropertyMap& map, const std::vector<NitfField_t>& fields) {
    Json object = Json::object();
    for (const NitfField_t& field : fields) {
        if (CNitfProperty* value = FindProperty(map, field.name))
            object[field.name] = fieldValue(field, value);
    }
    return object;
}

// The TREs of a list, each with its fields in file order when the library parses it.
Json tresOf(const std::list<CNitfTag*>& tags, FILE* fp, const Settings& settings) {
    Json list = Json::array();
    for (CNitfTag* tag : tags) {
        std::string name = trimmed(tag->getIdentifier());
        if (!settings.tre.empty() && name != settings.tre)
            continue;
        Json tre = {{"tag", name},
                    {"length", tag->getDataLength()},
                    {"source", static_cast<int>(tag->getSource())},
                    {"occurrence", tag->getOccurrence()},
                    {"total", tag->getTotal()}};
        std::unique_ptr<CNitfExtension> extension(CNitfExtension::Build(tag));
        if (extension) {
            try {
                extension->readNewInfo(fp, false);
                tre["fields"] = fieldsOf(extension->getProperties(), extension->getFields());
            } catch (const vexo::Exception& e) {
                tre["error"] = e.what();
            }
        }
        list.push_back(tre);
    }
    return list;
}

long long numberOf(PropertyMap& map, const char* name) {
    CNitfProperty* value = FindProperty(map, name);
    return value && value->getDataType() != CNitfProperty::eNone ? value->getAsInt64() : 0;
}

Json textOf(PropertyMap& map, const char* name) {
    CNitfProperty* value = FindProperty(map, name);
    if (!value || value->getDataType() == CNitfProperty::eNone)
        return nullptr;
    return trimmed(value->toText());
}

// What the text form's summary lines say, with numbers as numbers.
Json imageSummary(CNitfImageSubheader& subheader, const CNitfHeaderDataPair* pair) {
    PropertyMap& map = subheader.getProperties();
    static const char* const modes[] = {"S", "B", "P", "R", "?"};
    CNitfImagePropertiesIF geometry;
    PropertyMap copy = map; // setProperties inserts the fields it misses: keep them out of the sub-header
    geometry.setProperties(copy);
    for (auto& entry : copy) {
        if (!FindProperty(map, entry.first))
            delete entry.second;
    }
    Json summary = {{"NROWS", numberOf(map, "NROWS")},
                    {"NCOLS", numberOf(map, "NCOLS")},
                    {"bands", subheader.getBandCount()},
                    {"NBPP", numberOf(map, "NBPP")},
                    {"ABPP", numberOf(map, "ABPP")},
                    {"PVTYPE", textOf(map, "PVTYPE")},
                    {"IREP", textOf(map, "IREP")},
                    {"IMODE", textOf(map, "IMODE")},
                    {"IC", textOf(map, "IC")},
                    {"COMRAT", textOf(map, "COMRAT")},
                    {"NBPR", numberOf(map, "NBPR")},
                    {"NBPC", numberOf(map, "NBPC")},
                    {"NPPBH", numberOf(map, "NPPBH")},
                    {"NPPBV", numberOf(map, "NPPBV")},
                    {"blockWidth", geometry.getTileWidth()},
                    {"blockHeight", geometry.getTileHeight()},
                    {"interleaving", modes[geometry.getInterleavingType()]},
                    {"geometryValid", geometry.dataValid()}};
    Json luts = Json::array();
    for (int i = 0; i < subheader.getLutCount(); ++i) {
        CNitfLutSource* lut = subheader.getLutSource(i);
        luts.push_back({{"band", lut->getBand()},
                        {"entries", lut->getEntryCount()},
                        {"entrySize", lut->getEntrySize()}});
    }
    summary["luts"] = luts;
    summary["dataOffset"] = pair ? pair->getDataOffset() : 0;
    summary["dataLength"] = pair ? pair->getDataLength() : 0;
    // The corners as the file gives them.
    summary["ICORDS"] =
        FindProperty(map, "ICORDS") ? Json(FindProperty(map, "ICORDS")->toText()) : Json(nullptr);
    if (FindProperty(map, "IGEOLO1")) {
        Json corners = Json::array();
        for (const char* corner : {"IGEOLO1", "IGEOLO2", "IGEOLO3", "IGEOLO4"})
            corners.push_back(FindProperty(map, corner) ? FindProperty(map, corner)->toText()
                                                        : std::string());
        summary["IGEOLO"] = corners;
    } else {
        summary["IGEOLO"] = nullptr;
    }
    return summary;
}

// Where the image lies (corners in degrees, the projection record, a sensor model) and, for RPF frames, what
// the frame says of itself: JSON objects for --json, the tool's text lines otherwise.
void describePlacement(CNitfFileReader& reader, CNitfImageSubheader& subheader, int index,
                       const Settings& settings, Json& image) {
    const nitfgeoref::Summary summary = nitfgeoref::summarize(reader.getInputStream(), &subheader);
    if (settings.json)
        image["georeferencing"] = nitfgeoref::reportJson(summary);
    else
        image["georeferencingLines"] = nitfgeoref::reportLines(summary);
    if (!reader.hasExtensionRpf())
        return;
    try {
        const RpfFrameDescription frame = describeRpfFrame(reader, index);
        if (settings.json)
            image["rpf"] = frame.json;
        else
            image["rpfLines"] = frame.lines;
    } catch (const vexo::Exception& e) {
        image["rpfError"] = e.what();
    }
}

Json describeImage(CNitfFileReader& reader, CNitfImageSubheader& subheader, int index,
                   const Settings& settings) {
    FILE* fp = reader.getInputStream();
    const CNitfHeaderDataPair* pair = reader.getFileHeader()->getImageHeaderDataPair(index);
    Json image = {{"summary", imageSummary(subheader, pair)},
                  {"subheader", fieldsOf(subheader.getProperties(), subheader.getFields())},
                  {"tres", tresOf(subheader.getTaggedRecords(), fp, settings)}};
    describePlacement(reader, subheader, index, settings, image);
    Json comments = Json::array();
    for (int i = 0; i < subheader.getCommentCount(); ++i) {
        char comment[82];
        subheader.readComment(fp, i, comment);
        comment[80] = '\0';
        comments.push_back(trimmed(comment));
    }
    image["comments"] = comments;
    return image;
}

Json describeSegment(CNitfSegmentSource& segment, const std::list<CNitfTag*>& tags, FILE* fp,
                     const Settings& settings) {
    return {{"subheader", fieldsOf(segment.getProperties(), segment.getFields())},
            {"tres", tresOf(tags, fp, settings)},
            {"dataOffset", segment.getDataOffset()},
            {"dataLength", segment.getDataLength()}};
}

Json describeDes(CNitfDataExtensionSource& des, FILE* fp, const Settings& settings) {
    Json segment = describeSegment(des, des.getOverflowTags(), fp, settings);
    Json kinds = Json::array();
    if (des.isOverflow())
        kinds.push_back("TRE overflow");
    if (des.isStreamingFileHeader())
        kinds.push_back("streaming file header");
    if (des.isXMLDES())
        kinds.push_back("XML data");
    if (des.isCloudShape())
        kinds.push_back("cloud shape");
    segment["kinds"] = kinds;
    return segment;
}

// The file header's fields, with each segment table's lengths right after its count, as they stand in the
// file.
Json describeHeader(CNitfFileHeader& header) {
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
    Json fields = Json::object();
    for (const NitfField_t& field : header.getFields()) {
        fields[field.name] = fieldValue(field, FindProperty(header.getProperties(), field.name));
        for (const Table& table : tables) {
            if (std::strcmp(field.name, table.count) != 0)
                continue;
            for (int i = 0; CNitfHeaderDataPair* pair = (header.*table.pair)(i); ++i) {
                char name[32], value[32];
                std::snprintf(name, sizeof name, "%s%03d", table.headerName, i + 1);
                std::snprintf(value, sizeof value, "%0*lld", table.headerWidth, pair->getHeaderLength());
                fields[name] = value;
                std::snprintf(name, sizeof name, "%s%03d", table.dataName, i + 1);
                std::snprintf(value, sizeof value, "%0*lld", table.dataWidth, pair->getDataLength());
                fields[name] = value;
            }
        }
    }
    return fields;
}

Json describe(const std::string& path, const Settings& settings) {
    CNitfFileReader reader;
    if (!reader.open(path.c_str()))
        throw std::runtime_error(std::string("cannot open the file: ") + std::strerror(errno));
    CNitfFileHeader* header = reader.getFileHeader();
    FILE* fp = reader.getInputStream();

    char version[10] = {0};
    DKFSeek64(fp, 0, SEEK_SET);
    DKFRead(version, 1, 9, fp);
    Json info = {
        {"file", path}, {"version", version}, {"versionCode", static_cast<int>(header->getVersion())}};
    info["segments"] = {
        {"image", header->getImageCount()},       {"graphic", header->getSymbolCount()},
        {"label", header->getLabelCount()},       {"text", header->getTextCount()},
        {"des", header->getDataExtensionCount()}, {"res", header->getReservedExtensionCount()}};

    // Each segment on its own: one that cannot be read is reported in its place ("error") and the others are
    // still described.
    auto each = [&](int count, Json& list, const std::function<Json(int)>& one) {
        for (int i = 0; i < count; ++i) {
            try {
                list.push_back(one(i));
            } catch (const vexo::Exception& e) {
                list.push_back(Json{{"error", e.what()}});
            }
        }
    };
    // Overflow segments first: their TREs join the lists of the headers they overflowed from.
    Json des = Json::array(), images = Json::array();
    each(header->getDataExtensionCount(), des, [&](int i) {
        std::unique_ptr<CNitfDataExtensionSource> segment(reader.getNewDataExtensionSource(i));
        return describeDes(*segment, fp, settings);
    });
    each(header->getImageCount(), images, [&](int i) {
        std::unique_ptr<CNitfImageSubheader> subheader(header->getNewImageSubheader(fp, i));
        return describeImage(reader, *subheader, i, settings);
    });
    Json graphics = Json::array(), labels = Json::array(), texts = Json::array();
    each(header->getSymbolCount(), graphics, [&](int i) {
        std::unique_ptr<CNitfSymbolSource> graphic(reader.getNewSymbolSource(i));
        return describeSegment(*graphic, graphic->getTaggedRecords(), fp, settings);
    });
    each(header->getLabelCount(), labels, [&](int i) {
        std::unique_ptr<CNitfLabelSource> label(reader.getNewLabelSource(i));
        return describeSegment(*label, label->getTaggedRecords(), fp, settings);
    });
    each(header->getTextCount(), texts, [&](int i) {
        std::unique_ptr<CNitfTextSource> text(reader.getNewTextSource(i));
        return describeSegment(*text, text->getTaggedRecords(), fp, settings);
    });
    info["header"] = describeHeader(*header);
    info["tres"] = tresOf(header->getTaggedRecords(), fp, settings);
    info["images"] = images;
    info["graphics"] = graphics;
    info["labels"] = labels;
    info["texts"] = texts;
    info["des"] = des;
    return info;
}

// ---- text
// ---------------------------------------------------------------------------------------------------

std::string plain(const Json& value) {
    return value.is_string() ? value.get<std::string>() : value.dump();
}

void printFields(const Json& fields, const char* indent) {
    size_t width = 0;
    for (auto& item : fields.items())
        width = std::max(width, item.key().size());
    for (auto& item : fields.items())
        std::printf("%s%-*s  %s\n", indent, static_cast<int>(width), item.key().c_str(),
                    plain(item.value()).c_str());
}

void printTres(const Json& tres, const char* indent) {
    for (const Json& tre : tres) {
        int source = tre["source"].get<int>();
        std::printf("%sTRE %-6s %6lld bytes, %s", indent, tre["tag"].get<std::string>().c_str(),
                    tre["length"].get<long long>(), source >= 0 && source <= 8 ? kSourceNames[source] : "?");
        if (tre["occurrence"].get<int>())
            std::printf(", occurrence %d of %d", tre["occurrence"].get<int>(), tre["total"].get<int>());
        std::printf("\n");
        std::string inner = std::string(indent) + "    ";
        if (tre.contains("fields"))
            printFields(tre["fields"], inner.c_str());
        if (tre.contains("error"))
            std::printf("%s(not parsed: %s)\n", inner.c_str(), tre["error"].get<std::string>().c_str());
    }
}

void printImageSummary(const Json& s) {
    std::printf("  %lld x %lld pixels, %d band(s) of %lld bits (ABPP %lld), PVTYPE %s, IREP %s, IMODE %s\n",
                s["NCOLS"].get<long long>(), s["NROWS"].get<long long>(), s["bands"].get<int>(),
                s["NBPP"].get<long long>(), s["ABPP"].get<long long>(), plain(s["PVTYPE"]).c_str(),
                plain(s["IREP"]).c_str(), plain(s["IMODE"]).c_str());
    std::printf("  %lld x %lld blocks of %d x %d, IC %s", s["NBPR"].get<long long>(),
                s["NBPC"].get<long long>(), s["blockWidth"].get<int>(), s["blockHeight"].get<int>(),
                plain(s["IC"]).c_str());
    if (!s["COMRAT"].is_null())
        std::printf(" (COMRAT %s)", plain(s["COMRAT"]).c_str());
    std::printf(", data %lld bytes at offset %lld\n", s["dataLength"].get<long long>(),
                s["dataOffset"].get<long long>());
    for (const Json& lut : s["luts"])
        std::printf("  LUT: band %d, %d entries of %d byte(s)\n", lut["band"].get<int>(),
                    lut["entries"].get<int>(), lut["entrySize"].get<int>());
    if (!s["IGEOLO"].is_null()) {
        std::printf("  corners (ICORDS %s):", plain(s["ICORDS"]).c_str());
        for (const Json& corner : s["IGEOLO"])
            std::printf(" %s", plain(corner).c_str());
        std::printf("\n");
    }
    if (!s["geometryValid"].get<bool>())
        std::printf("  geometry is not valid for decoding\n");
}

void printSegments(const char* kind, const Json& segments) {
    for (size_t i = 0; i < segments.size(); ++i) {
        const Json& segment = segments[i];
        std::printf("\n%s %zu:\n", kind, i);
        if (segment.contains("error")) {
            std::printf("  not readable: %s\n", plain(segment["error"]).c_str());
            continue;
        }
        if (segment.contains("summary"))
            printImageSummary(segment["summary"]);
        if (segment.contains("dataLength"))
            std::printf("  data: %lld bytes at offset %lld\n", segment["dataLength"].get<long long>(),
                        segment["dataOffset"].get<long long>());
        for (const Json& kindName : segment.value("kinds", Json::array()))
            std::printf("  %s\n", plain(kindName).c_str());
        for (const Json& comment : segment.value("comments", Json::array()))
            std::printf("  comment: %s\n", plain(comment).c_str());
        for (const char* lines : {"georeferencingLines", "rpfLines"})
            for (const Json& line : segment.value(lines, Json::array()))
                std::printf("  %s\n", plain(line).c_str());
        if (segment.contains("rpfError"))
            std::printf("  RPF: %s\n", plain(segment["rpfError"]).c_str());
        printFields(segment["subheader"], "    ");
        printTres(segment["tres"], "    ");
    }
}

void printText(const Json& info) {
    static const char* const versions[] = {"NITF 1.1", "NITF 2.0", "NITF 2.1", "NITF 2.1",
                                           "NSIF 1.0", "OSDE",     "unknown"};
    int code = info["versionCode"].get<int>();
    const Json& counts = info["segments"];
    std::printf("File: %s\nVersion: %s (%s)\n", plain(info["file"]).c_str(), plain(info["version"]).c_str(),
                versions[code >= 0 && code <= 6 ? code : 6]);
    std::printf("Segments: %d image, %d graphic, %d label, %d text, %d DES, %d RES\n\nFile header:\n",
                counts["image"].get<int>(), counts["graphic"].get<int>(), counts["label"].get<int>(),
                counts["text"].get<int>(), counts["des"].get<int>(), counts["res"].get<int>());
    printFields(info["header"], "  ");
    printTres(info["tres"], "  ");
    printSegments("Image", info["images"]);
    printSegments("Graphic", info["graphics"]);
    printSegments("Label", info["labels"]);
    printSegments("Text", info["texts"]);
    printSegments("DES", info["des"]);
}

} // namespace

int runInfo(int argc, char** argv) {
    Settings settings;
    cli::Options options(*cli::findCommand("info"),
                         {{"json", no_argument, nullptr, 'j'}, {"tre", required_argument, nullptr, 't'}},
                         "jt:");
    int status = options.parse(argc, argv, [&](int code, const char* value) {
        if (code == 'j')
            settings.json = true;
        else if (code == 't')
            settings.tre = value;
        return code == 'j' || code == 't';
    });
    if (status >= 0)
        return status;
    if (options.operands().empty())
        return options.usageError("no file given");

    Json all = Json::array();
    int failures = 0;
    for (const std::string& path : options.operands()) {
        cli::WarningsOnStderr warnings("info", path);
        try {
            Json info = describe(path, settings);
            // A segment that cannot be read makes the file not a valid one.
            for (const char* list : {"images", "graphics", "labels", "texts", "des"})
                for (const Json& segment : info[list])
                    if (segment.contains("error")) {
                        cli::reportError("info", path,
                                         std::string(list) + ": " + segment["error"].get<std::string>());
                        ++failures;
                    }
            if (settings.json)
                all.push_back(info);
            else
                printText(info);
            if (!settings.json && &path != &options.operands().back())
                std::printf("\n");
        } catch (const vexo::Exception& e) {
            cli::reportError("info", path, e.what());
            ++failures;
        } catch (const std::exception& e) {
            cli::reportError("info", path, e.what());
            ++failures;
        }
    }
    if (settings.json && !all.empty()) {
        // One file gives its object, several an array of them.
        const Json& document = options.operands().size() == 1 && all.size() == 1 ? all[0] : all;
        std::printf("%s\n", document.dump(2, ' ', false, Json::error_handler_t::replace).c_str());
    }
    return failures ? 1 : 0;
}
