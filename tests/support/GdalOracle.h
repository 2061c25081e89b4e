// GDAL as an independent reader of the TIFF files the tests write (through tests/support/gdal_oracle.py).
#pragma once

#include <optional>
#include <string>
#include <vector>

#include <nlohmann/json.hpp>

// What GDAL finds in each file (see gdal_oracle.py), in the order given; nothing when GDAL's Python bindings
// are not installed, so that the caller can skip.
std::optional<nlohmann::json> gdalView(const std::vector<std::string>& paths);

// In a test: `view` holds what GDAL finds in `paths`; the test skips when GDAL's bindings are missing.
#define GDAL_VIEW(view, paths)                                                                               \
    std::optional<nlohmann::json> view = gdalView(paths);                                                    \
    if (!view)                                                                                               \
    GTEST_SKIP() << "GDAL's Python bindings (python3-gdal) are not installed"
