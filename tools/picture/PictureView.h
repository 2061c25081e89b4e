// Pictures of decoded images for looking at: which bands become grey, colour or palette samples and how
// sample values become picture levels (look-up tables applied, ABPP respected, other ranges stretched).
#pragma once

#include <cstdio>
#include <vector>

#include "RawExtract.h"

class CNitfFileReader;
class CNitfImageSource;

// Writes a PNG (`png`) or PGM/PPM picture of the window of `bands` (0-based: none for the default view,
// one for grey or a look-up table, three for RGB) to `out`. Returns the blocks that could not be decoded.
// `level` is a reduced resolution level (see CNitfRegionReader::setLevel).
nitfextract::Outcome writePicture(CNitfFileReader& reader, CNitfImageSource& source,
                                  const nitfextract::Window& window, const std::vector<int>& bands, int level,
                                  bool png, FILE* out, const nitfextract::Progress& progress);
