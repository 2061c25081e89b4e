// GDAL as an independent reader of the TIFF files the tests write (through tests/support/gdal_oracle.py).
#pragma once

#include <optional>
#include <string>
#include <vector>

#include <nlohmann/json.hpp>

// What GDAL finds in each file (see gdal_oracle.py), in the order given; nothing when GDAL's Python bindings
// are not installed, so that the caller can skip.
std::optional<nlohmann::json> gdalView(const std::vector<std::string>& paths);
