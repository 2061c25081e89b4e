#include "RpfFrameDescription.h"

#include <cstdarg>
#include <cstdio>

#include "NitfFileReader.h"
#include "RpfFrame.h"

std::string formatText(const char* pattern, ...) {
    va_list arguments, again;
    va_start(arguments, pattern);
    va_copy(again, arguments);
    const int length = std::vsnprintf(nullptr, 0, pattern, arguments);
    va_end(arguments);
    std::string text(length > 0 ? static_cast<size_t>(length) : 0, '\0');
    if (length > 0)
        std::vsnprintf(&text[0], text.size() + 1, pattern, again);
    va_end(again);
    return text;
}

std::vector<std::string> describeCornerLines(const RpfCorners& c) {
    return {formatText("  upper left  %.9f %.9f   upper right %.9f %.9f", c.upperLeft[0], c.upperLeft[1],
                       c.upperRight[0], c.upperRight[1]),
            formatText("  lower left  %.9f %.9f   lower right %.9f %.9f", c.lowerLeft[0], c.lowerLeft[1],
                       c.lowerRight[0], c.lowerRight[1])};
}

nlohmann::json describeCorners(const RpfCorners& c) {
    return {{"upperLeft", {c.upperLeft[0], c.upperLeft[1]}},
            {"upperRight", {c.upperRight[0], c.upperRight[1]}},
            {"lowerLeft", {c.lowerLeft[0], c.lowerLeft[1]}},
            {"lowerRight", {c.lowerRight[0], c.lowerRight[1]}}};
}

nlohmann::json describeRpfHeader(const nitf::CRpfHeaderSection& header) {
    return {{"fileName", nitf::textOf(header.fileName)},
            {"byteOrder", header.byteOrder == 0 ? "big-endian" : "little-endian"},
            {"newReplacementUpdate", header.newReplacementUpdate},
            {"standardNumber", nitf::textOf(header.standardNumber)},
            {"standardDate", nitf::textOf(header.standardDate)},
            {"classification", nitf::textOf(header.classification)},
            {"countryCode", nitf::textOf(header.countryCode)},
            {"releaseMarking", nitf::textOf(header.releaseMarking)},
            {"locationSectionLocation", header.locationSectionLocation}};
}

RpfFrameDescription describeRpfFrame(CNitfFileReader& reader, int image) {
    const CRpfFrame frame(reader, image);
    RpfFrameDescription description;
    std::vector<std::string>& lines = description.lines;
    nlohmann::json& json = description.json;
    const nitf::CRpfHeaderSection& header = frame.getHeader();
    json["header"] = describeRpfHeader(header);
    lines.push_back("RPF frame " + frame.getFileName() + " (" + nitf::textOf(header.standardNumber) + " " +
                    nitf::textOf(header.standardDate) + ", classification " +
                    nitf::textOf(header.classification) + ")");

    if (frame.hasCoverage()) {
        const RpfCoverage_t& c = frame.getCoverage();
        const RpfCorners corners = {{c.upperLeftLatitude, c.upperLeftLongitude},
                                    {c.upperRightLatitude, c.upperRightLongitude},
                                    {c.lowerLeftLatitude, c.lowerLeftLongitude},
                                    {c.lowerRightLatitude, c.lowerRightLongitude}};
        json["coverage"] = {{"corners", describeCorners(corners)},
                            {"verticalResolution", c.verticalResolution},
                            {"horizontalResolution", c.horizontalResolution},
                            {"verticalInterval", c.verticalInterval},
                            {"horizontalInterval", c.horizontalInterval}};
        json["locationCode"] = frame.getLocationCode();
        for (const std::string& line : describeCornerLines(corners))
            lines.push_back(line);
        lines.push_back(formatText("  intervals   %.12g x %.12g degrees per pixel (north-south x east-west)",
                                   c.verticalInterval, c.horizontalInterval));
        lines.push_back(formatText("  resolution  %.6g x %.6g metres per pixel", c.verticalResolution,
                                   c.horizontalResolution));
        lines.push_back("  location    " + frame.getLocationCode());
    } else {
        json["coverage"] = nullptr;
        json["locationCode"] = nullptr;
        lines.push_back("  no coverage section");
    }

    nlohmann::json colours = nlohmann::json::array();
    for (const RpfColour_t& colour : frame.getColours())
        colours.push_back(
            formatText("#%02X%02X%02X%02X", colour.red, colour.green, colour.blue, colour.alpha));
    json["colours"] = colours;
    json["transparentCode"] = frame.getTransparentCode() >= 0 ? nlohmann::json(frame.getTransparentCode())
                                                              : nlohmann::json(nullptr);
    json["transparentCodeStored"] = frame.isTransparentCodeStored();
    std::string colourLine = "  colours     " + std::to_string(frame.getColours().size());
    if (frame.getTransparentCode() >= 0)
        colourLine +=
            ", transparent code " + std::to_string(frame.getTransparentCode()) +
            (frame.isTransparentCodeStored() ? " (stored in the mask)" : " (first code past the colours)");
    lines.push_back(colourLine);
    return description;
}
