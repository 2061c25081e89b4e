// An image segment as a GeoTIFF: its samples, its georeferencing and sensor model, its colour map and its pad
// value, through the GeoTIFF writer. For nitf extract -f tiff.
#pragma once

#include <string>
#include <vector>

#include "GeoTiffWriter.h"
#include "GeorefReport.h"

class CNitfFile;
class CNitfImageSource;
class CRpcSource;

namespace nitfpicture {

// The GeoTIFF placement of a georeferencing summary: the geotransform of an axis-aligned rectangle, else the
// four corners as tie points; UTM or geographic on WGS 84 (other systems are left out, with a note).
GeoReference geoReferenceOf(const nitfgeoref::Summary& summary, std::vector<std::string>& notes);

// The 92 values of the GeoTIFF RPC tag for a model, in the image's own pixels: a chip's mapping is folded
// into the offsets and scales, which an axis-aligned chip allows. Empty (with a note) otherwise.
std::vector<double> rpcTagOf(const CRpcSource& model, std::vector<std::string>& notes);

// Writes `bands` (0-based; empty: every band) of the image to `path`, in the region reader's sample types,
// with reduced levels as COG overviews where the source has them. Returns notes on what could not be carried
// over; throws std::runtime_error when blocks cannot be read.
std::vector<std::string> writeImageGeoTiff(CNitfFile& file, CNitfImageSource& source,
                                           const std::vector<int>& bands, const std::string& path,
                                           const TiffOptions& options);

} // namespace nitfpicture
