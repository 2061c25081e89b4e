// nitf toc: the RPF table of contents of an A.TOC file (raw or NITF-wrapped) with its boundary rectangles and
// their frames, and whether each frame file is there beside it; or the RPF description of a frame file. As
// text or as one JSON object.
#include <cctype>
#include <cstdio>
#include <cstring>
#include <filesystem>
#include <map>
#include <memory>
#include <nlohmann/json.hpp>
#include <stdexcept>
#include <string>
#include <strings.h>
#include <vector>

#include "CommandLine.h"
#include "Commands.h"
#include "HostError.h"
#include "HostFile.h"
#include "NitfFileReader.h"
#include "NitfTag.h"
#include "RpfFrameDescription.h"
#include "RpfSource.h"

namespace fs = std::filesystem;

namespace {

// Closes a stream opened with DKOpen.
struct StreamCloser {
    void operator()(FILE* fp) const { DKClose(fp); }
};

// Files named by paths relative to a directory, each component matched as written or else without regard to
// case (tables store upper-case names; files on disk are often lower case). Each directory is listed once,
// however many frames of the table lie in it.
class FileFinder {
public:
    explicit FileFinder(fs::path directory) : m_directory(std::move(directory)) {}

    // The file `relative` names, or empty when it is missing.
    std::string find(const std::string& relative) {
        fs::path found = m_directory;
        std::error_code error;
        for (const fs::path& part : fs::path(relative)) {
            if (part == "." || part.empty())
                continue;
            if (fs::exists(found / part, error)) {
                found /= part;
                continue;
            }
            const std::map<std::string, fs::path>& names = listing(found);
            const auto match = names.find(lowered(part.string()));
            if (match == names.end())
                return std::string();
            found /= match->second;
        }
        return fs::is_regular_file(found, error) ? found.string() : std::string();
    }

private:
    static std::string lowered(std::string text) {
        for (char& c : text)
            c = static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
        return text;
    }

    // The entries of `directory` by their lower-case names (the first of names that differ only in case).
    const std::map<std::string, fs::path>& listing(const fs::path& directory) {
        const auto [place, added] = m_listings.try_emplace(directory.string());
        if (added) {
            std::error_code error;
            for (const fs::directory_entry& entry : fs::directory_iterator(directory, error))
                place->second.emplace(lowered(entry.path().filename().string()), entry.path().filename());
        }
        return place->second;
    }

