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
namespace nitfextract {
class BandReader;
}

namespace nitfpicture {

// The sample type a GeoTIFF holds an image's samples in: by PVTYPE and the canonical sample size, widened to
// the next TIFF size (3 bytes to 4, 5 to 7 to 8). Throws std::runtime_error for reals and complex numbers of
// other sizes.
SampleType sampleTypeOf(CNitfImageSource& source, int canonicalBytes);

// The GeoTIFF placement of a georeferencing summary: the geotransform of an axis-aligned rectangle, else the
// four corners as tie points; UTM or geographic on WGS 84 (other systems are left out, with a note).
GeoReference geoReferenceOf(const nitfgeoref::Summary& summary, std::vector<std::string>& notes);

// The 92 values of the GeoTIFF RPC tag for a model, in the image's own pixels: a chip's mapping is folded
// into the offsets and scales, which an axis-aligned chip allows. Empty (with a note) otherwise.
std::vector<double> rpcTagOf(const CRpcSource& model, std::vector<std::string>& notes);

// Writes band `band` (or every band when it is negative) of the image to `path`. Returns notes on what could
// not be carried over.
std::vector<std::string> writeImageGeoTiff(CNitfFile& file, CNitfImageSource& source,
                                           nitfextract::BandReader& bands, int band, const std::string& path,
                                           const TiffOptions& options);

} // namespace nitfpicture
