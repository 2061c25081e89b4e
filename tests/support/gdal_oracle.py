#!/usr/bin/python3
"""Reads TIFF files with GDAL, an independent reader, and prints what it finds as one JSON array.

    gdal_oracle.py FILE...

Per file: size, band count, geotransform, EPSG code, tie points (GCPs), RPC metadata, and per band the GDAL
type, the SHA-256 of its samples as GDAL returns them (native order) and in big-endian order (the corpus's
canonical form), no-data value, colour table and
overviews (size and SHA-256); and the errors of GDAL's Cloud-Optimized GeoTIFF layout check. Exits with 3
when GDAL's Python bindings are missing, so that callers can skip.
"""
import array
import hashlib
import json
import sys

try:
    from osgeo import gdal
    from osgeo_utils.samples import validate_cloud_optimized_geotiff as cog
except ImportError:
    sys.exit(3)

gdal.UseExceptions()


def sha256(data):
    return hashlib.sha256(data).hexdigest()


# array type codes of GDAL's types (complex types as pairs of their parts)
TYPECODES = {"Byte": "B", "Int8": "b", "UInt16": "H", "Int16": "h", "UInt32": "I", "Int32": "i", "UInt64": "Q",
             "Int64": "q", "Float32": "f", "Float64": "d", "CInt16": "h", "CInt32": "i", "CFloat32": "f",
             "CFloat64": "d"}


def big_endian(data, type_name):
    """The samples in the canonical big-endian form (complex numbers part by part)."""
    values = array.array(TYPECODES[type_name], data)
    if sys.byteorder == "little":
        values.byteswap()
    return values.tobytes()


def epsg(srs):
    if srs is None:
        return None
    code = srs.GetAuthorityCode(None)
    return int(code) if code else None


def describe(path):
    ds = gdal.Open(path)
    result = {
        "path": path,
        "width": ds.RasterXSize,
        "height": ds.RasterYSize,
        "geotransform": ds.GetGeoTransform(can_return_null=True),
        "epsg": epsg(ds.GetSpatialRef()),
        "gcps": [[g.GCPPixel, g.GCPLine, g.GCPX, g.GCPY] for g in ds.GetGCPs()],
        "gcp_epsg": epsg(ds.GetGCPSpatialRef()),
        "rpc": ds.GetMetadata("RPC") or {},
        "bands": [],
    }
    for index in range(1, ds.RasterCount + 1):
        band = ds.GetRasterBand(index)
        table = band.GetColorTable()
        type_name = gdal.GetDataTypeName(band.DataType)
        data = band.ReadRaster()
        result["bands"].append({
            "type": type_name,
            "pixeltype": band.GetMetadataItem("PIXELTYPE", "IMAGE_STRUCTURE"),
            "sha256": sha256(data),
            "sha256_be": sha256(big_endian(data, type_name)),
            "nodata": band.GetNoDataValue(),
            "colours": [list(table.GetColorEntry(i))[:3] for i in range(table.GetCount())] if table else None,
            "overviews": [[o.XSize, o.YSize, sha256(o.ReadRaster())]
                          for o in (band.GetOverview(i) for i in range(band.GetOverviewCount()))],
        })
    warnings, errors, _ = cog.validate(ds, full_check=True)
    result["cog_errors"] = errors
    return result


print(json.dumps([describe(path) for path in sys.argv[1:]]))
