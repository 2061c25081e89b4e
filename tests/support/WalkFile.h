// Opens a file and reads everything the library can read from it, the way a careful application would: every
// sub-header, every segment's data, every TRE entry. Used by the robustness tests and the fuzz targets.
#pragma once

#include <cstddef>
#include <string>

// Returns normally when the file was read or refused with vexo::Exception (the message goes to `refusal`,
// when given); anything else (a crash, another exception type) is the caller's failure to report.
void walkFile(const std::string& path, std::string* refusal = nullptr);
class CNitfFileReader;

// Every image of an open file through its image source: every block of every band read into buffers sized
// by the image's properties (as many as stay quick), a window through the region reader (at full and at a
// reduced resolution, where the source holds one), the look-up tables.
// Refusals with vexo::Exception are taken as they come.
void readEveryImage(CNitfFileReader& reader);
// One of them; the message of its refusal, or "" when it was read.
std::string readImage(CNitfFileReader& reader, int index);
// The same for a file held in memory.
void walkBytes(const void* data, size_t size, std::string* refusal = nullptr);

namespace nitfsample {
struct Image;
}
// A file of this one image, built in memory by the sample writer, opened and read by readEveryImage (the
// image-shaped fuzz targets); a layout the writer cannot build, or a file refused, ends it quietly.
void readSample(const nitfsample::Image& image);
