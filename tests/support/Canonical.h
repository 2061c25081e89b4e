// The canonical raw form of images (see the corpus README): what `nitf extract -f raw` writes.
#pragma once

#include <string>
#include <vector>

class CNitfFile;
class CNitfImageSource;

struct CanonicalImage {
    std::vector<std::string> bands; // each band's samples in canonical form
    int absentBlocks = 0;
    int failedBlocks = 0;
    std::string firstError;
};

// Image `image` of the file at `path`, written by the tool's raw writer on `threads` threads (into a
// scratch file) and cut into its bands.
CanonicalImage canonicalImage(const std::string& path, int image, int threads = 2);

// One band of an open source, whole image, through the region reader.
std::string canonicalBand(CNitfFile& file, CNitfImageSource& source, int band);