    fs::path m_directory;
    std::map<std::string, std::map<std::string, fs::path>> m_listings;
};

struct Description {
    std::vector<std::string> lines;
    nlohmann::json json;
};

Description describeToc(CRpfSource& toc, const std::string& path, const char* form) {
    Description out;
    FileFinder files(fs::path(path).parent_path());
    const nitf::CRpfHeaderSection& header = toc.getToc().header;
    out.json["file"] = path;
    out.json["form"] = form;
    out.json["header"] = describeRpfHeader(header);
    out.lines.push_back(path + ": RPF table of contents (" + form + "), " +
                        nitf::textOf(header.standardNumber) + " " + nitf::textOf(header.standardDate) +
                        ", classification " + nitf::textOf(header.classification));

    std::unique_ptr<RPFBoundaryRectangle_t*, void (*)(RPFBoundaryRectangle_t**)> boundaries(
        toc.readRpfBoundaries(nullptr), CRpfSource::freeRpfBoundaries);
    nlohmann::json rectangles = nlohmann::json::array();
    int present = 0, listed = 0;
    for (int n = 0; boundaries.get()[n]; ++n) {
        const RPFBoundaryRectangle_t& r = *boundaries.get()[n];
        const RpfCorners corners = {{r.upperLeftLatitude, r.upperLeftLongitude},
                                    {r.upperRightLatitude, r.upperRightLongitude},
                                    {r.lowerLeftLatitude, r.lowerLeftLongitude},
                                    {r.lowerRightLatitude, r.lowerRightLongitude}};
        nlohmann::json rectangle = {{"index", n},
                                    {"productDataType", r.productDataType},
                                    {"compressionRatio", r.compressionRatio},
                                    {"scale", r.scale},
                                    {"zone", std::string(1, r.zone)},
                                    {"producer", r.producer},
                                    {"corners", describeCorners(corners)},
                                    {"verticalInterval", r.verticalInterval},
                                    {"horizontalInterval", r.horizontalInterval},
                                    {"verticalFrames", r.verticalFrames},
                                    {"horizontalFrames", r.horizontalFrames}};
        out.lines.push_back("rectangle " + std::to_string(n) + ": " + r.productDataType + " " +
                            r.compressionRatio + " scale " + r.scale + ", zone " + std::string(1, r.zone) +
                            ", producer " + r.producer);
        for (const std::string& line : describeCornerLines(corners))
            out.lines.push_back(line);
        out.lines.push_back(
            formatText("  frames of   %.9g x %.9g degrees (north-south x east-west), grid of %u rows "
                       "x %u columns",
                       r.verticalInterval, r.horizontalInterval, r.verticalFrames, r.horizontalFrames));
        nlohmann::json frames = nlohmann::json::array();
        for (int i = 0; i < r.frameCount; ++i) {
            if (!r.frameFiles[i])
                continue;
            // Rows count from the south, as the table stores them.
            const unsigned row = r.verticalFrames - 1 - static_cast<unsigned>(i) / r.horizontalFrames;
            const unsigned column = static_cast<unsigned>(i) % r.horizontalFrames;
            const std::string onDisk = files.find(r.frameFiles[i]);
            ++listed;
            present += onDisk.empty() ? 0 : 1;
            frames.push_back({{"row", row},
                              {"column", column},
                              {"path", r.frameFiles[i]},
                              {"file", onDisk.empty() ? nlohmann::json(nullptr) : nlohmann::json(onDisk)},
                              {"exists", !onDisk.empty()}});
            out.lines.push_back(formatText("  row %3u column %3u  %s%s", row, column, r.frameFiles[i],
                                           onDisk.empty() ? "  (missing)" : ""));
        }
        rectangle["frames"] = frames;
        rectangles.push_back(rectangle);
    }
    out.json["rectangles"] = rectangles;
    out.json["framesListed"] = listed;
    out.json["framesPresent"] = present;
    out.lines.push_back(std::to_string(rectangles.size()) + " boundary rectangles, " +
                        std::to_string(listed) + " frames, " + std::to_string(present) + " of them present");
    return out;
}

bool startsWithNitf(const std::string& path) {
    std::unique_ptr<FILE, StreamCloser> fp(DKOpen(path.c_str(), DK_MODE_READ_BINARY, "rb"));
    char start[4] = {0};
    return fp && DKFRead(start, 1, sizeof start, fp.get()) == sizeof start &&
           (std::memcmp(start, "NITF", 4) == 0 || std::memcmp(start, "NSIF", 4) == 0 ||
            std::memcmp(start, "OSDE", 4) == 0);
}

// A NITF file with an RPF header section: a table of contents when the header names one or there is no image,
// else a frame.
Description describeNitf(const std::string& path) {
    CNitfFileReader reader;
    if (!reader.open(path.c_str()))
        throw std::runtime_error("cannot open " + path);
    CNitfTag* tag = CNitfTag::find("RPFHDR", reader.getFileHeader()->getTaggedRecords());
    if (!tag)
        throw std::runtime_error(path + " has no RPF header section (RPFHDR)");
    nitf::CRpfHeaderSection header;
    CRpfSource::readHeaderSection(reader.getInputStream(), tag->getDataOffset(), header);
    if (strcasecmp(nitf::textOf(header.fileName).c_str(), "A.TOC") == 0 || reader.getImageCount() == 0) {
        std::unique_ptr<CRpfSource> toc(reader.getNewExtensionRpfSource());
        return describeToc(*toc, path, "NITF-wrapped");
    }
    RpfFrameDescription frame = describeRpfFrame(reader);
    Description out;
    out.json = {{"file", path}, {"frame", frame.json}};
    out.lines.push_back(path + ":");
    out.lines.insert(out.lines.end(), frame.lines.begin(), frame.lines.end());
    return out;
}

Description describeRaw(const std::string& path) {
    std::unique_ptr<FILE, StreamCloser> fp(DKOpen(path.c_str(), DK_MODE_READ_BINARY, "rb"));
    if (!fp)
        throw std::runtime_error("cannot open " + path);
    if (!CRpfSource::isRawToc(fp.get()))
        throw std::runtime_error(path + " is neither an A.TOC nor a NITF frame file");
    CRpfSource toc;
    toc.readStartAt(fp.get(), 0);
    return describeToc(toc, path, "raw");
}

} // namespace

int runToc(int argc, char** argv) {
    bool json = false;
    cli::Options options(*cli::findCommand("toc"), {{"json", no_argument, nullptr, 'j'}}, "j");
    const int status = options.parse(argc, argv, [&](int code, const char*) {
        json = code == 'j';
        return json;
    });
    if (status >= 0)
        return status;
    if (options.operands().size() != 1)
        return options.usageError("one A.TOC or frame file");
    const std::string& path = options.operands().front();
    try {
        const Description description = startsWithNitf(path) ? describeNitf(path) : describeRaw(path);
        if (json) {
            std::printf("%s\n", description.json.dump(2).c_str());
        } else {
            for (const std::string& line : description.lines)
                std::printf("%s\n", line.c_str());
        }
    } catch (const std::exception& e) {
        cli::reportError("toc", path, e.what());
        return 1;
    }
    return 0;
}
