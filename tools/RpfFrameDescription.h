// The RPF side of a frame file (CADRG, CIB) for the tool's commands: its header section, coverage, colours,
// transparent code and location code, as text lines and as one JSON object.
#pragma once

#include <nlohmann/json.hpp>
#include <string>
#include <vector>

#include "RpfHeaderSection.h"

class CNitfFileReader;

struct RpfFrameDescription {
    std::vector<std::string> lines; // indented text, one line each, no newlines
    nlohmann::json json;
};

// Describes the frame in image `image`. Raises vexo::Exception when the file has no RPF header section.
RpfFrameDescription describeRpfFrame(CNitfFileReader& reader, int image = 0);

// The fields of an RPF header section, keyed as in the description.
nlohmann::json describeRpfHeader(const nitf::CRpfHeaderSection& header);

// Four corners (latitude, longitude in degrees), as two aligned text lines and as an object of
// [latitude, longitude] pairs.
struct RpfCorners {
    double upperLeft[2], upperRight[2], lowerLeft[2], lowerRight[2];
};
std::vector<std::string> describeCornerLines(const RpfCorners& corners);
nlohmann::json describeCorners(const RpfCorners& corners);

// printf-style formatting into a std::string.
std::string formatText(const char* pattern, ...) __attribute__((format(printf, 1, 2)));
